// The engine's built-in bitmap font: printable ASCII in cells of 5 x 8
// dots (7 above the baseline, 1 below for descenders), advancing 6 dots.
// Other characters draw as '?'.
#pragma once

#include <cstdint>

namespace tarsel_ref {

constexpr int kGlyphWidth = 5;
constexpr int kGlyphHeight = 8;
constexpr int kGlyphAdvance = 6;
constexpr int kLineAdvance = 10;  // dots from one line of text to the next

// Row `row` (0 at the top) of the glyph of `c`: bit 4 is the leftmost dot.
std::uint8_t glyph_row(unsigned char c, int row);

}  // namespace tarsel_ref
