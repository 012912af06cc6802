"""The faults the fuzz targets found in the module and engine, one call each.

    python tests/fuzz/reproducers/reproduce.py CASE

Each case makes the call that once went wrong and exits 0 only if it now ends
in the exception or result it should. Before the fixes they crashed, hung,
or (the cases marked "sanitizer") read or wrote memory they must not without
always crashing: the suite runs those under tools/sanitize.sh too, where such
an access is reported."""
import pathlib
import sys

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[1]))
import fuzz_common  # noqa: E402  (puts tests/ on the path)

import _renderlib  # noqa: E402
import renderlib  # noqa: E402
from renderlib import effects  # noqa: E402

CASES = {}
render = getattr(_renderlib, "render_tarsel_effect_to_native_image")


def case(function):
    CASES[function.__name__] = function
    return function


def refused(error_type, message, call, *args):
    try:
        result = call(*args)
    except error_type as error:
        assert message in str(error), error
        return
    raise AssertionError("returned %r" % (result,))


def render_arguments(rasters=(), images=(), n_rasters=1):
    """A T_Blur render of a 2x2 destination, `rasters` and `images` after its own entries."""
    dest = renderlib.T_RasterInfo()
    dest.pixel_type = _renderlib.pixel_rgba8
    pixels = bytearray(_renderlib.make_tarsel_raster_info(dest, 2, 2))
    return [_renderlib.init_tarsel_effect("T_Blur", False), "", pixels, 0, 0, 1, 1, [dest] + list(rasters),
            [None] + list(images), 1.0, n_rasters, 1.0, 1, 0, 0, 25, False, "linear", "linear", "linear"]


def rewriting_look_alike(rewrite):
    """An object of the class name the typemap looks for whose `this` runs
    `rewrite` first, then leads to an empty record."""
    keep = renderlib.T_RasterInfo()
    return type("T_RasterInfo", (), {"__slots__": (), "this": property(lambda self: rewrite() or keep.this)})()


# None as the decoder's text or destination (read and written through), and a
# negative length (memset of (size_t)-1 bytes).
@case
def decode_dest_none():
    refused(ValueError, "argument 2 of type 'uchar_t *'", _renderlib.base64decode, "QUJD", None, 3)


@case
def decode_text_none():
    dest = fuzz_common.byte_address_module().byte_address(bytearray(8), 0)
    refused(ValueError, "argument 1 of type 'char const *'", _renderlib.base64decode, None, dest, 3)


@case
def decode_negative_length():
    dest = fuzz_common.byte_address_module().byte_address(bytearray(8), 0)
    refused(ValueError, "argument 3 of type 'int' must not be negative", _renderlib.base64decode, "QUJD", dest, -1)


# A look-alike in the rasters list whose `this` clears the list while it
# converts: the typemap read on by the length the list had (a null or freed
# item array). It now converts the items the list held when the call began;
# the look-alike's empty record makes the engine refuse.
@case
def render_list_cleared():
    args = render_arguments()
    args[7] = [rewriting_look_alike(lambda: args[7].clear())] + [renderlib.T_RasterInfo() for _ in range(8)]
    assert render(*args) is False


# The same replacing the destination's record: its proxy died and the pointer
# already taken from it dangled into the render (sanitizer: heap-use-after-free
# in the engine). The input's empty record is refused.
@case
def render_list_replaced():
    args = render_arguments([None], [bytearray(16)], 2)
    args[7][1] = rewriting_look_alike(lambda: args[7].__setitem__(0, None))
    assert render(*args) is False


# An object whose `this` is itself: the pointer conversion followed `this` for
# ever (a hang, or a stack overflow in an unoptimised build).
@case
def render_this_loop():
    looped = type("T_RasterInfo", (), {})()
    looped.this = looped
    args = render_arguments()
    args[7] = [looped]
    refused(TypeError, "argument 8 of type 'T_RasterInfo **'", render, *args)


# n_rasters larger than the lists: the binding passed both lists' arrays and
# the count unchecked, and the engine read past them (sanitizer:
# heap-buffer-overflow in render()).
@case
def render_count_past_lists():
    refused(ValueError, "argument 11 of type 'int': more entries than the rasters or images list holds", render,
            *render_arguments(n_rasters=3))


# Frame -2**31 (a valid int argument) rendered an echo of frame - 1: signed
# overflow in render_echo (sanitizer: UndefinedBehaviorSanitizer, echo.cpp).
# An echo before the first frame is a frame the host does not have.
@case
def echo_frame_overflow():
    echo = _renderlib.init_tarsel_effect("T_Echo", False)
    assert effects.render(echo, effects.raster(4, 2, 2), [effects.raster(4, 2, 2)], None, -2 ** 31) is True


# The same at the other end for the frames around the last one: the time
# blur's run of frames after 2**31 - 1 overflowed int (time_blur.cpp).
@case
def time_blur_frame_overflow():
    class Frames(renderlib.LoadFrameInterface):
        asked, kept = set(), []  # the pixels stay referenced until the render returns

        def load_frame(self, input, frame, width, height):
            self.asked.add(frame)
            self.info, pixels = effects.raster(4, width, height)
            self.kept.append(pixels)
            return pixels

        def current_raster_info(self, input):
            return self.info

    source = Frames()
    _renderlib.set_load_frame_impl(source)
    blur = effects.recreate(_renderlib.init_tarsel_effect("T_TimeBlur", False), {"frames_after": "3"})
    assert effects.render(blur, effects.raster(4, 2, 2), [effects.raster(4, 2, 2)], None, 2 ** 31 - 1) is True
    assert sorted(source.asked) == [2 ** 31 - 3, 2 ** 31 - 2], source.asked  # the two before; none after the last
    _renderlib.set_load_frame_impl(None)


if __name__ == "__main__":
    if len(sys.argv) != 2 or sys.argv[1] not in CASES:
        sys.exit("usage: reproduce.py CASE  (%s)" % ", ".join(CASES))
    CASES[sys.argv[1]]()
