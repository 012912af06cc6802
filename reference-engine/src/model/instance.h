// Effect instances: the engine object behind every EffectGlobals_t handed to
// a host. Each instance builds its own descriptors, parameters and
// definitions from its plug-in's definition, so instances never share values.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "model/definition.h"
#include "model/descriptor.h"
#include "tarsel/effect_globals.h"

namespace tarsel_ref {

// The widget a mouse drag holds, kept with the instance so that it ends with it.
struct WidgetHold {
  int param_index = -1;                // into the held descriptor's parameter table; -1: none held
  const Genotype *descriptor = nullptr;  // the descriptor in use at the press
  int press_x = 0, press_y = 0;        // the mouse at the press, in viewer pixels
  float press_value[MAX_CHANNELS] = {};  // the value the parameter held at the press
};

struct EffectInstance : EffectGlobals_t {
  const PluginDefinition *plugin = nullptr;
  std::vector<std::unique_ptr<Descriptor>> descriptors;
  std::string plugin_name_text;
  std::string gpu_status;
  WidgetHold widget_hold;
};

// Builds an instance of `plugin` and registers it as live; throws on failure.
EffectInstance *create_instance(const PluginDefinition &plugin);

// The live instance behind `globals`; null for null or for a pointer this
// engine did not hand out (or has freed).
EffectInstance *live_instance(EffectGlobals_t *globals);

// Unregisters and frees an instance; false when `globals` is not live.
bool destroy_instance(EffectGlobals_t *globals);

int live_instance_count();

}  // namespace tarsel_ref
