"""A host-side frame source for the callback tests: solid-colour frames."""
import threading

import numpy

import _renderlib
import renderlib
from renderlib import effects


def solid_frame(colour, width, height):
    """A (T_RasterInfo, bytearray) pair of straight rgbaf pixels of one colour."""
    info, pixels = effects.raster(_renderlib.pixel_rgbaf, width, height)
    numpy.frombuffer(pixels, numpy.float32).reshape(-1, 4)[:] = colour
    return info, pixels


def pixels_of(frame):
    """The rgbaf pixels of a (T_RasterInfo, bytearray) pair as an array (h, w, 4)."""
    info, pixels = frame
    return numpy.frombuffer(pixels, numpy.float32).reshape(info.ds_ysize, info.ds_xsize, 4)


class FrameSource(renderlib.LoadFrameInterface):
    """Serves frame `f` of input `i` as a solid frame of colour(i, f), at the
    size the engine asks for unless `size` fixes one. Records each request
    with the thread it came on, and keeps every frame it handed out."""

    def __init__(self, colour, size=None):
        super().__init__()
        self.colour = colour
        self.size = size
        self.requests = []
        self.threads = set()
        self.kept = []
        self.current = {}

    def load_frame(self, input, frame, width, height):
        self.requests.append((input, frame, width, height))
        self.threads.add(threading.get_ident())
        info, pixels = solid_frame(self.colour(input, frame), *(self.size or (width, height)))
        self.kept.append(pixels)
        self.current[input] = info
        return pixels

    def current_raster_info(self, input):
        return self.current[input]
