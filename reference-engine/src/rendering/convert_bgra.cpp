// Conversion of native images to 8-bit BGRA for display. The colour of each
// pixel, made straight, goes through the input table, is decoded from the
// source's colour space to linear light, multiplied by the exposure, encoded
// for the display and looked up in the display table (set_tarsel_luts).
#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include "core/messages.h"
#include "rendering/colour.h"
#include "rendering/image_utils.h"
#include "rendering/luts.h"
#include "rendering/pixels.h"
#include "rendering/workers.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

constexpr float kBayer[4][4] = {{0, 8, 2, 10}, {12, 4, 14, 6}, {3, 11, 1, 9}, {15, 7, 13, 5}};

unsigned char to_byte(float v, float dither) {
  if (std::isnan(v)) return 0;
  const float scaled = std::clamp(v, 0.0f, 1.0f) * 255.0f + dither + 0.5f;
  return static_cast<unsigned char>(std::clamp(scaled, 0.0f, 255.0f));
}

}  // namespace

void convert_to_bgra(T_RasterInfo *src_info, RawImage src, RawImage dst, int alpha_mode, int dither, int flip,
                     const char *src_colorspace, const char *display_colorspace) {
  auto fail = [](const std::string &why) { emit_message(Err_Error, ("tarsel_convert_to_bgra_8: " + why).c_str()); };
  if (!src_info) return fail("no source descriptor");
  RasterView source;
  std::string error;
  if (!describe_raster(*src_info, src, &source, &error)) return fail(error);
  ColourSpace from, to;
  if (!parse_colour_space(src_colorspace, &from))
    return fail(std::string("unknown colour space \"") + src_colorspace + "\"");
  if (!parse_colour_space(display_colorspace, &to))
    return fail(std::string("unknown colour space \"") + display_colorspace + "\"");
  if (alpha_mode < RGBA_NONE || alpha_mode > RGBA_SET_ALPHA_TO_ONE)
    return fail("alpha mode " + std::to_string(alpha_mode) + " is not one of RGBA_NONE .. RGBA_SET_ALPHA_TO_ONE");
  if (source.empty()) return;
  if (!dst) return fail("no destination");
  const std::shared_ptr<const LutSet> luts = current_luts();
  const bool premultiplied = src_info->is_premultiplied != 0;
  const std::size_t out_line = static_cast<std::size_t>(source.width) * 4;
  auto *out = static_cast<unsigned char *>(dst);
  try {
    run_rows(source.height, 0, [&](int y) {
      std::vector<float> px(static_cast<std::size_t>(source.width) * 4);
      read_pixels(source, y, 0, source.width, px.data(), premultiplied);
      if (premultiplied) unpremultiply(px.data(), source.width);
      for (int x = 0; x < source.width; ++x) {
        float *p = px.data() + static_cast<std::size_t>(x) * 4;
        for (int c = 0; c < 3; ++c) {
          float v = apply_lut(luts->input, p[c]);
          if (from == ColourSpace::srgb) v = srgb_to_linear(v);
          v *= luts->exposure;
          if (to == ColourSpace::srgb) v = linear_to_srgb(v);
          p[c] = apply_lut(luts->display, v);
        }
      }
      unsigned char *d = out + out_line * static_cast<std::size_t>(flip ? source.height - 1 - y : y);
      for (int x = 0; x < source.width; ++x) {
        const float *p = px.data() + static_cast<std::size_t>(x) * 4;
        const float shift = dither ? (kBayer[y & 3][x & 3] - 7.5f) / 16.0f : 0.0f;
        unsigned char *q = d + static_cast<std::size_t>(x) * 4;
        if (alpha_mode == RGBA_COPY_ALPHA) {
          q[0] = q[1] = q[2] = to_byte(p[3], shift);
          q[3] = 255;
          continue;
        }
        q[0] = to_byte(p[2], shift);
        q[1] = to_byte(p[1], shift);
        q[2] = to_byte(p[0], shift);
        q[3] = alpha_mode == RGBA_OK ? to_byte(p[3], 0.0f) : 255;
      }
    });
  } catch (const std::bad_alloc &) {
    fail("not enough memory");
  }
}

}  // namespace tarsel_ref
