"""Python drawing objects: called through the module's method wrappers,
handed over to the native side, and drawing effect widgets for the engine;
mouse events dragging the widgets. (Every wrapper's failure paths, the
abstract bases' included, and reference counts: tests/core.)"""

import gc
import weakref

import pytest

import _renderlib
import renderlib
from native_build import REPO
from renderlib.widgets import SvgDrawing

PICTURES = REPO / "build" / "test-renders"
VIEW = (960, 540, 0.0, 0.0, 0.5, 0.5)  # a 1920 x 1080 frame shown at half size
FRAME = [1920, 1080, 0]


@pytest.fixture
def drawing():
    drawing = SvgDrawing(char_width=4)
    _renderlib.tarsel_set_gfx_impl(drawing)
    yield drawing
    _renderlib.tarsel_set_gfx_impl(None)


def draw(effect, name=""):
    _renderlib.tarsel_widget_draw(effect, name, *VIEW, FRAME)


def mouse(effect, x, y, event, name=""):
    return _renderlib.tarsel_widget_mouse_event(effect, name, *VIEW, FRAME, x, y, event)


def value_of(effect, canonical_name):
    param = next(p for p in effect.effect_genotype._get_params() if p.get_canonical_name() == canonical_name)
    return [float(v) for v in param.to_string(None).split()]


def swatch(colour, top, label):
    """The drawing of a colour's swatch: filled, with a stippled white outline
    and its label."""
    return [
        ("color_3f", colour),
        ("line_width", (1.0,)),
        ("rect_filled", (10.0, top, 34.0, top + 16)),
        ("color_3f", (1.0, 1.0, 1.0)),
        ("stipple_pattern", (0x0F0F,)),
        ("stipple_on", ()),
        ("begin_line", ()),
        ("lines", ((10.0, 34.0, 34.0, 10.0, 10.0), (top, top, top + 16, top + 16, top))),
        ("end_line", ()),
        ("stipple_off", ()),
        ("draw_text", (label, 40.0, top + 14)),
    ]


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


def test_one_draw_in_order(instance, drawing):
    draw(instance("T_Gradient"))
    name, (context,) = drawing.calls[0]
    assert name == "set_graphics_context" and context is not None
    swatches = swatch((0.0, 0.0, 0.0), 10.0, "Start Color") + swatch((1.0, 1.0, 1.0), 34.0, "End Color")
    assert drawing.calls[1:] == [("start_drawing", (3,))] + swatches + [
        # The centre's handle, its name centred under it by its measured width.
        ("color_3f", (1.0, 1.0, 0.0)),
        ("line_width", (1.0,)),
        ("line", (466.0, 270.0, 494.0, 270.0)),
        ("line", (480.0, 256.0, 480.0, 284.0)),
        ("circle", (480.0, 270.0, 10.0)),
        ("get_text_length_in_pixels", ("Center",)),
        ("draw_text", ("Center", 468.0, 294.0)),
        ("flush", ()),
        ("end_drawing", ()),
    ]


def test_widget_pictures_use_every_drawing_operation(instance, drawing):
    """Draws each effect's widgets to an SVG file a person can look at."""
    used = set()
    for plugin in ("T_Gradient", "T_LensFlare", "T_Transform", "T_Caption", "T_Blur"):
        drawing.calls.clear()
        draw(instance(plugin))
        operations = drawing.operations()
        assert operations[1] == "start_drawing" and operations[-2:] == ["flush", "end_drawing"], plugin
        used.update(operations)
        PICTURES.mkdir(parents=True, exist_ok=True)
        (PICTURES / ("widgets-%s.svg" % plugin)).write_text(drawing.svg(*VIEW[:2]))
    assert used == {name for name in dir(renderlib.GfxInterface) if not name.startswith("_") and name != "thisown"}


def test_a_drag_moves_a_point_by_the_mouse_travel_and_scales_a_colour(instance, drawing):
    effect = instance("T_Gradient")
    assert value_of(effect, "center") == [0.5, 0.5]
    # The handle is at the frame's centre: (480, 270) on screen.
    assert mouse(effect, 480, 270, _renderlib.MouseEventType_PRESS) == (1, ())
    status, changed = mouse(effect, 500, 280, _renderlib.MouseEventType_DRAG)
    assert status == 1 and [name for name, _ in changed] == ["center"]
    # 20 and 10 screen pixels at half size: 40 and 20 frame pixels.
    assert changed[0][1] == pytest.approx((0.5 + 40 / 1920, 0.5 + 20 / 1080, 0, 0))
    assert value_of(effect, "center") == pytest.approx([0.5 + 40 / 1920, 0.5 + 20 / 1080])
    # The held handle is drawn wider.
    draw(effect)
    assert ("line_width", (2.0,)) in drawing.calls
    status, changed = mouse(effect, 540, 270, _renderlib.MouseEventType_RELEASE)
    assert status == 2 and changed[0][1] == pytest.approx((0.5 + 120 / 1920, 0.5, 0, 0))
    # Let go: moving on drags nothing.
    assert mouse(effect, 700, 400, _renderlib.MouseEventType_DRAG) == (0, ())
    assert value_of(effect, "center") == pytest.approx([0.5 + 120 / 1920, 0.5])
    # A colour swatch's drag scales the colour: 100 pixels left halves it.
    before = value_of(effect, "end_color")
    assert mouse(effect, 20, 40, _renderlib.MouseEventType_PRESS) == (1, ())
    status, changed = mouse(effect, 20 - 100, 40, _renderlib.MouseEventType_DRAG)
    assert status == 1 and changed[0][0] == "end_color"
    assert value_of(effect, "end_color") == pytest.approx([c / 2 for c in before[:3]] + before[3:])


def test_events_that_touch_nothing(instance, drawing):
    effect = instance("T_Gradient")
    assert mouse(effect, 900, 500, _renderlib.MouseEventType_MOVE) == (0, ())
    assert mouse(effect, 481, 271, _renderlib.MouseEventType_MOVE) == (1, ())
    # Any integer is taken as the event kind; the engine decides what it means.
    assert mouse(effect, 900, 500, 77) == (0, ())
    # Only the widget named is hit.
    assert mouse(effect, 480, 270, _renderlib.MouseEventType_PRESS, "start_color") == (0, ())
    assert drawing.calls == []  # mouse events draw nothing


@pytest.mark.parametrize(
    "operation, cause, message",
    [
        ("rect_filled", ZeroDivisionError, "^the host's drawing failed$"),
        ("get_text_length_in_pixels", TypeError, "^SWIG director type mismatch in output value of type 'long'$"),
    ],
)
@pytest.mark.usefixtures("drawing")  # taken out again afterwards
def test_a_failed_drawing_call_aborts_the_draw_with_it_as_cause(instance, probe, operation, cause, message):
    class Failing(SvgDrawing):
        def _record(self, name, *args):
            super()._record(name, *args)
            if name == operation and cause is ZeroDivisionError:
                raise ZeroDivisionError("the host's drawing failed")

        def get_text_length_in_pixels(self, text):
            super().get_text_length_in_pixels(text)
            return "wide"  # not a length; the failing drawing call comes before any measure

    effect = instance("T_Gradient")
    failing = Failing()
    _renderlib.tarsel_set_gfx_impl(failing)
    with pytest.raises(RuntimeError, match="^Tarsel Abort$") as raised:
        draw(effect)
    with pytest.raises(cause, match=message):
        raise raised.value.__cause__
    # Nothing was drawn after the failure, and the abort was that call's alone.
    assert failing.operations()[-1] == operation
    assert not probe.abort_requested()


def test_a_drawing_object_that_goes_away_is_taken_back(instance, error_handler_removed):
    messages = []
    _renderlib.set_error_handler(lambda level, text: messages.append((level, text)))
    effect = instance("T_Gradient")
    drawing = SvgDrawing()
    _renderlib.tarsel_set_gfx_impl(drawing)
    draw(effect)
    assert drawing.calls and not messages
    # The module keeps no reference: the object goes with its last one.
    dropped = weakref.ref(drawing)
    del drawing
    gc.collect()
    assert dropped() is None
    draw(effect)  # the engine has no drawing object now
    assert messages and messages[-1][0] == _renderlib.Err_Error
