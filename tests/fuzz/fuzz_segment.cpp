// Fuzz target: the check that tells a shared-memory transport segment from
// anything else found under its name (check_segment, reference-engine/src/ipc/).
//
// Input: one byte choosing the object's size, then the header bytes (at most
// a page), checked in a read-only shared mapping of a memory file of the
// chosen size (the rest zero: as a peer finds a segment; a write faults), and
// in heap copies of exactly the bytes given, one at an odd address, so that
// AddressSanitizer sees any read past the object. The answer must not depend
// on asking for a reason, a refusal must give one, and an acceptance must
// hold for the header as the segment's layout describes it, field by field;
// an accepted header's queue positions must pass check_positions exactly
// when they follow the queue's rules.
//
// Built with libFuzzer by tools/fuzz.sh; with replay_main.cpp by the short
// run in tests/fuzz/test_fuzz_short.py.
#include <sys/mman.h>
#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
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

uint64_t word_at(const unsigned char *bytes, std::size_t offset) {
  uint64_t value;
  std::memcpy(&value, bytes + offset, sizeof value);
  return value;
}

// What an acceptance promises, from the fields of the header.
bool describes_segment(const unsigned char *bytes, std::size_t size) {
  if (size < sizeof(SegmentHeader)) return false;
  SegmentHeader h;
  std::memcpy(&h, bytes, sizeof h);
  bool ok = h.magic == kSegmentMagic && h.layout_version == kLayoutVersion && h.header_bytes == kHeaderBytes &&
            h.mutex_bytes == sizeof(pthread_mutex_t) && h.queue_bytes == sizeof(QueueControl);
  for (uint64_t capacity : h.capacity)
    ok = ok && capacity >= kMinCapacity && capacity <= kMaxCapacity && capacity % kMessageAlignment == 0;
  return ok && h.ring_offset[0] == kHeaderBytes && h.ring_offset[1] == kHeaderBytes + h.capacity[0] &&
         h.segment_bytes == size && kHeaderBytes + h.capacity[0] + h.capacity[1] == size && h.server_pid > 0 &&
         h.client_pid >= 0;
}

void check(const unsigned char *bytes, std::size_t size) {
  std::string why = "unchanged";
  const bool accepted = check_segment(bytes, size, &why);
  require(accepted == check_segment(bytes, size, nullptr), "the answer depends on asking for a reason");
  require(accepted == describes_segment(bytes, size), "the answer disagrees with the header's fields");
  require(accepted == (why == "unchanged") && !why.empty(), "a refusal gave no reason, or an acceptance one");
  for (int q = 0; accepted && q < 2; ++q) {
    const std::size_t at = offsetof(SegmentHeader, queue) + q * sizeof(QueueControl);
    const uint64_t base = word_at(bytes, at + offsetof(QueueControl, base)),
                   release = word_at(bytes, at + offsetof(QueueControl, release_pos)),
                   read = word_at(bytes, at + offsetof(QueueControl, read_pos)),
                   write = word_at(bytes, at + offsetof(QueueControl, write_pos)),
                   capacity = word_at(bytes, offsetof(SegmentHeader, capacity) + q * sizeof(uint64_t));
    const bool consistent = base <= release && release <= read && read <= write && write - release <= capacity &&
                            (release - base) % kMessageAlignment == 0 && (read - base) % kMessageAlignment == 0 &&
                            (write - base) % kMessageAlignment == 0;
    require(check_positions(base, release, read, write, capacity) == consistent,
            "check_positions disagrees with the queue's rules");
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, std::size_t size) {
  if (size == 0) return 0;
  const uint8_t choice = data[0];
  const std::size_t header_size = size - 1 < kHeaderBytes ? size - 1 : kHeaderBytes;
  std::vector<unsigned char> odd(header_size + 1), exact(header_size ? header_size : 1);
  std::memcpy(odd.data() + 1, data + 1, header_size);
  std::memcpy(exact.data(), data + 1, header_size);
  check(odd.data() + 1, header_size);
  check(exact.data(), header_size);
  // The mapped object's size: what the header records (so that it can be
  // accepted; a real segment is at most a page and two rings of 1 GiB, and
  // the mapping only reserves address space), the bytes given, or sizes
  // around the header's.
  const uint64_t recorded = header_size >= offsetof(SegmentHeader, segment_bytes) + 8
                                ? word_at(exact.data(), offsetof(SegmentHeader, segment_bytes))
                                : 0;
  std::size_t mapped_size = choice % 4 == 2 ? header_size : sizeof(SegmentHeader) - 8 + choice / 4 % 16;
  if (choice % 4 < 2) mapped_size = recorded <= kHeaderBytes + 2 * kMaxCapacity ? recorded : header_size;
  if (mapped_size > 0) {
    const int fd = memfd_create("fuzz-segment", 0);
    require(fd >= 0 && ftruncate(fd, static_cast<off_t>(mapped_size)) == 0, "memfd_create or ftruncate failed");
    const std::size_t written = header_size < mapped_size ? header_size : mapped_size;
    require(pwrite(fd, data + 1, written, 0) == static_cast<ssize_t>(written), "pwrite failed");
    void *mapped = mmap(nullptr, mapped_size, PROT_READ, MAP_SHARED, fd, 0);
    close(fd);
    require(mapped != MAP_FAILED, "mmap failed");
    check(static_cast<const unsigned char *>(mapped), mapped_size);
    munmap(mapped, mapped_size);
  }
  require(!check_segment(nullptr, sizeof(SegmentHeader), nullptr), "null bytes accepted");
  return 0;
}
