"""A served segment and a client of it in one process: views over the
segment, the write functions' conversions, the error codes and the
size and queue limits."""
import os
import stat
import time

import numpy
import pytest

import _renderlib
import renderlib
from isolated import run_python
from process_memory import UNDER_ADDRESS_SANITIZER
from segments import connect, segment_file, serve

E = _renderlib
QUEUE = 1 << 16
LARGEST = QUEUE - 64  # a message's header is 64 bytes; an empty queue takes one this big


@pytest.fixture
def pair(name):
    server = serve(name, QUEUE, QUEUE)
    client = connect(name)
    yield server, client
    for transport in (client, server):
        transport.remove()


def test_the_segment_is_private_to_its_user(pair, name):
    assert stat.S_IMODE(os.stat(segment_file(name)).st_mode) == 0o600
    server, client = pair
    assert server.is_segment_valid() and client.is_segment_valid()
    assert client.client_pid_exists()


def test_nothing_to_read_is_none_without_an_error(pair):
    server, client = pair
    assert client.try_read_pybuf() is None
    assert client.get_last_error() == E.ShmemError_RETRY
    assert client.get_msg_header() is None
    start = time.perf_counter()
    assert client.timed_read_pybuf(0.05) is None
    assert client.get_last_error() == E.ShmemError_TIMEOUT
    assert 0.05 <= time.perf_counter() - start < 0.05 + 0.02


def test_written_messages_are_read_in_place(pair):
    server, client = pair
    assert server.write_pybuf(b"first message", "greeting")
    assert server.get_last_error() == E.ShmemError_SHMEM_NO_ERROR
    assert server.write_pybuf(bytearray(b"second"))
    header = client.get_msg_header()
    assert not header.this.own()
    assert (header.id, header.size, header.desc) == (1, 13, "greeting")
    # A header query only looks: the read takes that same message.
    view = client.read_pybuf()
    assert view.readonly and bytes(view) == b"first message"
    with pytest.raises(TypeError):
        view[0] = 0
    # The view stays valid until the next read.
    assert bytes(client.try_read_pybuf()) == b"second"
    assert client.get_msg_header() is None


def test_reserved_space_is_filled_in_place(pair):
    server, client = pair
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
    assert server.write_pybuf(b"")
    assert server.write_string("text")
    assert server.write_string("text", "with desc")
    # An empty message reads as nothing, header included, but it was one.
    assert client.get_msg_header() is None
    assert client.read_pybuf() is None
    assert client.get_last_error() == E.ShmemError_SHMEM_NO_ERROR
    assert (client.get_msg_header().desc, bytes(client.read_pybuf())) == ("", b"text\0")
    assert client.get_msg_header().desc == "with desc"
    full = "x" * 30
    assert server.write_string("y", full)
    client.read_pybuf()
    assert client.get_msg_header().desc == full[:24]


@pytest.mark.parametrize("function, operation", [
    (lambda t, m: t.write_pybuf(m), "write"),
    (lambda t, m: t.try_write_pybuf(m), "try_write"),
    (lambda t, m: t.timed_write_pybuf(m, 0.1), "timed_write"),
])
def test_a_message_without_a_buffer(pair, function, operation):
    server, _ = pair
    with pytest.raises(SystemError) as raised:
        function(server, 5)
    assert isinstance(raised.value.__cause__, TypeError)
    assert str(raised.value.__cause__) == "in ShmemTransport::%s, msg must support the buffer protocol" % operation
    strided = numpy.zeros((4, 4), numpy.uint8)[:, ::2]
    with pytest.raises(SystemError) as raised:
        function(server, strided)
    assert str(raised.value.__cause__) == ("in ShmemTransport::%s, unable to get Py_buffer view; maybe has no size?"
                                           % operation)


def test_argument_errors(pair):
    server, _ = pair
    with pytest.raises(TypeError, match=r"^in method 'ShmemTransport_read_pybuf', argument 1 of type "
                                        r"'Tarsel::IPC::ShmemTransport \*'$"):
        _renderlib.ShmemTransport_read_pybuf(renderlib.MessageHeader_t())
    with pytest.raises(TypeError, match="^in method 'ShmemTransport_timed_read_pybuf', argument 2 of type 'float'$"):
        server.timed_read_pybuf("soon")
    with pytest.raises(TypeError, match="Wrong number or type of arguments for overloaded function "
                                        "'ShmemTransport_reserve_pybuf'") as raised:
        server.reserve_pybuf(-1)
    assert ("Tarsel::IPC::ShmemTransport::reserve_pybuf(size_t,char const *const)\n"
            "    Tarsel::IPC::ShmemTransport::reserve_pybuf(size_t)") in str(raised.value)
    with pytest.raises(TypeError, match="overloaded function 'ShmemTransport_write_string'"):
        _renderlib.ShmemTransport_write_string(server)
    with pytest.raises(TypeError, match="overloaded function 'ShmemTransport_write_string'"):
        server.write_string(b"bytes")


def test_identity_queries(pair):
    server, client = pair
    pid = server.get_server_pid()
    assert not isinstance(pid, int) and "pid_t *" in repr(pid)
    assert pid.own() is True and pid != server.get_server_pid()  # a new copy each time, freed by its handle
    texts = [_renderlib.shmem_error_to_string(code) for code in range(6)]
    assert all(isinstance(text, str) and text for text in texts) and len(set(texts)) == 6
    assert _renderlib.shmem_error_to_string(99) is None
    server.print_stats()


def test_size_boundaries(pair):
    server, client = pair
    assert server.write_pybuf(bytes(LARGEST))
    assert len(client.read_pybuf()) == LARGEST
    assert client.try_read_pybuf() is None
    assert not server.try_write_pybuf(bytes(LARGEST + 1))
    assert server.get_last_error() == E.ShmemError_MSG_TOO_LARGE
    assert server.try_reserve_pybuf(LARGEST + 1) is None
    assert server.get_last_error() == E.ShmemError_MSG_TOO_LARGE
    assert client.try_read_pybuf() is None  # nothing was sent
    assert server.write_pybuf(b"still works") and bytes(client.read_pybuf()) == b"still works"


def test_a_full_queue(pair):
    server, client = pair
    sent = 0
    while server.try_write_pybuf(bytes(1000)):
        sent += 1
    assert server.get_last_error() == E.ShmemError_RETRY and sent > 10
    start = time.perf_counter()
    assert not server.timed_write_pybuf(bytes(1000), 0.1)
    assert server.get_last_error() == E.ShmemError_TIMEOUT
    assert 0.1 <= time.perf_counter() - start < 0.1 + 0.02
    assert server.try_reserve_pybuf(1000) is None and server.get_last_error() == E.ShmemError_RETRY
    # Every message arrives once the reader drains the queue.
    assert sum(1 for _ in iter(client.try_read_pybuf, None)) == sent
    assert server.try_write_pybuf(bytes(1000))


def test_a_removed_segment_is_invalid_for_both_ends(pair, name):
    server, client = pair
    assert server.write_pybuf(b"pending")
    assert client.remove()
    assert not segment_file(name).exists()
    for transport in (server, client):
        assert not transport.is_segment_valid()
        assert transport.try_read_pybuf() is None
        assert transport.get_last_error() == E.ShmemError_INVALID_SEGMENT
        assert not transport.try_write_pybuf(b"x")
        assert transport.get_last_error() == E.ShmemError_INVALID_SEGMENT


def test_a_million_server_pid_handles_leak_nothing_and_print_nothing(name):
    calls = 1000 if "vgpreload" in os.environ.get("LD_PRELOAD", "") else 1000000
    done = run_python("""
        import sys, _renderlib, renderlib
        from process_memory import resident_kib
        server = _renderlib.ShmemManager_serve(sys.argv[1], 1 << 12, 1 << 12)
        calls = int(sys.argv[2])
        for _ in range(calls // 10):
            server.get_server_pid()
        before = resident_kib()
        for _ in range(calls):
            server.get_server_pid()
        sys.stderr.write("grew %d KiB" % (resident_kib() - before))
        server.remove()
    """, timeout=120, args=[name, calls])
    assert done.returncode == 0 and done.stdout == "", (done.stdout[:300], done.stderr[-2000:])
    if not UNDER_ADDRESS_SANITIZER:  # a pid_t kept per call would be some 32 MB
        assert int(done.stderr.split()[-2]) < 1024, done.stderr
