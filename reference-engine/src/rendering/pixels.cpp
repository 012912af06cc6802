#include "rendering/pixels.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>

namespace tarsel_ref {
namespace {

constexpr PixelLayout kLayouts[] = {
    // type           name        ch element      size  R   G   B   A  lum    raster       bits
    {pixel_a8, "pixel_a8", 1, Element::u8, 1, -1, -1, -1, 0, false, raster_a, 8},
    {pixel_rgb8, "pixel_rgb8", 3, Element::u8, 1, 0, 1, 2, -1, false, raster_rgb, 8},
    {pixel_bgr8, "pixel_bgr8", 3, Element::u8, 1, 2, 1, 0, -1, false, raster_rgb, 8},
    {pixel_rgba8, "pixel_rgba8", 4, Element::u8, 1, 0, 1, 2, 3, false, raster_rgba, 8},
    {pixel_bgra8, "pixel_bgra8", 4, Element::u8, 1, 2, 1, 0, 3, false, raster_rgba, 8},
    {pixel_argb8, "pixel_argb8", 4, Element::u8, 1, 1, 2, 3, 0, false, raster_rgba, 8},
    {pixel_a16, "pixel_a16", 1, Element::u16, 2, -1, -1, -1, 0, false, raster_a, 16},
    {pixel_rgb16, "pixel_rgb16", 3, Element::u16, 2, 0, 1, 2, -1, false, raster_rgb, 16},
    {pixel_rgba16, "pixel_rgba16", 4, Element::u16, 2, 0, 1, 2, 3, false, raster_rgba, 16},
    {pixel_bgra16, "pixel_bgra16", 4, Element::u16, 2, 2, 1, 0, 3, false, raster_rgba, 16},
    {pixel_argb16, "pixel_argb16", 4, Element::u16, 2, 1, 2, 3, 0, false, raster_rgba, 16},
    {pixel_af, "pixel_af", 1, Element::f32, 4, -1, -1, -1, 0, false, raster_a, 32},
    {pixel_rgbf, "pixel_rgbf", 3, Element::f32, 4, 0, 1, 2, -1, false, raster_rgb, 32},
    {pixel_rgbaf, "pixel_rgbaf", 4, Element::f32, 4, 0, 1, 2, 3, false, raster_rgba, 32},
    {pixel_argbf, "pixel_argbf", 4, Element::f32, 4, 1, 2, 3, 0, false, raster_rgba, 32},
    {pixel_l8, "pixel_l8", 1, Element::u8, 1, 0, 0, 0, -1, true, raster_l, 8},
    {pixel_l16, "pixel_l16", 1, Element::u16, 2, 0, 0, 0, -1, true, raster_l, 16},
    {pixel_lf, "pixel_lf", 1, Element::f32, 4, 0, 0, 0, -1, true, raster_l, 32},
    {pixel_la8, "pixel_la8", 2, Element::u8, 1, 0, 0, 0, 1, true, raster_la, 8},
    {pixel_la16, "pixel_la16", 2, Element::u16, 2, 0, 0, 0, 1, true, raster_la, 16},
    {pixel_laf, "pixel_laf", 2, Element::f32, 4, 0, 0, 0, 1, true, raster_la, 32},
    {pixel_rgb16f, "pixel_rgb16f", 3, Element::f16, 2, 0, 1, 2, -1, false, raster_rgb, 16},
    {pixel_rgba16f, "pixel_rgba16f", 4, Element::f16, 2, 0, 1, 2, 3, false, raster_rgba, 16},
    {pixel_a16f, "pixel_a16f", 1, Element::f16, 2, -1, -1, -1, 0, false, raster_a, 16},
};

// Images larger than this on a side are refused: no frame is that big, and
// sizes derived from them stay far from overflowing.
constexpr int kMaxSide = 1 << 20;

float half_to_float(std::uint16_t h) {
  const std::uint32_t sign = static_cast<std::uint32_t>(h & 0x8000u) << 16;
  const std::uint32_t exponent = (h >> 10) & 0x1fu;
  std::uint32_t mantissa = h & 0x3ffu;
  std::uint32_t bits;
  if (exponent == 0) {
    if (mantissa == 0) {
      bits = sign;
    } else {  // subnormal: renormalise
      int e = -1;
      do {
        ++e;
        mantissa <<= 1;
      } while ((mantissa & 0x400u) == 0);
      bits = sign | (static_cast<std::uint32_t>(127 - 15 - e) << 23) | ((mantissa & 0x3ffu) << 13);
    }
  } else if (exponent == 31) {
    bits = sign | 0x7f800000u | (mantissa << 13);
  } else {
    bits = sign | ((exponent + 127 - 15) << 23) | (mantissa << 13);
  }
  float f;
  std::memcpy(&f, &bits, sizeof f);
  return f;
}

// Round to nearest even, overflowing to infinity as the format does.
std::uint16_t float_to_half(float f) {
  std::uint32_t bits;
  std::memcpy(&bits, &f, sizeof bits);
  const std::uint16_t sign = static_cast<std::uint16_t>((bits >> 16) & 0x8000u);
  const std::uint32_t abs = bits & 0x7fffffffu;
  if (abs >= 0x7f800000u) return static_cast<std::uint16_t>(sign | 0x7c00u | (abs > 0x7f800000u ? 0x200u : 0u));
  if (abs >= 0x477ff000u) return static_cast<std::uint16_t>(sign | 0x7c00u);
  if (abs < 0x38800000u) {  // below the smallest normal half
    if (abs < 0x33000000u) return sign;
    const std::uint32_t e = abs >> 23;
    const std::uint32_t m = (abs & 0x7fffffu) | 0x800000u;
    const std::uint32_t shift = 126 - e;  // 14..24
    std::uint32_t half = m >> shift;
    const std::uint32_t rest = m & ((1u << shift) - 1u);
    const std::uint32_t midpoint = 1u << (shift - 1);
    if (rest > midpoint || (rest == midpoint && (half & 1u))) ++half;
    return static_cast<std::uint16_t>(sign | half);
  }
  std::uint32_t half = ((abs >> 13) - ((127u - 15u) << 10));
  const std::uint32_t rest = abs & 0x1fffu;
  if (rest > 0x1000u || (rest == 0x1000u && (half & 1u))) ++half;
  return static_cast<std::uint16_t>(sign | half);
}

template <Element E>
struct Codec;

template <>
struct Codec<Element::u8> {
  static float get(const unsigned char *p) { return static_cast<float>(*p) * (1.0f / 255.0f); }
  static void put(unsigned char *p, float v) {
    v = std::isnan(v) ? 0.0f : std::clamp(v, 0.0f, 1.0f);
    *p = static_cast<unsigned char>(v * 255.0f + 0.5f);
  }
};

template <>
struct Codec<Element::u16> {
  static float get(const unsigned char *p) {
    std::uint16_t v;
    std::memcpy(&v, p, sizeof v);
    return static_cast<float>(v) * (1.0f / 65535.0f);
  }
  static void put(unsigned char *p, float v) {
    v = std::isnan(v) ? 0.0f : std::clamp(v, 0.0f, 1.0f);
    const std::uint16_t stored = static_cast<std::uint16_t>(v * 65535.0f + 0.5f);
    std::memcpy(p, &stored, sizeof stored);
  }
};

template <>
struct Codec<Element::f16> {
  static float get(const unsigned char *p) {
    std::uint16_t v;
    std::memcpy(&v, p, sizeof v);
    return half_to_float(v);
  }
  static void put(unsigned char *p, float v) {
    const std::uint16_t stored = float_to_half(v);
    std::memcpy(p, &stored, sizeof stored);
  }
};

template <>
struct Codec<Element::f32> {
  static float get(const unsigned char *p) {
    float v;
    std::memcpy(&v, p, sizeof v);
    return v;
  }
  static void put(unsigned char *p, float v) { std::memcpy(p, &v, sizeof v); }
};

template <Element E>
void read_line(const PixelLayout &l, const unsigned char *src, int count, float *rgba, bool premultiplied) {
  const int step = l.pixel_size();
  const int es = l.element_size;
  for (int i = 0; i < count; ++i, src += step, rgba += 4) {
    const float a = l.alpha >= 0 ? Codec<E>::get(src + l.alpha * es) : 1.0f;
    if (l.red < 0) {
      const float white = premultiplied ? a : 1.0f;
      rgba[0] = rgba[1] = rgba[2] = white;
    } else if (l.luminance) {
      rgba[0] = rgba[1] = rgba[2] = Codec<E>::get(src + l.red * es);
    } else {
      rgba[0] = Codec<E>::get(src + l.red * es);
      rgba[1] = Codec<E>::get(src + l.green * es);
      rgba[2] = Codec<E>::get(src + l.blue * es);
    }
    rgba[3] = a;
  }
}

template <Element E>
void write_line(const PixelLayout &l, unsigned char *dst, int count, const float *rgba, bool clamp) {
  const int step = l.pixel_size();
  const int es = l.element_size;
  auto put = [clamp](unsigned char *p, float v) {
    if (clamp) v = std::isnan(v) ? 0.0f : std::clamp(v, 0.0f, 1.0f);
    Codec<E>::put(p, v);
  };
  for (int i = 0; i < count; ++i, dst += step, rgba += 4) {
    if (l.luminance) {
      // Grey is stored as it is: the weights need not sum to exactly 1 in floats.
      const bool grey = rgba[0] == rgba[1] && rgba[1] == rgba[2];
      put(dst + l.red * es, grey ? rgba[0] : kLumaR * rgba[0] + kLumaG * rgba[1] + kLumaB * rgba[2]);
    } else if (l.red >= 0) {
      put(dst + l.red * es, rgba[0]);
      put(dst + l.green * es, rgba[1]);
      put(dst + l.blue * es, rgba[2]);
    }
    if (l.alpha >= 0) put(dst + l.alpha * es, rgba[3]);
  }
}

}  // namespace

const PixelLayout *pixel_layout(int type) {
  for (const PixelLayout &layout : kLayouts)
    if (layout.type == type) return &layout;
  return nullptr;
}

std::size_t image_bytes(const PixelLayout &layout, long long width, long long height, long long extra_elements) {
  if (width < 0 || height < 0 || extra_elements < 0 || width > kMaxSide || height > kMaxSide ||
      extra_elements > kMaxSide)
    return 0;
  const unsigned long long line =
      static_cast<unsigned long long>(width) * static_cast<unsigned long long>(layout.pixel_size()) +
      static_cast<unsigned long long>(extra_elements) * static_cast<unsigned long long>(layout.element_size);
  const unsigned long long total = line * static_cast<unsigned long long>(height);
  if (total > std::numeric_limits<std::size_t>::max() / 2) return 0;
  return static_cast<std::size_t>(total);
}

bool describe_raster(const T_RasterInfo &info, void *pixels, RasterView *view, std::string *error) {
  const PixelLayout *layout = pixel_layout(info.pixel_type);
  if (!layout) {
    *error = "pixel type " + std::to_string(static_cast<int>(info.pixel_type)) + " is not supported";
    return false;
  }
  if (info.sizeof_pixel != 0 && info.sizeof_pixel != layout->pixel_size()) {
    *error = std::string(layout->name) + " pixels take " + std::to_string(layout->pixel_size()) +
             " bytes, but sizeof_pixel says " + std::to_string(info.sizeof_pixel);
    return false;
  }
  if (info.ds_xsize < 0 || info.ds_ysize < 0 || info.ds_xsize > kMaxSide || info.ds_ysize > kMaxSide) {
    *error = "an image of " + std::to_string(info.ds_xsize) + " x " + std::to_string(info.ds_ysize) +
             " pixels is not possible";
    return false;
  }
  if (info.extra_line_stride_elts < 0 || info.extra_line_stride_elts > kMaxSide) {
    *error = "extra_line_stride_elts " + std::to_string(info.extra_line_stride_elts) + " is not possible";
    return false;
  }
  if (info.res_factor < 0) {
    *error = "res_factor " + std::to_string(info.res_factor) + " is not possible";
    return false;
  }
  if (image_bytes(*layout, info.ds_xsize, info.ds_ysize, info.extra_line_stride_elts) == 0 && info.ds_xsize > 0 &&
      info.ds_ysize > 0) {
    *error = "the image is too large";
    return false;
  }
  if (!pixels && info.ds_xsize > 0 && info.ds_ysize > 0) {
    *error = "no pixels for an image of " + std::to_string(info.ds_xsize) + " x " + std::to_string(info.ds_ysize);
    return false;
  }
  RasterView v;
  v.layout = layout;
  v.base = static_cast<unsigned char *>(pixels);
  v.width = info.ds_xsize;
  v.height = info.ds_ysize;
  v.x_origin = info.x_origin;
  v.y_origin = info.y_origin;
  v.line_bytes = image_bytes(*layout, info.ds_xsize, 1, info.extra_line_stride_elts);
  v.flip = info.flip_y_p != 0;
  v.clamp = info.clamp_p != 0;
  *view = v;
  return true;
}

void read_pixels(const RasterView &view, int y, int x, int count, float *rgba, bool premultiplied) {
  if (count <= 0) return;
  const PixelLayout &l = *view.layout;
  const unsigned char *src = view.line(y) + static_cast<std::size_t>(x) * static_cast<std::size_t>(l.pixel_size());
  switch (l.element) {
    case Element::u8: read_line<Element::u8>(l, src, count, rgba, premultiplied); break;
    case Element::u16: read_line<Element::u16>(l, src, count, rgba, premultiplied); break;
    case Element::f16: read_line<Element::f16>(l, src, count, rgba, premultiplied); break;
    case Element::f32: read_line<Element::f32>(l, src, count, rgba, premultiplied); break;
  }
}

void write_pixels(const RasterView &view, int y, int x, int count, const float *rgba) {
  if (count <= 0) return;
  const PixelLayout &l = *view.layout;
  unsigned char *dst = view.line(y) + static_cast<std::size_t>(x) * static_cast<std::size_t>(l.pixel_size());
  switch (l.element) {
    case Element::u8: write_line<Element::u8>(l, dst, count, rgba, false); break;
    case Element::u16: write_line<Element::u16>(l, dst, count, rgba, false); break;
    case Element::f16: write_line<Element::f16>(l, dst, count, rgba, view.clamp); break;
    case Element::f32: write_line<Element::f32>(l, dst, count, rgba, view.clamp); break;
  }
}

}  // namespace tarsel_ref
