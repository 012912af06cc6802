"""Short runs of the fuzz targets (tests/fuzz/) in the normal test run.

Each target runs in a process of its own, so that a crash fails the test
instead of ending the session: the Python targets on this environment's
module without atheris (--replay: the seed corpus, then a fixed number of
generated inputs, each checked as in a long run), the C++ target built with
g++ under AddressSanitizer and UndefinedBehaviorSanitizer with a replaying
main. tools/fuzz.sh does the long, coverage-guided runs.

The faults the fuzzing found and reported are reproduced by
reproducers/reproduce.py; they are expected to fail until fixed (strict: a
fixed one fails here until its mark is removed and the fuzz targets take
those inputs again)."""
import os
import pathlib
import re
import subprocess
import sys

import pytest

from native_build import REPO, run
from process_memory import UNDER_ADDRESS_SANITIZER

FUZZ = pathlib.Path(__file__).resolve().parent
CORPUS = FUZZ / "corpus"
SEED = int(os.environ.get("RENDERLIB_FUZZ_SEED", "1"))


def target_environment(helpers=None):
    env = {k: v for k, v in os.environ.items() if k != "RENDERLIB_FUZZ_KNOWN_FAULTS"}
    if helpers:
        env["RENDERLIB_FUZZ_HELPERS"] = str(helpers)
    return env


def seed_files(target):
    folder = CORPUS / target
    return ([str(folder)], sum(1 for p in folder.rglob("*") if p.is_file())) if folder.is_dir() else ([], 0)


def check_replay(command, target, inputs, env, timeout):
    paths, count = seed_files(target)
    result = subprocess.run(command + ["--inputs", str(inputs), "--seed", str(SEED)] + paths, cwd=FUZZ, env=env,
                            capture_output=True, text=True, timeout=timeout)
    assert result.returncode == 0, "%s ended with %d\n%s\n%s" % (target, result.returncode, result.stdout[-4000:],
                                                                result.stderr[-8000:])
    # Every input ran: the count is printed only after the last one passed.
    assert "replayed %d corpus inputs and %d generated inputs" % (count, inputs) in result.stdout, result.stdout


def test_raster_serialisation(shared_registry):
    check_replay([sys.executable, "fuzz_raster_serialisation.py", "--replay"], "raster_serialisation", 3000,
                 target_environment(pathlib.Path(shared_registry.__file__).parent), timeout=120)


@pytest.mark.parametrize("mode, target, inputs", [([], "render_arguments", 3000),
                                                  (["--render"], "render_arguments-render", 1500)],
                         ids=["conversion", "render"])
def test_render_arguments(mode, target, inputs):
    check_replay([sys.executable, "fuzz_render_arguments.py", "--replay"] + mode, target, inputs,
                 target_environment(), timeout=120)


def test_segment(tmp_path):
    binary = tmp_path / "fuzz_segment"
    run([os.environ.get("CXX", "g++"), "-std=c++17", "-O1", "-g", "-fsanitize=address,undefined",
         "-fno-sanitize-recover=undefined", "-I", REPO / "reference-engine" / "src", FUZZ / "fuzz_segment.cpp",
         FUZZ / "replay_main.cpp", REPO / "reference-engine" / "src" / "ipc" / "segment.cpp", "-o", binary])
    # The binary carries its own sanitizer runtimes.
    env = {k: v for k, v in os.environ.items() if k not in ("LD_PRELOAD", "ASAN_OPTIONS", "UBSAN_OPTIONS")}
    env["UBSAN_OPTIONS"] = "print_stacktrace=1:halt_on_error=1"
    check_replay([str(binary)], "segment", 20000, env, timeout=120)


# Reproducers that fail the same way with or without a sanitizer, and those
# only a sanitizer shows (the sanitizer run of tools/sanitize.sh).
REPORTED = ["decode_dest_none", "decode_text_none", "decode_negative_length", "render_list_cleared", "render_this_loop"]
SANITIZER_SHOWS = ["render_list_replaced", "render_count_past_lists", "echo_frame_overflow"]


@pytest.mark.xfail(strict=True, reason="a reported fault of the module or engine, not fixed yet")
@pytest.mark.parametrize("case", REPORTED + (SANITIZER_SHOWS if UNDER_ADDRESS_SANITIZER else []))
def test_reported_fault(case, shared_registry):
    env = target_environment(pathlib.Path(shared_registry.__file__).parent)
    result = subprocess.run([sys.executable, str(FUZZ / "reproducers" / "reproduce.py"), case], env=env,
                            capture_output=True, text=True, timeout=10 if case == "render_this_loop" else 60)
    assert result.returncode == 0 and not re.search(r"ERROR: \w+Sanitizer|runtime error:", result.stderr), result.stderr[-4000:]
