"""Python subclasses of the callback classes: calls through the module's
method wrappers, and hand-over to the native side. (Every wrapper's failure
paths, the abstract bases' included, and reference counts: tests/core.)"""

import gc
import weakref

import _renderlib
import renderlib
from renderlib.widgets import SvgDrawing


def test_the_method_wrappers_dispatch_to_the_python_override():
    # The bare pointer object is not the bound instance, so the wrapper calls
    # the native method, which the director forwards to the subclass. (The
    # director holds no reference: the instance must stay referenced.)
    class Doubling(SvgDrawing):
        def lines(self, xs, ys):  # the vectors are the caller's own, live
            super().lines(xs, ys)
            for i in range(len(xs)):
                xs[i] *= 2

    drawing = Doubling()
    _renderlib.GfxInterface_line(drawing.this, 1, 2, 3.5, 4)
    _renderlib.GfxInterface_stipple_pattern(drawing.this, 0xF0F0)
    _renderlib.GfxInterface_draw_text(drawing.this, "caf\xe9", 5, 6)
    assert _renderlib.GfxInterface_get_text_length_in_pixels(drawing.this, "abcd") == 24
    xs, ys = renderlib.float_vector([1, 2]), renderlib.float_vector([3, 4])
    _renderlib.GfxInterface_lines(drawing.this, xs, ys)
    assert drawing.calls == [
        ("line", (1.0, 2.0, 3.5, 4.0)),
        ("stipple_pattern", (0xF0F0,)),
        ("draw_text", ("caf\xe9", 5.0, 6.0)),
        ("get_text_length_in_pixels", ("abcd",)),
        ("lines", ((1.0, 2.0), (3.0, 4.0))),
    ]
    assert list(xs) == [2, 4] and list(ys) == [3, 4]


def test_a_disowned_callback_object_belongs_to_the_native_side():
    # (Until then the native object holds no reference: see the tests of a
    # source or drawing object that goes away.)
    drawing = SvgDrawing()
    assert isinstance(drawing.__disown__(), weakref.ProxyType)
    alive = weakref.ref(drawing)
    _renderlib.disown_GfxInterface(drawing)  # a second hand-over changes nothing
    del drawing
    gc.collect()
    # The native side now owns it, and it owns its Python instance.
    assert alive() is not None
    _renderlib.GfxInterface_flush(alive().this)
    assert alive().calls == [("flush", ())]
