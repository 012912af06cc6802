"""A survivor and a line of peers that die: this process serves a segment
and starts peer processes one after the other. Each peer connects (taking
the dead one's place), sends numbered messages (written, or reserved and
committed), reads what this process sends back, and kills itself with
SIGKILL at a random moment: between messages, holding the queue's lock, or
with a reservation open. This process blocks in read_pybuf, takes each death
as the end of its wait, and reaps the dead at once or leaves them zombies
for a while. Run by test_hostile_peers.py:

    python hostile_peers.py NAME SECONDS SEED

The last line of output is a JSON object of counts. A committed message that
never arrives, or one that arrives twice, out of order or changed, is a
fault."""
import json
import os
import random
import struct
import subprocess
import sys
import tempfile
import time

import _renderlib
import renderlib  # noqa: F401  (registers the proxy classes)
from process_memory import resident_kib

NAME, SECONDS, SEED = sys.argv[1], float(sys.argv[2]), int(sys.argv[3])
E = _renderlib
rng = random.Random(SEED)

# A message of peer NUMBER: its sequence number and NUMBER, then one byte
# repeated. The peer notes each message in its ledger after committing it,
# so the survivor knows the least it must receive.
PEER = r"""
import os, random, signal, struct, sys, threading
import _renderlib, renderlib
from engine_probe import EngineProbe
name, number, seed, ledger = sys.argv[1], int(sys.argv[2]), int(sys.argv[3]), sys.argv[4]
rng = random.Random(seed)
transport = _renderlib.ShmemManager_connect(name)
if transport is None:
    sys.exit(4)
notes = os.open(ledger, os.O_WRONLY | os.O_CREAT | os.O_APPEND)
death = rng.randrange(1, 300)
for sequence in range(10 ** 9):
    body = struct.pack("<QI", sequence, number) + bytes([(number * 31 + sequence) % 251]) * rng.choice([0, 17, 1000, 30000])
    if sequence == death:
        way = rng.randrange(3)
        if way == 1:  # holding the queue's lock: it never lets go, so a timer kills
            threading.Timer(rng.uniform(0.0, 0.02), os.kill, (os.getpid(), signal.SIGKILL)).start()
            EngineProbe().lib.tarsel_probe_shmem_stall_holding_lock(int(transport.this), 1)
        elif way == 2:  # with a reservation open
            transport.reserve_pybuf(len(body), "open")[:] = body
        os.kill(os.getpid(), signal.SIGKILL)
    if sequence % 2:
        view = transport.reserve_pybuf(len(body), "reserved")
        view[:] = body
        sent = transport.commit()
    else:
        sent = transport.write_pybuf(body, "written")
    if not sent:
        sys.exit(5)
    os.write(notes, b"%d\n" % sequence)
    echo = transport.try_read_pybuf()
    if echo is not None and bytes(echo) != bytes([bytes(echo)[0]]) * len(echo):
        sys.exit(3)  # what the survivor sent arrived changed
"""


def dead(process):
    """Whether the process has died, reaped or not."""
    try:
        with open("/proc/%d/stat" % process.pid) as stat:
            return stat.read().rsplit(")", 1)[1].split()[0] in "ZX"
    except FileNotFoundError:
        return True


def resources():
    """Open descriptors, mappings of shared-memory segments, resident KiB."""
    with open("/proc/self/maps") as maps:
        return len(os.listdir("/proc/self/fd")), sum("/dev/shm/" in line for line in maps), resident_kib()


server = _renderlib.ShmemManager_serve(NAME, 1 << 16, 1 << 16)
assert server is not None
ledgers = tempfile.mkdtemp(prefix="peer-ledgers-")
counts = {"peers": 0, "deaths": 0, "left as zombies": 0, "messages": 0, "bytes": 0, "echoes": 0,
          "lost": 0, "out of order": 0, "changed": 0}
faults, zombies = [], []


def serve_one_peer(number):
    ledger = os.path.join(ledgers, str(number))
    peer = subprocess.Popen([sys.executable, "-c", PEER, NAME, str(number), str(rng.randrange(10 ** 9)), ledger])
    received = 0
    while True:
        # Until the peer is connected a server waits for a client for ever:
        # timed reads then, the blocking read once messages come.
        view = server.read_pybuf() if received else server.timed_read_pybuf(0.5)
        if view is None:
            if received or dead(peer):
                break  # RETRY: the peer died (its committed messages were all read first)
            continue
        data = bytes(view)
        sequence, sender = struct.unpack_from("<QI", data)
        if (sequence, sender) != (received, number):
            counts["out of order"] += 1
        elif data[12:] != bytes([(number * 31 + sequence) % 251]) * (len(data) - 12):
            counts["changed"] += 1
        received += 1
        counts["messages"] += 1
        counts["bytes"] += len(data)
        if server.try_write_pybuf(bytes([received % 256]) * 100):
            counts["echoes"] += 1
    if server.get_last_error() != E.ShmemError_RETRY:
        faults.append("peer %d: the wait ended with error %d" % (number, server.get_last_error()))
    counts["deaths"] += 1
    if rng.random() < 0.5:
        zombies.append(peer)
        counts["left as zombies"] += 1
    else:
        peer.wait()
    if len(zombies) > 4:
        for zombie in zombies:
            zombie.wait()
        zombies.clear()
    with open(ledger) as notes:
        committed = len(notes.read().split())
    os.unlink(ledger)
    # The peer may die between committing a message and noting it: one more.
    if received < committed:
        counts["lost"] += committed - received
    if received > committed + 1:
        counts["out of order"] += received - committed - 1
    if peer.poll() not in (None, -9):
        faults.append("peer %d ended with %s" % (number, peer.returncode))


start, warm = time.monotonic(), None
while time.monotonic() - start < SECONDS:
    serve_one_peer(counts["peers"])
    counts["peers"] += 1
    if warm is None and time.monotonic() - start > SECONDS / 4:
        warm = resources()
for zombie in zombies:
    zombie.wait()
os.rmdir(ledgers)
server.remove()
now = resources()
warm = warm or now
counts.update(files_growth=now[0] - warm[0], mappings_growth=now[1] - warm[1], rss_growth_kib=now[2] - warm[2],
              faults=faults)
print(json.dumps(counts))
