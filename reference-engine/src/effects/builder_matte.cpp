// Builder Matte: keys out a colour, softens and chokes the matte's edge and
// removes the key colour's spill from what remains.
#include <algorithm>
#include <cmath>

#include "catalogue/catalogue.h"
#include "effects/builder_nodes.h"
#include "rendering/kernels/box_blur.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {
namespace {

// The kernel: a matte keyed from the matte input (the source when it is
// not connected): colours within half the tolerance of the key colour are
// keyed out, those beyond the tolerance kept, with a ramp between. The choke
// then shrinks (or, negative, grows) the matte by that many pixels, the
// softness blurs its edge, and the source is cut out by it; remove spill
// limits the key colour's main channel to the mean of the other two.
int render_builder_matte(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const float key[3] = {p.number("key_color", 0), p.number("key_color", 1), p.number("key_color", 2)};
  const float tolerance = std::clamp(p.number("key_tolerance"), 0.0f, 1.0f);
  const double softness = ctx.length(std::max(0.0f, p.number("edge_softness")));
  const double choke = ctx.length(p.number("edge_choke"));
  const bool despill = p.flag("spill_remove");
  const int main_channel = static_cast<int>(std::max_element(key, key + 3) - key);
  const WorkImage &src = ctx.input(0);
  const WorkImage &matte_in = ctx.input(1);

  // The matte goes in the alpha of `out`, to be blurred like any image.
  ctx.rows([&](int y) {
    const float *m = matte_in.row(y);
    float *d = out.row(y);
    for (int x = 0; x < ctx.width; ++x) {
      const float *mp = m + x * 4;
      float distance = 0.0f;
      for (int c = 0; c < 3; ++c) {
        const float straight = mp[3] > 0.0f ? mp[c] / mp[3] : 0.0f;
        distance += (straight - key[c]) * (straight - key[c]);
      }
      distance = std::sqrt(distance);
      float alpha;
      if (tolerance <= 0.0f)
        alpha = 1.0f;
      else
        alpha = std::clamp((distance - 0.5f * tolerance) / (0.5f * tolerance), 0.0f, 1.0f);
      d[x * 4 + 0] = d[x * 4 + 1] = d[x * 4 + 2] = 0.0f;
      d[x * 4 + 3] = alpha;
    }
  });
  // Choking: a box blur of twice the choke moves the half-way level of an
  // edge by the choke; stretching the levels back cuts there.
  if (std::fabs(choke) > 0.0) {
    BoxBlur blur;
    blur.passes = 1;
    blur.edge = Edge::repeat;
    blur.radius_x = std::fabs(choke) / ctx.pixel_aspect;
    blur.radius_y = std::fabs(choke);
    box_blur(ctx, out, out, blur);
    ctx.rows([&](int y) {
      float *d = out.row(y);
      for (int x = 0; x < ctx.width; ++x) {
        float &a = d[x * 4 + 3];
        a = std::clamp(choke > 0.0 ? 2.0f * a - 1.0f : 2.0f * a, 0.0f, 1.0f);
      }
    });
  }
  if (softness > 0.0) {
    BoxBlur blur;
    blur.passes = ctx.quality == 0 ? 2 : 3;
    blur.edge = Edge::repeat;
    blur.radius_x = box_radius_for_sigma(softness / 2.0 / ctx.pixel_aspect, blur.passes);
    blur.radius_y = box_radius_for_sigma(softness / 2.0, blur.passes);
    box_blur(ctx, out, out, blur);
  }
  ctx.rows([&](int y) {
    const float *s = src.row(y);
    float *d = out.row(y);
    for (int x = 0; x < ctx.width; ++x) {
      const float matte = std::clamp(d[x * 4 + 3], 0.0f, 1.0f);
      float px[4] = {s[x * 4], s[x * 4 + 1], s[x * 4 + 2], s[x * 4 + 3]};
      if (despill) {
        float others = 0.0f;
        for (int c = 0; c < 3; ++c)
          if (c != main_channel) others += px[c];
        px[main_channel] = std::min(px[main_channel], others / 2.0f);
      }
      for (int c = 0; c < 4; ++c) d[x * 4 + c] = px[c] * matte;
    }
  });
  return kWrote;
}

std::vector<DescriptorDefinition> assemble() {
  const std::vector<BuilderNode> nodes = {
      {"Key",
       "key",
       0,
       {color_param("Key Color", "color", {0.1f, 0.8f, 0.2f}).bounds(0.0f, 1.0f),
        float_param("Tolerance", "tolerance", 0.2f).bounds(0.0f, 1.0f).shown_as(format_percent, 100.0f)}},
      {"Edge",
       "edge",
       0,
       {float_param("Softness", "softness", 2.0f).bounds(0.0f, 100.0f).sliders(0.0f, 20.0f).shown_as(format_pixels),
        float_param("Choke", "choke", 0.0f).bounds(-50.0f, 50.0f).sliders(-10.0f, 10.0f).shown_as(format_pixels)}},
      {"Spill", "spill", 0, {bool_param("Remove Spill", "remove", true).with_flags("builder_disable")}},
  };
  // A missing matte input is keyed from the source itself.
  DescriptorDefinition d =
      assemble_nodes("Builder Matte", {{"Source", "src"}, {"Matte", "matte", true, kFallbackFirstInput, 0.0f}}, nodes);
  d.rgba_mode = kRgbaAll;
  d.kernel = render_builder_matte;
  return {d};
}

}  // namespace

const PluginDefinition &builder_matte_plugin() {
  static const PluginDefinition plugin{"T_BuilderMatte", "Builder", false, true, {}, &assemble};
  return plugin;
}

}  // namespace tarsel_ref
