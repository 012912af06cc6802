#include "model/instance.h"

#include <mutex>
#include <stdexcept>
#include <unordered_set>

#include "model/flare.h"
#include "model/param_store.h"
#include "model/stamps.h"

namespace tarsel_ref {
namespace {

struct Registry {
  std::mutex mutex;
  std::unordered_set<const EffectGlobals_t *> live;
};

Registry &registry() {
  static Registry *instance = new Registry;  // kept to process exit: hosts may free instances late
  return *instance;
}

// Renders draw these elements from the first frame on; preparing their stamps
// now keeps that cost out of the first render.
void prepare_stamps(const Descriptor &d, const DescriptorDefinition &source) {
  std::vector<std::string> kinds = source.stamps;
  if (const Param *flare = d.genotype.flare_param) {
    std::vector<FlareElement> elements;
    const char *text = store_of(*flare).text;
    if (parse_flare(text ? text : "", &elements))
      for (const FlareElement &e : elements)
        if (!texture_kind(e.kind)) kinds.push_back(e.kind);  // textures are drawn as they are
  }
  for (const std::string &kind : kinds) element_stamp(kind, kElementStampSize);
}

}  // namespace

EffectInstance *create_instance(const PluginDefinition &plugin) {
  std::unique_ptr<EffectInstance> instance(new EffectInstance());
  instance->plugin = &plugin;
  const std::vector<DescriptorDefinition> sources = plugin.descriptors_now();
  if (sources.empty() || sources.size() > MAX_EFFECTS_PER_PLUGIN)
    throw std::logic_error("plug-in \"" + plugin.name + "\" has no usable descriptor table");
  for (const DescriptorDefinition &source : sources) {
    instance->descriptors.push_back(build_descriptor(source));
    prepare_stamps(*instance->descriptors.back(), source);
  }
  add_instance_slots(*instance->descriptors.front());
  instance->plugin_name_text = plugin.name;
  instance->plugin_name = instance->plugin_name_text.data();
  instance->n_effects = static_cast<short>(instance->descriptors.size());
  for (std::size_t i = 0; i < instance->descriptors.size(); ++i)
    instance->genotypes[i] = &instance->descriptors[i]->genotype;
  instance->effect_genotype = instance->genotypes[0];
  instance->gpu_status = "CPU: the reference engine has no graphics-processor path (" + plugin.name + ")";

  std::lock_guard<std::mutex> lock(registry().mutex);
  registry().live.insert(instance.get());
  return instance.release();
}

EffectInstance *live_instance(EffectGlobals_t *globals) {
  std::lock_guard<std::mutex> lock(registry().mutex);
  return registry().live.count(globals) ? static_cast<EffectInstance *>(globals) : nullptr;
}

bool destroy_instance(EffectGlobals_t *globals) {
  {
    std::lock_guard<std::mutex> lock(registry().mutex);
    if (registry().live.erase(globals) == 0) return false;
  }
  delete static_cast<EffectInstance *>(globals);
  return true;
}

int live_instance_count() {
  std::lock_guard<std::mutex> lock(registry().mutex);
  return static_cast<int>(registry().live.size());
}

}  // namespace tarsel_ref
