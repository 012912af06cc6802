"""Effect instances as a host uses them: walking the catalogues and the saved
text of an instance.

Saved text is what ``init_tarsel_effect_from_string`` takes: a JSON object
``{"effect": plug-in name, "builder": bool, "params": {canonical name: text}}``
where each text is the parameter's ``to_string`` form. Changing values from
Python goes through it: ``recreate(instance, {"radius": "12"})``."""

from __future__ import annotations

import json
from typing import TYPE_CHECKING

import _renderlib
import renderlib

if TYPE_CHECKING:
    from collections.abc import Mapping, Sequence

    from typing_extensions import Buffer


def catalogue(builder: bool = False) -> list[renderlib.Plugin_Info | None]:
    """The Plugin_Info entries of the effect catalogue (or of the effect
    builder's), in catalogue order."""
    count = _renderlib.get_n_tarsel_builder_effects() if builder else _renderlib.get_n_tarsel_effects()
    entry = _renderlib.get_tarsel_builder_info_i if builder else _renderlib.get_tarsel_plugin_info_i
    return [entry(i) for i in range(count)]


def is_builder_effect(plugin_name: str | None) -> bool:
    return any(info is not None and info.plugin_name == plugin_name for info in catalogue(builder=True))


def parameter_texts(instance: renderlib.EffectGlobals_t) -> dict[str, str | None]:
    """{canonical name: to_string text} for the parameters of the effect the
    instance runs, in table order."""
    texts = {}
    genotype = instance.effect_genotype
    if genotype is None:
        raise ValueError("%s has no effect descriptor" % instance.plugin_name)
    for param in filter(None, genotype._get_params()):
        name = param.get_canonical_name()
        if name:
            texts[name] = param.to_string(None)
    return texts


def saved_text(instance: renderlib.EffectGlobals_t, changes: Mapping[str, str | None] | None = None) -> str:
    """The saved text of `instance`, with `changes` ({canonical name: text})
    applied over its current values. An unknown name raises KeyError."""
    texts = parameter_texts(instance)
    for name, text in (changes or {}).items():
        if name not in texts:
            raise KeyError("%s has no parameter %r" % (instance.plugin_name, name))
        texts[name] = text
    return json.dumps(
        {"effect": instance.plugin_name, "builder": is_builder_effect(instance.plugin_name), "params": texts}
    )


def recreate(
    instance: renderlib.EffectGlobals_t, changes: Mapping[str, str | None] | None = None
) -> renderlib.EffectGlobals_t | None:
    """A new instance of the same effect with the same values, `changes`
    applied; None when the engine refuses the saved text as a whole. A value
    text the engine cannot read is left at the effect's default with an
    Err_Warning message (renderlib.rendering.effect_instance refuses it)."""
    return _renderlib.init_tarsel_effect_from_string(saved_text(instance, changes))


def raster(pixel_type: int, width: int, height: int) -> tuple[renderlib.T_RasterInfo, bytearray]:
    """A T_RasterInfo filled by the engine for `pixel_type` at width x height,
    and a zeroed bytearray of the size it needs."""
    info = renderlib.T_RasterInfo()
    info.pixel_type = pixel_type
    size = _renderlib.make_tarsel_raster_info(info, width, height)
    if size <= 0:
        raise ValueError("the engine cannot lay out pixel type %d at %dx%d" % (pixel_type, width, height))
    return info, bytearray(size)


def render(
    instance: renderlib.EffectGlobals_t | None,
    dest: tuple[renderlib.T_RasterInfo | None, Buffer],
    inputs: Sequence[tuple[renderlib.T_RasterInfo | None, Buffer | None] | None] = (),
    previous: Buffer | None = None,
    frame: int = 0,
    colorspace: str | None = "linear",
) -> bool:
    """Renders one frame of `instance` into `dest`, a (T_RasterInfo, buffer)
    pair, from `inputs`, a sequence of such pairs or None for an unconnected
    input, with `previous` the previous output's buffer (or None). Returns the
    engine's answer; the engine's messages say why a render failed."""
    rasters = [dest[0]] + [pair[0] if pair else None for pair in inputs]
    images = [previous] + [pair[1] if pair else None for pair in inputs]
    return _renderlib.render_tarsel_effect_to_native_image(
        instance,
        "",
        dest[1],
        frame,
        0,
        1,
        1,
        rasters,
        images,
        1.0,
        len(rasters),
        1.0,
        0,
        0,
        0,
        25,
        False,
        colorspace,
        colorspace,
        "linear",
    )
