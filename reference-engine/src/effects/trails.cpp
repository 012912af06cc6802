// Trails: the effect's previous output, faded, blended under the current
// frame, so that moving things leave a trail.
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

DescriptorDefinition trails() {
  DescriptorDefinition d;
  d.name = "Trails";
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
