// _renderlib: the Python binding of the tarsel_ps render engine and the
// QRVExternalMonitor library. This file holds the module declaration, the
// build's constants, the one exception guard and the list of interface files;
// each subsystem lives in its own folder.
%module(moduleimport="import _renderlib", directors="1") renderlib

%begin %{
// Import enables thread support last; see renderlib_initialize_threads.
#define SWIG_PYTHON_INITIALIZE_THREADS renderlib_initialize_threads()
%}

%{
// From Python 3.9 on the interpreter always runs with thread support and
// PyEval_InitThreads is deprecated; before that the module must enable it so
// that wrappers can release the lock and engine threads can re-enter Python.
static void renderlib_initialize_threads()
{
#if PY_VERSION_HEX < 0x03090000
  PyEval_InitThreads();
#endif
}
%}

%{
#include "tarsel/errors.h"
%}

// Proxy methods pass their arguments on as given, so that an omitted argument
// takes the default of the engine's declaration and every overload set
// reports its own prototypes.
%feature("python:cdefaultargs");

// Wrappers keep the interpreter lock unless an interface file lets a long
// engine call run without it (%threadallow).
%nothreadallow;

// The abort guard around every engine call. An engine abort becomes
// RuntimeError "Tarsel Abort" (chained to the host callback that caused it,
// if one did); when the call ran without the interpreter lock, the lock is
// taken back as the call's frame unwinds, before the error is set. A failed
// host callback that reaches a wrapper has its Python error set already; a
// call the module's own code refuses on the way carries its exception. A
// container asked for more than memory holds raises MemoryError instead of
// ending the process.
%exception {
  try {
    $action
  } catch (const TarselAbortException &) {
    raise_tarsel_abort();
    SWIG_fail;
  } catch (const Swig::DirectorException &) {
    SWIG_fail;
  } catch (const RefusedCall &refused) {
    PyErr_SetString(refused.type, refused.message.c_str());
    SWIG_fail;
  } catch (const std::length_error &too_long) {
    PyErr_SetString(PyExc_MemoryError, too_long.what());
    SWIG_fail;
  } catch (const std::bad_alloc &) {
    PyErr_NoMemory();
    SWIG_fail;
  }
}

%include "engine_dll_path.i"
%include "conventions.i"
%include "renderlib_typemaps.i"
%include "abort_translation.i"
%include "callbacks/engine_threads.i"
%include "render/instance_uses.i"

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

// The order of this list is the order in which the module registers its
// constants and classes at import.
%include "std_except.i"
%include "std_string.i"
%include "model/container_iterators.i"
%include "std_vector.i"
%include "std_map.i"
%include "callbacks/load_frame.i"
%include "model/value_arrays.i"
%include "model/containers.i"
%include "model/param_enums.i"
%include "model/effect_globals.i"
%include "model/genotype.i"
%include "model/effect_def.i"
%include "model/param_flags.i"
%include "model/param.i"
%include "render/raster_info.i"
%include "model/catalogue.i"
%include "render/raster_serialisation.i"
%include "render/render_calls.i"
%include "render/flare_textures.i"
%include "render/image_utils.i"
%include "model/param_queries.i"
%include "render/effect_instance.i"
%include "error_handler.i"
%include "ipc/shmem_error.i"
%include "ipc/message_header.i"
%include "ipc/shmem_transport.i"
%include "ipc/shmem_manager.i"
%include "monitor/external_monitor.i"
%include "callbacks/gfx.i"
%include "build_identity.i"
