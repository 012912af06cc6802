"""Fuzz target: the argument conversion of render_tarsel_effect_to_native_image.
Each input builds the call's twenty arguments, right and wrong, and the call
must return or raise TypeError, ValueError, OverflowError or BufferError: as
a model of the typemaps says with the render returning at once (the default),
or rendering tiny frames for real (--render). Run under atheris by
tools/fuzz.sh, without it by --replay."""

import array
import base64
import ctypes
import math
import re
import struct
import sys

import numpy

import fuzz_common
from fuzz_common import ByteReader

import _renderlib
import renderlib
from engine_probe import EngineProbe
from renderlib import effects

render = _renderlib.render_tarsel_effect_to_native_image
RENDER = "--render" in sys.argv  # left in place: libFuzzer ignores it, a replay skips it
ALLOWED = (TypeError, ValueError, OverflowError, BufferError)
FLT_MAX = 3.4028234663852886e38
PIXEL_TYPES = [1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 17, 18, 19, 20, 21, 22, 23, 24, 25, 26, 28]
# Kinds of the twenty positions, in order.
KINDS = "instance text dest int int int int rasters images float int float int int int int bool text text text".split()
instances = []  # (instance, descriptor names)
dead_instance = None


IntSubclass, FloatSubclass, TextSubclass = (type(t.__name__ + "Subclass", (t,), {}) for t in (int, float, str))
ListSubclass = type("ListSubclass", (list,), {})


NamedRaster = type("NamedRaster", (renderlib.T_RasterInfo,), {})  # a real record under another class name


def look_alike(this=None, slots=False, raising=False, on_this=None):
    """An object of a class named T_RasterInfo, not the proxy class, whose `this`
    is an attribute or a property (that may raise, or run `on_this` first)."""
    if not slots:
        obj = type("T_RasterInfo", (), {})()
        if this is not None:
            obj.this = this
        return obj

    def get_this(self):
        if raising:
            raise RuntimeError("no record here")
        return (on_this and on_this()) or this

    return type("T_RasterInfo", (), {"__slots__": (), "this": property(get_this)})()


def bare_pointer():  # the pointer object of a record
    return renderlib.T_RasterInfo().this


def released_view():
    view = memoryview(bytearray(8))
    view.release()
    return view


def readonly_array(size):
    return numpy.frombuffer(bytes(size), numpy.uint8)


BUFFER_KINDS = [
    bytearray,
    lambda n: (ctypes.c_char * n)(),
    lambda n: numpy.zeros(n, numpy.uint8),
    lambda n: array.array("B", bytes(n)),
    lambda n: memoryview(bytearray(n)),
    lambda n: numpy.zeros(n // 4, numpy.float32) if n % 4 == 0 else bytearray(n),
]


def made(item):
    """The tables below hold constants, and makers of the objects made anew for each call."""
    return item() if callable(item) else item


READ_ONLY = [lambda r: bytes(r.int_in(0, 32)), lambda r: memoryview(b"pixels"), lambda r: readonly_array(8)]
# Destinations whose buffer cannot be had (TypeError, whatever the exporter
# raised), and objects that have none.
UNVIEWABLE = [lambda: numpy.zeros((4, 4), numpy.float32)[:, ::2], lambda: memoryview(bytearray(16))[::2], released_view]
NOT_BUFFERS = ["pixels", 16, None, lambda: [bytearray(4)], renderlib.T_RasterInfo]
# Items of the rasters list other than a record or None, (item, refused):
# objects that are not records, then look-alikes of one, refused unless their
# `this` is a record's.
NOT_RECORDS = [renderlib.T_RenderInfo, 7, "raster", lambda: bytearray(104), NamedRaster, bare_pointer]
WRONG_RASTERS = [(item, True) for item in NOT_RECORDS] + [
    (look_alike, True),
    (lambda: look_alike(this=5), True),
    (lambda: look_alike(slots=True, raising=True), True),
    (lambda: look_alike(slots=True, this=renderlib.T_RenderInfo().this), True),
    (lambda: look_alike(this=renderlib.T_RenderInfo()), True),
    (lambda: look_alike(slots=True, this=renderlib.T_RasterInfo().this), False),
    (lambda: look_alike(this=renderlib.T_RasterInfo()), False),
]
WRONG_INSTANCES = [renderlib.T_RasterInfo, lambda: instances[0][0].effect_genotype, 3, "T_Blur", bare_pointer]
# Items of the images list that are refused: read-only, without a view, not a buffer.
WRONG_IMAGES = [lambda: bytes(8), lambda: readonly_array(4), lambda: memoryview(b"abc")]
WRONG_IMAGES += [released_view, lambda: numpy.zeros((4, 4), numpy.uint8)[:, ::2], "pixels", 8, renderlib.T_RasterInfo]


def writable_buffer(r, size):  # writable, contiguous, exactly `size` bytes
    return BUFFER_KINDS[r.int_in(0, 5)](size)


# Values for the scalar positions: in range, at and past the limits of an int
# or a float, and of other types (more of these below, made for each call).
INTS = [0, 1, -1, 2**31 - 1, -(2**31), 2**31, -(2**31) - 1, 2**63, 2**64 + 5, True]
FLOATS = [0.0, 1.0, -1.0, math.nan, math.inf, -math.inf, 3.5e38, -1e300, FLT_MAX, 1, 2**127, 2**128, 10**400]
TEXTS = ["", "linear", "srgb", None, "Blur", "\0", "x" * 300, "\u00e9t\u00e9", "\udc80"]


def wrong_scalar(r, kind):
    """A value for an int, float, bool or text position, right or wrong:
    (value, None when it converts, else the exception class)."""
    if kind == "int":
        value = r.pick(INTS + [IntSubclass(7), r.int32(), 1.0, "1", None, b"\x01"])
        in_range = isinstance(value, int) and -(2**31) <= value < 2**31
        return value, None if in_range else OverflowError if isinstance(value, int) else TypeError
    if kind == "float":
        value = r.pick(FLOATS + [FloatSubclass(0.5), r.float32(), True, "1.0", None, 1j])
        try:
            as_double = float(value) if isinstance(value, (int, float)) else None
        except OverflowError:
            as_double = None  # too large even for a double
        if as_double is None:
            return value, TypeError
        return value, OverflowError if math.isfinite(as_double) and abs(as_double) > FLT_MAX else None
    if kind == "bool":
        value = r.pick([True, False, 1, 0, None, "true", 1.0])
        return value, None if isinstance(value, bool) else TypeError
    value = r.pick(TEXTS + [TextSubclass("srgb"), b"linear", 3, renderlib.T_RasterInfo])
    value = value() if value is renderlib.T_RasterInfo else value
    return value, None if value is None or (isinstance(value, str) and value != "\udc80") else TypeError


def list_argument(r, kind, wrong):
    """A list for the rasters or images position: (value, the length of the
    list the call sees, None or the exception class)."""
    items, refused = [], []
    good, last = (8, 15) if kind == "rasters" else (6, 11)  # choices: good items, two Nones, wrong items
    for _ in range(r.int_in(0, 4)):
        choice = r.int_in(0, last if wrong else good + 1)
        item, refusal = None, False
        if choice >= good + 2:
            item, refusal = r.pick(WRONG_RASTERS) if kind == "rasters" else (r.pick(WRONG_IMAGES), True)
        elif choice < good:
            item = renderlib.T_RasterInfo if kind == "rasters" else writable_buffer(r, r.int_in(0, 64))
        items.append(made(item))
        refused.append(refusal)
    if kind == "rasters" and wrong:
        if items and r.one_in(3):
            # An item whose `this` clears the list or replaces its records: the
            # call goes on with the items the list held when it began.
            k, keep, replace = r.int_in(0, len(items) - 1), renderlib.T_RasterInfo(), r.int_in(0, 1)

            def rewrite():
                items[:] = [renderlib.T_RasterInfo() if i is not None else None for i in items] if replace else []

            items[k], refused[k] = look_alike(slots=True, this=keep.this, on_this=rewrite), False
        if r.one_in(6):
            looped = look_alike()
            looped.this = looped  # its `this` leads back to itself
            items.append(looped)
            refused.append(True)
    choice = r.int_in(0, 3) if wrong else r.int_in(1, 15)
    if choice == 0:
        return tuple(items), 0, TypeError
    if choice == 2:
        return r.pick([None, bytearray(8), 5, "list"]), 0, TypeError
    return (ListSubclass(items) if choice == 1 else items), len(items), TypeError if any(refused) else None


# Conversion: effect instances, descriptor names, destinations of every kind
# the buffer protocol offers, lists of records, None and buffers, numbers at
# and past their ranges, objects of the wrong type and look-alikes of a
# T_RasterInfo. The engine probe makes the render return at once; the first
# argument that does not convert is refused, and with the exception its kind
# gives, and a call that converts returns what the probe answers.
def conversion_case(r):
    args, errors, lengths, chosen_instance = [], [], {}, None
    wrong_positions = {r.int_in(1, 20) for _ in range(r.pick([0, 0, 0, 1, 1, 2, 4]))}
    for position, kind in enumerate(KINDS, start=1):
        wrong = position in wrong_positions
        error = None
        if kind == "instance":
            if wrong:
                value, error = made(r.pick(WRONG_INSTANCES)), TypeError
            else:
                value = chosen_instance = r.pick([None, dead_instance] + [i for i, _ in instances] * 3)
        elif kind == "dest":
            choice = r.int_in(5, 9) if wrong else r.int_in(0, 5)
            if choice < 5:
                value = writable_buffer(r, r.int_in(0, 64))
            elif choice == 5:  # read-only is taken
                value = r.pick(READ_ONLY)(r)
            else:
                value, error = made(r.pick(NOT_BUFFERS) if choice == 9 else UNVIEWABLE[choice - 6]), TypeError
        elif kind in ("rasters", "images"):
            value, lengths[kind], error = list_argument(r, kind, wrong)
        elif kind == "text" and position == 2 and not wrong:
            value = r.pick(["", None, "Blur", "Glow", "no such descriptor"])
        elif wrong:
            value, error = wrong_scalar(r, kind)
        elif kind == "bool":
            value = r.flag()
        elif kind == "int":
            value = r.int_in(-2, 4) if r.flag() else r.int32()
        elif kind == "float":
            value = r.pick([1.0, 0.0, 0.5, -1.0, math.nan, r.float32()])
            error = OverflowError if math.isfinite(value) and abs(value) > FLT_MAX else None
        else:
            value = r.pick(["linear", "srgb", "", None])
        args.append(value)
        errors.append(error)
    n_rasters = args[10]
    try:
        result, error = render(*args), None
    except ALLOWED as raised:
        result, error = None, raised
    # Checked once every argument has converted, in argument order.
    past_lists = isinstance(n_rasters, int) and n_rasters > 0 and any(0 < n < n_rasters for n in lengths.values())
    errors += [ValueError if chosen_instance is dead_instance else None, ValueError if past_lists else None]
    first = next(((p, e) for p, e in zip(list(range(1, 21)) + [1, 11], errors) if e is not None), None)
    if first is None:
        assert error is None, error
        assert result is (chosen_instance is not None and lengths["rasters"] > 0 and n_rasters >= 1), result
        return
    assert error is not None, ("argument %d converted" % first[0], args[first[0] - 1])
    assert re.search(r"\b(argument|arg) %d\b" % first[0], str(error)), (first, error)
    assert type(error) is first[1], (first, type(error), error)


def mostly(r, usual, rare):  # now and then one of `rare`: settings the engine refuses
    return r.pick(rare) if r.one_in(16) else r.pick(usual)


def make_raster(r):
    """(T_RasterInfo, its size in bytes): the engine's layout for a pixel type
    and a tiny size, the other words from the data."""
    info = renderlib.T_RasterInfo()
    if r.one_in(2):
        raw = bytearray(r.bytes(104).ljust(104, b"\0"))
        for offset in (8, 12):  # origins: mostly near the frame
            if not r.one_in(8):
                raw[offset : offset + 4] = struct.pack("<i", r.int_in(-6, 6))
        if not r.one_in(8):
            raw[48:52] = struct.pack("<i", r.pick([0, 1]))  # res_factor
        _renderlib.make_tarsel_raster_info_from_base64(info, base64.b64encode(bytes(raw)).decode())
    info.pixel_type = r.pick(PIXEL_TYPES) if not r.one_in(12) else r.pick([0, 16, 27, 29, -1, 1000])
    info.extra_line_stride_elts = r.pick([0, 0, 0, 1, 3])
    width, height = r.int_in(0, 6), r.int_in(0, 5)
    size = _renderlib.make_tarsel_raster_info(info, width, height)
    if size == 0:
        info.ds_xsize, info.ds_ysize = width, height  # an unsupported type: the engine refuses it
    elif r.one_in(10):
        info.sizeof_pixel = r.pick([0, 1, 3, 64])  # 0 means the layout's size; others are refused
    return info, size


# Render: every argument of its type, buffers as large as their descriptors
# say (the caller's side of the contract), descriptors otherwise arbitrary.
# Inputs stay as they were, and a field render leaves the other field alone.
def render_case(r):
    instance, names = r.pick(instances)
    if r.one_in(30):
        instance = r.pick([None, dead_instance])
    descriptor = mostly(r, ["", None] + names, ["no such descriptor"])
    dest_info, dest_size = make_raster(r)
    dest = writable_buffer(r, dest_size)
    rasters, images, inputs = [dest_info], [None], []
    if r.one_in(3):
        images[0] = writable_buffer(r, dest_size)  # the previous output, in the destination's layout
        inputs.append(images[0])
    for _ in range(r.int_in(0, 3)):
        choice = r.int_in(0, 7)
        if choice < 2:  # nothing, or the destination read as an input too
            rasters.append(dest_info if choice else None)
            images.append(dest if choice else None)
            continue
        info, size = make_raster(r)
        rasters.append(info if choice != 2 else None)
        images.append(writable_buffer(r, size) if choice != 3 else None)
        if images[-1] is not None:
            inputs.append(images[-1])
    for buffer in inputs:
        view = memoryview(buffer).cast("B")
        pattern = r.bytes(r.int_in(1, 64)) or b"\x80"
        view[:] = (pattern * (len(view) // len(pattern) + 1))[: len(view)]
    n_rasters = len(rasters) if not r.one_in(6) else r.int_in(0, len(rasters))
    images_arg = images if not r.one_in(8) else []
    past_lists = r.one_in(10)
    if past_lists:
        n_rasters = len(rasters) + r.int_in(1, 4)  # more entries than the lists hold: refused
    field = mostly(r, [0, 0, 1, 2], [3, -1])
    flags = mostly(r, [0, 0, 1, 2, 3], [r.int32()])
    frame = r.pick([0, 1, 5, -3, r.int32() // 2, -(2**31), 2**31 - 1])  # and runs of frames past the ends
    before_dest = bytes(memoryview(dest).cast("B"))
    before_inputs = [bytes(memoryview(b).cast("B")) for b in inputs]
    spaces = [mostly(r, ["linear", "srgb", "", None], [bad]) for bad in ("cmyk", "rgb", "\u00e9")]
    downsample, quality = mostly(r, [1, 1, 2, 4, 0], [-1, 3]), r.int_in(-1, 3)
    mix = mostly(r, [1.0, 0.0, 0.5, 2.0, -1.0], [math.nan, math.inf])
    aspect = mostly(r, [1.0, 0.0, 2.0, 0.5], [-1.0, math.nan, math.inf])
    threads = r.int_in(0, 2)
    seed = r.int32()
    rate = mostly(r, [25, 0, 1, 30, 1000], [-5])
    args = [instance, descriptor, dest, frame, field, downsample, quality, rasters, images_arg, mix, n_rasters]
    args += [aspect, threads, seed, flags, rate, r.flag()] + spaces
    try:
        result = render(*args)
    except ALLOWED as error:
        # Only a freed instance and n_rasters past the lists are refused.
        assert type(error) is ValueError and (
            (instance is dead_instance and "argument 1 " in str(error)) or (past_lists and "argument 11 " in str(error))
        ), error
        return
    assert not past_lists and type(result) is bool, result
    reads_dest = any(image is dest for image in images)
    for buffer, before in zip(inputs, before_inputs):
        assert reads_dest or bytes(memoryview(buffer).cast("B")) == before, "an input buffer was written"
    # A field render of a supported type and size (a layout's size is 0 for
    # an unsupported type or an empty frame) leaves the other field alone.
    if result and field in (1, 2) and not flags & 1 and dest_size > 0 and not reads_dest:
        height, after = dest_info.ds_ysize, bytes(memoryview(dest).cast("B"))
        line = dest_size // height
        for y in range(height):
            stored = (height - 1 - y if dest_info.flip_y_p else y) * line
            kept = after[stored : stored + line] == before_dest[stored : stored + line]
            assert kept or (dest_info.y_origin + y) & 1 == field - 1, "line %d of the other field was written" % y


def TestOneInput(data):
    (render_case if RENDER else conversion_case)(ByteReader(data))


if __name__ == "__main__":
    probe = EngineProbe()
    probe.keep_call_log(False)
    probe.abort_next_call(False)
    probe.render_returns_at_once(not RENDER)
    _renderlib.set_error_handler(lambda level, message: None)
    for builder in (False, True):
        for info in effects.catalogue(builder):
            instance = _renderlib.init_tarsel_effect(info.plugin_name, builder)
            instances.append((instance, [g.name for g in instance._get_genotypes()]))
    dead_instance = _renderlib.init_tarsel_effect("T_Blur", False)
    _renderlib.free_tarsel_effect(dead_instance)  # a proxy of an instance that no longer exists
    fuzz_common.main(TestOneInput, max_len=2048)
