import importlib
import sys

import pytest

import _renderlib
import renderlib  # noqa: F401  (registers the proxy classes before a second module loads)
from engine_probe import EngineProbe
from native_build import REPO, build_module_against, build_reference_engine, build_swig_module
from time_limit import pytest_configure, pytest_handlecrashitem, pytest_runtest_protocol  # noqa: F401 (hooks)

PROBE = EngineProbe()


@pytest.fixture
def probe():
    """The engine's test probe, with a clean call log; left quiet afterwards."""
    PROBE.reset()
    yield PROBE
    PROBE.reset()
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
    engine = build_reference_engine(tmp_path_factory.mktemp("separate-engine"))
    return build_module_against(engine, tmp_path_factory.mktemp("module-on-separate-engine"))


@pytest.fixture
def instance():
    """Factory of effect instances that frees them after the test."""
    made = []

    def make(name, builder=False):
        effect = _renderlib.init_tarsel_effect(name, builder)
        assert effect is not None, name
        made.append(effect)
        return effect

    yield make
    for effect in made:
        if effect.this.own():  # not freed by the test itself
            _renderlib.free_tarsel_effect(effect)


@pytest.fixture(scope="session")
def shared_registry(tmp_path_factory):
    """A second SWIG module sharing _renderlib's type registry."""
    interface = REPO / "tests" / "shared_registry.i"
    folder = build_swig_module(interface, tmp_path_factory.mktemp("shared-registry"), [REPO / "engine-api"])
    sys.path.insert(0, str(folder))
    try:
        yield importlib.import_module("shared_registry")
    finally:
        sys.path.remove(str(folder))
