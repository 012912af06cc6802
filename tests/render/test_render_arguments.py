"""How the render calls convert their twenty arguments. The engine's render is
switched to return at once, so only the binding is exercised."""
import sys

import numpy
import pytest

import _renderlib
import renderlib
from process_memory import UNDER_ADDRESS_SANITIZER, resident_kib

EFFECT = "render_tarsel_effect_to_native_image"
FLARE = "render_tarsel_lensflare_to_native_image"


@pytest.fixture
def quick(probe, instance):
    probe.render_returns_at_once()
    return instance("T_Blur")


def effect_arguments(effect, dest=None, rasters=None, images=None):
    return [effect, "", bytearray(16) if dest is None else dest, 0, 0, 1, 1,
            [renderlib.T_RasterInfo()] if rasters is None else rasters,
            [bytearray(16)] if images is None else images,
            1.0, 1, 1.0, 0, 0, 0, 25, False, "linear", "linear", "linear"]


def flare_arguments(effect, dest=None, rasters=None, images=None):
    return [effect, "", 0.5, 0.5, bytearray(16) if dest is None else dest, 0, 0, 1, 1,
            [renderlib.T_RasterInfo()] if rasters is None else rasters,
            [bytearray(16)] if images is None else images,
            1.0, 1, 1.0, 0, 0, "linear", "linear", "linear", False]


CALLS = [(EFFECT, effect_arguments, 3, 8, 9), (FLARE, flare_arguments, 5, 10, 11)]


@pytest.mark.parametrize("name, arguments, dest_at, rasters_at, images_at", CALLS, ids=["effect", "flare"])
def test_lists_and_buffers(quick, probe, name, arguments, dest_at, rasters_at, images_at):
    call = getattr(_renderlib, name)
    assert call(*arguments(quick)) is True
    for rasters, images, arrays in (([], [], "null"), ([None, None], [None, bytearray(4)], "0x")):
        probe.clear_calls()
        call(*arguments(quick, rasters=rasters, images=images))
        logged = probe.calls()[-1]
        passed = logged[logged.index("(") + 1:-1].split(", ")
        # Empty lists pass null arrays; lists of None pass arrays of null entries.
        assert passed[rasters_at - 1].startswith(arrays) and passed[images_at - 1].startswith(arrays)
    assert call(*arguments(quick, dest=bytes(16))) is True  # the destination needs no writability
    assert call(*arguments(quick, dest=numpy.zeros((4, 4), numpy.float32), images=[numpy.zeros(8)])) is True

    class ListSubclass(list):
        pass

    assert call(*arguments(quick, rasters=ListSubclass([renderlib.T_RasterInfo()]))) is True
    refusals = [
        (dict(rasters=(renderlib.T_RasterInfo(),)), "in %s, arg %d of type T_RasterInfo **: expected list." % (name, rasters_at)),
        (dict(images=(bytearray(4),)), "in %s, arg %d of type RawImage *: expected list." % (name, images_at)),
        (dict(rasters=[renderlib.T_RenderInfo()]), "in %s, arg %d of type T_RasterInfo **, elts should be T_RasterInfo" % (name, rasters_at)),
        (dict(images=[bytes(4)]), "in %s, arg %d, cannot get Py_buffer view; maybe has no size?" % (name, images_at)),
        (dict(images=[numpy.zeros((4, 4))[:, ::2]]), "in %s, arg %d, cannot get Py_buffer view; maybe has no size?" % (name, images_at)),
        (dict(images=[5]), "in %s, arg %d, list must contain objects that support the buffer protocol" % (name, images_at)),
        (dict(dest="pixels"), "in method '%s', argument %d of type '(RawImage)'" % (name, dest_at)),
        # the exporter raises ValueError for a strided array; the destination is refused as TypeError all the same
        (dict(dest=numpy.zeros((4, 4))[:, ::2]), "in method '%s', argument %d of type '(RawImage)'" % (name, dest_at)),
    ]
    for change, message in refusals:
        with pytest.raises(TypeError) as raised:
            call(*arguments(quick, **change))
        assert str(raised.value) == message


def test_a_subclass_under_another_name_is_refused_but_a_bare_proxy_too(quick):
    class MyRaster(renderlib.T_RasterInfo):
        pass

    for item in (MyRaster(), renderlib.T_RasterInfo().this):
        with pytest.raises(TypeError, match=r"elts should be T_RasterInfo$"):
            _renderlib.render_tarsel_effect_to_native_image(*effect_arguments(quick, rasters=[item]))


def test_a_record_named_t_rasterinfo_that_does_not_convert(quick):
    impostor = type("T_RasterInfo", (), {})()
    with pytest.raises(TypeError, match=r"^in method 'render_tarsel_effect_to_native_image', argument 8 of type "
                                        r"'T_RasterInfo \*\*': cannot convert to T_RasterInfo$"):
        _renderlib.render_tarsel_effect_to_native_image(*effect_arguments(quick, rasters=[impostor]))


SCALARS = {EFFECT: {1: "EffectGlobals_t *", 2: "char const *", 4: "int", 5: "int", 6: "int", 7: "int", 10: "float",
                    11: "int", 12: "float", 13: "int", 14: "int", 15: "int", 16: "int", 17: "bool",
                    18: "char const *", 19: "char const *", 20: "char const *"},
           FLARE: {1: "EffectGlobals_t *", 2: "char const *", 3: "float", 4: "float", 6: "int", 7: "int", 8: "int",
                   9: "int", 12: "float", 13: "int", 14: "float", 15: "int", 16: "int", 17: "char const *",
                   18: "char const *", 19: "char const *", 20: "bool"}}
BAD = {"EffectGlobals_t *": renderlib.Genotype(), "char const *": b"x", "int": 1.5, "float": "1", "bool": 1}


@pytest.mark.parametrize("name, arguments", [(EFFECT, effect_arguments), (FLARE, flare_arguments)], ids=["effect", "flare"])
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


def test_no_argument_gains_or_loses_references_over_ten_thousand_calls(quick):
    dest, image, raster = bytearray(16), bytearray(16), renderlib.T_RasterInfo()
    rasters, images = [raster, None], [image, None]
    good = effect_arguments(quick, dest=dest, rasters=rasters, images=images)
    failing = []
    for position, type_name in SCALARS[EFFECT].items():
        args = list(good)
        args[position - 1] = BAD[type_name]
        failing.append(args)
    failing.append(good[:7] + [[raster, 5]] + good[8:])
    failing.append(good[:8] + [[image, 5]] + good[9:])
    # The objects the calls are given (shared constants such as "" or 1 are left out:
    # the interpreter itself moves their counts).
    watched = [dest, image, raster, rasters, images, quick] + [
        a for args in failing for a in args if not isinstance(a, (int, float, str, bytes))]
    before = [sys.getrefcount(item) for item in watched]
    rss = resident_kib()
    for _ in range(10_000 // (len(failing) + 1)):
        _renderlib.render_tarsel_effect_to_native_image(*good)
        for args in failing:
            with pytest.raises(TypeError):
                _renderlib.render_tarsel_effect_to_native_image(*args)
    assert [sys.getrefcount(item) for item in watched] == before
    if not UNDER_ADDRESS_SANITIZER:
        assert resident_kib() - rss < 1024, "resident memory grew by %d KiB" % (resident_kib() - rss)
    image.extend(b"x")  # no view of the input is left behind: it can be resized again
