"""The interpreter ends cleanly while engine threads are inside host
callbacks (a frame source busy in Python, messages from engine workers):
every run exits with status 0 within 5 seconds.

RENDERLIB_SHUTDOWN_RUNS sets the number of runs (100 by default; the audit
runs 1,000)."""
import concurrent.futures
import os
import pathlib
import subprocess
import sys

RUNS = int(os.environ.get("RENDERLIB_SHUTDOWN_RUNS", "100"))
SCRIPT = pathlib.Path(__file__).with_name("shutdown_script.py")
TESTS = pathlib.Path(__file__).parents[1]


def run_once(index):
    """(index, None) for a clean exit, else (index, what went wrong)."""
    arguments = [sys.executable, str(SCRIPT)] + (["messages"] if index % 2 else [])
    env = dict(os.environ, PYTHONPATH=os.pathsep.join([str(TESTS)] + sys.path))
    try:
        done = subprocess.run(arguments, capture_output=True, text=True, timeout=5, env=env)
    except subprocess.TimeoutExpired:
        return index, "did not exit within 5 s"
    if done.returncode != 0:
        return index, "exit status %d: %s" % (done.returncode, done.stderr.strip()[-300:])
    return index, None


def test_the_interpreter_ends_cleanly_with_engine_threads_in_callbacks():
    with concurrent.futures.ThreadPoolExecutor(max_workers=4) as pool:
        failures = [(i, what) for i, what in pool.map(run_once, range(RUNS)) if what]
    assert failures == [], "%d of %d runs failed, first: %s" % (len(failures), RUNS, failures[:3])
