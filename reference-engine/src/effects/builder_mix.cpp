// Builder Mix: blends one input over the other, then sets the result's levels.
#include "effects/builder_nodes.h"
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

std::vector<DescriptorDefinition> assemble() {
  const std::vector<BuilderNode> nodes = {
      {"Blend",
       "blend",
       kNodeMixesInputs,
       {popup_param("Mode", "mode", {"Normal", "Add", "Multiply", "Screen", "Overlay", "Difference"}),
        float_param("Opacity", "opacity", 1.0f).bounds(0.0f, 1.0f).shown_as(format_percent, 100.0f)}},
      {"Levels",
       "levels",
       0,
       {float_param("Black Point", "black", 0.0f).bounds(0.0f, 1.0f),
        float_param("White Point", "white", 1.0f).bounds(0.0f, 1.0f),
        float_param("Gamma", "gamma", 1.0f).bounds(0.1f, 10.0f).sliders(0.2f, 5.0f).with_flags("builder_disable_one")}},
  };
  DescriptorDefinition d = assemble_nodes("Builder Mix", {{"Front", "front"}, {"Back", "back", true}}, nodes);
  d.hardcoded = {{"background", {0.0f, 0.0f, 0.0f}}};
  return {d};
}

}  // namespace

const PluginDefinition &builder_mix_plugin() {
  static const PluginDefinition plugin{"T_BuilderMix", "Builder", false, true, {}, &assemble};
  return plugin;
}

}  // namespace tarsel_ref
