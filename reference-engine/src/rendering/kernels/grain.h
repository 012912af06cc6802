// Grain: a repeatable random value per cell of a grid, the same for a given
// seed whatever part of the frame is rendered or how the work is shared.
#pragma once

#include <cstdint>

namespace tarsel_ref {

inline std::uint32_t mix_bits(std::uint32_t h) {
  h ^= h >> 16;
  h *= 0x7feb352du;
  h ^= h >> 15;
  h *= 0x846ca68bu;
  h ^= h >> 16;
  return h;
}

// A value in [0, 1) for cell (x, y) under `seed`.
inline float grain_value(std::int64_t x, std::int64_t y, std::uint32_t seed) {
  std::uint32_t h = mix_bits(seed ^ 0x9e3779b9u);
  h = mix_bits(h ^ static_cast<std::uint32_t>(x) ^ (static_cast<std::uint32_t>(x >> 32) * 0x85ebca6bu));
  h = mix_bits(h ^ static_cast<std::uint32_t>(y) * 0xc2b2ae35u ^ static_cast<std::uint32_t>(y >> 32));
  return static_cast<float>(h >> 8) * (1.0f / 16777216.0f);
}

}  // namespace tarsel_ref
