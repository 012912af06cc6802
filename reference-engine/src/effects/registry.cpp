#include "effects/registry.h"

#include <cstring>

namespace tarsel_ref {

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
