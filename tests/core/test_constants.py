"""The constants the module registers at import: names, values and order."""
import subprocess
import sys

import _renderlib
import renderlib

INSTALL_DIR = "/opt/tarsel"

# Written from the constant tables, in registration order.
PRODUCT_AND_BUILD = [
    ("N_DYNAMIC_PARAM_GROUPS", 10),
    ("PRODUCTLINE_TARSEL", 1),
    ("PRODUCTLINE_TARSEL_BUILDER", 2),
    ("PRODUCTLINE_TARSEL_STUDIO", 3),
    ("PRODUCTLINE_TARSEL_PREVIEW", 4),
    ("PRODUCTLINE_TARSEL_BATCH", 5),
    ("PRODUCTLINE_TARSEL_FLARES", 6),
    ("PRODUCTLINE_TARSEL_GRADE", 7),
    ("PRODUCTLINE_TARSEL_OEM", 8),
    ("PRODUCTLINE_STR", "Tarsel"),
    ("PRODUCTLINE_STRL", "tarsel"),
    ("PRODUCTLINE_STRU", "TARSEL"),
    ("PLUGIN_STRING", " Plug-ins "),
    ("PLUGIN_STRING_ENDL", " Plug-ins"),
    ("PL_name_type_natural", 0),
    ("PL_name_type_lower", 1),
    ("PL_name_type_upper", 2),
    ("PL_name_type_capitalized", 3),
    ("PL_name_type_limit", 4),
    ("HAS_NANOSLEEP", 1),
    ("HAVE_CUDA", 1),
    ("USE_OCIO", 1),
    ("PLUGIN_NAME_PREFIX", "T_"),
    ("PLUGIN_NAME_PREFIX_LEN", 2),
    ("TARSEL_REGISTRY_KEY", "Tarsel RH"),
    ("DEFAULT_NATIVE_CONFIG_DIR", INSTALL_DIR),
    ("DEFAULT_CONFIG_DIR", INSTALL_DIR),
    ("DEFAULT_HELP_DIR", INSTALL_DIR),
    ("BASE_NAME", "Render Host"),
    ("BASE_NAME_SHORT", "RH"),
] + [(name, 1) for name in (
    "WIDGETS", "USE_TIMEWARP", "USE_LUTS", "GLYPHS_USE_RGB", "SET_HOLD_VALUE_RETURNS_NODE",
    "HOST_CAN_DOWNSAMPLE", "USE_SLIDER_BOUNDS", "USE_BIG_SLIDER_BOUNDS", "HAS_ANGLE_PARAMS",
    "HAS_PARAM_COLUMNS", "HAS_GROUP_NAMES", "HAS_DYNAMIC_PARAMS", "HAS_SUPER_COLORS", "flip_y",
    "HOST_DOES_MINI_RENDERS", "USE_64BIT_REGISTRY", "ENABLE_BUILDER")] + [("_MIPS_SIM", -1)]


def numbered(prefix, names, start=0):
    return [(prefix + name, start + i) for i, name in enumerate(names)]


PIXEL_TYPES = numbered("pixel_", [
    "unknown", "a8", "rgb8", "bgr8", "rgba8", "bgra8", "argb8", "a16", "rgb16", "rgba16",
    "bgra16", "argb16", "af", "rgbf", "rgbaf", "argbf"]) + numbered("pixel_", [
    "rgba16z", "l8", "l16", "lf", "la8", "la16", "laf", "rgb10", "rgb16f", "rgba16f"], 17) + [
    ("pixel_a16f", 28), ("pixel_ntypes", 29)]

ENUMERATIONS = (
    numbered("ptype_", ["unknown", "float", "int", "color", "popup", "boolean", "pushbutton",
                        "string", "label", "flare", "pellam_data", "none"])
    + numbered("screen_mode_", ["normal", "screen", "screen_center", "screen_center0", "normalize",
                                "normalize_scale", "screen_to_norm", "screen_center_to_norm",
                                "screen_x", "screen_y"])
    + numbered("auto_anim_", ["none", "floor0", "floor1", "ramp_up"])
    + numbered("autotrans_", ["none", "linear", "spline"])
    + numbered("raster_", ["unknown", "rgb", "rgba", "a", "rgbaz", "l", "la", "ntypes"])
    + PIXEL_TYPES
    + numbered("RGBA_", ["NONE", "OK", "COPY_ALPHA", "SET_ALPHA_TO_ONE"])
    + numbered("Err_", ["LogOnly", "NoHdrNoBeep", "InfoNoBeep", "NoteNoBeep", "Info", "Note",
                        "NoHdr", "Alert", "Warning", "Error", "Fatal"])
    + numbered("ShmemError_", ["SHMEM_NO_ERROR", "INVALID_SEGMENT", "TIMEOUT", "LOCK_ERROR",
                               "RETRY", "MSG_TOO_LARGE"])
    + numbered("EM_error", ["None", "Param", "NotFound", "Allocate", "Last"]) + [("EM_errorDevice", 2000)]
    + numbered("EM_ImageFormat_", ["32BitIntBGRA", "32BitIntARGB"])
    + numbered("MouseEventType_", ["MOVE", "DRAG", "PRESS", "RELEASE"])
)

ALL_CONSTANTS = PRODUCT_AND_BUILD + ENUMERATIONS


def module_constants():
    """The module dictionary's non-callable public entries, in insertion order."""
    return [(name, value) for name, value in vars(_renderlib).items()
            if isinstance(value, (int, str)) and not name.startswith("__")]


def test_every_constant_has_its_value_in_registration_order():
    assert module_constants() == ALL_CONSTANTS


def test_pixel_type_numbering_keeps_its_holes():
    values = {value for name, value in module_constants() if name.startswith("pixel_")}
    assert 16 not in values and 27 not in values
    assert _renderlib.pixel_ntypes == 29
    assert len(values) == 28  # 27 named formats plus the count


def test_companion_layer_republishes_the_constants():
    for name, value in ALL_CONSTANTS:
        assert getattr(renderlib, name) == value, name


def test_import_publishes_the_type_registry_and_calls_no_engine_function():
    # A fresh interpreter, so the registry and the call log start empty.
    script = (
        "import ctypes, sys, _renderlib\n"
        "sys.path.insert(0, %r)\n"
        "from engine_probe import EngineProbe\n"
        "registry = sys.modules['swig_runtime_data4'].type_pointer_capsule\n"
        "ctypes.pythonapi.PyCapsule_GetName.restype = ctypes.c_char_p\n"
        "ctypes.pythonapi.PyCapsule_GetName.argtypes = [ctypes.py_object]\n"
        "print(ctypes.pythonapi.PyCapsule_GetName(registry).decode())\n"
        "print(EngineProbe().calls())\n"
    ) % str(__import__("pathlib").Path(__file__).parents[1])
    out = subprocess.run([sys.executable, "-c", script], capture_output=True, text=True, check=True).stdout
    assert out.splitlines() == ["swig_runtime_data4.type_pointer_capsule", "[]"]
