import importlib
import pathlib
import sys

import pytest

import renderlib  # noqa: F401  (registers the proxy classes before the second module loads)
from native_build import REPO, build_swig_module


@pytest.fixture(scope="session")
def shared_registry(tmp_path_factory):
    """A second SWIG module sharing _renderlib's type registry."""
    folder = build_swig_module(pathlib.Path(__file__).with_name("shared_registry.i"),
                               tmp_path_factory.mktemp("shared-registry"), [REPO / "engine-api"])
    sys.path.insert(0, str(folder))
    try:
        yield importlib.import_module("shared_registry")
    finally:
        sys.path.remove(str(folder))
