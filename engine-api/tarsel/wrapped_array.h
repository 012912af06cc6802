// Fixed-size arrays held in place inside the engine's records.
#pragma once

#include <cstddef>

#include "tarsel/limits.h"

// N elements of T with no header and no count: overlays an array of a record.
template <typename T, size_t N>
struct wrapped_array {
  T data[N];  // the elements, in place
};

// One float per channel of a parameter value.
typedef wrapped_array<float, MAX_CHANNELS> ValueArray;

// One short per effect input.
typedef wrapped_array<short, MAX_INPUTS> ShortInputArray;

static_assert(sizeof(ValueArray) == 16, "ValueArray is four floats");
static_assert(alignof(ValueArray) == 4, "ValueArray is float-aligned");
static_assert(sizeof(ShortInputArray) == 16, "ShortInputArray is eight shorts");
static_assert(alignof(ShortInputArray) == 2, "ShortInputArray is short-aligned");
