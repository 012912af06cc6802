// Blur: repeated box passes that approach a Gaussian whose standard
// deviation is half the radius.
#include <algorithm>
#include <cmath>

#include "rendering/kernels/box_blur.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {
namespace {

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

}  // namespace

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

}  // namespace tarsel_ref
