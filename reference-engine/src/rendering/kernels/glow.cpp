// Glow: what is brighter than the threshold (as luma) is kept by how much it
// exceeds it, blurred with a Gaussian of half the radius, tinted, scaled by
// the intensity and by the mask, and added to the source as light.
#include <algorithm>
#include <vector>

#include "rendering/kernels/box_blur.h"
#include "rendering/kernels/kernel.h"
#include "rendering/pixels.h"

namespace tarsel_ref {

int render_glow(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const float threshold = std::clamp(p.number("threshold"), 0.0f, 1.0f);
  const double radius = ctx.length(std::max(0.0f, p.number("radius")));
  const float intensity = std::max(0.0f, p.number("intensity"));
  const float tint[3] = {p.number("tint", 0), p.number("tint", 1), p.number("tint", 2)};
  const bool invert = p.flag("invert_mask");
  float weights[3] = {kLumaR, kLumaG, kLumaB};
  if (const std::vector<float> *fixed = p.fixed("luma_weights"))
    for (std::size_t c = 0; c < 3 && c < fixed->size(); ++c) weights[c] = (*fixed)[c];
  const WorkImage &src = ctx.input(0);
  const WorkImage &mask = ctx.input(1);

  ctx.rows([&](int y) {
    const float *s = src.row(y);
    float *h = out.row(y);
    for (int x = 0; x < ctx.width; ++x) {
      const float *px = s + x * 4;
      const float luma = weights[0] * px[0] + weights[1] * px[1] + weights[2] * px[2];
      const float keep = luma > threshold ? (luma - threshold) / luma : 0.0f;
      for (int c = 0; c < 3; ++c) h[x * 4 + c] = px[c] * keep;
      h[x * 4 + 3] = 0.0f;
    }
  });
  BoxBlur blur;
  blur.passes = ctx.quality == 0 ? 2 : 3;
  blur.whole_pixels = ctx.quality == 0;
  blur.radius_x = box_radius_for_sigma(radius / 2.0 / ctx.pixel_aspect, blur.passes);
  blur.radius_y = box_radius_for_sigma(radius / 2.0, blur.passes);
  box_blur(ctx, out, out, blur);

  ctx.rows([&](int y) {
    const float *s = src.row(y);
    const float *m = mask.row(y);
    float *g = out.row(y);
    for (int x = 0; x < ctx.width; ++x) {
      const float *mp = m + x * 4;
      float amount = std::clamp(weights[0] * mp[0] + weights[1] * mp[1] + weights[2] * mp[2], 0.0f, 1.0f);
      if (invert) amount = 1.0f - amount;
      const float *px = s + x * 4;
      float *d = g + x * 4;
      float brightest = 0.0f;
      for (int c = 0; c < 3; ++c) {
        const float light = d[c] * tint[c] * intensity * amount;
        brightest = std::max(brightest, light);
        d[c] = px[c] + light;
      }
      d[3] = px[3] + std::min(brightest, 1.0f) * (1.0f - px[3]);
    }
  });
  return kWrote;
}

}  // namespace tarsel_ref
