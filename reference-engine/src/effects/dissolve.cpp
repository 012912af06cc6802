// Dissolve: a transition from one input to the other through a grain pattern
// that changes every frame.
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

DescriptorDefinition dissolve() {
  DescriptorDefinition d;
  d.name = "Dissolve";
  d.popup_name = "Dissolve";
  d.inputs = {{"From", "from"}, {"To", "to"}};
  d.transition = true;
  d.node_flags = kNodeMixesInputs;
  d.params = {
      float_param("Dissolve", "mix", 0.0f)
          .bounds(0.0f, 1.0f)
          .shown_as(format_percent, 100.0f)
          .transition(autotrans_linear),
      float_param("Softness", "softness", 0.1f).bounds(0.0f, 1.0f),
      float_param("Grain Size", "grain_size", 1.0f).bounds(0.5f, 100.0f).sliders(0.5f, 10.0f).shown_as(format_pixels),
      int_param("Seed", "seed", 0, 0, 1000000 - 1).animated(auto_anim_floor0).with_flags("builder_disable_one"),
  };
  // Both inputs are mixed premultiplied; the definition allows no other way.
  d.hardcoded = {{"premultiplied", {}}};
  return d;
}

}  // namespace

const PluginDefinition &dissolve_plugin() {
  static const PluginDefinition plugin{"T_Dissolve", "Transitions", false, false, {dissolve()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
