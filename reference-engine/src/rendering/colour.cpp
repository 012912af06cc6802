#include "rendering/colour.h"

#include <cctype>
#include <cmath>
#include <cstring>

namespace tarsel_ref {
namespace {

bool same_word(const char *a, const char *b) {
  for (; *a && *b; ++a, ++b)
    if (std::tolower(static_cast<unsigned char>(*a)) != *b) return false;
  return *a == *b;
}

}  // namespace

bool parse_colour_space(const char *name, ColourSpace *space) {
  if (!name || !*name || same_word(name, "linear")) {
    *space = ColourSpace::linear;
    return true;
  }
  if (same_word(name, "srgb")) {
    *space = ColourSpace::srgb;
    return true;
  }
  return false;
}

// Values beyond 0..1 (float images) keep the curve's shape: mirrored below 0,
// the power law continued above 1.
float srgb_to_linear(float v) {
  const float a = std::fabs(v);
  const float l = a <= 0.04045f ? a * (1.0f / 12.92f) : std::pow((a + 0.055f) * (1.0f / 1.055f), 2.4f);
  return std::copysign(l, v);
}

float linear_to_srgb(float v) {
  const float a = std::fabs(v);
  const float s = a <= 0.0031308f ? a * 12.92f : 1.055f * std::pow(a, 1.0f / 2.4f) - 0.055f;
  return std::copysign(s, v);
}

void convert_colour(float *rgba, int count, ColourSpace from, ColourSpace to, bool premultiplied) {
  if (from == to) return;
  float (*const f)(float) = to == ColourSpace::linear ? srgb_to_linear : linear_to_srgb;
  for (int i = 0; i < count; ++i, rgba += 4) {
    const float a = rgba[3];
    if (premultiplied) {
      if (a <= 0.0f) continue;  // no colour to convert
      for (int c = 0; c < 3; ++c) rgba[c] = f(rgba[c] / a) * a;
    } else {
      for (int c = 0; c < 3; ++c) rgba[c] = f(rgba[c]);
    }
  }
}

void premultiply(float *rgba, int count) {
  for (int i = 0; i < count; ++i, rgba += 4)
    for (int c = 0; c < 3; ++c) rgba[c] *= rgba[3];
}

void unpremultiply(float *rgba, int count) {
  for (int i = 0; i < count; ++i, rgba += 4) {
    const float a = rgba[3];
    if (a == 1.0f) continue;
    // Dividing (not multiplying by the inverse) gives back the colour that was
    // premultiplied, so straight images pass through unchanged.
    for (int c = 0; c < 3; ++c) rgba[c] = a != 0.0f ? rgba[c] / a : 0.0f;
  }
}

}  // namespace tarsel_ref
