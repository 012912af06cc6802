"""Every wrapper of the module, on its success path and on its failure paths,
called over and over: the process's memory stays flat (resident size, the C
heap in use and the interpreter's own blocks), the objects handed to the calls
keep their reference counts, and the engine's and the monitor library's live
objects come back to their counts. A function added to the module without a
case here fails test_every_wrapper_is_exercised."""
import ast
import base64
import ctypes
import gc
import os
import pathlib
import sys

import numpy
import pytest

import _renderlib
import renderlib
from engine_probe import EngineProbe, loaded_library_path
from process_memory import UNDER_ADDRESS_SANITIZER, resident_kib
from renderlib import effects, png

REPO = pathlib.Path(__file__).resolve().parents[2]
STUBS = REPO / "python" / "render-lib" / "_renderlib-stubs" / "__init__.pyi"

# valgrind puts its own libraries in front of the interpreter's; it checks
# memory itself, far more slowly, so a few rounds do there.
UNDER_VALGRIND = "vgpreload" in os.environ.get("LD_PRELOAD", "")
ROUNDS = 3 if UNDER_VALGRIND else 200  # each of the two measured stretches
WARM_UP = 1 if UNDER_VALGRIND else 50  # rounds that fill the caches and pools first
MEASURE_MEMORY = not (UNDER_ADDRESS_SANITIZER or UNDER_VALGRIND)

# Functions of the module no case calls, and why: SWIG's registration of
# each proxy class (<Class>_swigregister), run once as renderlib is imported;
# calling it again would re-register the class.
NOT_EXERCISED = {
    name: "SWIG's registration of the proxy class %s" % name[:-len("_swigregister")]
    for name in dir(_renderlib) if name.endswith("_swigregister")
}


class Stranger:
    """An argument no wrapper takes."""


STRANGER = Stranger()
BIG = 2 ** 40  # outside every 32-bit range


def text(value):
    """A str equal to `value` but not the interned constant, so that its
    reference count belongs to the test alone."""
    return (value + "#")[:-1]


# --- The memory of the C heap, the engine and the monitor library ----------

class _MallInfo2(ctypes.Structure):
    _fields_ = [(name, ctypes.c_size_t) for name in
                ("arena", "ordblks", "smblks", "hblks", "hblkhd", "usmblks", "fsmblks", "uordblks",
                 "fordblks", "keepcost")]


try:
    _mallinfo2 = ctypes.CDLL(None).mallinfo2  # glibc 2.33 and later
    _mallinfo2.restype = _MallInfo2
except (AttributeError, OSError, TypeError):
    _mallinfo2 = None


def heap_in_use():
    """Bytes of the C heap in use (every arena and mapped block); 0 where
    the C library does not tell."""
    if _mallinfo2 is None:
        return 0
    info = _mallinfo2()
    return info.uordblks + info.hblkhd


class MonitorCounts:
    def __init__(self):
        lib = ctypes.CDLL(loaded_library_path("QRVExternalMonitor"))
        lib.qrv_probe_set_init_fails.argtypes = [ctypes.c_int]
        lib.qrv_probe_set_no_devices.argtypes = [ctypes.c_int]
        self.lib = lib

    def live(self):
        return self.lib.qrv_probe_live_displays(), self.lib.qrv_probe_live_images()

    def forget_calls(self):
        """Empties the library's call log, which has no switch to pause it."""
        self.lib.qrv_probe_clear_calls()


ENGINE = EngineProbe()
MONITOR = MonitorCounts()


def live_objects():
    return {"instances": ENGINE.live_instances(), "params": ENGINE.live_params(),
            "stamps": ENGINE.stamp_count(), "displays+images": MONITOR.live()}


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
        self.names.add(name)
        try:
            result = getattr(_renderlib, name)(*args)
        except error:
            return
        raise AssertionError("%s%r gave %r instead of raising %s" % (name, args, result, error))

    def aborted(self, name, *args):
        """The engine fails the call: the probe makes its next entry throw."""
        ENGINE.abort_next_call()
        try:
            self.fails(RuntimeError, name, *args)
        finally:
            armed = ENGINE.abort_armed()
            ENGINE.abort_next_call(False)
        assert not armed, "%s did not reach the engine" % name


def arities():
    """{function: (fewest, most) positional arguments}, from the type stubs."""
    counts = {}
    for node in ast.parse(STUBS.read_text()).body:
        if isinstance(node, ast.FunctionDef):
            positional = node.args.posonlyargs + node.args.args
            low, high = len(positional) - len(node.args.defaults), len(positional)
            if node.name in counts:  # an overload
                low, high = min(low, counts[node.name][0]), max(high, counts[node.name][1])
            counts[node.name] = (low, high)
    return counts


def module_functions():
    return sorted(name for name in dir(_renderlib) if callable(getattr(_renderlib, name)))


def construct(call, cls, *args):
    """A proxy made the way the proxy classes make themselves: new_X, then X_swiginit."""
    proxy = cls.__new__(cls)
    call(cls.__name__ + "_swiginit", proxy, call("new_" + cls.__name__, *args))
    return proxy


def attributes(call, prefix, obj, write=True, keep=()):
    """Reads every `<prefix>*_get` of `obj` and, when `write`, writes back
    what it read through each `<prefix>*_set` (but those named in `keep`),
    refusing a wrong type and, for an int, a value out of range."""
    for name in sorted(dir(_renderlib)):
        if not (name.startswith(prefix) and name.endswith("_get")):
            continue
        value = call(name, obj)
        setter = name[:-len("get")] + "set"
        if write and hasattr(_renderlib, setter) and setter not in keep:
            call(setter, obj, value)
            call.fails(TypeError, setter, obj, STRANGER)
            if isinstance(value, int):
                call.fails(OverflowError, setter, obj, BIG)


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


def nothing():
    pass


RENDER = "render_tarsel_effect_to_native_image"
FLARE = "render_tarsel_lensflare_to_native_image"
LINEAR = text("linear")


def builder_effect_name():
    return effects.catalogue(builder=True)[0].plugin_name


def render_arguments(effect, dest, rasters, images, frame=0):
    return [effect, "", dest, frame, 0, 1, 1, rasters, images, 1.0, len(rasters), 1.0, 0, 0, 0, 25, False,
            LINEAR, LINEAR, LINEAR]


def flare_arguments(effect, dest, rasters, images):
    return [effect, "", 4.0, 4.0, dest, 0, 0, 1, 1, rasters, images, 1.0, len(rasters), 1.0, 0, 0,
            LINEAR, LINEAR, LINEAR, False]


@family
def effect_instances(call, helpers, tmp_path):
    name, builder, unknown = text("T_Glow"), text(builder_effect_name()), text("T_NoSuchEffect")
    kept = call("init_tarsel_effect", name, False)
    saved = text(effects.saved_text(kept))
    broken = text('{"effect": "T_Glow", "params": ')

    def step():
        effect = call("init_tarsel_effect", name, False)
        assert effect is not None
        assert call("EffectGlobals_t_plugin_name_get", effect) == name
        assert call("EffectGlobals_t_n_effects_get", effect) >= 1
        call("EffectGlobals_t_effect_genotype_get", effect)
        call("EffectGlobals_t__get_genotypes", effect)
        assert call("EffectGlobals_t__get_shared_params", effect)
        assert call("EffectGlobals_t___eq__", effect, effect) is True
        assert call("EffectGlobals_t___ne__", effect, kept) is True
        assert call("EffectGlobals_t___eq__", effect, STRANGER) is NotImplemented
        assert call("EffectGlobals_t___ne__", effect, STRANGER) is NotImplemented
        call("EffectGlobals_t___hash__", effect)
        call("EffectGlobals_t___repr__", effect)
        call("tarsel_effect_is_time_varying", effect, name, 0)
        call.fails(OverflowError, "tarsel_effect_is_time_varying", effect, name, BIG)
        call("tarsel_get_gpu_status", effect)
        call("tarsel_get_gpu_status", None)
        call("free_tarsel_effect", effect)
        assert not effect.thisown
        again = call("init_tarsel_effect_from_string", saved)
        assert again is not None
        call("delete_EffectGlobals_t", again)
        dropped = call("init_tarsel_effect", builder, True)
        assert dropped is not None
        del dropped  # freed by its proxy
        assert call("init_tarsel_effect", unknown, False) is None
        assert call("init_tarsel_effect_from_string", broken) is None
        assert call("init_tarsel_effect_from_string", None) is None
        call.fails(TypeError, "init_tarsel_effect", name, 1)  # booleans are strict
        call.fails(TypeError, "init_tarsel_effect", name)
        call.fails(TypeError, "init_tarsel_effect_from_string", 5)
        call.aborted("init_tarsel_effect", name, False)
        call.aborted("init_tarsel_effect_from_string", saved)
        call("free_tarsel_effect", None)
        call.fails(TypeError, "free_tarsel_effect", STRANGER)
        call.fails(TypeError, "EffectGlobals_t__get_genotypes", kept.effect_genotype)
        call.fails(ValueError, "EffectGlobals_t_plugin_name_get", None)

    return step, [name, builder, unknown, kept, saved, broken], lambda: call("free_tarsel_effect", kept)


@family
def catalogue(call, helpers, tmp_path):
    def step():
        for count_of, entry in (("get_n_tarsel_effects", "get_tarsel_plugin_info_i"),
                                ("get_n_tarsel_builder_effects", "get_tarsel_builder_info_i")):
            count = call(count_of)
            assert count > 0
            for i in range(count):
                attributes(call, "Plugin_Info_", call(entry, i))
            assert call(entry, count) is None and call(entry, -1) is None
            call.fails(OverflowError, entry, BIG)
            call.fails(TypeError, entry, 0.0)
            call.fails(TypeError, count_of, 0)
        made = construct(call, renderlib.Plugin_Info)
        attributes(call, "Plugin_Info_", made)
        call("delete_Plugin_Info", made)
        call.fails(TypeError, "delete_Plugin_Info", STRANGER)

    return step, [], nothing


def engine_genotypes(call, builder_too=True):
    names = [(text("T_Glow"), False), (text("T_LensFlare"), False)]
    if builder_too:
        names.append((text(builder_effect_name()), True))
    made = [call("init_tarsel_effect", name, builder) for name, builder in names]
    return made, [genotype for effect in made for genotype in effect._get_genotypes()]


@family
def genotypes(call, helpers, tmp_path):
    made, genotypes = engine_genotypes(call)
    collected = []
    collector = helpers.object_address(collected)
    flags = 0x20000

    def step():
        for genotype in genotypes:
            attributes(call, "Genotype_", genotype)
            call("Genotype__get_input_names", genotype)
            call("Genotype__get_canonical_input_names", genotype)
            params = call("Genotype__get_params", genotype)
            for param in params[:3]:
                call("Genotype_get_param_group_name", genotype, param)
            call.fails(TypeError, "Genotype_get_param_group_name", genotype, genotype)
            call("Genotype__uses_host_data", genotype)
            call("Genotype__has_flare_param", genotype)
            call("Genotype__has_glare_param", genotype)
            assert call("Genotype___eq__", genotype, genotype) is True
            assert call("Genotype___ne__", genotype, STRANGER) is NotImplemented
            call("Genotype___hash__", genotype)
            call("Genotype___repr__", genotype)
            call("tarsel_any_nodes_get_flag", genotype, flags)
            info = call("Genotype_effect_info_get", genotype)
            if info is not None:
                call("effect_def_name_get", info)
                call("effect_def_input_names_get", info)
                call("effect_def_input_optional_p_get", info)
                call("effect_def_arg_names_get", info)
                call("effect_def_get_arg_hardcoded_values", info)
            assert call("add_param_to_list", genotype, 0, collector) == 0
            assert call("add_param_to_list", genotype, 10_000, collector) == 0
            collected.clear()
        call.fails(TypeError, "add_param_to_list", genotypes[0], 0, collected)
        call.fails(OverflowError, "add_param_to_list", genotypes[0], BIG, collector)
        call.fails(TypeError, "tarsel_any_nodes_get_flag", STRANGER, 0)
        call.fails(OverflowError, "tarsel_any_nodes_get_flag", genotypes[0], BIG)
        call.fails(TypeError, "effect_def_name_get", genotypes[0])
        call.fails(ValueError, "Genotype_name_get", None)
        blank = construct(call, renderlib.Genotype)
        attributes(call, "Genotype_", blank)
        assert call("Genotype__get_params", blank) == ()
        call("delete_Genotype", blank)

    def cleanup():
        for effect in made:
            call("free_tarsel_effect", effect)

    return step, made + genotypes + [collected, collector], cleanup


def sample_params(genotypes):
    """A few parameters of every type, and each kind of special one."""
    chosen, seen = [], {}
    for genotype in genotypes:
        for param in genotype._get_params():
            key = (param.ptype, param.n_channels, bool(param.flags.fromfile_popup_p), param.is_point())
            if seen.get(key, 0) < 2:
                seen[key] = seen.get(key, 0) + 1
                chosen.append(param)
    return chosen


@family
def params(call, helpers, tmp_path):
    made, genotypes = engine_genotypes(call)
    params = sample_params(genotypes)
    bounds = [renderlib.ValueArray() for _ in range(4)]
    pointers = [values.data for values in bounds]
    title = text(" " * 255)
    label = text("Radius")

    def step():
        for param in params:
            # An engine parameter keeps its name: the engine owns that text.
            attributes(call, "Param_", param, keep={"Param_name_set"})
            attributes(call, "ParamFlags_", call("Param_flags_get", param))
            for values in (call("Param_default_value_get", param), call("Param_old_default_value_get", param)):
                assert call("ValueArray___len__", values) == 4
                call("ValueArray___setitem__", values, 0, call("ValueArray___getitem__", values, 0))
            call("Param_numeric_p", param)
            call("Param_format", param)
            call("Param_needs_old_default", param, 1.0)
            call("Param_maybe_set_to_old_default", param, None, 1.0)
            call("Param_maybe_set_to_old_default", param, None, 1.0, 0)
            call("Param_to_string", param, None)
            call("Param_to_string", param, None, True)
            call("Param_to_string_const", param, None)
            call("Param_ptype_name", param)
            call("Param_get_canonical_name", param)
            call("Param_get_titles", param)
            call("Param_get_limits", param)
            call("Param_get_state_names", param)
            call("Param_get_fromfile_popup_names", param)
            call("Param_is_point", param)
            assert call("Param___eq__", param, param) is True
            assert call("Param___ne__", param, STRANGER) is NotImplemented
            call("Param___hash__", param)
            call("Param___repr__", param)
            call("tarsel_param_to_string", param)
            call("tarsel_get_param_title", param, 0, title, 256)
            call("tarsel_get_fromfile_popup_names", param, None)
            call("tarsel_get_param_bounds2", param, 1.0, 0, *pointers, 0)
        param = params[0]
        call.fails(TypeError, "Param_to_string", param, None, 1)
        call.fails(TypeError, "Param_to_string", param, STRANGER)
        call.fails(TypeError, "Param_to_string_const", param, None, 1)
        call.fails(TypeError, "Param_needs_old_default", param, "1")
        call.fails(TypeError, "Param_maybe_set_to_old_default", param, None, 1.0, -1)
        call.fails(OverflowError, "tarsel_get_param_title", param, 0, title, -1)
        call.fails(TypeError, "tarsel_get_param_bounds2", param, "1", 0, *pointers, 0)
        call.fails(TypeError, "tarsel_get_param_bounds2", param, 1.0, 0, *pointers)
        call.fails(TypeError, "tarsel_get_fromfile_popup_names", param, [])
        call.fails(TypeError, "tarsel_param_to_string", STRANGER)
        call.fails(ValueError, "Param_get_titles", None)
        call.fails(TypeError, "Param_flags_get", STRANGER)
        call("tarsel_param_to_string", None)
        # Parameters a host makes: every constructor overload, every setter.
        for arguments in ((label, _renderlib.ptype_float), (label, _renderlib.ptype_float, 2),
                          (label, _renderlib.ptype_float, 2, _renderlib.screen_mode_screen_center)):
            own = construct(call, renderlib.Param, *arguments)
            attributes(call, "Param_", own)
            call("Param_name_set", own, label)
            call("Param_name_set", own, None)
            call.fails(OverflowError, "Param_n_channels_set", own, 256)
            call("delete_Param", own)
        call.fails(TypeError, "new_Param")
        call.fails(TypeError, "new_Param", label, 1.0)
        call.fails(TypeError, "new_Param", label, 1, 1, 0, 0)
        flags = construct(call, renderlib.ParamFlags)
        attributes(call, "ParamFlags_", flags)
        call("delete_ParamFlags", flags)

    def cleanup():
        for effect in made:
            call("free_tarsel_effect", effect)

    return step, made + params + bounds + pointers + [title, label], cleanup


@family
def value_arrays(call, helpers, tmp_path):
    made, genotypes = engine_genotypes(call, builder_too=False)
    inputs = [call("Genotype_input_optional_p_get", genotype) for genotype in genotypes]

    def step():
        for cls, value, wrong in ((renderlib.ValueArray, 1.5, 1e39), (renderlib.ShortInputArray, 7, 32768)):
            prefix = cls.__name__ + "_"
            array, other = construct(call, cls), construct(call, cls)
            assert call(prefix + "__len__", array) > 0
            call(prefix + "__setitem__", array, 1, value)
            assert call(prefix + "__getitem__", array, 1) == value
            call(prefix + "data_set", other, call(prefix + "data_get", array))
            call.fails(IndexError, prefix + "__getitem__", array, 8)
            call.fails(IndexError, prefix + "__setitem__", array, 8, value)
            call.fails(OverflowError, prefix + "__getitem__", array, -1)
            call.fails(OverflowError, prefix + "__setitem__", array, 0, wrong)
            call.fails(TypeError, prefix + "__setitem__", array, 0, "1")
            call.fails(ValueError, prefix + "data_set", array, None)
            call.fails(TypeError, prefix + "data_set", array, [value])
            call.fails(TypeError, prefix + "__len__", STRANGER)
            call("delete_" + cls.__name__, array)
            call("delete_" + cls.__name__, other)
        for shorts in inputs:
            for i in range(call("ShortInputArray___len__", shorts)):
                call("ShortInputArray___getitem__", shorts, i)

    def cleanup():
        for effect in made:
            call("free_tarsel_effect", effect)

    return step, made + inputs, cleanup


@family
def raster_descriptors(call, helpers, tmp_path):
    bits, short_bits, raw_bits = text("A" * 104 + "ignored"), text("A" * 103), b"A" * 104
    encoded = text(base64.b64encode(bytes(range(1, 105))).decode())
    three = text("QUJD")
    decoded = bytearray(120)
    decoded_at = helpers.byte_address(decoded, 0)
    contexts = [helpers.context_handle(0), helpers.context_handle(1)]
    # Neither the record nor the text is given as None to the two record
    # writers: they pass it on to memcpy and strlen unchecked.

    def step():
        info = construct(call, renderlib.T_RasterInfo)
        attributes(call, "T_RasterInfo_", info)
        call("T_RasterInfo_pixel_type_set", info, _renderlib.pixel_rgba8)
        assert call("make_tarsel_raster_info", info, 10, 5) == 200
        call("T_RasterInfo_pixel_type_set", info, 27)  # no such layout
        assert call("make_tarsel_raster_info", info, 10, 5) == 0
        call.fails(OverflowError, "make_tarsel_raster_info", info, BIG, 5)
        call("tarsel_get_native_image_dims", info)
        call("tarsel_get_native_image_dims", None)
        assert len(call("raster_info_to_bytearray", info)) == 104
        call.fails(TypeError, "raster_info_to_bytearray", STRANGER)
        call("make_tarsel_raster_info_from_bits", info, bits)
        call.fails(ValueError, "make_tarsel_raster_info_from_bits", info, short_bits)
        call.fails(TypeError, "make_tarsel_raster_info_from_bits", info, raw_bits)
        call("make_tarsel_raster_info_from_base64", info, encoded)
        call.fails(TypeError, "make_tarsel_raster_info_from_base64", info, 5)
        call.fails(TypeError, "make_tarsel_raster_info_from_base64", STRANGER, encoded)
        call("delete_T_RasterInfo", info)
        call.fails(TypeError, "delete_T_RasterInfo", STRANGER)
        render_info = construct(call, renderlib.T_RenderInfo)
        attributes(call, "T_RenderInfo_", render_info)
        call("delete_T_RenderInfo", render_info)
        call("base64decode", encoded, decoded_at, 120)
        call("base64decode", three, None, 0)
        call.fails(TypeError, "base64decode", three, decoded, 4)
        call.fails(OverflowError, "base64decode", three, decoded_at, BIG)
        first, second = contexts
        assert call("RenderContext___eq__", first, first) is True
        assert call("RenderContext___ne__", first, second) is True
        assert call("RenderContext___eq__", first, 3) is NotImplemented
        call("RenderContext___hash__", first)
        call.fails(ValueError, "delete_RenderContext", None)
        call.fails(TypeError, "delete_RenderContext", STRANGER)

    return step, [bits, short_bits, raw_bits, encoded, three, decoded, decoded_at] + contexts, \
        nothing


@family
def renders(call, helpers, tmp_path):
    gradient = call("init_tarsel_effect", text("T_Gradient"), False)
    blur = call("init_tarsel_effect", text("T_Blur"), False)
    flare = call("init_tarsel_effect", text("T_LensFlare"), False)
    dest_info, dest = effects.raster(_renderlib.pixel_rgba8, 8, 8)
    source_info, source = effects.raster(_renderlib.pixel_rgba8, 8, 8)
    float_info, _ = effects.raster(_renderlib.pixel_rgbaf, 8, 8)
    array = numpy.zeros((8, 8, 4), numpy.float32)
    rasters, images = [dest_info, source_info], [None, source]
    alone, nothing_in = [dest_info], [None]
    floats = [float_info]
    wrong_rasters, wrong_images = (dest_info, source_info), [None, 5]
    other_record = renderlib.T_RenderInfo()
    blurred = render_arguments(blur, dest, rasters, images)

    def step():
        assert call(RENDER, *blurred) is True
        assert call(RENDER, *render_arguments(gradient, dest, alone, nothing_in)) is True
        assert call(RENDER, *render_arguments(gradient, array, floats, nothing_in)) is True
        assert call(FLARE, *flare_arguments(flare, dest, alone, nothing_in)) is True
        for name, arguments in ((RENDER, render_arguments), (FLARE, flare_arguments)):
            call.fails(TypeError, name, *arguments(blur, "pixels", rasters, images))
            call.fails(TypeError, name, *arguments(blur, dest, wrong_rasters, images))
            call.fails(TypeError, name, *arguments(blur, dest, rasters, wrong_images))
            call.fails(TypeError, name, *arguments(blur, dest, [other_record], nothing_in))
            call.fails(TypeError, name, *arguments(STRANGER, dest, rasters, images))
            call.fails(TypeError, name, *arguments(blur, dest, rasters, images)[:-1])
            call.aborted(name, *arguments(blur, dest, rasters, images))
        call.fails(OverflowError, RENDER, *render_arguments(blur, dest, rasters, images, frame=BIG))
        call("tarsel_abort_render")
        call.fails(RuntimeError, RENDER, *blurred)
        call("tarsel_clear_abort")
        call.fails(TypeError, "tarsel_abort_render", 1)
        call.fails(TypeError, "tarsel_clear_abort", 1)
        assert call(RENDER, *blurred) is True

    def cleanup():
        for effect in (gradient, blur, flare):
            call("free_tarsel_effect", effect)

    return step, [gradient, blur, flare, dest_info, dest, source_info, source, float_info, array, rasters, images,
                  alone, nothing_in, floats, wrong_rasters, wrong_images, other_record, LINEAR], cleanup


@family
def image_services(call, helpers, tmp_path):
    source_info, source = effects.raster(_renderlib.pixel_rgbaf, 2, 1)
    source[:] = numpy.array([0, 0, 0, 1, 1, 1, 1, 1], numpy.float32).tobytes()
    size = _renderlib.tarsel_get_resized_image_size(source_info, 8, 1, 0, 0, 1.0, 0)
    dest_info, dest = renderlib.T_RasterInfo(), bytearray(size)
    shown, empty = bytearray(8), text("")
    effect = call("init_tarsel_effect", text("T_Glow"), False)
    lut = tmp_path / "gamma.lut"
    lut.write_text("\n".join("%.6f" % ((i / 255) ** (1 / 2.2)) for i in range(256)))
    lut_path, missing = text(str(lut)), text(str(tmp_path / "missing.lut"))
    messages = [0]

    def count(level, message):
        messages[0] += 1

    def step():
        assert call("tarsel_get_resized_image_size", source_info, 8, 1, 0, 0, 1.0, 0) == size
        call.fails(TypeError, "tarsel_get_resized_image_size", source_info, 8, 1, 0, 0, "1", 0)
        assert call("tarsel_resize_native_image", source_info, source, 8, 1, 0, 0, 1.0, dest_info, dest,
                    1, 0.0, 0.0, 0.0) == [8, 1]
        call.fails(TypeError, "tarsel_resize_native_image", source_info, source, 8, 1, 0, 0, 1.0, dest_info, "d",
                   1, 0.0, 0.0, 0.0)
        call.fails(TypeError, "tarsel_resize_native_image", source_info, source, 8, 1, 0, 0, 1.0, dest_info, dest,
                   1, 0.0, 0.0)
        call.fails(OverflowError, "tarsel_resize_native_image", source_info, source, BIG, 1, 0, 0, 1.0, dest_info,
                   dest, 1, 0.0, 0.0, 0.0)
        for instance in (None, effect):
            call("tarsel_convert_to_bgra_8", instance, source_info, source, shown, _renderlib.RGBA_OK, 0, 0,
                 LINEAR, LINEAR)
        call.fails(TypeError, "tarsel_convert_to_bgra_8", None, source_info, source, shown, 1, 0, 0, 5, LINEAR)
        call.fails(TypeError, "tarsel_convert_to_bgra_8", None, source_info, "pixels", shown, 1, 0, 0,
                   LINEAR, LINEAR)
        call("tarsel_comp_bgra_8", shown, 2, 1, 8, -16711936, 0)
        call.fails(TypeError, "tarsel_comp_bgra_8", "pixels", 2, 1, 8, 0, 0)
        call.fails(OverflowError, "tarsel_comp_bgra_8", shown, 2, 1, 8, BIG, 0)
        call("set_error_handler", count)
        call("set_tarsel_luts", lut_path, empty, 1.0)
        call("set_tarsel_luts", missing, empty, 1.0)  # reported to the handler
        call("set_error_handler", None)
        call.fails(TypeError, "set_tarsel_luts", empty, empty, "1")
        call("get_ocio_path")
        call.fails(TypeError, "get_ocio_path", 1)

    def cleanup():
        _renderlib.set_tarsel_luts("", "", 1.0)
        call("free_tarsel_effect", effect)

    return step, [source_info, source, dest_info, dest, shown, effect, lut_path, missing, messages, count, LINEAR], \
        cleanup


@family
def flare_textures(call, helpers, tmp_path):
    pixels, out, wrong_out = bytearray(range(16)), bytearray(16), bytearray(1)
    path = tmp_path / "spot.png"
    png.write_rgba8(path, bytes(8 * 8 * 4), 8, 8)
    spot, missing = text(str(path)), text(str(tmp_path / "missing.png"))

    def step():
        index = call("tarsel_register_flare_texture", 2, 2, 4, 1, pixels)
        assert index >= 0 and call("tarsel_get_flare_texture_error") is None
        assert call("tarsel_get_texture_info", index)[0] == 0
        assert call("tarsel_get_texture_pixels", index, out) == 16
        call.fails(TypeError, "tarsel_get_texture_pixels", index, 16)
        call.fails(TypeError, "tarsel_register_flare_texture", 2, 2, 4, 1, "pixels")
        call.fails(TypeError, "tarsel_register_flare_texture", 2, 2, 4.0, 1, pixels)
        call.fails(OverflowError, "tarsel_register_flare_texture", BIG, 2, 4, 1, pixels)
        assert call("tarsel_load_flare_texture", spot) >= 0
        assert call("tarsel_load_flare_texture", missing) < 0
        assert call("tarsel_get_flare_texture_error")
        assert call("tarsel_load_flare_texture", None) < 0
        call.fails(TypeError, "tarsel_load_flare_texture", path)
        call("tarsel_free_all_flare_textures")
        assert call("tarsel_get_texture_info", index)[0] != 0
        assert call("tarsel_get_texture_pixels", index, wrong_out) < 0
        call.fails(OverflowError, "tarsel_get_texture_info", BIG)
        call.fails(TypeError, "tarsel_free_all_flare_textures", 0)

    return step, [pixels, out, wrong_out, spot, missing, path], lambda: _renderlib.tarsel_free_all_flare_textures()


class QuietDrawing(renderlib.GfxInterface):
    """A graphics object that draws nothing and keeps nothing."""

    def set_graphics_context(self, context):
        pass

    def start_drawing(self, mode):
        pass

    def end_drawing(self):
        pass

    def begin_line(self):
        pass

    def end_line(self):
        pass

    def line(self, x1, y1, x2, y2):
        pass

    def lines(self, xs, ys):
        pass

    def color_3f(self, red, green, blue):
        pass

    def stipple_on(self):
        pass

    def stipple_off(self):
        pass

    def stipple_pattern(self, pattern):
        pass

    def line_width(self, width):
        pass

    def flush(self):
        pass

    def circle(self, x, y, r):
        pass

    def dot(self, x, y, size):
        pass

    def rect_filled(self, x1, y1, x2, y2):
        pass

    def draw_text(self, text, x, y):
        pass

    def get_text_length_in_pixels(self, text):
        return 6 * len(text)


class WrongResult(QuietDrawing):
    def get_text_length_in_pixels(self, text):
        return "wide"


class RaisingDrawing(QuietDrawing):
    def circle(self, x, y, r):
        raise KeyError("the host's own error")


@family
def drawing_callbacks(call, helpers, tmp_path):
    drawing, wrong, raising = QuietDrawing(), WrongResult(), RaisingDrawing()
    xs, ys = renderlib.float_vector([1, 2]), renderlib.float_vector([3, 4])
    flare = call("init_tarsel_effect", text("T_LensFlare"), False)
    words, empty = text("abcd"), text("")
    values, short_values = renderlib.float_vector([96, 54, 0]), [96.0, 54.0]
    view = (96, 54, 0.0, 0.0, 0.5, 0.5)
    drawing_calls = [("set_graphics_context", (None,)), ("set_graphics_context", (xs,)), ("start_drawing", (1,)),
                     ("end_drawing", ()), ("begin_line", ()), ("end_line", ()), ("line", (1, 2, 3.5, 4)),
                     ("lines", (xs, ys)), ("color_3f", (1.0, 0.5, 0.0)), ("stipple_on", ()), ("stipple_off", ()),
                     ("stipple_pattern", (0xF0F0,)), ("line_width", (2.0,)), ("flush", ()), ("circle", (1, 2, 3)),
                     ("dot", (1, 2, 3)), ("rect_filled", (1, 2, 3, 4)), ("draw_text", (words, 5, 6)),
                     ("get_text_length_in_pixels", (words,))]

    def step():
        for method, arguments in drawing_calls:
            call("GfxInterface_" + method, drawing.this, *arguments)
        call.fails(TypeError, "GfxInterface_get_text_length_in_pixels", wrong.this, words)
        call.fails(KeyError, "GfxInterface_circle", raising.this, 1, 2, 3)
        call.fails(RuntimeError, "GfxInterface_line", drawing, 0, 0, 1, 1)  # the abstract base's own
        call.fails(OverflowError, "GfxInterface_stipple_pattern", drawing.this, 65536)
        call.fails(ValueError, "GfxInterface_lines", drawing.this, None, ys)
        call.fails(TypeError, "GfxInterface_lines", drawing.this, [1.0], ys)
        call.fails(TypeError, "GfxInterface_set_graphics_context", drawing.this, STRANGER)
        call.fails(TypeError, "GfxInterface_draw_text", drawing.this, 5, 0, 0)
        # Construction as the proxy does it, and hand-over to the native side.
        fresh = QuietDrawing.__new__(QuietDrawing)
        call("GfxInterface_swiginit", fresh, call("new_GfxInterface", fresh))
        call("GfxInterface_flush", fresh.this)
        del fresh
        handed = QuietDrawing()
        call("disown_GfxInterface", handed)
        call("delete_GfxInterface", handed)
        call.fails(RuntimeError, "new_GfxInterface", None)
        call.fails(TypeError, "delete_GfxInterface", STRANGER)
        call("tarsel_set_gfx_impl", drawing)
        call("tarsel_widget_draw", flare, empty, *view, values)
        call("tarsel_widget_draw", flare, empty, *view, short_values)
        call("tarsel_widget_mouse_event", flare, empty, *view, values, 10, 10, _renderlib.MouseEventType_PRESS)
        call("tarsel_widget_mouse_event", flare, empty, *view, short_values, 10, 10, _renderlib.MouseEventType_DRAG)
        call("tarsel_set_gfx_impl", None)
        call.fails(TypeError, "tarsel_set_gfx_impl", STRANGER)
        call.fails(TypeError, "tarsel_widget_draw", flare, empty, *view, 5)
        call.fails(OverflowError, "tarsel_widget_mouse_event", flare, empty, *view, values, BIG, 10, 0)
        call.fails(TypeError, "tarsel_widget_mouse_event", flare, empty, *view, values, 10, 10)

    def cleanup():
        _renderlib.tarsel_set_gfx_impl(None)
        call("free_tarsel_effect", flare)

    return step, [drawing, drawing.this, wrong, wrong.this, raising, raising.this, xs, ys, flare, words, values,
                  short_values], cleanup


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
def frame_callbacks(call, helpers, tmp_path):
    frame = effects.raster(_renderlib.pixel_rgbaf, 16, 8)
    dest, current = effects.raster(_renderlib.pixel_rgbaf, 16, 8), effects.raster(_renderlib.pixel_rgbaf, 16, 8)
    source, missing, not_a_descriptor = StillSource(frame), MissingSource(frame), NotADescriptor(frame)
    echo = effects.recreate(call("init_tarsel_effect", text("T_Echo"), False), {"echoes": "2"})
    rasters, images = [dest[0], current[0]], [None, current[1]]
    echoed = render_arguments(echo, dest[1], rasters, images)

    def step():
        call("set_load_frame_impl", source)
        assert call(RENDER, *echoed) is True
        call("set_load_frame_impl", missing)
        call.fails(RuntimeError, RENDER, *echoed)
        call("set_load_frame_impl", None)
        call.fails(TypeError, "set_load_frame_impl", STRANGER)
        assert call("LoadFrameInterface_load_frame", source.this, 0, 0, 16, 8) is frame[1]
        call("LoadFrameInterface_current_raster_info", source.this, 0)
        call.fails(ValueError, "LoadFrameInterface_load_frame", missing.this, 0, 0, 16, 8)
        call.fails(TypeError, "LoadFrameInterface_current_raster_info", not_a_descriptor.this, 0)
        call.fails(TypeError, "LoadFrameInterface_load_frame", source.this, 0, 0, "1", 1)
        call.fails(RuntimeError, "LoadFrameInterface_load_frame", source, 0, 0, 0, 0)  # the abstract base's own
        call.fails(OverflowError, "LoadFrameInterface_current_raster_info", source.this, BIG)
        fresh = StillSource.__new__(StillSource)
        call("LoadFrameInterface_swiginit", fresh, call("new_LoadFrameInterface", fresh))
        del fresh
        handed = StillSource(frame)
        call("disown_LoadFrameInterface", handed)
        call("delete_LoadFrameInterface", handed)
        call.fails(RuntimeError, "new_LoadFrameInterface", None)
        call.fails(TypeError, "disown_LoadFrameInterface", STRANGER)

    def cleanup():
        _renderlib.set_load_frame_impl(None)
        _renderlib.free_tarsel_effect(echo)

    return step, [frame, frame[0], frame[1], dest[1], current[1], source, missing, not_a_descriptor, echo, rasters,
                  images], cleanup


@family
def engine_controls(call, helpers, tmp_path):
    heard = [0]

    def handler(level, message):
        heard[0] += 1

    me, someone = text("S-1-22-1-%d" % os.geteuid()), text("S-1-22-1-%d" % (os.geteuid() + 1))
    note = "leak check"

    def step():
        call("set_error_handler", handler)
        ENGINE.emit_here(_renderlib.Err_Info, note)
        ENGINE.emit_from_worker(2, _renderlib.Err_Warning, note)
        call.fails(TypeError, "set_error_handler", STRANGER)
        call.fails(TypeError, "set_error_handler")
        call("set_error_handler", None)
        call("tarsel_free_all_stamp_collections")
        call("tarsel_shutdown_apps")
        call.fails(TypeError, "tarsel_shutdown_apps", 1)
        call.fails(TypeError, "tarsel_free_all_stamp_collections", 1)
        call("get_tarsel_version_info")
        ENGINE.set_version_text(b"engine \xff\xfe")
        call("get_tarsel_version_info")
        ENGINE.set_version_text(None)
        call("ext_build_id")
        call("get_tarsel_build_id")
        assert call("check_build_id") is True
        assert call("check_user", me) is True
        assert call("check_user", someone) is False
        assert call("check_user", None) is False
        call.fails(TypeError, "check_user", 5)
        for name in ("get_tarsel_version_info", "ext_build_id", "get_tarsel_build_id", "check_build_id"):
            call.fails(TypeError, name, 1)
        for error in range(7):
            call("shmem_error_to_string", error)
        call.fails(OverflowError, "shmem_error_to_string", BIG)
        call.fails(TypeError, "shmem_error_to_string", "1")
        call("SWIG_PyInstanceMethod_New", handler)

    def cleanup():
        _renderlib.set_error_handler(None)
        ENGINE.set_version_text(None)

    return step, [handler, heard, me, someone], cleanup


@family
def shared_memory(call, helpers, tmp_path):
    name, other = text("rlleak-%d-a" % os.getpid()), text("rlleak-%d-b" % os.getpid())
    missing, bad = text("rlleak-%d-missing" % os.getpid()), text("a/b")
    message, payload, sixteen = text("a message"), bytes(range(100)), bytes(range(16))
    description = text("leak check")
    oversized = 1 << 20

    def read_all(client, expected):
        readers = [("ShmemTransport_read_pybuf",), ("ShmemTransport_try_read_pybuf",),
                   ("ShmemTransport_timed_read_pybuf", 1.0), ("ShmemTransport_read_pybuf_and_retry", 1.0)]
        for i in range(expected):
            header = call("ShmemTransport_get_msg_header", client)
            assert header is not None
            attributes(call, "MessageHeader_t_", header)
            reader = readers[i % len(readers)]
            view = call(reader[0], client, *reader[1:])
            assert view is not None, reader
            bytes(view)
            del view, header

    def step():
        server = call("ShmemManager_serve", name, 1 << 16, 1 << 16)
        client = call("ShmemManager_connect", name)
        assert server is not None and client is not None
        assert call("ShmemTransport_write_string", server, message)
        assert call("ShmemTransport_write_string", server, message, description)
        assert call("ShmemTransport_try_write_string", server, message)
        assert call("ShmemTransport_timed_write_string", server, message, 1.0, description)
        assert call("ShmemTransport_write_pybuf", server, payload)
        assert call("ShmemTransport_try_write_pybuf", server, payload, description)
        assert call("ShmemTransport_timed_write_pybuf", server, payload, 1.0)
        for reserve, extra in (("ShmemTransport_reserve_pybuf", ()), ("ShmemTransport_try_reserve_pybuf", ()),
                               ("ShmemTransport_timed_reserve_pybuf", (1.0,))):
            view = call(reserve, server, 16, *extra, description)
            view[:] = sixteen
            del view
            assert call("ShmemTransport_commit", server)
        read_all(client, 10)
        assert call("ShmemTransport_try_read_pybuf", client) is None
        assert call("ShmemTransport_timed_read_pybuf", client, 0.0) is None
        assert call("ShmemTransport_get_msg_header", client) is None
        assert call("ShmemTransport_get_last_error", client) != _renderlib.ShmemError_SHMEM_NO_ERROR
        assert call("ShmemTransport_try_reserve_pybuf", server, oversized) is None
        assert not call("ShmemTransport_try_write_pybuf", server, bytes(oversized))
        assert call("ShmemTransport_is_segment_valid", client)
        assert call("ShmemTransport_client_pid_exists", server)
        call("ShmemTransport_print_stats", server)
        # A message without the buffer protocol: a SystemError caused by the TypeError.
        call.fails(SystemError, "ShmemTransport_write_pybuf", server, STRANGER)
        call.fails(SystemError, "ShmemTransport_try_write_pybuf", server, 5)
        call.fails(SystemError, "ShmemTransport_timed_write_pybuf", server, message, 1.0)
        call.fails(TypeError, "ShmemTransport_write_string", server, 5)
        call.fails(TypeError, "ShmemTransport_timed_read_pybuf", client, "1")
        call.fails(TypeError, "ShmemTransport_reserve_pybuf", server, -1)  # overloaded: no match
        call.fails(TypeError, "ShmemTransport_commit", STRANGER)
        call.fails(ValueError, "ShmemTransport_get_last_error", None)
        assert call("ShmemManager_serve", name, 1 << 16, 1 << 16) is None  # served already
        assert call("ShmemManager_serve", other, 16, 16) is None  # queues too small
        assert call("ShmemManager_serve", bad, 1 << 16, 1 << 16) is None
        assert call("ShmemManager_connect", missing) is None
        assert call("ShmemManager_connect", None) is None
        call.fails(OverflowError, "ShmemManager_serve", other, -1, 1)
        call.fails(TypeError, "ShmemManager_serve", other, 1)
        call.fails(TypeError, "ShmemManager_connect", 5)
        call.fails(TypeError, "ShmemManager_reset_all", 1)
        call.fails(TypeError, "ShmemManager_reset", name, False, 3)
        assert call("ShmemTransport_remove", server)
        client.this.disown()
        call("free_tarsel_ipc_shmemtransport", client)
        call("free_tarsel_ipc_shmemtransport", None)
        call("delete_ShmemTransport", server)
        call("ShmemManager_reset", name)
        call("ShmemManager_reset", name, True)
        call("ShmemManager_reset", missing, True)
        call("ShmemManager_reset_all")
        call("ShmemManager_reset_all", False)
        dropped = call("ShmemManager_serve", name, 1 << 16, 1 << 16)
        assert call("ShmemTransport_remove", dropped)
        del dropped  # freed by its proxy
        manager = construct(call, renderlib.ShmemManager)
        call("delete_ShmemManager", manager)
        header = construct(call, renderlib.MessageHeader_t)
        attributes(call, "MessageHeader_t_", header)
        call("delete_MessageHeader_t", header)

    def cleanup():
        for segment in (name, other):
            _renderlib.ShmemManager_reset(segment, True)

    return step, [name, other, missing, bad, message, payload, sixteen, description], cleanup


@family
def server_process_id(call, helpers, tmp_path):
    # An opaque pid_t pointer: SWIG would hand out a new pid_t it has no
    # destructor for; the module's interned copy is owned by nobody.
    name = text("rlleak-%d-pid" % os.getpid())
    server = _renderlib.ShmemManager_serve(name, 1 << 16, 1 << 16)

    def step():
        call("ShmemTransport_get_server_pid", server)
        call.fails(TypeError, "ShmemTransport_get_server_pid", STRANGER)

    def cleanup():
        server.remove()
        _renderlib.ShmemManager_reset(name, True)

    return step, [name, server], cleanup


@family
def monitor(call, helpers, tmp_path):
    preview, nowhere, mode = text("preview"), text("nowhere"), text("640x360p25")
    pixels, frame_name = bytearray(8 * 4 * 4), text("leak check")
    frame = bytearray(640 * 360 * 4)

    def wrap(display, *changes):
        arguments = [display, pixels, 8, 4, 32, frame_name, False, _renderlib.EM_ImageFormat_32BitIntBGRA,
                     1.0, 2.2, False, True]
        for at, value in changes:
            arguments[at] = value
        return call("EM_Display_EM_XIImageWrapper", *arguments)

    def step():
        display = call("EM_DisplayInit")
        assert call("EM_Display_devices", display)
        assert call("EM_Display_device_modes", display, preview)
        assert call("EM_Display_device_modes", display, nowhere) == []
        assert call("EM_Display_connect", display, preview, mode) == _renderlib.EM_errorNone
        assert call("EM_Display_get_width", display, preview) == 640
        assert call("EM_Display_get_height", display, preview) == 360
        image = wrap(display)
        assert call("EM_XIImage_getWidth", image) == 8
        assert call("EM_XIImage_getHeight", image) == 4
        assert call("EM_XIImage_getRowBytes", image) == 32
        assert call("EM_XIImage_addRef", image) == 2
        assert call("EM_XIImage_removeRef", image) == 1
        # A frame not of the connected mode's size is refused.
        assert call("EM_Display_display_frame", display, preview, image) != _renderlib.EM_errorNone
        assert call("EM_Display_display_frame", display, nowhere, image) == _renderlib.EM_errorNotFound
        whole = wrap(display, (1, frame), (2, 640), (3, 360), (4, 640 * 4))
        assert call("EM_Display_display_frame", display, preview, whole) == _renderlib.EM_errorNone
        del whole
        call("delete_EM_XIImage", image)
        call.fails(ValueError, "EM_XIImage_getWidth", image)  # its last reference went
        dropped = wrap(display, (5, None))
        del dropped  # the proxy gives its reference back
        call.fails(TypeError, "EM_Display_EM_XIImageWrapper", display, "pixels", 8, 4, 32, frame_name, False, 0,
                   1.0, 2.2, False, True)
        call.fails(TypeError, "EM_Display_EM_XIImageWrapper", display, pixels, 8, 4, 32, frame_name, 1, 0,
                   1.0, 2.2, False, True)
        call.fails(OverflowError, "EM_Display_EM_XIImageWrapper", display, pixels, BIG, 4, 32, frame_name, False,
                   0, 1.0, 2.2, False, True)
        call.fails(ValueError, "EM_XIImage_getHeight", None)
        call.fails(TypeError, "EM_XIImage_addRef", display)
        assert call("EM_Display_connect", display, None, mode) == _renderlib.EM_errorParam
        assert call("EM_Display_connect", display, nowhere, mode) == _renderlib.EM_errorNotFound
        call.fails(TypeError, "EM_Display_connect", display, preview, 5)
        assert call("EM_Display_disconnect", display, preview) == _renderlib.EM_errorNone
        assert call("EM_Display_get_width", display, preview) == 0
        call("release_external_monitor", display)
        call.fails(ValueError, "release_external_monitor", display)  # released already
        call.fails(ValueError, "EM_Display_devices", display)
        call.fails(TypeError, "release_external_monitor", STRANGER)
        MONITOR.lib.qrv_probe_set_init_fails(1)
        try:
            assert call("EM_DisplayInit") is None
        finally:
            MONITOR.lib.qrv_probe_set_init_fails(0)
        MONITOR.lib.qrv_probe_set_no_devices(1)
        try:
            bare = call("EM_DisplayInit")
        finally:
            MONITOR.lib.qrv_probe_set_no_devices(0)
        assert call("EM_Display_devices", bare) == []
        assert call("EM_Display_connect", bare, preview, mode) == _renderlib.EM_errorNotFound
        call("release_external_monitor", bare)
        call.fails(TypeError, "EM_DisplayInit", 1)

    return step, [preview, nowhere, mode, pixels, frame_name, frame], nothing


def vector_calls(call, kind, first, second):
    """Every wrapper of one std::vector instance, with elements `first` and `second`."""
    cls = getattr(renderlib, kind)
    p = kind + "_"
    vector = construct(call, cls, [first, second, first])
    for arguments in ((), (3,), (3, first), (vector,)):
        call("delete_" + kind, construct(call, cls, *arguments))
    call.fails(TypeError, "new_" + kind, STRANGER)
    call.fails((OverflowError, TypeError), "new_" + kind, -1)
    assert call(p + "__len__", vector) == call(p + "size", vector) == 3
    assert call(p + "__bool__", vector) and call(p + "__nonzero__", vector) and not call(p + "empty", vector)
    call(p + "reserve", vector, 8)
    assert call(p + "capacity", vector) >= 8
    call(p + "append", vector, second)
    call(p + "push_back", vector, first)
    call(p + "__getitem__", vector, 0)
    call(p + "__getitem__", vector, -1)
    call(p + "__getitem__", vector, slice(0, 2))
    call.fails(IndexError, p + "__getitem__", vector, 99)
    call.fails(TypeError, p + "__getitem__", vector, "0")
    call(p + "__setitem__", vector, 0, second)
    call(p + "__setitem__", vector, slice(0, 1), [first])
    call(p + "__setitem__", vector, slice(4, 5))
    call.fails(TypeError, p + "__setitem__", vector, 0, STRANGER)
    call.fails(ValueError, p + "__setitem__", vector, slice(0, 4, 2), [first])
    call(p + "__delitem__", vector, 0)
    call(p + "__delitem__", vector, slice(0, 1))
    call.fails(IndexError, p + "__delitem__", vector, 99)
    call(p + "__getslice__", vector, 0, 2)
    call(p + "__setslice__", vector, 0, 1, [second])
    call(p + "__setslice__", vector, 0, 1)
    call(p + "__delslice__", vector, 0, 1)
    # back, front and pop_back are only ever called on a vector that has
    # elements: on an empty one they read or free what is not there.
    call(p + "append", vector, first)
    call(p + "append", vector, second)
    call(p + "append", vector, first)
    assert call(p + "size", vector) >= 3
    call(p + "back", vector)
    call(p + "front", vector)
    call(p + "pop", vector)
    call(p + "pop_back", vector)
    call(p + "assign", vector, 3, second)
    call(p + "resize", vector, 4)
    call(p + "resize", vector, 5, first)
    call.fails(TypeError, p + "resize", vector, 5, STRANGER)
    at = call(p + "insert", vector, call(p + "begin", vector), first)
    call(p + "insert", vector, at, 2, second)
    call(p + "erase", vector, call(p + "begin", vector))
    call(p + "erase", vector, call(p + "begin", vector), call(p + "end", vector))
    call(p + "rbegin", vector)
    call(p + "rend", vector)
    other = construct(call, cls, [first, second])
    call(p + "swap", vector, other)
    call.fails(TypeError, p + "swap", vector, STRANGER)
    three = construct(call, cls, [first, second, first])
    iterate(call, p, three)
    call("delete_" + kind, three)
    call(p + "clear", vector)
    call.fails(IndexError, p + "pop", vector)
    call.fails(TypeError, p + "append", vector, STRANGER)
    call("delete_" + kind, other)
    call("delete_" + kind, vector)


def iterator_calls(call, begin, also_begin, end, closed):
    """Every wrapper of SWIG's iterator, over a sequence of three: `begin`,
    `also_begin` and `end` are its begin() and end(), `closed` its iterator()."""
    p = "SwigPyIterator_"
    call(p + "value", begin)
    call(p + "incr", begin)
    call(p + "incr", begin, 1)
    call(p + "decr", begin)
    call(p + "decr", begin, 1)
    call(p + "distance", begin, end)
    assert call(p + "equal", begin, also_begin)
    assert call(p + "__eq__", begin, also_begin) and not call(p + "__ne__", begin, also_begin)
    assert call(p + "__eq__", begin, STRANGER) is NotImplemented
    call(p + "next", begin)
    call(p + "__next__", begin)
    call(p + "previous", begin)
    call(p + "decr", begin)
    copy = call(p + "copy", begin)
    call(p + "value", copy)
    call(p + "advance", begin, 1)
    # The in-place operators hand the iterator over to their result (as
    # `iterator += n` rebinds the name): keep the result, not the argument.
    begin = call(p + "__iadd__", begin, 1)
    begin = call(p + "__isub__", begin, 2)
    call(p + "__add__", begin, 1)
    call(p + "__sub__", end, begin)
    call.fails(TypeError, p + "distance", begin, STRANGER)
    call.fails(TypeError, p + "advance", begin, "1")
    call.fails(StopIteration, p + "previous", closed)  # a closed iterator at its start
    for _ in range(4):
        try:
            call(p + "__next__", closed)
        except StopIteration:
            break
    else:
        raise AssertionError("a closed iterator went past the end")
    call.fails(StopIteration, p + "__next__", closed)
    call.fails(StopIteration, p + "value", closed)
    call("delete_SwigPyIterator", copy)
    call.fails(TypeError, "delete_SwigPyIterator", STRANGER)


def iterate(call, prefix, sequence):
    iterator_calls(call, call(prefix + "begin", sequence), call(prefix + "begin", sequence),
                   call(prefix + "end", sequence), call(prefix + "iterator", sequence))


@family
def containers(call, helpers, tmp_path):
    made, genotypes = engine_genotypes(call, builder_too=False)
    param = genotypes[0]._get_params()[0]
    elements = {"bool_vector": (True, False), "float_vector": (1.5, 2.5),
                "string_vector": (text("ab"), text("cd")), "genotype_vector": (genotypes[0], None),
                "param_vector": (param, None)}
    key, other_key, missing = text("radius"), text("center"), text("missing")
    values = [2.5, 1.0]

    def step():
        for kind, (first, second) in elements.items():
            vector_calls(call, kind, first, second)
        p = "value_map_"
        mapping = construct(call, renderlib.value_map)
        call(p + "__setitem__", mapping, key, values)
        call(p + "__setitem__", mapping, other_key, renderlib.float_vector(values))
        call(p + "__setitem__", mapping, missing, values)
        iterate(call, p, mapping)
        call(p + "__setitem__", mapping, missing)  # without a value: removes the key
        call.fails(IndexError, p + "__delitem__", mapping, missing)
        copy = construct(call, renderlib.value_map, mapping)
        call("delete_value_map", construct(call, renderlib.value_map, {key: values}))
        call.fails(TypeError, "new_value_map", STRANGER)
        call.fails(TypeError, p + "__setitem__", mapping, 5, values)
        assert call(p + "__getitem__", mapping, key) == (2.5, 1.0)
        call.fails(IndexError, p + "__getitem__", mapping, missing)
        assert call(p + "__contains__", mapping, key) and call(p + "has_key", mapping, key)
        call.fails(TypeError, p + "__contains__", mapping, 5)
        assert call(p + "count", mapping, key) == 1
        assert call(p + "__len__", mapping) == call(p + "size", mapping) == 2
        assert call(p + "__bool__", mapping) and call(p + "__nonzero__", mapping) and not call(p + "empty", mapping)
        call(p + "keys", mapping)
        call(p + "values", mapping)
        call(p + "items", mapping)
        call(p + "asdict", mapping)
        for name in ("key_iterator", "value_iterator", "rbegin", "rend", "end"):
            call(p + name, mapping)
        call(p + "lower_bound", mapping, key)
        call(p + "upper_bound", mapping, key)
        call(p + "erase", mapping, call(p + "find", mapping, key))
        assert call(p + "erase", mapping, other_key) == 1
        call.fails(IndexError, p + "__delitem__", mapping, missing)
        call(p + "swap", mapping, copy)
        call(p + "erase", mapping, call(p + "begin", mapping), call(p + "end", mapping))
        call(p + "clear", copy)
        call.fails(TypeError, p + "swap", mapping, STRANGER)
        call("delete_value_map", copy)
        call("delete_value_map", mapping)

    def cleanup():
        for effect in made:
            call("free_tarsel_effect", effect)

    return step, made + [param, key, other_key, missing, values] + [e for pair in elements.values()
                                                                            for e in pair], cleanup


@family
def container_allocators(call, helpers, tmp_path):
    # SWIG would hand out a new allocator it has no destructor for; the
    # module's shared one is owned by nobody.
    kinds = ["bool_vector", "float_vector", "string_vector", "genotype_vector", "param_vector", "value_map"]
    containers = [getattr(renderlib, kind)() for kind in kinds]

    def step():
        for kind, container in zip(kinds, containers):
            call(kind + "_get_allocator", container)
            call.fails(TypeError, kind + "_get_allocator", STRANGER)

    return step, containers, nothing


@family
def parameters_as_json(call, helpers, tmp_path):
    # Each Param keeps only its latest cJSON tree: the one before is freed.
    effect = call("init_tarsel_effect", text("T_Glow"), False)
    param = effect.effect_genotype._get_params()[1]

    def step():
        assert call("Param_to_json", param, None) is not None
        call("Param_to_json", param, None, True)
        call.fails(TypeError, "Param_to_json", param, None, 1)
        call.fails(TypeError, "Param_to_json", param, STRANGER)

    return step, [effect, param], lambda: call("free_tarsel_effect", effect)


@family
def iterator_minus_a_number(call, helpers, tmp_path):
    # `iterator - n` and `iterator + n` past either end make a copy and then
    # stop: the copy is freed.
    vector = renderlib.float_vector([1.0, 2.0, 3.0])

    def step():
        call("SwigPyIterator___sub__", vector.end(), 1)
        call("SwigPyIterator___sub__", vector.begin(), 1)
        call("SwigPyIterator___add__", vector.begin(), 5)

    return step, [vector], nothing


@family
def sequences_refused_midway(call, helpers, tmp_path):
    # A list whose first element converts and a later one does not: the
    # container made for the conversion is freed when it gives up.
    flare = call("init_tarsel_effect", text("T_LensFlare"), False)
    empty, key = text(""), text("radius")
    view = (96, 54, 0.0, 0.0, 0.5, 0.5)
    mapping = renderlib.value_map()
    lists = {kind: [first, STRANGER] for kind, first in
             (("bool_vector", True), ("float_vector", 1.0), ("string_vector", key), ("genotype_vector", None),
              ("param_vector", None))}
    floats = [1.0, STRANGER]

    def step():
        call.fails(TypeError, "tarsel_widget_draw", flare, empty, *view, floats)
        call.fails(TypeError, "tarsel_widget_mouse_event", flare, empty, *view, floats, 10, 10, 0)
        call.fails(TypeError, "value_map___setitem__", mapping, key, floats)
        call.fails(TypeError, "new_value_map", {"radius": [1.0], "size": floats})
        for kind, elements in lists.items():
            call.fails(TypeError, "new_" + kind, elements)

    return step, [flare, empty, key, mapping, floats] + list(lists.values()), \
        lambda: call("free_tarsel_effect", flare)


@family
def argument_errors(call, helpers, tmp_path):
    """Every function with too many arguments, with too few, and with an
    argument of a type no wrapper takes in first place; every function that
    takes arguments with None in each of them (what the call then does is up
    to the function; it must neither crash nor leak)."""
    counts = arities()
    operators = ("__eq__", "__ne__", "__add__", "__sub__", "__iadd__", "__isub__")
    refused = (TypeError, ValueError, OverflowError, RuntimeError, AttributeError)
    # Functions that take any object first, or whose None is not refused
    # (the calls that make the records raster_descriptors leaves out).
    takes_anything = {"SWIG_PyInstanceMethod_New", "new_GfxInterface", "new_LoadFrameInterface"}
    unsafe_with_none = {"make_tarsel_raster_info_from_base64", "make_tarsel_raster_info_from_bits",
                        "raster_info_to_bytearray"}
    functions = [name for name in module_functions() if name not in NOT_EXERCISED]
    # SWIG's overload dispatch of this operator answers three arguments with
    # NotImplemented while leaving its TypeError set (a SystemError results).
    no_extra_argument = {"SwigPyIterator___sub__"}

    def expect(name, arguments, allowed):
        call.names.add(name)
        try:
            result = getattr(_renderlib, name)(*arguments)
        except refused:
            return
        if not allowed(name, result):
            raise AssertionError("%s%r gave %r" % (name, tuple(arguments), result))

    def operator(name, result):
        return name.endswith(operators) and result is NotImplemented

    def anything(name, result):
        return True

    def step():
        for name in functions:
            low, high = counts[name]
            if name not in no_extra_argument:
                expect(name, [STRANGER] * (high + 1), operator)
            if low > 0:
                expect(name, [], operator)
                if name not in takes_anything and not name.endswith("_swiginit"):
                    expect(name, [STRANGER] * low, operator)
                if name not in unsafe_with_none and not name.endswith("_swiginit"):
                    for count in range(low, high + 1):
                        expect(name, [None] * count, anything)

    def cleanup():
        _renderlib.set_error_handler(None)
        _renderlib.set_load_frame_impl(None)
        _renderlib.tarsel_set_gfx_impl(None)

    return step, [], cleanup


# --- The tests --------------------------------------------------------------

def shared_constant(item):
    """Objects the interpreter itself keeps and counts references to."""
    return item is None or isinstance(item, bool) or (type(item) is int and -5 <= item <= 256) or \
        (type(item) is str and len(item) < 2)


def memory():
    """Interpreter blocks, C heap bytes and resident KiB in use. A full
    collection empties the interpreter's free lists. The method cache is
    emptied too: each of its 4096 entries keeps the name last looked up
    through it, and a name made for one lookup ("prefix" + "name" here,
    a director's method name, which SWIG's director calls make afresh on
    each call) lands in a slot of its own address, so the cache holds more
    of them as the heap shifts, up to its size, without any leak."""
    gc.collect()
    sys._clear_type_cache()
    return sys.getallocatedblocks(), heap_in_use(), resident_kib()


def check_flat(name, make, helpers, tmp_path):
    """Runs family `name` WARM_UP rounds, which fill the engine's and the
    interpreter's caches and pools, then two stretches of ROUNDS rounds. A
    leak grows memory in both stretches alike; the interpreter's own
    one-off growth (a table that doubles) shows in one only."""
    _renderlib.tarsel_free_all_stamp_collections()
    before = live_objects()
    call = Calls()
    step, watched, cleanup = make(call, helpers, tmp_path)
    watched = [item for item in watched if not shared_constant(item)]

    def one_round():
        step()
        MONITOR.forget_calls()

    try:
        for _ in range(WARM_UP):
            one_round()
        references = [sys.getrefcount(item) for item in watched]
        live = live_objects()
        growth = []
        start = memory()
        for _ in range(2):
            for _ in range(ROUNDS):
                one_round()
            end = memory()
            growth.append([later - earlier for later, earlier in zip(end, start)])
            start = end
        after = [sys.getrefcount(item) for item in watched]
        moved = ["%s %.60r: %+d" % (type(item).__name__, item, now - then)
                 for item, then, now in zip(watched, references, after) if now != then]
        assert moved == [], "%s: references gained or lost over %d rounds: %s" % (name, 2 * ROUNDS, moved)
        assert live_objects() == live, "%s: engine or monitor objects left alive" % name
        if MEASURE_MEMORY:
            (blocks, heap, rss), (more_blocks, more_heap, more_rss) = growth
            # A leak of one object, or of one small block of the C heap (32
            # bytes), a round shows as ROUNDS blocks or ROUNDS * 32 bytes a stretch.
            assert min(blocks, more_blocks) < ROUNDS // 2, \
                "%s: %d and %d interpreter blocks more in %d rounds" % (name, blocks, more_blocks, ROUNDS)
            assert min(heap, more_heap) < ROUNDS * 16, \
                "%s: the C heap grew by %d and %d bytes in %d rounds" % (name, heap, more_heap, ROUNDS)
            assert rss + more_rss < 1024, \
                "%s: resident memory grew by %d KiB in %d rounds" % (name, rss + more_rss, 2 * ROUNDS)
    finally:
        cleanup()
        ENGINE.abort_next_call(False)
        _renderlib.tarsel_clear_abort()
        _renderlib.tarsel_free_all_stamp_collections()
    del step, watched, cleanup
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
    """Each function of the module has cases of its own in a family; the
    sweep of argument_errors, which calls every function alike, does not
    count."""
    exercised = set()
    for name, make in FAMILIES.items():
        if name == "argument_errors":
            continue
        call = Calls()
        (tmp_path / name).mkdir()
        step, watched, cleanup = make(call, shared_registry, tmp_path / name)
        try:
            step()
        finally:
            cleanup()
        exercised |= call.names
    functions = set(module_functions())
    assert exercised - functions == set()
    assert NOT_EXERCISED and all(isinstance(getattr(renderlib, name[:-len("_swigregister")], None), type)
                                 for name in NOT_EXERCISED)
    assert sorted(functions - exercised - set(NOT_EXERCISED)) == []
