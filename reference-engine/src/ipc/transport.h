// One end of a shared-memory transport: a mapped segment, the queue this end
// writes and the queue it reads. ShmemTransport's members forward here.
#pragma once

#include <sys/types.h>

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <mutex>
#include <string>

#include "ipc/queue.h"
#include "ipc/segment.h"
#include "tarsel/ipc.h"

namespace tarsel_ref {
namespace ipc {

// A segment mapped into this process.
struct Mapping {
  unsigned char *bytes = nullptr;
  std::size_t size = 0;
  dev_t device = 0;  // identity of the object, to tell it from a later one of the same name
  ino_t inode = 0;
  const std::atomic<bool> *truncated = nullptr;  // see truncation.h
  int fd = -1;                                   // the object, kept open to see its size

  SegmentHeader *header() const { return reinterpret_cast<SegmentHeader *>(bytes); }
};

class Endpoint {
public:
  // Takes over the mapping (unmapped when the endpoint ends).
  Endpoint(const Mapping &mapping, bool server, std::string object);
  virtual ~Endpoint();
  Endpoint(const Endpoint &) = delete;
  Endpoint &operator=(const Endpoint &) = delete;

  std::size_t receive(void **data, MessageHeader_t **header, const Deadline &deadline);
  std::size_t receive_retrying(void **data, MessageHeader_t **header, double timeout);
  void *reserve(std::size_t size, const char *desc, const Deadline &deadline);
  bool send(const void *data, std::size_t size, const char *desc, const Deadline &deadline);
  bool send_text(const char *text, const char *desc, const Deadline &deadline);
  bool commit();
  bool remove();
  bool segment_valid() const;
  pid_t server_pid() const;
  bool client_exists() const;
  void print_stats() const;
  // The calling thread's last outcome on this transport; the transport's last
  // outcome on any thread when this thread has none recorded.
  ShmemError last_error() const;
  // Whether the calling thread's last wait on any transport was ended by a
  // signal.
  static bool interrupted();

  // Leaves the mapping alone from now on (for an endpoint discarded before
  // use: its maker unmaps).
  void forget_mapping() { mapping_.bytes = nullptr; }

  // The control block of queue `index` (kServerToClient, kClientToServer).
  QueueControl &queue_control(int index) const { return mapping_.header()->queue[index]; }

private:
  // Waits, the queue locked, until `ready` gives NO_ERROR (the lock is then
  // still held) or the operation fails (the lock is then released, `wakes`
  // sent). `for_data`: a reader waiting for a message, else a writer waiting
  // for room. A signal that comes while it waits ends the wait with RETRY,
  // nothing taken or sent, so that a host can act on it (Ctrl-C) at once;
  // interrupted() then says so.
  template <typename Ready>
  ShmemError wait_until(Queue &queue, bool for_data, const Deadline &deadline, PendingWakes *wakes, Ready ready);
  // Whether the process at the other end is gone (a client not yet connected
  // is not gone: a server waits for one). Looks at most every wait slice.
  bool peer_gone(int64_t now);
  // Whether the segment's object is smaller than its mapping (truncated by
  // some process, its lost pages not touched here yet). Looks at most every
  // wait slice.
  bool object_shrunk(int64_t now);
  ShmemError fail(ShmemError error, Queue &queue, bool writing);
  void record(ShmemError error);
  // Capacity of queue `index` as this end mapped it.
  uint64_t capacity_of(int index) const {
    return (index == kServerToClient) == server_ ? out_.capacity() : in_.capacity();
  }
  void succeed() { record(ShmemError::SHMEM_NO_ERROR); }

  Mapping mapping_;
  bool server_;
  std::string object_;
  const uint64_t serial_;  // tells this endpoint from earlier ones at the same address
  Queue out_;              // the queue this end writes
  Queue in_;               // the queue this end reads
  std::atomic<int> last_error_{0};

  // The open reservation, guarded by out_'s lock.
  bool reserved_ = false;
  Placement reservation_;
  uint64_t reserved_size_ = 0;
  char reserved_desc_[24] = {};

  // The last look at the peer process, reused within a wait slice.
  std::mutex peer_mutex_;
  int32_t checked_pid_ = 0;
  bool checked_alive_ = false;
  int64_t checked_at_ = 0;
  int64_t sized_at_ = 0;  // the last look at the object's size
};

// Live transports, so that freeing and the test probe can tell a transport of
// this engine from any other pointer.
void register_endpoint(const void *transport, Endpoint *endpoint);
Endpoint *find_endpoint(const void *transport);
bool unregister_endpoint(const void *transport);

// Marks the mapped segment removed and wakes every sleeper of both queues;
// false when it was removed already.
bool mark_removed(SegmentHeader *header, unsigned char *segment);

// Unlinks the shared-memory object `object` when it is still the one
// identified by device and inode; true when unlinked.
bool unlink_if_same(const std::string &object, dev_t device, ino_t inode);

}  // namespace ipc
}  // namespace tarsel_ref

// The engine's state of a transport (declared private in the contract).
struct Tarsel::IPC::ShmemTransport::Impl : tarsel_ref::ipc::Endpoint {
  using tarsel_ref::ipc::Endpoint::Endpoint;
};
