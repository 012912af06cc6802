// Builder Mix: blends one input over the other, then sets the result's levels.
#include <algorithm>
#include <cmath>

#include "catalogue/catalogue.h"
#include "effects/builder_nodes.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {
namespace {

// The kernel: the front blended over the back by the blend mode at the
// opacity, then the colour's levels set: black and white points stretched to
// 0 and 1 and the gamma applied (on straight colour).
enum Mode { kNormal = 0, kAdd, kMultiply, kScreen, kOverlay, kDifference };

// The blend of straight colours where both layers cover.
float blend(int mode, float f, float b) {
  switch (mode) {
    case kAdd: return f + b;
    case kMultiply: return f * b;
    case kScreen: return f + b - f * b;
    case kOverlay: return b <= 0.5f ? 2.0f * f * b : 1.0f - 2.0f * (1.0f - f) * (1.0f - b);
    case kDifference: return std::fabs(f - b);
    default: return f;
  }
}

int render_builder_mix(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const int mode = std::clamp(p.whole("blend_mode"), 0, 5);
  const float opacity = std::clamp(p.number("blend_opacity"), 0.0f, 1.0f);
  const float black = p.number("levels_black"), white = p.number("levels_white");
  const float gamma = std::max(0.1f, p.number("levels_gamma"));
  const float range = white - black;
  const bool levels = black != 0.0f || white != 1.0f || gamma != 1.0f;
  const WorkImage &front = ctx.input(0);
  const WorkImage &back = ctx.input(1);

  ctx.rows([&](int y) {
    const float *f = front.row(y), *b = back.row(y);
    float *d = out.row(y);
    for (int x = 0; x < ctx.width; ++x) {
      const float *fp = f + x * 4, *bp = b + x * 4;
      float *dp = d + x * 4;
      const float af = fp[3] * opacity, ab = bp[3];
      for (int c = 0; c < 3; ++c) {
        const float fc = fp[c] * opacity;  // premultiplied
        const float fs = fp[3] > 0.0f ? fp[c] / fp[3] : 0.0f, bs = ab > 0.0f ? bp[c] / ab : 0.0f;
        dp[c] = fc * (1.0f - ab) + bp[c] * (1.0f - af) + af * ab * blend(mode, fs, bs);
      }
      dp[3] = af + ab - af * ab;
      if (!levels || dp[3] <= 0.0f) continue;
      for (int c = 0; c < 3; ++c) {
        float v = dp[c] / dp[3];
        v = range != 0.0f ? (v - black) / range : (v >= black ? 1.0f : 0.0f);
        v = std::max(v, 0.0f);
        if (gamma != 1.0f) v = std::pow(v, 1.0f / gamma);
        dp[c] = v * dp[3];
      }
    }
  });
  return kWrote;
}

std::vector<DescriptorDefinition> assemble() {
  const std::vector<BuilderNode> nodes = {
      {"Blend",
       "blend",
       kNodeMixesInputs,
       {popup_param("Mode", "mode", {"Normal", "Add", "Multiply", "Screen", "Overlay", "Difference"}),
        float_param("Opacity", "opacity", 1.0f).bounds(0.0f, 1.0f).shown_as(format_percent, 100.0f)}},
      {"Levels",
       "levels",
       0,
       {float_param("Black Point", "black", 0.0f).bounds(0.0f, 1.0f),
        float_param("White Point", "white", 1.0f).bounds(0.0f, 1.0f),
        float_param("Gamma", "gamma", 1.0f).bounds(0.1f, 10.0f).sliders(0.2f, 5.0f).with_flags("builder_disable_one")}},
  };
  DescriptorDefinition d = assemble_nodes("Builder Mix", {{"Front", "front"}, {"Back", "back", true}}, nodes);
  d.hardcoded = {{"background", {0.0f, 0.0f, 0.0f}}};
  d.kernel = render_builder_mix;
  return {d};
}

}  // namespace

const PluginDefinition &builder_mix_plugin() {
  static const PluginDefinition plugin{"T_BuilderMix", "Builder", false, true, {}, &assemble};
  return plugin;
}

}  // namespace tarsel_ref
