"""Short runs of the fuzz targets, each in a process of its own: the Python
targets without atheris (--replay), the C++ target built with g++ under the
address and undefined-behaviour sanitizers; and the faults the fuzzing found,
replayed one by one (reproducers/reproduce.py). tools/fuzz.sh runs them long."""

import os
import pathlib
import re
import struct
import subprocess
import sys

import pytest

from fuzz_common import inputs
from native_build import REPO, run

FUZZ = pathlib.Path(__file__).resolve().parent
SEED = int(os.environ.get("RENDERLIB_FUZZ_SEED", "1"))
SANITIZER_REPORT = re.compile(r"ERROR: \w+Sanitizer|runtime error:")


def corpus(target):
    folder = FUZZ / "corpus" / target
    return [folder] if folder.is_dir() else []


def check_run(command, expected, env, timeout=120, stdin=None):
    done = subprocess.run(
        [str(part) for part in command], cwd=FUZZ, env=env, stdin=stdin, capture_output=True, timeout=timeout
    )
    out, err = done.stdout.decode(errors="replace"), done.stderr.decode(errors="replace")
    passed = done.returncode == 0 and expected in out and not SANITIZER_REPORT.search(err)
    assert passed, "%s ended with %d\n%s\n%s" % (command[1:], done.returncode, out[-4000:], err[-8000:])


# Generated inputs per Python target (tools/fuzz.sh's names: a "-render"
# target is its script run with --render).
INPUTS = {"raster_serialisation": 3000, "render_arguments": 3000, "render_arguments-render": 1500}


@pytest.mark.parametrize("target", INPUTS)
def test_python_target(target, shared_registry):
    script = "fuzz_%s.py" % target.split("-")[0]
    mode = ["--render"] if target.endswith("-render") else []
    files = sum(1 for folder in corpus(target) for p in folder.rglob("*") if p.is_file())
    # The target finds the byte_address module where the fixture built it.
    env = dict(os.environ, RENDERLIB_FUZZ_HELPERS=str(pathlib.Path(shared_registry.__file__).parent))
    # The count is printed only after the last input passed.
    command = [sys.executable, script, "--replay", "--inputs", INPUTS[target], "--seed", SEED] + mode + corpus(target)
    check_run(command, "replayed %d inputs" % (files + INPUTS[target]), env)


def test_segment(tmp_path):
    src = REPO / "reference-engine" / "src"
    flags = "-std=c++17 -O1 -g -fsanitize=address,undefined -fno-sanitize-recover=undefined".split()
    sources = [FUZZ / "fuzz_segment.cpp", FUZZ / "replay_main.cpp", src / "ipc" / "segment.cpp"]
    binary = tmp_path / "fuzz_segment"
    run([os.environ.get("CXX", "g++"), *flags, "-I", src, *sources, "-o", binary])
    stream = tmp_path / "inputs"  # kept to replay a failure: fuzz_segment < inputs
    replayed = list(inputs(corpus("segment"), 20000, SEED, 4200))
    stream.write_bytes(b"".join(struct.pack("<I", len(data)) + data for data in replayed))
    # The binary carries its own sanitizer runtimes.
    env = {k: v for k, v in os.environ.items() if k not in ("LD_PRELOAD", "ASAN_OPTIONS", "UBSAN_OPTIONS")}
    env["UBSAN_OPTIONS"] = "print_stacktrace=1:halt_on_error=1"
    with open(stream, "rb") as stdin:
        check_run([binary], "replayed %d inputs" % len(replayed), env, stdin=stdin)


@pytest.mark.parametrize("case", ["render_list_replaced", "echo_frame_overflow", "time_blur_frame_overflow"])
def test_found_fault_stays_fixed(case):
    check_run([sys.executable, FUZZ / "reproducers" / "reproduce.py", case], "", None, 60)
