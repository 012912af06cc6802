"""On Windows the companion package makes the engine's DLL folders known to
the loader before it imports the module; elsewhere it leaves the loader alone."""

import os
import pathlib
import sys

import pytest

import renderlib

SOURCE = pathlib.Path(renderlib.__file__).read_text()
PRELUDE = SOURCE[: SOURCE.index("import _renderlib")]


@pytest.mark.parametrize(
    "platform, folders, added",
    [
        ("win32", ["renderlib/lib", "engine"], ["renderlib/lib", "engine"]),  # the bundled engine and the named one
        ("win32", [], []),  # missing folders are skipped
        ("linux", ["renderlib/lib", "engine"], []),
    ],
)
def test_the_engine_folders_known_to_the_loader(monkeypatch, tmp_path, platform, folders, added):
    for folder in ["renderlib"] + folders:
        (tmp_path / folder).mkdir(parents=True, exist_ok=True)
    calls = []
    monkeypatch.setattr(sys, "platform", platform)
    monkeypatch.setattr(os, "add_dll_directory", lambda path: calls.append(path) or ("handle", path), raising=False)
    monkeypatch.setenv("RENDERLIB_ENGINE_DIR", str(tmp_path / "engine"))
    namespace = {"__file__": str(tmp_path / "renderlib" / "__init__.py")}
    exec(compile(PRELUDE, renderlib.__file__, "exec"), namespace)  # the package's prelude, installed there
    assert calls == [str(tmp_path / folder) for folder in added]
    # The handles are kept: closing one would remove its folder again.
    assert namespace.get("_engine_dll_directories", []) == [("handle", folder) for folder in calls]
