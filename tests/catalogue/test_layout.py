"""Every field the module reads in place, checked against raw bytes written
with ctypes at the proxy's address: a wrong offset or bit is the fault that
nothing else catches."""

import ctypes
import struct

import pytest

import _renderlib
import renderlib


def address(proxy):
    return int(proxy.this)


def poke(proxy, offset, data):
    ctypes.memmove(address(proxy) + offset, data, len(data))


def peek(proxy, offset, size):
    return ctypes.string_at(address(proxy) + offset, size)


# ParamFlags: (field, byte of the little-endian 32-bit word, first bit, width)
FLAG_BITS = [
    ("wenable_p", 0, 6, 1),
    ("fromfile_popup_p", 2, 0, 1),
    ("screen_mode", 2, 1, 4),
    ("autotrans_type", 2, 7, 2),
    ("hidden_p", 3, 4, 1),
    ("group_start_p", 5, 2, 3),
    ("group_start_open_p", 5, 5, 1),
    ("group_end_p", 4, 14, 3),
    ("doc_group_p", 6, 1, 1),
    ("dont_publish_p", 20, 1, 1),
    ("builder_disable_p", 20, 2, 1),
    ("builder_disable_one_p", 20, 3, 1),
]
FLAG_SHORTS = [("needs_input_n", 10), ("auto_animation_type", 16)]
ALL_FLAG_FIELDS = [f[0] for f in FLAG_BITS] + [f[0] for f in FLAG_SHORTS]
# Genotype's one-bit flags: (field, byte, bit)
GENOTYPE_BITS = [
    ("need_other_frames_p", 1240, 1),
    ("use_prev_dest_p", 1240, 2),
    ("mask_color_p", 1241, 6),
    ("transition_p", 1243, 2),
    ("use_reduce_p", 1244, 0),
]
# Both records' bit fields: (record, field, byte, first bit, width), with the record's size and its other fields.
BIT_FIELDS = [(renderlib.ParamFlags, *f) for f in FLAG_BITS] + [(renderlib.Genotype, *g, 1) for g in GENOTYPE_BITS]
SIZES = {renderlib.ParamFlags: 36, renderlib.Genotype: 1336}
SIBLINGS = {renderlib.ParamFlags: ALL_FLAG_FIELDS, renderlib.Genotype: [g[0] for g in GENOTYPE_BITS]}


def bits_record(size, bits):
    """`size` bytes with the given (byte, bit) pairs set."""
    record = bytearray(size)
    for byte, bit in bits:
        record[byte + bit // 8] |= 1 << (bit % 8)
    return bytes(record)


@pytest.mark.parametrize("record, name, byte, first, width", BIT_FIELDS, ids=[f[1] for f in BIT_FIELDS])
def test_a_bit_field_reads_exactly_its_bits(record, name, byte, first, width):
    proxy, size = record(), SIZES[record]
    poke(proxy, 0, bits_record(size, [(byte, first + i) for i in range(width)]))
    assert getattr(proxy, name) == (1 << width) - 1
    assert all(getattr(proxy, other) == 0 for other in SIBLINGS[record] if other != name)
    # Both neighbours of the field set, the field itself clear.
    poke(proxy, 0, bits_record(size, [(byte, first - 1), (byte, first + width)] if first else [(byte, first + width)]))
    assert getattr(proxy, name) == 0
    # The lowest bit alone reads as 1: the field is not shifted.
    poke(proxy, 0, bits_record(size, [(byte, first)]))
    assert getattr(proxy, name) == 1


@pytest.mark.parametrize("name, offset", FLAG_SHORTS)
def test_flag_shorts_are_signed_16_bit_words(name, offset):
    flags = renderlib.ParamFlags()
    poke(flags, offset, struct.pack("<h", -2))
    assert getattr(flags, name) == -2
    assert all(getattr(flags, other) == 0 for other in ALL_FLAG_FIELDS if other != name)


def test_a_new_flag_record_is_zero_and_setting_screen_mode_writes_only_its_four_bits():
    flags = renderlib.ParamFlags()
    assert peek(flags, 0, 36) == bytes(36)  # each field reading its own bits: test_a_bit_field_reads_exactly_its_bits
    poke(flags, 0, b"\xff" * 36)
    flags.screen_mode = 0
    assert peek(flags, 0, 36) == b"\xff\xff\xe1" + b"\xff" * 33
    poke(flags, 0, bytes(36))
    flags.screen_mode = 9
    assert peek(flags, 0, 36) == bytes([0, 0, 9 << 1]) + bytes(33)


class StringSlot:
    """Points a char * member at a ctypes buffer for the duration of a check,
    then puts the original pointer back so the engine frees what it owns."""

    def __init__(self, proxy, offset, raw):
        self.proxy, self.offset = proxy, offset
        self.buffer = ctypes.create_string_buffer(raw)

    def __enter__(self):
        self.saved = peek(self.proxy, self.offset, 8)
        poke(self.proxy, self.offset, struct.pack("<Q", ctypes.addressof(self.buffer)))

    def __exit__(self, *exc):
        poke(self.proxy, self.offset, self.saved)


def test_param_members_at_their_offsets():
    param = renderlib.Param("layout", _renderlib.ptype_float, 3)
    scalars = [
        ("ptype", 8, "<i", 7),
        ("use_old_default_p", 76, "<h", -3),
        ("old_default_version_limit", 78, "<h", 0x1234),
        ("param_group", 208, "<b", -5),
    ]
    for name, offset, fmt, value in scalars:
        saved = peek(param, offset, struct.calcsize(fmt))
        poke(param, offset, struct.pack(fmt, value))
        assert getattr(param, name) == value, name
        poke(param, offset, saved)
    # Two runs of floats: from byte 80 and from byte 192.
    floats = list(zip("min_bound max_bound step normalize_scale".split(), range(80, 96, 4)))
    floats += zip("slider_min slider_max big_slider_min big_slider_max".split(), range(192, 208, 4))
    for i, (_, offset) in enumerate(floats):
        poke(param, offset, struct.pack("<f", 0.5 + i))
    assert [getattr(param, name) for name, _ in floats] == [0.5 + i for i in range(len(floats))]
    poke(param, 40, bytes([200, 201]))
    assert (param.n_channels, param.n_channels_c1) == (200, 201)
    poke(param, 44, struct.pack("<4f", 1, 2, 3, 4) + struct.pack("<4f", 5, 6, 7, 8))
    assert list(param.default_value) == [1, 2, 3, 4] and list(param.old_default_value) == [5, 6, 7, 8]
    assert address(param.default_value) == address(param) + 44
    assert address(param.flags) == address(param) + 156
    for name, offset in [("canonical_name", 24), ("flags_string", 216)]:
        with StringSlot(param, offset, b"caf\xe9"):
            assert getattr(param, name) == "caf\udce9"
    poke(param, 158, bytes([6 << 1]))
    assert param.flags.screen_mode == 6


def test_param_name_assignment_writes_the_pointer_at_16():
    param = renderlib.Param("first", _renderlib.ptype_int)
    param.name = "second"
    pointer = struct.unpack("<Q", peek(param, 16, 8))[0]
    assert ctypes.string_at(pointer) == b"second"
    param.name = None
    assert peek(param, 16, 8) == bytes(8) and param.name is None


def test_genotype_members_at_their_offsets():
    genotype = renderlib.Genotype()
    assert peek(genotype, 0, 1336) == bytes(1336)
    poke(genotype, 0, b"N" * 32 + b"overflow")  # 32 bytes, no terminator
    assert genotype.name == "N" * 32
    ints = list(zip("disable_gpu force_gpu_enable force_gpu_disable gpu_disable_reason".split(), range(392, 408, 4)))
    ints += [("rgba_mode", 1224), ("transform_with_warp", 1232)]
    for i, (_, offset) in enumerate(ints):
        poke(genotype, offset, struct.pack("<i", -100 - i))
    assert [getattr(genotype, name) for name, _ in ints] == [-100 - i for i in range(len(ints))]
    poke(genotype, 1228, struct.pack("<b", -2))
    poke(genotype, 1236, struct.pack("<b", 3))
    poke(genotype, 1312, struct.pack("<hh", 4, -6))
    assert (genotype.rgba_ok_for_inputs, genotype.alpha_z_source_input) == (-2, 3)
    assert (genotype.old_default_effect, genotype.old_default_version_limit) == (4, -6)
    assert address(genotype.input_optional_p) == address(genotype) + 224
    assert address(genotype.input_default_to) == address(genotype) + 240
    assert int(genotype.input_default_value) == address(genotype) + 256
    genotype.disable_gpu = 7
    assert struct.unpack("<i", peek(genotype, 392, 4))[0] == 7
    with StringSlot(genotype, 1304, b"Menu name"):
        assert genotype.effect_popup_name == "Menu name"


def test_genotype_input_names_and_count():
    genotype = renderlib.Genotype()
    poke(genotype, 32, b"Front".ljust(12, b"\0") + b"Background12")  # the second fills its slot
    poke(genotype, 128, b"front".ljust(12, b"\0") + b"back".ljust(12, b"\0"))
    assert genotype._get_input_names() == ()
    poke(genotype, 1248, bytes([2]))
    assert genotype._get_input_names() == ("Front", "Background12")
    assert genotype._get_canonical_input_names() == ("front", "back")


def test_plugin_info_fields_at_their_offsets_and_read_only():
    info = renderlib.Plugin_Info()
    assert peek(info, 0, 120) == bytes(120) and info.plugin_name is None and info.this.own()
    poke(info, 68, bytes([1, 255]))
    assert (info.use_prev_dest_p, info.dynamic_genotype_p) == (1, 255)
    with StringSlot(info, 0, b"T_Example"), StringSlot(info, 32, b"Tests"):
        assert (info.plugin_name, info._category) == ("T_Example", "Tests")
    with pytest.raises(AttributeError):
        info.plugin_name = "T_Blur"
