// Builder Matte: keys out a colour, softens and chokes the matte's edge and
// removes the key colour's spill from what remains.
#include "effects/builder_nodes.h"
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

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
  return {d};
}

}  // namespace

const PluginDefinition &builder_matte_plugin() {
  static const PluginDefinition plugin{"T_BuilderMatte", "Builder", false, true, {}, &assemble};
  return plugin;
}

}  // namespace tarsel_ref
