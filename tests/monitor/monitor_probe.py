"""The reference monitor library's test probe, reached through ctypes."""

import ctypes

import _renderlib  # noqa: F401  (loads the monitor library)
from engine_probe import loaded_library_path


def address(proxy):
    """The native address a proxy holds."""
    return int(proxy.this)


class MonitorProbe:
    def __init__(self):
        lib = ctypes.CDLL(loaded_library_path("QRVExternalMonitor"))
        self.lib = lib
        lib.qrv_probe_call.restype = ctypes.c_char_p
        lib.qrv_probe_call.argtypes = [ctypes.c_int]
        lib.qrv_probe_image_refs.argtypes = [ctypes.c_void_p]
        lib.qrv_probe_object_number.argtypes = [ctypes.c_void_p]
        lib.qrv_probe_preview_frame.argtypes = [
            ctypes.c_void_p,
            ctypes.c_void_p,
            ctypes.c_int,
            ctypes.POINTER(ctypes.c_int),
            ctypes.POINTER(ctypes.c_int),
            ctypes.POINTER(ctypes.c_longlong),
            ctypes.c_char_p,
            ctypes.c_int,
        ]

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
        width, height, frames = ctypes.c_int(), ctypes.c_int(), ctypes.c_longlong()
        pixels, name = ctypes.create_string_buffer(1920 * 1080 * 4), ctypes.create_string_buffer(256)
        size = self.lib.qrv_probe_preview_frame(
            address(display),
            pixels,
            len(pixels),
            ctypes.byref(width),
            ctypes.byref(height),
            ctypes.byref(frames),
            name,
            len(name),
        )
        assert size >= 0, "no live display"
        return pixels.raw[:size], width.value, height.value, frames.value, name.value.decode()
