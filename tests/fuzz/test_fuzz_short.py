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
    assert done.returncode == 0 and expected in out and not SANITIZER_REPORT.search(err), "%s ended with %d\n%s\n%s" % (
        command[1:],
        done.returncode,
        out[-4000:],
        err[-8000:],
    )


def helpers(shared_registry):
    """The environment in which a target finds the byte_address module."""
    return dict(os.environ, RENDERLIB_FUZZ_HELPERS=str(pathlib.Path(shared_registry.__file__).parent))


@pytest.mark.parametrize(
    "script, mode, target, count",
    [
        ("fuzz_raster_serialisation.py", [], "raster_serialisation", 3000),
        ("fuzz_render_arguments.py", [], "render_arguments", 3000),
        ("fuzz_render_arguments.py", ["--render"], "render_arguments-render", 1500),
    ],
    ids=["raster_serialisation", "render_arguments", "render_arguments-render"],
)
def test_python_target(script, mode, target, count, shared_registry):
    files = sum(1 for folder in corpus(target) for p in folder.rglob("*") if p.is_file())
    # The count is printed only after the last input passed.
    check_run(
        [sys.executable, script, "--replay", "--inputs", count, "--seed", SEED] + mode + corpus(target),
        "replayed %d inputs" % (files + count),
        helpers(shared_registry),
    )


def test_segment(tmp_path):
    binary = tmp_path / "fuzz_segment"
    run(
        [
            os.environ.get("CXX", "g++"),
            "-std=c++17",
            "-O1",
            "-g",
            "-fsanitize=address,undefined",
            "-fno-sanitize-recover=undefined",
            "-I",
            REPO / "reference-engine" / "src",
            FUZZ / "fuzz_segment.cpp",
            FUZZ / "replay_main.cpp",
            REPO / "reference-engine" / "src" / "ipc" / "segment.cpp",
            "-o",
            binary,
        ]
    )
    stream = tmp_path / "inputs"  # kept to replay a failure: fuzz_segment < inputs
    count = 0
    with open(stream, "wb") as out:
        for data in inputs(corpus("segment"), 20000, SEED, 4200):
            out.write(struct.pack("<I", len(data)) + data)
            count += 1
    # The binary carries its own sanitizer runtimes.
    env = {k: v for k, v in os.environ.items() if k not in ("LD_PRELOAD", "ASAN_OPTIONS", "UBSAN_OPTIONS")}
    env["UBSAN_OPTIONS"] = "print_stacktrace=1:halt_on_error=1"
    with open(stream, "rb") as replayed:
        check_run([binary], "replayed %d inputs" % count, env, stdin=replayed)


@pytest.mark.parametrize("case", ["render_list_replaced", "echo_frame_overflow", "time_blur_frame_overflow"])
def test_found_fault_stays_fixed(case):
    check_run([sys.executable, FUZZ / "reproducers" / "reproduce.py", case], "", None, 60)
