// The effect definitions the engine is built with, one file each in this
// folder, in catalogue order; the lists themselves are declared with the
// catalogue (catalogue/catalogue.h).
#pragma once

#include "catalogue/catalogue.h"

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

}  // namespace tarsel_ref
