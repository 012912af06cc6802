"""Every wrapper of the module, on its success path and on its failure paths,
called over and over: the process's memory stays flat (resident size, the C
heap in use and the interpreter's own blocks), the objects handed to the calls
keep their reference counts, and the engine's and the monitor library's live
objects come back to their counts. A function added to the module without a
case here fails test_every_wrapper_is_exercised."""

import ast
import base64
import ctypes
import functools
import gc
import inspect
import operator
import os
import pathlib
import re
import sys

import numpy
import pytest

import _renderlib
import renderlib
from engine_probe import EngineProbe, loaded_library_path
from process_memory import UNDER_ADDRESS_SANITIZER, resident_kib
from renderlib import effects, png

# A failure that every wrapper reaches alike (too many or too few arguments,
# a first argument of a type none takes, None for any argument) is left to
# the sweep of argument_errors; the other families make the calls that are
# their own.


# valgrind puts its own libraries in front of the interpreter's; it checks
# memory itself, far more slowly, so a few rounds do there.
UNDER_VALGRIND = "vgpreload" in os.environ.get("LD_PRELOAD", "")
ROUNDS = 3 if UNDER_VALGRIND else 200  # each of the two measured stretches
WARM_UP = 1 if UNDER_VALGRIND else 50  # rounds that fill the caches and pools first
MEASURE_MEMORY = not (UNDER_ADDRESS_SANITIZER or UNDER_VALGRIND)

# Functions of the module no case calls: SWIG's registration of each proxy
# class (<Class>_swigregister), run once as renderlib is imported; calling it
# again would re-register the class.
NOT_EXERCISED = [name for name in dir(_renderlib) if name.endswith("_swigregister")]


STRANGER = type("Stranger", (), {"__doc__": "An argument no wrapper takes."})()
BIG = 2**40  # outside every 32-bit range
ANY = object()  # any result will do


def text(value):
    # A str equal to `value` but not the interned constant, so that its
    # reference count belongs to the test alone.
    return (value + "#")[:-1]


def stub_text():
    """The extension module's type stubs (installed by the build), which give each function's arity."""
    return (pathlib.Path(_renderlib.__file__).parent / "_renderlib-stubs" / "__init__.pyi").read_text()


@functools.lru_cache(maxsize=None)
def arities():
    """{function: (fewest, most) positional arguments}, from the type stubs."""
    counts = {}
    # Without the positional-only marker, which Python 3.7's parser cannot read.
    for node in ast.parse(re.sub(r",\s*/(?=\s*[,)])", "", stub_text())).body:
        if isinstance(node, ast.FunctionDef):
            positional = node.args.args
            low, high = len(positional) - len(node.args.defaults), len(positional)
            fewest, most = counts.get(node.name, (low, high))  # another overload's, if any
            counts[node.name] = (min(low, fewest), max(high, most))
    return counts


def module_functions():
    return sorted(name for name in dir(_renderlib) if callable(getattr(_renderlib, name)))


# --- The memory of the C heap, the engine and the monitor library ----------


class MallInfo2(ctypes.Structure):
    names = "arena ordblks smblks hblks hblkhd usmblks fsmblks uordblks fordblks keepcost"
    _fields_ = [(name, ctypes.c_size_t) for name in names.split()]


mallinfo2 = getattr(ctypes.CDLL(None), "mallinfo2", None)  # glibc 2.33 and later
if mallinfo2:
    mallinfo2.restype = MallInfo2


def heap_in_use():
    # Bytes of the C heap in use (every arena and mapped block); 0 where the
    # C library does not tell.
    return mallinfo2().uordblks + mallinfo2().hblkhd if mallinfo2 else 0


ENGINE = EngineProbe()
MONITOR = ctypes.CDLL(loaded_library_path("QRVExternalMonitor"))
MONITOR.qrv_probe_set_init_fails.argtypes = MONITOR.qrv_probe_set_no_devices.argtypes = [ctypes.c_int]


def live_objects():
    return {
        "instances": ENGINE.live_instances(),
        "params": ENGINE.live_params(),
        "stamps": ENGINE.stamp_count(),
        "displays+images": (MONITOR.qrv_probe_live_displays(), MONITOR.qrv_probe_live_images()),
    }


# --- Calling by name ---------------------------------------------------------


class Calls:
    """Calls functions of _renderlib by name and remembers which."""

    def __init__(self):
        self.names = set()

    def __call__(self, name, *args):
        self.names.add(name)
        return getattr(_renderlib, name)(*args)

    def fails(self, error, name, *args):
        """The call raises `error` (a class or a tuple of classes)."""
        try:
            result = self(name, *args)
        except error:
            return
        raise AssertionError("%s%r gave %r instead of raising %s" % (name, args, result, error))

    # Each row is (want, name, *arguments), or text naming calls with no
    # arguments, (ANY, name) for each name in it: `want` is the error the call
    # raises, ANY, a test of its result, or the result itself (None, a bool and
    # NotImplemented the very object).
    def rows(self, *rows):
        for want, name, *args in spelled(rows):
            wants = want if isinstance(want, tuple) and want else (want,)
            if all(isinstance(w, type) and issubclass(w, BaseException) for w in wants):
                self.fails(want, name, *args)
                continue
            result = self(name, *args)
            by_identity = want is None or want is NotImplemented or isinstance(want, bool)
            same = result is want if by_identity else result == want
            wanted = want is ANY or (want(result) if callable(want) else same)
            assert wanted, "%s%.200r gave %.200r, not %.200r" % (name, tuple(args), result, want)
            # The same call with a stranger in each later place is refused once
            # the arguments before it are converted (and must leak nothing).
            for at in range(1, len(args)):
                try:
                    result = self(name, *args[:at], STRANGER, *args[at + 1 :])
                except (TypeError, ValueError, OverflowError, SystemError):
                    continue
                assert result is NotImplemented, "%s took a stranger as argument %d" % (name, at + 1)

    def each(self, name, *rows):
        """rows(), each row (want, *arguments) a call of `name`."""
        self.rows(*[(want, name, *args) for want, *args in rows])

    def on(self, prefix, obj, *rows):
        """rows(), each row (want, member, *arguments) a call of `<prefix>member` on `obj`."""
        self.rows(*[(want, prefix + member, obj, *args) for want, member, *args in spelled(rows)])

    def aborted(self, name, *args):
        """The engine fails the call: the probe makes its next entry throw."""
        ENGINE.abort_next_call()
        try:
            self.fails(RuntimeError, name, *args)
        finally:
            armed = ENGINE.abort_armed()
            ENGINE.abort_next_call(False)
        assert not armed, "%s did not reach the engine" % name


def spelled(rows):
    """The rows with each text row written out as its calls."""
    return [call for row in rows for call in ([(ANY, name) for name in row.split()] if isinstance(row, str) else [row])]


def construct(call, cls, *args):
    """A proxy made the way the proxy classes make themselves: new_X, then X_swiginit."""
    proxy = cls.__new__(cls)
    call(cls.__name__ + "_swiginit", proxy, call("new_" + cls.__name__, *args))
    return proxy


# Calls every one-argument `<prefix>*` on `obj` (its getters among them) but
# the class's static methods and, when `write`, writes back what each getter
# read through its setter (but those named in `keep`), refusing a wrong type
# and, for an int, a value out of range. An object that compares is equal to
# itself and leaves the comparison with a stranger to Python.
def members(call, prefix, obj, write=True, keep=()):
    cls = getattr(renderlib, prefix[:-1])
    if hasattr(_renderlib, prefix + "__eq__"):
        strange = [(NotImplemented, "__eq__", STRANGER), (NotImplemented, "__ne__", STRANGER)]
        call.on(prefix, obj, (True, "__eq__", obj), (False, "__ne__", obj), *strange)
    for name in sorted(dir(_renderlib)):
        if not name.startswith(prefix) or name.endswith("_swigregister") or arities()[name] != (1, 1):
            continue
        if isinstance(inspect.getattr_static(cls, name[len(prefix) :], None), staticmethod):
            continue
        value = call(name, obj)
        setter = name[: -len("get")] + "set"
        if write and name.endswith("_get") and hasattr(_renderlib, setter) and setter not in keep:
            call.rows((None, setter, obj, value))
            if isinstance(value, int):
                call.fails(OverflowError, setter, obj, BIG)


def named(scope, names):
    """The objects of those names in `scope`, a family's locals()."""
    return [scope[name] for name in names.split()]


def listener(heard):
    """A message handler that keeps what it hears in `heard`."""
    return lambda level, message: heard.append(message)


def free_all(call, effects_made):
    for effect in effects_made:
        call("free_tarsel_effect", effect)


# --- The cases: one family of wrappers each --------------------------------
#
# A family makes what its calls need, then hands back `step` (one round of
# its calls), the objects the calls are given, whose reference counts must not
# move, and a cleanup. `helpers` is the second binding module of the tests
# (tests/shared_registry.i): it makes the raw pointers a few wrappers take.

FAMILIES = {}


def family(make):
    FAMILIES[make.__name__] = make
    return make


RENDER = "render_tarsel_effect_to_native_image"
FLARE = "render_tarsel_lensflare_to_native_image"
LINEAR = text("linear")
VIEW = (96, 54, 0.0, 0.0, 0.5, 0.5)  # a widget's view: size, offset, centre


# The input, output and working colour spaces of a render.
SPACES = [LINEAR] * 3


def render_arguments(effect, dest, rasters, images, frame=0):
    return [effect, "", dest, frame, 0, 1, 1, rasters, images, 1.0, len(rasters), 1.0, 0, 0, 0, 25, False, *SPACES]


def flare_arguments(effect, dest, rasters, images):
    return [effect, "", 4.0, 4.0, dest, 0, 0, 1, 1, rasters, images, 1.0, len(rasters), 1.0, 0, 0, *SPACES, False]


def builder_effect_name():
    return text(effects.catalogue(builder=True)[0].plugin_name)


def engine_genotypes(call, builder_too=True):
    names = [(text("T_Glow"), False), (text("T_LensFlare"), False)] + [(builder_effect_name(), True)] * builder_too
    made_effects = [call("init_tarsel_effect", name, builder) for name, builder in names]
    return made_effects, [genotype for effect in made_effects for genotype in effect._get_genotypes()]


def changed(row, at, value):
    return row[:at] + [value] + row[at + 1 :]


@family
def records(call, helpers, tmp_path):
    # Every record a host can make on its own: made, each field read and
    # written back, deleted; then the engine's catalogue, walked.
    def step():
        for name in "Plugin_Info Genotype ParamFlags T_RasterInfo T_RenderInfo MessageHeader_t ShmemManager".split():
            record = construct(call, getattr(renderlib, name))
            members(call, name + "_", record)
            call("delete_" + name, record)
        for count_of, entry in (
            ("get_n_tarsel_effects", "get_tarsel_plugin_info_i"),
            ("get_n_tarsel_builder_effects", "get_tarsel_builder_info_i"),
        ):
            count = call(count_of)
            assert count > 0
            for i in range(count):
                members(call, "Plugin_Info_", call(entry, i))
            call.rows((None, entry, count), (None, entry, -1), (OverflowError, entry, BIG))

    return step, [], lambda: None


@family
def engine(call, helpers, tmp_path):
    name, builder, unknown = text("T_Glow"), builder_effect_name(), text("T_NoSuchEffect")
    kept = call("init_tarsel_effect", name, False)
    saved = text(effects.saved_text(kept))
    broken = text('{"effect": "T_Glow", "params": ')
    heard = []
    handler = listener(heard)
    me, someone = text("S-1-22-1-%d" % os.geteuid()), text("S-1-22-1-%d" % (os.geteuid() + 1))

    def step():
        effect = call("init_tarsel_effect", name, False)
        members(call, "EffectGlobals_t_", effect, write=False)
        call.on(
            "EffectGlobals_t_", effect, (name, "plugin_name_get"), (bool, "_get_shared_params"), (True, "__ne__", kept)
        )
        call.rows((TypeError, "EffectGlobals_t__get_genotypes", kept.effect_genotype))
        call.each("tarsel_effect_is_time_varying", (ANY, effect, name, 0), (OverflowError, effect, name, BIG))
        call.each("tarsel_get_gpu_status", (ANY, effect), (ANY, None))
        call.each("free_tarsel_effect", (None, effect), (None, None))
        assert not effect.thisown
        call.each("init_tarsel_effect", (None, unknown, False), (bool, builder, True))  # freed by its proxy
        call.each("init_tarsel_effect_from_string", (None, broken), (None, None))
        call("delete_EffectGlobals_t", call("init_tarsel_effect_from_string", saved))
        call.aborted("init_tarsel_effect", name, False)
        call.aborted("init_tarsel_effect_from_string", saved)
        call("set_error_handler", handler)
        ENGINE.emit_here(_renderlib.Err_Info, "leak check")
        ENGINE.emit_from_worker(2, _renderlib.Err_Warning, "leak check")
        call("get_tarsel_version_info")
        ENGINE.set_version_text(b"engine \xff\xfe")
        call.rows(
            (None, "set_error_handler", None),
            (None, "tarsel_free_all_stamp_collections"),
            "tarsel_shutdown_apps get_tarsel_version_info ext_build_id get_tarsel_build_id",
            (True, "check_build_id"),
            (ANY, "SWIG_PyInstanceMethod_New", draw_nothing),
        )
        call.each("check_user", (True, me), (False, someone), (False, None))
        call.each("shmem_error_to_string", *[(ANY, error) for error in range(7)], (OverflowError, BIG))
        ENGINE.set_version_text(None)
        heard.clear()

    def cleanup():
        call("free_tarsel_effect", kept)
        _renderlib.set_error_handler(None)
        ENGINE.set_version_text(None)

    return step, [name, builder, unknown, kept, saved, broken, heard, handler, me, someone], cleanup


def sample_params(genotypes):
    """A parameter of every type, and of each kind of special one."""
    params = [param for genotype in genotypes for param in genotype._get_params()]
    return list({(p.ptype, p.n_channels, bool(p.flags.fromfile_popup_p), p.is_point()): p for p in params}.values())


@family
def parameters(call, helpers, tmp_path):
    made_effects, genotypes = engine_genotypes(call)
    params = sample_params(genotypes)
    bounds = [renderlib.ValueArray() for _ in range(4)]
    pointers = [values.data for values in bounds]
    title, label = text(" " * 255), text("Radius")
    inputs = [call("Genotype_input_optional_p_get", genotype) for genotype in genotypes]
    collected = []
    collector = helpers.object_address(collected)

    def step():
        for param in params:
            # An engine parameter keeps its name: the engine owns that text.
            members(call, "Param_", param, keep={"Param_name_set"})
            members(call, "ParamFlags_", call("Param_flags_get", param))
            for values in (call("Param_default_value_get", param), call("Param_old_default_value_get", param)):
                call.on(
                    "ValueArray_", values, (4, "__len__"), (None, "__setitem__", 0, values[0]), (ANY, "__getitem__", 0)
                )
            call.on(
                "Param_",
                param,
                (ANY, "needs_old_default", 1.0),
                (ANY, "maybe_set_to_old_default", None, 1.0),
                (ANY, "maybe_set_to_old_default", None, 1.0, 0),
                (ANY, "to_string", None),
                (ANY, "to_string", None, True),
                (ANY, "to_string_const", None),
            )
            call.rows(
                (ANY, "tarsel_param_to_string", param),
                (ANY, "tarsel_get_param_title", param, 0, title, 256),
                (ANY, "tarsel_get_fromfile_popup_names", param, None),
                (ANY, "tarsel_get_param_bounds2", param, 1.0, 0, *pointers, 0),
            )
        param = params[1]
        # Each Param keeps only its latest cJSON tree: the one before is freed.
        call.on("Param_", param, (bool, "to_json", None), (ANY, "to_json", None, True))
        call.rows(
            (TypeError, "Param_to_string_const", param, None, 1),
            (TypeError, "Param_maybe_set_to_old_default", param, None, 1.0, -1),
            (OverflowError, "tarsel_get_param_title", param, 0, title, -1),
            (TypeError, "tarsel_get_fromfile_popup_names", param, []),
            (TypeError, "new_Param", label, 1.0),
        )
        # Parameters a host makes: every constructor overload, every setter.
        for more in ((), (2,), (2, _renderlib.screen_mode_screen_center)):
            own = construct(call, renderlib.Param, label, _renderlib.ptype_float, *more)
            members(call, "Param_", own)
            call.on(
                "Param_",
                own,
                (None, "name_set", label),
                (None, "name_set", None),
                (OverflowError, "n_channels_set", 256),
            )
            call("delete_Param", own)
        for cls, value, wrong in ((renderlib.ValueArray, 1.5, 1e39), (renderlib.ShortInputArray, 7, 32768)):
            array, other = construct(call, cls), construct(call, cls)
            call.on(
                cls.__name__ + "_",
                array,
                (bool, "__len__"),
                (None, "__setitem__", 1, value),
                (value, "__getitem__", 1),
                (IndexError, "__getitem__", 8),
                (IndexError, "__setitem__", 8, value),
                (OverflowError, "__getitem__", -1),
                (OverflowError, "__setitem__", 0, wrong),
                (ValueError, "data_set", None),
                (TypeError, "data_set", [value]),
            )
            call(cls.__name__ + "_data_set", other, call(cls.__name__ + "_data_get", array))
            for each in (array, other):
                call("delete_" + cls.__name__, each)
        for shorts in inputs:
            for i in range(call("ShortInputArray___len__", shorts)):
                call("ShortInputArray___getitem__", shorts, i)
        for genotype in genotypes:
            members(call, "Genotype_", genotype)
            call.each(
                "Genotype_get_param_group_name",
                *[(ANY, genotype, param) for param in call("Genotype__get_params", genotype)[:3]],
            )
            call.rows((ANY, "tarsel_any_nodes_get_flag", genotype, 0x20000))
            call.each("add_param_to_list", (0, genotype, 0, collector), (0, genotype, 10_000, collector))
            info = call("Genotype_effect_info_get", genotype)
            if info is not None:
                members(call, "effect_def_", info, write=False)
            collected.clear()
        call.fails(OverflowError, "add_param_to_list", genotypes[0], BIG, collector)
        call.fails(OverflowError, "tarsel_any_nodes_get_flag", genotypes[0], BIG)

    watched = made_effects + genotypes + params + bounds + pointers + inputs + [title, label, collected, collector]
    return step, watched, lambda: free_all(call, made_effects)


@family
def renders(call, helpers, tmp_path):
    gradient, blur, flare = made_effects = [
        call("init_tarsel_effect", text(name), False) for name in ("T_Gradient", "T_Blur", "T_LensFlare")
    ]
    dest_info, dest = effects.raster(_renderlib.pixel_rgba8, 8, 8)
    source_info, source_pixels = effects.raster(_renderlib.pixel_rgba8, 8, 8)
    float_info, _ = effects.raster(_renderlib.pixel_rgbaf, 8, 8)
    array = numpy.zeros((8, 8, 4), numpy.float32)
    rasters, images, alone, nothing_in = [dest_info, source_info], [None, source_pixels], [dest_info], [None]
    floats, wrong_rasters, wrong_images = [float_info], (dest_info, source_info), [None, 5]
    other_record = renderlib.T_RenderInfo()
    blurred = render_arguments(blur, dest, rasters, images)
    # An effect that asks the host for other frames, and the hosts' frame sources.
    frame, echo_dest, current = (effects.raster(_renderlib.pixel_rgbaf, 16, 8) for _ in range(3))
    source, missing, not_a_descriptor = StillSource(frame), MissingSource(frame), NotADescriptor(frame)
    echo = effects.recreate(call("init_tarsel_effect", text("T_Echo"), False), {"echoes": "2"})
    echoed = render_arguments(echo, echo_dest[1], [echo_dest[0], current[0]], [None, current[1]])

    def step():
        call.rows(
            (True, RENDER, *blurred),
            (True, RENDER, *render_arguments(gradient, dest, alone, nothing_in)),
            (True, RENDER, *render_arguments(gradient, array, floats, nothing_in)),
            (True, FLARE, *flare_arguments(flare, dest, alone, nothing_in)),
            (OverflowError, RENDER, *render_arguments(blur, dest, rasters, images, frame=BIG)),
        )
        for name, arguments in ((RENDER, render_arguments), (FLARE, flare_arguments)):
            for wrong in ((wrong_rasters, images), (rasters, wrong_images), ([other_record], nothing_in)):
                call.fails(TypeError, name, *arguments(blur, dest, *wrong))
            call.aborted(name, *arguments(blur, dest, rasters, images))
        call.rows(
            (None, "tarsel_abort_render"),
            (RuntimeError, RENDER, *blurred),
            (None, "tarsel_clear_abort"),
            (True, RENDER, *blurred),
            (None, "set_load_frame_impl", source),
            (True, RENDER, *echoed),
            (None, "set_load_frame_impl", missing),
            (RuntimeError, RENDER, *echoed),
            (None, "set_load_frame_impl", None),
            (ValueError, "LoadFrameInterface_load_frame", missing.this, 0, 0, 16, 8),
            (TypeError, "LoadFrameInterface_current_raster_info", not_a_descriptor.this, 0),
            (RuntimeError, "LoadFrameInterface_load_frame", source, 0, 0, 0, 0),  # the abstract base's own
        )
        call.on(
            "LoadFrameInterface_",
            source.this,
            (lambda pixels: pixels is frame[1], "load_frame", 0, 0, 16, 8),
            (ANY, "current_raster_info", 0),
            (OverflowError, "current_raster_info", BIG),
        )
        director_lifetimes(call, StillSource, frame)

    def cleanup():
        free_all(call, made_effects)
        _renderlib.set_load_frame_impl(None)
        _renderlib.free_tarsel_effect(echo)

    watched = named(locals(), "dest_info dest source_info source_pixels float_info array rasters images alone")
    watched += named(locals(), "nothing_in floats wrong_rasters wrong_images other_record frame source missing")
    return step, made_effects + watched + [not_a_descriptor, echo, LINEAR, *frame, current[1], *echoed], cleanup


@family
def images(call, helpers, tmp_path):
    bits, short_bits = text("A" * 104 + "ignored"), text("A" * 103)
    encoded, three = text(base64.b64encode(bytes(range(1, 105))).decode()), text("QUJD")
    decoded = bytearray(120)
    decoded_at = helpers.byte_address(decoded, 0)
    first, second = contexts = [helpers.context_handle(0), helpers.context_handle(1)]
    source_info, source = effects.raster(_renderlib.pixel_rgbaf, 2, 1)
    source[:] = numpy.array([0, 0, 0, 1, 1, 1, 1, 1], numpy.float32).tobytes()
    size = _renderlib.tarsel_get_resized_image_size(source_info, 8, 1, 0, 0, 1.0, 0)
    dest_info, dest, shown, empty = renderlib.T_RasterInfo(), bytearray(size), bytearray(8), text("")
    effect = call("init_tarsel_effect", text("T_Glow"), False)
    lut = tmp_path / "gamma.lut"
    lut.write_text("\n".join("%.6f" % ((i / 255) ** (1 / 2.2)) for i in range(256)))
    lut_path, missing = text(str(lut)), text(str(tmp_path / "missing.lut"))
    messages = []
    handler = listener(messages)
    sized = ["tarsel_get_resized_image_size", source_info, 8, 1, 0, 0, 1.0, 0]
    resize = ["tarsel_resize_native_image", source_info, source, 8, 1, 0, 0, 1.0, dest_info, dest, 1, 0.0, 0.0, 0.0]
    convert = ["tarsel_convert_to_bgra_8", None, source_info, source, shown, _renderlib.RGBA_OK, 0, 0, LINEAR, LINEAR]
    comp = ["tarsel_comp_bgra_8", shown, 2, 1, 8, -16711936, 0]
    pixels, out, wrong_out = bytearray(range(16)), bytearray(16), bytearray(1)
    path = tmp_path / "spot.png"
    png.write_rgba8(path, bytes(8 * 8 * 4), 8, 8)
    spot, no_spot = text(str(path)), text(str(tmp_path / "missing.png"))
    register = ["tarsel_register_flare_texture", 2, 2, 4, 1, pixels]

    def step():
        info = renderlib.T_RasterInfo()
        info.pixel_type = _renderlib.pixel_rgba8
        call.each("make_tarsel_raster_info", (200, info, 10, 5), (OverflowError, info, BIG, 5))
        info.pixel_type = 27  # no such layout
        call.each("make_tarsel_raster_info", (0, info, 10, 5))
        call.each("tarsel_get_native_image_dims", (ANY, info), (ANY, None))
        call.rows(
            (lambda data: len(data) == 104, "raster_info_to_bytearray", info),
            (ValueError, "delete_RenderContext", None),
        )  # a host never owns one
        # None for the record or the text of the two record writers is refused
        # before the engine sees it (the engine would read through it).
        call.each(
            "make_tarsel_raster_info_from_bits",
            (None, info, bits),
            (ValueError, info, short_bits),
            (ValueError, None, bits),
        )
        call.each("make_tarsel_raster_info_from_base64", (None, info, encoded), (ValueError, info, None))
        call.each(
            "base64decode",
            (ANY, encoded, decoded_at, 120),
            (ANY, three, None, 0),
            (OverflowError, three, decoded_at, BIG),
        )
        call.on(
            "RenderContext_", first, (True, "__eq__", first), (True, "__ne__", second), (NotImplemented, "__eq__", 3)
        )
        call("RenderContext___hash__", first)
        call.rows(
            (size, *sized),
            ([8, 1], *resize),
            (OverflowError, *changed(resize, 3, BIG)),
            (ANY, *convert),
            (ANY, *changed(convert, 1, effect)),
            (ANY, *comp),
            (OverflowError, *changed(comp, 5, BIG)),
            (None, "set_error_handler", handler),
            "get_ocio_path",
        )
        call.each("set_tarsel_luts", (ANY, lut_path, empty, 1.0), (ANY, missing, empty, 1.0))  # the handler hears it
        call("set_error_handler", None)
        messages.clear()
        index = call(*register)
        assert index >= 0
        call.rows(
            (None, "tarsel_get_flare_texture_error"),
            (lambda got: got[0] == 0, "tarsel_get_texture_info", index),
            (TypeError, *changed(register, 5, "pixels")),
            (TypeError, *changed(register, 3, 4.0)),
            (OverflowError, *changed(register, 1, BIG)),
        )
        call.each("tarsel_get_texture_pixels", (16, index, out))
        call.each(
            "tarsel_load_flare_texture", (lambda i: i >= 0, spot), (lambda i: i < 0, no_spot), (lambda i: i < 0, None)
        )
        assert call("tarsel_get_flare_texture_error")
        call("tarsel_free_all_flare_textures")
        call.each("tarsel_get_texture_info", (lambda got: got[0] != 0, index), (OverflowError, BIG))
        call.each("tarsel_get_texture_pixels", (lambda n: n < 0, index, wrong_out))

    def cleanup():
        _renderlib.set_tarsel_luts("", "", 1.0)
        call("free_tarsel_effect", effect)
        _renderlib.tarsel_free_all_flare_textures()

    watched = named(locals(), "source_info source dest_info dest shown effect lut_path missing messages handler bits")
    watched += named(locals(), "short_bits encoded three decoded decoded_at pixels out wrong_out spot no_spot path")
    return step, watched + contexts, cleanup


def director_lifetimes(call, cls, *args):
    # An object of `cls` made as its proxy class makes one, and another handed
    # over to the native side and deleted there: the first is returned.
    base = next(c.__name__ for c in cls.__mro__ if c.__module__ == "renderlib")
    fresh = cls.__new__(cls)
    call(base + "_swiginit", fresh, call("new_" + base, fresh))
    handed = cls(*args)
    call("disown_" + base, handed)
    call("delete_" + base, handed)
    return fresh


def draw_nothing(self, *args):
    pass


# A graphics object that draws nothing and keeps nothing: every method of the
# interface is its own.
DRAWING = [name for name, value in vars(renderlib.GfxInterface).items() if callable(value) and not name.startswith("_")]
QuietDrawing = type("QuietDrawing", (renderlib.GfxInterface,), dict.fromkeys(DRAWING, draw_nothing))
QuietDrawing.get_text_length_in_pixels = lambda self, text: 6 * len(text)


def raise_key_error(self, *args):
    raise KeyError("the host's own error")


@family
def drawing_callbacks(call, helpers, tmp_path):
    drawing = QuietDrawing()
    wrong = type("WrongResult", (QuietDrawing,), {"get_text_length_in_pixels": lambda self, text: "wide"})()
    raising = type("RaisingDrawing", (QuietDrawing,), {"circle": raise_key_error})()
    xs, ys = renderlib.float_vector([1, 2]), renderlib.float_vector([3, 4])
    flare = call("init_tarsel_effect", text("T_LensFlare"), False)
    words, empty = text("abcd"), text("")
    values, short_values = renderlib.float_vector([96, 54, 0]), [96.0, 54.0]
    draw = ["tarsel_widget_draw", flare, empty, *VIEW, values]
    mouse = ["tarsel_widget_mouse_event", flare, empty, *VIEW, values, 10, 10, _renderlib.MouseEventType_PRESS]

    def step():
        call.on(
            "GfxInterface_",
            drawing.this,
            (ANY, "set_graphics_context", None),
            (ANY, "set_graphics_context", xs),
            (ANY, "start_drawing", 1),
            "end_drawing begin_line end_line",
            (ANY, "line", 1, 2, 3.5, 4),
            (ANY, "lines", xs, ys),
            (ANY, "color_3f", 1.0, 0.5, 0.0),
            "stipple_on stipple_off",
            (ANY, "stipple_pattern", 0xF0F0),
            (ANY, "line_width", 2.0),
            "flush",
            *[(ANY, name, 1, 2, 3) for name in ("circle", "dot")],
            (ANY, "rect_filled", 1, 2, 3, 4),
            (ANY, "draw_text", words, 5, 6),
            (ANY, "get_text_length_in_pixels", words),
            (OverflowError, "stipple_pattern", 65536),
            (ValueError, "lines", None, ys),
            (TypeError, "lines", [1.0], ys),
        )
        call.rows(
            (TypeError, "GfxInterface_get_text_length_in_pixels", wrong.this, words),
            (KeyError, "GfxInterface_circle", raising.this, 1, 2, 3),
            (RuntimeError, "GfxInterface_line", drawing, 0, 0, 1, 1),  # the abstract base's own
        )
        fresh = director_lifetimes(call, QuietDrawing)
        call("GfxInterface_flush", fresh.this)
        del fresh
        call.rows(
            (None, "tarsel_set_gfx_impl", drawing),
            (ANY, *draw),
            (ANY, *changed(draw, 9, short_values)),
            (ANY, *mouse),
            (ANY, *changed(changed(mouse, 9, short_values), 12, _renderlib.MouseEventType_DRAG)),
            (None, "tarsel_set_gfx_impl", None),
            (OverflowError, *changed(mouse, 10, BIG)),
        )

    def cleanup():
        _renderlib.tarsel_set_gfx_impl(None)
        call("free_tarsel_effect", flare)

    watched = named(locals(), "drawing wrong raising xs ys flare words values short_values")
    return step, watched + [drawing.this, wrong.this, raising.this], cleanup


class StillSource(renderlib.LoadFrameInterface):
    """Hands out the same frame for every request."""

    def __init__(self, frame):
        super().__init__()
        self.frame = frame

    def load_frame(self, input, frame, width, height):
        return self.frame[1]

    def current_raster_info(self, input):
        return self.frame[0]


class MissingSource(StillSource):
    def load_frame(self, input, frame, width, height):
        raise ValueError("no such frame")


class NotADescriptor(StillSource):
    def current_raster_info(self, input):
        return self.frame[1]


@family
def shared_memory(call, helpers, tmp_path):
    name, other = text("rlleak-%d-a" % os.getpid()), text("rlleak-%d-b" % os.getpid())
    missing, bad = text("rlleak-%d-missing" % os.getpid()), text("a/b")
    message, payload, sixteen = text("a message"), bytes(range(100)), bytes(range(16))
    note, oversized, size = text("leak check"), 1 << 20, 1 << 16
    readers = [("read_pybuf",), ("try_read_pybuf",), ("timed_read_pybuf", 1.0), ("read_pybuf_and_retry", 1.0)]
    t = "ShmemTransport_"

    def step():
        server, client = call("ShmemManager_serve", name, size, size), call("ShmemManager_connect", name)
        assert server is not None and client is not None
        call.on(
            t,
            server,
            (bool, "write_string", message),
            (bool, "write_string", message, note),
            (bool, "try_write_string", message),
            (bool, "timed_write_string", message, 1.0, note),
            (bool, "write_pybuf", payload),
            (bool, "try_write_pybuf", payload, note),
            (bool, "timed_write_pybuf", payload, 1.0),
        )
        for reserve, *extra in (("reserve_pybuf",), ("try_reserve_pybuf",), ("timed_reserve_pybuf", 1.0)):
            call(t + reserve, server, 16, *extra, note)[:] = sixteen
            assert call(t + "commit", server)
        for i in range(10):
            members(call, "MessageHeader_t_", call(t + "get_msg_header", client))
            reader, *extra = readers[i % len(readers)]
            bytes(call(t + reader, client, *extra))
        call.on(
            t,
            client,
            (None, "try_read_pybuf"),
            (None, "timed_read_pybuf", 0.0),
            (None, "get_msg_header"),
            (bool, "is_segment_valid"),
            (lambda error: error != _renderlib.ShmemError_SHMEM_NO_ERROR, "get_last_error"),
        )
        call.on(
            t,
            server,
            (None, "try_reserve_pybuf", oversized),
            (operator.not_, "try_write_pybuf", bytes(oversized)),
            (bool, "client_pid_exists"),
            "print_stats get_server_pid",
            # A message without the buffer protocol: a SystemError caused by the TypeError.
            (SystemError, "write_pybuf", STRANGER),
            (SystemError, "try_write_pybuf", 5),
            (SystemError, "timed_write_pybuf", message, 1.0),
            (TypeError, "reserve_pybuf", -1),
        )  # overloaded: no match
        call.each(
            "ShmemManager_serve",
            (None, name, size, size),  # served already
            (None, other, 16, 16),
            (None, bad, size, size),
            (OverflowError, other, -1, 1),
        )  # queues too small
        call.each("ShmemManager_connect", (None, missing), (None, None))
        assert call(t + "remove", server)
        client.this.disown()
        call.each("free_tarsel_ipc_shmemtransport", (None, client), (None, None))
        call("delete_ShmemTransport", server)
        call.each("ShmemManager_reset", (None, name), (None, name, True), (None, missing, True))
        call.each("ShmemManager_reset_all", (None,), (None, False), (TypeError, 1))
        assert call(t + "remove", call("ShmemManager_serve", name, size, size))  # freed by its proxy

    def cleanup():
        for segment in (name, other):
            _renderlib.ShmemManager_reset(segment, True)

    return step, [name, other, missing, bad, message, payload, sixteen, note], cleanup


@family
def monitor(call, helpers, tmp_path):
    preview, nowhere, mode = text("preview"), text("nowhere"), text("640x360p25")
    pixels, frame_name, frame = bytearray(8 * 4 * 4), text("leak check"), bytearray(640 * 360 * 4)
    none, not_found = _renderlib.EM_errorNone, _renderlib.EM_errorNotFound
    d = "EM_Display_"
    # An image's format, pixel aspect, gamma, and whether premultiplied and of full range.
    look = [_renderlib.EM_ImageFormat_32BitIntBGRA, 1.0, 2.2, False, True]

    def step():
        display = call("EM_DisplayInit")
        wrap = [d + "EM_XIImageWrapper", display, pixels, 8, 4, 32, frame_name, False, *look]
        image = call(*wrap)
        call.on(d, display, (bool, "devices"), (bool, "device_modes", preview), ([], "device_modes", nowhere))
        call.on(d, display, (none, "connect", preview, mode), (640, "get_width", preview), (360, "get_height", preview))
        # A frame not of the connected mode's size is refused.
        wrong_size = (lambda error: error != none, "display_frame", preview, image)
        call.on(d, display, wrong_size, (not_found, "display_frame", nowhere, image))
        call.on("EM_XIImage_", image, (8, "getWidth"), (4, "getHeight"), (32, "getRowBytes"))
        call.on("EM_XIImage_", image, (2, "addRef"), (1, "removeRef"))  # its count of references
        whole = call(*wrap[:2], frame, 640, 360, 640 * 4, *wrap[6:])
        assert call(d + "display_frame", display, preview, whole) == none
        del whole
        call("delete_EM_XIImage", image)
        call.fails(ValueError, "EM_XIImage_getWidth", image)  # its last reference went
        call(*changed(wrap, 6, None))  # the proxy gives its reference back
        call.rows(
            (TypeError, *changed(wrap, 2, "pixels")),
            (TypeError, *changed(wrap, 7, 1)),
            (OverflowError, *changed(wrap, 3, BIG)),
            (TypeError, "EM_XIImage_addRef", display),
        )
        call.on(d, display, (_renderlib.EM_errorParam, "connect", None, mode), (not_found, "connect", nowhere, mode))
        call.on(d, display, (none, "disconnect", preview), (0, "get_width", preview))
        call.each("release_external_monitor", (None, display), (ValueError, display))  # the second: released already
        call.fails(ValueError, d + "devices", display)
        # The library's fault switches: its start fails; it finds no device.
        MONITOR.qrv_probe_set_init_fails(1)
        assert call("EM_DisplayInit") is None
        MONITOR.qrv_probe_set_init_fails(0)
        MONITOR.qrv_probe_set_no_devices(1)
        bare = call("EM_DisplayInit")
        MONITOR.qrv_probe_set_no_devices(0)
        call.on(d, bare, ([], "devices"), (not_found, "connect", preview, mode))
        call("release_external_monitor", bare)

    return step, [preview, nowhere, mode, pixels, frame_name, frame], lambda: None


def vector_calls(call, kind, first, second):
    """Every wrapper of one std::vector instance, with elements `first` and `second`."""
    cls, p = getattr(renderlib, kind), kind + "_"
    pair = [first, second]
    vector, other, three = (construct(call, cls, items) for items in (pair + [first], pair, pair + [first]))
    for arguments in ((), (3,), (3, first), (vector,)):
        call("delete_" + kind, construct(call, cls, *arguments))
    call.rows((TypeError, "new_" + kind, STRANGER), ((OverflowError, TypeError), "new_" + kind, -1))
    call.on(
        p,
        vector,
        *sizes(3),
        "get_allocator",
        (ANY, "reserve", 8),
        (lambda n: n >= 8, "capacity"),
        (ANY, "append", second),
        (ANY, "push_back", first),
        *[(ANY, "__getitem__", at) for at in (0, -1, slice(0, 2))],
        (IndexError, "__getitem__", 99),
        (ANY, "__setitem__", 0, second),
        (ANY, "__setitem__", slice(0, 1), [first]),
        (ANY, "__setitem__", slice(4, 5)),
        (ValueError, "__setitem__", slice(0, 4, 2), [first]),
        *[(ANY, "__delitem__", at) for at in (0, slice(0, 1))],
        (IndexError, "__delitem__", 99),
        (ANY, "__getslice__", 0, 2),
        (ANY, "__setslice__", 0, 1, [second]),
        (ANY, "__setslice__", 0, 1),
        (ANY, "__delslice__", 0, 1),
        # back, front and pop_back are only ever called on a vector that
        # has elements: on an empty one they read or free what is not there.
        *[(ANY, "append", each) for each in (first, second, first)],
        (lambda n: n >= 3, "size"),
        "back front pop pop_back",
        (ANY, "assign", 3, second),
        (ANY, "resize", 4),
        (ANY, "resize", 5, first),
    )
    at = call(p + "insert", vector, call(p + "begin", vector), first)
    call(p + "insert", vector, at, 2, second)
    call(p + "erase", vector, call(p + "begin", vector))
    call(p + "erase", vector, call(p + "begin", vector), call(p + "end", vector))
    call.on(p, vector, "rbegin", "rend", (ANY, "swap", other))
    iterate(call, p, three)
    call.on(p, vector, (None, "clear"), (IndexError, "pop"))
    for each in (three, other, vector):
        call("delete_" + kind, each)


def sizes(n):
    """The rows of a container's size queries, for one of `n` elements."""
    return [(n, "__len__"), (n, "size"), (n > 0, "__bool__"), (n > 0, "__nonzero__"), (n == 0, "empty")]


def iterate(call, prefix, sequence):
    """Every wrapper of SWIG's iterator, over a sequence of three."""
    begin, also_begin, end, closed = (call(prefix + name, sequence) for name in ("begin", "begin", "end", "iterator"))
    p = "SwigPyIterator_"
    call.on(
        p,
        begin,
        "value incr",
        (ANY, "incr", 1),
        "decr",
        (ANY, "decr", 1),
        (ANY, "distance", end),
        (True, "equal", also_begin),
        (True, "__eq__", also_begin),
        (False, "__ne__", also_begin),
        (NotImplemented, "__eq__", STRANGER),
        "next __next__ previous decr",
    )
    copy = call(p + "copy", begin)
    call.rows((ANY, p + "value", copy), (ANY, p + "advance", begin, 1))
    # The in-place operators hand the iterator over to their result (as
    # `iterator += n` rebinds the name): keep the result, not the argument.
    begin = call(p + "__iadd__", begin, 1)
    begin = call(p + "__isub__", begin, 2)
    call.rows((ANY, p + "__sub__", end, begin))
    call.on(p, begin, (ANY, "__add__", 1))
    # A closed iterator: nothing before its start, three steps, then the end.
    call.on(
        p,
        closed,
        (StopIteration, "previous"),
        "__next__ __next__ __next__",
        *[(StopIteration, name) for name in ("__next__", "__next__", "value")],
    )
    call("delete_SwigPyIterator", copy)


@family
def containers(call, helpers, tmp_path):
    made_effects, genotypes = engine_genotypes(call, builder_too=False)
    param = genotypes[0]._get_params()[0]
    elements = {
        "bool_vector": (True, False),
        "float_vector": (1.5, 2.5),
        "string_vector": (text("ab"), text("cd")),
        "genotype_vector": (genotypes[0], None),
        "param_vector": (param, None),
    }
    key, other_key, missing = text("radius"), text("center"), text("missing")
    values, numbers = [2.5, 1.0], renderlib.float_vector([1.0, 2.0, 3.0])
    p = "value_map_"
    # Lists whose first element converts and a later one does not: the
    # container made for the conversion is freed when it gives up.
    flare, empty, floats = call("init_tarsel_effect", text("T_LensFlare"), False), text(""), [1.0, STRANGER]
    kept = renderlib.value_map()
    refused = {kind: [first, STRANGER] for kind, (first, _) in elements.items()}

    def step():
        for kind, (first, second) in elements.items():
            vector_calls(call, kind, first, second)
        mapping = construct(call, renderlib.value_map)
        call.on(
            p,
            mapping,
            (None, "__setitem__", key, values),
            (None, "__setitem__", missing, values),
            (None, "__setitem__", other_key, renderlib.float_vector(values)),
        )
        iterate(call, p, mapping)
        call(p + "__setitem__", mapping, missing)  # without a value: removes the key
        copy = construct(call, renderlib.value_map, mapping)
        call("delete_value_map", construct(call, renderlib.value_map, {key: values}))
        call.fails(TypeError, "new_value_map", STRANGER)
        call.on(
            p,
            mapping,
            (IndexError, "__delitem__", missing),
            ((2.5, 1.0), "__getitem__", key),
            (IndexError, "__getitem__", missing),
            (True, "__contains__", key),
            (True, "has_key", key),
            (1, "count", key),
            *sizes(2),
            (ANY, "lower_bound", key),
            (ANY, "upper_bound", key),
            "keys values items asdict end key_iterator value_iterator rbegin rend get_allocator",
        )
        call(p + "erase", mapping, call(p + "find", mapping, key))
        call.on(p, mapping, (1, "erase", other_key), (IndexError, "__delitem__", missing), (ANY, "swap", copy))
        call(p + "erase", mapping, call(p + "begin", mapping), call(p + "end", mapping))
        call("value_map_clear", copy)
        call.rows(
            (None, "delete_value_map", copy),
            (None, "delete_value_map", mapping),
            # `iterator - n` and `iterator + n` past either end make a
            # copy and then stop: the copy is freed.
            (ANY, "SwigPyIterator___sub__", numbers.end(), 1),
            (ANY, "SwigPyIterator___sub__", numbers.begin(), 1),
            (ANY, "SwigPyIterator___add__", numbers.begin(), 5),
            (TypeError, "tarsel_widget_draw", flare, empty, *VIEW, floats),
            (TypeError, "tarsel_widget_mouse_event", flare, empty, *VIEW, floats, 10, 10, 0),
            (TypeError, "value_map___setitem__", kept, key, floats),
            (TypeError, "new_value_map", {"radius": [1.0], "size": floats}),
            *[(TypeError, "new_" + kind, items) for kind, items in refused.items()],
        )

    watched = made_effects + [param, key, other_key, missing, values, numbers, flare, empty, floats, kept]
    watched += list(refused.values()) + [e for pair in elements.values() for e in pair]
    return step, watched, lambda: free_all(call, made_effects + [flare])


@family
def argument_errors(call, helpers, tmp_path):
    # Every function with too many arguments, with too few, and with an
    # argument of a type no wrapper takes in first place; every function that
    # takes arguments with None in each of them (what the call then does is
    # up to the function; it must neither crash nor leak).
    operators = ("__eq__", "__ne__", "__add__", "__sub__", "__iadd__", "__isub__")
    refused = (TypeError, ValueError, OverflowError, RuntimeError, AttributeError)
    # Functions that take any object first, or whose None is not refused
    # (the two record writers, which the images family leaves out too).
    takes_anything = {"SWIG_PyInstanceMethod_New", "new_GfxInterface", "new_LoadFrameInterface"}
    record_writers = {"make_tarsel_raster_info_from_base64", "make_tarsel_raster_info_from_bits"}
    unsafe_with_none = record_writers | {"raster_info_to_bytearray"}
    # SWIG's overload dispatch of this operator answers three arguments with
    # NotImplemented while leaving its TypeError set (a SystemError results).
    no_extra_argument = {"SwigPyIterator___sub__"}
    functions = [name for name in module_functions() if name not in NOT_EXERCISED]

    def expect(name, arguments, anything=False):
        try:
            result = call(name, *arguments)
        except refused:
            return
        taken = anything or (name.endswith(operators) and result is NotImplemented)
        assert taken, "%s%r gave %r" % (name, tuple(arguments), result)

    def step():
        for name in functions:
            low, high = arities()[name]
            if name not in no_extra_argument:
                expect(name, [STRANGER] * (high + 1))
            if low > 0:
                expect(name, [])
                if name not in takes_anything and not name.endswith("_swiginit"):
                    expect(name, [STRANGER] * low)
                if name not in unsafe_with_none and not name.endswith("_swiginit"):
                    for count in range(low, high + 1):
                        expect(name, [None] * count, anything=True)

    def cleanup():
        _renderlib.set_error_handler(None)
        _renderlib.set_load_frame_impl(None)
        _renderlib.tarsel_set_gfx_impl(None)

    return step, [], cleanup


# --- The tests --------------------------------------------------------------


def shared_constant(item):
    """Objects the interpreter itself keeps and counts references to."""
    small = (type(item) is int and -5 <= item <= 256) or (type(item) is str and len(item) < 2)
    return item is None or isinstance(item, bool) or small


# Interpreter blocks, C heap bytes and resident KiB in use. A full collection
# empties the interpreter's free lists. The method cache is emptied too: each
# of its 4096 entries keeps the name last looked up through it, and a name
# made for one lookup ("prefix" + "name" here, or a director's method name,
# which SWIG's director calls make afresh on each call) lands in the slot of
# its own address, so the cache holds more of them as the heap shifts, up to
# its size, without any leak.
def memory():
    gc.collect()
    sys._clear_type_cache()
    return sys.getallocatedblocks(), heap_in_use(), resident_kib()


# Runs a family WARM_UP rounds, which fill the engine's and the interpreter's
# caches and pools, then two stretches of ROUNDS rounds. A leak grows memory
# in both stretches alike; the interpreter's own one-off growth (a table that
# doubles) shows in one only.
def check_flat(name, make, helpers, tmp_path):
    _renderlib.tarsel_free_all_stamp_collections()
    before = live_objects()
    call = Calls()
    step, watched, cleanup = make(call, helpers, tmp_path)
    watched = [item for item in watched if not shared_constant(item)]

    def run(rounds):
        for _ in range(rounds):
            step()
            MONITOR.qrv_probe_clear_calls()  # the library's call log has no switch to pause it
        return memory()

    try:
        run(WARM_UP)
        counts, live = [sys.getrefcount(item) for item in watched], live_objects()
        start, middle, end = memory(), run(ROUNDS), run(ROUNDS)
        after = [sys.getrefcount(item) for item in watched]
        moved = ["%s %.60r: %+d" % (type(x).__name__, x, b - a) for x, a, b in zip(watched, counts, after) if b != a]
        assert moved == [], "%s: references gained or lost over %d rounds: %s" % (name, 2 * ROUNDS, moved)
        assert live_objects() == live, "%s: engine or monitor objects left alive" % name
        growth = [[b - a for a, b in zip(earlier, later)] for earlier, later in ((start, middle), (middle, end))]
        (blocks, heap, rss), (more_blocks, more_heap, more_rss) = growth
        grew = "%s: %s grew by %d and %d in the two stretches of %d rounds"
        # A leak of one object, or of one small block of the C heap (32 bytes),
        # a round shows as ROUNDS blocks or ROUNDS * 32 bytes a stretch.
        if MEASURE_MEMORY:
            assert min(blocks, more_blocks) < ROUNDS // 2, grew % (name, "Python's blocks", blocks, more_blocks, ROUNDS)
            assert min(heap, more_heap) < ROUNDS * 16, grew % (name, "the C heap (bytes)", heap, more_heap, ROUNDS)
            assert rss + more_rss < 1024, grew % (name, "resident memory (KiB)", rss, more_rss, ROUNDS)
    finally:
        cleanup()
        MONITOR.qrv_probe_set_init_fails(0)
        MONITOR.qrv_probe_set_no_devices(0)
        ENGINE.abort_next_call(False)
        _renderlib.tarsel_clear_abort()
        _renderlib.tarsel_free_all_stamp_collections()
    step = watched = cleanup = None  # what the family made goes before the next one
    gc.collect()
    assert live_objects() == before, "%s: its objects outlived it" % name


@pytest.fixture(autouse=True)
def quiet_engine():
    """No call log (it would grow with every call), no handler left behind."""
    ENGINE.reset()
    ENGINE.keep_call_log(False)
    yield
    ENGINE.reset()
    _renderlib.set_error_handler(None)


@pytest.mark.parametrize("name", sorted(FAMILIES))
def test_a_family_of_wrappers_leaks_nothing(name, shared_registry, tmp_path):
    check_flat(name, FAMILIES[name], shared_registry, tmp_path)


def test_every_wrapper_is_exercised(shared_registry, tmp_path):
    # Each function of the module has cases of its own in a family; the sweep
    # of argument_errors, which calls every function alike, does not count.
    exercised = set()
    for name, make in FAMILIES.items():
        if name != "argument_errors":
            call = Calls()
            (tmp_path / name).mkdir()
            step, watched, cleanup = make(call, shared_registry, tmp_path / name)
            try:
                step()
            finally:
                cleanup()
            exercised |= call.names
    registered = [name[: -len("_swigregister")] for name in NOT_EXERCISED]
    assert registered and all(isinstance(getattr(renderlib, cls, None), type) for cls in registered)
    assert sorted(set(module_functions()) ^ exercised) == sorted(NOT_EXERCISED)
