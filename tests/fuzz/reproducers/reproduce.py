"""Faults the fuzz targets found that their short runs do not reach again
(the others are among their inputs), one call each, which exits 0 only if
the call now ends as it should:

    python tests/fuzz/reproducers/reproduce.py CASE

Before the fixes they read or wrote memory they must not without always
crashing: the suite runs them under tools/sanitize.sh too, which reports it."""

import sys

import _renderlib
import renderlib
from renderlib import effects


# The arguments after the lists: mix, n_rasters, pixel aspect, threads, seed,
# flags, frame rate, premultiplied and the three colour spaces.
SETTINGS = (1.0, 2, 1.0, 1, 0, 0, 25, False, "linear", "linear", "linear")


# An item of the rasters list, a look-alike of a T_RasterInfo, whose `this`
# replaces the destination's record while the list converts: its proxy died
# and the pointer already taken from it dangled into the render
# (heap-use-after-free in the engine). The look-alike's empty record is refused.
def render_list_replaced():
    dest, keep = renderlib.T_RasterInfo(), renderlib.T_RasterInfo()
    dest.pixel_type = _renderlib.pixel_rgba8
    pixels = bytearray(_renderlib.make_tarsel_raster_info(dest, 2, 2))
    replacing = property(lambda self: rasters.__setitem__(0, None) or keep.this)
    rasters = [dest, type("T_RasterInfo", (), {"__slots__": (), "this": replacing})()]
    blur = _renderlib.init_tarsel_effect("T_Blur", False)
    render = _renderlib.render_tarsel_effect_to_native_image
    assert render(blur, "", pixels, 0, 0, 1, 1, rasters, [None, bytearray(16)], *SETTINGS) is False


# Frame -2**31 (a valid int argument) rendered an echo of frame - 1: signed
# overflow in render_echo (UndefinedBehaviorSanitizer, echo.cpp). An echo
# before the first frame is a frame the host does not have.
def echo_frame_overflow():
    echo = _renderlib.init_tarsel_effect("T_Echo", False)
    assert effects.render(echo, effects.raster(4, 2, 2), [effects.raster(4, 2, 2)], None, -(2**31)) is True


# The same at the other end for the frames around the last one: the time
# blur's run of frames after 2**31 - 1 overflowed int (time_blur.cpp).
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
    assert effects.render(blur, effects.raster(4, 2, 2), [effects.raster(4, 2, 2)], None, 2**31 - 1) is True
    assert sorted(source.asked) == [2**31 - 3, 2**31 - 2], source.asked  # the two before; none after the last
    _renderlib.set_load_frame_impl(None)


if __name__ == "__main__":
    cases = {case.__name__: case for case in (render_list_replaced, echo_frame_overflow, time_blur_frame_overflow)}
    if len(sys.argv) != 2 or sys.argv[1] not in cases:
        sys.exit("usage: reproduce.py CASE  (%s)" % ", ".join(cases))
    cases[sys.argv[1]]()
