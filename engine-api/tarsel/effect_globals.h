// The engine's state for one loaded effect plug-in, and effect definitions.
#pragma once

#include <cstddef>
#include <map>
#include <string>
#include <vector>

#include "tarsel/export.h"
#include "tarsel/genotype.h"
#include "tarsel/limits.h"

// An effect's definition as the engine parsed it; engine-owned.
struct effect_def {
  std::string name;                                                // the effect's name
  std::vector<std::string> input_names;                            // input names, in input order
  std::vector<bool> input_optional_p;                              // per input: may be left unconnected
  std::vector<std::string> arg_names;                              // names of the definition's arguments
  std::map<std::string, std::vector<float>> arg_hardcoded_values;  // argument values fixed by the definition
};

// An effect instance: the state of one loaded plug-in, with its table of
// effect descriptors and the descriptor in use. Laid out by the engine,
// which creates, owns and frees it.
struct EffectGlobals_t {
  char *plugin_name;                // offset 0: the plug-in's name
  unsigned char reserved_8[408];    // engine bytes 8-415
  short n_effects;                  // offset 416: entries of the descriptor table
  unsigned char reserved_418[838];  // engine bytes 418-1255
  Genotype *effect_genotype;        // offset 1256: descriptor of the effect this instance runs
  Genotype
      *genotypes[MAX_EFFECTS_PER_PLUGIN];  // offset 1264: one descriptor per effect (the engine's maximum per plug-in)
};

// Called once per generated parameter: the descriptor, the index into its
// parameter table and the caller's data; returns 0 to go on.
typedef int (*T_ParamCollector)(Genotype *genotype, int param_index, void *user_data);

// Reports every parameter the instance shares, synchronously, on the calling thread.
TARSEL_API void generate_all_tarsel_effect_params(EffectGlobals_t *globals, T_ParamCollector collect, void *user_data);

static_assert(sizeof(EffectGlobals_t) == 1264 + 8 * MAX_EFFECTS_PER_PLUGIN, "EffectGlobals_t size");
static_assert(alignof(EffectGlobals_t) == 8, "EffectGlobals_t is 8-byte aligned");
static_assert(offsetof(EffectGlobals_t, plugin_name) == 0, "EffectGlobals_t::plugin_name at 0");
static_assert(offsetof(EffectGlobals_t, n_effects) == 416, "EffectGlobals_t::n_effects at 416");
static_assert(offsetof(EffectGlobals_t, effect_genotype) == 1256, "EffectGlobals_t::effect_genotype at 1256");
static_assert(offsetof(EffectGlobals_t, genotypes) == 1264, "EffectGlobals_t::genotypes at 1264");
