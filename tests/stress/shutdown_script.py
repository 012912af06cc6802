"""Ends the interpreter while engine threads are inside host callbacks: a
render in a daemon thread whose frame source is busy in Python, and an
engine worker sending messages to a Python handler. Exits with status 0
when the interpreter's end is clean."""
import sys
import threading
import time

import numpy

import _renderlib
import renderlib
from renderlib import effects

inside = threading.Event()


class SlowFrames(renderlib.LoadFrameInterface):
    def load_frame(self, input, frame, width, height):
        self.info, pixels = effects.raster(_renderlib.pixel_rgbaf, width, height)
        numpy.frombuffer(pixels, numpy.float32)[:] = 0.5
        self.pixels = pixels
        inside.set()
        time.sleep(0.002)  # the engine thread is in Python when the interpreter ends
        return pixels

    def current_raster_info(self, input):
        return self.info


def render_forever(instance):
    dest = effects.raster(_renderlib.pixel_rgbaf, 64, 36)
    source = effects.raster(_renderlib.pixel_rgbaf, 64, 36)
    frame = 0
    while True:
        effects.render(instance, dest, [source], frame=frame)
        frame += 1


def emit_forever(probe):
    while True:
        probe.tarsel_probe_emit_from_worker(50, _renderlib.Err_Info, b"late message")


frames = SlowFrames()
_renderlib.set_load_frame_impl(frames)
_renderlib.set_error_handler(lambda level, text: None)
echo = effects.recreate(_renderlib.init_tarsel_effect("T_Echo", False), {"echoes": "8"})
threading.Thread(target=render_forever, args=(echo,), daemon=True).start()
if len(sys.argv) > 1:
    import ctypes
    from engine_probe import loaded_library_path
    threading.Thread(target=emit_forever, args=(ctypes.CDLL(loaded_library_path("tarsel_ps")),), daemon=True).start()
inside.wait(5)
