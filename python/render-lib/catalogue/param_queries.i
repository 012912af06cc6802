// The engine's free queries on parameters and descriptors, under their engine
// names, with plain argument conversion: pointer arguments are pointer
// proxies, not sequences. Param and Genotype methods are the safe forms.

%{
#include "tarsel/param_queries.h"
%}

int tarsel_get_fromfile_popup_names(Param const *param, char ***names);
void tarsel_get_param_bounds2(Param const *param, float scale, int channel, float *lower, float *upper,
                              float *slider_min, float *slider_max, int flags);
// The buffer is the caller's str, copied; it must be at least size - 1 bytes long.
char *tarsel_get_param_title(Param const *param, int channel, char *buffer, size_t size);
int tarsel_any_nodes_get_flag(Genotype *genotype, int mask);
char *tarsel_param_to_string(Param *param);
// The collector of EffectGlobals_t._get_shared_params; `list` is a pointer
// proxy of a Python list.
int add_param_to_list(Genotype *genotype, int index, void *list);
