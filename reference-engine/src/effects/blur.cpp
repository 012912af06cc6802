// Blur: a repeated box blur that approaches a Gaussian, and its fast form that
// blurs a reduced copy once and scales it back up.
#include <algorithm>
#include <cmath>

#include "catalogue/catalogue.h"
#include "core/abort.h"
#include "rendering/kernels/box_blur.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {
namespace {

// The kernel: repeated box passes that approach a Gaussian whose standard
// deviation is half the radius.
void apply_gamma(const KernelContext &ctx, WorkImage &image, float gamma) {
  ctx.rows([&](int y) {
    float *r = image.row(y);
    for (int x = 0; x < image.width(); ++x)
      for (int c = 0; c < 3; ++c) {
        float &v = r[x * 4 + c];
        if (v > 0.0f) v = std::pow(v, gamma);
      }
  });
}

int render_blur(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const double radius = ctx.length(std::max(0.0f, p.number("radius")));
  const int passes = std::clamp(p.whole("iterations"), 1, 8);
  const double vertical = std::max(0.0f, p.number("vertical_scale"));
  const int quality = std::min(ctx.quality, std::clamp(p.whole("quality"), 0, 2));
  const bool blur_alpha = p.flag("blur_alpha");
  const int edges = std::clamp(p.whole("edges"), 0, 2);
  const float gamma = p.number("gamma");
  const WorkImage &src = ctx.input(0);

  BoxBlur blur;
  blur.passes = passes;
  blur.whole_pixels = quality == 0;
  blur.bias = std::clamp(p.number("kernel_bias"), -1.0f, 1.0f);
  blur.edge = edges == 0 ? Edge::transparent : edges == 1 ? Edge::repeat : Edge::mirror;
  const double sigma = radius / 2.0;
  blur.radius_x = box_radius_for_sigma(sigma / ctx.pixel_aspect, passes);
  blur.radius_y = box_radius_for_sigma(sigma * vertical, passes);

  if (blur.radius_x <= 0.0 && blur.radius_y <= 0.0) return 0;
  const bool shaped = gamma > 0.0f && gamma != 1.0f;
  if (shaped) {
    ctx.rows([&](int y) { std::copy(src.row(y), src.row(y) + static_cast<std::size_t>(ctx.width) * 4, out.row(y)); });
    apply_gamma(ctx, out, gamma);
    box_blur(ctx, out, out, blur);
    apply_gamma(ctx, out, 1.0f / gamma);
  } else {
    box_blur(ctx, src, out, blur);
  }
  if (blur_alpha) return kWrote;
  // The colour blurred, the alpha kept: the blurred colour is made straight
  // and multiplied by the source's alpha again.
  ctx.rows([&](int y) {
    float *r = out.row(y);
    const float *s = src.row(y);
    for (int x = 0; x < ctx.width; ++x) {
      float *px = r + x * 4;
      const float a = px[3], keep = s[x * 4 + 3];
      for (int c = 0; c < 3; ++c) px[c] = a > 0.0f ? px[c] / a * keep : 0.0f;
      px[3] = keep;
    }
  });
  return kWrote;
}

// The fast form's kernel: the source reduced by averaging blocks of pixels, blurred once
// with a single box at the reduced size, and scaled back up bilinearly. Much
// cheaper than the full blur for large radii, at the cost of its smoothness.
int render_blur_fast(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const double radius = ctx.length(std::max(0.0f, p.number("radius")));
  const int passes = std::clamp(p.whole("iterations"), 1, 8);
  const bool blur_alpha = p.flag("blur_alpha");
  if (radius <= 0.0) return 0;
  const WorkImage &src = ctx.input(0);
  const int w = ctx.width, h = ctx.height;

  // A block per quarter of the radius keeps several blocks under the box.
  const int k = std::clamp(static_cast<int>(radius / 4.0), 1, 64);
  const int rw = (w + k - 1) / k, rh = (h + k - 1) / k;
  WorkImage small(rw, rh);
  run_rows(rh, ctx.n_threads, [&](int sy) {
    float *d = small.row(sy);
    std::fill(d, d + static_cast<std::size_t>(rw) * 4, 0.0f);
    const int y1 = std::min(h, (sy + 1) * k);
    for (int y = sy * k; y < y1; ++y) {
      throw_if_aborted();
      const float *s = src.row(y);
      for (int x = 0; x < w; ++x)
        for (int c = 0; c < 4; ++c) d[(x / k) * 4 + c] += s[x * 4 + c];
    }
    for (int sx = 0; sx < rw; ++sx) {
      const int cells = (std::min(w, (sx + 1) * k) - sx * k) * (y1 - sy * k);
      for (int c = 0; c < 4; ++c) d[sx * 4 + c] /= static_cast<float>(cells);
    }
  });

  BoxBlur blur;
  blur.passes = passes;
  blur.edge = Edge::repeat;
  const double sigma = radius / 2.0 / k;
  blur.radius_x = box_radius_for_sigma(sigma / ctx.pixel_aspect, passes);
  blur.radius_y = box_radius_for_sigma(sigma, passes);
  KernelContext reduced = ctx;
  reduced.width = rw;
  reduced.height = rh;
  box_blur(reduced, small, small, blur);

  ctx.rows([&](int y) {
    float *d = out.row(y);
    const float *s = src.row(y);
    const double fy = std::clamp((y + 0.5) / k - 0.5, 0.0, static_cast<double>(rh - 1));
    const int y0 = static_cast<int>(fy), y1 = std::min(y0 + 1, rh - 1);
    const float ty = static_cast<float>(fy - y0);
    for (int x = 0; x < w; ++x) {
      const double fx = std::clamp((x + 0.5) / k - 0.5, 0.0, static_cast<double>(rw - 1));
      const int x0 = static_cast<int>(fx), x1 = std::min(x0 + 1, rw - 1);
      const float tx = static_cast<float>(fx - x0);
      for (int c = 0; c < 4; ++c) {
        const float top = small.row(y0)[x0 * 4 + c] * (1 - tx) + small.row(y0)[x1 * 4 + c] * tx;
        const float bottom = small.row(y1)[x0 * 4 + c] * (1 - tx) + small.row(y1)[x1 * 4 + c] * tx;
        d[x * 4 + c] = top * (1 - ty) + bottom * ty;
      }
      if (!blur_alpha) {
        const float a = d[x * 4 + 3], keep = s[x * 4 + 3];
        for (int c = 0; c < 3; ++c) d[x * 4 + c] = a > 0.0f ? d[x * 4 + c] / a * keep : 0.0f;
        d[x * 4 + 3] = keep;
      }
    }
  });
  return kWrote;
}

// Projects older than version 2 blurred with a radius of 10 by default.
ParamDefinition radius() {
  return float_param("Radius", "radius", 5.0f)
      .bounds(0.0f, 500.0f)
      .sliders(0.0f, 50.0f)
      .shown_as(format_pixels)
      .old_default({10.0f}, 2);
}

DescriptorDefinition blur() {
  DescriptorDefinition d;
  d.name = "Blur";
  d.kernel = render_blur;
  d.popup_name = "Blur";
  d.inputs = {{"Source", "src"}};
  d.params = {
      radius(),
      int_param("Iterations", "iterations", 3, 1, 8),
      float_param("Vertical Scale", "vertical_scale", 1.0f).bounds(0.01f, 100.0f).sliders(0.25f, 4.0f),
      popup_param("Quality", "quality", {"Draft", "Normal", "High"}, 1).in_group("Advanced", "group_start"),
      bool_param("Blur Alpha", "blur_alpha", true),
      popup_param("Edges", "edges", {"Transparent", "Repeat", "Mirror"}, 1),
      float_param("Blur Gamma", "gamma", 1.0f).bounds(0.1f, 10.0f).with_flags("hidden,no_publish"),
      float_param("Kernel Bias", "kernel_bias", 0.0f).bounds(-1.0f, 1.0f).with_flags("hidden,group_end"),
  };
  d.stamps = {"glow"};
  return d;
}

// The fast form fixes what the full one lets the user choose; older projects
// took its defaults from the full form (descriptor 0).
DescriptorDefinition blur_fast() {
  DescriptorDefinition d;
  d.name = "Blur Fast";
  d.kernel = render_blur_fast;
  d.popup_name = "Blur (Fast)";
  d.inputs = {{"Source", "src"}};
  d.use_reduce = true;
  d.old_default_effect = 0;
  d.old_default_limit = 2;
  d.params = {radius(), bool_param("Blur Alpha", "blur_alpha", true)};
  d.hardcoded = {{"iterations", {1.0f}}, {"quality", {0.0f}}};
  return d;
}

}  // namespace

const PluginDefinition &blur_plugin() {
  static const PluginDefinition plugin{"T_Blur", "Blur & Sharpen", false, false, {blur(), blur_fast()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
