"""The reference engine's test probe, reached through ctypes: it lives in the engine library that _renderlib loaded,
and opening the same file again gives the same, already loaded, library."""

import ctypes
from ctypes import c_char_p, c_double, c_int, c_void_p

import _renderlib  # noqa: F401  (loads the engine)


def loaded_library_path(stem):
    """Path of the shared library `lib<stem>.so` mapped into this process."""
    with open("/proc/self/maps") as maps:
        for line in maps:
            path = line.split()[-1]
            if path.endswith("/lib%s.so" % stem):
                return path
    raise LookupError("lib%s.so is not loaded" % stem)


# The argument and result types of the probe's functions (tarsel_probe_<name>)
# that take arguments or return other than an int.
ARGUMENTS = {
    **dict.fromkeys(["call", "set_abort_next_call", "set_call_log", "set_render_immediate_return"], [c_int]),
    **dict.fromkeys(["shmem_stall_holding_lock", "shmem_abandon_lock", "shmem_break_lock"], [c_void_p, c_int]),
    "emit_from_worker": [c_int, c_int, c_char_p],
    "emit_here": [c_int, c_char_p],
    "set_version_text": [c_char_p],
    "time_frame_requests": [c_int] * 3,
}
RESULTS = {"call": c_char_p, "last_render_seconds": c_double, "time_frame_requests": c_double}


class EngineProbe:
    def __init__(self):
        self.lib = ctypes.CDLL(loaded_library_path("tarsel_ps"))
        for name, types in ARGUMENTS.items():
            getattr(self.lib, "tarsel_probe_" + name).argtypes = types
        for name, result in RESULTS.items():
            getattr(self.lib, "tarsel_probe_" + name).restype = result

    def live_instances(self):
        return self.lib.tarsel_probe_live_instances()

    def live_params(self):
        return self.lib.tarsel_probe_live_params()

    def stamp_count(self):
        return self.lib.tarsel_probe_stamp_count()

    def render_returns_at_once(self, on=True):
        """While on, the render entries return success at once, touching nothing."""
        self.lib.tarsel_probe_set_render_immediate_return(int(on))

    def last_render_seconds(self):
        return self.lib.tarsel_probe_last_render_seconds()

    def calls(self):
        """The call log, oldest first, as text."""
        count = self.lib.tarsel_probe_call_count()
        return [self.lib.tarsel_probe_call(i).decode("utf-8", "surrogateescape") for i in range(count)]

    def keep_call_log(self, on=True):
        self.lib.tarsel_probe_set_call_log(int(on))

    def clear_calls(self):
        self.lib.tarsel_probe_clear_calls()

    def abort_next_call(self, armed=True):
        self.lib.tarsel_probe_set_abort_next_call(int(armed))

    def abort_armed(self):
        return bool(self.lib.tarsel_probe_abort_armed())

    def abort_requested(self):
        return bool(self.lib.tarsel_probe_abort_requested())

    def emit_from_worker(self, count, level, text):
        return self.lib.tarsel_probe_emit_from_worker(count, level, text.encode())

    def emit_here(self, level, text):
        self.lib.tarsel_probe_emit_here(level, text.encode())

    def time_frame_requests(self, count, width, height):
        """Seconds the installed frame-request callback takes for `count`
        requests from an engine thread; -1 when none is installed or one failed."""
        return self.lib.tarsel_probe_time_frame_requests(count, width, height)

    def set_version_text(self, raw):
        self.lib.tarsel_probe_set_version_text(raw)

    def reset(self):
        """Back to a quiet engine: no armed fault, no abort, no override."""
        self.abort_next_call(False)
        self.render_returns_at_once(False)
        self.keep_call_log(True)
        self.lib.tarsel_probe_set_version_text(None)
        self.clear_calls()
