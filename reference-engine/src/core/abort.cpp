#include "core/abort.h"

#include <atomic>

#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {
std::atomic<bool> abort_flag{false};
}

bool abort_requested() { return abort_flag.load(std::memory_order_relaxed); }

void throw_if_aborted() {
  if (abort_requested()) throw TarselAbortException();
}

// The request stays set until cleared: every render started meanwhile ends as
// an abort too, which is what a host cancelling a batch wants.
void request_abort() { abort_flag.store(true); }

void clear_abort_request() { abort_flag.store(false); }

}  // namespace tarsel_ref
