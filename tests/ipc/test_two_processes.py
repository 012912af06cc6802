"""Two processes on one segment: a writer blocked on a full queue, peers that
die at the worst moments, and a segment that goes under its users. (Long
traffic both ways between peers that die at random: tests/stress.)"""

import time

import pytest

import _renderlib as E
from isolated import run_cleanly
from segments import Peer, serve

QUEUE = 1 << 15


# The peer fills the queue, then blocks writing one more message.
BLOCKED = """
transport = _renderlib.ShmemManager_connect(name)
while transport.try_write_pybuf(bytes(1000)):
    pass
print("full")
start = time.monotonic()
print(transport.write_pybuf(b"last".ljust(1000)), round(time.monotonic() - start, 2))
"""


def test_a_blocked_writer_resumes_when_the_reader_drains(name):
    server = serve(name, QUEUE, QUEUE)
    peer = Peer(BLOCKED, name)
    assert peer.line() == "full"
    time.sleep(0.3)
    count = 0
    while not bytes(server.timed_read_pybuf(2.0) or b"last").startswith(b"last"):
        count += 1
    ok, waited = peer.finish().split()
    assert ok == "True" and float(waited) >= 0.25 and count > 10
    server.remove()


# The peer commits three messages, then stays holding the client-to-server
# queue's lock or with a reservation open on it until it is killed.
KILLED = """
transport = _renderlib.ShmemManager_connect(name)
for i in range(3):
    assert transport.write_pybuf(b"committed %%d" %% i)
if %r == "lock":
    from engine_probe import EngineProbe
    print("ready")
    EngineProbe().lib.tarsel_probe_shmem_stall_holding_lock(int(transport.this), 1)  # never returns
transport.reserve_pybuf(100, "never committed")[:] = b"u" * 100
print("ready")
time.sleep(60)
"""


@pytest.mark.parametrize("held", ["lock", "reservation"])
def test_a_peer_killed_holding_the_lock_or_a_reservation(name, held):
    server = serve(name, QUEUE, QUEUE)
    peer = Peer(KILLED % held, name)
    assert peer.line() == "ready"
    time.sleep(0.2)
    assert peer.process.poll() is None, "the peer did not stay"
    if held == "lock":
        assert server.try_read_pybuf() is None  # the lock is taken: a try_ read would wait
        assert server.get_last_error() == E.ShmemError_RETRY
    peer.kill()
    start = time.perf_counter()
    # Each committed message exactly once, at once; the wait after them ends on the dead peer.
    got = [bytes(view) for view in iter(lambda: server.timed_read_pybuf(1.0), None)]
    assert got == [b"committed 0", b"committed 1", b"committed 2"]
    assert time.perf_counter() - start < 0.25 and server.get_last_error() == E.ShmemError_RETRY
    # A new client takes the dead one's place on the recovered queue.
    assert Peer("assert _renderlib.ShmemManager_connect(name).write_pybuf(b'again')", name).finish() == ""
    assert bytes(server.timed_read_pybuf(5.0)) == b"again"
    server.remove()


# The host starts its peer itself, so a killed peer stays a zombie until the
# host reaps it, and a host blocked in a transport call cannot: dead is dead,
# reaped or not. The host runs in a process of its own, since a wait that
# never ends would hang whoever runs it.
DEAD_PEER = """
import subprocess, sys, time
import _renderlib, renderlib
from segments import Peer

name, reaped, side = sys.argv[1], sys.argv[2] == "reaped", sys.argv[3]
if side == "client":  # the peer connects; this process serves
    here = _renderlib.ShmemManager_serve(name, %(queue)d, %(queue)d)
    peer = Peer("t = _renderlib.ShmemManager_connect(name); print('ready'); time.sleep(60)", name)
else:  # the peer serves; this process connects once it does
    peer = Peer("t = _renderlib.ShmemManager_serve(name, %(queue)d, %(queue)d); print('ready'); time.sleep(60)", name)
assert peer.line() == "ready"
if side == "server":
    here = _renderlib.ShmemManager_connect(name)
while here.try_write_pybuf(bytes(1000)):
    pass  # full: a write or a reservation waits for the peer to read
peer.kill(reap=reaped)
waits = {"read": here.read_pybuf, "timed read": lambda: here.timed_read_pybuf(5.0),
         "write": lambda: here.write_pybuf(bytes(1000)), "reserve": lambda: here.reserve_pybuf(1000)}
for what, wait in waits.items():
    start = time.perf_counter()
    result = wait()
    print(what, bool(result), here.get_last_error(), time.perf_counter() - start < 0.25)
if side == "server":
    again = _renderlib.ShmemManager_serve(name, %(queue)d, %(queue)d)  # the dead server's segment is taken back
    print("served again", again is not None)
    again.remove()
else:
    print("client alive", here.client_pid_exists())
    here.remove()
peer.reap()
""" % {"queue": QUEUE}


@pytest.mark.parametrize("reaped", ["reaped", "not reaped"])
@pytest.mark.parametrize("side", ["client", "server"], ids=["dead client", "dead server"])
def test_a_dead_peer_ends_every_blocking_wait(name, side, reaped):
    out = run_cleanly(DEAD_PEER, timeout=30, args=[name, reaped, side]).splitlines()
    # Nothing read or sent, RETRY, within one wait slice (50 ms) and a margin.
    waits = ["%s False %d True" % (what, E.ShmemError_RETRY) for what in ("read", "timed read", "write", "reserve")]
    assert out == waits + ["served again True" if side == "server" else "client alive False"]


# Any process of the same user can shrink a segment's object under the
# processes using it, or remove it. Touching a lost page would end them with
# SIGBUS; a reader blocked in another process must wake up.
GONE = """
import os, sys, time
import _renderlib, renderlib
from segments import Peer, segment_file

name, how = sys.argv[1], sys.argv[2]
server = _renderlib.ShmemManager_serve(name, %(queue)d, %(queue)d)
peer = Peer("t = _renderlib.ShmemManager_connect(name); t.write_pybuf(b'kept in view'); "
            "print('reading', flush=True); "
            "print(t.read_pybuf(), t.get_last_error(), t.is_segment_valid(), flush=True)", name)
assert peer.line() == "reading"
view = server.read_pybuf()
time.sleep(0.2)  # the peer sleeps in its read
start = time.monotonic()
if how == "removed":
    assert server.remove()
else:
    os.truncate(str(segment_file(name)), int(how))
print("valid", server.is_segment_valid())
print("write", server.write_pybuf(b"x"), server.get_last_error())
print("read", server.try_read_pybuf(), server.get_last_error())
print("view", bytes(view) in (b"kept in view", bytes(12)))
print("peer", peer.line(), time.monotonic() - start < 1.5)
peer.finish()
_renderlib.ShmemManager_reset(name, True)
""" % {"queue": QUEUE}


@pytest.mark.parametrize(
    "how", ["0", "4096", "removed"], ids=["truncated to nothing", "truncated to its header", "removed"]
)
def test_a_segment_truncated_or_removed_under_its_transports(name, how):
    out = run_cleanly(GONE, timeout=30, args=[name, how]).splitlines()
    lines = "valid False|write False {0}|read None {0}|view True|peer None {0} False True"
    assert out == lines.format(E.ShmemError_INVALID_SEGMENT).split("|")
