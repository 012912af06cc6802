"""The reference monitor library's test probe, reached through ctypes, and
images made for its displays."""

import collections
import ctypes
from ctypes import POINTER, byref, c_char_p, c_int, c_longlong, c_void_p

import _renderlib  # loads the monitor library
from engine_probe import loaded_library_path

WIDTH, HEIGHT = 640, 360
# The image wrapper's arguments after the pixels; FRAME describes a whole
# 640x360 frame of straight full-range 8-bit BGRA, top row first.
Image = collections.namedtuple(
    "Image", "width height row_bytes name bottom_up fmt aspect gamma premultiplied full_range"
)
FRAME = Image(WIDTH, HEIGHT, WIDTH * 4, "frame", False, _renderlib.EM_ImageFormat_32BitIntBGRA, 1.0, 2.2, False, True)


def wrap(display, pixels, **changes):
    """The display's image of `pixels`, described by FRAME with `changes`."""
    return _renderlib.EM_Display_EM_XIImageWrapper(display, pixels, *FRAME._replace(**changes))


def address(proxy):
    """The native address a proxy holds."""
    return int(proxy.this)


class MonitorProbe:
    def __init__(self):
        self.lib = lib = ctypes.CDLL(loaded_library_path("QRVExternalMonitor"))
        lib.qrv_probe_call.restype = c_char_p
        lib.qrv_probe_call.argtypes = [c_int]
        lib.qrv_probe_image_refs.argtypes = lib.qrv_probe_object_number.argtypes = [c_void_p]
        # display, pixels and their size, width, height, frames, name and its size
        frame_args = [c_void_p, c_void_p, c_int, POINTER(c_int), POINTER(c_int), POINTER(c_longlong), c_char_p, c_int]
        lib.qrv_probe_preview_frame.argtypes = frame_args

    def calls(self):
        """The call log, oldest first."""
        return [self.lib.qrv_probe_call(i).decode() for i in range(self.lib.qrv_probe_call_count())]

    def clear_calls(self):
        self.lib.qrv_probe_clear_calls()

    def calls_of(self, proxy):
        """The logged calls of one display or image, without its name prefix."""
        prefix = "%s%d." % ("display" if type(proxy).__name__ == "EM_Display" else "image", self.number(proxy))
        return [call[len(prefix) :] for call in self.calls() if call.startswith(prefix)]

    def number(self, proxy):
        return self.lib.qrv_probe_object_number(address(proxy))

    def live_displays(self):
        return self.lib.qrv_probe_live_displays()

    def live_images(self):
        return self.lib.qrv_probe_live_images()

    def image_refs(self, image_address):
        return self.lib.qrv_probe_image_refs(image_address)

    def preview_frame(self, display):
        """(bgra bytes, width, height, frames shown since connect, image name)
        of the preview device's last frame (at most 1920x1080)."""
        width, height, frames = c_int(), c_int(), c_longlong()
        pixels, name = ctypes.create_string_buffer(1920 * 1080 * 4), ctypes.create_string_buffer(256)
        size = self.lib.qrv_probe_preview_frame(
            address(display), pixels, len(pixels), byref(width), byref(height), byref(frames), name, len(name)
        )
        assert size >= 0, "no live display"
        return pixels.raw[:size], width.value, height.value, frames.value, name.value.decode()
