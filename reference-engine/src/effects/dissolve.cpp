// Dissolve: a transition from one input to the other through a grain pattern
// that changes every frame.
#include <algorithm>
#include <cmath>
#include <cstdint>

#include "catalogue/catalogue.h"
#include "rendering/kernels/grain.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {
namespace {

// The kernel: each grain of the frame switches from the first input to the
// second at its own moment, drawn from the seed, as the dissolve goes from 0
// to 1. Softness turns the switch into a fade of that fraction of the
// transition. At 0 the result is the first input, at 1 the second, exactly.
int render_dissolve(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const float amount = std::clamp(p.number("mix"), 0.0f, 1.0f);
  const float softness = std::clamp(p.number("softness"), 0.0f, 1.0f);
  const double grain = std::max(1e-3, ctx.length(std::max(0.5f, p.number("grain_size"))));
  // The seed parameter counts frames by itself, so the grain changes every frame.
  const std::uint32_t seed =
      mix_bits(static_cast<std::uint32_t>(p.whole("seed"))) ^ static_cast<std::uint32_t>(ctx.seed) * 0x27d4eb2fu;
  if (amount <= 0.0f) return 0;
  if (amount >= 1.0f) return 1;
  const WorkImage &from = ctx.input(0);
  const WorkImage &to = ctx.input(1);
  const float reach = amount * (1.0f + softness);

  ctx.rows([&](int y) {
    float *r = out.row(y);
    const float *a = from.row(y), *b = to.row(y);
    const auto gy = static_cast<std::int64_t>(std::floor((ctx.y0 + y + 0.5) / grain));
    for (int x = 0; x < ctx.width; ++x) {
      const auto gx = static_cast<std::int64_t>(std::floor((ctx.x0 + x + 0.5) / grain));
      const float n = grain_value(gx, gy, seed);
      const float wgt = softness <= 0.0f ? (amount > n ? 1.0f : 0.0f) : std::clamp((reach - n) / softness, 0.0f, 1.0f);
      for (int c = 0; c < 4; ++c) {
        const int i = x * 4 + c;
        r[i] = wgt == 0.0f ? a[i] : wgt == 1.0f ? b[i] : a[i] + (b[i] - a[i]) * wgt;
      }
    }
  });
  return kWrote;
}

DescriptorDefinition dissolve() {
  DescriptorDefinition d;
  d.name = "Dissolve";
  d.kernel = render_dissolve;
  d.popup_name = "Dissolve";
  d.inputs = {{"From", "from"}, {"To", "to"}};
  d.transition = true;
  d.node_flags = kNodeMixesInputs;
  d.params = {
      float_param("Dissolve", "mix", 0.0f)
          .bounds(0.0f, 1.0f)
          .shown_as(format_percent, 100.0f)
          .transition(autotrans_linear),
      float_param("Softness", "softness", 0.1f).bounds(0.0f, 1.0f),
      float_param("Grain Size", "grain_size", 1.0f).bounds(0.5f, 100.0f).sliders(0.5f, 10.0f).shown_as(format_pixels),
      int_param("Seed", "seed", 0, 0, 1000000 - 1).animated(auto_anim_floor0).with_flags("builder_disable_one"),
  };
  // Both inputs are mixed premultiplied; the definition allows no other way.
  d.hardcoded = {{"premultiplied", {}}};
  return d;
}

}  // namespace

const PluginDefinition &dissolve_plugin() {
  static const PluginDefinition plugin{"T_Dissolve", "Transitions", false, false, {dissolve()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
