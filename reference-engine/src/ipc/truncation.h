// Segments truncated under this process. Any process of the same user may
// shrink a segment's object while it is mapped here, and touching a page past
// the object's new end raises SIGBUS. Every segment this process maps is
// registered here; a SIGBUS inside one puts zero pages in place of the lost
// ones (from the faulting page to the end of the mapping), so the access
// completes, and marks the segment truncated: the transport then answers
// INVALID_SEGMENT, and views of it read zeros instead of ending the process.
// Any other SIGBUS goes to the handler installed before.
//
// Not covered: more than kGuardedMappings mappings at once (the rest are not
// guarded), and a thread holding a segment's lock when its page goes: the C
// library's list of the thread's robust locks then keeps pointing into the
// lost page.
#pragma once

#include <atomic>
#include <cstddef>

namespace tarsel_ref {
namespace ipc {

constexpr int kGuardedMappings = 256;

// Registers a mapping; its flag turns true once it was found truncated. A
// flag that never turns when the registry is full.
const std::atomic<bool> *guard_mapping(void *start, std::size_t size);

// Before the mapping is unmapped.
void unguard_mapping(void *start);

}  // namespace ipc
}  // namespace tarsel_ref
