// Message transport over named shared-memory segments.
#pragma once

#include <cstddef>
#include <cstdint>

#include "tarsel/export.h"

#if defined(_WIN32) && !defined(__MINGW32__)
// Process identifier.
typedef int pid_t;
#else
#  include <sys/types.h>
#endif

namespace Tarsel {
namespace IPC {
class ShmemTransport;
}  // namespace IPC
}  // namespace Tarsel

// Frees a transport made by ShmemManager::serve or ShmemManager::connect.
TARSEL_API void free_tarsel_ipc_shmemtransport(Tarsel::IPC::ShmemTransport *transport);

namespace Tarsel {
namespace IPC {

// Header that precedes each message in the segment: 64 bytes, little-endian,
// shared with the peer process.
struct MessageHeader_t {
  uint32_t id;        // offset 0: message identifier
  uint32_t padding;   // offset 4: alignment of size, never read
  size_t size;        // offset 8: size of the message body in bytes
  char desc[24];      // offset 16: writer's description, NUL-terminated when shorter
  char reserved[24];  // offset 40: reserved text, encoded as desc
};

// Cause of a transport failure.
enum class ShmemError : int {
  SHMEM_NO_ERROR = 0,   // no error
  INVALID_SEGMENT = 1,  // the segment is missing or not valid
  TIMEOUT = 2,          // a timed operation ran out of time
  LOCK_ERROR = 3,       // the segment's lock could not be taken
  RETRY = 4,            // the operation should be retried
  MSG_TOO_LARGE = 5     // the message does not fit the segment
};

// Text naming an error code, engine-owned; null for an unknown code.
TARSEL_API const char *shmem_error_to_string(ShmemError error);

// One end of a message transport over a shared-memory segment. Made only by
// ShmemManager, freed only by free_tarsel_ipc_shmemtransport.
class TARSEL_API ShmemTransport {
public:
  // Waits for a message; returns its body size (0 when none) and sets *data
  // to the body and *header to its header where those are not null. With
  // data null and header not null, only looks at the next message.
  size_t read(void **data, MessageHeader_t **header);

  // As read, without waiting.
  size_t try_read(void **data, MessageHeader_t **header);

  // As read, waiting at most `timeout` seconds.
  size_t timed_read(void **data, float timeout, MessageHeader_t **header);

  // As timed_read, trying again within `timeout` seconds after a failure
  // that may pass (RETRY, LOCK_ERROR).
  size_t read_and_retry(void **data, float timeout, MessageHeader_t **header);

  // Waits for `size` bytes of segment space for a message filled in place
  // (finished by commit); null on failure.
  void *reserve(size_t size, const char *const desc = nullptr);

  // As reserve, without waiting.
  void *try_reserve(size_t size, const char *const desc = nullptr);

  // As reserve, waiting at most `timeout` seconds.
  void *timed_reserve(size_t size, float timeout, const char *const desc = nullptr);

  // Writes a copy of `size` bytes as one message, waiting for space; true on success.
  bool write(const void *data, size_t size, const char *const desc = nullptr);

  // As write, without waiting.
  bool try_write(const void *data, size_t size, const char *const desc = nullptr);

  // As write, waiting at most `timeout` seconds.
  bool timed_write(const void *data, size_t size, float timeout, const char *const desc = nullptr);

  // Writes a NUL-terminated text as one message, waiting for space; true on success.
  bool write_string(const char *const text, const char *const desc = nullptr);

  // As write_string, without waiting.
  bool try_write_string(const char *const text, const char *const desc = nullptr);

  // As write_string, waiting at most `timeout` seconds.
  bool timed_write_string(const char *const text, float timeout, const char *const desc = nullptr);

  // Completes the message last reserved; true on success.
  bool commit();

  // Removes the segment; true on success.
  bool remove();

  // Whether the segment is usable.
  bool is_segment_valid();

  // Process identifier of the serving process.
  pid_t get_server_pid();

  // Whether the client process is alive.
  bool client_pid_exists();

  // Prints the transport's statistics to standard output.
  void print_stats();

  // Cause of the last failure.
  ShmemError get_last_error();

  // Transports are not copied.
  ShmemTransport(const ShmemTransport &) = delete;

  // Transports are not assigned.
  ShmemTransport &operator=(const ShmemTransport &) = delete;

private:
  // The transport's state, private to the engine.
  struct Impl;

  // Wraps the engine's state; used by ShmemManager.
  explicit ShmemTransport(Impl *impl);

  // Releases the engine's state; used by free_tarsel_ipc_shmemtransport.
  ~ShmemTransport();

  Impl *impl_;  // the engine's state

  // Creates transports.
  friend class ShmemManager;

  // Frees transports.
  friend void ::free_tarsel_ipc_shmemtransport(ShmemTransport *transport);
};

// Serves, connects and resets named shared-memory segments.
class TARSEL_API ShmemManager {
public:
  // Serves the named segment with the two given sizes; a new transport, or null.
  static ShmemTransport *serve(const char *const name, size_t size1, size_t size2);

  // Connects to the named segment; a new transport, or null.
  static ShmemTransport *connect(const char *const name);

  // Resets the named segment.
  static void reset(const char *const name, bool flag = false);

  // Resets every segment.
  static void reset_all(bool flag = false);

  // Creates a manager.
  ShmemManager();

  // Copies a manager.
  ShmemManager(const ShmemManager &other);

  // Assigns a manager.
  ShmemManager &operator=(const ShmemManager &other);

  // Destroys a manager.
  ~ShmemManager();
};

static_assert(sizeof(MessageHeader_t) == 64, "MessageHeader_t is 64 bytes");
static_assert(offsetof(MessageHeader_t, id) == 0, "MessageHeader_t::id at 0");
static_assert(offsetof(MessageHeader_t, padding) == 4, "MessageHeader_t padding at 4");
static_assert(offsetof(MessageHeader_t, size) == 8, "MessageHeader_t::size at 8");
static_assert(offsetof(MessageHeader_t, desc) == 16, "MessageHeader_t::desc at 16");
static_assert(offsetof(MessageHeader_t, reserved) == 40, "MessageHeader_t::reserved at 40");
static_assert(sizeof(ShmemError) == 4, "ShmemError is 32-bit");
static_assert(sizeof(pid_t) == 4, "pid_t is a 32-bit signed integer");

}  // namespace IPC
}  // namespace Tarsel
