// The entry points' side of enter(): the text forms of their arguments, the
// calling thread's entry depth, and the hand-over to the installed observer.
#include "core/entry.h"

#include <atomic>
#include <cinttypes>
#include <cstdint>
#include <cstdio>

namespace tarsel_ref {
namespace {

std::atomic<const EntryObserver *> installed_observer{nullptr};

}  // namespace

std::string describe(const char *text) {
  if (!text) return "null";
  return std::string("\"") + text + "\"";
}

std::string describe(const void *pointer) {
  if (!pointer) return "null";
  char buffer[32];
  std::snprintf(buffer, sizeof buffer, "0x%" PRIxPTR, reinterpret_cast<std::uintptr_t>(pointer));
  return buffer;
}

std::string describe(long long value) { return std::to_string(value); }

std::string describe(double value) {
  char buffer[32];
  std::snprintf(buffer, sizeof buffer, "%g", value);
  return buffer;
}

int &entry_depth() {
  thread_local int depth = 0;
  return depth;
}

void set_entry_observer(const EntryObserver *observer) { installed_observer.store(observer); }

bool call_log_enabled() {
  const EntryObserver *observer = installed_observer.load(std::memory_order_acquire);
  return observer && observer->wants_arguments();
}

void record_entry(const char *name, std::string arguments, bool may_abort) {
  if (const EntryObserver *observer = installed_observer.load(std::memory_order_acquire))
    observer->entered(name, std::move(arguments), may_abort);
}

}  // namespace tarsel_ref
