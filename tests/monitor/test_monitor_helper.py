"""The companion layer's Monitor: whole frames of the mode's size, failures raised."""
import numpy as np
import pytest

import _renderlib as rl
from renderlib.monitor import Monitor, MonitorError, devices


def test_devices_lists_every_device_with_its_modes(probe):
    displays = probe.live_displays()
    listed = devices()
    assert list(listed) == ["preview", "folder"] and "640x360p25" in listed["preview"]
    assert probe.live_displays() == displays


def test_a_frame_shown_through_the_monitor_reaches_the_device(probe):
    frame = np.random.default_rng(1).integers(0, 256, (360, 640, 4), dtype=np.uint8)
    with Monitor("preview", "640x360p25") as monitor:
        assert (monitor.width, monitor.height) == (640, 360)
        monitor.show(frame, name="first")
        pixels, width, height, frames, name = probe.preview_frame(monitor._display)
        assert (width, height, frames, name) == (640, 360, 1, "first")
        assert pixels == frame.tobytes()
    with pytest.raises(ValueError, match="closed"):
        monitor.show(frame)


def test_failures_are_raised_with_the_status(probe):
    displays = probe.live_displays()
    with pytest.raises(MonitorError, match="EM_errorNotFound") as raised:
        Monitor("preview", "800x600p60")
    assert raised.value.status == rl.EM_errorNotFound
    assert probe.live_displays() == displays  # the display made for it is released
    with Monitor("preview", "640x360p25") as monitor:
        with pytest.raises(ValueError, match="a 640x360 frame needs 921600 bytes, the buffer has 16"):
            monitor.show(bytearray(16))
        with pytest.raises(MonitorError, match="describing the frame"):
            monitor.show(bytearray(640 * 360 * 4), pixel_aspect=0.0)
