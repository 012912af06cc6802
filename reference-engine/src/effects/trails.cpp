// Trails: the effect's previous output, faded, blended under the current
// frame, so that moving things leave a trail.
#include <algorithm>

#include "catalogue/catalogue.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {
namespace {

// The kernel: the previous output fades towards the fade colour by what the
// persistence does not keep, and the current frame is blended with it.
int render_trails(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const float keep = std::clamp(p.number("persistence"), 0.0f, 1.0f);
  const int blend = std::clamp(p.whole("blend"), 0, 3);
  float fade[4];
  for (int c = 0; c < 4; ++c) fade[c] = p.number("fade_to", c);
  for (int c = 0; c < 3; ++c) fade[c] *= fade[3];
  const WorkImage &current = ctx.input(0);
  const WorkImage *previous = ctx.previous.get();

  ctx.rows([&](int y) {
    float *r = out.row(y);
    const float *s = current.row(y);
    const float *q = previous ? previous->row(y) : nullptr;
    for (int x = 0; x < ctx.width; ++x) {
      float trail[4];
      for (int c = 0; c < 4; ++c) trail[c] = (q ? q[x * 4 + c] * keep : 0.0f) + fade[c] * (1.0f - keep);
      const float *a = s + x * 4;
      float *d = r + x * 4;
      for (int c = 0; c < 4; ++c) {
        switch (blend) {
          case 0: d[c] = a[c] + trail[c] * (1.0f - a[3]); break;     // over
          case 1: d[c] = a[c] + trail[c]; break;                     // add
          case 2: d[c] = std::max(a[c], trail[c]); break;            // lighten
          default: d[c] = a[c] + trail[c] - a[c] * trail[c]; break;  // screen
        }
      }
      if (blend == 1) d[3] = std::min(d[3], 1.0f);
    }
  });
  return kWrote;
}

// The frames whose trails still show: the fewest before the persistence has
// faded them below 1/1024, at most 16.
int trails_history(const KernelContext &ctx) {
  const double keep = std::clamp(ctx.p().number("persistence"), 0.0f, 1.0f);
  if (keep <= 0.0) return 0;
  constexpr int kLongest = 16;
  double left = 1.0;
  for (int n = 1; n < kLongest; ++n) {
    left *= keep;
    if (left < 1.0 / 1024.0) return n;
  }
  return kLongest;
}

DescriptorDefinition trails() {
  DescriptorDefinition d;
  d.name = "Trails";
  d.kernel = render_trails;
  d.history = trails_history;
  d.popup_name = "Trails";
  d.inputs = {{"Source", "src"}};
  d.use_prev_dest = true;
  d.node_flags = kNodeReadsPreviousOutput;
  d.params = {
      float_param("Persistence", "persistence", 0.8f).bounds(0.0f, 1.0f).shown_as(format_percent, 100.0f),
      popup_param("Blend", "blend", {"Over", "Add", "Lighten", "Screen"}),
      color_param("Fade To", "fade_to", {0.0f, 0.0f, 0.0f, 0.0f}).bounds(0.0f, 1.0f),
  };
  return d;
}

}  // namespace

const PluginDefinition &trails_plugin() {
  static const PluginDefinition plugin{"T_Trails", "Time", true, false, {trails()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
