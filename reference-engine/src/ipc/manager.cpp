// Making, joining and resetting named segments, and the error texts.
#include "ipc/manager.h"

#include <dirent.h>
#include <errno.h>
#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <cstring>
#include <new>
#include <string>

#include "ipc/segment.h"
#include "ipc/transport.h"
#include "ipc/truncation.h"
#include "tarsel/ipc.h"

using Tarsel::IPC::ShmemError;
using Tarsel::IPC::ShmemManager;
using Tarsel::IPC::ShmemTransport;

namespace tarsel_ref {
namespace ipc {
namespace {

// Attempts of serve before it gives up on a name that keeps changing under it
// (a reclaim or removal by another process in progress), a millisecond apart.
constexpr int kServeAttempts = 200;

void pause_briefly() {
  timespec ts{0, 1000 * 1000};
  nanosleep(&ts, nullptr);
}

// Maps the whole object open as `fd` (read and write); false when it is
// smaller than a segment header or cannot be mapped.
bool map_object(int fd, Mapping *mapping) {
  struct stat info;
  if (fstat(fd, &info) != 0 || info.st_size < static_cast<off_t>(sizeof(SegmentHeader))) return false;
  void *bytes = mmap(nullptr, static_cast<std::size_t>(info.st_size), PROT_READ | PROT_WRITE, MAP_SHARED, fd, 0);
  if (bytes == MAP_FAILED) return false;
  mapping->bytes = static_cast<unsigned char *>(bytes);
  mapping->size = static_cast<std::size_t>(info.st_size);
  mapping->device = info.st_dev;
  mapping->inode = info.st_ino;
  mapping->truncated = guard_mapping(bytes, mapping->size);
  mapping->fd = fcntl(fd, F_DUPFD_CLOEXEC, 0);
  return true;
}

// Opens and maps an existing object; false when it is missing or unusable.
bool open_object(const std::string &object, Mapping *mapping) {
  const int fd = shm_open(object.c_str(), O_RDWR, 0);
  if (fd < 0) return false;
  const bool mapped = map_object(fd, mapping);
  close(fd);
  return mapped;
}

void unmap(const Mapping &mapping) {
  if (!mapping.bytes) return;
  unguard_mapping(mapping.bytes);
  munmap(mapping.bytes, mapping.size);
  if (mapping.fd >= 0) close(mapping.fd);
}

bool init_lock(pthread_mutex_t *lock) {
  pthread_mutexattr_t attributes;
  if (pthread_mutexattr_init(&attributes) != 0) return false;
  const bool made = pthread_mutexattr_setpshared(&attributes, PTHREAD_PROCESS_SHARED) == 0 &&
                    pthread_mutexattr_setrobust(&attributes, PTHREAD_MUTEX_ROBUST) == 0 &&
                    pthread_mutexattr_settype(&attributes, PTHREAD_MUTEX_ERRORCHECK) == 0 &&
                    pthread_mutex_init(lock, &attributes) == 0;
  pthread_mutexattr_destroy(&attributes);
  return made;
}

// Lays out a new segment in the zeroed bytes; the magic number goes last, so
// nobody takes a half-made segment for one.
bool init_segment(const Mapping &mapping, uint64_t capacity0, uint64_t capacity1) {
  SegmentHeader *header = mapping.header();
  header->layout_version = kLayoutVersion;
  header->header_bytes = kHeaderBytes;
  header->segment_bytes = mapping.size;
  header->capacity[0] = capacity0;
  header->capacity[1] = capacity1;
  header->ring_offset[0] = kHeaderBytes;
  header->ring_offset[1] = kHeaderBytes + capacity0;
  header->mutex_bytes = sizeof(pthread_mutex_t);
  header->queue_bytes = sizeof(QueueControl);
  header->server_pid = getpid();
  header->client_pid = 0;
  header->removed = 0;
  for (QueueControl &queue : header->queue) {
    if (!init_lock(&queue.lock)) return false;
    queue.next_id = 1;
  }
  store(header->magic, kSegmentMagic);
  return true;
}

ShmemTransport *make_transport(const Mapping &mapping, bool server, const std::string &object, Construct construct);

// Gives the newly created object `fd` its size and layout; a transport, or
// null (the object is then unlinked).
ShmemTransport *create_segment(int fd, const std::string &object, uint64_t capacity0, uint64_t capacity1,
                               Construct construct) {
  const uint64_t size = kHeaderBytes + capacity0 + capacity1;
  Mapping mapping;
  // The permissions are those asked for whatever the process's umask; the
  // memory is allocated now, so that a full /dev/shm refuses the segment here
  // instead of faulting a process that touches it later.
  bool made = fchmod(fd, 0600) == 0 && ftruncate(fd, static_cast<off_t>(size)) == 0;
  if (made) {
    const int allocated = posix_fallocate(fd, 0, static_cast<off_t>(size));
    made = allocated == 0 || allocated == EOPNOTSUPP || allocated == EINVAL;
  }
  made = made && map_object(fd, &mapping) && init_segment(mapping, capacity0, capacity1);
  close(fd);
  ShmemTransport *transport = made ? make_transport(mapping, true, object, construct) : nullptr;
  if (!transport) {
    unmap(mapping);
    shm_unlink(object.c_str());
  }
  return transport;
}

// What serve found under a name it could not create.
enum class Existing { kGone, kReclaimed, kBeingRemoved, kRefused };

// Looks at the segment already under `object`: one of ours whose server is
// dead is marked removed (its attached clients see INVALID_SEGMENT) and
// unlinked; a live server's, or anything not of this layout, is refused.
// `stale_removed`: a segment marked removed long ago, by a process that died
// before unlinking it, is unlinked too.
Existing examine_existing(const std::string &object, bool stale_removed) {
  const int fd = shm_open(object.c_str(), O_RDWR, 0);
  if (fd < 0) return errno == ENOENT ? Existing::kGone : Existing::kRefused;
  Mapping mapping;
  const bool mapped = map_object(fd, &mapping);
  close(fd);
  if (!mapped || !check_segment(mapping.bytes, mapping.size, nullptr)) {
    unmap(mapping);
    return Existing::kRefused;
  }
  SegmentHeader *header = mapping.header();
  const bool server_alive = process_exists(load(header->server_pid));
  Existing result;
  if (load(header->removed))
    result = stale_removed && !server_alive && unlink_if_same(object, mapping.device, mapping.inode)
                 ? Existing::kReclaimed
                 : Existing::kBeingRemoved;
  else if (server_alive)
    result = Existing::kRefused;
  else if (mark_removed(header, mapping.bytes))
    result = unlink_if_same(object, mapping.device, mapping.inode) ? Existing::kReclaimed : Existing::kBeingRemoved;
  else
    result = Existing::kBeingRemoved;  // another process reclaims it
  unmap(mapping);
  return result;
}

// The transport, registered; null (the mapping left to the caller) when
// memory runs out.
ShmemTransport *make_transport(const Mapping &mapping, bool server, const std::string &object, Construct construct) {
  Endpoint *endpoint = nullptr;
  try {
    ShmemTransport *transport = construct(mapping, server, object, &endpoint);
    register_endpoint(transport, endpoint);
    return transport;
  } catch (const std::bad_alloc &) {
    if (endpoint) endpoint->forget_mapping();
    delete endpoint;
    return nullptr;
  }
}

// A queue capacity from a size asked for: rounded down to a multiple of 64;
// 0 when outside the bounds.
uint64_t capacity_for(std::size_t size) {
  const uint64_t capacity = static_cast<uint64_t>(size) / kMessageAlignment * kMessageAlignment;
  return capacity >= kMinCapacity && capacity <= kMaxCapacity ? capacity : 0;
}

// Unlinks the object when `always`, or when it is a segment of ours whose
// server is dead; a segment of ours is marked removed first.
void reset_object(const std::string &object, bool always) {
  const int fd = shm_open(object.c_str(), O_RDWR, 0);
  if (fd < 0) {
    if (always && errno != ENOENT) shm_unlink(object.c_str());
    return;
  }
  Mapping mapping;
  const bool mapped = map_object(fd, &mapping);
  if (!mapped) {
    // Too small for a header (or unmappable): never one of ours in use.
    struct stat info;
    if (always && fstat(fd, &info) == 0) unlink_if_same(object, info.st_dev, info.st_ino);
    close(fd);
    return;
  }
  close(fd);
  SegmentHeader *header = mapping.header();
  const bool ours = check_segment(mapping.bytes, mapping.size, nullptr);
  const bool stale = ours && !process_exists(load(header->server_pid));
  if (always || stale) {
    if (ours) mark_removed(header, mapping.bytes);
    unlink_if_same(object, mapping.device, mapping.inode);
  }
  unmap(mapping);
}

}  // namespace

ShmemTransport *serve_segment(const char *name, size_t size1, size_t size2, Construct construct) {
  std::string object;
  const uint64_t capacity0 = capacity_for(size1);
  const uint64_t capacity1 = capacity_for(size2);
  if (!object_name(name, &object) || !capacity0 || !capacity1) return nullptr;
  for (int attempt = 0; attempt < kServeAttempts; ++attempt) {
    const int fd = shm_open(object.c_str(), O_CREAT | O_EXCL | O_RDWR, 0600);
    if (fd >= 0) return create_segment(fd, object, capacity0, capacity1, construct);
    if (errno != EEXIST) return nullptr;
    switch (examine_existing(object, attempt >= kServeAttempts / 2)) {
      case Existing::kGone:
      case Existing::kReclaimed: break;
      case Existing::kBeingRemoved: pause_briefly(); break;
      case Existing::kRefused: return nullptr;
    }
  }
  return nullptr;
}

ShmemTransport *connect_segment(const char *name, Construct construct) {
  std::string object;
  Mapping mapping;
  if (!object_name(name, &object) || !open_object(object, &mapping)) return nullptr;
  SegmentHeader *header = mapping.header();
  bool usable = check_segment(mapping.bytes, mapping.size, nullptr) && !load(header->removed) &&
                process_exists(load(header->server_pid));
  // One client at a time: a live one keeps the segment; a dead one's place is
  // taken over, together with its wait counts.
  const int32_t own = getpid();
  while (usable) {
    int32_t current = load(header->client_pid);
    if (current != 0 && process_exists(current)) {
      usable = false;
    } else if (__atomic_compare_exchange_n(&header->client_pid, &current, own, false, __ATOMIC_SEQ_CST,
                                           __ATOMIC_SEQ_CST)) {
      if (current != 0) {
        store(header->queue[kServerToClient].readers_waiting, 0u);
        store(header->queue[kClientToServer].writers_waiting, 0u);
      }
      break;
    }
  }
  ShmemTransport *transport = usable ? make_transport(mapping, false, object, construct) : nullptr;
  if (!transport) {
    if (usable) {
      int32_t expected = own;
      __atomic_compare_exchange_n(&header->client_pid, &expected, 0, false, __ATOMIC_SEQ_CST, __ATOMIC_SEQ_CST);
    }
    unmap(mapping);
  }
  return transport;
}

void reset_segment(const char *name, bool flag) {
  std::string object;
  if (object_name(name, &object)) reset_object(object, flag);
}

void reset_all_segments(bool flag) {
  DIR *directory = opendir("/dev/shm");
  if (!directory) return;
  const std::string prefix = kObjectPrefix + 1;  // without the "/"
  const uid_t user = geteuid();
  while (const dirent *entry = readdir(directory)) {
    if (std::strncmp(entry->d_name, prefix.c_str(), prefix.size()) != 0) continue;
    struct stat info;
    if (fstatat(dirfd(directory), entry->d_name, &info, AT_SYMLINK_NOFOLLOW) != 0 || !S_ISREG(info.st_mode) ||
        info.st_uid != user)
      continue;
    reset_object(std::string("/") + entry->d_name, flag);
  }
  closedir(directory);
}

const char *error_text(ShmemError error) {
  switch (error) {
    case ShmemError::SHMEM_NO_ERROR: return "no error";
    case ShmemError::INVALID_SEGMENT: return "invalid segment: removed, reset or not a transport segment";
    case ShmemError::TIMEOUT: return "timed out";
    case ShmemError::LOCK_ERROR: return "the segment's lock cannot be taken";
    case ShmemError::RETRY:
      return "try again: the operation would have to wait, the peer process is gone, or a signal came";
    case ShmemError::MSG_TOO_LARGE: return "message too large for the queue";
  }
  return nullptr;
}

}  // namespace ipc
}  // namespace tarsel_ref
