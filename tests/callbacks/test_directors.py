"""Python subclasses of the callback classes: construction, calls through the
module's method wrappers, result conversion, up-calls to the abstract base,
ownership and hand-over to the native side."""
import gc
import sys
import weakref

import pytest

import _renderlib
import renderlib
from frame_source import FrameSource, solid_frame
from renderlib.widgets import SvgDrawing

FLOAT_VECTOR = "std::vector< float,std::allocator< float > > &"


def test_the_abstract_classes_themselves_cannot_be_made():
    for cls in (renderlib.LoadFrameInterface, renderlib.GfxInterface):
        with pytest.raises(RuntimeError, match="^accessing abstract class or protected constructor$"):
            cls()
        with pytest.raises(RuntimeError, match="^accessing abstract class or protected constructor$"):
            getattr(_renderlib, "new_" + cls.__name__)(None)


def test_calling_the_base_method_of_a_subclass_is_a_pure_virtual_call():
    drawing, source = SvgDrawing(), FrameSource(lambda i, f: (0, 0, 0, 1))
    with pytest.raises(RuntimeError, match="^SWIG director pure virtual method called GfxInterface::line$"):
        renderlib.GfxInterface.line(drawing, 0, 0, 1, 1)
    with pytest.raises(RuntimeError, match="^SWIG director pure virtual method called "
                                           "LoadFrameInterface::load_frame$"):
        renderlib.LoadFrameInterface.load_frame(source, 0, 0, 0, 0)
    with pytest.raises(RuntimeError, match="LoadFrameInterface::current_raster_info$"):
        renderlib.LoadFrameInterface.current_raster_info(source, 0)


def test_a_subclass_that_skips_the_base_init_is_refused_where_it_is_passed():
    class Forgetful(renderlib.GfxInterface):
        def __init__(self):
            pass

    with pytest.raises(TypeError, match=r"^in method 'tarsel_set_gfx_impl', argument 1 of type 'GfxInterface \*'$"):
        _renderlib.tarsel_set_gfx_impl(Forgetful())


def test_the_method_wrappers_dispatch_to_the_python_override():
    # The bare pointer object is not the bound instance, so the wrapper calls
    # the native method, which the director forwards to the subclass. (The
    # director holds no reference: the instance must stay referenced.)
    drawing = SvgDrawing()
    _renderlib.GfxInterface_line(drawing.this, 1, 2, 3.5, 4)
    _renderlib.GfxInterface_stipple_pattern(drawing.this, 0xF0F0)
    _renderlib.GfxInterface_draw_text(drawing.this, "caf\xe9", 5, 6)
    assert _renderlib.GfxInterface_get_text_length_in_pixels(drawing.this, "abcd") == 24
    assert drawing.calls == [("line", (1.0, 2.0, 3.5, 4.0)), ("stipple_pattern", (0xF0F0,)),
                             ("draw_text", ("caf\xe9", 5.0, 6.0)), ("get_text_length_in_pixels", ("abcd",))]
    xs, ys = renderlib.float_vector([1, 2]), renderlib.float_vector([3, 4])
    _renderlib.GfxInterface_lines(drawing.this, xs, ys)
    assert drawing.calls[-1] == ("lines", ((1.0, 2.0), (3.0, 4.0)))


def test_a_drawing_method_sees_and_may_change_the_live_vectors():
    class Doubling(SvgDrawing):
        def lines(self, xs, ys):
            for i in range(len(xs)):
                xs[i] *= 2

    xs, ys = renderlib.float_vector([1, 2]), renderlib.float_vector([3, 4])
    doubling = Doubling()
    _renderlib.GfxInterface_lines(doubling.this, xs, ys)
    assert list(xs) == [2, 4] and list(ys) == [3, 4]


def test_method_wrapper_argument_errors():
    drawing = SvgDrawing()
    with pytest.raises(OverflowError, match="^in method 'GfxInterface_stipple_pattern', argument 2 of type "
                                            "'unsigned short'$"):
        _renderlib.GfxInterface_stipple_pattern(drawing.this, 65536)
    with pytest.raises(OverflowError, match="argument 2 of type 'unsigned short'"):
        _renderlib.GfxInterface_stipple_pattern(drawing.this, -1)
    with pytest.raises(ValueError, match="^invalid null reference in method 'GfxInterface_lines', argument 2 of "
                                         "type '%s'$" % FLOAT_VECTOR.replace("*", r"\*")):
        _renderlib.GfxInterface_lines(drawing.this, None, renderlib.float_vector())
    with pytest.raises(ValueError, match="argument 3 of type"):
        _renderlib.GfxInterface_lines(drawing.this, renderlib.float_vector(), None)
    with pytest.raises(TypeError, match="^in method 'GfxInterface_lines', argument 2 of type"):
        _renderlib.GfxInterface_lines(drawing.this, [1.0], renderlib.float_vector([1.0]))
    with pytest.raises(TypeError, match="^in method 'LoadFrameInterface_load_frame', argument 4 of type 'int'$"):
        _renderlib.LoadFrameInterface_load_frame(FrameSource(None).this, 0, 0, "1", 1)  # refused unconverted
    assert drawing.calls == []


def test_director_result_conversion():
    class Wrong(SvgDrawing):
        def get_text_length_in_pixels(self, text):
            return "wide"

    with pytest.raises(TypeError, match="^SWIG director type mismatch in output value of type 'long'$"):
        wrong = Wrong()
        _renderlib.GfxInterface_get_text_length_in_pixels(wrong.this, "x")

    class Failing(SvgDrawing):
        def circle(self, x, y, r):
            raise KeyError("the host's own error")

    with pytest.raises(KeyError, match="the host's own error"):
        failing = Failing()
        _renderlib.GfxInterface_circle(failing.this, 1, 2, 3)


def test_frame_source_results_through_the_wrappers():
    source = FrameSource(lambda input, frame: (input, frame, 0, 1))
    pixels = _renderlib.LoadFrameInterface_load_frame(source.this, 1, 7, 4, 2)
    assert pixels is source.kept[-1] and len(pixels) == 4 * 2 * 16
    # The wrapper's result is a reference of its own: the caller's, the
    # source's list and getrefcount's argument.
    assert sys.getrefcount(pixels) == 3
    info = _renderlib.LoadFrameInterface_current_raster_info(source.this, 1)
    assert info.this.own() and info is not source.current[1]
    assert (info.ds_xsize, info.ds_ysize, info.pixel_type) == (4, 2, _renderlib.pixel_rgbaf)

    class NotADescriptor(FrameSource):
        def current_raster_info(self, input):
            return solid_frame((0, 0, 0, 0), 1, 1)[1]

    with pytest.raises(TypeError, match="^SWIG director type mismatch in output value of type 'T_RasterInfo'$"):
        not_a_descriptor = NotADescriptor(None)
        _renderlib.LoadFrameInterface_current_raster_info(not_a_descriptor.this, 0)


def test_callback_objects_belong_to_python_until_disowned():
    drawing = SvgDrawing()
    alive = weakref.ref(drawing)
    del drawing
    gc.collect()
    assert alive() is None  # the native object holds no reference

    drawing = SvgDrawing()
    proxy = drawing.__disown__()
    assert isinstance(proxy, weakref.ProxyType)
    alive = weakref.ref(drawing)
    _renderlib.disown_GfxInterface(drawing)  # a second hand-over changes nothing
    del drawing
    gc.collect()
    # The native side now owns it, and it owns its Python instance.
    assert alive() is not None
    _renderlib.GfxInterface_flush(alive().this)
    assert alive().calls == [("flush", ())]
