"""What one engine frame request costs through the binding: the adapter, the
two calls into the Python frame source and the interpreter lock taken and
given back, against a ctypes callback doing the same work, both called from
the same engine thread. Prints a table; asserts nothing.

    .venv/bin/python benchmarks/frame_request.py
"""

import ctypes
import pathlib
import platform
import subprocess
import sys

import _renderlib
import renderlib
from renderlib import effects

HERE = pathlib.Path(__file__).resolve().parent
sys.path.insert(0, str(HERE.parent / "tests"))
from engine_probe import EngineProbe, loaded_library_path  # noqa: E402

WIDTH, HEIGHT = 64, 64
REQUESTS = 200_000
INSTALL_SYMBOL_PREFIX = "_Z36set_load_other_frame_into_buffer_fun"
RASTER_INFO_SIZE = 104


class KeptFrame(renderlib.LoadFrameInterface):
    """A frame source that serves one kept frame."""

    def __init__(self):
        super().__init__()
        self.info, self.pixels = effects.raster(_renderlib.pixel_rgba8, WIDTH, HEIGHT)

    def load_frame(self, input, frame, width, height):
        return self.pixels

    def current_raster_info(self, input):
        return self.info


def install_ctypes_callback(engine_library, source):
    """A CFUNCTYPE callback installed directly in the engine, doing the
    adapter's work: both Python calls, the descriptor copied, the address back."""
    symbols = subprocess.run(
        ["nm", "-D", "--defined-only", engine_library], capture_output=True, text=True, check=True
    ).stdout
    name = next(line.split()[-1] for line in symbols.splitlines() if INSTALL_SYMBOL_PREFIX in line)
    install = getattr(ctypes.CDLL(engine_library), name)
    p = ctypes.c_void_p
    callback_type = ctypes.CFUNCTYPE(p, p, ctypes.c_int, ctypes.c_int, ctypes.c_ubyte, p, p, p)
    install.argtypes = [callback_type]

    def request(state, input, frame, flag, data1, data2, out_info):
        pixels = source.load_frame(input, frame, WIDTH, HEIGHT)
        ctypes.memmove(out_info, int(source.current_raster_info(input).this), RASTER_INFO_SIZE)
        return ctypes.addressof((ctypes.c_char * len(pixels)).from_buffer(pixels))

    callback = callback_type(request)
    install(callback)
    return callback  # keeps it alive while installed


def nanoseconds_per_request(probe):
    best = min(probe.time_frame_requests(REQUESTS, WIDTH, HEIGHT) for _ in range(5))
    if best < 0:
        raise RuntimeError("a frame request failed")
    return best / REQUESTS * 1e9


def main():
    probe = EngineProbe()
    engine_library = loaded_library_path("tarsel_ps")
    source = KeptFrame()
    _renderlib.set_load_frame_impl(source)
    binding = nanoseconds_per_request(probe)
    callback = install_ctypes_callback(engine_library, source)
    foreign = nanoseconds_per_request(probe)
    _renderlib.set_load_frame_impl(None)
    del callback

    print(
        "%s, Python %s, %d requests from one engine thread (best of 5)"
        % (platform.processor() or platform.machine(), platform.python_version(), REQUESTS)
    )
    print()
    print("| frame request round trip | ns per request |")
    print("|---|---|")
    print("| binding (adapter, two director calls, lock) | %.0f |" % binding)
    print("| ctypes CFUNCTYPE doing the same | %.0f |" % foreign)
    print()
    print("ctypes / binding: %.2fx" % (foreign / binding))


if __name__ == "__main__":
    main()
