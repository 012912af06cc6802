// Resizing native images: a separable filter, across then down, whose kernel
// widens by the reduction factor when shrinking, so every source pixel counts
// (no pixel is merely picked). Edge pixels repeat beyond the image. Colour is
// filtered premultiplied and stored values are used as they are (no colour
// space conversion).
#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include "core/messages.h"
#include "rendering/colour.h"
#include "rendering/image_utils.h"
#include "rendering/pixels.h"
#include "rendering/workers.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

enum Filter { kBox = 0, kBilinear = 1, kBicubic = 2 };

struct Plan {
  const PixelLayout *src_layout = nullptr;
  const PixelLayout *dst_layout = nullptr;
  int width = 0, height = 0;
};

int scaled(int given, int source, float scale) {
  if (given > 0) return given;
  return static_cast<int>(std::max(1.0, std::round(static_cast<double>(source) * scale)));
}

bool plan_resize(const T_RasterInfo *src_info, int new_xsize, int new_ysize, int pixel_type, int extra, float scale,
                 Plan *plan, std::string *error) {
  if (!src_info) {
    *error = "no source descriptor";
    return false;
  }
  plan->src_layout = pixel_layout(src_info->pixel_type);
  if (!plan->src_layout) {
    *error = "source pixel type " + std::to_string(static_cast<int>(src_info->pixel_type)) + " is not supported";
    return false;
  }
  plan->dst_layout = pixel_layout(pixel_type == 0 ? static_cast<int>(src_info->pixel_type) : pixel_type);
  if (!plan->dst_layout) {
    *error = "pixel type " + std::to_string(pixel_type) + " is not supported";
    return false;
  }
  if (src_info->ds_xsize <= 0 || src_info->ds_ysize <= 0) {
    *error = "the source is empty";
    return false;
  }
  if (new_xsize < 0 || new_ysize < 0 || extra < 0) {
    *error = "sizes and line padding cannot be negative";
    return false;
  }
  if ((new_xsize == 0 || new_ysize == 0) && !(std::isfinite(scale) && scale > 0.0f)) {
    *error = "a size given as 0 needs a positive scale";
    return false;
  }
  plan->width = scaled(new_xsize, src_info->ds_xsize, scale);
  plan->height = scaled(new_ysize, src_info->ds_ysize, scale);
  if (image_bytes(*plan->dst_layout, plan->width, plan->height, extra) == 0) {
    *error = "the result would be too large";
    return false;
  }
  return true;
}

// Weights of the source samples that make each result sample along one axis.
struct Taps {
  std::vector<int> first, count;
  std::vector<int> index;
  std::vector<double> weight;
  bool identity = true;  // every result sample is the source sample at its place
};

double cubic(double x, double b, double c) {
  x = std::fabs(x);
  if (x < 1.0) return ((12 - 9 * b - 6 * c) * x * x * x + (-18 + 12 * b + 6 * c) * x * x + (6 - 2 * b)) / 6.0;
  if (x < 2.0)
    return ((-b - 6 * c) * x * x * x + (6 * b + 30 * c) * x * x + (-12 * b - 48 * c) * x + (8 * b + 24 * c)) / 6.0;
  return 0.0;
}

// Bicubic sharpness walks the family of cubics whose B + 2C = 1: 0 is the
// smooth B-spline, about 0.67 the balanced cubic, 1 Catmull-Rom.
Taps make_taps(int n, int m, double offset, int filter, double sharpness) {
  Taps taps;
  const double f = static_cast<double>(n) / m;
  const double widen = std::max(f, 1.0);
  const double support = filter == kBicubic ? 2.0 * widen : filter == kBilinear ? widen : widen / 2.0 + 0.5;
  const double b = 1.0 - sharpness, c = sharpness / 2.0;
  for (int j = 0; j < m; ++j) {
    const double centre = (j + 0.5) * f - 0.5 + offset;
    const int lo = static_cast<int>(std::floor(centre - support)), hi = static_cast<int>(std::ceil(centre + support));
    std::vector<std::pair<int, double>> kept;
    double total = 0.0;
    for (int i = lo; i <= hi; ++i) {
      const double d = i - centre;
      double w;
      if (filter == kBox) {
        const double half = widen / 2.0;
        w = std::max(0.0, std::min(d + 0.5, half) - std::max(d - 0.5, -half));
      } else if (filter == kBilinear) {
        w = std::max(0.0, 1.0 - std::fabs(d) / widen);
      } else {
        w = cubic(d / widen, b, c);
      }
      if (w == 0.0) continue;
      kept.emplace_back(std::clamp(i, 0, n - 1), w);
      total += w;
    }
    if (kept.empty() || total == 0.0) {  // weights that cancel out: the nearest sample stands in
      kept.assign(1, {std::clamp(static_cast<int>(std::lround(centre)), 0, n - 1), 1.0});
      total = 1.0;
    }
    taps.first.push_back(static_cast<int>(taps.index.size()));
    taps.count.push_back(static_cast<int>(kept.size()));
    for (const auto &k : kept) {
      taps.index.push_back(k.first);
      taps.weight.push_back(k.second / total);
    }
    taps.identity = taps.identity && n == m && kept.size() == 1 && kept[0].first == j && kept[0].second == total;
  }
  return taps;
}

}  // namespace

size_t resized_image_size(T_RasterInfo *src_info, int new_xsize, int new_ysize, int pixel_type, int extra_line_elts,
                          float scale) {
  tarsel_ref::Plan plan;
  std::string error;
  if (!tarsel_ref::plan_resize(src_info, new_xsize, new_ysize, pixel_type, extra_line_elts, scale, &plan, &error))
    return 0;
  return tarsel_ref::image_bytes(*plan.dst_layout, plan.width, plan.height, extra_line_elts);
}

void resize_image(T_RasterInfo *src_info, RawImage src, int new_xsize, int new_ysize, int pixel_type,
                  int extra_line_elts, float scale, T_RasterInfo *dst_info, RawImage dst, int filter, float x_offset,
                  float y_offset, float sharpness, int *out_xsize, int *out_ysize) {
  if (out_xsize) *out_xsize = 0;
  if (out_ysize) *out_ysize = 0;
  auto fail = [](const std::string &why) { emit_message(Err_Error, ("tarsel_resize_native_image: " + why).c_str()); };
  Plan plan;
  std::string error;
  RasterView source, result;
  if (!plan_resize(src_info, new_xsize, new_ysize, pixel_type, extra_line_elts, scale, &plan, &error) ||
      !describe_raster(*src_info, src, &source, &error))
    return fail(error);
  if (filter < kBox || filter > kBicubic) return fail("filter " + std::to_string(filter) + " is not 0, 1 or 2");
  if (!std::isfinite(x_offset) || !std::isfinite(y_offset) || !std::isfinite(sharpness))
    return fail("offsets and sharpness must be numbers");
  if (!dst_info || !dst) return fail("no destination");
  try {
    T_RasterInfo info = *dst_info;
    info.pixel_type = plan.dst_layout->type;
    info.extra_line_stride_elts = extra_line_elts;
    info.ds_xsize = info.world_xsize = plan.width;
    info.ds_ysize = info.world_ysize = plan.height;
    info.x_origin = info.y_origin = 0;
    info.bit_depth = plan.dst_layout->bit_depth;
    info.raster_type = plan.dst_layout->raster_type;
    info.sizeof_pixel = plan.dst_layout->pixel_size();
    info.res_factor = 1;
    if (plan.dst_layout->integer()) info.clamp_p = 1;
    info.flip_y_p = 0;
    info.is_premultiplied = src_info->is_premultiplied;
    if (!describe_raster(info, dst, &result, &error)) return fail(error);

    const bool straight = !src_info->is_premultiplied && plan.src_layout->has_alpha();
    const double s = std::clamp(static_cast<double>(sharpness), 0.0, 1.0);
    const Taps across = make_taps(source.width, plan.width, x_offset, filter, s);
    const Taps down = make_taps(source.height, plan.height, y_offset, filter, s);
    const std::size_t line = static_cast<std::size_t>(plan.width) * 4;
    if (across.identity && down.identity) {
      // Nothing to filter: the pixels are converted as they are, so that
      // straight colour under zero alpha survives.
      run_rows(plan.height, 0, [&](int y) {
        std::vector<float> row(line);
        read_pixels(source, y, 0, plan.width, row.data(), src_info->is_premultiplied != 0);
        write_pixels(result, y, 0, plan.width, row.data());
      });
      *dst_info = info;
      if (out_xsize) *out_xsize = plan.width;
      if (out_ysize) *out_ysize = plan.height;
      return;
    }
    std::vector<float> middle(line * static_cast<std::size_t>(source.height));
    run_rows(source.height, 0, [&](int y) {
      std::vector<float> in(static_cast<std::size_t>(source.width) * 4);
      read_pixels(source, y, 0, source.width, in.data(), src_info->is_premultiplied != 0);
      if (straight) premultiply(in.data(), source.width);
      float *out = middle.data() + line * static_cast<std::size_t>(y);
      for (int x = 0; x < plan.width; ++x) {
        double acc[4] = {0, 0, 0, 0};
        for (int k = 0; k < across.count[static_cast<std::size_t>(x)]; ++k) {
          const std::size_t t = static_cast<std::size_t>(across.first[static_cast<std::size_t>(x)] + k);
          const float *p = in.data() + static_cast<std::size_t>(across.index[t]) * 4;
          for (int c = 0; c < 4; ++c) acc[c] += across.weight[t] * p[c];
        }
        for (int c = 0; c < 4; ++c) out[x * 4 + c] = static_cast<float>(acc[c]);
      }
    });
    run_rows(plan.height, 0, [&](int y) {
      std::vector<double> acc(line, 0.0);
      for (int k = 0; k < down.count[static_cast<std::size_t>(y)]; ++k) {
        const std::size_t t = static_cast<std::size_t>(down.first[static_cast<std::size_t>(y)] + k);
        const float *p = middle.data() + line * static_cast<std::size_t>(down.index[t]);
        for (std::size_t i = 0; i < line; ++i) acc[i] += down.weight[t] * p[i];
      }
      std::vector<float> out(line);
      for (std::size_t i = 0; i < line; ++i) out[i] = static_cast<float>(acc[i]);
      if (straight) unpremultiply(out.data(), plan.width);
      write_pixels(result, y, 0, plan.width, out.data());
    });
    *dst_info = info;
    if (out_xsize) *out_xsize = plan.width;
    if (out_ysize) *out_ysize = plan.height;
  } catch (const std::bad_alloc &) {
    fail("not enough memory");
  }
}

}  // namespace tarsel_ref
