// The engine's two catalogues of effect plug-ins: the ordinary effects and the
// effect builder's, made from the effect definitions. The lists of definitions
// are declared here and made by the effects (effects/registry.cpp), which the
// catalogue never includes.
#pragma once

#include <vector>

#include "catalogue/definition.h"
#include "tarsel/catalogue.h"

namespace tarsel_ref {

// The effect catalogue and the effect builder's, each in its order.
const std::vector<const PluginDefinition *> &effect_plugins();
const std::vector<const PluginDefinition *> &builder_plugins();

// The plug-in of that name in one of the catalogues; null when none.
const PluginDefinition *find_plugin(const char *name, bool builder);

struct Catalogues {
  std::vector<plugin_info> effects;
  std::vector<plugin_info> builder_effects;
};

// The catalogues, filled on first use; they live as long as the engine.
const Catalogues &catalogues();

// Entry i of a catalogue; null outside it.
plugin_info *catalogue_entry(const std::vector<plugin_info> &list, int i);

}  // namespace tarsel_ref
