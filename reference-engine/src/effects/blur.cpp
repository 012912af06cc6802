// Blur: a repeated box blur that approaches a Gaussian, and its fast form that
// blurs a reduced copy once and scales it back up.
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

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
