// Every exported engine entry point starts with enter(): it records the call in
// the probe's call log and honours the probe's "abort the next call" switch.
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

// Appends "name(arg, arg, ...)" to the call log, then throws
// TarselAbortException if the probe armed its fault switch.
void record_entry(const char *name, std::string arguments);

inline void join_arguments(std::string &) {}
template <typename First, typename... Rest>
void join_arguments(std::string &out, const First &first, const Rest &...rest) {
  if (!out.empty()) out += ", ";
  out += describe(first);
  join_arguments(out, rest...);
}

template <typename... Args>
void enter(const char *name, const Args &...args) {
  std::string arguments;
  join_arguments(arguments, args...);
  record_entry(name, std::move(arguments));
}

}  // namespace tarsel_ref
