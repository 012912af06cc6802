"""numpy arrays as render buffers: every supported layout, and the refusals."""
import numpy as np
import pytest

import _renderlib
from renderlib import arrays, effects
from renderlib.rendering import EffectRenderer, card_frame

WIDTH, HEIGHT = 24, 16
LUMA = np.array([0.2126, 0.7152, 0.0722], np.float32)
TOP = {"uint8": 255, "uint16": 65535}


def expected(rgba, layout, dtype):
    """The card as the engine stores it in `layout` of `dtype`."""
    channels = {"R": rgba[..., 0], "G": rgba[..., 1], "B": rgba[..., 2], "A": rgba[..., 3],
                "L": rgba[..., :3] @ LUMA}
    values = np.stack([channels[c] for c in layout], axis=-1)
    if dtype in TOP:
        return np.rint(np.clip(values, 0, 1) * TOP[dtype])
    return values


@pytest.mark.parametrize("layout, dtype", sorted(arrays.PIXEL_TYPES))
def test_every_layout_renders_into_its_array(layout, dtype):
    card = card_frame(WIDTH, HEIGHT, 3)
    card[..., 3] = np.linspace(0.25, 1, WIDTH, dtype=np.float32)  # an alpha ramp, to tell A from L
    card[..., :3] *= card[..., 3:]  # premultiplied, as the engine keeps colour
    shape = (HEIGHT, WIDTH) if len(layout) == 1 else (HEIGHT, WIDTH, len(layout))
    out = np.zeros(shape, dtype)
    info = arrays.raster_info_for(out, layout)
    assert info.pixel_type == arrays.PIXEL_TYPES[(layout, dtype)]
    assert (info.ds_xsize, info.ds_ysize) == (WIDTH, HEIGHT)
    with EffectRenderer("T_Transform", {"position": "12 8"}, [lambda f: card], colorspace="linear") as renderer:
        assert effects.render(renderer.instance, (info, out), [arrays.described(card)], colorspace="linear")
    got = out.reshape(HEIGHT, WIDTH, len(layout)).astype(np.float64)
    tolerance = {"uint8": 1, "uint16": 1, "float16": 2e-3, "float32": 1e-5}[dtype]
    np.testing.assert_allclose(got, expected(card, layout, dtype), atol=tolerance)


def test_the_default_layout_follows_the_channel_count():
    for channels, pixel_type in ((1, _renderlib.pixel_l8), (2, _renderlib.pixel_la8), (3, _renderlib.pixel_rgb8),
                                 (4, _renderlib.pixel_rgba8)):
        shape = (4, 4) if channels == 1 else (4, 4, channels)
        assert arrays.raster_info_for(np.zeros(shape, np.uint8)).pixel_type == pixel_type


@pytest.mark.parametrize("array, layout, error, message", [
    (np.zeros((8, 8, 4), np.uint8)[:, ::2], None, ValueError, "not C-contiguous"),
    (np.zeros((8, 8, 4), np.uint8).transpose(1, 0, 2), None, ValueError, "not C-contiguous"),
    (np.zeros((2, 8, 8, 4), np.uint8), None, ValueError, "not 4-dimensional"),
    (np.zeros(8, np.uint8), None, ValueError, "not 1-dimensional"),
    (np.zeros((8, 8, 4), np.float64), None, ValueError, "no RGBA pixels of float64"),
    (np.zeros((8, 8, 4), np.int32), None, ValueError, "no RGBA pixels of int32"),
    (np.zeros((8, 8, 3), np.uint16), "BGR", ValueError, "no BGR pixels of uint16"),
    (np.zeros((8, 8, 4), np.uint8), "RGB", ValueError, "4 channels do not match layout 'RGB'"),
    (np.zeros((8, 8, 5), np.uint8), None, ValueError, "5 channels do not match layout None"),
    (bytearray(256), None, TypeError, "expected a numpy array, got bytearray"),
])
def test_arrays_the_engine_cannot_take_are_refused(array, layout, error, message):
    with pytest.raises(error, match=message):
        arrays.raster_info_for(array, layout)


@pytest.mark.parametrize("pixel_type", sorted(arrays.LAYOUTS))
def test_array_for_allocates_what_the_descriptor_describes(pixel_type):
    info, buffer = effects.raster(pixel_type, 7, 5)
    array = arrays.array_for(info)
    assert array.nbytes == len(buffer) and array.shape[:2] == (5, 7) and not array.any()
    assert arrays.raster_info_for(array, arrays.layout_of(info)).pixel_type == pixel_type


def test_array_for_refuses_padded_lines_and_unknown_types():
    info, _ = effects.raster(_renderlib.pixel_rgba8, 7, 5)
    info.extra_line_stride_elts = 4
    with pytest.raises(ValueError, match="pads its lines"):
        arrays.array_for(info)
    info, _ = effects.raster(_renderlib.pixel_rgba8, 7, 5)
    info.pixel_type = _renderlib.pixel_rgb10
    with pytest.raises(ValueError, match="no array type for pixel type 24"):
        arrays.array_for(info)


def test_a_render_into_numpy_takes_three_lines():
    source = card_frame(64, 36)
    out = np.zeros((36, 64, 4), np.float32)
    glow = _renderlib.init_tarsel_effect("T_Glow", False)
    assert effects.render(glow, arrays.described(out), [arrays.described(source)])
    _renderlib.free_tarsel_effect(glow)
    assert out[..., 3].min() == 1 and out[..., :3].max() > 0.9
