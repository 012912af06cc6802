// Large pixel buffers, kept for reuse. A frame-sized working image takes
// tens of milliseconds to get from the system and to give back (its pages
// are faulted in and unmapped one by one), which would be most of a fast
// render's time and would hold up an aborted render's return. Buffers come
// back here instead, within a budget, until tarsel_shutdown_apps lets them go.
#pragma once

#include <cstddef>
#include <memory>

namespace tarsel_ref {

struct BufferReturn {
  std::size_t capacity = 0;
  void operator()(float *buffer) const;
};

using FloatBuffer = std::unique_ptr<float[], BufferReturn>;

// At least `count` floats, contents unset.
FloatBuffer acquire_floats(std::size_t count);

// Frees every kept buffer.
void release_buffer_cache();

// Bytes the cache holds.
std::size_t cached_buffer_bytes();

}  // namespace tarsel_ref
