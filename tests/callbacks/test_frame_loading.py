"""The engine fetching other frames from a Python frame source during a
render: from its own threads while the render call waits without the
interpreter lock, with the descriptors and pixels handed back."""

import gc
import threading
import weakref

import numpy
import pytest

import _renderlib
import renderlib
from isolated import run_cleanly
from renderlib import effects

WIDTH, HEIGHT, FRAME = 16, 8, 10
ECHO = {"echoes": "3", "decay": "0.5", "frame_step": "-1", "combine": "Average"}


def colour(input, frame):
    """Every frame of every input a colour of its own."""
    return (frame / 100.0, 0.1 + input / 10.0, 0.5, 1.0)


def solid_frame(colour, width=WIDTH, height=HEIGHT):
    """A (T_RasterInfo, bytearray) pair of straight rgbaf pixels of one colour."""
    info, pixels = effects.raster(_renderlib.pixel_rgbaf, width, height)
    numpy.frombuffer(pixels, numpy.float32).reshape(-1, 4)[:] = colour
    return info, pixels


class FrameSource(renderlib.LoadFrameInterface):
    """Serves frame `f` of input `i` as a solid frame of colour(i, f), at the
    size the engine asks for unless `size` fixes one. Records each request
    with the thread it came on, and keeps every frame it handed out."""

    def __init__(self, colour=colour, size=None):
        super().__init__()
        self.colour, self.size = colour, size
        self.requests, self.threads, self.kept, self.current = [], set(), [], {}

    def load_frame(self, input, frame, width, height):
        self.requests.append((input, frame, width, height))
        self.threads.add(threading.get_ident())
        info, pixels = solid_frame(self.colour(input, frame), *(self.size or (width, height)))
        self.kept.append(pixels)
        self.current[input] = info
        return pixels

    def current_raster_info(self, input):
        return self.current[input]


@pytest.fixture
def effect(instance):
    """Factory of effect instances, an echo unless named, with changed
    settings; freed after the test, and no frame source is left installed."""
    made = []

    def make(name="T_Echo", **changes):
        made.append(effects.recreate(instance(name), dict(ECHO, **changes) if name == "T_Echo" else changes))
        return made[-1]

    yield make
    _renderlib.set_load_frame_impl(None)
    for each in made:
        _renderlib.free_tarsel_effect(each)


def render(effect, inputs=None):
    """The rendered frame (from the current frame of input 0 unless `inputs`
    are given), premultiplied: the render writes straight colour."""
    dest = solid_frame((0, 0, 0, 0))
    assert effects.render(effect, dest, inputs or [solid_frame(colour(0, FRAME))], frame=FRAME)
    result = numpy.frombuffer(dest[1], numpy.float32).reshape(HEIGHT, WIDTH, 4).copy()
    result[..., :3] *= result[..., 3:]
    return result


@pytest.mark.parametrize("size", [None, (4, 2)], ids=["frames as asked", "smaller frames"])
def test_frames_come_from_engine_threads_at_the_engines_size_and_are_used(effect, size):
    source = FrameSource(size=size)
    _renderlib.set_load_frame_impl(source)
    result = render(effect())
    # The caller waits without the lock: the requests run on the engine's threads.
    assert source.threads and threading.get_ident() not in source.threads
    assert source.requests == [(0, 9, WIDTH, HEIGHT), (0, 8, WIDTH, HEIGHT)]
    current, nine, eight = (numpy.array(colour(0, f)) for f in (10, 9, 8))
    expected = numpy.empty_like(result)
    expected[:] = (current + 0.5 * nine + 0.25 * eight) / 1.75
    if size:  # a smaller frame covers the top-left corner only; elsewhere it is empty
        expected[size[1] :, :] = expected[:, size[0] :] = current / 1.75
    numpy.testing.assert_allclose(result, expected, rtol=1e-5)


@pytest.mark.parametrize(
    "name, changes, asked",
    [
        ("T_TimeBlur", {"frames_before": "2", "frames_after": "1"}, [(0, 8), (0, 9), (0, 11), (1, 8), (1, 9), (1, 11)]),
        # Trails rebuild their previous output: 0.5 ** 11 is the first weight below 1/1024.
        ("T_Trails", {"persistence": "0.5"}, [(0, frame) for frame in range(FRAME - 11, FRAME)]),
    ],
)
def test_the_inputs_and_frames_an_effect_asks_for(effect, name, changes, asked):
    source = FrameSource(lambda input, frame: colour(0, frame) if input == 0 else (1, 1, 1, 1))
    _renderlib.set_load_frame_impl(source)
    blur = effect(name, **changes)
    inputs = [solid_frame(colour(0, FRAME)), solid_frame((1, 1, 1, 1))][: len(blur.effect_genotype._get_input_names())]
    result = render(blur, inputs)
    assert sorted((input, frame) for input, frame, _, _ in source.requests) == asked
    if name == "T_TimeBlur":
        expected = numpy.mean([colour(0, f) for f in (8, 9, 10, 11)], axis=0)
        numpy.testing.assert_allclose(result, numpy.broadcast_to(expected, result.shape), rtol=1e-5)


def test_a_source_that_goes_away_is_no_longer_called(effect, probe):
    first, second, refused = FrameSource(), FrameSource(), FrameSource()
    echo = effect(echoes="2")
    _renderlib.set_load_frame_impl(first)
    _renderlib.set_load_frame_impl(second)
    probe.abort_next_call()
    with pytest.raises(RuntimeError, match="^Tarsel Abort$"):  # an aborted installation changes nothing
        _renderlib.set_load_frame_impl(refused)
    render(echo)
    assert first.requests == refused.requests == [] and len(second.requests) == 1
    # The module keeps no reference: a source used and then dropped is collected.
    dropped = weakref.ref(second)
    del second
    gc.collect()
    assert dropped() is None
    # Only the current frame is at hand: the echo is that frame exactly.
    alone = numpy.broadcast_to(numpy.float32(colour(0, FRAME)), (HEIGHT, WIDTH, 4))
    numpy.testing.assert_array_equal(render(echo), alone)
    _renderlib.set_load_frame_impl(first)
    _renderlib.set_load_frame_impl(None)
    numpy.testing.assert_array_equal(render(echo), alone)
    assert first.requests == []  # nor is a source removed


def test_an_empty_bytearray_is_an_empty_frame_not_a_missing_one(effect):
    class Empty(FrameSource):
        def load_frame(self, input, frame, width, height):
            self.kept.append(bytearray())
            self.current[input] = renderlib.T_RasterInfo()
            self.current[input].pixel_type = _renderlib.pixel_rgbaf
            _renderlib.make_tarsel_raster_info(self.current[input], 0, 0)
            return self.kept[-1]

    source = Empty()  # referenced by the test: the module keeps none
    _renderlib.set_load_frame_impl(source)
    # The empty frame counts, with nothing in it.
    numpy.testing.assert_allclose(render(effect(echoes="2"))[0, 0], numpy.array(colour(0, 10)) / 1.5, rtol=1e-5)


# A source whose second request goes wrong in the way given, for two renders
# in a row, then a sound source: each failed render ends at once as an abort
# caused by the failure, with no request after it and no abort left behind.
# In a process of its own: a lock left held would hang the next render.
FAILING = """
import sys, time, _renderlib, renderlib
from engine_probe import EngineProbe
from renderlib import effects

class Source(renderlib.LoadFrameInterface):
    def __init__(self, failure=None):
        super().__init__()
        self.failure, self.requests, self.kept = failure, 0, []
    def load_frame(self, input, frame, width, height):
        self.requests += 1
        self.info, pixels = effects.raster(_renderlib.pixel_rgbaf, width, height)
        self.kept.append(pixels)
        if self.requests < 2 or self.failure in (None, "descriptor"):
            return pixels
        if self.failure == "raises":
            raise LookupError("frame %%d is not on disk" %% frame)
        if self.failure == "short":
            self.kept.append(pixels[:-1])
            return self.kept[-1]
        return {"bytes": bytes, "unreferenced": bytearray}[self.failure](pixels)
    def current_raster_info(self, input):
        return "not a descriptor" if self.failure == "descriptor" and self.requests > 1 else self.info

echo = effects.recreate(_renderlib.init_tarsel_effect("T_Echo", False), %r)
dest, current = effects.raster(_renderlib.pixel_rgbaf, 16, 8), effects.raster(_renderlib.pixel_rgbaf, 16, 8)
for source in (Source(sys.argv[1]), Source(sys.argv[1]), Source()):
    _renderlib.set_load_frame_impl(source)
    start = time.perf_counter()
    try:
        print(effects.render(echo, dest, [current], frame=10), source.requests)
    except RuntimeError as error:
        cause, where = error.__cause__, error.__cause__.__traceback__
        while where and where.tb_next:
            where = where.tb_next
        print("|".join(map(str, [error, type(cause).__name__, cause, source.requests, EngineProbe().abort_requested(),
                                 time.perf_counter() - start < 1.0,
                                 where is not None and where.tb_frame.f_code.co_name == "load_frame"])))
""" % dict(ECHO, echoes="4")


@pytest.mark.parametrize(
    "failure, cause, message",
    [
        ("raises", "LookupError", "frame 8 is not on disk"),
        ("descriptor", "TypeError", "SWIG director type mismatch in output value of type 'T_RasterInfo'"),
        ("bytes", "TypeError", "load_frame must return a bytearray, not 'bytes'"),
        (
            "unreferenced",
            "ValueError",
            "load_frame's bytearray must stay referenced by the host until the render returns",
        ),
        ("short", "ValueError", "load_frame returned 2047 bytes; its descriptor describes 2048"),
    ],
)
def test_a_failed_request_ends_the_render_as_an_abort_caused_by_it(failure, cause, message):
    out = run_cleanly(FAILING, timeout=30, args=[failure]).splitlines()
    in_load_frame = str(failure == "raises")  # the host's own exception comes with its traceback
    assert out == ["|".join(["Tarsel Abort", cause, message, "2", "False", "True", in_load_frame])] * 2 + ["True 3"]
