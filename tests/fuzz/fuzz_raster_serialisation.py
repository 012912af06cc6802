"""Fuzz target: raster records from base64 text and from 104-byte images, and
the module's base64 decoder writing into a caller's bytes. Each input is a
few calls on one record (and on other records and wrong objects); each must
be refused with the exception and argument the binding's rules give, the
record left as it was, or do what a model of the decoder written here does,
the bytes around the decoder's destination untouched. Run under atheris by
tools/fuzz.sh, without it by --replay (see fuzz_common)."""

import base64
import re

import fuzz_common
from fuzz_common import ByteReader

import _renderlib
import renderlib

IMAGE = 104
GUARD = 16
ALPHABET = b"ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/"
TEXT_CHARS = ALPHABET.decode() + "==\0-_ \n\x80\xff\u0100\U0001f600"

helpers = None  # the byte_address module, made in main()


def decoded(raw):
    """The bytes the decoder reads: up to the first NUL or '='."""
    return re.split(rb"[\0=]", raw, maxsplit=1)[0]


# The decoder's rules: a text's UTF-8 bytes up to the first NUL or '=', each
# character's value (a byte outside the alphabet is its own value), four
# characters to three bytes, the length's bytes cleared first, and only the
# second write of phases 1 and 2 bounded by the length: the caller gives a
# length that covers the others (reach()).
def decode_into(raw, dest, start, length):
    """base64decode(raw, &dest[start], length) on bytearray `dest`; False for a write outside it."""
    if length == 0:
        return True
    dest[start : start + length] = bytes(length)
    j = 0
    for i, c in enumerate(decoded(raw)):
        v, phase = ALPHABET.find(c) if c in ALPHABET else c, i % 4
        writes = [(j, [v << 2 & 0xFF, (v & 0x30) >> 4, (v & 0x3C) >> 2, v & 0x3F][phase])]
        if phase:
            j += 1
            if phase < 3 and j < length:
                writes.append((j, [0, (v & 0x0F) << 4 & 0xFF, (v & 0x03) << 6][phase]))
        for at, bits in writes:
            if start + at >= len(dest):
                return False
            dest[start + at] |= bits
    return True


def reach(raw):
    """Bytes the unbounded writes of the decoder reach for `raw` (0: none)."""
    n = len(decoded(raw))
    return (n - 1) // 4 * 3 + (1, 1, 2, 3)[(n - 1) % 4] if n else 0


TextSubclass = type("TextSubclass", (str,), {})


def text_argument(r):
    """(argument, its UTF-8 bytes, or None when it is not a text the call
    takes): base64-like, a real encoding, any code points (lone surrogates
    included, which do not encode), or no text at all."""
    mode = r.int_in(0, 15)
    if mode == 0:
        return r.pick([b"QUJD" * 30, bytearray(b"A" * IMAGE), 104, 1.5, ["A" * IMAGE], renderlib.T_RasterInfo()]), None
    if mode == 1:
        return None, None
    mode = r.int_in(0, 5)
    if mode == 0:
        text = "".join(TEXT_CHARS[r.byte() % len(TEXT_CHARS)] for _ in range(r.int_in(0, 220)))
    elif mode == 1:
        text = base64.b64encode(r.bytes(r.int_in(0, 170))).decode()
        text = text[: r.int_in(0, len(text))] if r.flag() else text
    elif mode in (2, 3):
        text = r.bytes(r.int_in(0, 160)).decode(*(("latin-1",), ("utf-8", "surrogateescape"))[mode - 2])
    elif mode == 4:
        text = "".join(chr(r.int_in(0, 0x10FFFF)) for _ in range(r.int_in(0, 60)))
    else:
        text = TextSubclass(r.bytes(r.int_in(IMAGE - 4, IMAGE + 4)).decode("latin-1"))
    try:
        return text, text.encode("utf-8")
    except UnicodeEncodeError:
        return text, None


def first(*rules):
    """The refusal of the first (condition, refusal) rule that holds, else None."""
    return next((refusal for holds, refusal in rules if holds), None)


def check(call, args, refusal):
    """`refusal`: None for a call that must go through, else (exception, argument number)."""
    try:
        result = call(*args)
    except (TypeError, ValueError, OverflowError) as error:
        named = refusal and re.search(r"argument %d\b" % refusal[1], str(error))
        assert named and isinstance(error, refusal[0]), (refusal, error)
        return None
    assert refusal is None, ("taken", refusal, args)
    return result


class Case:
    def __init__(self, r):
        self.r, self.info, self.shadow = r, renderlib.T_RasterInfo(), bytes(IMAGE)

    def record_argument(self):
        """(argument, "ok" for the record or its bare pointer, "wrong" for another object, or None)."""
        choice = self.r.int_in(0, 11)
        if choice == 0:
            return self.r.pick([renderlib.T_RenderInfo(), 7, "record", bytearray(IMAGE)]), "wrong"
        return [(None, None), (self.info.this, "ok")][choice - 1] if choice < 3 else (self.info, "ok")

    def from_base64(self):
        (info, kind), (text, raw) = self.record_argument(), text_argument(self.r)
        # Conversions first, in argument order, then the null checks.
        refusal = first(
            (kind == "wrong", (TypeError, 1)),
            (raw is None and text is not None, (TypeError, 2)),
            (info is None, (ValueError, 1)),
            (text is None, (ValueError, 2)),
        )
        check(_renderlib.make_tarsel_raster_info_from_base64, (info, text), refusal)
        if refusal is None:
            raw = raw.split(b"\0", 1)[0]
            scratch = bytearray(max(len(raw), IMAGE))
            assert decode_into(raw, scratch, 0, len(raw))
            self.shadow = bytes(scratch[:IMAGE])

    def from_bits(self):
        (info, kind), (text, raw) = self.record_argument(), text_argument(self.r)
        short = text is None or (raw is not None and len(raw) < IMAGE)
        refusal = first(
            (kind == "wrong", (TypeError, 1)),
            (short, (ValueError, 2)),
            (raw is None, (TypeError, 2)),
            (info is None, (ValueError, 1)),
        )
        check(_renderlib.make_tarsel_raster_info_from_bits, (info, text), refusal)
        if refusal is None:
            self.shadow = raw[:IMAGE]

    def to_bytearray(self):
        info, kind = self.record_argument()
        refusal = None if kind == "ok" else (TypeError if kind == "wrong" else ValueError, 1)
        image = check(_renderlib.raster_info_to_bytearray, (info,), refusal)
        assert kind != "ok" or (type(image) is bytearray and image == self.shadow), image

    def decode(self):
        r = self.r
        text, raw = text_argument(r)
        before, least = r.int_in(0, 3), reach(raw or b"")
        length = r.pick([0, least, least + r.int_in(0, 40), len(raw or b""), (3 * len(raw or b"") + 3) // 4])
        length = max(length, least) if length else 0
        buffer = bytearray(b"\xa5" * (before + length + GUARD))
        dest, bad = helpers.byte_address(buffer, before), r.int_in(0, 15)
        given = length  # or a length of another type or out of range
        if bad == 0:
            dest = r.pick([buffer, 3, "dest", renderlib.T_RasterInfo()])
        elif bad == 1:
            given = r.pick([1.0, 2**31, -(2**31) - 1, "4", None])
        elif bad == 2:
            dest = None
        elif bad == 3:
            length = given = r.int_in(-(2**31), -1)
        expected = bytearray(buffer)
        refusal = first(
            (raw is None and text is not None, (TypeError, 1)),
            (bad == 0, (TypeError, 2)),
            (bad == 1, ((TypeError, OverflowError), 3)),
            (length < 0, (ValueError, 3)),
            (length > 0 and text is None, (ValueError, 1)),
            (length > 0 and dest is None, (ValueError, 2)),
        )
        check(_renderlib.base64decode, (text, dest, given), refusal)
        if refusal is None and text is not None and dest is not None:
            assert decode_into(raw, expected, before, length)
            assert expected[before + length :] == b"\xa5" * GUARD  # the length given was enough
        assert buffer == expected, (text, length, bytes(buffer).hex(), bytes(expected).hex())

    def run(self):
        for _ in range(1 + self.r.int_in(0, 3)):
            self.r.pick([self.from_base64, self.from_bits, self.decode, self.to_bytearray])()
            image = bytes(_renderlib.raster_info_to_bytearray(self.info))
            assert image == self.shadow, (image.hex(), self.shadow.hex())
            if self.r.at >= len(self.r.data):
                break


def TestOneInput(data):
    Case(ByteReader(data)).run()


if __name__ == "__main__":
    helpers = fuzz_common.byte_address_module()
    fuzz_common.main(TestOneInput, max_len=1024)
