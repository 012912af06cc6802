"""The engine's flare-texture store, and lens flares drawn with it."""

import numpy
import pytest

import _renderlib
from renderlib import effects, png


@pytest.fixture
def store():
    _renderlib.tarsel_free_all_flare_textures()
    yield
    _renderlib.tarsel_free_all_flare_textures()


def test_registered_pixels_are_copied_and_read_back(store):
    pixels = bytearray(range(16))
    index = _renderlib.tarsel_register_flare_texture(2, 2, 4, 1, pixels)
    assert index >= 0 and _renderlib.tarsel_get_flare_texture_error() is None
    pixels[:] = bytes(16)  # the engine kept its own copy
    assert _renderlib.tarsel_get_texture_info(index) == [0, 2, 2, 4, 1, 16]
    out = bytearray(16)
    assert _renderlib.tarsel_get_texture_pixels(index, out) == 16
    assert out == bytearray(range(16))


def test_textures_load_from_png_files(store, tmp_path):
    path = tmp_path / "spot.png"
    rgba = numpy.zeros((8, 8, 4), numpy.uint8)
    rgba[2:6, 2:6] = (255, 200, 100, 255)
    png.write_rgba8(path, rgba.tobytes(), 8, 8)
    index = _renderlib.tarsel_load_flare_texture(str(path))
    assert index >= 0
    result, width, height, channels, depth, size = _renderlib.tarsel_get_texture_info(index)
    assert (result, width, height) == (0, 8, 8) and size == width * height * channels * depth
    if (channels, depth) == (4, 1):
        out = bytearray(size)
        _renderlib.tarsel_get_texture_pixels(index, out)
        assert bytes(out) == rgba.tobytes()
    missing = _renderlib.tarsel_load_flare_texture(str(tmp_path / "missing.png"))
    assert missing < 0 and "missing.png" in _renderlib.tarsel_get_flare_texture_error()


def test_freeing_the_store_forgets_every_texture(store):
    index = _renderlib.tarsel_register_flare_texture(1, 1, 1, 1, bytearray(1))
    _renderlib.tarsel_free_all_flare_textures()
    status, *sizes = _renderlib.tarsel_get_texture_info(index)
    assert status != 0 and sizes == [0, 0, 0, 0, 0]


COLOURS = ("linear", "srgb", "linear")  # the colour spaces of the background, the result and the drawing


def render_flare(effect, width=64, height=64, brightness=1.0):
    info, dest = effects.raster(_renderlib.pixel_rgba8, width, height)
    return _renderlib.render_tarsel_lensflare_to_native_image(
        effect, "", width / 2, height / 2, dest, 0, 0, 1, 1, [info], [None], brightness, 1, 1.0, 0, 0, *COLOURS, False
    ), dest


def test_a_lens_flare_draws_and_a_texture_element_uses_the_store(store, instance):
    ok, plain = render_flare(instance("T_LensFlare"))
    assert ok and any(plain)
    ok, dark = render_flare(instance("T_LensFlare"), brightness=0.0)
    assert ok and not any(dark[i] for i in range(0, len(dark)) if i % 4 != 3)
    ok, glare = render_flare(instance("T_Glare"))
    assert ok and glare != plain
    index = _renderlib.tarsel_register_flare_texture(4, 4, 1, 1, bytearray([255] * 16))
    textured = effects.recreate(instance("T_LensFlare"), {"flare": "texture:%d 0.5 1 0 1 1 1" % index})
    assert textured is not None
    ok, with_texture = render_flare(textured)
    _renderlib.free_tarsel_effect(textured)
    assert ok and with_texture != plain and any(with_texture)
