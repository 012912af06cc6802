"""How the render calls convert their twenty arguments. The engine's render is
switched to return at once, so only the binding is exercised."""

import numpy
import pytest

import _renderlib
import renderlib

EFFECT = "render_tarsel_effect_to_native_image"
FLARE = "render_tarsel_lensflare_to_native_image"


@pytest.fixture
def quick(probe, instance):
    probe.render_returns_at_once()
    return instance("T_Blur")


def effect_arguments(effect, dest=None, rasters=None, images=None):
    return [
        effect,
        "",
        bytearray(16) if dest is None else dest,
        0,
        0,
        1,
        1,
        [renderlib.T_RasterInfo()] if rasters is None else rasters,
        [bytearray(16)] if images is None else images,
        1.0,
        1,
        1.0,
        0,
        0,
        0,
        25,
        False,
        "linear",
        "linear",
        "linear",
    ]


def flare_arguments(effect, dest=None, rasters=None, images=None):
    return [
        effect,
        "",
        0.5,
        0.5,
        bytearray(16) if dest is None else dest,
        0,
        0,
        1,
        1,
        [renderlib.T_RasterInfo()] if rasters is None else rasters,
        [bytearray(16)] if images is None else images,
        1.0,
        1,
        1.0,
        0,
        0,
        "linear",
        "linear",
        "linear",
        False,
    ]


CALLS = [(EFFECT, effect_arguments, 3, 8, 9), (FLARE, flare_arguments, 5, 10, 11)]


@pytest.mark.parametrize("name, arguments, dest_at, rasters_at, images_at", CALLS, ids=["effect", "flare"])
def test_lists_and_buffers(quick, probe, name, arguments, dest_at, rasters_at, images_at):
    call = getattr(_renderlib, name)
    assert call(*arguments(quick)) is True
    for rasters, images, arrays in (([], [], "null"), ([None, None], [None, bytearray(4)], "0x")):
        probe.clear_calls()
        call(*arguments(quick, rasters=rasters, images=images))
        logged = probe.calls()[-1]
        passed = logged[logged.index("(") + 1 : -1].split(", ")
        # Empty lists pass null arrays; lists of None pass arrays of null entries.
        assert passed[rasters_at - 1].startswith(arrays) and passed[images_at - 1].startswith(arrays)
    assert call(*arguments(quick, dest=bytes(16))) is True  # the destination needs no writability
    assert call(*arguments(quick, dest=numpy.zeros((4, 4), numpy.float32), images=[numpy.zeros(8)])) is True

    class ListSubclass(list):
        pass

    class MyRaster(renderlib.T_RasterInfo):
        pass

    assert call(*arguments(quick, rasters=ListSubclass([renderlib.T_RasterInfo()]))) is True
    refusals = [
        (
            dict(rasters=(renderlib.T_RasterInfo(),)),
            "in %s, arg %d of type T_RasterInfo **: expected list." % (name, rasters_at),
        ),
        (dict(images=(bytearray(4),)), "in %s, arg %d of type RawImage *: expected list." % (name, images_at)),
        (
            dict(rasters=[renderlib.T_RenderInfo()]),
            "in %s, arg %d of type T_RasterInfo **, elts should be T_RasterInfo" % (name, rasters_at),
        ),
        # a subclass under another name, and a bare pointer object, are refused alike
        (
            dict(rasters=[MyRaster()]),
            "in %s, arg %d of type T_RasterInfo **, elts should be T_RasterInfo" % (name, rasters_at),
        ),
        (
            dict(rasters=[renderlib.T_RasterInfo().this]),
            "in %s, arg %d of type T_RasterInfo **, elts should be T_RasterInfo" % (name, rasters_at),
        ),
        (
            dict(rasters=[type("T_RasterInfo", (), {})()]),
            "in method '%s', argument %d of type 'T_RasterInfo **': cannot convert to T_RasterInfo"
            % (name, rasters_at),
        ),
        (dict(images=[bytes(4)]), "in %s, arg %d, cannot get Py_buffer view; maybe has no size?" % (name, images_at)),
        (
            dict(images=[numpy.zeros((4, 4))[:, ::2]]),
            "in %s, arg %d, cannot get Py_buffer view; maybe has no size?" % (name, images_at),
        ),
        (
            dict(images=[5]),
            "in %s, arg %d, list must contain objects that support the buffer protocol" % (name, images_at),
        ),
        (dict(dest="pixels"), "in method '%s', argument %d of type '(RawImage)'" % (name, dest_at)),
        # the exporter raises ValueError for a strided array; the destination is refused as TypeError all the same
        (dict(dest=numpy.zeros((4, 4))[:, ::2]), "in method '%s', argument %d of type '(RawImage)'" % (name, dest_at)),
    ]
    for change, message in refusals:
        with pytest.raises(TypeError) as raised:
            call(*arguments(quick, **change))
        assert str(raised.value) == message


SCALARS = {
    EFFECT: {
        1: "EffectGlobals_t *",
        2: "char const *",
        4: "int",
        5: "int",
        6: "int",
        7: "int",
        10: "float",
        11: "int",
        12: "float",
        13: "int",
        14: "int",
        15: "int",
        16: "int",
        17: "bool",
        18: "char const *",
        19: "char const *",
        20: "char const *",
    },
    FLARE: {
        1: "EffectGlobals_t *",
        2: "char const *",
        3: "float",
        4: "float",
        6: "int",
        7: "int",
        8: "int",
        9: "int",
        12: "float",
        13: "int",
        14: "float",
        15: "int",
        16: "int",
        17: "char const *",
        18: "char const *",
        19: "char const *",
        20: "bool",
    },
}
BAD = {"EffectGlobals_t *": renderlib.Genotype(), "char const *": b"x", "int": 1.5, "float": "1", "bool": 1}


@pytest.mark.parametrize(
    "name, arguments", [(EFFECT, effect_arguments), (FLARE, flare_arguments)], ids=["effect", "flare"]
)
def test_every_scalar_position_names_itself(quick, name, arguments):
    call = getattr(_renderlib, name)
    for position, type_name in SCALARS[name].items():
        args = arguments(quick)
        args[position - 1] = BAD[type_name]
        with pytest.raises(TypeError) as raised:
            call(*args)
        assert str(raised.value) == "in method '%s', argument %d of type '%s'" % (name, position, type_name)
    for count in (19, 21):
        with pytest.raises(TypeError, match="^%s expected 20 arguments, got %d$" % (name, count)):
            call(*(arguments(quick) + [0])[:count])
