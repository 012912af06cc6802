// Glow: the parts of the source brighter than a threshold, blurred, tinted
// and added back; an optional mask limits where it glows.
#include <algorithm>
#include <vector>

#include "catalogue/catalogue.h"
#include "rendering/kernels/box_blur.h"
#include "rendering/kernels/kernel.h"
#include "rendering/pixels.h"

namespace tarsel_ref {
namespace {

// The kernel: what is brighter than the threshold (as luma) is kept by how much it
// exceeds it, blurred with a Gaussian of half the radius, tinted, scaled by
// the intensity and by the mask, and added to the source as light.
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

DescriptorDefinition glow() {
  DescriptorDefinition d;
  d.name = "Glow";
  d.kernel = render_glow;
  d.popup_name = "Glow";
  // An unconnected mask lets the whole frame glow.
  d.inputs = {{"Source", "src"}, {"Mask", "mask", true, kFallbackConstant, 1.0f}};
  d.mask_color = true;
  d.params = {
      float_param("Threshold", "threshold", 0.7f).bounds(0.0f, 1.0f).shown_as(format_percent, 100.0f),
      float_param("Radius", "radius", 20.0f).bounds(0.0f, 1000.0f).sliders(0.0f, 100.0f).shown_as(format_pixels),
      float_param("Intensity", "intensity", 1.0f).bounds(0.0f, 10.0f).sliders(0.0f, 4.0f),
      color_param("Tint", "tint", {1.0f, 0.9f, 0.8f}).sliders(0.0f, 1.0f),
      bool_param("Invert Mask", "invert_mask", false).needs(2),
      button_param("Reset", "reset", {"threshold", "radius", "intensity", "tint"}).with_flags("builder_disable"),
  };
  // Brightness is measured as Rec. 709 luma.
  d.hardcoded = {{"luma_weights", {0.2126f, 0.7152f, 0.0722f}}};
  d.stamps = {"glow"};
  return d;
}

}  // namespace

const PluginDefinition &glow_plugin() {
  static const PluginDefinition plugin{"T_Glow", "Light", false, false, {glow()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
