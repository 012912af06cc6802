"""A time limit for each test, with the stacks of a test that overruns it.

Before each test the interpreter's own watchdog (a C thread, so it fires also when a hung call holds the interpreter
lock) is armed: past the limit it writes every thread's stack and ends the process. In an xdist worker (the suite's
usual way to run) the stacks go to the worker's dump file; xdist then reports the test as failed ("worker 'gw0' crashed
while running ...") with the dump, and starts a new worker for the rest. Run in one process (-n 0), the stacks go to
standard error and the run ends there.

RENDERLIB_TEST_TIME_LIMIT sets the limit in seconds (300; 0 for none)."""

import faulthandler
import os
import pathlib
import shutil
import sys
import tempfile

import pytest

TEST_TIME_LIMIT = float(os.environ.get("RENDERLIB_TEST_TIME_LIMIT", "300"))
DUMPS = "RENDERLIB_STACK_DUMPS"  # the folder of the dump files, one a worker
_dump_file = None


def _dump_path(worker):
    return pathlib.Path(os.environ[DUMPS], "%s.txt" % worker)


def pytest_configure(config):
    if not hasattr(config, "workerinput") and DUMPS not in os.environ:  # the controlling process
        os.environ[DUMPS] = tempfile.mkdtemp(prefix="test-stacks-")
        config.add_cleanup(lambda: shutil.rmtree(os.environ.pop(DUMPS), ignore_errors=True))


@pytest.hookimpl(hookwrapper=True)
def pytest_runtest_protocol(item, nextitem):
    global _dump_file
    if TEST_TIME_LIMIT > 0:
        worker = os.environ.get("PYTEST_XDIST_WORKER")
        dump = sys.__stderr__  # the main thread's stack names the test
        if worker is not None:
            dump = _dump_file = _dump_file or open(_dump_path(worker), "w")
            dump.seek(0)
            dump.truncate()
            dump.write("%s ran past its %g s; the stacks of its threads:\n" % (item.nodeid, TEST_TIME_LIMIT))
            dump.flush()
        faulthandler.dump_traceback_later(TEST_TIME_LIMIT, exit=True, file=dump)
    try:
        yield
    finally:
        faulthandler.cancel_dump_traceback_later()  # nothing to cancel without a limit


@pytest.hookimpl(optionalhook=True)
def pytest_handlecrashitem(crashitem, report, sched):
    """In the controlling process: a worker that ended during a test leaves its dump, if the time limit ended it."""
    dump = _dump_path(report.node.gateway.id)
    if dump.exists() and "Timeout (" in dump.read_text(errors="replace"):
        report.longrepr = "%s\n%s" % (report.longrepr, dump.read_text(errors="replace"))
