// Every exported engine entry point starts with enter(): it tells the entry
// observer, if one is installed (the test probe installs one: its call log and
// its "abort the next call" switch), that the host called it.
//
// enter() returns a scope that marks the calling thread as inside the engine
// until the entry point returns. Calls the engine makes to its own entry points
// meanwhile (a parameter's virtual operations while an instance is built, say)
// are neither logged nor aborted: the log shows what the host asked for, and
// the fault switch strikes only where the host can see the abort.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

namespace tarsel_ref {

// Text forms of entry arguments as the call log shows them.
std::string describe(const char *text);
std::string describe(const void *pointer);
std::string describe(long long value);
std::string describe(double value);
inline std::string describe(int value) { return describe(static_cast<long long>(value)); }
inline std::string describe(unsigned value) { return describe(static_cast<long long>(value)); }
inline std::string describe(std::size_t value) { return describe(static_cast<long long>(value)); }
inline std::string describe(bool value) { return value ? "true" : "false"; }
inline std::string describe(float value) { return describe(static_cast<double>(value)); }

// What watches the entry points. entered() gets the entry's name and its
// arguments as text ("" unless wants_arguments() said yes, so that timing
// runs do not pay for formatting them); when `may_abort` it may throw
// TarselAbortException to fail the call.
struct EntryObserver {
  bool (*wants_arguments)();
  void (*entered)(const char *name, std::string arguments, bool may_abort);
};

// Installs `observer` (null: none) for every entry point from now on.
void set_entry_observer(const EntryObserver *observer);

// Tells the observer of an entry.
void record_entry(const char *name, std::string arguments, bool may_abort = true);

// Whether the observer wants the arguments as text.
bool call_log_enabled();

// Depth of engine entry calls on the calling thread.
int &entry_depth();

class EntryScope {
public:
  EntryScope() { ++entry_depth(); }
  ~EntryScope() { --entry_depth(); }
  EntryScope(const EntryScope &) = delete;
  EntryScope &operator=(const EntryScope &) = delete;
};

inline void join_arguments(std::string &) {}
template <typename First, typename... Rest>
void join_arguments(std::string &out, const First &first, const Rest &...rest) {
  if (!out.empty()) out += ", ";
  out += describe(first);
  join_arguments(out, rest...);
}

template <typename... Args>
EntryScope enter(const char *name, const Args &...args) {
  if (entry_depth() == 0) {
    std::string arguments;
    if (call_log_enabled()) join_arguments(arguments, args...);
    record_entry(name, std::move(arguments));
  }
  return EntryScope();
}

// For entry points that must not throw (destructors): logged like enter(), but
// the fault switch stays armed for the next call.
template <typename... Args>
void note_entry(const char *name, const Args &...args) {
  if (entry_depth() != 0) return;
  std::string arguments;
  if (call_log_enabled()) join_arguments(arguments, args...);
  record_entry(name, std::move(arguments), false);
}

}  // namespace tarsel_ref
