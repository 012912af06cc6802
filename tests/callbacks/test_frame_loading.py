"""The engine fetching other frames from a Python frame source during a
render: from its own threads while the render call waits without the
interpreter lock, with the descriptors and pixels handed back."""
import gc
import subprocess
import sys
import textwrap
import threading
import weakref

import numpy
import pytest

import _renderlib
import renderlib
from frame_source import FrameSource, pixels_of, solid_frame
from renderlib import effects

WIDTH, HEIGHT, FRAME = 16, 8, 10


def colour(input, frame):
    """Every frame of every input a colour of its own."""
    return (frame / 100.0, 0.1 + input / 10.0, 0.5, 1.0)


@pytest.fixture(autouse=True)
def no_frame_source_afterwards():
    yield
    _renderlib.set_load_frame_impl(None)


def echo(instance, **changes):
    texts = {"echoes": "3", "decay": "0.5", "frame_step": "-1", "combine": "Average"}
    texts.update(changes)
    effect = effects.recreate(instance("T_Echo"), texts)
    assert effect is not None
    return effect


def render(effect, inputs, frame=FRAME):
    """The rendered frame, premultiplied (the render writes straight colour)."""
    dest = solid_frame((0, 0, 0, 0), WIDTH, HEIGHT)
    assert effects.render(effect, dest, inputs, frame=frame)
    result = pixels_of(dest).copy()
    result[..., :3] *= result[..., 3:]
    return result


def source_frame(input=0, frame=FRAME):
    return solid_frame(colour(input, frame), WIDTH, HEIGHT)


def test_frames_come_from_an_engine_thread_and_are_used(instance):
    source = FrameSource(colour)
    _renderlib.set_load_frame_impl(source)
    effect = echo(instance)
    result = render(effect, [source_frame()])
    # The caller waits without the lock: the requests run on the engine's threads.
    assert source.threads and threading.get_ident() not in source.threads
    assert source.requests == [(0, 9, WIDTH, HEIGHT), (0, 8, WIDTH, HEIGHT)]
    expected = (numpy.array(colour(0, 10)) + 0.5 * numpy.array(colour(0, 9))
                + 0.25 * numpy.array(colour(0, 8))) / 1.75
    numpy.testing.assert_allclose(result, numpy.broadcast_to(expected, result.shape), rtol=1e-5)
    _renderlib.free_tarsel_effect(effect)


def test_the_size_asked_for_is_the_engines_not_the_frames(instance):
    source = FrameSource(colour, size=(4, 2))  # frames smaller than asked for
    _renderlib.set_load_frame_impl(source)
    effect = echo(instance, echoes="2")
    result = render(effect, [source_frame()])
    assert source.requests == [(0, 9, WIDTH, HEIGHT)]
    # The smaller frame covers the top-left corner only; elsewhere it is empty.
    current, earlier = numpy.array(colour(0, 10)), numpy.array(colour(0, 9))
    numpy.testing.assert_allclose(result[0, 0], (current + 0.5 * earlier) / 1.5, rtol=1e-5)
    numpy.testing.assert_allclose(result[HEIGHT - 1, WIDTH - 1], current / 1.5, rtol=1e-5)
    _renderlib.free_tarsel_effect(effect)


def test_several_inputs_and_frames(instance):
    source = FrameSource(lambda input, frame: colour(0, frame) if input == 0 else (1, 1, 1, 1))
    _renderlib.set_load_frame_impl(source)
    effect = effects.recreate(instance("T_TimeBlur"), {"frames_before": "2", "frames_after": "1"})
    matte = solid_frame((1, 1, 1, 1), WIDTH, HEIGHT)
    result = render(effect, [source_frame(), matte])
    asked = sorted((input, frame) for input, frame, _, _ in source.requests)
    assert asked == [(0, 8), (0, 9), (0, 11), (1, 8), (1, 9), (1, 11)]
    assert threading.get_ident() not in source.threads
    expected = numpy.mean([colour(0, f) for f in (8, 9, 10, 11)], axis=0)
    numpy.testing.assert_allclose(result, numpy.broadcast_to(expected, result.shape), rtol=1e-5)
    _renderlib.free_tarsel_effect(effect)


def test_trails_rebuild_their_previous_output_from_earlier_frames(instance):
    source = FrameSource(colour)
    _renderlib.set_load_frame_impl(source)
    effect = effects.recreate(instance("T_Trails"), {"persistence": "0.5"})
    render(effect, [source_frame()])
    frames = [frame for _, frame, _, _ in source.requests]
    assert frames == list(range(FRAME - 11, FRAME))  # 0.5 ** 11 is the first below 1/1024
    _renderlib.free_tarsel_effect(effect)


def test_a_source_that_goes_away_is_no_longer_called(instance):
    source = FrameSource(colour)
    _renderlib.set_load_frame_impl(source)
    collected = weakref.ref(source)
    del source
    gc.collect()
    assert collected() is None
    effect = echo(instance, echoes="2")
    numpy.testing.assert_array_equal(render(effect, [source_frame()]), pixels_of(source_frame()))
    _renderlib.free_tarsel_effect(effect)


def test_installing_replaces_and_none_removes(instance):
    first, second = FrameSource(colour), FrameSource(colour)
    effect = echo(instance, echoes="2")
    _renderlib.set_load_frame_impl(first)
    _renderlib.set_load_frame_impl(second)
    render(effect, [source_frame()])
    assert first.requests == [] and len(second.requests) == 1
    _renderlib.set_load_frame_impl(None)
    alone = render(effect, [source_frame()])
    assert len(second.requests) == 1
    # Only the current frame is at hand: the echo is that frame exactly.
    numpy.testing.assert_array_equal(alone, pixels_of(source_frame()))
    with pytest.raises(TypeError, match=r"^in method 'set_load_frame_impl', argument 1 of type "
                                        r"'LoadFrameInterface \*'$"):
        _renderlib.set_load_frame_impl(42)
    _renderlib.free_tarsel_effect(effect)


def test_an_aborted_installation_keeps_the_installed_source(instance, probe):
    kept, refused = FrameSource(colour), FrameSource(colour)
    _renderlib.set_load_frame_impl(kept)
    probe.abort_next_call()
    with pytest.raises(RuntimeError, match="^Tarsel Abort$"):
        _renderlib.set_load_frame_impl(refused)
    effect = echo(instance, echoes="2")
    render(effect, [source_frame()])
    assert len(kept.requests) == 1 and refused.requests == []
    _renderlib.free_tarsel_effect(effect)


def test_an_empty_bytearray_is_an_empty_frame_not_a_missing_one(instance):
    class Empty(FrameSource):
        def load_frame(self, input, frame, width, height):
            self.kept.append(bytearray())
            self.current[input] = renderlib.T_RasterInfo()
            self.current[input].pixel_type = _renderlib.pixel_rgbaf
            _renderlib.make_tarsel_raster_info(self.current[input], 0, 0)
            return self.kept[-1]

    source = Empty(colour)
    _renderlib.set_load_frame_impl(source)
    effect = echo(instance, echoes="2")
    result = render(effect, [source_frame()])
    # The empty frame counts, with nothing in it.
    numpy.testing.assert_allclose(result[0, 0], numpy.array(colour(0, 10)) / 1.5, rtol=1e-5)
    _renderlib.free_tarsel_effect(effect)


class Failing(FrameSource):
    """A frame source whose second request goes wrong in the way given."""

    def __init__(self, failure):
        super().__init__(colour)
        self.failure = failure

    def load_frame(self, input, frame, width, height):
        pixels = super().load_frame(input, frame, width, height)
        if len(self.requests) < 2:
            return pixels
        if self.failure == "raises":
            raise LookupError("frame %d is not on disk" % frame)
        if self.failure == "bytes":
            return bytes(pixels)
        if self.failure == "unreferenced":
            return bytearray(pixels)
        if self.failure == "short":
            self.kept.append(pixels[:-1])
            return self.kept[-1]

    def current_raster_info(self, input):
        if self.failure == "descriptor" and len(self.requests) >= 2:
            return "not a descriptor"
        return super().current_raster_info(input)


@pytest.mark.parametrize("failure, cause, message", [
    ("raises", LookupError, "frame 8 is not on disk"),
    ("descriptor", TypeError, "^SWIG director type mismatch in output value of type 'T_RasterInfo'$"),
    ("bytes", TypeError, "^load_frame must return a bytearray, not 'bytes'$"),
    ("unreferenced", ValueError, "^load_frame's bytearray must stay referenced by the host until the render returns$"),
    ("short", ValueError, "^load_frame returned 2047 bytes; its descriptor describes 2048$"),
])
def test_a_failed_request_ends_the_render_as_an_abort_caused_by_it(instance, probe, failure, cause, message):
    source = Failing(failure)
    _renderlib.set_load_frame_impl(source)
    effect = echo(instance, echoes="4")
    with pytest.raises(RuntimeError, match="^Tarsel Abort$") as raised:
        render(effect, [source_frame()])
    with pytest.raises(cause, match=message):
        raise raised.value.__cause__
    if failure == "raises":  # the host's own traceback comes along
        traceback = raised.value.__cause__.__traceback__
        while traceback.tb_next:
            traceback = traceback.tb_next
        assert traceback.tb_frame.f_code.co_name == "load_frame"
    # No request after the failed one; the abort was this render's alone.
    assert len(source.requests) == 2
    assert not probe.abort_requested()
    _renderlib.set_load_frame_impl(FrameSource(colour))
    render(effect, [source_frame()])
    _renderlib.free_tarsel_effect(effect)


def test_a_failing_source_never_hangs_the_render():
    # In a process of its own, so that a lock left held fails the test by its
    # timeout instead of stalling the suite.
    script = textwrap.dedent("""
        import time, renderlib, _renderlib
        from renderlib import effects
        class Raising(renderlib.LoadFrameInterface):
            def load_frame(self, input, frame, width, height):
                raise ValueError("gone")
            def current_raster_info(self, input):
                raise AssertionError("not reached")
        source = Raising()
        _renderlib.set_load_frame_impl(source)
        effect = _renderlib.init_tarsel_effect("T_Echo", False)
        dest, src = effects.raster(_renderlib.pixel_rgba8, 64, 64), effects.raster(_renderlib.pixel_rgba8, 64, 64)
        for _ in range(3):
            start = time.perf_counter()
            try:
                effects.render(effect, dest, [src])
            except RuntimeError as error:
                print(error, type(error.__cause__).__name__, round(time.perf_counter() - start, 3))
        _renderlib.set_load_frame_impl(None)
        print(effects.render(effect, dest, [src]))
    """)
    done = subprocess.run([sys.executable, "-c", script], capture_output=True, text=True, timeout=20)
    assert done.returncode == 0, done.stderr
    lines = done.stdout.splitlines()
    assert len(lines) == 4 and lines[-1] == "True", done.stdout
    for line in lines[:3]:
        text, seconds = line.rsplit(" ", 1)
        assert text == "Tarsel Abort ValueError" and float(seconds) < 1.0
