// Transform: moves, scales, rotates and crops the input. Its two-channel
// parameters show every way a value can sit in image space.
#include <algorithm>
#include <cmath>

#include "catalogue/catalogue.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {
namespace {

// The kernel: the source's anchor point (the pivot, in fractions of the
// frame, moved by the anchor offset) is placed at the destination point (the
// position, moved by the offset, the target's distance from the centre and the
// origin), scaled by scale times stretch, skewed, and turned by the rotation
// plus the spin's degrees per second. Lengths are full-resolution pixels, y
// downwards: with the defaults a 1920 x 1080 frame is left as it is. The
// crop keeps the source between its left and right, top and bottom edges.
// Samples are nearest, bilinear or bicubic (Catmull-Rom; bilinear in draft),
// and the edges say what lies beyond the source.
constexpr double kPi = 3.14159265358979323846;

enum EdgeMode { kTransparent = 0, kRepeat = 1, kMirror = 2, kClamp = 3 };

int edge_index(int k, int n, int mode) {
  if (k >= 0 && k < n) return k;
  switch (mode) {
    case kRepeat: {
      const int m = k % n;
      return m < 0 ? m + n : m;
    }
    case kMirror: {
      const int period = 2 * n;
      int m = k % period;
      if (m < 0) m += period;
      return m < n ? m : period - 1 - m;
    }
    case kClamp: return k < 0 ? 0 : n - 1;
    default: return -1;
  }
}

struct Source {
  const WorkImage *image;
  int width, height, edges;
  double crop_x0, crop_x1, crop_y0, crop_y1;  // in source pixel indices

  // Pixel (i, j) of the source as the edges and the crop make it; null for nothing.
  const float *at(int i, int j) const {
    const int x = edge_index(i, width, edges), y = edge_index(j, height, edges);
    if (x < 0 || y < 0) return nullptr;
    if (x < crop_x0 || x >= crop_x1 || y < crop_y0 || y >= crop_y1) return nullptr;
    return image->row(y) + x * 4;
  }
};

void cubic_weights(double t, double w[4]) {
  const double t2 = t * t, t3 = t2 * t;
  w[0] = -0.5 * t3 + t2 - 0.5 * t;
  w[1] = 1.5 * t3 - 2.5 * t2 + 1.0;
  w[2] = -1.5 * t3 + 2.0 * t2 + 0.5 * t;
  w[3] = 0.5 * t3 - 0.5 * t2;
}

void sample(const Source &s, double u, double v, int filter, float *out) {
  out[0] = out[1] = out[2] = out[3] = 0.0f;
  if (filter == 0) {
    if (const float *p = s.at(static_cast<int>(std::floor(u + 0.5)), static_cast<int>(std::floor(v + 0.5))))
      std::copy(p, p + 4, out);
    return;
  }
  const int taps = filter == 1 ? 2 : 4;
  const int first = filter == 1 ? 0 : -1;
  const double fu = std::floor(u), fv = std::floor(v);
  const double tu = u - fu, tv = v - fv;
  double wx[4], wy[4];
  if (filter == 1) {
    wx[0] = 1.0 - tu, wx[1] = tu, wy[0] = 1.0 - tv, wy[1] = tv;
  } else {
    cubic_weights(tu, wx);
    cubic_weights(tv, wy);
  }
  double acc[4] = {0.0, 0.0, 0.0, 0.0};
  const int iu = static_cast<int>(fu), iv = static_cast<int>(fv);
  for (int j = 0; j < taps; ++j) {
    if (wy[j] == 0.0) continue;
    for (int i = 0; i < taps; ++i) {
      if (wx[i] == 0.0) continue;
      const float *p = s.at(iu + first + i, iv + first + j);
      if (!p) continue;
      const double w = wx[i] * wy[j];
      for (int c = 0; c < 4; ++c) acc[c] += w * p[c];
    }
  }
  for (int c = 0; c < 4; ++c) out[c] = static_cast<float>(acc[c]);
}

int render_transform(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const double pa = ctx.pixel_aspect, fw = ctx.frame_width, fh = ctx.frame_height;
  auto len = [&](const char *name, int c) { return ctx.length(p.number(name, c)); };
  // Points in square units: x times the pixel aspect.
  const double ax = (p.number("pivot", 0) * fw + len("anchor", 0)) * pa;
  const double ay = p.number("pivot", 1) * fh + len("anchor", 1);
  const double dx =
      (len("position", 0) + len("offset", 0) + (p.number("target", 0) - 0.5) * fw + p.number("origin", 0) * fw) * pa;
  const double dy =
      len("position", 1) + len("offset", 1) + (p.number("target", 1) - 0.5) * fh + p.number("origin", 1) * fh;
  const double sx = static_cast<double>(p.number("scale", 0)) * p.number("stretch", 0);
  const double sy = static_cast<double>(p.number("scale", 1)) * p.number("stretch", 1);
  const double theta = (static_cast<double>(p.number("rotation")) + p.number("spin")) * kPi / 180.0;
  const double shear = std::tan(std::clamp(static_cast<double>(p.number("skew")), -89.0, 89.0) * kPi / 180.0);
  int filter = std::clamp(p.whole("filter"), 0, 2);
  if (filter == 2 && ctx.quality == 0) filter = 1;

  Source src;
  src.image = &ctx.input(0);
  src.width = ctx.width;
  src.height = ctx.height;
  src.edges = std::clamp(p.whole("edges"), 0, 3);
  // The crop's edges in frame pixels, as source pixel indices.
  src.crop_x0 = len("crop_x", 0) - ctx.x0 - 0.5;
  src.crop_x1 = len("crop_x", 1) - ctx.x0 - 0.5;
  src.crop_y0 = len("crop_y", 0) - ctx.y0 - 0.5;
  src.crop_y1 = len("crop_y", 1) - ctx.y0 - 0.5;

  // Inverse of rotation * shear * scale, taking destination offsets back to the source.
  const bool degenerate = sx == 0.0 || sy == 0.0 || !std::isfinite(sx) || !std::isfinite(sy);
  const double c = std::cos(theta), s = std::sin(theta);
  // R^-1 = [c s; -s c], K^-1 = [1 -shear; 0 1], S^-1 = diag(1/sx, 1/sy)
  const double m00 = (c - shear * -s) / (degenerate ? 1.0 : sx), m01 = (s - shear * c) / (degenerate ? 1.0 : sx);
  const double m10 = -s / (degenerate ? 1.0 : sy), m11 = c / (degenerate ? 1.0 : sy);

  // Every pixel taken from where it is, nothing cropped: the source itself.
  const bool identity = !degenerate && m00 == 1.0 && m01 == 0.0 && m10 == 0.0 && m11 == 1.0 && ax == dx && ay == dy &&
                        src.crop_x0 <= -0.5 && src.crop_x1 >= ctx.width - 0.5 && src.crop_y0 <= -0.5 &&
                        src.crop_y1 >= ctx.height - 0.5;
  if (identity) return 0;
  ctx.rows([&](int y) {
    float *d = out.row(y);
    if (degenerate) {
      std::fill(d, d + static_cast<std::size_t>(ctx.width) * 4, 0.0f);
      return;
    }
    const double py = ctx.y0 + y + 0.5 - dy;
    for (int x = 0; x < ctx.width; ++x) {
      const double px = (ctx.x0 + x + 0.5) * pa - dx;
      const double qx = ax + m00 * px + m01 * py, qy = ay + m10 * px + m11 * py;
      sample(src, qx / pa - ctx.x0 - 0.5, qy - ctx.y0 - 0.5, filter, d + x * 4);
    }
  });
  return kWrote;
}

DescriptorDefinition transform() {
  DescriptorDefinition d;
  d.name = "Transform";
  d.kernel = render_transform;
  d.popup_name = "Transform";
  d.inputs = {{"Source", "src"}};
  d.transform_with_warp = 1;
  d.params = {
      label_param("Coordinates", "coordinates").in_group("Image Space", "doc_group,no_publish"),
      pair_param("Scale", "scale", screen_mode_normal, 1.0f, 1.0f).sliders(0.0f, 2.0f).big_sliders(0.0f, 10.0f),
      pair_param("Position", "position", screen_mode_screen, 960.0f, 540.0f)
          .sliders(0.0f, 1920.0f)
          .big_sliders(-4000.0f, 6000.0f)
          .shown_as(format_pixels),
      pair_param("Anchor", "anchor", screen_mode_screen_center, 0.0f, 0.0f)
          .sliders(-960.0f, 960.0f)
          .big_sliders(-4000.0f, 4000.0f)
          .shown_as(format_pixels),
      pair_param("Offset", "offset", screen_mode_screen_center0, 0.0f, 0.0f)
          .sliders(-100.0f, 100.0f)
          .big_sliders(-2000.0f, 2000.0f)
          .shown_as(format_pixels),
      pair_param("Pivot", "pivot", screen_mode_normalize, 0.5f, 0.5f).sliders(0.0f, 1.0f).big_sliders(-1.0f, 2.0f),
      pair_param("Stretch", "stretch", screen_mode_normalize_scale, 1.0f, 1.0f)
          .bounds(0.0f, 100.0f)
          .sliders(0.0f, 2.0f),
      pair_param("Target", "target", screen_mode_screen_to_norm, 0.5f, 0.5f).sliders(0.0f, 1.0f),
      pair_param("Origin", "origin", screen_mode_screen_center_to_norm, 0.0f, 0.0f).sliders(-0.5f, 0.5f),
      pair_param("Crop X", "crop_x", screen_mode_screen_x, 0.0f, 1920.0f)
          .sliders(0.0f, 1920.0f)
          .shown_as(format_pixels),
      pair_param("Crop Y", "crop_y", screen_mode_screen_y, 0.0f, 1080.0f)
          .sliders(0.0f, 1080.0f)
          .shown_as(format_pixels),
      float_param("Rotation", "rotation", 0.0f)
          .shown_as(format_angle)
          .sliders(-180.0f, 180.0f)
          .big_sliders(-3600.0f, 3600.0f),
      // Degrees added per second of the clip: the rotation keeps turning.
      float_param("Spin", "spin", 0.0f).shown_as(format_angle).sliders(-360.0f, 360.0f).animated(auto_anim_ramp_up),
      float_param("Skew", "skew", 0.0f).bounds(-89.0f, 89.0f).shown_as(format_angle),
      popup_param("Edges", "edges", {"Transparent", "Repeat", "Mirror", "Clamp"})
          .in_group("Sampling", "group_start,open"),
      popup_param("Filter", "filter", {"Nearest", "Bilinear", "Bicubic"}, 2),
      bool_param("Motion Vectors", "motion_vectors", false).with_flags("group_end,builder_disable"),
  };
  return d;
}

}  // namespace

const PluginDefinition &transform_plugin() {
  static const PluginDefinition plugin{"T_Transform", "Distort", false, false, {transform()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
