"""Rendering effects frame by frame into numpy arrays, with the inputs'
other frames served to the engine when an effect asks for them.

    with EffectRenderer("T_Glow", {"radius": "20"}, [card_frame]) as renderer:
        rgba = renderer.render(frame=0, width=640, height=360)

An input is a function of the frame number giving a float32 RGBA array
(height, width, 4), or None for an unconnected input."""

from __future__ import annotations

from typing import TYPE_CHECKING

import numpy

import _renderlib
import renderlib
from renderlib import arrays, effects

if TYPE_CHECKING:
    from collections.abc import Callable, Iterable, Mapping, Sequence

    from numpy.typing import ArrayLike, NDArray
    from typing_extensions import Self, TypeAlias

    # An input: a frame number's picture, as anything numpy turns into an
    # RGBA array; None for an unconnected input.
    _FrameSource: TypeAlias = "Callable[[int], ArrayLike] | None"


class EffectError(ValueError):
    """An effect or one of its parameter values does not exist."""


class RenderError(RuntimeError):
    """The engine did not render a frame; the message carries its messages."""


def card_frame(width: int, height: int, frame: int = 0) -> NDArray[numpy.float32]:
    """A test picture: a dusky gradient, colour bars along the bottom, and a
    white square that crosses the frame as `frame` goes from 0 to 24."""
    ys = numpy.linspace(0, 1, height, dtype=numpy.float32)[:, None]
    xs = numpy.linspace(0, 1, width, dtype=numpy.float32)[None, :]
    card = numpy.ones((height, width, 4), numpy.float32)
    card[:, :, 0] = 0.05 + 0.25 * xs * (1 - ys)
    card[:, :, 1] = 0.04 + 0.10 * ys
    card[:, :, 2] = 0.12 + 0.30 * ys
    bars = [(1, 1, 1), (1, 1, 0), (0, 1, 1), (0, 1, 0), (1, 0, 1), (1, 0, 0), (0, 0, 1)]
    top = height - max(height // 6, 1)
    for i, colour in enumerate(bars):
        card[top:, i * width // len(bars) : (i + 1) * width // len(bars), :3] = colour
    side = max(height // 5, 1)
    left = (frame % 25) * (width - side) // 24
    upper = (top - side) // 2
    card[upper : upper + side, left : left + side, :3] = 1
    return card


def effect_instance(name: str | None, params: Mapping[str, str | None] | None = None) -> renderlib.EffectGlobals_t:
    """A new instance of `name` (either catalogue) with `params` ({canonical
    name: text in the engine's text form}) applied. A value the engine cannot
    read raises EffectError with the engine's own message."""
    builder = effects.is_builder_effect(name)
    instance = _renderlib.init_tarsel_effect(name, builder)
    if instance is None:
        raise EffectError("no effect %r" % name)
    if not params:
        return instance
    complaints = []
    _renderlib.set_error_handler(
        lambda level, text: complaints.append(text) if level >= _renderlib.Err_Warning else None
    )
    try:
        changed = effects.recreate(instance, params)
    except KeyError as error:
        raise EffectError(error.args[0]) from None
    finally:
        _renderlib.set_error_handler(None)
        _renderlib.free_tarsel_effect(instance)
    if changed is None or complaints:
        if changed is not None:
            _renderlib.free_tarsel_effect(changed)
        raise EffectError("%s: %s" % (name, "; ".join(complaints) or "the engine refused the values"))
    return changed


class _InputFrames(renderlib.LoadFrameInterface):
    """Serves frame f of input i as the engine asks, keeping each answer
    until the render returns."""

    def __init__(self, inputs: Sequence[_FrameSource], width: int, height: int) -> None:
        super().__init__()
        self.inputs, self.width, self.height = inputs, width, height
        self.kept: dict[int, tuple[renderlib.T_RasterInfo, bytearray]] = {}

    def load_frame(self, input: int, frame: int, width: int, height: int) -> bytearray:
        source = self.inputs[input] if input < len(self.inputs) else None
        if source is None:  # unconnected: a transparent frame
            rgba = numpy.zeros((self.height, self.width, 4), numpy.float32)
        else:
            rgba = numpy.ascontiguousarray(source(frame), numpy.float32)
        self.kept[input] = (arrays.raster_info_for(rgba), bytearray(rgba.tobytes()))
        return self.kept[input][1]

    def current_raster_info(self, input: int) -> renderlib.T_RasterInfo:
        return self.kept[input][0]


class EffectRenderer:
    """An effect instance with its inputs, rendering whole frames. Use it as
    a context manager (or call close) to free the instance."""

    def __init__(
        self,
        name: str | None,
        params: Mapping[str, str | None] | None = None,
        inputs: Iterable[_FrameSource] = (),
        colorspace: str | None = "srgb",
    ) -> None:
        self.instance: renderlib.EffectGlobals_t | None = effect_instance(name, params)
        self.name = name
        genotype = self.instance.effect_genotype
        if genotype is None:
            self.close()
            raise EffectError("%s has no effect descriptor" % name)
        self.n_inputs = len(genotype._get_input_names())
        self.inputs = list(inputs)[: self.n_inputs]
        self.colorspace = colorspace

    def render(self, frame: int, width: int, height: int) -> NDArray[numpy.float32]:
        """Frame `frame` as float32 RGBA (height, width, 4)."""
        out = numpy.zeros((height, width, 4), numpy.float32)
        pairs = []
        for source in self.inputs + [None] * (self.n_inputs - len(self.inputs)):
            pairs.append(
                None if source is None else arrays.described(numpy.ascontiguousarray(source(frame), numpy.float32))
            )
        messages = []
        frames = _InputFrames(self.inputs, width, height)
        _renderlib.set_error_handler(lambda level, text: messages.append(text))
        _renderlib.set_load_frame_impl(frames)
        try:
            ok = effects.render(self.instance, arrays.described(out), pairs, frame=frame, colorspace=self.colorspace)
        finally:
            _renderlib.set_load_frame_impl(None)
            _renderlib.set_error_handler(None)
        if not ok:
            raise RenderError(
                "%s did not render frame %d: %s" % (self.name, frame, "; ".join(messages) or "no message")
            )
        return out

    def close(self) -> None:
        if self.instance is not None:
            _renderlib.free_tarsel_effect(self.instance)
            self.instance = None

    def __enter__(self) -> Self:
        return self

    def __exit__(self, *exc: object) -> None:
        self.close()
