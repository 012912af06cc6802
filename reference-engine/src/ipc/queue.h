// One direction of a transport: its lock, its sleeps and wake-ups, and the
// placement and lookup of messages in its ring. Every function here that
// touches positions expects the caller to hold the queue's lock.
#pragma once

#include <sched.h>
#include <signal.h>
#include <time.h>

#include <atomic>
#include <cstdint>

#include "ipc/segment.h"
#include "tarsel/ipc.h"

namespace tarsel_ref {
namespace ipc {

using Tarsel::IPC::MessageHeader_t;
using Tarsel::IPC::ShmemError;

// Blocking waits sleep at most this long before they look again at the
// segment and at the peer process.
constexpr int64_t kWaitSliceNanoseconds = 50 * 1000 * 1000;

// Before sleeping, a wait first watches the queue this long, and a busy lock
// is retried this long: a peer running on another processor usually answers
// sooner than a sleep and a wake-up take. The first kSpinBusyNanoseconds
// of it only spin; after that the watcher yields its processor between
// looks, so that a peer waiting for that processor (a loaded machine) runs
// at once. Not done on a single processor.
constexpr int64_t kSpinWaitNanoseconds = 20 * 1000;
constexpr int64_t kSpinLockNanoseconds = 5 * 1000;
constexpr int64_t kSpinBusyNanoseconds = 2 * 1000;

int64_t monotonic_nanoseconds();

// Whether the machine has more than one processor.
bool spinning_pays();

inline void cpu_relax() {
#if defined(__x86_64__) || defined(__i386__)
  __builtin_ia32_pause();
#elif defined(__aarch64__)
  asm volatile("yield");
#endif
}

// Calls `done` until it gives true or `budget` nanoseconds (at most until
// `limit`, CLOCK_MONOTONIC ns, when not 0) have passed; whether it gave true.
// At once false on a single processor.
template <typename Done>
bool spin(int64_t budget, int64_t limit, Done done) {
  if (!spinning_pays()) return false;
  const int64_t start = monotonic_nanoseconds();
  const int64_t end = limit && limit < start + budget ? limit : start + budget;
  for (unsigned round = 1;; ++round) {
    if (done()) return true;
    cpu_relax();
    if (round % 16 == 0) {
      const int64_t now = monotonic_nanoseconds();
      if (now >= end) return false;
      if (now - start >= kSpinBusyNanoseconds) sched_yield();
    }
  }
}

// How long an operation may wait: not at all (the try forms), until a moment
// on CLOCK_MONOTONIC (the timed forms) or for ever.
struct Deadline {
  enum Kind { kNone, kUntil, kForever };
  Kind kind = kNone;
  int64_t at = 0;  // nanoseconds of CLOCK_MONOTONIC, for kUntil

  static Deadline none() { return Deadline{kNone, 0}; }
  static Deadline forever() { return Deadline{kForever, 0}; }
  // `seconds` from now; not above 0 (or NaN): already passed; beyond ten
  // years: for ever.
  static Deadline after(double seconds);

  bool passed(int64_t now) const { return kind == kUntil && now >= at; }
  // End of the next sleep that starts at `now`.
  int64_t slice_end(int64_t now) const;
};

// Holds back, while a call waits, the signals a host handles (not the
// faults: SIGBUS, SIGSEGV and their kind still come at once). A signal that
// came while the wait was on its way to sleep would otherwise be handled
// before the sleep and missed by it, and the sleep would go on for ever; held
// back, it stays pending, and the wait looks for one before each sleep and
// after each sleep slice. It is let through, and handled, when the call
// returns. Holders nest (a retrying read holds them across its reads).
class SignalsHeldBack {
public:
  SignalsHeldBack();
  ~SignalsHeldBack();
  SignalsHeldBack(const SignalsHeldBack &) = delete;
  SignalsHeldBack &operator=(const SignalsHeldBack &) = delete;
  // Runs `sleep` (one slice of a Queue::sleep) unless a signal is waiting;
  // false when one was waiting before it or came during it.
  template <typename Sleep>
  bool sleep(Sleep sleep) {
    if (signal_waiting()) return false;
    sleep();
    return !signal_waiting();
  }

private:
  static bool signal_waiting();
};

// Where a message goes: the wrap marker's offset when `gap` is not 0, and the
// message's own offset.
struct Placement {
  uint64_t write_pos = 0;  // the queue's write position it was made at
  uint64_t base = 0;       // the queue's base it was made with
  uint64_t skip_offset = 0;
  uint64_t gap = 0;        // bytes skipped to the end of the ring
  uint64_t offset = 0;     // ring offset of the message header
  uint64_t footprint = 0;  // header and padded body
};

// The next unread message.
struct Located {
  MessageHeader_t *header = nullptr;
  uint64_t size = 0;  // body bytes
  uint64_t end = 0;   // read position after it
};

// Wake-ups owed once the lock is released.
struct PendingWakes {
  bool data = false;
  bool space = false;
};

class Queue {
public:
  // `truncated`: the mapping's flag (truncation.h), null for a passing look.
  Queue(SegmentHeader *header, int index, unsigned char *segment, const std::atomic<bool> *truncated = nullptr);

  SegmentHeader *header() const { return header_; }
  QueueControl &control() const { return *control_; }
  unsigned char *ring() const { return ring_; }
  uint64_t capacity() const { return capacity_; }

  // Takes the lock, waiting as `deadline` allows (in slices that end early
  // when the segment is removed). A lock whose owner died is made consistent
  // and taken. NO_ERROR, RETRY (kNone and busy), TIMEOUT, INVALID_SEGMENT
  // (removed while waiting) or LOCK_ERROR.
  ShmemError lock(const Deadline &deadline);
  void unlock();

  // Whether the segment still carries its identity, is not removed and was
  // not truncated under this process.
  bool intact() const;

  // Finds room for a message of `footprint` bytes: NO_ERROR and the
  // placement, RETRY when the room is not free yet, INVALID_SEGMENT for
  // inconsistent positions. An empty queue (nothing unread, nothing held)
  // starts again at ring offset 0.
  ShmemError place(uint64_t footprint, Placement *placement);

  // Writes the wrap marker and the message header, then publishes the
  // message in one store of the write position.
  void publish(const Placement &placement, uint64_t body_size, const char desc[24], PendingWakes *wakes);

  // Finds the next unread message: NO_ERROR, RETRY when there is none,
  // INVALID_SEGMENT when the ring does not hold a well-formed one.
  ShmemError locate(Located *message);

  // Releases the messages read so far (their space returns to the writer).
  void release_read(PendingWakes *wakes);

  // Sleeps while `*word` holds `seen`, until `until` (CLOCK_MONOTONIC ns).
  static void sleep(uint32_t *word, uint32_t seen, int64_t until);
  // Wakes every thread asleep on `word`.
  static void wake_all(uint32_t *word);
  // Sends the wake-ups owed (the lock released).
  void wake(PendingWakes *wakes);
  // Wakes every sleeper of this queue, readers and writers.
  void wake_everyone();

private:
  SegmentHeader *header_;
  const std::atomic<bool> *truncated_;
  QueueControl *control_;
  unsigned char *ring_;
  uint64_t capacity_;
};

// Fills the 24-byte description field: `desc` cut to 24 bytes, NUL-terminated
// and zero-filled when shorter, all zeros for null.
void copy_description(char field[24], const char *desc);

// Whether a process of that id is alive (it may belong to another user); a
// dead process that its parent has not reaped yet is not.
bool process_exists(int32_t pid);

}  // namespace ipc
}  // namespace tarsel_ref
