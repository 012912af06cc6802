"""Fuzz target: raster descriptors from base64 text and from 104-byte images,
and the module's base64 decoder writing into a caller's bytes.

Each input is a short sequence of calls on one record (and on other records
and wrong objects). Every call must either raise TypeError, ValueError or
OverflowError and leave the record as it was, or do exactly what the decoder's
rules say, checked against a model of them written here: a text's UTF-8 bytes
up to the first NUL or '=', each character's value (a byte outside the
alphabet is its own value), four characters to three bytes, only the second
write of phases 1 and 2 bounded by the length. The decoder is given a length
it documents as enough (at least the bytes its unbounded writes reach), and
guard bytes around the destination must stay untouched.

Run under atheris by tools/fuzz.sh; `--replay` runs it without atheris (see
fuzz_common)."""
import base64
import ctypes
import struct
import sys

import fuzz_common
from fuzz_common import ByteReader

import _renderlib
import renderlib

IMAGE = 104
GUARD = 16
ALLOWED = (TypeError, ValueError, OverflowError)
ALPHABET = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/"
TEXT_CHARS = ALPHABET + "==\0-_ \n\x80\xff\u0100\U0001f600"

helpers = None  # the byte_address module, made in main()


def dec(c):
    if 65 <= c <= 90:
        return c - 65
    if 97 <= c <= 122:
        return c - 71
    if 48 <= c <= 57:
        return c + 4
    if c == 43:
        return 62
    if c == 47:
        return 63
    return c


def decoded_chars(raw):
    """The bytes the decoder reads: up to the first NUL or '='."""
    for stop, c in enumerate(raw):
        if c in (0, 61):
            return raw[:stop]
    return raw


def decode_into(raw, dest, start, length):
    """The decoder's effect on bytearray `dest` for base64decode(raw,
    &dest[start], length); False when a write would fall outside `dest`."""
    if length == 0:
        return True
    dest[start:start + length] = bytes(length)
    j = 0
    for i, c in enumerate(decoded_chars(raw)):
        v = dec(c)
        phase = i % 4
        writes = []
        if phase == 0:
            writes.append((j, (v << 2) & 0xFF))
        elif phase == 1:
            writes.append((j, (v & 0x30) >> 4))
            j += 1
            if j < length:
                writes.append((j, ((v & 0x0F) << 4) & 0xFF))
        elif phase == 2:
            writes.append((j, (v & 0x3C) >> 2))
            j += 1
            if j < length:
                writes.append((j, ((v & 0x03) << 6) & 0xFF))
        else:
            writes.append((j, v & 0x3F))
            j += 1
        for index, bits in writes:
            if start + index >= len(dest):
                return False
            dest[start + index] |= bits
    return True


def reach(raw):
    """Bytes the unbounded writes of the decoder reach for `raw` (0: none)."""
    n = len(decoded_chars(raw))
    return max(((i // 4) * 3 + {0: 0, 1: 0, 2: 1, 3: 2}[i % 4] + 1 for i in range(n)), default=0)


class TextSubclass(str):
    pass


def make_text(r):
    """A str the fuzz data chooses: base64-like, a real encoding, or any
    code points (lone surrogates included, which do not encode)."""
    mode = r.int_in(0, 5)
    if mode == 0:
        return "".join(TEXT_CHARS[r.byte() % len(TEXT_CHARS)] for _ in range(r.int_in(0, 220)))
    if mode == 1:
        text = base64.b64encode(r.bytes(r.int_in(0, 170))).decode()
        return text[:r.int_in(0, len(text))] if r.flag() else text
    if mode == 2:
        return r.bytes(r.int_in(0, 160)).decode("latin-1")
    if mode == 3:
        return r.bytes(r.int_in(0, 160)).decode("utf-8", "surrogateescape")
    if mode == 4:
        return "".join(chr(r.int_in(0, 0x10FFFF)) for _ in range(r.int_in(0, 60)))
    return TextSubclass(r.bytes(r.int_in(IMAGE - 4, IMAGE + 4)).decode("latin-1"))


def text_argument(r):
    """(argument, its UTF-8 bytes or None when it is not a text the call takes)."""
    choice = r.int_in(0, 15)
    if choice == 0:
        return r.pick([b"QUJD" * 30, bytearray(b"A" * IMAGE), 104, 1.5, ["A" * IMAGE], renderlib.T_RasterInfo()]), None
    if choice == 1:
        return None, None
    text = make_text(r)
    try:
        return text, text.encode("utf-8")
    except UnicodeEncodeError:
        return text, None


def image_of(info):
    return bytes(_renderlib.raster_info_to_bytearray(info))


def check_fields(info, image):
    """The named fields read the words of the image."""
    words = struct.unpack("<26i", image)
    assert (info.ds_xsize, info.ds_ysize, info.extra_line_stride_elts) == (words[0], words[1], words[14]), image
    assert (info.flip_y_p, info.is_premultiplied) == (words[20], words[22]), image


class Case:
    def __init__(self, r):
        self.r = r
        self.info = renderlib.T_RasterInfo()
        self.shadow = bytes(IMAGE)

    def record_argument(self):
        """(argument, True for this case's record, as its proxy or its bare
        pointer object, False for an object the call refuses, None for None)."""
        choice = self.r.int_in(0, 11)
        if choice == 0:
            return self.r.pick([renderlib.T_RenderInfo(), 7, "record", bytearray(IMAGE)]), False
        if choice == 1:
            return None, None
        if choice == 2:
            return self.info.this, True  # the bare pointer object converts too
        return self.info, True

    def call(self, function, *args):
        try:
            function(*args)
        except ALLOWED as error:
            return error
        return None

    def null_refused(self, error, position, ctype):
        assert isinstance(error, ValueError) and str(error).startswith("invalid null reference") \
            and "argument %d of type '%s'" % (position, ctype) in str(error), error

    def from_base64(self):
        info, valid_info = self.record_argument()
        text, raw = text_argument(self.r)
        error = self.call(_renderlib.make_tarsel_raster_info_from_base64, info, text)
        # Conversions first, in argument order, then the null checks.
        if valid_info is False:
            assert isinstance(error, TypeError) and "argument 1 of type 'T_RasterInfo *'" in str(error), error
        elif raw is None and text is not None:
            assert isinstance(error, TypeError) and "argument 2 of type 'char const *'" in str(error), error
        elif info is None:
            self.null_refused(error, 1, "T_RasterInfo *")
        elif text is None:
            self.null_refused(error, 2, "char const *")
        else:
            assert error is None, error
            length = len(raw.split(b"\0", 1)[0])
            scratch = bytearray(max(length, IMAGE))
            assert decode_into(raw[:length], scratch, 0, length)
            self.shadow = bytes(scratch[:IMAGE])

    def from_bits(self):
        info, valid_info = self.record_argument()
        text, raw = text_argument(self.r)
        error = self.call(_renderlib.make_tarsel_raster_info_from_bits, info, text)
        if valid_info is False:
            assert isinstance(error, TypeError) and "argument 1 of type 'T_RasterInfo *'" in str(error), error
        elif text is None or (raw is not None and len(raw) < IMAGE):
            assert isinstance(error, ValueError) and "a raster descriptor image is 104 bytes" in str(error), error
        elif raw is None:
            assert isinstance(error, TypeError) and "argument 2 of type 'char const *'" in str(error), error
        elif info is None:
            self.null_refused(error, 1, "T_RasterInfo *")
        else:
            assert error is None, error
            self.shadow = raw[:IMAGE]

    def to_bytearray(self):
        info, valid_info = self.record_argument()
        try:
            image = _renderlib.raster_info_to_bytearray(info)
        except ALLOWED as error:
            if valid_info is False:
                assert isinstance(error, TypeError) and "argument 1 of type 'T_RasterInfo *'" in str(error), error
            else:
                assert info is None, error
                self.null_refused(error, 1, "T_RasterInfo *")
            return
        assert valid_info and type(image) is bytearray and bytes(image) == self.shadow, (info, image)

    def decode(self):
        r = self.r
        text, raw = text_argument(r)
        usable = raw if raw is not None else b""
        before = r.int_in(0, 3)
        least = reach(usable)
        length = r.pick([0, least, least + r.int_in(0, 40), len(usable), (3 * len(usable) + 3) // 4])
        length = max(length, least) if length else 0
        buffer = bytearray(bytes([0xA5]) * (before + length + GUARD))
        dest = helpers.byte_address(buffer, before)
        bad = r.int_in(0, 15)
        if bad == 0:
            dest = r.pick([buffer, 3, "dest", renderlib.T_RasterInfo()])
        elif bad == 1:
            length = r.pick([1.0, 2 ** 31, -2 ** 31 - 1, "4", None])
        elif bad == 2:
            dest = None
        elif bad == 3:
            length = r.int_in(-2 ** 31, -1)
        text_refused = raw is None and text is not None
        expected = bytearray(buffer)
        error = self.call(_renderlib.base64decode, text, dest, length)
        if text_refused:
            assert isinstance(error, TypeError) and "argument 1 of type 'char const *'" in str(error), error
        elif bad == 0:
            assert isinstance(error, TypeError) and "argument 2 of type 'uchar_t *'" in str(error), error
        elif bad == 1:
            assert isinstance(error, (TypeError, OverflowError)) and "argument 3 of type 'int'" in str(error), error
        elif length < 0:
            assert isinstance(error, ValueError) and "argument 3 of type 'int' must not be negative" in str(error), error
        elif length > 0 and (text is None or dest is None):
            which = "argument 1 of type 'char const *'" if text is None else "argument 2 of type 'uchar_t *'"
            assert isinstance(error, ValueError) and "null reference" in str(error) and which in str(error), error
        else:
            assert error is None, error
            if text is not None and dest is not None:
                assert decode_into(raw, expected, before, length)
                assert expected[before + length:] == bytes([0xA5]) * GUARD  # the length given was enough
        assert buffer == expected, (text, length, bytes(buffer).hex(), bytes(expected).hex())

    def run(self):
        operations = [self.from_base64, self.from_bits, self.decode, self.to_bytearray]
        for _ in range(1 + self.r.int_in(0, 3)):
            self.r.pick(operations)()
            image = image_of(self.info)
            assert image == self.shadow, (image.hex(), self.shadow.hex())
            check_fields(self.info, image)
            if self.r.remaining() == 0:
                break


def TestOneInput(data):
    Case(ByteReader(data)).run()


def main():
    global helpers
    helpers = fuzz_common.byte_address_module()
    fuzz_common.main(TestOneInput, sys.modules[__name__], max_len=1024)


if __name__ == "__main__":
    main()
