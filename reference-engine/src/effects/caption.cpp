// Caption: a line of text over the input, set in the face the host supplies;
// "{n}" in the text stands for a counter that counts frames from 1.
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

DescriptorDefinition caption() {
  DescriptorDefinition d;
  d.name = "Caption";
  d.popup_name = "Caption";
  d.inputs = {{"Background", "bg", true, kFallbackTransparent, 0.0f}};
  d.host_data = true;
  d.node_flags = kNodeUsesHostData;
  d.params = {
      label_param("Text Settings", "text_settings"),
      string_param("Text", "text", "Shot {n}"),
      float_param("Size", "size", 48.0f).bounds(1.0f, 1000.0f).sliders(8.0f, 200.0f).shown_as(format_pixels),
      color_param("Color", "color", {1.0f, 1.0f, 1.0f, 1.0f}).bounds(0.0f, 1.0f),
      pair_param("Position", "position", screen_mode_screen_center, 0.0f, -200.0f)
          .sliders(-960.0f, 960.0f)
          .big_sliders(-4000.0f, 4000.0f),
      int_param("Counter", "counter", 1, 1, 1000000 - 1).animated(auto_anim_floor1),
      popup_param("Align", "align", {"Left", "Center", "Right"}, 1),
  };
  return d;
}

}  // namespace

const PluginDefinition &caption_plugin() {
  static const PluginDefinition plugin{"T_Caption", "Stylize", false, false, {caption()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
