// Errors of the shared-memory transport, as its get_last_error reports them.

%{
#include "tarsel/ipc.h"
%}

namespace Tarsel {
namespace IPC {
enum class ShmemError {
  SHMEM_NO_ERROR = 0,
  INVALID_SEGMENT = 1,
  TIMEOUT = 2,
  LOCK_ERROR = 3,
  RETRY = 4,
  MSG_TOO_LARGE = 5
};
}
}

namespace Tarsel {
namespace IPC {
// The engine's text for a code; None for a code it does not know.
const char *shmem_error_to_string(ShmemError error);
}
}
