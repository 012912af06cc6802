"""The 64-byte message header, read in place at its wire layout."""
import ctypes
import struct

import pytest

import _renderlib
import renderlib


def header_bytes(header):
    return ctypes.string_at(int(header.this), 64)


def test_a_new_header_is_64_zero_bytes():
    header = renderlib.MessageHeader_t()
    assert header.this.own()
    assert header_bytes(header) == bytes(64)
    assert (header.id, header.size, header.desc, header.reserved) == (0, 0, "", "")


def test_fields_are_read_at_their_offsets():
    header = renderlib.MessageHeader_t()
    image = struct.pack("<II Q 24s 24s", 0xFFFFFFFF, 0xDEAD, 2 ** 64 - 1, b"d" * 24, b"\xe9t\xe9\0tail")
    ctypes.memmove(int(header.this), image, 64)
    assert header.id == 2 ** 32 - 1  # unsigned, positive
    assert header.size == 2 ** 64 - 1
    assert header.desc == "d" * 24  # a full field has no terminator
    # Up to the first NUL; bytes that are not UTF-8 come back as surrogate escapes.
    assert header.reserved == "\udce9t\udce9"
    ctypes.memmove(int(header.this) + 16, b"\0after", 6)
    assert header.desc == ""


def test_fields_cannot_be_written():
    header = renderlib.MessageHeader_t()
    for field in ("id", "size", "desc", "reserved"):
        with pytest.raises(AttributeError):
            setattr(header, field, 1)
        assert not hasattr(_renderlib, "MessageHeader_t_%s_set" % field)
