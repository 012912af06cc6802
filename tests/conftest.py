import pytest

import _renderlib
from engine_probe import EngineProbe

_probe = None


@pytest.fixture
def probe():
    """The engine's test probe, with a clean call log; left quiet afterwards."""
    global _probe
    if _probe is None:
        _probe = EngineProbe()
    _probe.reset()
    yield _probe
    _probe.reset()
    _renderlib.tarsel_clear_abort()


@pytest.fixture
def error_handler_removed():
    """Leaves no message handler installed after the test."""
    yield
    _renderlib.set_error_handler(None)


@pytest.fixture(scope="session")
def module_on_separate_engine(tmp_path_factory):
    """A module built with the build's option for another engine, against a
    reference engine configured and built on its own: the folder holding it."""
    from native_build import build_module_against, build_reference_engine
    engine = build_reference_engine(tmp_path_factory.mktemp("separate-engine"))
    return build_module_against(engine, tmp_path_factory.mktemp("module-on-separate-engine"))
