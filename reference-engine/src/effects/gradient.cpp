// Gradient: fills the frame with a blend between two colours, along a line
// through the centre at an angle, or around the centre.
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

DescriptorDefinition gradient() {
  DescriptorDefinition d;
  d.name = "Gradient";
  d.popup_name = "Gradient";
  d.alpha_z_source_input = -1;
  d.rgba_mode = kRgbaAll;
  d.params = {
      color_param("Start Color", "start_color", {0.0f, 0.0f, 0.0f, 1.0f}).bounds(0.0f, kNoUpperBound),
      color_param("End Color", "end_color", {1.0f, 1.0f, 1.0f, 1.0f}).bounds(0.0f, kNoUpperBound),
      float_param("Angle", "angle", 90.0f)
          .shown_as(format_angle)
          .sliders(0.0f, 360.0f)
          .big_sliders(-720.0f, 720.0f)
          .stepping(1.0f),
      pair_param("Center", "center", screen_mode_normalize, 0.5f, 0.5f).sliders(0.0f, 1.0f).big_sliders(-1.0f, 2.0f),
      popup_param("Shape", "shape", {"Linear", "Radial", "Diamond", "Conical"}),
      float_param("Spread", "spread", 1.0f).bounds(0.01f, 100.0f).sliders(0.1f, 4.0f),
  };
  d.hardcoded = {{"dither", {1.0f}}};
  return d;
}

}  // namespace

const PluginDefinition &gradient_plugin() {
  static const PluginDefinition plugin{"T_Gradient", "Generators", false, false, {gradient()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
