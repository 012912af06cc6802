"""Image files in and out, as float32 RGBA arrays (height, width, 4), 0..1.

PNG and most other formats go through Pillow (8 bits a channel; 16-bit
greyscale PNG is read at full depth). TIFF goes through tifffile: read at
any of 8 bits, 16 bits or 32-bit float a channel, written at the depth asked.
"""

from __future__ import annotations

import pathlib
from typing import TYPE_CHECKING, Any

import numpy

if TYPE_CHECKING:
    from _typeshed import StrPath
    from numpy.typing import ArrayLike, NDArray

TIFF_SUFFIXES = (".tif", ".tiff")
DEPTHS = ("8", "16", "float")


class ImageFileError(OSError):
    """An image file could not be read or written; the message says which and why."""


def _as_rgba(array: NDArray[Any]) -> NDArray[numpy.float32]:
    """Any (h, w[, c]) array of 1 to 4 channels as float32 RGBA, 0..1."""
    if array.ndim == 2:
        array = array[:, :, None]
    if array.ndim != 3 or not 1 <= array.shape[2] <= 4:
        raise ValueError("an image of shape %s is not 1 to 4 channels of pixels" % (array.shape,))
    if array.dtype == numpy.uint8:
        values = array.astype(numpy.float32) / 255
    elif array.dtype == numpy.uint16:
        values = array.astype(numpy.float32) / 65535
    elif array.dtype.kind == "f":
        values = array.astype(numpy.float32)
    else:
        raise ValueError("pixels of %s are not 8-bit, 16-bit or float" % array.dtype)
    channels = values.shape[2]
    rgba = numpy.ones(values.shape[:2] + (4,), numpy.float32)
    if channels <= 2:
        rgba[:, :, :3] = values[:, :, :1]
        if channels == 2:
            rgba[:, :, 3] = values[:, :, 1]
    else:
        rgba[:, :, :channels] = values
    return rgba


def read_image(path: StrPath) -> NDArray[numpy.float32]:
    """The image file at `path` as float32 RGBA."""
    path = pathlib.Path(path)
    try:
        if path.suffix.lower() in TIFF_SUFFIXES:
            import tifffile

            array = tifffile.imread(path)
            if array.ndim == 3 and array.shape[0] <= 4 < array.shape[2]:
                array = numpy.moveaxis(array, 0, 2)  # planar channels
            return _as_rgba(array)
        from PIL import Image

        with Image.open(path) as image:
            if image.mode in ("I;16", "I;16B", "I;16L", "I"):
                return _as_rgba(numpy.asarray(image).astype(numpy.uint16))
            return _as_rgba(numpy.asarray(image.convert("RGBA")))
    except (OSError, ValueError, SyntaxError) as error:
        raise ImageFileError("cannot read %s: %s" % (path, error)) from error


def quantised(rgba: ArrayLike, depth: str) -> NDArray[numpy.uint8] | NDArray[numpy.uint16] | NDArray[numpy.float32]:
    """float RGBA as the array a file of `depth` ("8", "16", "float") stores."""
    if depth == "float":
        return numpy.ascontiguousarray(rgba, numpy.float32)
    top = 255 if depth == "8" else 65535
    scaled: NDArray[numpy.floating[Any]] = numpy.rint(numpy.clip(rgba, 0, 1) * top)
    return scaled.astype(numpy.uint8) if depth == "8" else scaled.astype(numpy.uint16)


def write_image(path: StrPath, rgba: ArrayLike, depth: str = "8") -> None:
    """Writes float RGBA to `path`: TIFF at `depth`, anything else at 8 bits."""
    path = pathlib.Path(path)
    if depth not in DEPTHS:
        raise ValueError("a depth is one of %s, not %r" % (", ".join(DEPTHS), depth))
    try:
        if path.suffix.lower() in TIFF_SUFFIXES:
            import tifffile

            tifffile.imwrite(
                path, quantised(rgba, depth), photometric="rgb", extrasamples=["unassalpha"], compression="zlib"
            )
            return
        if depth != "8":
            raise ValueError("%s files are written at 8 bits a channel; use .tif for %s" % (path.suffix, depth))
        from PIL import Image

        image = Image.fromarray(quantised(rgba, "8"), "RGBA")
        if path.suffix.lower() in (".jpg", ".jpeg", ".bmp"):
            image = image.convert("RGB")
        image.save(path)
    except (OSError, KeyError) as error:
        raise ImageFileError("cannot write %s: %s" % (path, error)) from error
