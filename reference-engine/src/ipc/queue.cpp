// Locks, futex sleeps and the ring arithmetic of one transport direction.
#include "ipc/queue.h"

#include <errno.h>
#include <fcntl.h>
#include <linux/futex.h>
#include <signal.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <climits>
#include <cmath>
#include <cstdio>
#include <cstring>

namespace tarsel_ref {
namespace ipc {
namespace {

constexpr int64_t kNanosecondsPerSecond = 1000 * 1000 * 1000;

timespec to_timespec(int64_t nanoseconds) {
  timespec ts;
  ts.tv_sec = static_cast<time_t>(nanoseconds / kNanosecondsPerSecond);
  ts.tv_nsec = static_cast<long>(nanoseconds % kNanosecondsPerSecond);
  return ts;
}

// Whether no thread holds the lock (a plain read of its futex word, where
// the C library's layout is known; otherwise always "maybe").
bool lock_looks_free(const pthread_mutex_t *lock) {
#if defined(__GLIBC__)
  return (__atomic_load_n(&lock->__data.__lock, __ATOMIC_RELAXED) & FUTEX_TID_MASK) == 0;
#else
  (void)lock;
  return true;
#endif
}

}  // namespace

int64_t monotonic_nanoseconds() {
  timespec ts;
  clock_gettime(CLOCK_MONOTONIC, &ts);
  return static_cast<int64_t>(ts.tv_sec) * kNanosecondsPerSecond + ts.tv_nsec;
}

bool spinning_pays() {
  static const bool pays = sysconf(_SC_NPROCESSORS_ONLN) > 1;
  return pays;
}

Deadline Deadline::after(double seconds) {
  if (!(seconds > 0)) return Deadline{kUntil, monotonic_nanoseconds()};
  if (seconds > 10.0 * 365 * 24 * 3600) return forever();
  return Deadline{kUntil, monotonic_nanoseconds() + static_cast<int64_t>(std::ceil(seconds * 1e9))};
}

int64_t Deadline::slice_end(int64_t now) const {
  const int64_t end = now + kWaitSliceNanoseconds;
  return kind == kUntil && at < end ? at : end;
}

Queue::Queue(SegmentHeader *header, int index, unsigned char *segment, const std::atomic<bool> *truncated)
    : header_(header), truncated_(truncated), control_(&header->queue[index]),
      ring_(segment + header->ring_offset[index]), capacity_(header->capacity[index]) {}

ShmemError Queue::lock(const Deadline &deadline) {
  int result = pthread_mutex_trylock(&control_->lock);
  if (result == EBUSY) {
    if (deadline.kind == Deadline::kNone) return ShmemError::RETRY;
    // Locks are held for short moments: retrying briefly saves the sleep.
    // Only a lock that looks free is tried, so that the spinning leaves the
    // lock's cache line to its holder.
    spin(kSpinLockNanoseconds, deadline.kind == Deadline::kUntil ? deadline.at : 0, [&] {
      return lock_looks_free(&control_->lock) && (result = pthread_mutex_trylock(&control_->lock)) != EBUSY;
    });
    while (result == EBUSY) {
      if (load(header_->removed)) return ShmemError::INVALID_SEGMENT;
      const int64_t now = monotonic_nanoseconds();
      if (deadline.passed(now)) return ShmemError::TIMEOUT;
      const timespec until = to_timespec(deadline.slice_end(now));
      result = pthread_mutex_clocklock(&control_->lock, CLOCK_MONOTONIC, &until);
      if (result == ETIMEDOUT) result = EBUSY;
    }
  }
  if (result == EOWNERDEAD) {
    // The positions move in single stores, so the queue is consistent as the
    // dead owner left it.
    pthread_mutex_consistent(&control_->lock);
    add(control_->lock_recoveries, uint64_t(1));
    result = 0;
  }
  return result == 0 ? ShmemError::SHMEM_NO_ERROR : ShmemError::LOCK_ERROR;
}

void Queue::unlock() { pthread_mutex_unlock(&control_->lock); }

bool Queue::intact() const {
  if (truncated_ && truncated_->load(std::memory_order_acquire)) return false;
  return load(header_->magic) == kSegmentMagic && load(header_->layout_version) == kLayoutVersion &&
         load(header_->removed) == 0;
}

ShmemError Queue::place(uint64_t footprint, Placement *placement) {
  QueueControl &c = *control_;
  const uint64_t release_pos = c.release_pos;
  const uint64_t write_pos = c.write_pos;
  uint64_t base = c.base;
  if (!check_positions(base, release_pos, c.read_pos, write_pos, capacity_)) return ShmemError::INVALID_SEGMENT;
  if (release_pos == write_pos && base != write_pos) {
    // Empty: the next message starts the ring again, so an empty queue takes
    // a message as large as the ring allows.
    store(c.base, write_pos);
    base = write_pos;
  }
  const uint64_t offset = (write_pos - base) % capacity_;
  const uint64_t gap = offset + footprint > capacity_ ? capacity_ - offset : 0;
  if (write_pos - release_pos + gap + footprint > capacity_) return ShmemError::RETRY;
  placement->write_pos = write_pos;
  placement->base = base;
  placement->skip_offset = offset;
  placement->gap = gap;
  placement->offset = gap ? 0 : offset;
  placement->footprint = footprint;
  return ShmemError::SHMEM_NO_ERROR;
}

void Queue::publish(const Placement &placement, uint64_t body_size, const char desc[24], PendingWakes *wakes) {
  QueueControl &c = *control_;
  if (placement.gap) {
    MessageHeader_t marker{};
    marker.size = kWrapMarker;
    std::memcpy(ring_ + placement.skip_offset, &marker, sizeof marker);
  }
  const uint64_t id = c.next_id;
  MessageHeader_t header{};
  header.id = static_cast<uint32_t>(id);
  header.size = body_size;
  std::memcpy(header.desc, desc, sizeof header.desc);
  std::memcpy(ring_ + placement.offset, &header, sizeof header);
  // A writer that dies between these two stores leaves an id unused, never a
  // message half published.
  store(c.next_id, id + 1);
  store(c.write_pos, placement.write_pos + placement.gap + placement.footprint);
  add(c.messages_written, uint64_t(1));
  add(c.bytes_written, body_size);
  if (load(c.readers_waiting)) {
    __atomic_fetch_add(&c.data_seq, 1u, __ATOMIC_SEQ_CST);
    wakes->data = true;
  }
}

ShmemError Queue::locate(Located *message) {
  QueueControl &c = *control_;
  const uint64_t base = c.base;
  uint64_t read_pos = c.read_pos;
  const uint64_t write_pos = c.write_pos;
  if (!check_positions(base, c.release_pos, read_pos, write_pos, capacity_)) return ShmemError::INVALID_SEGMENT;
  if (read_pos == write_pos) return ShmemError::RETRY;
  uint64_t offset = (read_pos - base) % capacity_;
  auto *header = reinterpret_cast<MessageHeader_t *>(ring_ + offset);
  if (header->size == kWrapMarker) {
    read_pos += capacity_ - offset;
    offset = 0;
    header = reinterpret_cast<MessageHeader_t *>(ring_);
    if (read_pos >= write_pos) return ShmemError::INVALID_SEGMENT;
  }
  const uint64_t size = header->size;
  const uint64_t footprint = message_footprint(size, capacity_);
  if (footprint == 0 || offset + footprint > capacity_ || footprint > write_pos - read_pos)
    return ShmemError::INVALID_SEGMENT;
  message->header = header;
  message->size = size;
  message->end = read_pos + footprint;
  return ShmemError::SHMEM_NO_ERROR;
}

void Queue::release_read(PendingWakes *wakes) {
  QueueControl &c = *control_;
  const uint64_t read_pos = c.read_pos;
  if (c.release_pos >= read_pos) return;
  store(c.release_pos, read_pos);
  if (load(c.writers_waiting)) {
    __atomic_fetch_add(&c.space_seq, 1u, __ATOMIC_SEQ_CST);
    wakes->space = true;
  }
}

void Queue::sleep(uint32_t *word, uint32_t seen, int64_t until) {
  const timespec at = to_timespec(until);
  // Shared between processes, so not FUTEX_PRIVATE_FLAG; the bitset form
  // takes an absolute CLOCK_MONOTONIC time.
  syscall(SYS_futex, word, FUTEX_WAIT_BITSET, seen, &at, nullptr, FUTEX_BITSET_MATCH_ANY);
}

namespace {

sigset_t host_signals() {
  sigset_t signals;
  sigfillset(&signals);
  for (int fault : {SIGBUS, SIGSEGV, SIGILL, SIGFPE, SIGTRAP, SIGSYS}) sigdelset(&signals, fault);
  return signals;
}

}  // namespace

namespace {

thread_local int signals_held_depth = 0;
thread_local sigset_t mask_before_held;  // the thread's own mask, outside every holder

}  // namespace

SignalsHeldBack::SignalsHeldBack() {
  static const sigset_t held = host_signals();
  if (signals_held_depth++ == 0) pthread_sigmask(SIG_BLOCK, &held, &mask_before_held);
}

SignalsHeldBack::~SignalsHeldBack() {
  if (--signals_held_depth == 0) pthread_sigmask(SIG_SETMASK, &mask_before_held, nullptr);
}

namespace {

// Whether a signal would do anything once let through: one that is ignored,
// by its handler or by default (a child ending, a window resized), must not
// end a wait, or a host's unrelated child process would cut its reads short.
bool signal_acts(int signal) {
  struct sigaction action;
  if (sigaction(signal, nullptr, &action) != 0) return true;
  if (action.sa_handler == SIG_IGN) return false;
  if (action.sa_handler != SIG_DFL) return true;
  return signal != SIGCHLD && signal != SIGCONT && signal != SIGURG && signal != SIGWINCH;
}

}  // namespace

bool SignalsHeldBack::signal_waiting() {
  sigset_t pending;
  if (sigpending(&pending) != 0) return false;
  for (int signal = 1; signal < NSIG; ++signal)
    if (sigismember(&pending, signal) == 1 && sigismember(&mask_before_held, signal) == 0 && signal_acts(signal))
      return true;
  return false;
}

void Queue::wake_all(uint32_t *word) { syscall(SYS_futex, word, FUTEX_WAKE, INT_MAX, nullptr, nullptr, 0); }

void Queue::wake(PendingWakes *wakes) {
  if (wakes->data) wake_all(&control_->data_seq);
  if (wakes->space) wake_all(&control_->space_seq);
  wakes->data = wakes->space = false;
}

void Queue::wake_everyone() {
  __atomic_fetch_add(&control_->data_seq, 1u, __ATOMIC_SEQ_CST);
  __atomic_fetch_add(&control_->space_seq, 1u, __ATOMIC_SEQ_CST);
  wake_all(&control_->data_seq);
  wake_all(&control_->space_seq);
}

void copy_description(char field[24], const char *desc) {
  std::memset(field, 0, 24);
  if (!desc) return;
  for (int i = 0; i < 24 && desc[i]; ++i) field[i] = desc[i];
}

bool process_exists(int32_t pid) {
  if (pid <= 0) return false;
  if (kill(pid, 0) != 0 && errno != EPERM) return false;
#if defined(__linux__)
  // A process that has died but that its parent has not reaped yet (the host
  // that started its helper, say) still answers kill(); its state in /proc is
  // Z (zombie) or X (dead). The state follows the command name, whose closing
  // parenthesis is the last in the line.
  char path[32];
  std::snprintf(path, sizeof path, "/proc/%d/stat", static_cast<int>(pid));
  const int fd = open(path, O_RDONLY | O_CLOEXEC);
  if (fd < 0) return errno != ENOENT;  // gone between the two looks
  char stat[512];
  const ssize_t length = read(fd, stat, sizeof stat - 1);
  close(fd);
  if (length <= 0) return true;
  stat[length] = '\0';
  const char *end_of_name = std::strrchr(stat, ')');
  if (end_of_name && end_of_name[1] == ' ' && (end_of_name[2] == 'Z' || end_of_name[2] == 'X')) return false;
#endif
  return true;
}

}  // namespace ipc
}  // namespace tarsel_ref
