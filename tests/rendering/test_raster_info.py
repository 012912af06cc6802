"""Raster and render descriptors made and edited from Python, against the
record's raw bytes."""

import ctypes
import struct

import pytest

import renderlib

# The first 24 words of a raster descriptor (two floats follow); "-" for words the module does not name.
WORDS = (
    "ds_xsize ds_ysize x_origin y_origin world_xsize world_ysize pixel_type - bit_depth raster_type sizeof_pixel"
    " clamp_p res_factor downsample_offset extra_line_stride_elts - - - - - flip_y_p levels_601_p is_premultiplied -"
).split()
WRITABLE = [name for name in WORDS[:15] if name != "-"]
READ_ONLY = ["background_pixel", "flip_y_p", "levels_601_p", "is_premultiplied", "x_origin_float", "y_origin_float"]


def test_raster_descriptor_fields_read_and_write_their_own_words():
    info = renderlib.T_RasterInfo()
    ctypes.memmove(int(info.this), struct.pack("<24i", *range(1, 25)) + struct.pack("<ff", 0.25, -4.5), 104)
    assert [getattr(info, name) for name in WORDS if name != "-"] == [i + 1 for i, n in enumerate(WORDS) if n != "-"]
    assert (info.x_origin_float, info.y_origin_float) == (0.25, -4.5)
    info = renderlib.T_RasterInfo()
    for value, name in enumerate(WRITABLE, start=1):
        setattr(info, name, value * 1000 + 1)
    words = struct.unpack("<26i", ctypes.string_at(int(info.this), 104))
    assert [words[WORDS.index(name)] for name in WRITABLE] == [v * 1000 + 1 for v in range(1, len(WRITABLE) + 1)]
    assert sum(1 for w in words if w) == len(WRITABLE)  # nothing else written
    pointer = info.background_pixel  # the colour sits at byte 60 of the record
    assert "'float *'" in repr(pointer) and not pointer.own() and int(pointer) - int(info.this) == 60


def test_enumerated_fields_take_any_int_and_read_only_fields_refuse():
    info = renderlib.T_RasterInfo()
    info.pixel_type, info.raster_type = 16, -5  # 16: an engine format with no name here
    assert (info.pixel_type, info.raster_type) == (16, -5)
    for name in READ_ONLY:
        with pytest.raises(AttributeError):
            setattr(info, name, 1)
    render_info = renderlib.T_RenderInfo()
    assert render_info.full_xsize == 0 and render_info.pixel_scale == 0.0 and type(render_info.y_pixel_scale) is float
    with pytest.raises(AttributeError):
        render_info.full_xsize = 1
