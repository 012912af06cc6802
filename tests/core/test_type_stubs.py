"""The types installed with the package: the stubs the build generates for the SWIG layer (_renderlib-stubs,
renderlib/__init__.pyi) and the annotations of the hand-written modules (py.typed).

mypy's stubtest compares them with the modules as installed; mypy --strict checks the hand-written modules and a typed
host (which also runs here), and must find nothing wrong with either; and it checks a host's mistakes, every one of
which it must report and every one of which fails at run time too."""

import os
import pathlib
import pkgutil
import re
import runpy
import subprocess
import sys
import textwrap

import pytest

import _renderlib
import renderlib

# The test extra installs mypy only where it runs (Python 3.10 and later).
pytest.importorskip("mypy")

ALLOWLIST = pathlib.Path(__file__).resolve().with_name("stubtest_allowlist.txt")

# A host written against the stubs: every line must type-check under --strict,
# and the assert_type lines pin what the stubs say the binding gives.
TYPED_HOST = """
from typing_extensions import assert_type

import _renderlib
import renderlib
from renderlib import effects


def catalogue_names(builder: bool) -> list[str]:
    count = _renderlib.get_n_tarsel_builder_effects() if builder else _renderlib.get_n_tarsel_effects()
    entry_at = _renderlib.get_tarsel_builder_info_i if builder else _renderlib.get_tarsel_plugin_info_i
    names = []
    for index in range(count):
        entry = entry_at(index)
        assert_type(entry, renderlib.Plugin_Info | None)
        if entry is not None and entry.plugin_name is not None:
            names.append(entry.plugin_name)
    return names


def parameter_texts(name: str) -> dict[str, str | None]:
    instance = _renderlib.init_tarsel_effect(name, False)
    assert_type(instance, renderlib.EffectGlobals_t | None)
    assert instance is not None
    try:
        genotype = instance.effect_genotype
        assert genotype is not None
        assert_type(genotype.input_names, tuple[str, ...])
        texts = {}
        for param in genotype.params:
            assert param is not None
            lower, upper, _start, _end = param.get_limits()
            assert_type(lower, float | None)
            assert_type(param.flags.screen_mode, int)
            texts[param.get_canonical_name() or param.name or ""] = param.to_string(None)
        return texts
    finally:
        _renderlib.free_tarsel_effect(instance)


def render_gradient(width: int, height: int) -> bytearray:
    info = renderlib.T_RasterInfo()
    info.pixel_type = renderlib.pixel_rgba8
    size = _renderlib.make_tarsel_raster_info(info, width, height)
    assert_type(size, int)
    assert_type(info.ds_xsize, int)
    assert_type(info.x_origin_float, float)
    pixels = bytearray(size)
    gradient = _renderlib.init_tarsel_effect("T_Gradient", False)
    rasters = [info]
    rendered = _renderlib.render_tarsel_effect_to_native_image(
        gradient, "", pixels, 0, 0, 1, 1, rasters, [None], 1.0, len(rasters), 1.0, 0, 0, 0, 25, False,
        "srgb", "srgb", "linear")
    assert_type(rendered, bool)
    again = effects.render(gradient, (info, pixels), frame=1, colorspace="srgb")
    _renderlib.free_tarsel_effect(gradient)
    assert rendered and again
    return pixels


def messages_of(name: str) -> list[str]:
    seen: list[str] = []
    _renderlib.set_error_handler(lambda level, text: seen.append("%d: %s" % (level, text)))
    try:
        _renderlib.init_tarsel_effect(name, False)
    finally:
        _renderlib.set_error_handler(None)
    return seen
"""

# A host's mistakes, after a correct start: (statement, mypy's error code,
# the exception the binding raises for it).
MISTAKES_START = """
import _renderlib
import renderlib

info = renderlib.T_RasterInfo()
pixels = bytearray(64)
after_pixels = (0, 0, 1, 1, [info], [pixels], 1.0, 1, 1.0, 0, 0, 0, 25, False, "srgb", "srgb", "linear")
"""
MISTAKES = [
    # A bool argument takes True and False only.
    ('_renderlib.init_tarsel_effect("T_Gradient", 1)', "arg-type", TypeError),
    # The flat functions take positional arguments only.
    ('_renderlib.init_tarsel_effect(name="T_Gradient", builder=False)', "call-arg", TypeError),
    ("_renderlib.make_tarsel_raster_info(info, 64)", "call-arg", TypeError),
    # An int field takes no float.
    ("info.ds_xsize = 2.5", "assignment", TypeError),
    # A read-only field.
    ("info.background_pixel = info.background_pixel", "misc", AttributeError),
    # Records the engine makes have no constructor.
    ("renderlib.EffectGlobals_t()", "call-arg", AttributeError),
    # Pixels are a buffer, not text.
    ('_renderlib.render_tarsel_effect_to_native_image(None, "", "pixels", *after_pixels)', "arg-type", TypeError),
    # A catalogue entry may be None (past the end, here).
    ("_renderlib.get_tarsel_plugin_info_i(1 << 20).plugin_name", "union-attr", AttributeError),
]

MYPY_LINE = re.compile(r"^(?P<file>[^:]+):(?P<line>\d+): error: (?P<message>.*)\[(?P<code>[\w-]+)\]$")


def run(command, cwd, strip_preload=False):
    # A static check loads nothing of the binding: no sanitizer runtime needed.
    dropped = ("LD_PRELOAD", "ASAN_OPTIONS", "UBSAN_OPTIONS", "PYTHONMALLOC") if strip_preload else ()
    env = {name: value for name, value in os.environ.items() if name not in dropped}
    return subprocess.run(command, cwd=cwd, env=env, capture_output=True, text=True, timeout=300)


def config(tmp_path):
    # The package's code passes numpy arrays as buffers, which they are at run
    # time on every version, and to a type checker from Python 3.12 on (PEP 688).
    (tmp_path / "mypy.ini").write_text("[mypy]\npython_version = %d.%d\n" % max(sys.version_info[:2], (3, 12)))
    return tmp_path / "mypy.ini"


def mypy(tmp_path, name, source):
    """mypy --strict on `source`, written to <name>.py; without a source, on the installed package `name`."""
    if source:
        (tmp_path / ("%s.py" % name)).write_text(textwrap.dedent(source))
    options = ["--warn-unreachable", "%s.py" % name] if source else ["--config-file", config(tmp_path), "-p", name]
    strict = "-m mypy --strict --no-error-summary --show-error-codes --no-pretty --cache-dir".split()
    result = run([sys.executable, *strict, tmp_path / "mypy-cache", *options], tmp_path, strip_preload=True)
    found = [MYPY_LINE.match(line) for line in result.stdout.splitlines() if ": error:" in line]
    assert all(found), "an error mypy reported in a form not understood:\n" + result.stdout
    return result, [(int(match["line"]), match["code"], match["message"].strip()) for match in found]


def test_stubtest_finds_the_stubs_true_to_the_installed_modules(tmp_path):
    # From an empty folder, so that the installed modules and stubs are what
    # is checked, not anything in the working directory.
    modules = ["_renderlib", "renderlib", "--allowlist", ALLOWLIST, "--mypy-config-file", config(tmp_path)]
    result = run([sys.executable, "-m", "mypy.stubtest", *modules], tmp_path)
    report = result.stdout + result.stderr
    checked = re.search(r"Success: no issues found in (\d+) modules", report)
    assert result.returncode == 0 and checked, report
    # Every module of the package was compared, not just the two named (the
    # count also takes in the engine's folder, renderlib/lib).
    submodules = [m.name for m in pkgutil.walk_packages(renderlib.__path__, "renderlib.")]
    assert "renderlib.effects" in submodules
    assert int(checked.group(1)) >= 2 + len(submodules), report


def test_the_hand_written_modules_check_clean_against_their_annotations(tmp_path):
    result, errors = mypy(tmp_path, "renderlib", None)
    assert result.returncode == 0 and not errors, result.stdout + result.stderr


def test_a_typed_host_checks_clean_and_runs(tmp_path):
    result, errors = mypy(tmp_path, "typed_host", TYPED_HOST)
    assert result.returncode == 0 and not errors, result.stdout + result.stderr

    # The host is a working one: what was checked is what a host does.
    namespace = runpy.run_path(tmp_path / "typed_host.py")  # the file mypy checked
    names = namespace["catalogue_names"](False)
    assert "T_Gradient" in names and all(isinstance(name, str) for name in names)
    assert namespace["catalogue_names"](True)
    texts = namespace["parameter_texts"]("T_Blur")
    assert texts and all(isinstance(text, str) for text in texts.values())
    pixels = namespace["render_gradient"](16, 8)
    assert len(pixels) == 16 * 8 * 4 and any(pixels)
    messages = namespace["messages_of"]("T_NoSuchEffect")
    assert any(m.startswith("%d: " % _renderlib.Err_Error) and "T_NoSuchEffect" in m for m in messages), messages


def test_every_mistake_is_reported_and_fails_at_run_time(tmp_path):
    first_line = MISTAKES_START.count("\n") + 1
    source = MISTAKES_START + "".join("%s\n" % statement for statement, _code, _error in MISTAKES)
    result, errors = mypy(tmp_path, "mistakes", source)
    expected = {(first_line + n, code) for n, (_statement, code, _error) in enumerate(MISTAKES)}
    reported = {(line, code) for line, code, _message in errors}
    missing = [MISTAKES[line - first_line][0] for line, _code in sorted(expected - reported)]
    assert not missing, "mypy let these through: %s\n%s" % (missing, result.stdout)
    # Nothing else: the correct start is not reported.
    assert all(line >= first_line for line, _code, _message in errors), result.stdout

    for statement, _code, error in MISTAKES:
        namespace = {}
        exec(MISTAKES_START, namespace)
        with pytest.raises(error):
            exec(statement, namespace)
