// Checks of a segment's layout and of transport names.
#include "ipc/segment.h"

#include <cstring>

namespace tarsel_ref {
namespace ipc {
namespace {

// The field of type T at `offset` of the bytes, whatever their alignment.
template <typename T>
T field_at(const void *bytes, std::size_t offset) {
  T value;
  std::memcpy(&value, static_cast<const unsigned char *>(bytes) + offset, sizeof value);
  return value;
}

bool fail(std::string *why, const std::string &text) {
  if (why) *why = text;
  return false;
}

bool valid_capacity(uint64_t capacity) {
  return capacity >= kMinCapacity && capacity <= kMaxCapacity && capacity % kMessageAlignment == 0;
}

}  // namespace

bool check_segment(const void *bytes, std::size_t size, std::string *why) {
  if (!bytes || size < sizeof(SegmentHeader))
    return fail(why, "smaller than a segment header (" + std::to_string(size) + " bytes)");
  if (field_at<uint64_t>(bytes, offsetof(SegmentHeader, magic)) != kSegmentMagic)
    return fail(why, "not a transport segment (wrong magic number)");
  const uint32_t version = field_at<uint32_t>(bytes, offsetof(SegmentHeader, layout_version));
  if (version != kLayoutVersion)
    return fail(why, "layout version " + std::to_string(version) + ", expected " + std::to_string(kLayoutVersion));
  if (field_at<uint32_t>(bytes, offsetof(SegmentHeader, header_bytes)) != kHeaderBytes)
    return fail(why, "wrong header size");
  if (field_at<uint32_t>(bytes, offsetof(SegmentHeader, mutex_bytes)) != sizeof(pthread_mutex_t) ||
      field_at<uint32_t>(bytes, offsetof(SegmentHeader, queue_bytes)) != sizeof(QueueControl))
    return fail(why, "made with another lock layout");
  const uint64_t segment_bytes = field_at<uint64_t>(bytes, offsetof(SegmentHeader, segment_bytes));
  if (segment_bytes != size)
    return fail(why, "records " + std::to_string(segment_bytes) + " bytes but has " + std::to_string(size));
  uint64_t expected_offset = kHeaderBytes;
  for (int queue = 0; queue < 2; ++queue) {
    const uint64_t capacity = field_at<uint64_t>(bytes, offsetof(SegmentHeader, capacity) + queue * sizeof(uint64_t));
    const uint64_t offset = field_at<uint64_t>(bytes, offsetof(SegmentHeader, ring_offset) + queue * sizeof(uint64_t));
    if (!valid_capacity(capacity))
      return fail(why, "queue " + std::to_string(queue) + " has an invalid capacity " + std::to_string(capacity));
    if (offset != expected_offset) return fail(why, "queue " + std::to_string(queue) + " ring is misplaced");
    expected_offset += capacity;
  }
  if (expected_offset != size) return fail(why, "the rings do not end at the end of the segment");
  if (field_at<int32_t>(bytes, offsetof(SegmentHeader, server_pid)) <= 0)
    return fail(why, "no server process recorded");
  if (field_at<int32_t>(bytes, offsetof(SegmentHeader, client_pid)) < 0) return fail(why, "negative client process id");
  return true;
}

bool check_positions(uint64_t base, uint64_t release_pos, uint64_t read_pos, uint64_t write_pos, uint64_t capacity) {
  return base <= release_pos && release_pos <= read_pos && read_pos <= write_pos &&
         write_pos - release_pos <= capacity && (release_pos - base) % kMessageAlignment == 0 &&
         (read_pos - base) % kMessageAlignment == 0 && (write_pos - base) % kMessageAlignment == 0;
}

bool object_name(const char *name, std::string *object) {
  if (!name) return false;
  if (*name == '/') ++name;
  const std::size_t length = std::strlen(name);
  if (length == 0 || length > kMaxNameLength || std::strchr(name, '/')) return false;
  if (object) *object = std::string(kObjectPrefix) + name;
  return true;
}

}  // namespace ipc
}  // namespace tarsel_ref
