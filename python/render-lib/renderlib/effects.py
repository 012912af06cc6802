"""Effect instances as a host uses them: walking the catalogues and the saved
text of an instance.

Saved text is what ``init_tarsel_effect_from_string`` takes: a JSON object
``{"effect": plug-in name, "builder": bool, "params": {canonical name: text}}``
where each text is the parameter's ``to_string`` form. Changing values from
Python goes through it: ``recreate(instance, {"radius": "12"})``."""
import json

import _renderlib
import renderlib


def catalogue(builder=False):
    """The Plugin_Info entries of the effect catalogue (or of the effect
    builder's), in catalogue order."""
    count = _renderlib.get_n_tarsel_builder_effects() if builder else _renderlib.get_n_tarsel_effects()
    entry = _renderlib.get_tarsel_builder_info_i if builder else _renderlib.get_tarsel_plugin_info_i
    return [entry(i) for i in range(count)]


def is_builder_effect(plugin_name):
    return any(info.plugin_name == plugin_name for info in catalogue(builder=True))


def parameter_texts(instance):
    """{canonical name: to_string text} for the parameters of the effect the
    instance runs, in table order."""
    texts = {}
    for param in instance.effect_genotype._get_params():
        name = param.get_canonical_name()
        if name:
            texts[name] = param.to_string(None)
    return texts


def saved_text(instance, changes=None):
    """The saved text of `instance`, with `changes` ({canonical name: text})
    applied over its current values. An unknown name raises KeyError."""
    texts = parameter_texts(instance)
    for name, text in (changes or {}).items():
        if name not in texts:
            raise KeyError("%s has no parameter %r" % (instance.plugin_name, name))
        texts[name] = text
    return json.dumps({"effect": instance.plugin_name, "builder": is_builder_effect(instance.plugin_name),
                       "params": texts})


def recreate(instance, changes=None):
    """A new instance of the same effect with the same values, `changes`
    applied; None when the engine refuses the saved text as a whole. A value
    text the engine cannot read is left at the effect's default with an
    Err_Warning message (renderlib.rendering.effect_instance refuses it)."""
    return _renderlib.init_tarsel_effect_from_string(saved_text(instance, changes))


def raster(pixel_type, width, height):
    """A T_RasterInfo filled by the engine for `pixel_type` at width x height,
    and a zeroed bytearray of the size it needs."""
    info = renderlib.T_RasterInfo()
    info.pixel_type = pixel_type
    size = _renderlib.make_tarsel_raster_info(info, width, height)
    if size <= 0:
        raise ValueError("the engine cannot lay out pixel type %d at %dx%d" % (pixel_type, width, height))
    return info, bytearray(size)


def render(instance, dest, inputs=(), previous=None, frame=0, colorspace="linear"):
    """Renders one frame of `instance` into `dest`, a (T_RasterInfo, buffer)
    pair, from `inputs`, a sequence of such pairs or None for an unconnected
    input, with `previous` the previous output's buffer (or None). Returns the
    engine's answer; the engine's messages say why a render failed."""
    rasters = [dest[0]] + [pair[0] if pair else None for pair in inputs]
    images = [previous] + [pair[1] if pair else None for pair in inputs]
    return _renderlib.render_tarsel_effect_to_native_image(
        instance, "", dest[1], frame, 0, 1, 1, rasters, images, 1.0, len(rasters), 1.0, 0, 0, 0, 25, False,
        colorspace, colorspace, "linear")
