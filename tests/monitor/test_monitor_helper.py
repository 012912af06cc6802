"""The companion layer's Monitor: whole frames of the mode's size, failures raised."""

import numpy as np
import pytest

from renderlib.monitor import Monitor, MonitorError


def test_a_frame_shown_through_the_monitor_reaches_the_device(probe):
    frame = np.random.default_rng(1).integers(0, 256, (360, 640, 4), dtype=np.uint8)
    with Monitor("preview", "640x360p25") as monitor:
        monitor.show(frame, name="first")
        pixels, width, height, frames, name = probe.preview_frame(monitor._display)
        assert (width, height, frames, name) == (640, 360, 1, "first") and pixels == frame.tobytes()
        with pytest.raises(MonitorError, match="describing the frame"):
            monitor.show(frame, pixel_aspect=0.0)
