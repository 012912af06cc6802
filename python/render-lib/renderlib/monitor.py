"""Frames on an external monitor device, the way a host usually wants them:
one device of its own display, connected in one mode, showing whole frames
of that mode's size, with failures raised instead of returned.

    with Monitor("preview", "1280x720p50") as monitor:
        monitor.show(pixels)          # width x height x 4 bytes, B, G, R, A

The flat functions (``EM_Display_connect`` and the rest) stay available for
anything else; they return the library's status and check no sizes."""

from __future__ import annotations

from typing import TYPE_CHECKING

import _renderlib

if TYPE_CHECKING:
    from typing_extensions import Buffer, Self

STATUS_NAMES = {
    getattr(_renderlib, name): name
    for name in (
        "EM_errorNone",
        "EM_errorParam",
        "EM_errorNotFound",
        "EM_errorAllocate",
        "EM_errorLast",
        "EM_errorDevice",
    )
}


class MonitorError(RuntimeError):
    """A monitor operation failed; `status` is the library's status, or None
    when the library made no object."""

    def __init__(self, operation: str, status: int | None = None) -> None:
        self.status = status
        reason = "no object made" if status is None else STATUS_NAMES.get(status, "status %d" % status)
        super().__init__("%s failed: %s" % (operation, reason))


def devices() -> dict[str, list[str]]:
    """{device name: [mode names]} of the monitor library."""
    display = _renderlib.EM_DisplayInit()
    if display is None:
        raise MonitorError("EM_DisplayInit")
    try:
        return {
            device: _renderlib.EM_Display_device_modes(display, device)
            for device in _renderlib.EM_Display_devices(display)
        }
    finally:
        _renderlib.release_external_monitor(display)


class Monitor:
    """A device connected in a mode, on a display of its own. Close it (or
    leave the ``with`` block) to disconnect and release the display."""

    def __init__(self, device: str, mode: str) -> None:
        self.device = device
        self._display = _renderlib.EM_DisplayInit()
        if self._display is None:
            raise MonitorError("EM_DisplayInit")
        status = _renderlib.EM_Display_connect(self._display, device, mode)
        if status != _renderlib.EM_errorNone:
            _renderlib.release_external_monitor(self._display)
            self._display = None
            raise MonitorError("connecting %s in %s" % (device, mode), status)
        self.width = _renderlib.EM_Display_get_width(self._display, device)
        self.height = _renderlib.EM_Display_get_height(self._display, device)

    def show(
        self,
        pixels: Buffer,
        format: int = _renderlib.EM_ImageFormat_32BitIntBGRA,
        name: str | None = None,
        bottom_up: bool = False,
        pixel_aspect: float = 1.0,
        gamma: float = 0.0,
        premultiplied: bool = False,
        full_range: bool = True,
    ) -> None:
        """Shows one frame: `pixels` is any C-contiguous buffer of width x
        height 32-bit pixels in `format`, top row first unless `bottom_up`."""
        if self._display is None:
            raise ValueError("the monitor is closed")
        view = memoryview(pixels)
        if not view.c_contiguous:
            raise ValueError("the frame's pixels are not C-contiguous")
        size = view.nbytes
        if size < self.width * self.height * 4:
            raise ValueError(
                "a %dx%d frame needs %d bytes, the buffer has %d"
                % (self.width, self.height, self.width * self.height * 4, size)
            )
        image = _renderlib.EM_Display_EM_XIImageWrapper(
            self._display,
            pixels,
            self.width,
            self.height,
            self.width * 4,
            name,
            bottom_up,
            format,
            pixel_aspect,
            gamma,
            premultiplied,
            full_range,
        )
        if image is None:
            raise MonitorError("describing the frame")
        status = _renderlib.EM_Display_display_frame(self._display, self.device, image)
        if status != _renderlib.EM_errorNone:
            raise MonitorError("showing a frame on %s" % self.device, status)

    def close(self) -> None:
        if self._display is not None:
            _renderlib.EM_Display_disconnect(self._display, self.device)
            _renderlib.release_external_monitor(self._display)
            self._display = None

    def __enter__(self) -> Self:
        return self

    def __exit__(self, *exc: object) -> None:
        self.close()
