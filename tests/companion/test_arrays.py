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
    channels = {"R": rgba[..., 0], "G": rgba[..., 1], "B": rgba[..., 2], "A": rgba[..., 3], "L": rgba[..., :3] @ LUMA}
    values = np.stack([channels[c] for c in layout], axis=-1)
    if dtype in TOP:
        return np.rint(np.clip(values, 0, 1) * TOP[dtype])
    return values


@pytest.mark.parametrize("layout, dtype", sorted(arrays.PIXEL_TYPES))
def test_every_layout_renders_into_its_array(layout, dtype):
    card = card_frame(WIDTH, HEIGHT, 3)
    card[..., 3] = np.linspace(0.25, 1, WIDTH, dtype=np.float32)  # an alpha ramp, to tell A from L
    card[..., :3] *= card[..., 3:]  # premultiplied, as the engine keeps colour
    out = np.zeros((HEIGHT, WIDTH) if len(layout) == 1 else (HEIGHT, WIDTH, len(layout)), dtype)
    info = arrays.raster_info_for(out, layout)
    with EffectRenderer("T_Transform", {"position": "12 8"}, [lambda f: card], colorspace="linear") as renderer:
        assert effects.render(renderer.instance, (info, out), [arrays.described(card)], colorspace="linear")
    got = out.reshape(HEIGHT, WIDTH, len(layout)).astype(np.float64)
    tolerance = {"uint8": 1, "uint16": 1, "float16": 2e-3, "float32": 1e-5}[dtype]
    np.testing.assert_allclose(got, expected(card, layout, dtype), atol=tolerance)


@pytest.mark.parametrize("channels, pixel_type", enumerate("pixel_l8 pixel_la8 pixel_rgb8 pixel_rgba8".split(), 1))
def test_the_default_layout_follows_the_channel_count(channels, pixel_type):
    array = np.zeros((4, 4, channels)[: 2 if channels == 1 else 3], np.uint8)
    assert arrays.raster_info_for(array).pixel_type == getattr(_renderlib, pixel_type)


@pytest.mark.parametrize(
    "array, layout, error, message",
    [
        (np.zeros((2, 8, 8, 4), np.uint8), None, ValueError, "not 4-dimensional"),
        (np.zeros(8, np.uint8), None, ValueError, "not 1-dimensional"),
        (np.zeros((8, 8, 3), np.uint16), "BGR", ValueError, "no BGR pixels of uint16"),
        (np.zeros((8, 8, 4), np.uint8), "RGB", ValueError, "4 channels do not match layout 'RGB'"),
        (np.zeros((8, 8, 5), np.uint8), None, ValueError, "5 channels do not match layout None"),
        (bytearray(256), None, TypeError, "expected a numpy array, got bytearray"),
    ],
)
def test_arrays_the_engine_cannot_take_are_refused(array, layout, error, message):
    with pytest.raises(error, match=message):
        arrays.raster_info_for(array, layout)


@pytest.mark.parametrize("pixel_type", sorted(arrays.LAYOUTS))
def test_array_for_allocates_what_the_descriptor_describes(pixel_type):
    info, buffer = effects.raster(pixel_type, 7, 5)
    array = arrays.array_for(info)
    assert array.nbytes == len(buffer) and array.shape[:2] == (5, 7) and not array.any()
    assert arrays.raster_info_for(array, arrays.layout_of(info)).pixel_type == pixel_type


@pytest.mark.parametrize(
    "field, value, message",
    [
        ("extra_line_stride_elts", 4, "pads its lines"),
        ("pixel_type", _renderlib.pixel_rgb10, "no array type for pixel"),
    ],
)
def test_array_for_refuses_padded_lines_and_unknown_types(field, value, message):
    info, _ = effects.raster(_renderlib.pixel_rgba8, 7, 5)
    setattr(info, field, value)
    with pytest.raises(ValueError, match=message):
        arrays.array_for(info)
