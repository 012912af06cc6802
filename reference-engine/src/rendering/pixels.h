// Pixel access: every layout the engine reads and writes, and the view of a
// caller's buffer that a T_RasterInfo describes. Everything the engine does to
// pixels happens in one working form, four floats per pixel in R G B A order;
// these functions move lines of pixels between that form and the buffers.
#pragma once

#include <cstddef>
#include <string>

#include "tarsel/raster_info.h"

namespace tarsel_ref {

enum class Element { u8, u16, f16, f32 };

// One supported T_PixelType: its channels in memory and their element.
struct PixelLayout {
  T_PixelType type;
  const char *name;
  int channels;  // elements per pixel
  Element element;
  int element_size;      // bytes per element; line padding is counted in these
  int red, green, blue;  // memory position of each colour channel, -1 when absent
  int alpha;             // memory position of alpha, -1 when absent
  bool luminance;        // one grey channel (at `red`) stands for all three colours
  T_RasterType raster_type;
  int bit_depth;

  int pixel_size() const { return channels * element_size; }
  bool integer() const { return element == Element::u8 || element == Element::u16; }
  bool has_colour() const { return red >= 0; }
  bool has_alpha() const { return alpha >= 0; }
};

// The layout of a pixel type; null for a type the engine cannot read or write.
const PixelLayout *pixel_layout(int type);

// A caller's buffer as a T_RasterInfo describes it. Lines are numbered from
// the top of the image whatever order they are stored in.
struct RasterView {
  const PixelLayout *layout = nullptr;
  unsigned char *base = nullptr;
  int width = 0, height = 0;
  int x_origin = 0, y_origin = 0;  // frame position of the top-left pixel
  std::size_t line_bytes = 0;      // distance between stored lines
  bool flip = false;               // lines stored bottom-up
  bool clamp = false;              // written values kept within 0..1

  unsigned char *line(int y) const {
    const std::size_t stored = static_cast<std::size_t>(flip ? height - 1 - y : y);
    return base + stored * line_bytes;
  }
  bool empty() const { return width == 0 || height == 0; }
};

// Checks a descriptor and makes the view of `pixels` it describes; false with
// `error` saying why when the layout is not supported or the sizes do not add
// up. `pixels` may be null only for an empty image.
bool describe_raster(const T_RasterInfo &info, void *pixels, RasterView *view, std::string *error);

// Bytes an image of this layout and size takes: `height` lines of `width`
// pixels plus `extra_elements` elements of padding each. 0 when a size is
// negative or the total does not fit.
std::size_t image_bytes(const PixelLayout &layout, long long width, long long height, long long extra_elements);

// Reads `count` pixels of line `y` from column `x` into `rgba`. Channels the
// layout lacks read as 1 (alpha) or, for alpha-only layouts, as white: the
// alpha itself when `premultiplied`, else 1. Luminance fills all three colours.
void read_pixels(const RasterView &view, int y, int x, int count, float *rgba, bool premultiplied);

// Writes `count` pixels to line `y` from column `x`. Integer layouts round and
// keep values within 0..1; float layouts do so only when the view clamps.
// Luminance layouts store the Rec. 709 luma of the colour.
void write_pixels(const RasterView &view, int y, int x, int count, const float *rgba);

// Rec. 709 luma weights, used wherever colour becomes one grey value.
constexpr float kLumaR = 0.2126f, kLumaG = 0.7152f, kLumaB = 0.0722f;

}  // namespace tarsel_ref
