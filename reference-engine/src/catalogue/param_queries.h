// The free queries on parameters and descriptors: from-file popup names,
// bounds, channel titles, descriptor flags and a parameter's text.
#pragma once

#include <cstddef>

#include "tarsel/genotype.h"
#include "tarsel/param.h"

namespace tarsel_ref {

int fromfile_popup_names(const Param *param, char ***names);
void param_bounds(const Param *param, float scale, int channel, float *min_bound, float *max_bound, float *slider_min,
                  float *slider_max, int flags);
char *param_title(const Param *param, int channel, char *buffer, size_t buffer_size);
int any_node_flags(Genotype *genotype, int mask);
char *param_text(Param *param);

}  // namespace tarsel_ref
