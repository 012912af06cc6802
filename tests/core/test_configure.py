"""Configuring the reference engine on a machine without one of its system libraries."""

import subprocess

import pytest

from native_build import REPO, tool


@pytest.mark.parametrize("library, package", [("cJSON", "libcjson-dev"), ("PNG", "libpng-dev")])
def test_a_missing_system_library_stops_the_configure_step_naming_its_package(tmp_path, library, package):
    hidden = "-DCMAKE_DISABLE_FIND_PACKAGE_%s=ON" % library
    configure = [tool("cmake"), "-S", str(REPO / "reference-engine"), "-B", str(tmp_path), "-G", "Ninja", hidden]
    done = subprocess.run(
        configure + ["-DCMAKE_MAKE_PROGRAM=" + tool("ninja")], capture_output=True, text=True, timeout=120
    )
    assert done.returncode != 0 and "apt-get install %s)" % package in " ".join(done.stderr.split()), done.stderr
