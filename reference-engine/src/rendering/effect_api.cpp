// Entry points that create, list and free effect instances.
#include <exception>
#include <string>

#include "core/entry.h"
#include "core/messages.h"
#include "effects/registry.h"
#include "rendering/instance.h"
#include "rendering/saved_text.h"
#include "tarsel/effect.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

// A failure while building is the engine's, never the host's: it becomes a
// message and no instance.
template <typename Make>
EffectGlobals_t *guarded(const char *what, Make make) {
  try {
    return make();
  } catch (const std::exception &error) {
    emit_message(Err_Error, (std::string(what) + ": " + error.what()).c_str());
  }
  return nullptr;
}

}  // namespace
}  // namespace tarsel_ref

EffectGlobals_t *init_tarsel_effect(const char *name, bool builder) {
  auto scope = tarsel_ref::enter("init_tarsel_effect", name, builder);
  const tarsel_ref::PluginDefinition *plugin = tarsel_ref::find_plugin(name, builder);
  if (!plugin) {
    tarsel_ref::emit_message(Err_Error, ("no effect named \"" + std::string(name ? name : "") + "\" in the " +
                                         (builder ? "effect builder's catalogue" : "effect catalogue"))
                                            .c_str());
    return nullptr;
  }
  return tarsel_ref::guarded("cannot make an effect", [&] { return tarsel_ref::create_instance(*plugin); });
}

EffectGlobals_t *init_tarsel_effect_from_string(const char *saved) {
  auto scope = tarsel_ref::enter("init_tarsel_effect_from_string", saved);
  return tarsel_ref::guarded("cannot make an effect from its saved text",
                             [&] { return tarsel_ref::instance_from_saved_text(saved); });
}

void free_tarsel_effect(EffectGlobals_t *globals) {
  auto scope = tarsel_ref::enter("free_tarsel_effect", static_cast<const void *>(globals));
  if (globals && !tarsel_ref::destroy_instance(globals))
    tarsel_ref::emit_message(Err_Error, "free_tarsel_effect: not a live effect instance of this engine");
}

// The published parameters (those without dont_publish_p) of the descriptor
// in use, in table order; a non-zero answer of `collect` ends the listing.
void generate_all_tarsel_effect_params(EffectGlobals_t *globals, T_ParamCollector collect, void *user_data) {
  auto scope = tarsel_ref::enter("generate_all_tarsel_effect_params", static_cast<const void *>(globals),
                                 reinterpret_cast<const void *>(collect), user_data);
  tarsel_ref::InstanceUse instance(globals);
  if (!instance || !collect) return;
  Genotype *genotype = instance->effect_genotype;
  for (int i = 0; i < genotype->n_params; ++i) {
    if (genotype->params[i]->flags.dont_publish_p) continue;
    if (collect(genotype, i, user_data) != 0) return;
  }
}
