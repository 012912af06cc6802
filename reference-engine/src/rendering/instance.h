// Effect instances: the engine object behind every EffectGlobals_t handed to
// a host. Each instance builds its own descriptors, parameters and
// definitions from its plug-in's definition, so instances never share values.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "catalogue/definition.h"
#include "catalogue/descriptor.h"
#include "tarsel/effect_globals.h"

namespace tarsel_ref {

// The widget a mouse drag holds, kept with the instance so that it ends with it.
struct WidgetHold {
  int param_index = -1;                  // into the held descriptor's parameter table; -1: none held
  const Genotype *descriptor = nullptr;  // the descriptor in use at the press
  int press_x = 0, press_y = 0;          // the mouse at the press, in viewer pixels
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

// An entry point's use of an instance, for as long as the entry point runs:
// the instance is not deleted while any use of it lasts. Empty (false) for
// null, for a pointer this engine did not hand out, or for an instance freed
// already, even one whose deletion waits for a use to end.
class InstanceUse {
public:
  explicit InstanceUse(EffectGlobals_t *globals);
  ~InstanceUse();
  InstanceUse(const InstanceUse &) = delete;
  InstanceUse &operator=(const InstanceUse &) = delete;
  EffectInstance *get() const { return instance_; }
  EffectInstance *operator->() const { return instance_; }
  explicit operator bool() const { return instance_ != nullptr; }

private:
  EffectInstance *instance_;
};

// Unregisters an instance; it is deleted now, or when its last use ends if
// an entry point is using it (a render freeing its own instance from a frame
// request, another thread freeing it meanwhile). False when `globals` is not
// live.
bool destroy_instance(EffectGlobals_t *globals);

// Instances that exist, freed ones waiting for their last use included.
int live_instance_count();

}  // namespace tarsel_ref
