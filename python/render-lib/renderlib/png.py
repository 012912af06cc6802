"""A minimal PNG writer for 8-bit RGBA frames (the standard library's zlib)."""

from __future__ import annotations

import struct
import zlib
from typing import TYPE_CHECKING

if TYPE_CHECKING:
    from _typeshed import FileDescriptorOrPath


def _chunk(kind: bytes, data: bytes) -> bytes:
    return struct.pack(">I", len(data)) + kind + data + struct.pack(">I", zlib.crc32(kind + data) & 0xFFFFFFFF)


def encode_rgba8(pixels: bytes | bytearray | memoryview, width: int, height: int) -> bytes:
    """PNG bytes of `height` rows of `width` RGBA pixels, 8 bits per channel,
    first row at the top."""
    row = width * 4
    if len(pixels) < row * height:
        raise ValueError("%d bytes do not hold %dx%d RGBA pixels" % (len(pixels), width, height))
    raw = b"".join(b"\0" + bytes(pixels[y * row : (y + 1) * row]) for y in range(height))
    header = struct.pack(">IIBBBBB", width, height, 8, 6, 0, 0, 0)
    return (
        b"\x89PNG\r\n\x1a\n" + _chunk(b"IHDR", header) + _chunk(b"IDAT", zlib.compress(raw, 6)) + _chunk(b"IEND", b"")
    )


def write_rgba8(path: FileDescriptorOrPath, pixels: bytes | bytearray | memoryview, width: int, height: int) -> None:
    with open(path, "wb") as out:
        out.write(encode_rgba8(pixels, width, height))
