"""Ends the interpreter while engine threads are inside host callbacks, each
thread of the modes named on the command line started first:
    frames    a render in a daemon thread whose frame source is busy in Python
    messages  an engine worker sending messages to a Python handler
    widgets   a daemon Python thread drawing widgets through a Python drawing object
Exits with status 0 when the interpreter's end is clean."""

import ctypes
import sys
import threading
import time

import _renderlib
import stress_frames
from engine_probe import loaded_library_path
from renderlib import effects

started = threading.Event()


class SlowFrames(stress_frames.SharedFrameSource):
    def load_frame(self, *request):
        started.set()
        time.sleep(0.002)  # the engine thread is in Python when the interpreter ends
        return super().load_frame(*request)


def frames():
    _renderlib.set_load_frame_impl(slow_frames)
    echo = effects.recreate(_renderlib.init_tarsel_effect("T_Echo", False), {"echoes": "8"})
    dest, source = effects.raster(_renderlib.pixel_rgbaf, 64, 36), effects.raster(_renderlib.pixel_rgbaf, 64, 36)
    for frame in range(10**9):
        effects.render(echo, dest, [source], frame=frame)


def messages():
    engine = ctypes.CDLL(loaded_library_path("tarsel_ps"))
    while True:
        engine.tarsel_probe_emit_from_worker(50, _renderlib.Err_Info, b"late message")


def widgets():
    from renderlib.widgets import SvgDrawing

    drawing = SvgDrawing(char_width=4)
    _renderlib.tarsel_set_gfx_impl(drawing)
    flare = _renderlib.init_tarsel_effect("T_LensFlare", False)
    while True:
        drawing.calls.clear()
        _renderlib.tarsel_widget_draw(flare, "", 960, 540, 0.0, 0.0, 0.5, 0.5, [1920, 1080, 0])
        started.set()


slow_frames = SlowFrames()
_renderlib.set_error_handler(lambda level, text: None)
for mode in sys.argv[1:]:
    threading.Thread(target=globals()[mode], daemon=True).start()
started.wait(5)
