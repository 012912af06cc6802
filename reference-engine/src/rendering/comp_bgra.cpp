// Compositing 8-bit BGRA images over a background for display.
#include <string>

#include "core/messages.h"
#include "rendering/image_utils.h"
#include "rendering/workers.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

// Exact rounding of a * b / 255 for bytes.
inline unsigned scale(unsigned a, unsigned b) {
  const unsigned t = a * b + 128;
  return (t + (t >> 8)) >> 8;
}

}  // namespace

void composite_bgra(RawImage image, int xsize, int ysize, int line_bytes, int background_argb, int checker_size) {
  if (xsize <= 0 || ysize <= 0) return;
  if (!image) {
    emit_message(Err_Error, "tarsel_comp_bgra_8: no image");
    return;
  }
  const long long stride = line_bytes == 0 ? static_cast<long long>(xsize) * 4 : line_bytes;
  if (stride < static_cast<long long>(xsize) * 4) {
    emit_message(Err_Error, ("tarsel_comp_bgra_8: lines of " + std::to_string(line_bytes) + " bytes cannot hold " +
                             std::to_string(xsize) + " pixels")
                                .c_str());
    return;
  }
  const unsigned bg = static_cast<unsigned>(background_argb);
  const unsigned colour[3] = {bg & 0xffu, (bg >> 8) & 0xffu, (bg >> 16) & 0xffu};  // B G R
  unsigned light[3];
  for (int c = 0; c < 3; ++c) light[c] = colour[c] + (255u - colour[c]) / 2u;  // half-way to white
  auto *base = static_cast<unsigned char *>(image);
  run_rows(ysize, 0, [&](int y) {
    unsigned char *p = base + static_cast<std::size_t>(stride) * static_cast<std::size_t>(y);
    for (int x = 0; x < xsize; ++x, p += 4) {
      const bool lighter = checker_size > 0 && ((x / checker_size + y / checker_size) & 1);
      const unsigned *under = lighter ? light : colour;
      const unsigned a = p[3];
      for (int c = 0; c < 3; ++c) p[c] = static_cast<unsigned char>(scale(p[c], a) + scale(under[c], 255u - a));
      p[3] = 255;
    }
  });
}

}  // namespace tarsel_ref
