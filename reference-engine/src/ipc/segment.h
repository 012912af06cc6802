// Byte layout of a shared-memory transport segment, and the checks that tell
// a segment of this layout from anything else found under its name.
//
// A segment is one POSIX shared-memory object "/tarsel-ipc.<name>":
//
//   offset 0          SegmentHeader (identity, process ids, the removed flag
//                     and the two queues' control blocks), padded to 4096
//   4096              ring of the server-to-client queue, capacity[0] bytes
//   4096 + cap[0]     ring of the client-to-server queue, capacity[1] bytes
//
// Every field is native-endian and shared by the processes on one machine.
// Fields that change while peers are attached are read and written with
// atomic operations (the helpers below) or under the queue's lock.
#pragma once

#include <pthread.h>

#include <cstddef>
#include <cstdint>
#include <string>

namespace tarsel_ref {
namespace ipc {

// "TRSLIPC\x01" read as a little-endian integer: the first eight bytes.
constexpr uint64_t kSegmentMagic = 0x014350494c535254ull;
// Raised whenever any field below moves or changes meaning.
constexpr uint32_t kLayoutVersion = 1;
// The header's share of the segment; the first ring starts on a page.
constexpr uint64_t kHeaderBytes = 4096;
// Messages start on 64-byte boundaries; a message header is 64 bytes.
constexpr uint64_t kMessageAlignment = 64;
constexpr uint64_t kMessageHeaderBytes = 64;
// Bounds of a queue's capacity (a multiple of 64).
constexpr uint64_t kMinCapacity = 4096;
constexpr uint64_t kMaxCapacity = uint64_t(1) << 30;
// MessageHeader_t::size of a wrap marker: the rest of the ring is skipped.
constexpr uint64_t kWrapMarker = ~uint64_t(0);
// Longest name, without its optional leading "/".
constexpr std::size_t kMaxNameLength = 200;
// Prefix of the shared-memory object's name; in /dev/shm without the "/".
constexpr const char *kObjectPrefix = "/tarsel-ipc.";

// Queue indices: the server writes queue 0 and reads queue 1, the client the
// opposite.
constexpr int kServerToClient = 0;
constexpr int kClientToServer = 1;

// One direction's shared state. Positions count bytes since the queue was
// made and only grow: the ring offset of position p is (p - base) % capacity.
// release_pos <= read_pos <= write_pos and write_pos - release_pos <= capacity.
// [release_pos, read_pos) holds the messages read and still held for the
// reader; [read_pos, write_pos) the messages not read yet. Each position moves
// in one store, so a process that dies anywhere leaves a consistent queue.
// The fields are grouped by who writes them, one group per cache line, so
// that the two processes pass as few lines back and forth as they can.
struct QueueControl {
  // Taken by both sides for every operation.
  alignas(64) pthread_mutex_t lock;  // robust and process-shared; guards the positions
  uint64_t base;                     // position of ring offset 0 (moved only while empty)
  uint64_t lock_recoveries;          // locks taken over from a dead owner
  // Written only when a thread goes to sleep or is woken.
  alignas(64) uint32_t data_seq;  // futex word: bumped when a message is published
  uint32_t space_seq;             // futex word: bumped when space is released
  uint32_t readers_waiting;       // threads asleep on data_seq
  uint32_t writers_waiting;       // threads asleep on space_seq
  // Written by the writer. Statistics are relaxed atomic additions.
  alignas(64) uint64_t write_pos;  // end of the published messages
  uint64_t next_id;                // id of the next message written (from 1)
  uint64_t messages_written;
  uint64_t bytes_written;  // body bytes
  uint64_t write_waits;    // writes and reservations that had to sleep
  uint64_t write_errors;   // writes, reservations and commits that failed
  // Written by the reader.
  alignas(64) uint64_t release_pos;  // first byte still in use
  uint64_t read_pos;                 // next message to read
  uint64_t messages_read;
  uint64_t bytes_read;   // body bytes
  uint64_t read_waits;   // reads that had to sleep
  uint64_t read_errors;  // reads that failed
};

struct SegmentHeader {
  uint64_t magic;           // kSegmentMagic, stored last when the segment is made
  uint32_t layout_version;  // kLayoutVersion
  uint32_t header_bytes;    // kHeaderBytes
  uint64_t segment_bytes;   // size of the whole object
  uint64_t capacity[2];     // ring sizes, multiples of 64
  uint64_t ring_offset[2];  // where the rings start
  uint32_t mutex_bytes;     // sizeof(pthread_mutex_t) of the maker
  uint32_t queue_bytes;     // sizeof(QueueControl) of the maker
  int32_t server_pid;       // the serving process
  int32_t client_pid;       // the connected client's process; 0 when none
  uint32_t removed;         // 1 once removed or reset: every operation fails
  uint32_t unused;
  QueueControl queue[2];  // kServerToClient, kClientToServer
};

static_assert(sizeof(SegmentHeader) <= kHeaderBytes, "the header fits its page");
static_assert(sizeof(QueueControl) == 4 * 64, "a queue's control block is four cache lines");

// Whether `bytes` (the whole object, `size` bytes) holds a segment of this
// layout: identity, version, sizes and offsets consistent with `size`,
// capacities within bounds, process ids not negative. Reads the bytes only
// (any alignment, any content); the queue positions, which peers change while
// attached, are checked separately by check_positions. On failure `why` (when
// not null) says what is wrong.
bool check_segment(const void *bytes, std::size_t size, std::string *why);

// Whether a queue's positions are consistent with its capacity (see
// QueueControl) and fall on message boundaries (multiples of 64 from base). Callers hold the queue's lock or own the bytes.
bool check_positions(uint64_t base, uint64_t release_pos, uint64_t read_pos, uint64_t write_pos, uint64_t capacity);

// The shared-memory object name for a transport name: kObjectPrefix followed
// by the name without its optional leading "/". False for a name that is
// null, empty (apart from the "/"), longer than kMaxNameLength or holding
// another "/".
bool object_name(const char *name, std::string *object);

// Bytes a message with a body of `body_size` bytes takes in a ring (header
// included); 0 when it could never fit a ring of `capacity` bytes.
inline uint64_t message_footprint(uint64_t body_size, uint64_t capacity) {
  if (capacity < kMessageHeaderBytes || body_size > capacity - kMessageHeaderBytes) return 0;
  const uint64_t padded = (body_size + kMessageAlignment - 1) & ~(kMessageAlignment - 1);
  const uint64_t footprint = kMessageHeaderBytes + padded;
  return footprint <= capacity ? footprint : 0;
}

// Atomic access to fields other processes change.
template <typename T>
inline T load(const T &field) {
  return __atomic_load_n(&field, __ATOMIC_ACQUIRE);
}
template <typename T>
inline void store(T &field, T value) {
  __atomic_store_n(&field, value, __ATOMIC_RELEASE);
}
template <typename T>
inline void add(T &field, T amount) {
  __atomic_fetch_add(&field, amount, __ATOMIC_RELAXED);
}

}  // namespace ipc
}  // namespace tarsel_ref
