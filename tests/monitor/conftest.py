import contextlib
import gc

import pytest

import _renderlib
from monitor_probe import MonitorProbe


@pytest.fixture(scope="session")
def probe():
    return MonitorProbe()


@pytest.fixture
def display(probe):
    """A fresh display, released after the test unless the test released it."""
    display = _renderlib.EM_DisplayInit()
    assert display is not None
    yield display
    with contextlib.suppress(ValueError):  # the test released it itself
        _renderlib.release_external_monitor(display)


@pytest.fixture(autouse=True)
def nothing_left_alive(probe):
    """Every image made in a test is freed by its end; displays by the fixture."""
    displays = probe.live_displays()
    yield
    gc.collect()  # a test's frame may live on in a caught exception's traceback
    assert probe.live_images() == 0
    assert probe.live_displays() <= displays
