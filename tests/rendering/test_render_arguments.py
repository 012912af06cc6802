"""How the render calls convert their twenty arguments. The engine's render is
switched to return at once, so only the binding is exercised."""

import numpy
import pytest

import _renderlib
import renderlib

EFFECT = "render_tarsel_effect_to_native_image"
FLARE = "render_tarsel_lensflare_to_native_image"
# Where each call takes its destination, its descriptor list and its image list.
POSITIONS = {EFFECT: (3, 8, 9), FLARE: (5, 10, 11)}


@pytest.fixture
def quick(probe, instance):
    probe.render_returns_at_once()
    return instance("T_Blur")


def arguments(name, effect, dest=None, rasters=None, images=None):
    """A call of `name` that converts, with the given buffers and lists."""
    dest = bytearray(16) if dest is None else dest
    rasters = [renderlib.T_RasterInfo()] if rasters is None else rasters
    images = [bytearray(16)] if images is None else images
    if name == EFFECT:
        return [effect, "", dest, 0, 0, 1, 1, rasters, images, 1.0, 1, 1.0, 0, 0, 0, 25, False, *["linear"] * 3]
    return [effect, "", 0.5, 0.5, dest, 0, 0, 1, 1, rasters, images, 1.0, 1, 1.0, 0, 0, *["linear"] * 3, False]


@pytest.mark.parametrize("name", [EFFECT, FLARE], ids=["effect", "flare"])
def test_lists_and_buffers(quick, probe, name):
    call = getattr(_renderlib, name)
    dest_at, rasters_at, images_at = POSITIONS[name]
    assert call(*arguments(name, quick)) is True
    for rasters, images, arrays in (([], [], "null"), ([None, None], [None, bytearray(4)], "0x")):
        probe.clear_calls()
        call(*arguments(name, quick, rasters=rasters, images=images))
        logged = probe.calls()[-1]
        passed = logged[logged.index("(") + 1 : -1].split(", ")
        # Empty lists pass null arrays; lists of None pass arrays of null entries.
        assert passed[rasters_at - 1].startswith(arrays) and passed[images_at - 1].startswith(arrays)
    assert call(*arguments(name, quick, dest=bytes(16))) is True  # the destination needs no writability
    assert call(*arguments(name, quick, dest=numpy.zeros((4, 4), numpy.float32), images=[numpy.zeros(8)])) is True
    ListSubclass, MyRaster = type("ListSubclass", (list,), {}), type("MyRaster", (renderlib.T_RasterInfo,), {})
    assert call(*arguments(name, quick, rasters=ListSubclass([renderlib.T_RasterInfo()]))) is True
    not_a_list = "in %s, arg %d of type %s: expected list."
    not_a_raster = "in %s, arg %d of type T_RasterInfo **, elts should be T_RasterInfo" % (name, rasters_at)
    no_view = "in %s, arg %d, cannot get Py_buffer view; maybe has no size?" % (name, images_at)
    not_pixels = "in method '%s', argument %d of type '(RawImage)'" % (name, dest_at)
    foreign = "in method '%s', argument %d of type 'T_RasterInfo **': cannot convert to T_RasterInfo"
    no_buffers = "in %s, arg %d, list must contain objects that support the buffer protocol" % (name, images_at)
    refusals = [
        (dict(rasters=(renderlib.T_RasterInfo(),)), not_a_list % (name, rasters_at, "T_RasterInfo **")),
        (dict(images=(bytearray(4),)), not_a_list % (name, images_at, "RawImage *")),
        (dict(rasters=[renderlib.T_RenderInfo()]), not_a_raster),
        # a subclass under another name, and a bare pointer object, are refused alike
        (dict(rasters=[MyRaster()]), not_a_raster),
        (dict(rasters=[renderlib.T_RasterInfo().this]), not_a_raster),
        (dict(rasters=[type("T_RasterInfo", (), {})()]), foreign % (name, rasters_at)),  # a class of the same name
        (dict(images=[bytes(4)]), no_view),
        (dict(images=[numpy.zeros((4, 4))[:, ::2]]), no_view),
        (dict(images=[5]), no_buffers),
        (dict(dest="pixels"), not_pixels),
        # the exporter raises ValueError for a strided array; the destination is refused as TypeError all the same
        (dict(dest=numpy.zeros((4, 4))[:, ::2]), not_pixels),
    ]
    for change, message in refusals:
        with pytest.raises(TypeError) as raised:
            call(*arguments(name, quick, **change))
        assert str(raised.value) == message


# The kind of each argument, in order; "-" for the buffers and lists (test_lists_and_buffers).
KINDS = {
    EFFECT: "instance text - int int int int - - float int float int int int int bool text text text".split(),
    FLARE: "instance text float float - int int int int - - float int float int int text text text bool".split(),
}
# Each kind's C type, as a refusal names it, and a value it refuses.
C_TYPES = {"instance": "EffectGlobals_t *", "text": "char const *", "int": "int", "float": "float", "bool": "bool"}
REFUSED = {"instance": renderlib.Genotype(), "text": b"x", "int": 1.5, "float": "1", "bool": 1}


@pytest.mark.parametrize("name", [EFFECT, FLARE], ids=["effect", "flare"])
def test_every_scalar_position_names_itself(quick, name):
    call = getattr(_renderlib, name)
    for position, kind in enumerate(KINDS[name], start=1):
        if kind == "-":
            continue
        args = arguments(name, quick)
        args[position - 1] = REFUSED[kind]
        with pytest.raises(TypeError) as raised:
            call(*args)
        assert str(raised.value) == "in method '%s', argument %d of type '%s'" % (name, position, C_TYPES[kind])
    for count in (19, 21):
        with pytest.raises(TypeError, match="^%s expected 20 arguments, got %d$" % (name, count)):
            call(*(arguments(name, quick) + [0])[:count])
