"""On Windows the companion package makes the engine's DLL folders known to
the loader before it imports the module; elsewhere it leaves the loader alone."""
import os
import pathlib
import sys

import renderlib

SOURCE = pathlib.Path(renderlib.__file__).read_text()
PRELUDE = SOURCE[:SOURCE.index("import _renderlib")]


def run_prelude(monkeypatch, package, platform, engine_dir=None):
    """Runs the package's prelude as if installed in `package` (a folder)."""
    added = []
    monkeypatch.setattr(sys, "platform", platform)
    monkeypatch.setattr(os, "add_dll_directory", lambda folder: added.append(folder) or ("handle", folder),
                        raising=False)
    if engine_dir:
        monkeypatch.setenv("RENDERLIB_ENGINE_DIR", str(engine_dir))
    else:
        monkeypatch.delenv("RENDERLIB_ENGINE_DIR", raising=False)
    namespace = {"__file__": str(package / "__init__.py")}
    exec(compile(PRELUDE, renderlib.__file__, "exec"), namespace)
    return added, namespace


def test_windows_adds_the_bundled_engine_and_the_named_one(monkeypatch, tmp_path):
    (tmp_path / "renderlib" / "lib").mkdir(parents=True)
    (tmp_path / "engine").mkdir()
    added, namespace = run_prelude(monkeypatch, tmp_path / "renderlib", "win32", tmp_path / "engine")
    assert added == [str(tmp_path / "renderlib" / "lib"), str(tmp_path / "engine")]
    # The handles are kept: closing one would remove its folder again.
    assert namespace["_engine_dll_directories"] == [("handle", folder) for folder in added]


def test_missing_folders_are_skipped_and_other_systems_add_nothing(monkeypatch, tmp_path):
    (tmp_path / "renderlib").mkdir()
    added, _ = run_prelude(monkeypatch, tmp_path / "renderlib", "win32", tmp_path / "absent")
    assert added == []
    (tmp_path / "renderlib" / "lib").mkdir()
    added, _ = run_prelude(monkeypatch, tmp_path / "renderlib", "linux", tmp_path)
    assert added == []
