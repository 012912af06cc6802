// effect_globals.h: listing an instance's parameters.
#include "core/entry.h"
#include "rendering/instance.h"
#include "tarsel/effect_globals.h"

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
