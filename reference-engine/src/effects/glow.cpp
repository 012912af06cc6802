// Glow: the parts of the source brighter than a threshold, blurred, tinted
// and added back; an optional mask limits where it glows.
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

DescriptorDefinition glow() {
  DescriptorDefinition d;
  d.name = "Glow";
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
