"""Every effect rendered deterministically at two pixel types and compared with
stored results: SHA-256 of the 8-bit frame, per-channel sums of the float
frame. Each render is also written as a PNG under build/test-renders/ so a
person can look at it.

After a deliberate change of a kernel, refresh the stored results with
    RENDERLIB_UPDATE_GOLDEN=1 .venv/bin/python -m pytest tests/render/test_golden_renders.py
and look at the PNGs before committing golden_renders.json."""
import array
import hashlib
import json
import os
import pathlib

import pytest

import _renderlib
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


def card(pixel_type, colorspace, changes):
    """A test card: a frame of the gradient generator."""
    generator = _renderlib.init_tarsel_effect("T_Gradient", False)
    if changes:
        generator = effects.recreate(generator, changes)
    frame = effects.raster(pixel_type, WIDTH, HEIGHT)
    assert effects.render(generator, frame, colorspace=colorspace)
    return frame


def render_frame(name, builder, pixel_type, colorspace):
    cards = [card(pixel_type, colorspace, {}), card(pixel_type, colorspace, SETTINGS["T_Gradient"])]
    instance = _renderlib.init_tarsel_effect(name, builder)
    if name in SETTINGS:
        instance = effects.recreate(instance, SETTINGS[name])
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
        found[name] = {"rgba8_sha256": hashlib.sha256(eight_bit).hexdigest(),
                       "rgbaf_channel_sums": [round(sum(floats[c::4]), 2) for c in range(4)]}
    return found


@pytest.fixture(scope="module")
def rendered():
    found = results()
    if UPDATING:
        GOLDEN.write_text(json.dumps(found, indent=1, sort_keys=True) + "\n")
    return found


def test_every_effect_has_stored_results(rendered):
    assert set(json.loads(GOLDEN.read_text())) == set(rendered)


@pytest.mark.parametrize("name", [name for name, _ in all_entries()])
def test_render_matches_the_stored_result(rendered, name):
    stored = json.loads(GOLDEN.read_text())[name]
    assert rendered[name]["rgba8_sha256"] == stored["rgba8_sha256"], "see %s" % (PICTURES / ("%s.png" % name))
    assert rendered[name]["rgbaf_channel_sums"] == pytest.approx(stored["rgbaf_channel_sums"], rel=1e-4, abs=0.05)


def test_renders_are_not_blank(rendered):
    blank = hashlib.sha256(bytes(WIDTH * HEIGHT * 4)).hexdigest()
    assert [name for name, result in rendered.items() if result["rgba8_sha256"] == blank] == []
    assert [name for name, result in rendered.items() if result["rgbaf_channel_sums"][3] == 0] == []
