"""Fuzz target: the argument conversion of render_tarsel_effect_to_native_image.

Each input builds the call's twenty arguments (fewer or more, sometimes):
effect instances, descriptor names, destination buffers of every kind the
buffer protocol offers, lists of T_RasterInfo, None and buffers, numbers at
and past their ranges, and objects of the wrong type, including objects that
only look like a T_RasterInfo. Every call must end in a return value or in
TypeError, ValueError, OverflowError or BufferError, never in a crash.

Two modes:
  conversion (default)  the engine probe makes the render return at once, so
                        only the binding runs. A model of the typemaps says
                        which argument is refused first and with which
                        exception; a call that converts returns what the probe
                        answers (instance, a raster list and n_rasters >= 1).
  --render              real renders of tiny frames: every argument has its
                        type, buffers are as large as their descriptors say
                        (the caller's side of the contract), and descriptors
                        are otherwise arbitrary. Inputs must be left as they
                        were, and a field render must leave the other field's
                        lines untouched.

Run under atheris by tools/fuzz.sh; `--replay` runs it without atheris (see
fuzz_common)."""
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

NAME = "render_tarsel_effect_to_native_image"
RENDER = "--render" in sys.argv  # left in place: libFuzzer ignores it, a replay skips it
ALLOWED = (TypeError, ValueError, OverflowError, BufferError)
FLT_MAX = 3.4028234663852886e38
PIXEL_TYPES = [1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 17, 18, 19, 20, 21, 22, 23, 24, 25, 26, 28]
UNSUPPORTED_TYPES = [0, 16, 27, 29, -1, 1000]

# Kinds of the twenty positions, in order.
KINDS = ["instance", "text", "dest", "int", "int", "int", "int", "rasters", "images", "float", "int", "float",
         "int", "int", "int", "int", "bool", "text", "text", "text"]

probe = None
instances = []  # (instance, descriptor names)
dead_instance = None


# ---------------------------------------------------------------- values

class IntSubclass(int):
    pass


class FloatSubclass(float):
    pass


class TextSubclass(str):
    pass


class ListSubclass(list):
    pass


class NamedRaster(renderlib.T_RasterInfo):
    """A real record under another class name: refused by name."""


def impostor(this=None, slots=False, raising=False):
    """An object of a class named T_RasterInfo that is not the proxy class."""
    if slots:
        def get_this(self):
            if raising:
                raise RuntimeError("no record here")
            return this
        cls = type("T_RasterInfo", (), {"__slots__": (), "this": property(get_this)})
        return cls()
    obj = type("T_RasterInfo", (), {})()
    if this is not None:
        obj.this = this
    return obj


def list_changer(items, how):
    """A T_RasterInfo look-alike whose `this` changes the list being converted
    (clears it, or replaces the records in it): the call goes on with the
    items the list held when it began."""
    keep = renderlib.T_RasterInfo()

    def get_this(self):
        if how == 0:
            items.clear()
        else:
            items[:] = [renderlib.T_RasterInfo() if item is not None else None for item in items]
        return keep.this
    return type("T_RasterInfo", (), {"__slots__": (), "this": property(get_this)})()


def released_view():
    view = memoryview(bytearray(8))
    view.release()
    return view


def readonly_array(size):
    a = numpy.zeros(size, numpy.uint8)
    a.flags.writeable = False
    return a


def writable_buffer(r, size):
    """A writable, contiguous buffer of exactly `size` bytes, of a kind the data chooses."""
    kind = r.int_in(0, 5)
    if kind == 0:
        return bytearray(size)
    if kind == 1:
        return (ctypes.c_char * size)()
    if kind == 2:
        return numpy.zeros(size, numpy.uint8)
    if kind == 3:
        return array.array("B", bytes(size))
    if kind == 4:
        return memoryview(bytearray(size))
    if size % 4 == 0:
        return numpy.zeros((size // 4,), numpy.float32)
    return bytearray(size)


def dest_value(r, wrong):
    """A destination for the conversion mode: (value, None) when it converts,
    else (value, exception class)."""
    choice = r.int_in(5, 9) if wrong else r.int_in(0, 5)
    if choice < 5:
        return writable_buffer(r, r.int_in(0, 64)), None
    if choice == 5:  # read-only is taken
        return r.pick([lambda: bytes(r.int_in(0, 32)), lambda: memoryview(b"pixels"), lambda: readonly_array(8)])(), None
    # A destination whose buffer cannot be had is TypeError, whatever the object raised.
    if choice == 6:
        return numpy.zeros((4, 4), numpy.float32)[:, ::2], TypeError
    if choice == 7:
        return memoryview(bytearray(16))[::2], TypeError
    if choice == 8:
        return released_view(), TypeError
    return r.pick([lambda: "pixels", lambda: 16, lambda: None, lambda: [bytearray(4)], renderlib.T_RasterInfo])(), TypeError


def scalar_value(r, kind):
    """A value for an int, float, bool or text position: (value, None when
    it converts, else the exception class)."""
    if kind == "int":
        value = r.pick([0, 1, -1, 2 ** 31 - 1, -2 ** 31, 2 ** 31, -2 ** 31 - 1, 2 ** 63, 2 ** 64 + 5, True,
                        IntSubclass(7), r.int32(), 1.0, "1", None, b"\x01"])
        if isinstance(value, int):
            return value, None if -2 ** 31 <= value < 2 ** 31 else OverflowError
        return value, TypeError
    if kind == "float":
        value = r.pick([0.0, 1.0, -1.0, math.nan, math.inf, -math.inf, 3.5e38, -1e300, FLT_MAX, 1, 2 ** 127,
                        2 ** 128, 10 ** 400, FloatSubclass(0.5), r.float32(), True, "1.0", None, 1j])
        if isinstance(value, (int, float)):
            try:
                as_double = float(value)
            except OverflowError:
                return value, TypeError  # too large even for a double
            overflow = math.isfinite(as_double) and abs(as_double) > FLT_MAX
            return value, OverflowError if overflow else None
        return value, TypeError
    if kind == "bool":
        value = r.pick([True, False, 1, 0, None, "true", 1.0])
        return value, None if isinstance(value, bool) else TypeError
    # text
    value = r.pick(["", "linear", "srgb", None, "Blur", "\0", "x" * 300, "\u00e9t\u00e9", "\udc80",
                    TextSubclass("srgb"), b"linear", 3, renderlib.T_RasterInfo])
    if value is renderlib.T_RasterInfo:
        value = value()
    if value is None:
        return value, None
    if isinstance(value, str):
        try:
            value.encode("utf-8")
        except UnicodeEncodeError:
            return value, TypeError
        return value, None
    return value, TypeError


# Items of the rasters list other than a T_RasterInfo or None: (maker, refused).
WRONG_RASTER_ITEMS = [
    (renderlib.T_RenderInfo, True), (lambda: 7, True), (lambda: "raster", True), (lambda: bytearray(104), True),
    (NamedRaster, True), (lambda: renderlib.T_RasterInfo().this, True), (impostor, True),
    (lambda: impostor(this=5), True), (lambda: impostor(slots=True, raising=True), True),
    (lambda: impostor(slots=True, this=renderlib.T_RenderInfo().this), True),
    (lambda: impostor(this=renderlib.T_RenderInfo()), True),
    (lambda: impostor(slots=True, this=renderlib.T_RasterInfo().this), False),
    (lambda: impostor(this=renderlib.T_RasterInfo()), False),
]

# Items of the images list that are refused.
WRONG_IMAGE_ITEMS = [
    lambda: bytes(8), lambda: readonly_array(4), lambda: memoryview(b"abc"), released_view,
    lambda: numpy.zeros((4, 4), numpy.uint8)[:, ::2], lambda: "pixels", lambda: 8, renderlib.T_RasterInfo,
]


def raster_items(r, count, wrong):
    """A list for the rasters position: (items, None or exception)."""
    items, refused = [], []
    for _ in range(count):
        choice = r.int_in(0, 15) if wrong else r.int_in(0, 9)
        if choice < 8:
            items.append(renderlib.T_RasterInfo())
        elif choice < 10:
            items.append(None)
        else:
            make, refusal = r.pick(WRONG_RASTER_ITEMS)
            items.append(make())
            refused.append(refusal)
            continue
        refused.append(False)
    if wrong and count and r.one_in(3):
        k = r.int_in(0, count - 1)
        items[k], refused[k] = list_changer(items, r.int_in(0, 1)), False
    if wrong and r.one_in(6):
        looped = impostor()
        looped.this = looped  # its `this` leads back to itself
        items.append(looped)
        refused.append(True)
    return items, TypeError if any(refused) else None


def image_items(r, count, wrong):
    items, error = [], None
    for _ in range(count):
        choice = r.int_in(0, 11) if wrong else r.int_in(0, 7)
        if choice < 6:
            items.append(writable_buffer(r, r.int_in(0, 64)))
        elif choice < 8:
            items.append(None)
        else:
            item = r.pick(WRONG_IMAGE_ITEMS)()
            items.append(item)
            error = error or TypeError
    return items, error


def wrap_list(r, items, wrong):
    choice = r.int_in(0, 3) if wrong else r.int_in(1, 15)
    if choice == 0:
        return tuple(items), True
    if choice == 1:
        return ListSubclass(items), False
    if choice == 2:
        return (r.pick([None, bytearray(8), 5, "list"]), True)
    return items, False


# ---------------------------------------------------------------- conversion mode

def past_lists(n_rasters, raster_count, image_count):
    """Whether n_rasters asks for more entries than a non-empty list holds."""
    return isinstance(n_rasters, int) and n_rasters > 0 and (0 < raster_count < n_rasters or
                                                             0 < image_count < n_rasters)


def conversion_case(r):
    args, errors = [], []
    chosen_instance = None
    wrong_positions = {r.int_in(1, 20) for _ in range(r.pick([0, 0, 0, 1, 1, 2, 4]))}
    for position, kind in enumerate(KINDS, start=1):
        wrong = position in wrong_positions
        if kind == "instance":
            if wrong:
                value, error = r.pick([renderlib.T_RasterInfo, lambda: instances[0][0].effect_genotype, lambda: 3,
                                       lambda: "T_Blur", lambda: renderlib.T_RasterInfo().this])(), TypeError
            else:
                value, error = r.pick([None, dead_instance] + [i for i, _ in instances] * 3), None
                chosen_instance = value
        elif kind == "dest":
            value, error = dest_value(r, wrong)
        elif kind in ("rasters", "images"):
            count = r.int_in(0, 4)
            items, error = raster_items(r, count, wrong) if kind == "rasters" else image_items(r, count, wrong)
            value, refused = wrap_list(r, items, wrong)
            if refused:
                error = TypeError
            if kind == "rasters":
                raster_count = len(value) if isinstance(value, list) else 0
            else:
                image_count = len(value) if isinstance(value, list) else 0
        elif kind == "text" and position == 2 and not wrong:
            value, error = r.pick(["", None, "Blur", "Glow", "no such descriptor"]), None
        elif wrong:
            value, error = scalar_value(r, kind)
        elif kind == "bool":
            value, error = r.flag(), None
        elif kind == "int":
            value, error = (r.int_in(-2, 4) if r.flag() else r.int32()), None
        elif kind == "float":
            value, error = r.pick([1.0, 0.0, 0.5, -1.0, math.nan, r.float32()]), None
            if math.isfinite(value) and abs(value) > FLT_MAX:
                error = OverflowError
        else:
            value, error = r.pick(["linear", "srgb", "", None]), None
        args.append(value)
        errors.append(error)
    n_rasters = args[10]
    count_change = r.one_in(40)
    if count_change:
        args = args[:r.int_in(0, 19)] if r.flag() else args + [None]
    try:
        result = getattr(_renderlib, NAME)(*args)
    except ALLOWED as raised:
        result, error = None, raised
    else:
        error = None
    if count_change:
        assert isinstance(error, TypeError) and "expected 20 arguments, got %d" % len(args) in str(error), error
        return
    first = next(((p, e) for p, e in enumerate(errors, start=1) if e is not None), None)
    # Checked once every argument has converted, in argument order.
    if first is None and chosen_instance is dead_instance:
        first = (1, ValueError)
    if first is None and past_lists(n_rasters, raster_count, image_count):
        first = (11, ValueError)
    if first is None:
        assert error is None, error
        expected = chosen_instance is not None and raster_count > 0 and n_rasters >= 1
        assert result is expected, (result, expected)
        return
    position, expected_error = first
    assert error is not None, ("argument %d converted" % position, args[position - 1])
    assert re.search(r"\b(argument|arg) %d\b" % position, str(error)), (position, error)
    if expected_error != "unknown":
        assert type(error) is expected_error, (position, type(error), error)


# ---------------------------------------------------------------- render mode

def mostly(r, usual, rare):
    """One of `usual`, or now and then one of `rare` (settings the engine refuses)."""
    return r.pick(rare) if r.one_in(16) else r.pick(usual)


def make_raster(r):
    """(T_RasterInfo, its size in bytes): the engine's layout for a pixel type
    and a tiny size, the other words from the data."""
    info = renderlib.T_RasterInfo()
    if r.one_in(2):
        raw = bytearray(r.bytes(104).ljust(104, b"\0"))
        for offset in (8, 12):  # origins: mostly near the frame
            if not r.one_in(8):
                raw[offset:offset + 4] = struct.pack("<i", r.int_in(-6, 6))
        if not r.one_in(8):
            raw[48:52] = struct.pack("<i", r.pick([0, 1]))  # res_factor
        _renderlib.make_tarsel_raster_info_from_base64(info, base64.b64encode(bytes(raw)).decode())
    info.pixel_type = r.pick(PIXEL_TYPES) if not r.one_in(12) else r.pick(UNSUPPORTED_TYPES)
    info.extra_line_stride_elts = r.pick([0, 0, 0, 1, 3])
    width, height = r.int_in(0, 6), r.int_in(0, 5)
    size = _renderlib.make_tarsel_raster_info(info, width, height)
    if size == 0:
        info.ds_xsize, info.ds_ysize = width, height  # an unsupported type: the engine refuses it
    elif r.one_in(10):
        info.sizeof_pixel = r.pick([0, 1, 3, 64])  # 0 means the layout's size; others are refused
    return info, size


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
        if choice == 0:
            rasters.append(None)
            images.append(None)
        elif choice == 1:
            rasters.append(dest_info)  # the destination read as an input too
            images.append(dest)
        else:
            info, size = make_raster(r)
            rasters.append(info if choice != 2 else None)
            images.append(writable_buffer(r, size) if choice != 3 else None)
            if images[-1] is not None:
                inputs.append(images[-1])
    for buffer in inputs:
        view = memoryview(buffer).cast("B")
        pattern = r.bytes(r.int_in(1, 64)) or b"\x80"
        view[:] = (pattern * (len(view) // len(pattern) + 1))[:len(view)]
    n_rasters = len(rasters) if not r.one_in(6) else r.int_in(0, len(rasters))
    if not r.one_in(8):
        images_arg = images
    else:
        images_arg = []
    count_past_lists = r.one_in(10)
    if count_past_lists:
        n_rasters = len(rasters) + r.int_in(1, 4)  # more entries than the lists hold: refused
    field = mostly(r, [0, 0, 1, 2], [3, -1])
    flags = mostly(r, [0, 0, 1, 2, 3], [r.int32()])
    frame = r.pick([0, 1, 5, -3, r.int32() // 2, -2 ** 31, 2 ** 31 - 1])  # and runs of frames past the ends
    before_dest = bytes(memoryview(dest).cast("B"))
    before_inputs = [bytes(memoryview(b).cast("B")) for b in inputs]
    spaces = [mostly(r, ["linear", "srgb", "", None], [bad]) for bad in ("cmyk", "rgb", "\u00e9")]
    args = [instance, descriptor, dest, frame, field, mostly(r, [1, 1, 2, 4, 0], [-1, 3]), r.int_in(-1, 3),
            rasters, images_arg, mostly(r, [1.0, 0.0, 0.5, 2.0, -1.0], [math.nan, math.inf]), n_rasters,
            mostly(r, [1.0, 0.0, 2.0, 0.5], [-1.0, math.nan, math.inf]), r.int_in(0, 2), r.int32(), flags,
            mostly(r, [25, 0, 1, 30, 1000], [-5]), r.flag()] + spaces
    try:
        result = getattr(_renderlib, NAME)(*args)
    except ALLOWED as error:
        if instance is dead_instance and type(error) is ValueError and "argument 1 " in str(error):
            return  # a freed instance is refused
        if count_past_lists and type(error) is ValueError and "argument 11 " in str(error):
            return
        raise AssertionError("a call whose arguments all have their types was refused: %r" % error)
    assert not count_past_lists, "n_rasters past the lists was taken"
    assert type(result) is bool, result
    for buffer, before in zip(inputs, before_inputs):
        if buffer is not dest and not any(image is dest for image in images):
            assert bytes(memoryview(buffer).cast("B")) == before, "an input buffer was written"
    if result and field in (1, 2) and not flags & 1 and dest_info.ds_ysize > 0 and dest_size > 0 \
            and dest_info.pixel_type in PIXEL_TYPES and not any(image is dest for image in images[1:]):
        height = dest_info.ds_ysize
        line = dest_size // height
        after = bytes(memoryview(dest).cast("B"))
        for y in range(height):
            if (dest_info.y_origin + y) & 1 != field - 1:
                stored = height - 1 - y if dest_info.flip_y_p else y
                assert after[stored * line:(stored + 1) * line] == before_dest[stored * line:(stored + 1) * line], \
                    "line %d of the other field was written" % y


def TestOneInput(data):
    r = ByteReader(data)
    if RENDER:
        render_case(r)
    else:
        conversion_case(r)


def setup():
    global probe, dead_instance
    probe = EngineProbe()
    probe.keep_call_log(False)
    probe.abort_next_call(False)
    probe.render_returns_at_once(not RENDER)
    _renderlib.set_error_handler(lambda level, message: None)
    for name, builder in [(info.plugin_name, builder) for builder in (False, True)
                          for info in effects.catalogue(builder)]:
        instance = _renderlib.init_tarsel_effect(name, builder)
        instances.append((instance, [g.name for g in instance._get_genotypes()]))
    dead_instance = _renderlib.init_tarsel_effect("T_Blur", False)
    _renderlib.free_tarsel_effect(dead_instance)  # a proxy of an instance that no longer exists


def main():
    setup()
    fuzz_common.main(TestOneInput, sys.modules[__name__], max_len=2048)


if __name__ == "__main__":
    main()
