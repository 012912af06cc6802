// catalogue.h: the effect catalogue and the effect builder's.
#include "catalogue/catalogue.h"
#include "core/entry.h"
#include "tarsel/catalogue.h"

using tarsel_ref::catalogues;

int get_n_tarsel_effects() {
  auto scope = tarsel_ref::enter("get_n_tarsel_effects");
  return static_cast<int>(catalogues().effects.size());
}

// An index outside the catalogue gives null.
plugin_info *get_tarsel_plugin_info_i(int i) {
  auto scope = tarsel_ref::enter("get_tarsel_plugin_info_i", i);
  return tarsel_ref::catalogue_entry(catalogues().effects, i);
}

int get_n_tarsel_builder_effects() {
  auto scope = tarsel_ref::enter("get_n_tarsel_builder_effects");
  return static_cast<int>(catalogues().builder_effects.size());
}

plugin_info *get_tarsel_builder_info_i(int i) {
  auto scope = tarsel_ref::enter("get_tarsel_builder_info_i", i);
  return tarsel_ref::catalogue_entry(catalogues().builder_effects, i);
}
