"""The faults the fuzz targets found in the module and engine, one call each.

    python tests/fuzz/reproducers/reproduce.py CASE

Each case makes the call that once went wrong and exits 0 only if it now
ends in the exception or result it should. Before the fixes they crashed,
hung, or (the cases marked "sanitizer") read or wrote memory they must not
without always crashing: the suite runs those under tools/sanitize.sh too,
where such an access is reported."""
import pathlib
import sys

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1]))
import fuzz_common  # noqa: E402,F401  (puts tests/ on the path)

import _renderlib  # noqa: E402
import renderlib  # noqa: E402

NAME = "render_tarsel_effect_to_native_image"


def returns(expected, call, *args):
    """Exit 0 when the call returns `expected`."""
    result = call(*args)
    print("returned %r" % (result,))
    if result is not expected:
        sys.exit(1)


def refused(error_type, message, call, *args):
    """Exit 0 when the call raises `error_type` with `message` in its text."""
    try:
        result = call(*args)
    except Exception as error:  # noqa: BLE001  (any other exception is the wrong answer)
        print("refused: %s: %s" % (type(error).__name__, error))
        if type(error) is error_type and message in str(error):
            return
        sys.exit(1)
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
    refused(ValueError, "argument 2 of type 'uchar_t *'", _renderlib.base64decode, "QUJD", None, 3)


def decode_text_none():
    helpers = fuzz_common.byte_address_module()
    refused(ValueError, "argument 1 of type 'char const *'", _renderlib.base64decode, None,
            helpers.byte_address(bytearray(8), 0), 3)


def decode_negative_length():
    helpers = fuzz_common.byte_address_module()
    refused(ValueError, "argument 3 of type 'int' must not be negative", _renderlib.base64decode, "QUJD",
            helpers.byte_address(bytearray(8), 0), -1)


# A T_RasterInfo look-alike in the rasters list whose `this` attribute clears
# the list while it is converted: the typemap read on by the length the list
# had (a null or freed item array). It now converts the items the list held
# when the call began; the look-alike's empty record makes the engine refuse.
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
    returns(False, getattr(_renderlib, NAME), *args)


# The same look-alike replacing the destination's record: its proxy died and
# the pointer already taken from it dangled into the render (sanitizer:
# heap-use-after-free in the engine). The input's empty record is refused.
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
    returns(False, getattr(_renderlib, NAME), *args)


# An object whose `this` is itself: the pointer conversion followed `this`
# for ever (a hang, or a stack overflow in an unoptimised build).
def render_this_loop():
    looped = type("T_RasterInfo", (), {})()
    looped.this = looped
    args = render_arguments(None, None, 1)
    args[7] = [looped]
    refused(TypeError, "argument 8 of type 'T_RasterInfo **'", getattr(_renderlib, NAME), *args)


# n_rasters larger than the lists: the binding passed both lists' arrays and
# the count unchecked, and the engine read past the arrays (sanitizer:
# heap-buffer-overflow in render()).
def render_count_past_lists():
    args = render_arguments(None, None, 3)
    refused(ValueError, "argument 11 of type 'int': more entries than the rasters or images list holds",
            getattr(_renderlib, NAME), *args)


# Frame -2**31 (a valid int argument) rendered an echo of frame - 1: signed
# overflow in render_echo (sanitizer: UndefinedBehaviorSanitizer, echo.cpp).
# An echo before the first frame is a frame the host does not have.
def echo_frame_overflow():
    from renderlib import effects
    echo = _renderlib.init_tarsel_effect("T_Echo", False)
    dest, source = effects.raster(4, 2, 2), effects.raster(4, 2, 2)
    returns(True, effects.render, echo, dest, [source], None, -2 ** 31)


# The same at the other end for the frames around the last one: the time
# blur's run of frames after 2**31 - 1 overflowed int (time_blur.cpp).
def time_blur_frame_overflow():
    from renderlib import effects

    class Frames(renderlib.LoadFrameInterface):
        asked, kept = [], []  # the pixels stay referenced until the render returns

        def load_frame(self, input, frame, width, height):
            self.asked.append(frame)
            self.info, pixels = effects.raster(4, width, height)
            self.kept.append(pixels)
            return pixels

        def current_raster_info(self, input):
            return self.info

    source = Frames()
    _renderlib.set_load_frame_impl(source)
    blur = effects.recreate(_renderlib.init_tarsel_effect("T_TimeBlur", False), {"frames_after": "3"})
    dest, image = effects.raster(4, 2, 2), effects.raster(4, 2, 2)
    returns(True, effects.render, blur, dest, [image], None, 2 ** 31 - 1)
    print("frames asked for: %s" % sorted(set(source.asked)))
    if sorted(set(source.asked)) != [2 ** 31 - 3, 2 ** 31 - 2]:  # the two before; none after the last
        sys.exit(1)
    _renderlib.set_load_frame_impl(None)


CASES = {
    "decode_dest_none": decode_dest_none,
    "decode_text_none": decode_text_none,
    "decode_negative_length": decode_negative_length,
    "render_list_cleared": render_list_cleared,
    "render_this_loop": render_this_loop,
    "render_list_replaced": render_list_replaced,  # sanitizer
    "render_count_past_lists": render_count_past_lists,  # sanitizer
    "echo_frame_overflow": echo_frame_overflow,  # sanitizer
    "time_blur_frame_overflow": time_blur_frame_overflow,  # sanitizer
}

if __name__ == "__main__":
    if len(sys.argv) != 2 or sys.argv[1] not in CASES:
        sys.exit("usage: reproduce.py CASE  (%s)" % ", ".join(CASES))
    CASES[sys.argv[1]]()
