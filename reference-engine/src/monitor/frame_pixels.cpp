#include "monitor/frame_pixels.h"

#include <algorithm>

namespace qrv_ref {
namespace {

// Video range 16..235 to full range 0..255, clamped.
uint8_t expand_range(uint8_t v) {
  int full = ((int(v) - 16) * 255 + 219 / 2) / 219;
  return uint8_t(std::clamp(full, 0, 255));
}

uint8_t unpremultiply(uint8_t c, uint8_t a) {
  if (a == 0) return 0;
  return uint8_t(std::min(255, (int(c) * 255 + a / 2) / a));
}

}  // namespace

void frame_from_image(const ImageValues &image, std::vector<uint8_t> &bgra) {
  const size_t width = size_t(image.width), height = size_t(image.height);
  bgra.resize(width * height * 4);
  // Byte positions of B, G, R, A within a source pixel.
  const int b = image.format == EM_ImageFormat_32BitIntBGRA ? 0 : 3;
  const int g = image.format == EM_ImageFormat_32BitIntBGRA ? 1 : 2;
  const int r = image.format == EM_ImageFormat_32BitIntBGRA ? 2 : 1;
  const int a = image.format == EM_ImageFormat_32BitIntBGRA ? 3 : 0;
  const auto *pixels = static_cast<const uint8_t *>(image.pixels);
  for (size_t y = 0; y < height; ++y) {
    size_t stored = image.flip_y ? height - 1 - y : y;
    const uint8_t *in = pixels + stored * size_t(image.row_bytes);
    uint8_t *out = bgra.data() + y * width * 4;
    for (size_t x = 0; x < width; ++x, in += 4, out += 4) {
      uint8_t px[4] = {in[b], in[g], in[r], in[a]};
      if (!image.full_range)
        for (int c = 0; c < 3; ++c) px[c] = expand_range(px[c]);
      if (image.premultiplied && px[3] != 255)
        for (int c = 0; c < 3; ++c) px[c] = unpremultiply(px[c], px[3]);
      std::copy(px, px + 4, out);
    }
  }
}

}  // namespace qrv_ref
