// Glare: star-shaped streaks around the brightest points of the input, as a
// camera's aperture draws them.
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

DescriptorDefinition glare() {
  DescriptorDefinition d;
  d.name = "Glare";
  d.popup_name = "Glare";
  d.inputs = {{"Source", "src"}};
  d.node_flags = kNodeDrawsFlare;
  d.flare_param = "glare";
  d.params = {
      float_param("Threshold", "threshold", 0.9f).bounds(0.0f, 1.0f).shown_as(format_percent, 100.0f),
      float_param("Size", "size", 0.2f).bounds(0.0f, 2.0f),
      float_param("Rotation", "rotation", 0.0f).shown_as(format_angle).sliders(-180.0f, 180.0f),
      flare_param("Glare", "glare", "star 0.4 1 0 1 1 1; streak 0.8 0.6 0 0.9 0.95 1", true),
  };
  return d;
}

}  // namespace

const PluginDefinition &glare_plugin() {
  static const PluginDefinition plugin{"T_Glare", "Light", false, false, {glare()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
