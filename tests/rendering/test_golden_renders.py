"""Every effect rendered deterministically at two pixel types and compared with
stored results: SHA-256 of the 8-bit frame, per-channel sums of the float
frame; then the less common settings (edge modes, filters, pixel types) and
the resize filters. Each render is also written as a PNG under build/test-renders/ so a
person can look at it.

After a deliberate change of a kernel, refresh the stored results with
    RENDERLIB_UPDATE_GOLDEN=1 .venv/bin/python -m pytest tests/rendering/test_golden_renders.py
and look at the PNGs before committing golden_renders.json."""

import array
import hashlib
import json
import os
import pathlib

import numpy
import pytest

import _renderlib
import renderlib
from effect_helpers import all_entries
from native_build import REPO
from renderlib import effects, png

GOLDEN = pathlib.Path(__file__).with_name("golden_renders.json")
PICTURES = REPO / "build" / "test-renders"
WIDTH, HEIGHT = 96, 54
UPDATING = os.environ.get("RENDERLIB_UPDATE_GOLDEN") == "1"


# Settings that make each effect do visible work on a 96x54 frame.
SETTINGS = {
    "T_Gradient": {"shape": "Radial", "start_color": "1 0.5 0 1"},
    "T_Dissolve": {"mix": "0.5"},
    "T_Caption": {"position": "0 0", "size": "16", "text": "Golden {n}"},
    "T_Transform": {"position": "48 27", "crop_x": "0 96", "crop_y": "0 54", "rotation": "20", "scale": "0.8 0.8"},
    "T_BuilderMix": {"blend_opacity": "0.5", "levels_gamma": "2.2"},
    "T_BuilderMatte": {"key_color": "0.5 0.5 0.5"},
}


# The less common settings, each rendered once more over the coloured card:
# (label, effect, settings, pixel type name). Integer and half-float frames
# are compared byte for byte, float frames by float_signature.
VARIANTS = [
    ("T_Blur %s %s" % (key, value), "T_Blur", {key: value, "radius": "12"}, "rgbaf")
    for key, value in (("edges", "Repeat"), ("edges", "Mirror"), ("quality", "Draft"))
]
SMALLER = dict(SETTINGS["T_Transform"], scale="0.4 0.4")  # the card's edges inside the frame
VARIANTS += [
    ("T_Transform edges %s filter %s" % (edges, f), "T_Transform", dict(SMALLER, edges=edges, filter=f), "rgbaf")
    for edges, f in (("Repeat", "Nearest"), ("Mirror", "Bilinear"), ("Clamp", "Bicubic"))
]
VARIANTS += [
    ("T_Blur in %s" % kind, "T_Blur", {"radius": "6"}, kind)
    for kind in "rgba16 bgra16 argb8 la8 l16 rgba16f argbf".split()
]


# The coloured card resized with each filter: (label, filter, width, height, sharpness).
# (Enlarging, the box filter is the bilinear one: its window covers one sample.)
RESIZES = [
    ("resize %s to %dx%d sharpness %g" % (name, w, h, sharp), f, w, h, sharp)
    for f, name in enumerate(("box", "bilinear", "bicubic"))
    for w, h in ((40, 23), (150, 80))
    for sharp in ((0.0, 1.0) if name == "bicubic" else (0.0,))
    if (name, w) != ("box", 150)
]


def resized(filter, width, height, sharpness):
    source = card(_renderlib.pixel_rgbaf, "linear", SETTINGS["T_Gradient"])
    info = renderlib.T_RasterInfo()
    dest = bytearray(_renderlib.tarsel_get_resized_image_size(source[0], width, height, 0, 0, 1.0, 0))
    assert _renderlib.tarsel_resize_native_image(
        *source, width, height, 0, 0, 1.0, info, dest, filter, 0.0, 0.0, sharpness
    ) == [width, height]
    return dest


def float_signature(frame):
    """SHA-256 of the float frame's values rounded to 1e-4: close settings
    (a blur's edge mode, a filter) often keep the channel sums."""
    rounded = numpy.round(numpy.frombuffer(frame, numpy.float32), 4)
    return {"rounded_sha256": hashlib.sha256(rounded.tobytes()).hexdigest()}


def card(pixel_type, colorspace, changes):
    """A test card: a frame of the gradient generator."""
    generator = _renderlib.init_tarsel_effect("T_Gradient", False)
    if changes:
        generator = effects.recreate(generator, changes)
    frame = effects.raster(pixel_type, WIDTH, HEIGHT)
    assert effects.render(generator, frame, colorspace=colorspace)
    return frame


def render_frame(name, builder, pixel_type, colorspace, settings=None):
    cards = [card(pixel_type, colorspace, {}), card(pixel_type, colorspace, SETTINGS["T_Gradient"])]
    if settings is not None:
        cards = cards[::-1]  # the coloured card first
    instance = _renderlib.init_tarsel_effect(name, builder)
    settings = SETTINGS.get(name) if settings is None else settings
    if settings:
        instance = effects.recreate(instance, settings)
    dest = effects.raster(pixel_type, WIDTH, HEIGHT)
    n_inputs = len(instance.effect_genotype._get_input_names())
    inputs = [cards[i % 2] for i in range(n_inputs)]
    assert effects.render(instance, dest, inputs, previous=cards[1][1], frame=3, colorspace=colorspace), name
    return dest[1]


def results():
    found = {}
    PICTURES.mkdir(parents=True, exist_ok=True)
    for name, builder in all_entries():
        eight_bit = render_frame(name, builder, _renderlib.pixel_rgba8, "srgb")
        png.write_rgba8(PICTURES / ("%s.png" % name), eight_bit, WIDTH, HEIGHT)
        floats = array.array("f", render_frame(name, builder, _renderlib.pixel_rgbaf, "linear"))
        found[name] = {
            "rgba8_sha256": hashlib.sha256(eight_bit).hexdigest(),
            "rgbaf_channel_sums": [round(sum(floats[c::4]), 2) for c in range(4)],
        }
    for label, name, settings, kind in VARIANTS:
        frame = render_frame(name, False, getattr(_renderlib, "pixel_" + kind), "linear", settings)
        floats = kind.endswith("f") and not kind.endswith("16f")
        found[label] = float_signature(frame) if floats else {"sha256": hashlib.sha256(frame).hexdigest()}
    for label, *resize in RESIZES:
        found[label] = float_signature(resized(*resize))
    return found


@pytest.fixture(scope="module")
def rendered():
    found = results()
    if UPDATING:
        GOLDEN.write_text(json.dumps(found, indent=1, sort_keys=True) + "\n")
    return found


def test_every_effect_has_stored_results(rendered):
    assert set(json.loads(GOLDEN.read_text())) == set(rendered)


@pytest.mark.parametrize("name", [name for name, _ in all_entries()] + [label for label, *_ in VARIANTS + RESIZES])
def test_render_matches_the_stored_result(rendered, name):
    stored = json.loads(GOLDEN.read_text())[name]
    for key, value in stored.items():
        if key.endswith("sha256"):
            assert rendered[name][key] == value, "see %s" % (PICTURES / ("%s.png" % name))
        else:
            assert rendered[name][key] == pytest.approx(value, rel=1e-4, abs=0.05), key


def test_renders_are_not_blank(rendered):
    blank = hashlib.sha256(bytes(WIDTH * HEIGHT * 4)).hexdigest()
    assert [name for name, result in rendered.items() if result.get("rgba8_sha256") == blank] == []
    assert [name for name, result in rendered.items() if result.get("rgbaf_channel_sums", [1] * 4)[3] == 0] == []
    # Each less common setting changes the picture: no two variants agree.
    variants = [repr(rendered[label]) for label, *_ in VARIANTS + RESIZES]
    assert len(set(variants)) == len(variants)
