// The engine's test probe (tarsel_probe.h): its call log, fed by the entry
// points through the observer it installs as the library loads, its fault
// switch, and the switches and counts it reaches in the engine. Nothing in
// the engine includes it.
#include <atomic>
#include <chrono>
#include <cstdio>
#include <string>
#include <thread>

#include <errno.h>
#include <pthread.h>
#include <unistd.h>

#include "callbacks/frame_requests.h"
#include "catalogue/param_values.h"
#include "core/abort.h"
#include "core/entry.h"
#include "core/identity.h"
#include "core/messages.h"
#include "core/thread_end.h"
#include "ipc/transport.h"
#include "probe/call_log.h"
#include "rendering/instance.h"
#include "rendering/render_stats.h"
#include "rendering/stamps.h"
#include "rendering/workers.h"
#include "tarsel/errors.h"
#include "tarsel_probe.h"

namespace tarsel_ref {
namespace {

CallLog &call_log() {
  // Never destroyed: entry calls may come during process exit.
  static CallLog *log = new CallLog(TARSEL_PROBE_LOG_CAPACITY);
  return *log;
}

std::atomic<bool> log_enabled{true};
std::atomic<bool> abort_next_call{false};

bool wants_arguments() { return log_enabled.load(std::memory_order_relaxed); }

void entered(const char *name, std::string arguments, bool may_abort) {
  if (wants_arguments()) call_log().append(std::string(name) + "(" + arguments + ")");
  // A plain load first: the exchange, a locked write to a shared cache line,
  // is paid only while the switch is armed.
  if (may_abort && abort_next_call.load(std::memory_order_relaxed) && abort_next_call.exchange(false))
    throw TarselAbortException();
}

const EntryObserver observer{wants_arguments, entered};
const bool observing = (set_entry_observer(&observer), true);

}  // namespace
}  // namespace tarsel_ref

using tarsel_ref::call_log;

int tarsel_probe_call_count(void) { return call_log().count(); }

const char *tarsel_probe_call(int index) { return call_log().at(index); }

void tarsel_probe_clear_calls(void) { call_log().clear(); }

void tarsel_probe_set_call_log(int on) { tarsel_ref::log_enabled.store(on != 0); }

void tarsel_probe_set_abort_next_call(int armed) { tarsel_ref::abort_next_call.store(armed != 0); }

int tarsel_probe_abort_armed(void) { return tarsel_ref::abort_next_call.load() ? 1 : 0; }

int tarsel_probe_abort_requested(void) { return tarsel_ref::abort_requested() ? 1 : 0; }

int tarsel_probe_emit_from_worker(int count, int level, const char *text) {
  const std::string prefix = text ? text : "";
  int sent = 0;
  std::thread worker([&] {
    for (int i = 0; i < count; ++i, ++sent) tarsel_ref::emit_message(level, (prefix + " " + std::to_string(i)).c_str());
  });
  worker.join();
  return sent;
}

void tarsel_probe_emit_here(int level, const char *text) { tarsel_ref::emit_message(level, text); }

double tarsel_probe_time_frame_requests(int count, int width, int height) {
  const T_LoadOtherFrameFun fun = tarsel_ref::installed_frame_request();
  if (!fun) return -1.0;
  T_RenderState state{};
  state.input_info[0].pixel_type = pixel_rgba8;
  make_tarsel_raster_info(&state.input_info[0], width, height);
  double seconds = -1.0;
  std::thread worker([&] {
    try {
      T_RasterInfo answer{};
      const auto start = std::chrono::steady_clock::now();
      for (int i = 0; i < count; ++i) fun(&state, 0, i, 0, nullptr, nullptr, &answer);
      seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    }
    TARSEL_LET_THREAD_END catch (...) { seconds = -1.0; }
  });
  worker.join();
  return seconds;
}

void tarsel_probe_set_version_text(const char *text) {
  tarsel_ref::set_version_text(text ? std::optional<std::string>(text) : std::nullopt);
}

int tarsel_probe_live_instances(void) { return tarsel_ref::live_instance_count(); }

int tarsel_probe_live_params(void) { return tarsel_ref::live_params(); }

int tarsel_probe_stamp_count(void) { return tarsel_ref::stamp_count(); }

void tarsel_probe_set_render_immediate_return(int on) { tarsel_ref::set_render_immediate_return(on != 0); }

double tarsel_probe_last_render_seconds(void) { return tarsel_ref::last_render_seconds(); }

int tarsel_probe_worker_threads(void) { return tarsel_ref::worker_thread_count(); }

namespace {

// The lock of a live transport's queue; null for anything else.
pthread_mutex_t *transport_queue_lock(void *transport, int which_queue) {
  if (which_queue != 0 && which_queue != 1) return nullptr;
  tarsel_ref::ipc::Endpoint *endpoint = tarsel_ref::ipc::find_endpoint(transport);
  return endpoint ? &endpoint->queue_control(which_queue).lock : nullptr;
}

// Takes the lock on a thread that then ends holding it.
void abandon(pthread_mutex_t *lock) {
  std::thread owner([lock] {
    if (pthread_mutex_lock(lock) == EOWNERDEAD) pthread_mutex_consistent(lock);
  });
  owner.join();
}

}  // namespace

int tarsel_probe_shmem_stall_holding_lock(void *transport, int which_queue) {
  pthread_mutex_t *lock = transport_queue_lock(transport, which_queue);
  if (!lock) return -1;
  if (pthread_mutex_lock(lock) == EOWNERDEAD) pthread_mutex_consistent(lock);
  for (;;) pause();
}

int tarsel_probe_shmem_abandon_lock(void *transport, int which_queue) {
  pthread_mutex_t *lock = transport_queue_lock(transport, which_queue);
  if (!lock) return -1;
  abandon(lock);
  return 0;
}

int tarsel_probe_shmem_break_lock(void *transport, int which_queue) {
  pthread_mutex_t *lock = transport_queue_lock(transport, which_queue);
  if (!lock) return -1;
  abandon(lock);
  if (pthread_mutex_lock(lock) == EOWNERDEAD) pthread_mutex_unlock(lock);  // not made consistent
  return 0;
}
