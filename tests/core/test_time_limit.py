"""The suite's time limit for each test (tests/time_limit.py), on a small suite of its own: a test that hangs holding
the interpreter lock fails with the stacks of its threads, and the tests after it still run."""

import os
import subprocess
import sys

from isolated import TESTS

HANGING_SUITE = """
import ctypes


def test_before():
    pass


def test_hangs_holding_the_interpreter_lock():
    ctypes.PyDLL(None).sleep(600)  # a foreign call that keeps the lock


def test_after():
    pass
"""


def test_a_test_that_hangs_holding_the_lock_fails_alone_with_its_stacks(tmp_path):
    (tmp_path / "conftest.py").write_text("from time_limit import *  # noqa: F401,F403\n")
    (tmp_path / "test_hanging.py").write_text(HANGING_SUITE)
    env = dict(os.environ, PYTHONPATH=os.pathsep.join([str(TESTS)] + sys.path), RENDERLIB_TEST_TIME_LIMIT="2")
    env.pop("RENDERLIB_STACK_DUMPS", None)
    command = [sys.executable, *"-m pytest -q -p no:cacheprovider -n 1 --max-worker-restart=5".split(), tmp_path]
    done = subprocess.run(command, cwd=tmp_path, capture_output=True, text=True, timeout=120, env=env)
    assert done.returncode == 1, done.stdout[-3000:]
    assert "1 failed, 2 passed" in done.stdout, done.stdout[-3000:]
    report = done.stdout[done.stdout.index("crashed while running") :]
    assert "test_hanging.py::test_hangs_holding_the_interpreter_lock ran past its 2 s" in report
    assert "line 10 in test_hangs_holding_the_interpreter_lock" in report, report[:3000]
