"""Raster descriptors as 104-byte images and base64 text."""

import base64
import struct

import pytest
from hypothesis import given, settings, strategies as st

import _renderlib
import renderlib

WORDS = st.lists(st.integers(-(2**31), 2**31 - 1), min_size=26, max_size=26)


def record_from_words(words):
    info = renderlib.T_RasterInfo()
    _renderlib.make_tarsel_raster_info_from_base64(info, base64.b64encode(struct.pack("<26i", *words)).decode())
    return info


@settings(max_examples=300, deadline=None)
@given(WORDS, st.booleans())
def test_base64_text_from_a_standard_encoder_restores_every_byte(words, padded):
    raw = struct.pack("<26i", *words)
    text = base64.b64encode(raw).decode()
    assert text.endswith("=")
    info = renderlib.T_RasterInfo()
    _renderlib.make_tarsel_raster_info_from_base64(info, text if padded else text.rstrip("="))
    image = _renderlib.raster_info_to_bytearray(info)
    assert type(image) is bytearray and bytes(image) == raw  # the unnamed words too
    assert info.ds_xsize == words[0] and info.extra_line_stride_elts == words[14]


@pytest.mark.parametrize(
    "cut, kept",
    [(lambda text: text[:40] + "=" + text[41:], 30), (lambda text: text[:120], 90)],
    ids=["stopping at an equals sign", "short"],
)
def test_a_cut_text_decodes_what_precedes_the_cut_and_leaves_the_tail_zero(cut, kept):
    raw = bytes(range(100, 204))
    info = record_from_words([-1] * 26)
    _renderlib.make_tarsel_raster_info_from_base64(info, cut(base64.b64encode(raw).decode()))
    image = bytes(_renderlib.raster_info_to_bytearray(info))
    assert image[:kept] == raw[:kept] and image[kept:] == bytes(104 - kept)


def test_from_bits_copies_the_first_104_bytes_of_the_texts_encoding():
    info = renderlib.T_RasterInfo()
    _renderlib.make_tarsel_raster_info_from_bits(info, "A" * 104 + "ignored")
    assert bytes(_renderlib.raster_info_to_bytearray(info)) == b"A" * 104
    with pytest.raises(ValueError, match="a raster descriptor image is 104 bytes"):
        _renderlib.make_tarsel_raster_info_from_bits(info, "A" * 103)
    assert bytes(_renderlib.raster_info_to_bytearray(info)) == b"A" * 104  # a refused call changes nothing


def test_character_values(shared_registry):
    # Each character's value lands in the top six bits of the first byte; a
    # byte outside the alphabet merges its own value ('-' is 45), and '=' ends
    # the text.
    values = []
    for character in "AZaz09+/-=":
        dest = bytearray(3)
        _renderlib.base64decode(character + "AAA", shared_registry.byte_address(dest, 0), 3)
        values.append(dest[0] >> 2)
    assert values == [0, 25, 26, 51, 52, 61, 62, 63, 45, 0]
    assert not hasattr(_renderlib, "DEC")  # the decoder's own, not a function of the module


def test_the_decoder_writes_into_the_callers_bytes(shared_registry):
    raw = bytes(range(200, 245))
    dest = bytearray(b"\xee" * 60)
    _renderlib.base64decode(base64.b64encode(raw).decode(), shared_registry.byte_address(dest, 0), 60)
    assert bytes(dest[:45]) == raw and bytes(dest[45:]) == bytes(15)  # the whole length is cleared first
    untouched = bytearray(b"\xee" * 4)
    _renderlib.base64decode("QUJD", shared_registry.byte_address(untouched, 0), 0)
    assert untouched == bytearray(b"\xee" * 4)  # a length of 0 touches nothing


@pytest.mark.parametrize(
    "call, position, ctype",
    [
        (lambda: _renderlib.make_tarsel_raster_info_from_base64(None, "AAAA"), 1, "T_RasterInfo *"),
        (lambda: _renderlib.make_tarsel_raster_info_from_base64(renderlib.T_RasterInfo(), None), 2, "char const *"),
        (lambda: _renderlib.make_tarsel_raster_info_from_bits(None, "A" * 104), 1, "T_RasterInfo *"),
        (lambda: _renderlib.raster_info_to_bytearray(None), 1, "T_RasterInfo *"),
    ],
)
def test_none_for_a_record_or_text_is_refused(call, position, ctype):
    with pytest.raises(
        ValueError,
        match=r"^invalid null reference in method '\w+', argument %d of type '%s'$"
        % (position, ctype.replace("*", r"\*")),
    ):
        call()
