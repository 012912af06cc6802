// The two catalogue lists (declared in catalogue/catalogue.h), in catalogue
// order. Adding an effect takes its own file in this folder and, here, its
// declaration and its place in a list.
#include <cstring>

#include "catalogue/catalogue.h"

namespace tarsel_ref {

// Each made in its own file in this folder.
const PluginDefinition &gradient_plugin();
const PluginDefinition &blur_plugin();
const PluginDefinition &glow_plugin();
const PluginDefinition &dissolve_plugin();
const PluginDefinition &echo_plugin();
const PluginDefinition &trails_plugin();
const PluginDefinition &lens_flare_plugin();
const PluginDefinition &glare_plugin();
const PluginDefinition &caption_plugin();
const PluginDefinition &transform_plugin();
const PluginDefinition &time_blur_plugin();
const PluginDefinition &builder_mix_plugin();
const PluginDefinition &builder_matte_plugin();

const std::vector<const PluginDefinition *> &effect_plugins() {
  static const std::vector<const PluginDefinition *> plugins = {
      &gradient_plugin(), &blur_plugin(),      &glow_plugin(),       &dissolve_plugin(),
      &echo_plugin(),     &trails_plugin(),    &lens_flare_plugin(), &glare_plugin(),
      &caption_plugin(),  &transform_plugin(), &time_blur_plugin(),
  };
  return plugins;
}

const std::vector<const PluginDefinition *> &builder_plugins() {
  static const std::vector<const PluginDefinition *> plugins = {&builder_mix_plugin(), &builder_matte_plugin()};
  return plugins;
}

const PluginDefinition *find_plugin(const char *name, bool builder) {
  if (!name) return nullptr;
  for (const PluginDefinition *plugin : builder ? builder_plugins() : effect_plugins())
    if (plugin->name == name) return plugin;
  return nullptr;
}

}  // namespace tarsel_ref
