// param_queries.h: the free queries on parameters and descriptors.
#include "catalogue/param_queries.h"
#include "core/entry.h"
#include "tarsel/param_queries.h"

int tarsel_get_fromfile_popup_names(const Param *param, char ***names) {
  auto scope = tarsel_ref::enter("tarsel_get_fromfile_popup_names", static_cast<const void *>(param),
                                 static_cast<const void *>(names));
  return tarsel_ref::fromfile_popup_names(param, names);
}

void tarsel_get_param_bounds2(const Param *param, float scale, int channel, float *min_bound, float *max_bound,
                              float *slider_min, float *slider_max, int flags) {
  auto scope = tarsel_ref::enter("tarsel_get_param_bounds2", static_cast<const void *>(param), scale, channel,
                                 static_cast<const void *>(min_bound), static_cast<const void *>(max_bound),
                                 static_cast<const void *>(slider_min), static_cast<const void *>(slider_max), flags);
  tarsel_ref::param_bounds(param, scale, channel, min_bound, max_bound, slider_min, slider_max, flags);
}

char *tarsel_get_param_title(const Param *param, int channel, char *buffer, size_t buffer_size) {
  auto scope = tarsel_ref::enter("tarsel_get_param_title", static_cast<const void *>(param), channel,
                                 static_cast<const void *>(buffer), buffer_size);
  return tarsel_ref::param_title(param, channel, buffer, buffer_size);
}

int tarsel_any_nodes_get_flag(Genotype *genotype, int mask) {
  auto scope = tarsel_ref::enter("tarsel_any_nodes_get_flag", static_cast<const void *>(genotype), mask);
  return tarsel_ref::any_node_flags(genotype, mask);
}

char *tarsel_param_to_string(Param *param) {
  auto scope = tarsel_ref::enter("tarsel_param_to_string", static_cast<const void *>(param));
  return tarsel_ref::param_text(param);
}
