"""Version text, build identifiers, colour configuration, the user check, and configuring without a system library."""

import os
import re
import subprocess
import sys

import pytest

import _renderlib
from native_build import REPO, tool
from renderlib.cli import main


def test_module_and_engine_built_together_share_one_identifier():
    module_id = _renderlib.ext_build_id()
    assert re.fullmatch(r"[0-9a-f]{16}", module_id)
    assert _renderlib.ext_build_id() == _renderlib.get_tarsel_build_id() == module_id
    assert _renderlib.check_build_id() is True


def test_a_module_built_against_a_separately_built_engine_fails_the_check(module_on_separate_engine):
    script = "import _renderlib as m\nprint(m.__file__, m.check_build_id(), m.ext_build_id(), m.get_tarsel_build_id())"
    env = dict(os.environ, PYTHONPATH=str(module_on_separate_engine))
    out = subprocess.check_output([sys.executable, "-c", script], env=env, text=True, timeout=120)
    location, check, module_id, engine_id = out.split()
    assert location.startswith(str(module_on_separate_engine)) and check == "False"
    assert re.fullmatch(r"[0-9a-f]{16}", module_id) and re.fullmatch(r"[0-9a-f]{16}", engine_id)
    assert module_id != engine_id


def test_version_text_is_the_engines(probe):
    assert _renderlib.get_tarsel_version_info().startswith("tarsel_ps reference engine ")
    [call] = probe.calls()
    assert re.fullmatch(r"get_tarsel_version_info\(0x[0-9a-f]+, 255\)", call)


# A text result is cut at its buffer's 255 bytes and keeps invalid UTF-8 as
# surrogate escapes (so that it encodes back to the engine's bytes).
@pytest.mark.parametrize("raw, text", [(b"v" * 300, "v" * 255), (b"caf\xe9 \xff build", "caf\udce9 \udcff build")])
def test_version_text_is_cut_at_255_bytes_and_keeps_invalid_utf8(probe, raw, text):
    probe.set_version_text(raw)
    assert _renderlib.get_tarsel_version_info() == text


def test_colour_configuration_is_what_the_engine_uses(monkeypatch):
    monkeypatch.setenv("OCIO", "/studio/config.ocio")
    assert _renderlib.get_ocio_path() == "/studio/config.ocio"
    monkeypatch.delenv("OCIO")
    assert _renderlib.get_ocio_path() == ""


def test_user_check_compares_the_identity_text_exactly_and_takes_only_encodable_text():
    identity = "S-1-22-1-%d" % os.geteuid()
    assert _renderlib.check_user(identity) is True
    for other in ("", identity + " ", "S-1-22-1-%d" % (os.geteuid() + 1), None):  # None: a null text
        assert _renderlib.check_user(other) is False, other
    for bad in (b"S-1-22-1-0", 0, "S-1-\udcff"):
        with pytest.raises(TypeError, match=r"^in method 'check_user', argument 1 of type 'char const \*'$"):
            _renderlib.check_user(bad)


def test_the_version_command_reports_engine_identity_and_user(capsys):
    assert main(["version"]) == 0
    fields = dict((part.strip() for part in line.split(":", 1)) for line in capsys.readouterr().out.splitlines())
    assert fields["engine version"] == _renderlib.get_tarsel_version_info()
    assert fields["engine build id"] == fields["module build id"] == _renderlib.ext_build_id()
    assert fields["build identity"] == "match"
    assert fields["user check"].endswith("-> ok")


@pytest.mark.parametrize("library, package", [("cJSON", "libcjson-dev"), ("PNG", "libpng-dev")])
def test_a_missing_system_library_stops_the_configure_step_naming_its_package(tmp_path, library, package):
    hidden = "-DCMAKE_DISABLE_FIND_PACKAGE_%s=ON" % library
    configure = [tool("cmake"), "-S", str(REPO / "reference-engine"), "-B", str(tmp_path), "-G", "Ninja", hidden]
    done = subprocess.run(
        configure + ["-DCMAKE_MAKE_PROGRAM=" + tool("ninja")], capture_output=True, text=True, timeout=120
    )
    assert done.returncode != 0 and "apt-get install %s)" % package in " ".join(done.stderr.split()), done.stderr
