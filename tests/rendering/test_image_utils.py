"""Native-image services: descriptors, resizing, conversion to 8-bit BGRA,
compositing."""

import struct

import numpy

import _renderlib
import renderlib
from renderlib import effects


def test_make_raster_info_fills_the_descriptor_for_its_pixel_type():
    info = renderlib.T_RasterInfo()
    info.pixel_type = _renderlib.pixel_rgba8
    assert _renderlib.make_tarsel_raster_info(info, 10, 5) == 200
    assert (info.ds_xsize, info.ds_ysize, info.sizeof_pixel) == (10, 5, 4)
    info.pixel_type = _renderlib.pixel_rgbaf
    assert _renderlib.make_tarsel_raster_info(info, 10, 5) == 800
    assert _renderlib.tarsel_get_native_image_dims(effects.raster(_renderlib.pixel_a8, 7, 3)[0]) == [7, 3]


def test_a_filtered_resize(instance):
    source = effects.raster(_renderlib.pixel_rgbaf, 2, 1)
    struct.pack_into("<8f", source[1], 0, 0, 0, 0, 1, 1, 1, 1, 1)  # black, white
    size = _renderlib.tarsel_get_resized_image_size(source[0], 8, 1, 0, 0, 1.0, 0)
    assert size == 8 * 16
    dest_info, dest = renderlib.T_RasterInfo(), bytearray(size)
    assert _renderlib.tarsel_resize_native_image(*source, 8, 1, 0, 0, 1.0, dest_info, dest, 1, 0.0, 0.0, 0.0) == [8, 1]
    reds = numpy.frombuffer(dest, numpy.float32)[0::4]
    assert reds[0] < reds[3] < reds[4] < reds[7] and len(set(reds.round(4))) > 2  # blended, not copied
    assert (dest_info.ds_xsize, dest_info.ds_ysize) == (8, 1)


OPAQUE_GREEN = struct.unpack("<i", struct.pack("<I", 0xFF00FF00))[0]  # 0xAARRGGBB as a signed int


def test_conversion_to_bgra_and_compositing_over_a_background():
    source = effects.raster(_renderlib.pixel_rgbaf, 2, 1)
    struct.pack_into("<8f", source[1], 0, 1, 0, 0, 1, 0, 0, 0, 0)  # opaque red, transparent
    shown = bytearray(8)
    assert (
        _renderlib.tarsel_convert_to_bgra_8(None, *source, shown, _renderlib.RGBA_OK, 0, 0, "linear", "linear") is None
    )
    assert shown[:4] == bytes([0, 0, 255, 255]) and shown[7] == 0
    _renderlib.tarsel_comp_bgra_8(shown, 2, 1, 8, OPAQUE_GREEN, 0)
    assert shown == bytearray([0, 0, 255, 255, 0, 255, 0, 255])
    assert _renderlib.tarsel_convert_to_bgra_8(None, *source, bytes(8), 1, 0, 0, "linear", "linear") is None
