"""Reproducers of the faults the fuzz targets found in the module and engine.

    python tests/fuzz/reproducers/reproduce.py CASE

Each case makes the one call that goes wrong and exits 0 only if the call
ends in a Python exception or a proper result. Until the fault is fixed the
process crashes, hangs or exits 1. The cases marked "sanitizer" read or write
memory they must not without always crashing; run them in the fuzzing
environment of tools/fuzz.sh (or under tools/sanitize.sh's preloads) to see
the report.

The fuzz targets leave these inputs out unless RENDERLIB_FUZZ_KNOWN_FAULTS=1."""
import pathlib
import sys

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1]))
import fuzz_common  # noqa: E402,F401  (puts tests/ on the path)

import _renderlib  # noqa: E402
import renderlib  # noqa: E402

NAME = "render_tarsel_effect_to_native_image"


def answered(call, *args):
    """For faults a sanitizer shows: any exception or result is an answer."""
    try:
        print("returned %r" % (call(*args),))
    except Exception as error:  # noqa: BLE001
        print("refused: %s: %s" % (type(error).__name__, error))


def refused(call, *args):
    """Exit 0 when the call raises an ordinary Python exception."""
    try:
        result = call(*args)
    except (TypeError, ValueError, OverflowError) as error:
        print("refused: %s: %s" % (type(error).__name__, error))
        return
    print("returned %r" % (result,))
    sys.exit(1)


def render_arguments(rasters, images, n_rasters):
    from engine_probe import EngineProbe
    EngineProbe().keep_call_log(False)
    effect = _renderlib.init_tarsel_effect("T_Blur", False)
    dest, size = renderlib.T_RasterInfo(), 0
    dest.pixel_type = 4  # pixel_rgba8
    size = _renderlib.make_tarsel_raster_info(dest, 2, 2)
    pixels = bytearray(size)
    rasters = [dest] + rasters if rasters is not None else [dest]
    images = [None] + images if images is not None else [None]
    return [effect, "", pixels, 0, 0, 1, 1, rasters, images, 1.0, n_rasters, 1.0, 1, 0, 0, 25, False,
            "linear", "linear", "linear"]


# None as the decoder's text or destination (read and written through), and
# a negative length (memset of (size_t)-1 bytes).
def decode_dest_none():
    refused(_renderlib.base64decode, "QUJD", None, 3)


def decode_text_none():
    helpers = fuzz_common.byte_address_module()
    refused(_renderlib.base64decode, None, helpers.byte_address(bytearray(8), 0), 3)


def decode_negative_length():
    helpers = fuzz_common.byte_address_module()
    refused(_renderlib.base64decode, "QUJD", helpers.byte_address(bytearray(8), 0), -1)


# A T_RasterInfo look-alike in the rasters list whose `this` attribute clears
# the list while it is converted: the typemap keeps reading the list's items
# by the length it had (a null or freed item array).
def render_list_cleared():
    rasters = []
    keep = renderlib.T_RasterInfo()

    class T_RasterInfo:  # noqa: N801  (the name the typemap looks for)
        __slots__ = ()

        @property
        def this(self):
            rasters.clear()
            return keep.this

    rasters.extend([T_RasterInfo()] + [renderlib.T_RasterInfo() for _ in range(8)])
    args = render_arguments(None, None, 1)
    args[7] = rasters
    refused(getattr(_renderlib, NAME), *args)


# The same look-alike replacing the records after the first: their proxies
# die, and the pointers already taken from them dangle into the render
# (sanitizer: heap-use-after-free in the engine).
def render_list_replaced():
    keep = renderlib.T_RasterInfo()

    class T_RasterInfo:  # noqa: N801
        __slots__ = ()

        @property
        def this(self):
            args[7][0] = None
            return keep.this

    args = render_arguments(None, None, 2)
    args[7] = [args[7][0], T_RasterInfo()]
    args[8] = [None, bytearray(16)]
    answered(getattr(_renderlib, NAME), *args)


# An object whose `this` is itself: the pointer conversion follows `this`
# for ever (a hang, or a stack overflow in an unoptimised build).
def render_this_loop():
    looped = type("T_RasterInfo", (), {})()
    looped.this = looped
    args = render_arguments(None, None, 1)
    args[7] = [looped]
    refused(getattr(_renderlib, NAME), *args)


# n_rasters larger than the lists: the binding passes both lists' arrays and
# the count unchecked, and the engine reads past the arrays (sanitizer:
# heap-buffer-overflow in render()).
def render_count_past_lists():
    args = render_arguments(None, None, 3)
    answered(getattr(_renderlib, NAME), *args)


# Frame -2**31 (a valid int argument) renders an echo of frame - 1: signed
# overflow in render_echo (sanitizer: UndefinedBehaviorSanitizer, echo.cpp).
def echo_frame_overflow():
    from renderlib import effects
    echo = _renderlib.init_tarsel_effect("T_Echo", False)
    dest, source = effects.raster(4, 2, 2), effects.raster(4, 2, 2)
    answered(effects.render, echo, dest, [source], None, -2 ** 31)


CASES = {
    "decode_dest_none": decode_dest_none,
    "decode_text_none": decode_text_none,
    "decode_negative_length": decode_negative_length,
    "render_list_cleared": render_list_cleared,
    "render_this_loop": render_this_loop,
    "render_list_replaced": render_list_replaced,  # sanitizer
    "render_count_past_lists": render_count_past_lists,  # sanitizer
    "echo_frame_overflow": echo_frame_overflow,  # sanitizer
}

if __name__ == "__main__":
    if len(sys.argv) != 2 or sys.argv[1] not in CASES:
        sys.exit("usage: reproduce.py CASE  (%s)" % ", ".join(CASES))
    CASES[sys.argv[1]]()
