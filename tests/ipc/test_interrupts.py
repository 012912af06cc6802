"""Ctrl-C during a transport call that waits for a peer that never answers:
the interpreter raises KeyboardInterrupt at once, nothing is taken or sent,
and the next call finds the queue as it was."""

from isolated import run_cleanly
from segments import fresh_name

# The host process: serves, lets its peer connect, fills its outgoing queue,
# then makes each waiting call in turn while another process sends it SIGINT,
# and reports how long after the signal KeyboardInterrupt came (both times on
# the system's monotonic clock). Afterwards its peer sends one message and
# reads the queue empty.
HOST = """
import os, subprocess, sys, time
import _renderlib, renderlib
from segments import Peer

SIGINT = "import os, sys, time; time.sleep(0.2); print(time.monotonic(), flush=True); os.kill(int(sys.argv[1]), 2)"
name = sys.argv[1]
here = _renderlib.ShmemManager_serve(name, 1 << 15, 1 << 15)
peer = Peer('''
t = _renderlib.ShmemManager_connect(name)
print("ready", flush=True)
assert sys.stdin.readline().strip() == "send"
assert t.write_pybuf(b"after the interrupts")
print(sum(1 for _ in iter(t.try_read_pybuf, None)), flush=True)
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
    sys.stderr.write("waiting in %s\\n" % what)  # names a wait that hangs
    sender = subprocess.Popen([sys.executable, "-c", SIGINT, str(os.getpid())], stdout=subprocess.PIPE, text=True)
    try:
        print("returned", what, wait())
    except KeyboardInterrupt:
        print("interrupted", what, time.monotonic() - float(sender.communicate()[0]))
peer.say("send")
print("received", bytes(here.timed_read_pybuf(5.0)), here.try_read_pybuf())
print("peer read", peer.line(), "of", filled)
peer.finish()
here.remove()
"""


def test_ctrl_c_ends_every_waiting_call_at_once():
    lines = run_cleanly(HOST, timeout=60, args=[fresh_name()]).splitlines()
    delays = {line.split()[1]: float(line.split()[2]) for line in lines if line.startswith("interrupted")}
    print("\nfrom SIGINT to KeyboardInterrupt, seconds:", delays)
    assert len(delays) == 8 and len(lines) == 10, lines
    assert max(delays.values()) < 0.25, delays  # a wait slice (50 ms) and a margin for a loaded machine
    # Nothing was taken or sent by the interrupted calls.
    filled = lines[-1].split()
    assert lines[-2] == "received b'after the interrupts' None" and filled[2] == filled[4], lines
