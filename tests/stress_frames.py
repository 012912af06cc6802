"""What the stress tests render with: frames of one colour per (input, frame),
served to several renders at once, and one render of a frame."""

import threading

import numpy

import _renderlib
import renderlib
from renderlib import effects


def colour(input, frame):
    return (0.1 + 0.1 * (frame % 8), 0.5 - 0.05 * (frame % 8), 0.2 + 0.3 * input, 1.0)


class SharedFrameSource(renderlib.LoadFrameInterface):
    """One source for every render: a request's descriptor and pixels are
    kept per engine thread, since several renders ask at once."""

    def __init__(self):
        super().__init__()
        self.current = {}
        self.lock = threading.Lock()

    def load_frame(self, input, frame, width, height):
        info, pixels = effects.raster(_renderlib.pixel_rgbaf, width, height)
        numpy.frombuffer(pixels, numpy.float32).reshape(-1, 4)[:] = colour(input, frame)
        with self.lock:
            self.current[(threading.get_ident(), input)] = (info, pixels)  # until this thread's next request
        return pixels

    def current_raster_info(self, input):
        with self.lock:
            return self.current[(threading.get_ident(), input)][0]


def render(instance, frame, width, height):
    """(the engine's answer, the pixels) of one frame over an input of colour(0, frame)."""
    dest = effects.raster(_renderlib.pixel_rgbaf, width, height)
    source = effects.raster(_renderlib.pixel_rgbaf, width, height)
    numpy.frombuffer(source[1], numpy.float32).reshape(-1, 4)[:] = colour(0, frame)
    ok = effects.render(instance, dest, [source], frame=frame)
    return ok, bytes(dest[1])
