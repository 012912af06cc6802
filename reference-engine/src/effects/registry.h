// The effect definitions the engine is built with, one file each in this
// folder, in catalogue order.
#pragma once

#include <vector>

#include "catalogue/definition.h"

namespace tarsel_ref {

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

// The effect catalogue and the effect builder's, each in its order.
const std::vector<const PluginDefinition *> &effect_plugins();
const std::vector<const PluginDefinition *> &builder_plugins();

// The plug-in of that name in one of the catalogues; null when none.
const PluginDefinition *find_plugin(const char *name, bool builder);

}  // namespace tarsel_ref
