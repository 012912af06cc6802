// Product identity and build configuration, fixed when the module is built.
%{
#ifdef _WIN32
#define RENDERLIB_INSTALL_DIR "C:\\Program Files\\Tarsel"
#else
#define RENDERLIB_INSTALL_DIR "/opt/tarsel"
#endif
%}
#define N_DYNAMIC_PARAM_GROUPS 10
#define PRODUCTLINE_TARSEL 1
#define PRODUCTLINE_TARSEL_BUILDER 2
#define PRODUCTLINE_TARSEL_STUDIO 3
#define PRODUCTLINE_TARSEL_PREVIEW 4
#define PRODUCTLINE_TARSEL_BATCH 5
#define PRODUCTLINE_TARSEL_FLARES 6
#define PRODUCTLINE_TARSEL_GRADE 7
#define PRODUCTLINE_TARSEL_OEM 8
#define PRODUCTLINE_STR "Tarsel"
#define PRODUCTLINE_STRL "tarsel"
#define PRODUCTLINE_STRU "TARSEL"
#define PLUGIN_STRING " Plug-ins "
#define PLUGIN_STRING_ENDL " Plug-ins"
#define PL_name_type_natural 0
#define PL_name_type_lower 1
#define PL_name_type_upper 2
#define PL_name_type_capitalized 3
#define PL_name_type_limit 4
#define HAS_NANOSLEEP 1
#define HAVE_CUDA 1
#define USE_OCIO 1
#define PLUGIN_NAME_PREFIX "T_"
#define PLUGIN_NAME_PREFIX_LEN 2
#define TARSEL_REGISTRY_KEY "Tarsel RH"
%constant const char *DEFAULT_NATIVE_CONFIG_DIR = RENDERLIB_INSTALL_DIR;
%constant const char *DEFAULT_CONFIG_DIR = RENDERLIB_INSTALL_DIR;
%constant const char *DEFAULT_HELP_DIR = RENDERLIB_INSTALL_DIR;
#define BASE_NAME "Render Host"
#define BASE_NAME_SHORT "RH"
#define WIDGETS 1
#define USE_TIMEWARP 1
#define USE_LUTS 1
#define GLYPHS_USE_RGB 1
#define SET_HOLD_VALUE_RETURNS_NODE 1
#define HOST_CAN_DOWNSAMPLE 1
#define USE_SLIDER_BOUNDS 1
#define USE_BIG_SLIDER_BOUNDS 1
#define HAS_ANGLE_PARAMS 1
#define HAS_PARAM_COLUMNS 1
#define HAS_GROUP_NAMES 1
#define HAS_DYNAMIC_PARAMS 1
#define HAS_SUPER_COLORS 1
#define flip_y 1
#define HOST_DOES_MINI_RENDERS 1
#define USE_64BIT_REGISTRY 1
#define ENABLE_BUILDER 1
#define _MIPS_SIM -1
