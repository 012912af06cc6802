"""Ctrl-C during a transport call that waits for a peer that never answers:
the interpreter raises KeyboardInterrupt at once, nothing is taken or sent,
and the next call finds the queue as it was."""
import os
import queue
import signal
import subprocess
import sys
import textwrap
import threading
import time

import pytest

from segments import TESTS, fresh_name

# The host process: serves, lets its peer connect, fills its outgoing queue,
# then makes each waiting call in turn and reports when KeyboardInterrupt
# came. Afterwards its peer sends one message and reads the queue empty.
HOST = """
import sys, time
import _renderlib, renderlib
from segments import Peer

name = sys.argv[1]
here = _renderlib.ShmemManager_serve(name, 1 << 15, 1 << 15)
peer = Peer('''
t = _renderlib.ShmemManager_connect(name)
print("ready", flush=True)
assert sys.stdin.readline().strip() == "send"
assert t.write_pybuf(b"after the interrupts")
count = 0
while t.try_read_pybuf() is not None:
    count += 1
print(count, flush=True)
''', name)
assert peer.line() == "ready"
filled = 0
while here.try_write_pybuf(bytes(1000)):
    filled += 1
waits = {
    "read_pybuf": here.read_pybuf,
    "timed_read_pybuf": lambda: here.timed_read_pybuf(30.0),
    "read_pybuf_and_retry": lambda: here.read_pybuf_and_retry(30.0),
    "write_pybuf": lambda: here.write_pybuf(bytes(1000)),
    "timed_write_pybuf": lambda: here.timed_write_pybuf(bytes(1000), 30.0),
    "write_string": lambda: here.write_string("x" * 1000),
    "reserve_pybuf": lambda: here.reserve_pybuf(1000),
    "timed_reserve_pybuf": lambda: here.timed_reserve_pybuf(1000, 30.0),
}
for what, wait in waits.items():
    print("waiting", what, flush=True)
    try:
        print("returned", what, wait(), flush=True)
    except KeyboardInterrupt:
        print("interrupted", what, time.monotonic(), flush=True)
peer.say("send")
print("received", bytes(here.timed_read_pybuf(5.0)), here.try_read_pybuf(), flush=True)
print("peer read", peer.line(), "of", filled, flush=True)
peer.finish()
here.remove()
"""


def test_ctrl_c_ends_every_waiting_call_at_once():
    env = dict(os.environ, PYTHONPATH=os.pathsep.join([str(TESTS), str(TESTS / "ipc")] + sys.path))
    host = subprocess.Popen([sys.executable, "-u", "-c", textwrap.dedent(HOST), fresh_name()],
                            stdout=subprocess.PIPE, stderr=subprocess.PIPE, text=True, env=env)
    delays, lines = {}, []
    try:
        output = queue.Queue()
        threading.Thread(target=lambda: [output.put(line.strip()) for line in host.stdout], daemon=True).start()
        deadline = time.monotonic() + 30
        while True:
            try:
                line = output.get(timeout=max(0.0, deadline - time.monotonic()))
            except queue.Empty:
                break  # it hangs
            lines.append(line)
            if line.startswith("waiting"):
                time.sleep(0.2)  # well inside the wait
                sent = time.monotonic()
                host.send_signal(signal.SIGINT)
            elif line.startswith("interrupted"):
                _, what, when = line.split()
                delays[what] = float(when) - sent
            elif line.startswith("peer read"):
                break
    finally:
        if host.poll() is None:
            time.sleep(1)
            host.kill()  # it hung
        host.wait()
        stderr = host.stderr.read()
    assert host.returncode == 0, (lines, stderr[-2000:])
    assert sorted(delays) == sorted(line.split()[1] for line in lines if line.startswith("waiting")), lines
    print("\nfrom SIGINT to KeyboardInterrupt, seconds:", delays)
    assert max(delays.values()) < 0.1, delays
    # Nothing was taken or sent by the interrupted calls.
    assert "received b'after the interrupts' None" in lines
    filled = lines[-1].split()
    assert filled[2] == filled[4], lines[-1]
