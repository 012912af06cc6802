"""Many renders with frame requests and many widget calls leave memory,
reference counts and the callback objects' lifetimes as they found them."""
import gc
import sys
import weakref

import pytest

import _renderlib
from frame_source import FrameSource, solid_frame
from process_memory import UNDER_ADDRESS_SANITIZER, resident_kib
from renderlib import effects
from renderlib.widgets import SvgDrawing

ROUNDS = 1000


class ReusingSource(FrameSource):
    """Hands out the same two frames over and over, so that only the binding
    could make memory grow."""

    def __init__(self):
        super().__init__(None)
        self.frame = solid_frame((0.25, 0.5, 0.75, 1.0), 16, 8)

    def load_frame(self, input, frame, width, height):
        self.requests.append(frame)
        return self.frame[1]

    def current_raster_info(self, input):
        return self.frame[0]


class FailingSource(ReusingSource):
    def load_frame(self, input, frame, width, height):
        raise ValueError("no frame %d" % frame)


def check_flat(step, watched):
    step()  # the first round makes the engine's caches and pools
    gc.collect()
    counts = [sys.getrefcount(item) for item in watched]
    objects, rss = len(gc.get_objects()), resident_kib()
    for _ in range(ROUNDS):
        step()
    gc.collect()
    assert [sys.getrefcount(item) for item in watched] == counts
    assert len(gc.get_objects()) - objects < 50
    if not UNDER_ADDRESS_SANITIZER:
        assert resident_kib() - rss < 2048, "resident memory grew by %d KiB" % (resident_kib() - rss)


def test_renders_with_frame_requests(instance):
    effect = effects.recreate(instance("T_Echo"), {"echoes": "3"})
    source, failing = ReusingSource(), FailingSource()
    dest, current = solid_frame((0, 0, 0, 0), 16, 8), solid_frame((1, 0, 0, 1), 16, 8)

    def step():
        _renderlib.set_load_frame_impl(source)
        assert effects.render(effect, dest, [current])
        _renderlib.set_load_frame_impl(failing)
        with pytest.raises(RuntimeError, match="^Tarsel Abort$"):
            effects.render(effect, dest, [current])

    try:
        check_flat(step, [source, failing, source.frame[0], source.frame[1], effect, dest[1], current[1]])
    finally:
        _renderlib.set_load_frame_impl(None)
    assert len(source.requests) == 2 * (ROUNDS + 1)
    _renderlib.free_tarsel_effect(effect)


def test_widget_draws_and_mouse_events(instance):
    effect = instance("T_LensFlare")
    drawing = SvgDrawing()
    view = (960, 540, 0.0, 0.0, 0.5, 0.5)

    def step():
        drawing.calls.clear()
        _renderlib.tarsel_widget_draw(effect, "", *view, [1920, 1080, 0])
        _renderlib.tarsel_widget_mouse_event(effect, "", *view, [1920, 1080], 10, 10, 0)

    _renderlib.tarsel_set_gfx_impl(drawing)
    try:
        check_flat(step, [drawing, effect])
    finally:
        _renderlib.tarsel_set_gfx_impl(None)


def test_callback_objects_are_collected_once_released(instance):
    source, drawing = ReusingSource(), SvgDrawing()
    _renderlib.set_load_frame_impl(source)
    _renderlib.tarsel_set_gfx_impl(drawing)
    effect = effects.recreate(instance("T_Echo"), {"echoes": "2"})
    effects.render(effect, solid_frame((0, 0, 0, 0), 16, 8), [solid_frame((1, 0, 0, 1), 16, 8)])
    _renderlib.tarsel_widget_draw(effect, "", 960, 540, 0.0, 0.0, 0.5, 0.5, [])
    assert source.requests and drawing.calls
    released = [weakref.ref(source), weakref.ref(drawing)]
    del source, drawing
    gc.collect()
    assert [ref() for ref in released] == [None, None]
    _renderlib.free_tarsel_effect(effect)
