// Gradient: fills the frame with a blend between two colours, along a line
// through the centre at an angle, or around the centre.
#include <algorithm>
#include <cmath>

#include "catalogue/catalogue.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {
namespace {

// The kernel: a blend from the start colour to the end colour. Linear runs
// along the angle (0 degrees left to right, 90 top to bottom) across the
// frame, so the first and last pixel centres get the two colours exactly;
// radial and diamond grow from the centre to the frame's farthest corner;
// conical turns once around the centre from the angle. Spread stretches the
// blend's length.
constexpr double kPi = 3.14159265358979323846;

// 4 x 4 ordered-dither thresholds, centred on zero.
constexpr float kBayer[4][4] = {{0, 8, 2, 10}, {12, 4, 14, 6}, {3, 11, 1, 9}, {15, 7, 13, 5}};

int render_gradient(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  float start[4], end[4];
  for (int c = 0; c < 4; ++c) {
    start[c] = p.number("start_color", c);
    end[c] = p.number("end_color", c);
  }
  for (int c = 0; c < 3; ++c) {  // colours blend premultiplied
    start[c] *= start[3];
    end[c] *= end[3];
  }
  const double angle = p.number("angle") * kPi / 180.0;
  const int shape = std::clamp(p.whole("shape"), 0, 3);
  const double spread = std::max(0.01f, p.number("spread"));
  const double pa = ctx.pixel_aspect;
  const double fw = ctx.frame_width, fh = ctx.frame_height;
  // Everything is measured in square units: a pixel is pa wide, 1 tall.
  const double cx = p.number("center", 0) * fw * pa, cy = p.number("center", 1) * fh;
  // Whole quarter turns give exact axes, so that a vertical blend does not drift across.
  auto snap = [](double v) { return std::fabs(v) < 1e-12 ? 0.0 : v; };
  const double dx = snap(std::cos(angle)), dy = snap(std::sin(angle));
  const double span_w = std::max(fw - 1.0, 0.0) * pa, span_h = std::max(fh - 1.0, 0.0);
  const double linear_length = std::max(std::fabs(span_w * dx) + std::fabs(span_h * dy), 1e-9) * spread;
  double corner = 0.0, diamond = 0.0;
  for (double x : {0.0, fw * pa})
    for (double y : {0.0, fh}) {
      corner = std::max(corner, std::hypot(x - cx, y - cy));
      diamond = std::max(diamond, std::fabs((x - cx) * dx + (y - cy) * dy) + std::fabs(-(x - cx) * dy + (y - cy) * dx));
    }
  corner = std::max(corner, 1e-9) * spread;
  diamond = std::max(diamond, 1e-9) * spread;
  // The result is written to integer pixels when the destination is; a
  // dither below half a step keeps exact colours exact and breaks up bands.
  const bool dither = p.has("dither") && p.number("dither") != 0.0f;

  ctx.rows([&](int y) {
    float *r = out.row(y);
    const double py = ctx.y0 + y + 0.5 - cy;
    for (int x = 0; x < ctx.width; ++x) {
      const double px = (ctx.x0 + x + 0.5) * pa - cx;
      double t;
      switch (shape) {
        case 0: t = 0.5 + (px * dx + py * dy) / linear_length; break;
        case 1: t = std::hypot(px, py) / corner; break;
        case 2: t = (std::fabs(px * dx + py * dy) + std::fabs(-px * dy + py * dx)) / diamond; break;
        default: {
          double turn = (std::atan2(py, px) - angle) / (2.0 * kPi);
          turn -= std::floor(turn);
          t = turn / spread;
        }
      }
      const float f = static_cast<float>(std::clamp(t, 0.0, 1.0));
      const float d = dither ? (kBayer[(ctx.y0 + y) & 3][(ctx.x0 + x) & 3] - 7.5f) / 16.0f / 255.0f * 0.9f : 0.0f;
      for (int c = 0; c < 4; ++c) {
        float v = start[c] + (end[c] - start[c]) * f;
        if (d != 0.0f && v > 0.0f && v < 1.0f && f > 0.0f && f < 1.0f) v += d;
        r[x * 4 + c] = v;
      }
    }
  });
  return kWrote;
}

DescriptorDefinition gradient() {
  DescriptorDefinition d;
  d.name = "Gradient";
  d.kernel = render_gradient;
  d.popup_name = "Gradient";
  d.alpha_z_source_input = -1;
  d.rgba_mode = kRgbaAll;
  d.params = {
      color_param("Start Color", "start_color", {0.0f, 0.0f, 0.0f, 1.0f}).bounds(0.0f, kNoUpperBound),
      color_param("End Color", "end_color", {1.0f, 1.0f, 1.0f, 1.0f}).bounds(0.0f, kNoUpperBound),
      float_param("Angle", "angle", 90.0f)
          .shown_as(format_angle)
          .sliders(0.0f, 360.0f)
          .big_sliders(-720.0f, 720.0f)
          .stepping(1.0f),
      pair_param("Center", "center", screen_mode_normalize, 0.5f, 0.5f).sliders(0.0f, 1.0f).big_sliders(-1.0f, 2.0f),
      popup_param("Shape", "shape", {"Linear", "Radial", "Diamond", "Conical"}),
      float_param("Spread", "spread", 1.0f).bounds(0.01f, 100.0f).sliders(0.1f, 4.0f),
  };
  d.hardcoded = {{"dither", {1.0f}}};
  return d;
}

}  // namespace

const PluginDefinition &gradient_plugin() {
  static const PluginDefinition plugin{"T_Gradient", "Generators", false, false, {gradient()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
