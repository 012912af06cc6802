"""Named segments served and connected in one process: refusals and resets,
the message header at its wire layout, views over the segment, the write
functions' conversions, the error codes and the size and queue limits.
(Every wrapper's argument errors and memory: tests/core.)"""

import ctypes
import os
import random
import stat
import struct
import subprocess
import time

import numpy
import pytest

import _renderlib as E
import renderlib
from isolated import run_cleanly
from segments import connect, segment_file, serve

QUEUE = 1 << 16
LARGEST = QUEUE - 64  # a message's header is 64 bytes; an empty queue takes one this big


@pytest.fixture
def pair(name):
    server = serve(name, QUEUE, QUEUE)
    client = connect(name)
    yield server, client
    for transport in (client, server):
        transport.remove()


def refused(result, transport, error):
    """Whether a call answered None or False with that error code."""
    return (result is None or result is False) and transport.get_last_error() == error


def test_serve_and_connect_refusals_a_private_segment_and_a_corrupt_one(name):
    for bad in ("", "a/b", "x" * 201, name + "/"):
        assert E.ShmemManager_serve(bad, QUEUE, QUEUE) is None
    server, client = serve(name), connect(name)
    assert stat.S_IMODE(os.stat(segment_file(name)).st_mode) == 0o600
    assert server.is_segment_valid() and client.is_segment_valid() and client.client_pid_exists()
    E.ShmemManager_reset(name)  # its server lives: nothing happens
    assert segment_file(name).exists() and client.is_segment_valid()
    with open(segment_file(name), "r+b") as segment:
        segment.write(b"not a segment header")
    assert E.ShmemManager_connect(name) is None
    assert not server.is_segment_valid()
    assert refused(server.try_write_pybuf(b"x"), server, E.ShmemError_INVALID_SEGMENT)
    # The name fixture's forced reset then takes the segment away.


def test_the_message_header_is_read_in_place_at_its_wire_layout():
    header = renderlib.MessageHeader_t()
    assert header.this.own() and ctypes.string_at(int(header.this), 64) == bytes(64)
    assert (header.id, header.size, header.desc, header.reserved) == (0, 0, "", "")
    image = struct.pack("<II Q 24s 24s", 0xFFFFFFFF, 0xDEAD, 2**64 - 1, b"d" * 24, b"\xe9t\xe9\0tail")
    ctypes.memmove(int(header.this), image, 64)
    # Unsigned; a full text field has no terminator; up to the first NUL, with
    # bytes that are not UTF-8 as surrogate escapes.
    assert (header.id, header.size, header.desc, header.reserved) == (2**32 - 1, 2**64 - 1, "d" * 24, "\udce9t\udce9")
    ctypes.memmove(int(header.this) + 16, b"\0after", 6)
    assert header.desc == ""
    for field in ("id", "size", "desc", "reserved"):  # read only
        with pytest.raises(AttributeError):
            setattr(header, field, 1)


def test_nothing_to_read_is_none_without_an_error(pair):
    server, client = pair
    assert refused(client.try_read_pybuf(), client, E.ShmemError_RETRY)
    start = time.perf_counter()
    assert refused(client.timed_read_pybuf(0.05), client, E.ShmemError_TIMEOUT)
    assert 0.05 <= time.perf_counter() - start < 0.05 + 0.02
    # A child of the host ending (its SIGCHLD is ignored by default) does not cut the wait short.
    child = subprocess.Popen(["sleep", "0.1"])
    start = time.perf_counter()
    assert refused(client.timed_read_pybuf(0.5), client, E.ShmemError_TIMEOUT)
    assert time.perf_counter() - start >= 0.5 and child.wait() == 0
    assert E.shmem_error_to_string(99) is None  # each code's own text: docs/ipc.md


def test_messages_written_or_filled_in_place_are_read_in_place(pair):
    server, client = pair
    assert server.write_pybuf(b"first message", "greeting")
    assert server.get_last_error() == E.ShmemError_SHMEM_NO_ERROR
    assert server.write_pybuf(bytearray(b"second"))
    header = client.get_msg_header()
    assert not header.this.own()
    assert (header.id, header.size, header.desc) == (1, 13, "greeting")
    raw = ctypes.string_at(int(header.this), 64)  # the wire layout, as the engine wrote it
    assert struct.unpack_from("<I4xQ24s", raw) == (1, 13, b"greeting".ljust(24, b"\0"))
    # A header query only looks: the read takes that same message.
    view = client.read_pybuf()
    assert view.readonly and bytes(view) == b"first message"
    with pytest.raises(TypeError):
        view[0] = 0
    # The view stays valid until the next read.
    assert bytes(client.try_read_pybuf()) == b"second"
    assert client.get_msg_header() is None
    view = client.reserve_pybuf(1000, "filled")
    assert not view.readonly and len(view) == 1000 and view.contiguous
    pattern = (numpy.arange(1000) % 251).astype(numpy.uint8)
    numpy.frombuffer(view, numpy.uint8)[:] = pattern
    assert server.try_read_pybuf() is None  # not sent before commit
    assert client.commit()
    assert bytes(server.read_pybuf()) == pattern.tobytes()
    assert server.get_msg_header() is None
    empty = client.try_reserve_pybuf(0)
    assert empty is not None and len(empty) == 0 and not empty.readonly
    assert client.commit()
    assert not client.commit()  # nothing reserved any more


def test_empty_and_text_messages(pair):
    server, client = pair
    assert server.write_pybuf(b"") and server.write_string("text") and server.write_string("text", "with desc")
    # An empty message reads as nothing, header included, but it was one.
    assert client.get_msg_header() is None
    assert refused(client.read_pybuf(), client, E.ShmemError_SHMEM_NO_ERROR)
    assert (client.get_msg_header().desc, bytes(client.read_pybuf())) == ("", b"text\0")
    assert client.get_msg_header().desc == "with desc"
    assert server.write_string("y", "x" * 30)
    client.read_pybuf()
    assert client.get_msg_header().desc == "x" * 24
    with pytest.raises(TypeError, match="overloaded function 'ShmemTransport_write_string'"):
        server.write_string(b"bytes")  # text is str only


@pytest.mark.parametrize("operation, timeout", [("write", ()), ("try_write", ()), ("timed_write", (0.1,))])
def test_a_message_without_a_buffer(pair, operation, timeout):
    strided = numpy.zeros((4, 4), numpy.uint8)[:, ::2]
    texts = ["msg must support the buffer protocol", "unable to get Py_buffer view; maybe has no size?"]
    for message, text in zip([5, strided], texts):
        with pytest.raises(SystemError) as raised:
            getattr(pair[0], operation + "_pybuf")(message, *timeout)
        cause = raised.value.__cause__
        assert type(cause) is TypeError and str(cause) == "in ShmemTransport::%s, %s" % (operation, text)


def test_a_message_too_large_and_a_full_queue(pair):
    server, client = pair
    assert refused(server.try_write_pybuf(bytes(LARGEST + 1)), server, E.ShmemError_MSG_TOO_LARGE)
    assert refused(server.try_reserve_pybuf(LARGEST + 1), server, E.ShmemError_MSG_TOO_LARGE)
    assert client.try_read_pybuf() is None  # nothing was sent
    sent = 0
    while server.try_write_pybuf(bytes(1000)):
        sent += 1
    assert server.get_last_error() == E.ShmemError_RETRY and sent > 10
    start = time.perf_counter()
    assert refused(server.timed_write_pybuf(bytes(1000), 0.1), server, E.ShmemError_TIMEOUT)
    assert 0.1 <= time.perf_counter() - start < 0.1 + 0.02
    assert refused(server.try_reserve_pybuf(1000), server, E.ShmemError_RETRY)
    # Every message arrives once the reader drains the queue.
    assert sum(1 for _ in iter(client.try_read_pybuf, None)) == sent
    assert server.try_write_pybuf(bytes(1000))


def message(number):
    """Message `number` of a long run: random bytes, empty, of the largest size or (mostly) small."""
    rng = random.Random(number)
    size = rng.choice([0, LARGEST] + [int(LARGEST * rng.random() ** 8)] * 8)
    return (rng.getrandbits(8 * size).to_bytes(size, "little") if size else b""), str(number)


def test_a_long_run_of_messages_arrives_whole_and_in_order(pair):
    # Sent (half written, half reserved and committed) until the queue is
    # full, then read one at a time: messages cross the ring's end at every
    # offset, and the largest fits only when the queue is empty.
    server, client = pair
    sent = received = 0
    while received < 5000:
        if sent < 5000:
            body, desc = message(sent)
            view = server.try_reserve_pybuf(len(body), desc) if sent % 2 else None
            if view is not None:
                view[:] = body
            if server.commit() if sent % 2 else server.try_write_pybuf(body, desc):
                sent += 1
                continue
            assert server.get_last_error() == E.ShmemError_RETRY, sent
        if received == sent:  # the message read last keeps its space until the next read
            assert client.try_read_pybuf() is None
            continue
        body, desc = message(received)
        header, view = client.get_msg_header(), client.try_read_pybuf()
        assert client.get_last_error() == E.ShmemError_SHMEM_NO_ERROR, received
        assert (bytes(view or b""), header and header.desc) == (body, body and desc or None), received
        received += 1


# A server's pid handle: a new one each time, owning its copy, freed without a
# word (the binding generator warns on standard output of a pointer it cannot
# free). That many calls leave memory flat: tests/core/test_wrapper_leaks.py.
PID_HANDLES = """
import sys, _renderlib, renderlib
server = _renderlib.ShmemManager_serve(sys.argv[1], 1 << 12, 1 << 12)
pid = server.get_server_pid()
print(type(pid).__name__, "pid_t *" in repr(pid), pid.own(), pid != server.get_server_pid())
del pid
server.remove()
"""


def test_server_pid_handles_are_copies_freed_silently(name):
    assert run_cleanly(PID_HANDLES, args=[name]) == "SwigPyObject True True True\n"
