// A test probe's call log: the latest entries in order, read by index through
// a C interface that hands out a text pointer. The engine's probe and the
// monitor library's each keep one.
#pragma once

#include <cstddef>
#include <deque>
#include <mutex>
#include <string>
#include <utility>

namespace tarsel_ref {

class CallLog {
public:
  explicit CallLog(std::size_t capacity) : capacity_(capacity) {}

  // Appends `entry`, dropping the oldest once the log holds `capacity`.
  void append(std::string entry) {
    std::lock_guard<std::mutex> lock(mutex_);
    if (entries_.size() == capacity_) entries_.pop_front();
    entries_.push_back(std::move(entry));
  }

  int count() {
    std::lock_guard<std::mutex> lock(mutex_);
    return static_cast<int>(entries_.size());
  }

  // Entry `index`, or null; the text stays valid until the next call of at().
  const char *at(int index) {
    std::lock_guard<std::mutex> lock(mutex_);
    if (index < 0 || static_cast<std::size_t>(index) >= entries_.size()) return nullptr;
    returned_ = entries_[static_cast<std::size_t>(index)];
    return returned_.c_str();
  }

  void clear() {
    std::lock_guard<std::mutex> lock(mutex_);
    entries_.clear();
  }

private:
  const std::size_t capacity_;
  std::mutex mutex_;
  std::deque<std::string> entries_;
  std::string returned_;
};

}  // namespace tarsel_ref
