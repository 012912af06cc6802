// The engine-wide abort request set by tarsel_abort_render and cleared by
// tarsel_clear_abort. Long-running engine work polls it.
#pragma once

namespace tarsel_ref {

bool abort_requested();

// Throws TarselAbortException when an abort has been requested.
void throw_if_aborted();

// Sets the request; it stays set until cleared.
void request_abort();

void clear_abort_request();

}  // namespace tarsel_ref
