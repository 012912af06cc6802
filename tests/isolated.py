"""Host code run in a process of its own, so that a crash or a hang fails one test instead of the whole run."""

import os
import pathlib
import signal
import subprocess
import sys
import textwrap

TESTS = pathlib.Path(__file__).resolve().parent


def run_python(script, timeout=30, args=()):
    """The finished process of `script` (dedented; the tests' helpers are importable). A process still running after
    `timeout` seconds is killed and reported as hung."""
    env = dict(os.environ, PYTHONPATH=os.pathsep.join([str(TESTS)] + sys.path))
    command = [sys.executable, "-c", textwrap.dedent(script)] + [str(a) for a in args]
    try:
        return subprocess.run(command, capture_output=True, text=True, timeout=timeout, env=env)
    except subprocess.TimeoutExpired as hung:
        stderr = hung.stderr.decode(errors="replace") if isinstance(hung.stderr, bytes) else (hung.stderr or "")
        raise AssertionError("hung: still running after %s s\n%s" % (timeout, stderr[-2000:])) from None


def ending(done):
    """How a process ended: "exit N" or the signal that killed it."""
    return signal.Signals(-done.returncode).name if done.returncode < 0 else "exit %d" % done.returncode


def run_cleanly(script, timeout=30, args=()):
    """The standard output of `script`, which must exit with status 0."""
    done = run_python(script, timeout, args)
    assert done.returncode == 0, "%s\n%s" % (ending(done), done.stderr[-3000:])
    return done.stdout
