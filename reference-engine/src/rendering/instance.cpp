#include "rendering/instance.h"

#include <mutex>
#include <stdexcept>
#include <unordered_map>

#include "catalogue/flare.h"
#include "catalogue/param_store.h"
#include "rendering/stamps.h"

namespace tarsel_ref {
namespace {

// Every instance that exists, with the number of entry points using it and
// whether it has been freed (it is then no longer handed to a new use).
struct Registration {
  int uses = 0;
  bool freed = false;
};

struct Registry {
  std::mutex mutex;
  std::unordered_map<const EffectGlobals_t *, Registration> instances;
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
  registry().instances[instance.get()] = Registration();
  return instance.release();
}

InstanceUse::InstanceUse(EffectGlobals_t *globals) : instance_(nullptr) {
  std::lock_guard<std::mutex> lock(registry().mutex);
  auto found = registry().instances.find(globals);
  if (found == registry().instances.end() || found->second.freed) return;
  ++found->second.uses;
  instance_ = static_cast<EffectInstance *>(globals);
}

InstanceUse::~InstanceUse() {
  if (!instance_) return;
  {
    std::lock_guard<std::mutex> lock(registry().mutex);
    auto found = registry().instances.find(instance_);
    if (--found->second.uses > 0 || !found->second.freed) return;
    registry().instances.erase(found);
  }
  delete instance_;
}

bool destroy_instance(EffectGlobals_t *globals) {
  {
    std::lock_guard<std::mutex> lock(registry().mutex);
    auto found = registry().instances.find(globals);
    if (found == registry().instances.end() || found->second.freed) return false;
    if (found->second.uses > 0) {
      found->second.freed = true;  // the last use deletes it
      return true;
    }
    registry().instances.erase(found);
  }
  delete static_cast<EffectInstance *>(globals);
  return true;
}

int live_instance_count() {
  std::lock_guard<std::mutex> lock(registry().mutex);
  return static_cast<int>(registry().instances.size());
}

}  // namespace tarsel_ref
