// Named segments: serving, joining and resetting them, and the texts of the
// transport errors.
#pragma once

#include <cstddef>
#include <string>

#include "ipc/transport.h"
#include "tarsel/ipc.h"

namespace tarsel_ref {
namespace ipc {

// Makes the contract's transport object around a new endpoint, which takes
// over the mapping, and says which endpoint that is. Supplied by
// ShmemManager, which alone may construct one.
using Construct = Tarsel::IPC::ShmemTransport *(*)(const Mapping &mapping, bool server, const std::string &object,
                                                   Endpoint **endpoint);

// A transport serving the named segment with queues of those sizes, or null.
Tarsel::IPC::ShmemTransport *serve_segment(const char *name, size_t size1, size_t size2, Construct construct);

// A transport of the client of the named segment, or null.
Tarsel::IPC::ShmemTransport *connect_segment(const char *name, Construct construct);

// Resets the named segment, or every segment of this user.
void reset_segment(const char *name, bool flag);
void reset_all_segments(bool flag);

// The text of an error; null for a value that is none.
const char *error_text(Tarsel::IPC::ShmemError error);

}  // namespace ipc
}  // namespace tarsel_ref
