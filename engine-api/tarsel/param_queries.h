// Queries on parameters and effect descriptors.
#pragma once

#include <cstddef>

#include "tarsel/export.h"
#include "tarsel/genotype.h"
#include "tarsel/param.h"

// Entries of a popup filled from a file: sets *names to an engine-owned array
// and returns its length (0 or less when there are none).
TARSEL_API int tarsel_get_fromfile_popup_names(const Param *param, char ***names);

// Value bounds and slider range of a parameter, written through the four
// outputs; -1000000 and 1000000 stand for "no lower" and "no upper" bound.
TARSEL_API void tarsel_get_param_bounds2(const Param *param, float scale, int channel, float *min_bound,
                                         float *max_bound, float *slider_min, float *slider_max, int flags);

// Title of one channel, written into buffer (buffer_size bytes); returns the title.
TARSEL_API char *tarsel_get_param_title(const Param *param, int channel, char *buffer, size_t buffer_size);

// Non-zero when any node of the effect carries a flag of `mask` (0x20000: uses host data).
TARSEL_API int tarsel_any_nodes_get_flag(Genotype *genotype, int mask);

// The parameter's value as text.
TARSEL_API char *tarsel_param_to_string(Param *param);
