"""Serving, connecting and resetting named segments."""
import gc

import pytest

import _renderlib
import renderlib
from segments import connect, segment_file, serve

Manager = renderlib.ShmemManager


def test_serve_and_connect_refusals(name):
    for bad in ("", "a/b", "x" * 201, name + "/"):
        assert Manager.serve(bad, 1 << 16, 1 << 16) is None
    assert Manager.serve(name, 16, 16) is None  # queues too small
    assert Manager.connect(name) is None  # nobody serves it
    server = serve(name)
    assert Manager.serve(name, 1 << 16, 1 << 16) is None  # served already, by a live process
    assert connect(name).is_segment_valid()
    server.remove()


def test_a_corrupt_segment_is_refused(name):
    server = serve(name)
    with open(segment_file(name), "r+b") as segment:
        segment.write(b"not a segment header")
    assert Manager.connect(name) is None
    assert not server.is_segment_valid()
    assert not server.try_write_pybuf(b"x")
    assert server.get_last_error() == _renderlib.ShmemError_INVALID_SEGMENT
    del server
    _renderlib.ShmemManager_reset(name, True)
    assert not segment_file(name).exists()


def test_the_static_operations_are_flat_functions_too(name):
    assert Manager.serve is not None and _renderlib.ShmemManager_serve(name, 1 << 16, 1 << 16) is not None
    manager = renderlib.ShmemManager()
    assert manager.this.own()
    _renderlib.ShmemManager_reset_all()
    _renderlib.ShmemManager_reset_all(False)
    _renderlib.ShmemManager_reset(name)  # our own server lives: nothing happens
    assert segment_file(name).exists()
    _renderlib.ShmemManager_reset(name, True)
    assert not segment_file(name).exists()
    del manager


def test_manager_argument_errors():
    with pytest.raises(TypeError, match="ShmemManager_serve expected 3 arguments, got 2"):
        _renderlib.ShmemManager_serve("name", 1)
    for size in ("big", -1):
        with pytest.raises((TypeError, OverflowError),
                           match="^in method 'ShmemManager_serve', argument 2 of type 'size_t'$"):
            _renderlib.ShmemManager_serve("name", size, 1)
    with pytest.raises(TypeError, match="^in method 'ShmemManager_connect', argument 1 of type 'char const \\*const'$"):
        _renderlib.ShmemManager_connect(5)
    with pytest.raises(TypeError, match="overloaded function 'ShmemManager_reset_all'") as raised:
        _renderlib.ShmemManager_reset_all(1)
    assert "Tarsel::IPC::ShmemManager::reset_all(bool)\n    Tarsel::IPC::ShmemManager::reset_all()" in str(raised.value)
    with pytest.raises(TypeError, match="overloaded function 'ShmemManager_reset'"):
        _renderlib.ShmemManager_reset("name", False, 3)


def test_transports_belong_to_their_proxy(name):
    server = serve(name)
    assert server.this.own()
    del server
    gc.collect()
    # The collected server freed its transport; a server that frees its end
    # leaves the segment for reset.
    _renderlib.ShmemManager_reset(name, True)
    client_side = serve(name)
    client_side.this.disown()
    _renderlib.free_tarsel_ipc_shmemtransport(client_side)  # freed at once; the proxy no longer owns
    del client_side
