"""What the render binding costs: its overhead per call against a hand-written
extension and ctypes, the time it adds to a large render, and how freely other
Python threads run meanwhile. Prints tables; asserts nothing.

    .venv/bin/python benchmarks/render_binding.py
"""

import ctypes
import os
import pathlib
import platform
import resource
import subprocess
import sys
import sysconfig
import tempfile
import threading
import time

import _renderlib
import renderlib  # noqa: F401  (registers the proxy classes)
from renderlib import effects

HERE = pathlib.Path(__file__).resolve().parent
sys.path.insert(0, str(HERE.parent / "tests"))
from engine_probe import EngineProbe, loaded_library_path  # noqa: E402

RENDER_SYMBOL_PREFIX = "_Z36render_tarsel_effect_to_native_image"


def build_fastcall_extension(engine_library):
    folder = pathlib.Path(tempfile.mkdtemp(prefix="fastcall-"))
    target = folder / ("fastcall_render" + sysconfig.get_config_var("EXT_SUFFIX"))
    subprocess.run(
        [
            "g++",
            "-O2",
            "-std=c++17",
            "-shared",
            "-fPIC",
            "-I" + sysconfig.get_paths()["include"],
            "-I" + str(HERE.parent / "engine-api"),
            str(HERE / "fastcall" / "fastcall_render.cpp"),
            engine_library,
            "-Wl,-rpath," + os.path.dirname(engine_library),
            "-o",
            str(target),
        ],
        check=True,
    )
    sys.path.insert(0, str(folder))
    import fastcall_render

    return fastcall_render


def ctypes_render(engine_library):
    """The same entry called through ctypes, arguments converted per call."""
    symbol = subprocess.run(
        ["nm", "-D", "--defined-only", engine_library], capture_output=True, text=True, check=True
    ).stdout
    name = next(line.split()[-1] for line in symbol.splitlines() if RENDER_SYMBOL_PREFIX in line)
    entry = getattr(ctypes.CDLL(engine_library), name)
    i, f, p, s = ctypes.c_int, ctypes.c_float, ctypes.c_void_p, ctypes.c_char_p
    # instance, descriptor, destination and its window; the two lists; then the
    # scalars, in the order the render call takes them; the three colour spaces.
    scalars = [f, i, f, i, i, i, i, ctypes.c_bool]
    entry.argtypes = [p, s, p, i, i, i, i, ctypes.POINTER(p), ctypes.POINTER(p), *scalars, s, s, s]
    entry.restype = i

    def call(
        instance,
        text,
        dest,
        a,
        b,
        c,
        d,
        rasters,
        images,
        mix,
        n,
        aspect,
        threads,
        seed,
        flags,
        rate,
        premultiplied,
        cs1,
        cs2,
        cs3,
    ):
        raster_array = (p * len(rasters))(*[int(r.this) if r is not None else None for r in rasters])
        image_array = (p * len(images))(*[ctypes.addressof((ctypes.c_char * len(im)).from_buffer(im)) for im in images])
        dest_address = ctypes.addressof((ctypes.c_char * len(dest)).from_buffer(dest))
        return bool(
            entry(
                int(instance.this),
                text.encode(),
                dest_address,
                a,
                b,
                c,
                d,
                raster_array,
                image_array,
                mix,
                n,
                aspect,
                threads,
                seed,
                flags,
                rate,
                premultiplied,
                cs1.encode(),
                cs2.encode(),
                cs3.encode(),
            )
        )

    return call


def per_call(function, args, seconds=0.5):
    count, start = 0, time.perf_counter()
    while time.perf_counter() - start < seconds:
        for _ in range(1000):
            function(*args)
        count += 1000
    return (time.perf_counter() - start) / count


def overhead_table(probe, engine_library):
    instance = _renderlib.init_tarsel_effect("T_Blur", False)
    info, dest = effects.raster(_renderlib.pixel_rgba8, 8, 8)
    image = bytearray(len(dest))
    args = [
        instance,
        "",
        dest,
        0,
        0,
        1,
        1,
        [info, info],
        [image, image],
        1.0,
        2,
        1.0,
        0,
        0,
        0,
        25,
        False,
        "linear",
        "linear",
        "linear",
    ]
    fastcall = build_fastcall_extension(engine_library)
    through_ctypes = ctypes_render(engine_library)
    probe.render_returns_at_once(True)
    probe.keep_call_log(False)
    try:
        rows = [
            ("no-argument wrapper (floor)", per_call(_renderlib.tarsel_clear_abort, [])),
            ("render wrapper, 20 arguments", per_call(_renderlib.render_tarsel_effect_to_native_image, args)),
            ("hand-written METH_FASTCALL", per_call(fastcall.render, args)),
            ("ctypes", per_call(through_ctypes, args)),
        ]
    finally:
        probe.render_returns_at_once(False)
        probe.keep_call_log(True)
    binding, hand, foreign = rows[1][1], rows[2][1], rows[3][1]
    print("Binding overhead (the engine returns at once)")
    print("%-32s %12s" % ("call", "ns per call"))
    for name, seconds in rows:
        print("%-32s %12.0f" % (name, seconds * 1e9))
    print("binding / hand-written: %.2fx   ctypes / binding: %.1fx" % (binding / hand, foreign / binding))
    print()


def zero_copy_table(probe):
    instance = _renderlib.init_tarsel_effect("T_Blur", False)
    before = resource.getrusage(resource.RUSAGE_SELF).ru_maxrss
    dest = effects.raster(_renderlib.pixel_rgbaf, 3840, 2160)
    source = effects.raster(_renderlib.pixel_rgbaf, 3840, 2160)
    source[1][:] = bytes(len(source[1]))  # touch the pages
    buffers_kib = 2 * len(dest[1]) / 1024
    start = time.perf_counter()
    effects.render(instance, dest, [source])
    call = time.perf_counter() - start
    engine = probe.last_render_seconds()
    peak_kib = resource.getrusage(resource.RUSAGE_SELF).ru_maxrss - before
    print("Zero copy: 3840x2160 pixel_rgbaf blur")
    print("%-40s %10.1f ms" % ("Python call", call * 1e3))
    print("%-40s %10.1f ms" % ("engine's own time", engine * 1e3))
    print(
        "%-40s %10.3f ms (%.3f%% of the render)"
        % ("added by the binding", (call - engine) * 1e3, 100 * (call - engine) / call)
    )
    print("%-40s %10.0f MiB (buffers %.0f MiB)" % ("peak resident growth", peak_kib / 1024, buffers_kib / 1024))
    print()


def lock_table():
    instance = _renderlib.init_tarsel_effect("T_Blur", False)
    heavy = effects.recreate(instance, {"iterations": "8", "radius": "60"})
    dest = effects.raster(_renderlib.pixel_rgbaf, 3840, 2160)
    source = effects.raster(_renderlib.pixel_rgbaf, 3840, 2160)

    def python_work(seconds):
        count, end = 0, time.perf_counter() + seconds
        while time.perf_counter() < end:
            sum(range(200))
            count += 1
        return count / seconds

    solo = python_work(1.0)
    rate = {}
    worker = threading.Thread(target=lambda: rate.setdefault("during", python_work(1.0)))
    # The render keeps one core free, so what is measured is the interpreter
    # lock, not two threads sharing one core.
    threads = max(1, (os.cpu_count() or 2) - 1)
    rasters = [dest[0], source[0]]

    def render_while_measuring():
        while worker.is_alive():
            _renderlib.render_tarsel_effect_to_native_image(
                heavy,
                "",
                dest[1],
                0,
                0,
                1,
                1,
                rasters,
                [None, source[1]],
                1.0,
                2,
                1.0,
                threads,
                0,
                0,
                25,
                False,
                "linear",
                "linear",
                "linear",
            )

    renderer = threading.Thread(target=render_while_measuring)
    worker.start()
    renderer.start()
    worker.join()
    renderer.join()
    print("The interpreter lock during a long render (%d render thread(s))" % threads)
    print("%-40s %10.0f loops/s" % ("Python thread alone", solo))
    print(
        "%-40s %10.0f loops/s (%.0f%%)" % ("Python thread while rendering", rate["during"], 100 * rate["during"] / solo)
    )
    print()


def main():
    print(
        "machine: %s, %d cores, Python %s"
        % (platform.processor() or platform.machine(), os.cpu_count(), platform.python_version())
    )
    print()
    probe = EngineProbe()
    engine_library = loaded_library_path("tarsel_ps")
    overhead_table(probe, engine_library)
    zero_copy_table(probe)
    lock_table()


if __name__ == "__main__":
    main()
