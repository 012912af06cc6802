"""The reference engine's test probe, reached through ctypes.

The probe lives in the engine library that _renderlib loaded; opening the
same file again gives the same, already loaded, library."""

import ctypes

import _renderlib  # noqa: F401  (loads the engine)


def loaded_library_path(stem):
    """Path of the shared library `lib<stem>.so` mapped into this process."""
    with open("/proc/self/maps") as maps:
        for line in maps:
            path = line.split()[-1]
            if path.endswith("/lib%s.so" % stem):
                return path
    raise LookupError("lib%s.so is not loaded" % stem)


class EngineProbe:
    def __init__(self):
        lib = ctypes.CDLL(loaded_library_path("tarsel_ps"))
        self.lib = lib
        lib.tarsel_probe_call_count.restype = ctypes.c_int
        lib.tarsel_probe_call.restype = ctypes.c_char_p
        lib.tarsel_probe_call.argtypes = [ctypes.c_int]
        lib.tarsel_probe_abort_armed.restype = ctypes.c_int
        lib.tarsel_probe_abort_requested.restype = ctypes.c_int
        lib.tarsel_probe_emit_from_worker.restype = ctypes.c_int
        lib.tarsel_probe_emit_from_worker.argtypes = [ctypes.c_int, ctypes.c_int, ctypes.c_char_p]
        lib.tarsel_probe_emit_here.argtypes = [ctypes.c_int, ctypes.c_char_p]
        lib.tarsel_probe_set_abort_next_call.argtypes = [ctypes.c_int]
        lib.tarsel_probe_set_call_log.argtypes = [ctypes.c_int]
        lib.tarsel_probe_set_render_immediate_return.argtypes = [ctypes.c_int]
        lib.tarsel_probe_last_render_seconds.restype = ctypes.c_double
        lib.tarsel_probe_set_version_text.argtypes = [ctypes.c_char_p]
        for name in ("stall_holding_lock", "abandon_lock", "break_lock"):
            function = getattr(lib, "tarsel_probe_shmem_" + name)
            function.argtypes = [ctypes.c_void_p, ctypes.c_int]
            function.restype = ctypes.c_int
        lib.tarsel_probe_time_frame_requests.restype = ctypes.c_double
        lib.tarsel_probe_time_frame_requests.argtypes = [ctypes.c_int, ctypes.c_int, ctypes.c_int]

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
        lib = self.lib
        return [
            lib.tarsel_probe_call(i).decode("utf-8", "surrogateescape") for i in range(lib.tarsel_probe_call_count())
        ]

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
