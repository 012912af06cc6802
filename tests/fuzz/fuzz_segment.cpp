// Fuzz target: the check that tells a shared-memory transport segment from
// anything else found under its name (check_segment, reference-engine/src/ipc/).
//
// Input: one byte choosing the object's size, then the header bytes (at most
// a page). The bytes are checked in two places:
//   - a read-only shared mapping of a memory file as large as the chosen size,
//     the header at its start, the rest zero: as a peer finds a segment (a
//     write through it faults);
//   - a heap copy of exactly the bytes given, at an odd address, so that
//     AddressSanitizer sees any read past the object.
// The answer must be the same with and without a reason, a refusal must give
// a reason, and an acceptance must hold for the header as the segment's
// layout describes it (checked here field by field). An accepted header's
// queue positions then go through check_positions, whose answer is checked
// the same way.
//
// Built with libFuzzer by tools/fuzz.sh; built without it (with
// replay_main.cpp) by the short run in tests/fuzz/test_fuzz_short.py.
#include <sys/mman.h>
#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <initializer_list>
#include <string>
#include <vector>

#include "ipc/segment.h"

using namespace tarsel_ref::ipc;

namespace {

void require(bool condition, const char *what) {
  if (!condition) {
    std::fprintf(stderr, "fuzz_segment: %s\n", what);
    std::abort();
  }
}

template <typename T>
T read_at(const unsigned char *bytes, std::size_t offset) {
  T value;
  std::memcpy(&value, bytes + offset, sizeof value);
  return value;
}

// What an acceptance promises, from the fields of the header.
bool describes_segment(const unsigned char *bytes, std::size_t size) {
  if (size < sizeof(SegmentHeader)) return false;
  SegmentHeader h;
  std::memcpy(&h, bytes, sizeof h);
  if (h.magic != kSegmentMagic || h.layout_version != kLayoutVersion || h.header_bytes != kHeaderBytes) return false;
  if (h.mutex_bytes != sizeof(pthread_mutex_t) || h.queue_bytes != sizeof(QueueControl)) return false;
  for (int q = 0; q < 2; ++q)
    if (h.capacity[q] < kMinCapacity || h.capacity[q] > kMaxCapacity || h.capacity[q] % kMessageAlignment != 0)
      return false;
  if (h.ring_offset[0] != kHeaderBytes || h.ring_offset[1] != kHeaderBytes + h.capacity[0]) return false;
  if (h.segment_bytes != size || kHeaderBytes + h.capacity[0] + h.capacity[1] != size) return false;
  return h.server_pid > 0 && h.client_pid >= 0;
}

bool consistent_positions(uint64_t base, uint64_t release, uint64_t read, uint64_t write, uint64_t capacity) {
  if (!(base <= release && release <= read && read <= write)) return false;
  if (write - release > capacity) return false;
  for (uint64_t p : {release, read, write})
    if ((p - base) % kMessageAlignment != 0) return false;
  return true;
}

void check(const unsigned char *bytes, std::size_t size) {
  std::string why = "unchanged";
  const bool accepted = check_segment(bytes, size, &why);
  require(accepted == check_segment(bytes, size, nullptr), "the answer depends on asking for a reason");
  require(accepted == describes_segment(bytes, size), "the answer disagrees with the header's fields");
  if (!accepted) {
    require(!why.empty() && why != "unchanged", "a refusal gave no reason");
    return;
  }
  require(why == "unchanged", "an acceptance changed the reason");
  for (int q = 0; q < 2; ++q) {
    const std::size_t at = offsetof(SegmentHeader, queue) + q * sizeof(QueueControl);
    const uint64_t base = read_at<uint64_t>(bytes, at + offsetof(QueueControl, base));
    const uint64_t release = read_at<uint64_t>(bytes, at + offsetof(QueueControl, release_pos));
    const uint64_t read = read_at<uint64_t>(bytes, at + offsetof(QueueControl, read_pos));
    const uint64_t write = read_at<uint64_t>(bytes, at + offsetof(QueueControl, write_pos));
    const uint64_t capacity = read_at<uint64_t>(bytes, offsetof(SegmentHeader, capacity) + q * sizeof(uint64_t));
    require(check_positions(base, release, read, write, capacity) ==
                consistent_positions(base, release, read, write, capacity),
            "check_positions disagrees with the queue's rules");
  }
}

// The object size the first byte chooses: what the header records (so that
// a header can be accepted), the bytes given, or sizes near the header's.
std::size_t chosen_size(uint8_t choice, const uint8_t *header, std::size_t header_size) {
  uint64_t recorded = 0;
  if (header_size >= offsetof(SegmentHeader, segment_bytes) + sizeof(uint64_t))
    recorded = read_at<uint64_t>(header, offsetof(SegmentHeader, segment_bytes));
  switch (choice % 4) {
    case 0:
    case 1:
      // A real segment is at most a page and two rings of 1 GiB; the mapping
      // reserves address space only.
      return recorded <= kHeaderBytes + 2 * kMaxCapacity ? static_cast<std::size_t>(recorded) : header_size;
    case 2:
      return header_size;
    default:
      return sizeof(SegmentHeader) - 8 + choice / 4 % 16;
  }
}

void check_mapped(const uint8_t *header, std::size_t header_size, std::size_t size) {
  if (size == 0) return;  // nothing to map; the heap copy covers it
  const int fd = memfd_create("fuzz-segment", 0);
  require(fd >= 0, "memfd_create failed");
  require(ftruncate(fd, static_cast<off_t>(size)) == 0, "ftruncate failed");
  const std::size_t written = header_size < size ? header_size : size;
  require(pwrite(fd, header, written, 0) == static_cast<ssize_t>(written), "pwrite failed");
  void *mapped = mmap(nullptr, size, PROT_READ, MAP_SHARED, fd, 0);
  close(fd);
  require(mapped != MAP_FAILED, "mmap failed");
  check(static_cast<const unsigned char *>(mapped), size);
  munmap(mapped, size);
}

void check_copied(const uint8_t *header, std::size_t header_size) {
  // One byte in, so that the header sits at an odd address.
  std::vector<unsigned char> storage(header_size + 1);
  std::memcpy(storage.data() + 1, header, header_size);
  unsigned char *exact = static_cast<unsigned char *>(std::malloc(header_size ? header_size : 1));
  std::memcpy(exact, header, header_size);
  check(storage.data() + 1, header_size);
  check(exact, header_size);
  std::free(exact);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, std::size_t size) {
  if (size == 0) return 0;
  const uint8_t choice = data[0];
  const uint8_t *header = data + 1;
  const std::size_t header_size = size - 1 < kHeaderBytes ? size - 1 : kHeaderBytes;
  check_copied(header, header_size);
  check_mapped(header, header_size, chosen_size(choice, header, header_size));
  require(!check_segment(nullptr, sizeof(SegmentHeader), nullptr), "null bytes accepted");
  return 0;
}
