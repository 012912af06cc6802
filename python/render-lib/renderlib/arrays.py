"""numpy arrays as render buffers.

An image array is C-contiguous, shaped (height, width, channels) or
(height, width) for one channel, of uint8, uint16, float16 or float32. Its
channel order is named by a layout ("RGBA", "BGRA", "ARGB", "RGB", "BGR",
"LA", "L", "A"); by default one channel is luminance, two luminance and
alpha, three RGB, four RGBA. A render into numpy arrays takes three lines::

    out = numpy.zeros((360, 640, 4), numpy.float32)
    glow = _renderlib.init_tarsel_effect("T_Glow", False)
    effects.render(glow, described(out), [described(source)])
"""

from __future__ import annotations

from typing import TYPE_CHECKING, Any, TypeVar

import numpy

import _renderlib
import renderlib

if TYPE_CHECKING:
    from numpy.typing import NDArray

_Array = TypeVar("_Array", bound="NDArray[Any]")

DEFAULT_LAYOUTS = {1: "L", 2: "LA", 3: "RGB", 4: "RGBA"}

# (layout, dtype) -> the engine's pixel type. 16-bit values are native byte
# order; float16 is IEEE half precision.
PIXEL_TYPES = {
    ("L", "uint8"): _renderlib.pixel_l8,
    ("A", "uint8"): _renderlib.pixel_a8,
    ("LA", "uint8"): _renderlib.pixel_la8,
    ("RGB", "uint8"): _renderlib.pixel_rgb8,
    ("BGR", "uint8"): _renderlib.pixel_bgr8,
    ("RGBA", "uint8"): _renderlib.pixel_rgba8,
    ("BGRA", "uint8"): _renderlib.pixel_bgra8,
    ("ARGB", "uint8"): _renderlib.pixel_argb8,
    ("L", "uint16"): _renderlib.pixel_l16,
    ("A", "uint16"): _renderlib.pixel_a16,
    ("LA", "uint16"): _renderlib.pixel_la16,
    ("RGB", "uint16"): _renderlib.pixel_rgb16,
    ("RGBA", "uint16"): _renderlib.pixel_rgba16,
    ("BGRA", "uint16"): _renderlib.pixel_bgra16,
    ("ARGB", "uint16"): _renderlib.pixel_argb16,
    ("L", "float32"): _renderlib.pixel_lf,
    ("A", "float32"): _renderlib.pixel_af,
    ("LA", "float32"): _renderlib.pixel_laf,
    ("RGB", "float32"): _renderlib.pixel_rgbf,
    ("RGBA", "float32"): _renderlib.pixel_rgbaf,
    ("ARGB", "float32"): _renderlib.pixel_argbf,
    ("A", "float16"): _renderlib.pixel_a16f,
    ("RGB", "float16"): _renderlib.pixel_rgb16f,
    ("RGBA", "float16"): _renderlib.pixel_rgba16f,
}
LAYOUTS = {pixel_type: (layout, numpy.dtype(dtype)) for (layout, dtype), pixel_type in PIXEL_TYPES.items()}


def raster_info_for(array: NDArray[Any], layout: str | None = None) -> renderlib.T_RasterInfo:
    """A T_RasterInfo describing `array` (see the module's notes); ValueError
    for an array the engine cannot take as it lies in memory."""
    if not isinstance(array, numpy.ndarray):
        raise TypeError("expected a numpy array, got %s" % type(array).__name__)
    if array.ndim not in (2, 3):
        raise ValueError("an image array is (height, width[, channels]), not %d-dimensional" % array.ndim)
    if not array.flags.c_contiguous:
        raise ValueError("the array is not C-contiguous (a view with strides); pass numpy.ascontiguousarray(array)")
    channels = 1 if array.ndim == 2 else array.shape[2]
    layout = layout or DEFAULT_LAYOUTS.get(channels)
    if layout is None or len(layout) != channels:
        raise ValueError("%d channels do not match layout %r" % (channels, layout))
    pixel_type = PIXEL_TYPES.get((layout, array.dtype.name))
    if pixel_type is None:
        raise ValueError("the engine has no %s pixels of %s" % (layout, array.dtype.name))
    height, width = array.shape[:2]
    info = renderlib.T_RasterInfo()
    info.pixel_type = pixel_type
    size = _renderlib.make_tarsel_raster_info(info, width, height)
    if size != array.nbytes:
        raise ValueError(
            "the engine lays out %dx%d %s pixels of %s in %d bytes, the array has %d"
            % (width, height, layout, array.dtype.name, size, array.nbytes)
        )
    return info


def described(array: _Array, layout: str | None = None) -> tuple[renderlib.T_RasterInfo, _Array]:
    """(T_RasterInfo, array): the pair the render helpers of renderlib.effects take."""
    return raster_info_for(array, layout), array


def array_for(info: renderlib.T_RasterInfo) -> NDArray[Any]:
    """A zeroed array laid out as `info` describes: (ds_ysize, ds_xsize,
    channels) of the layout's element type."""
    if info.pixel_type not in LAYOUTS:
        raise ValueError("no array type for pixel type %d" % info.pixel_type)
    if info.extra_line_stride_elts:
        raise ValueError("the descriptor pads its lines (extra_line_stride_elts %d)" % info.extra_line_stride_elts)
    layout, dtype = LAYOUTS[info.pixel_type]
    if info.ds_xsize <= 0 or info.ds_ysize <= 0:
        raise ValueError("the descriptor has no size (%dx%d)" % (info.ds_xsize, info.ds_ysize))
    return numpy.zeros((info.ds_ysize, info.ds_xsize, len(layout)), dtype)


def layout_of(info: renderlib.T_RasterInfo) -> str:
    """The channel layout of a descriptor's pixel type, such as "RGBA"."""
    return LAYOUTS[info.pixel_type][0]
