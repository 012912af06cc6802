"""Short runs of the fuzz targets (tests/fuzz/) in the normal test run.

Each target runs in a process of its own, so that a crash fails the test
instead of ending the session: the Python targets on this environment's
module without atheris (--replay: the seed corpus, then a fixed number of
generated inputs, each checked as in a long run), the C++ target built with
g++ under AddressSanitizer and UndefinedBehaviorSanitizer with a replaying
main. tools/fuzz.sh does the long, coverage-guided runs.

The faults the fuzzing found are replayed one by one by
reproducers/reproduce.py, each in a process of its own, since before their
fixes they crashed or hung."""
import os
import pathlib
import re
import subprocess
import sys

import pytest

from native_build import REPO, run

FUZZ = pathlib.Path(__file__).resolve().parent
CORPUS = FUZZ / "corpus"
SEED = int(os.environ.get("RENDERLIB_FUZZ_SEED", "1"))


def target_environment(helpers=None):
    env = dict(os.environ)
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


# Each fault that once crashed, hung or went wrong quietly; the sanitizer run
# (tools/sanitize.sh) shows the quiet ones if they come back.
FOUND = ["decode_dest_none", "decode_text_none", "decode_negative_length", "render_list_cleared", "render_this_loop",
         "render_list_replaced", "render_count_past_lists", "echo_frame_overflow", "time_blur_frame_overflow"]


@pytest.mark.parametrize("case", FOUND)
def test_found_fault_stays_fixed(case, shared_registry):
    env = target_environment(pathlib.Path(shared_registry.__file__).parent)
    result = subprocess.run([sys.executable, str(FUZZ / "reproducers" / "reproduce.py"), case], env=env,
                            capture_output=True, text=True, timeout=60)
    assert result.returncode == 0 and not re.search(r"ERROR: \w+Sanitizer|runtime error:", result.stderr), \
        result.stdout[-2000:] + result.stderr[-4000:]
