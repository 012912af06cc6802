"""Cost of crossing the boundary: a wrapper with no argument, one with an int,
a record field read and write, and engine messages delivered to a Python
handler from an engine worker thread. Prints a table; asserts nothing."""

import sys
import time

import _renderlib
import renderlib

sys.path.insert(0, __import__("os").path.join(__import__("os").path.dirname(__file__), "..", "tests"))
from engine_probe import EngineProbe  # noqa: E402


def per_call(function, repeat=200_000):
    start = time.perf_counter()
    for _ in range(repeat):
        function()
    return (time.perf_counter() - start) / repeat


def main():
    info = renderlib.T_RasterInfo()
    rows = [
        ("get_n_tarsel_effects()", per_call(_renderlib.get_n_tarsel_effects)),
        ("get_tarsel_plugin_info_i(0)", per_call(lambda: _renderlib.get_tarsel_plugin_info_i(0))),
        ("T_RasterInfo.ds_xsize read", per_call(lambda: info.ds_xsize)),
        ("T_RasterInfo.ds_xsize write", per_call(lambda: setattr(info, "ds_xsize", 5))),
        ("check_build_id()", per_call(_renderlib.check_build_id)),
    ]
    probe = EngineProbe()
    delivered = []
    _renderlib.set_error_handler(lambda level, message: delivered.append(level))
    count = 100_000
    start = time.perf_counter()
    probe.emit_from_worker(count, _renderlib.Err_Info, "tick")
    rows.append(("engine message from a worker", (time.perf_counter() - start) / count))
    _renderlib.set_error_handler(None)
    assert len(delivered) == count
    probe.clear_calls()

    print("%-32s %12s" % ("operation", "ns per call"))
    print("-" * 45)
    for name, seconds in rows:
        print("%-32s %12.0f" % (name, seconds * 1e9))


if __name__ == "__main__":
    main()
