#include "core/abort.h"

#include <atomic>

#include "core/entry.h"
#include "tarsel/effect.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {
std::atomic<bool> abort_flag{false};
}

bool abort_requested() { return abort_flag.load(std::memory_order_relaxed); }

void throw_if_aborted() {
  if (abort_requested()) throw TarselAbortException();
}

}  // namespace tarsel_ref

// The request stays set until cleared: every render started meanwhile ends as
// an abort too, which is what a host cancelling a batch wants.
void tarsel_abort_render() {
  tarsel_ref::enter("tarsel_abort_render");
  tarsel_ref::abort_flag.store(true);
}

void tarsel_clear_abort() {
  tarsel_ref::enter("tarsel_clear_abort");
  tarsel_ref::abort_flag.store(false);
}
