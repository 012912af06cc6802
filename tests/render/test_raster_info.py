"""Raster and render descriptors made and edited from Python."""
import ctypes
import struct

import pytest

import _renderlib
import renderlib

INT_FIELDS = ["ds_xsize", "ds_ysize", "x_origin", "y_origin", "world_xsize", "world_ysize", "pixel_type",
              "bit_depth", "raster_type", "sizeof_pixel", "clamp_p", "res_factor", "downsample_offset",
              "extra_line_stride_elts"]
READ_ONLY = ["background_pixel", "flip_y_p", "levels_601_p", "is_premultiplied", "x_origin_float", "y_origin_float"]


def test_a_new_raster_descriptor_reads_zero_everywhere():
    info = renderlib.T_RasterInfo()
    for name in INT_FIELDS + ["flip_y_p", "levels_601_p", "is_premultiplied"]:
        assert getattr(info, name) == 0, name
    assert info.x_origin_float == 0.0 and info.y_origin_float == 0.0


def test_writable_fields_are_independent_words():
    info = renderlib.T_RasterInfo()
    for value, name in enumerate(INT_FIELDS, start=1):
        setattr(info, name, value * 1000 + 1)
    assert [getattr(info, name) for name in INT_FIELDS] == [v * 1000 + 1 for v in range(1, len(INT_FIELDS) + 1)]


def test_enumerated_fields_accept_any_integer():
    info = renderlib.T_RasterInfo()
    info.pixel_type = 16  # an engine format with no name here
    info.raster_type = -5
    assert (info.pixel_type, info.raster_type) == (16, -5)
    with pytest.raises(TypeError, match=r"^in method 'T_RasterInfo_pixel_type_set', argument 2 of type 'T_PixelType'$"):
        info.pixel_type = "rgba8"
    with pytest.raises(OverflowError, match=r"^in method 'T_RasterInfo_raster_type_set', argument 2 of type 'T_RasterType'$"):
        info.raster_type = 2 ** 31


@pytest.mark.parametrize("name", READ_ONLY)
def test_read_only_fields_refuse_assignment(name):
    with pytest.raises(AttributeError):
        setattr(renderlib.T_RasterInfo(), name, 1)


def test_background_pixel_is_a_pointer_into_the_record():
    info = renderlib.T_RasterInfo()
    pointer = info.background_pixel
    assert "'float *'" in repr(pointer)
    assert pointer.own() is False
    assert int(pointer) - int(info.this) == 60  # the colour sits at byte 60 of the record


def test_render_descriptor_is_zero_filled_and_read_only():
    info = renderlib.T_RenderInfo()
    assert info.full_xsize == 0 and info.ds_crop_ysize == 0 and info.downsample_offset == 0
    assert info.pixel_scale == 0.0 and type(info.y_pixel_scale) is float
    with pytest.raises(AttributeError):
        info.full_xsize = 1


def test_render_context_cannot_be_made_from_python():
    with pytest.raises(AttributeError, match="No constructor defined"):
        renderlib.RenderContext()
    assert not hasattr(_renderlib, "new_RenderContext")


def test_raster_descriptor_fields_at_their_offsets():
    info = renderlib.T_RasterInfo()
    names = ["ds_xsize", "ds_ysize", "x_origin", "y_origin", "world_xsize", "world_ysize", "pixel_type", None,
             "bit_depth", "raster_type", "sizeof_pixel", "clamp_p", "res_factor", "downsample_offset",
             "extra_line_stride_elts", None, None, None, None, None, "flip_y_p", "levels_601_p",
             "is_premultiplied", None]
    ctypes.memmove(int(info.this), struct.pack("<24i", *range(1, 25)), 96)
    for word, name in enumerate(names):
        if name:
            assert getattr(info, name) == word + 1, name
    ctypes.memmove(int(info.this) + 96, struct.pack("<ff", 0.25, -4.5), 8)
    assert (info.x_origin_float, info.y_origin_float) == (0.25, -4.5)
