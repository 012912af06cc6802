// ShmemTransport: reads, reservations and writes over a mapped segment.
#include "ipc/transport.h"

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cinttypes>
#include <cstdio>
#include <cstring>
#include <optional>
#include <unordered_map>

#include "ipc/truncation.h"

namespace tarsel_ref {
namespace ipc {
namespace {

struct Registry {
  std::mutex mutex;
  std::unordered_map<const void *, Endpoint *> endpoints;
};

Registry &registry() {
  static Registry *instance = new Registry;  // never destroyed: transports may be freed during exit
  return *instance;
}

std::atomic<uint64_t> endpoint_serials{0};

// Outcomes of the calling thread's last operations, by endpoint serial, for
// the few transports it used last: a thread sharing a transport reads its own
// outcome, not that of a thread that ran after it.
struct ThreadOutcome {
  uint64_t serial = 0;
  int error = 0;
};
constexpr int kThreadOutcomes = 8;
thread_local ThreadOutcome thread_outcomes[kThreadOutcomes];
thread_local unsigned thread_outcome_next = 0;
thread_local bool wait_interrupted = false;

}  // namespace

void register_endpoint(const void *transport, Endpoint *endpoint) {
  std::lock_guard<std::mutex> lock(registry().mutex);
  registry().endpoints[transport] = endpoint;
}

Endpoint *find_endpoint(const void *transport) {
  std::lock_guard<std::mutex> lock(registry().mutex);
  auto found = registry().endpoints.find(transport);
  return found == registry().endpoints.end() ? nullptr : found->second;
}

bool unregister_endpoint(const void *transport) {
  std::lock_guard<std::mutex> lock(registry().mutex);
  return registry().endpoints.erase(transport) != 0;
}

bool mark_removed(SegmentHeader *header, unsigned char *segment) {
  const bool first = __atomic_exchange_n(&header->removed, 1u, __ATOMIC_SEQ_CST) == 0;
  for (int index = 0; index < 2; ++index) Queue(header, index, segment).wake_everyone();
  return first;
}

bool unlink_if_same(const std::string &object, dev_t device, ino_t inode) {
  const int fd = shm_open(object.c_str(), O_RDONLY, 0);
  if (fd < 0) return false;
  struct stat info;
  const bool same = fstat(fd, &info) == 0 && info.st_dev == device && info.st_ino == inode;
  close(fd);
  return same && shm_unlink(object.c_str()) == 0;
}

Endpoint::Endpoint(const Mapping &mapping, bool server, std::string object)
    : mapping_(mapping), server_(server), object_(std::move(object)), serial_(++endpoint_serials),
      out_(mapping.header(), server ? kServerToClient : kClientToServer, mapping.bytes, mapping.truncated),
      in_(mapping.header(), server ? kClientToServer : kServerToClient, mapping.bytes, mapping.truncated) {}

Endpoint::~Endpoint() {
  if (!mapping_.bytes) return;
  // Whatever this end read is no longer held; an open reservation lapses.
  if (in_.intact() && in_.lock(Deadline::after(0.05)) == ShmemError::SHMEM_NO_ERROR) {
    PendingWakes wakes;
    in_.release_read(&wakes);
    in_.unlock();
    in_.wake(&wakes);
  }
  if (!server_) {
    int32_t own = getpid();  // a forked child freeing an inherited end leaves its parent attached
    __atomic_compare_exchange_n(&mapping_.header()->client_pid, &own, 0, false, __ATOMIC_SEQ_CST, __ATOMIC_SEQ_CST);
  }
  unguard_mapping(mapping_.bytes);
  munmap(mapping_.bytes, mapping_.size);
  if (mapping_.fd >= 0) close(mapping_.fd);
}

void Endpoint::record(ShmemError error) {
  last_error_.store(static_cast<int>(error), std::memory_order_relaxed);
  for (ThreadOutcome &outcome : thread_outcomes) {
    if (outcome.serial == serial_) {
      outcome.error = static_cast<int>(error);
      return;
    }
  }
  thread_outcomes[thread_outcome_next++ % kThreadOutcomes] = ThreadOutcome{serial_, static_cast<int>(error)};
}

ShmemError Endpoint::last_error() const {
  for (const ThreadOutcome &outcome : thread_outcomes)
    if (outcome.serial == serial_) return static_cast<ShmemError>(outcome.error);
  return static_cast<ShmemError>(last_error_.load(std::memory_order_relaxed));
}

ShmemError Endpoint::fail(ShmemError error, Queue &queue, bool writing) {
  record(error);
  add(writing ? queue.control().write_errors : queue.control().read_errors, uint64_t(1));
  return error;
}

bool Endpoint::peer_gone(int64_t now) {
  SegmentHeader *header = mapping_.header();
  const int32_t pid = load(server_ ? header->client_pid : header->server_pid);
  if (pid == 0) return !server_;
  std::lock_guard<std::mutex> lock(peer_mutex_);
  if (pid != checked_pid_ || now - checked_at_ >= kWaitSliceNanoseconds) {
    checked_pid_ = pid;
    checked_alive_ = process_exists(pid);
    checked_at_ = now;
  }
  return !checked_alive_;
}

bool Endpoint::object_shrunk(int64_t now) {
  std::lock_guard<std::mutex> lock(peer_mutex_);
  if (now - sized_at_ < kWaitSliceNanoseconds) return false;
  sized_at_ = now;
  struct stat info;
  return mapping_.fd >= 0 && fstat(mapping_.fd, &info) == 0 && static_cast<std::size_t>(info.st_size) < mapping_.size;
}

template <typename Ready>
ShmemError Endpoint::wait_until(Queue &queue, bool for_data, const Deadline &deadline, PendingWakes *wakes,
                                Ready ready) {
  wait_interrupted = false;
  std::optional<SignalsHeldBack> signals;
  QueueControl &control = queue.control();
  uint32_t *word = for_data ? &control.data_seq : &control.space_seq;
  uint32_t *waiting = for_data ? &control.readers_waiting : &control.writers_waiting;
  bool counted = false;
  bool spun = !spinning_pays();
  for (;;) {
    // Loaded before the checks: a change made after them (a publish, a
    // release, a removal) changes the word, so the sleep below cannot miss it.
    const uint32_t seen = __atomic_load_n(word, __ATOMIC_SEQ_CST);
    ShmemError state = queue.intact() ? ready() : ShmemError::INVALID_SEGMENT;
    if (state == ShmemError::SHMEM_NO_ERROR) return state;
    if (state == ShmemError::RETRY && deadline.kind != Deadline::kNone) {
      // From the first moment the call may wait, before any system call
      // here: a signal handled before the sleep would be missed by it.
      if (!signals) signals.emplace();
      const int64_t now = monotonic_nanoseconds();
      if (deadline.passed(now))
        state = ShmemError::TIMEOUT;
      else if (object_shrunk(now))
        state = ShmemError::INVALID_SEGMENT;
      else if (!peer_gone(now))
        state = ShmemError::SHMEM_NO_ERROR;  // wait
    }
    if (state != ShmemError::SHMEM_NO_ERROR) {
      queue.unlock();
      queue.wake(wakes);
      return state;
    }
    if (!spun) {
      // First watch the position the peer moves, without the lock and
      // without announcing a sleeper, so that a quick peer owes no wake-up.
      spun = true;
      uint64_t *position = for_data ? &control.write_pos : &control.release_pos;
      const uint64_t observed = *position;
      queue.unlock();
      queue.wake(wakes);
      spin(kSpinWaitNanoseconds, deadline.kind == Deadline::kUntil ? deadline.at : 0,
           [&] { return load(*position) != observed || load(queue.header()->removed) != 0; });
      const ShmemError locked = queue.lock(deadline);
      if (locked != ShmemError::SHMEM_NO_ERROR) return locked;
      continue;
    }
    if (!counted) {
      add(for_data ? control.read_waits : control.write_waits, uint64_t(1));
      counted = true;
    }
    __atomic_fetch_add(waiting, 1u, __ATOMIC_SEQ_CST);
    queue.unlock();
    queue.wake(wakes);
    const bool slept = signals->sleep([&] { Queue::sleep(word, seen, deadline.slice_end(monotonic_nanoseconds())); });
    __atomic_fetch_sub(waiting, 1u, __ATOMIC_SEQ_CST);
    if (!slept) {
      wait_interrupted = true;
      return ShmemError::RETRY;  // the lock is not held: nothing to give back; the signal comes on return
    }
    const ShmemError locked = queue.lock(deadline);
    if (locked != ShmemError::SHMEM_NO_ERROR) return locked;
  }
}

bool Endpoint::interrupted() { return wait_interrupted; }

std::size_t Endpoint::receive(void **data, MessageHeader_t **header, const Deadline &deadline) {
  if (data) *data = nullptr;
  if (header) *header = nullptr;
  const bool query = !data && header;
  ShmemError error = in_.intact() ? in_.lock(deadline) : ShmemError::INVALID_SEGMENT;
  if (error != ShmemError::SHMEM_NO_ERROR) return fail(error, in_, false), 0;
  PendingWakes wakes;
  if (!query && in_.intact()) in_.release_read(&wakes);
  Located message;
  error = wait_until(in_, true, deadline, &wakes, [&] { return in_.locate(&message); });
  if (error != ShmemError::SHMEM_NO_ERROR) return fail(error, in_, false), 0;
  if (!in_.intact()) {  // the message's pages went while it was looked at
    in_.unlock();
    in_.wake(&wakes);
    return fail(ShmemError::INVALID_SEGMENT, in_, false), 0;
  }
  if (!query) {
    QueueControl &control = in_.control();
    store(control.read_pos, message.end);
    add(control.messages_read, uint64_t(1));
    add(control.bytes_read, message.size);
  }
  in_.unlock();
  in_.wake(&wakes);
  if (data) *data = reinterpret_cast<unsigned char *>(message.header) + kMessageHeaderBytes;
  if (header) *header = message.header;
  succeed();
  return static_cast<std::size_t>(message.size);
}

std::size_t Endpoint::receive_retrying(void **data, MessageHeader_t **header, double timeout) {
  const Deadline deadline = Deadline::after(timeout);
  SignalsHeldBack signals;  // also between the attempts
  for (;;) {
    const std::size_t size = receive(data, header, deadline);
    const ShmemError error = last_error();
    if (error != ShmemError::RETRY && error != ShmemError::LOCK_ERROR) return size;
    const int64_t now = monotonic_nanoseconds();
    if (deadline.passed(now) || interrupted()) return size;
    // Look again shortly; never past the deadline.
    const int64_t pause = 1000 * 1000;
    const int64_t until = deadline.kind == Deadline::kUntil && deadline.at < now + pause ? deadline.at : now + pause;
    timespec ts{static_cast<time_t>((until - now) / 1000000000), static_cast<long>((until - now) % 1000000000)};
    if (!signals.sleep([&] { nanosleep(&ts, nullptr); })) {
      wait_interrupted = true;
      return size;
    }
  }
}

void *Endpoint::reserve(std::size_t size, const char *desc, const Deadline &deadline) {
  const uint64_t footprint = message_footprint(size, out_.capacity());
  if (footprint == 0) return fail(ShmemError::MSG_TOO_LARGE, out_, true), nullptr;
  ShmemError error = out_.intact() ? out_.lock(deadline) : ShmemError::INVALID_SEGMENT;
  if (error != ShmemError::SHMEM_NO_ERROR) return fail(error, out_, true), nullptr;
  PendingWakes wakes;
  Placement placement;
  error = wait_until(out_, false, deadline, &wakes, [&] { return out_.place(footprint, &placement); });
  if (error != ShmemError::SHMEM_NO_ERROR) return fail(error, out_, true), nullptr;
  // The new reservation replaces an open one (same place: the write
  // position has not moved); a reservation that failed left it open.
  reserved_ = true;
  reservation_ = placement;
  reserved_size_ = size;
  copy_description(reserved_desc_, desc);
  out_.unlock();
  out_.wake(&wakes);
  succeed();
  return out_.ring() + placement.offset + kMessageHeaderBytes;
}

bool Endpoint::commit() {
  ShmemError error = out_.intact() ? out_.lock(Deadline::forever()) : ShmemError::INVALID_SEGMENT;
  if (error != ShmemError::SHMEM_NO_ERROR) return fail(error, out_, true), false;
  if (!reserved_) {
    out_.unlock();
    return false;  // nothing reserved: nothing happens, the last error stays
  }
  reserved_ = false;
  QueueControl &control = out_.control();
  if (!out_.intact() || control.write_pos != reservation_.write_pos || control.base != reservation_.base) {
    out_.unlock();
    return fail(ShmemError::INVALID_SEGMENT, out_, true), false;
  }
  PendingWakes wakes;
  out_.publish(reservation_, reserved_size_, reserved_desc_, &wakes);
  out_.unlock();
  out_.wake(&wakes);
  succeed();
  return true;
}

bool Endpoint::send(const void *data, std::size_t size, const char *desc, const Deadline &deadline) {
  if (!data && size) return false;  // nothing to copy from: nothing happens
  const uint64_t footprint = message_footprint(size, out_.capacity());
  if (footprint == 0) return fail(ShmemError::MSG_TOO_LARGE, out_, true), false;
  ShmemError error = out_.intact() ? out_.lock(deadline) : ShmemError::INVALID_SEGMENT;
  if (error != ShmemError::SHMEM_NO_ERROR) return fail(error, out_, true), false;
  PendingWakes wakes;
  Placement placement;
  error = wait_until(out_, false, deadline, &wakes, [&] { return out_.place(footprint, &placement); });
  if (error != ShmemError::SHMEM_NO_ERROR) return fail(error, out_, true), false;
  reserved_ = false;  // the message takes an open reservation's place
  if (size) std::memcpy(out_.ring() + placement.offset + kMessageHeaderBytes, data, size);
  if (!out_.intact()) {  // the pages written went meanwhile: nothing is published
    out_.unlock();
    out_.wake(&wakes);
    return fail(ShmemError::INVALID_SEGMENT, out_, true), false;
  }
  char field[24];
  copy_description(field, desc);
  out_.publish(placement, size, field, &wakes);
  out_.unlock();
  out_.wake(&wakes);
  succeed();
  return true;
}

bool Endpoint::send_text(const char *text, const char *desc, const Deadline &deadline) {
  if (!text) return false;
  return send(text, std::strlen(text) + 1, desc, deadline);
}

bool Endpoint::remove() {
  SegmentHeader *header = mapping_.header();
  const bool first = mark_removed(header, mapping_.bytes);
  if (first && unlink_if_same(object_, mapping_.device, mapping_.inode)) {
    succeed();
    return true;
  }
  record(ShmemError::INVALID_SEGMENT);
  return false;
}

bool Endpoint::segment_valid() const {
  if (mapping_.truncated && mapping_.truncated->load(std::memory_order_acquire)) return false;
  // A truncation whose lost pages nobody has touched yet shows in the size.
  struct stat info;
  if (mapping_.fd >= 0 && fstat(mapping_.fd, &info) == 0 && static_cast<std::size_t>(info.st_size) < mapping_.size)
    return false;
  const SegmentHeader *header = mapping_.header();
  return check_segment(mapping_.bytes, mapping_.size, nullptr) && load(header->removed) == 0 &&
         header->capacity[kServerToClient] == capacity_of(kServerToClient) &&
         header->capacity[kClientToServer] == capacity_of(kClientToServer);
}

pid_t Endpoint::server_pid() const { return load(mapping_.header()->server_pid); }

bool Endpoint::client_exists() const { return process_exists(load(mapping_.header()->client_pid)); }

void Endpoint::print_stats() const {
  const SegmentHeader *header = mapping_.header();
  std::printf("shared-memory transport %s (%s end; server pid %d, client pid %d)%s\n", object_.c_str(),
              server_ ? "server" : "client", static_cast<int>(load(header->server_pid)),
              static_cast<int>(load(header->client_pid)), load(header->removed) ? " removed" : "");
  static const char *const names[2] = {"server to client", "client to server"};
  for (int index = 0; index < 2; ++index) {
    const QueueControl &c = header->queue[index];
    std::printf("  %s: capacity %" PRIu64 " bytes, %" PRIu64 " in use\n", names[index], capacity_of(index),
                load(c.write_pos) - load(c.release_pos));
    std::printf("    written %" PRIu64 " messages, %" PRIu64 " bytes; read %" PRIu64 " messages, %" PRIu64 " bytes\n",
                load(c.messages_written), load(c.bytes_written), load(c.messages_read), load(c.bytes_read));
    std::printf("    waits: %" PRIu64 " writing, %" PRIu64 " reading; errors: %" PRIu64 " writing, %" PRIu64
                " reading; locks recovered: %" PRIu64 "\n",
                load(c.write_waits), load(c.read_waits), load(c.write_errors), load(c.read_errors),
                load(c.lock_recoveries));
  }
  std::fflush(stdout);
}

}  // namespace ipc
}  // namespace tarsel_ref
