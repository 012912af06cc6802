"""Host callback objects that let go of themselves, or of what they handed the
engine, while the engine is still using it; callback classes a host writes
as null objects; engine vectors a drawing method keeps. Each runs in a
process of its own: the faults these guard against crash the interpreter."""

import textwrap

import pytest

from isolated import run_cleanly

PROLOGUE = """
import gc, threading, time, weakref
import numpy, _renderlib, renderlib
from renderlib import effects
from renderlib.widgets import SvgDrawing
draw = lambda effect: _renderlib.tarsel_widget_draw(effect, "", 960, 540, 0.0, 0.0, 0.5, 0.5, [1920, 1080, 0])
"""


def run(script, timeout=30):
    """The lines `script` printed, run after PROLOGUE in a process of its own."""
    return run_cleanly(PROLOGUE + textwrap.dedent(script), timeout).splitlines()


def test_a_drawing_object_that_uninstalls_and_drops_itself_mid_draw_lives_to_the_end_of_the_call():
    # The engine draws the whole pass through the object it started with.
    assert run("""
        class Quitter(SvgDrawing):
            def start_drawing(self, mode):
                global drawing
                _renderlib.tarsel_set_gfx_impl(None)
                drawing = None
                gc.collect()
                super().start_drawing(mode)

        drawing = Quitter()
        gone = weakref.ref(drawing)
        calls = drawing.calls
        _renderlib.tarsel_set_gfx_impl(drawing)
        draw(_renderlib.init_tarsel_effect("T_LensFlare", False))
        print(calls[-1][0], gone() is None)
    """) == ["end_drawing True"]


# Draws while another thread keeps installing new drawing objects, each
# dropping the one before it.
REPLACING = """
calls = []  # (operation, drawing object): objects change, and only where a pass starts

class Slow(SvgDrawing):
    def _record(self, name, *args):
        calls.append((name, id(self)))
        time.sleep(0.0002)  # lets the other thread in

flare = _renderlib.init_tarsel_effect("T_LensFlare", False)
installed = [Slow()]
_renderlib.tarsel_set_gfx_impl(installed[0])
done = threading.Event()

def replace():
    while not done.is_set():
        drawing = Slow()
        _renderlib.tarsel_set_gfx_impl(drawing)
        installed[0] = drawing  # the one before loses its last reference, mid-draw
        time.sleep(0.0001)

replacer = threading.Thread(target=replace)
replacer.start()
for _ in range(200):
    draw(flare)
done.set()
replacer.join()
_renderlib.tarsel_set_gfx_impl(None)
changes = {name for (name, this), (_, before) in zip(calls[1:], calls) if this != before}
print([name for name, _ in calls].count("end_drawing"), changes == {"set_graphics_context"})
"""


def test_replacing_the_drawing_object_from_another_thread_during_draws():
    assert run(REPLACING, timeout=60) == ["200 True"]


def test_a_frame_source_that_lets_go_of_itself_in_load_frame_keeps_its_frame_for_the_render():
    assert run("""
        class Leaving(renderlib.LoadFrameInterface):
            def load_frame(self, input, frame, width, height):
                global source
                self.info, self.pixels = effects.raster(_renderlib.pixel_rgbaf, width, height)
                numpy.frombuffer(self.pixels, numpy.float32)[:] = 0.25
                _renderlib.set_load_frame_impl(None)
                source = None  # the last reference but the module's
                gc.collect()
                return self.pixels
            def current_raster_info(self, input):
                return self.info

        source = Leaving()
        gone = weakref.ref(source)
        _renderlib.set_load_frame_impl(source)
        # The frame before at full weight over an empty current frame: the
        # result is the requested frame. Its pixels (512 KiB) would be given
        # back to the system at once, were they freed.
        echo = effects.recreate(_renderlib.init_tarsel_effect("T_Echo", False),
                                {"echoes": "2", "decay": "1", "frame_step": "-1", "combine": "Maximum"})
        dest, current = effects.raster(_renderlib.pixel_rgbaf, 256, 128), effects.raster(_renderlib.pixel_rgbaf, 256, 128)
        assert effects.render(echo, dest, [current], frame=10)
        print(sorted(set(numpy.frombuffer(dest[1], numpy.float32).tolist())), gone() is None)
    """) == ["[0.25] True"]


# A callback class whose instances answer for any attribute is made and
# installed; objects that only look like one are refused.
NULL_OBJECTS = """
class Anything:  # its this is made on the spot
    def __getattr__(self, name):
        return lambda *args: 0
class Null(renderlib.%(kind)s, Anything):
    pass
null = Null()
_renderlib.%(install)s(null)
_renderlib.%(install)s(None)
print(type(null.this).__name__, repr(null).startswith("<__main__.Null; proxy of <Swig Object"))
class Itself:
    this = property(lambda self: self)
class Forgetful(renderlib.%(kind)s):
    __init__ = lambda self: None  # not the base's
for thing in (Anything(), Itself(), Forgetful(), object()):
    try:
        _renderlib.%(install)s(thing)
    except TypeError as error:
        print(error)
"""


@pytest.mark.parametrize(
    "kind, install", [("GfxInterface", "tarsel_set_gfx_impl"), ("LoadFrameInterface", "set_load_frame_impl")]
)
def test_a_callback_class_with_a_catch_all_getattr_is_made_and_installed(kind, install):
    refused = "in method '%s', argument 1 of type '%s *'" % (install, kind)
    assert run(NULL_OBJECTS % {"kind": kind, "install": install}) == ["SwigPyObject True"] + [refused] * 4


def test_engine_vectors_kept_past_the_drawing_call_refuse_use():
    out = run("""
        class Keeping(SvgDrawing):
            def lines(self, xs, ys):
                self.kept.append((xs, ys, list(xs), iter(xs)))
                super().lines(xs, ys)
        drawing = Keeping()
        drawing.kept = []
        _renderlib.tarsel_set_gfx_impl(drawing)
        draw(_renderlib.init_tarsel_effect("T_Gradient", False))
        xs, ys, copy, walk = drawing.kept[0]
        print(len(copy) > 0)
        for use in (len, lambda v: v[0], list, lambda v: v.append(1.0), lambda v: v.size()):
            try:
                use(xs)
                print("used")
            except ValueError as error:
                print(str(error).startswith("invalid null reference in method 'float_vector_"))
        try:
            next(walk)
        except ValueError as error:
            print(str(error) == "the iterator's float_vector no longer exists")
    """)
    assert out == ["True"] * 7
