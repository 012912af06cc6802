/* Test probe of the reference engine: a C interface, reached from tests through
 * ctypes, that shows what the engine was asked to do and injects faults. It is
 * not part of the engine contract and the Python module never calls it. */
#ifndef TARSEL_PROBE_H
#define TARSEL_PROBE_H

#include "tarsel/export.h"

#ifdef __cplusplus
extern "C" {
#endif

/* Call log: one entry "name(arg, arg, ...)" per engine entry call, oldest
 * first. Only the newest TARSEL_PROBE_LOG_CAPACITY entries are kept. */
#define TARSEL_PROBE_LOG_CAPACITY 4096
TARSEL_API int tarsel_probe_call_count(void);
/* Entry `index` (0 = oldest kept); null when out of range. The text stays
 * valid until the next probe call. */
TARSEL_API const char *tarsel_probe_call(int index);
TARSEL_API void tarsel_probe_clear_calls(void);
/* 0 pauses the call log (arguments are then not even formatted), 1 resumes it. */
TARSEL_API void tarsel_probe_set_call_log(int on);

/* Fault switch: while armed, the next engine entry call (of any thread)
 * throws TarselAbortException instead of doing its work, and disarms it.
 * 0 disarms. */
TARSEL_API void tarsel_probe_set_abort_next_call(int armed);
/* 1 while the switch is armed and no call has consumed it. */
TARSEL_API int tarsel_probe_abort_armed(void);

/* 1 while tarsel_abort_render's request stands. */
TARSEL_API int tarsel_probe_abort_requested(void);

/* Sends `count` messages "<text> <i>" (i from 0) at `level` to the installed
 * handler from a new engine worker thread and waits for it; returns the number
 * sent. */
TARSEL_API int tarsel_probe_emit_from_worker(int count, int level, const char *text);
/* Sends one message on the calling thread. */
TARSEL_API void tarsel_probe_emit_here(int level, const char *text);

/* Calls the installed frame-request callback `count` times from a new engine
 * thread (input 0, frames 0 to count - 1, flag 0, null engine values, a
 * render state whose input 0 is width x height pixel_rgba8) and waits for it;
 * returns the seconds the calls took, or -1 when no callback is installed or
 * one threw. The answers are not read: this times the callback alone. */
TARSEL_API double tarsel_probe_time_frame_requests(int count, int width, int height);

/* Replaces the version text that get_tarsel_version_info reports (any bytes,
 * for testing the text conversion); null restores the engine's own. */
TARSEL_API void tarsel_probe_set_version_text(const char *text);

/* Counts for leak checks: effect instances made and not yet freed, Param
 * objects alive (those of instances and those a host made), and stamps held
 * by the engine's stamp cache. */
TARSEL_API int tarsel_probe_live_instances(void);
TARSEL_API int tarsel_probe_live_params(void);
TARSEL_API int tarsel_probe_stamp_count(void);

/* Render timing and the binding's own cost. While immediate return is on
 * (non-zero), both render entry points check that an instance, a descriptor
 * list and at least one entry are given, return success (1 / true; failure
 * without a message when those are missing) and touch nothing else, so a
 * benchmark measures the binding alone. The call is still logged. */
TARSEL_API void tarsel_probe_set_render_immediate_return(int on);
/* The engine's own wall time of the last render call (either entry point),
 * in seconds, measured inside the entry point whatever its outcome. */
TARSEL_API double tarsel_probe_last_render_seconds(void);

/* Threads of the engine's worker pool: one per core once a render has made
 * it, 0 before that and after tarsel_shutdown_apps. */
TARSEL_API int tarsel_probe_worker_threads(void);

/* Shared-memory transports, for fault tests. `transport` is a
 * Tarsel::IPC::ShmemTransport pointer; queue 0 carries the server's messages
 * to the client, queue 1 the client's to the server. Each returns -1 at once
 * for a pointer that is not a live transport or another queue number. */
/* Takes the queue's lock and sleeps for ever holding it (never returns
 * otherwise): for tests that kill the process while it holds the lock. */
TARSEL_API int tarsel_probe_shmem_stall_holding_lock(void *transport, int which_queue);
/* Lets a new thread take the queue's lock and end without releasing it, as a
 * process dying with it would; the next operation on the queue takes the lock
 * over from its dead owner. 0 when done. */
TARSEL_API int tarsel_probe_shmem_abandon_lock(void *transport, int which_queue);
/* Leaves the queue's lock unrecoverable (taken over from a dead owner and
 * released without being made consistent): every operation on that queue
 * then fails with LOCK_ERROR, for every process. 0 when done. */
TARSEL_API int tarsel_probe_shmem_break_lock(void *transport, int which_queue);

#ifdef __cplusplus
}
#endif

#endif
