// The engine-wide abort request set by tarsel_abort_render and cleared by
// tarsel_clear_abort. Long-running engine work polls it.
#pragma once

namespace tarsel_ref {

bool abort_requested();

// Throws TarselAbortException when an abort has been requested.
void throw_if_aborted();

}  // namespace tarsel_ref
