import pytest

import _renderlib
from segments import fresh_name, session_segments, segment_file


@pytest.fixture
def name():
    """A segment name of its own; whatever the test left of it is reset."""
    name = fresh_name()
    yield name
    _renderlib.ShmemManager_reset(name, True)
    assert not segment_file(name).exists()


@pytest.fixture(scope="session", autouse=True)
def no_segment_left_behind():
    yield
    _renderlib.ShmemManager_reset_all(False)  # stale ones of dead servers
    assert session_segments() == []
