"""The survivor of test_hostile_peers.py: serves a segment and starts peers
one after the other, each taking the dead one's place, sending numbered
messages and killing itself at a random moment; blocks in read_pybuf, takes
each death as the end of its wait, and reaps the dead at once or leaves them
zombies for a while. Prints a JSON object of counts last.

    python hostile_peers.py NAME SECONDS SEED"""

import collections
import json
import os
import pathlib
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
rng = random.Random(SEED)

# A message of peer NUMBER: its sequence number and NUMBER, then one byte
# repeated, written or reserved and committed. The peer notes each message in
# its ledger once committed, so the survivor knows the least it must receive,
# and dies by SIGKILL between messages, holding the queue's lock or with a
# reservation open.
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
        elif way == 2:
            transport.reserve_pybuf(len(body), "open")[:] = body
        os.kill(os.getpid(), signal.SIGKILL)
    if sequence % 2:
        transport.reserve_pybuf(len(body), "reserved")[:] = body
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


def dead(process, within=0.0):
    """Whether the process has died, reaped or not (waitid leaves a zombie as it is), waiting up to `within` s."""
    peek, end = os.WEXITED | os.WNOHANG | os.WNOWAIT, time.monotonic() + within
    while process.returncode is None and os.waitid(os.P_PID, process.pid, peek) is None:
        if time.monotonic() >= end:
            return False
        time.sleep(0.005)
    return True


def resources():
    """Open descriptors, mappings of shared-memory segments, resident KiB."""
    maps = pathlib.Path("/proc/self/maps").read_text().splitlines()
    return len(os.listdir("/proc/self/fd")), sum("/dev/shm/" in line for line in maps), resident_kib()


server = _renderlib.ShmemManager_serve(NAME, 1 << 16, 1 << 16)
ledgers = pathlib.Path(tempfile.mkdtemp(prefix="peer-ledgers-"))
counts = collections.Counter(dict.fromkeys(["left as zombies", "lost", "out of order", "changed"], 0))
faults, zombies = [], []


def serve_one_peer(number):
    ledger = ledgers / str(number)
    peer = subprocess.Popen([sys.executable, "-c", PEER, NAME, str(number), str(rng.randrange(10**9)), ledger])
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
        if struct.unpack_from("<QI", data) != (received, number):
            counts["out of order"] += 1
        elif data[12:] != bytes([(number * 31 + received) % 251]) * (len(data) - 12):
            counts["changed"] += 1
        received += 1
        counts.update(messages=1, bytes=len(data), echoes=server.try_write_pybuf(bytes([received % 256]) * 100))
    if server.get_last_error() != _renderlib.ShmemError_RETRY:
        faults.append("peer %d: the wait ended with error %d" % (number, server.get_last_error()))
    # A peer killed with its timer thread running is a zombie in /proc, where
    # the engine looks, as soon as its main thread is gone; the kernel reports
    # it to waitid only once the other thread is gone too, moments later.
    if not dead(peer, within=5.0):
        faults.append("peer %d: the wait ended while it was alive" % number)
        peer.kill()
    if rng.random() < 0.5:
        zombies.append(peer)
        counts["left as zombies"] += 1
    else:
        peer.wait()
    if len(zombies) > 4:
        for zombie in zombies:
            zombie.wait()
        zombies.clear()
    committed = len(ledger.read_text().split()) if ledger.exists() else 0  # none: the peer never connected
    if ledger.exists():
        ledger.unlink()
    # The peer may die between committing a message and noting it: one more.
    counts["lost"] += max(committed - received, 0)
    counts["out of order"] += max(received - committed - 1, 0)
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
ledgers.rmdir()
server.remove()
now = resources()
warm = warm or now
counts.update(files_growth=now[0] - warm[0], mappings_growth=now[1] - warm[1], rss_growth_kib=now[2] - warm[2])
print(json.dumps(dict(counts, faults=faults)))
