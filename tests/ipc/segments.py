"""Shared-memory segments for the transport tests: names unique to this test
session, served and connected in this process, and peer processes that run
a short script against a segment with a hard time limit."""

import itertools
import os
import pathlib
import subprocess
import sys
import textwrap
from subprocess import PIPE

import _renderlib
import renderlib  # noqa: F401  (registers the proxy classes)

SESSION_PREFIX = "rltest-%d-" % os.getpid()
_numbers = itertools.count()
TESTS = pathlib.Path(__file__).resolve().parents[1]


def fresh_name():
    return SESSION_PREFIX + str(next(_numbers))


def segment_file(name):
    """Where the system keeps the segment of that name."""
    return pathlib.Path("/dev/shm") / ("tarsel-ipc." + name)


def session_segments():
    return sorted(path.name for path in pathlib.Path("/dev/shm").glob("tarsel-ipc." + SESSION_PREFIX + "*"))


def serve(name, size1=1 << 16, size2=1 << 16):
    transport = _renderlib.ShmemManager_serve(name, size1, size2)
    assert transport is not None, name
    return transport


def connect(name):
    transport = _renderlib.ShmemManager_connect(name)
    assert transport is not None, name
    return transport


class Peer:
    """Another Python process running `script` (with `name`, `_renderlib`
    and `renderlib` at hand, its output unbuffered). It may report on stdout
    and read lines from stdin."""

    def __init__(self, script, name):
        prologue = "import os, sys, time, zlib\nimport _renderlib, renderlib\nname = %r\n" % name
        paths = [str(TESTS), str(TESTS / "ipc")] + [p for p in [os.environ.get("PYTHONPATH")] if p]
        command = [sys.executable, "-u", "-c", prologue + textwrap.dedent(script)]
        env = dict(os.environ, PYTHONPATH=os.pathsep.join(paths))
        self.process = subprocess.Popen(command, stdin=PIPE, stdout=PIPE, stderr=PIPE, text=True, env=env)

    def line(self):
        """The next line the peer prints (empty when it ended)."""
        return self.process.stdout.readline().strip()

    def say(self, text):
        self.process.stdin.write(text + "\n")
        self.process.stdin.flush()

    def finish(self, limit=60):
        """Waits for the peer to end with status 0, killing it after `limit`
        seconds: its remaining output."""
        try:
            out, err = self.process.communicate(timeout=limit)
        except subprocess.TimeoutExpired as timeout:
            self.process.kill()
            raise AssertionError(
                "the peer did not end within %d s: %s" % (limit, self.process.communicate()[1])
            ) from timeout
        assert self.process.returncode == 0, err
        return out

    def kill(self, reap=True):
        """Ends the peer with SIGKILL, wherever it is, and waits for it to die;
        unless `reap`, it is left unreaped (a zombie) until reap()."""
        self.process.kill()
        if reap:
            self.reap()
        else:
            os.waitid(os.P_PID, self.process.pid, os.WEXITED | os.WNOWAIT)

    def reap(self):
        self.process.communicate()
