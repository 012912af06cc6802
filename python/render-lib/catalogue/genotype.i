// Genotype: the engine's fixed description of one effect (inputs, parameters,
// groups, graphics-processor settings, alpha handling), read in place. The
// engine owns every Genotype it hands out; one made from Python is an empty,
// zero-filled placeholder that the proxy owns.

%{
#include <string>
#include <vector>
#include "tarsel/genotype.h"
#include "tarsel/param_queries.h"

// The engine's node flag meaning "takes data from the host".
static const int NODE_FLAG_HOST_DATA = 0x20000;

static std::vector<std::string> input_name_slots(const Genotype *genotype, const char (*slots)[MAX_INPUT_NAME_LEN])
{
  std::vector<std::string> names;
  for (int i = 0; i < genotype->n_inputs && i < MAX_INPUTS; ++i)
    names.push_back(std::string(slots[i], strnlen(slots[i], MAX_INPUT_NAME_LEN)));
  return names;
}

// The bit in a flare parameter's flags that makes it a glare (byte 1, bit 4).
static bool flare_param_is_glare(const Param *flare)
{
  return packed_field(&flare->flags, 1, 4, 1) != 0;
}
%}

struct Genotype {
%immutable;
  char name[MAX_EFFECT_NAME_LEN];
  ShortInputArray input_optional_p;
  ShortInputArray input_default_to;
  float input_default_value[MAX_INPUT_DEFAULT_VALUES];
  Param *flare_param;
%mutable;
  int disable_gpu;
  int force_gpu_enable;
  int force_gpu_disable;
%immutable;
  int gpu_disable_reason;
  int rgba_mode;
  signed char rgba_ok_for_inputs;
  int transform_with_warp;
  signed char alpha_z_source_input;
  char *effect_popup_name;
  short old_default_effect;
  short old_default_version_limit;
  effect_def *effect_info;
%mutable;
};

%packed_field(Genotype, need_other_frames_p, 1240, 1, 1)
%packed_field(Genotype, use_prev_dest_p, 1240, 2, 1)
%packed_field(Genotype, mask_color_p, 1241, 6, 1)
%packed_field(Genotype, transition_p, 1243, 2, 1)
%packed_field(Genotype, use_reduce_p, 1244, 0, 1)

%extend Genotype {
  // The heap's own allocation, so that delete_Genotype can use free().
  Genotype() { return static_cast<Genotype *>(calloc(1, sizeof(Genotype))); }
  ~Genotype() { free($self); }

  std::vector<std::string> _get_input_names() { return input_name_slots($self, $self->input_names); }
  std::vector<std::string> _get_canonical_input_names() { return input_name_slots($self, $self->canonical_input_names); }

  std::vector<Param *> _get_params() {
    std::vector<Param *> params;
    for (int i = 0; i < $self->n_params; ++i)
      params.push_back($self->params[i]);
    return params;
  }

  // "" for a parameter outside any group, and for one that only documents a
  // group (doc_group_p set, group_start_p clear) and so names none.
  std::string get_param_group_name(const Param &param) {
    const int group = param.param_group;
    if (group < 0 || group >= MAX_PARAM_GROUPS)
      return "";
    if (packed_field(&param.flags, 5, 2, 3) == 0 && packed_field(&param.flags, 6, 1, 1) == 1)
      return "";
    const char *name = $self->param_groups[group].name;
    return name ? name : "";
  }

  bool _uses_host_data() {
    return tarsel_any_nodes_get_flag($self, NODE_FLAG_HOST_DATA) != 0 || $self->host_data != NULL;
  }

  bool _has_flare_param() { return $self->flare_param && !flare_param_is_glare($self->flare_param); }
  bool _has_glare_param() { return $self->flare_param && flare_param_is_glare($self->flare_param); }

  %pythoncode %{
    input_names = property(_get_input_names, doc="Display names of the inputs, in input order.")
    canonical_input_names = property(_get_canonical_input_names, doc="Stable names of the inputs.")
    params = property(_get_params, doc="The parameters, in order (views owned by the engine).")
  %}
}

%record_identity(Genotype)
%record_repr(Genotype, "Genotype(\"%s\" @%p)", std::string($self->name, strnlen($self->name, MAX_EFFECT_NAME_LEN)).c_str(), (void *)$self)
