// The engine's catalogues of effect plug-ins.
#pragma once

#include <cstddef>

#include "tarsel/export.h"

// One catalogue entry, 120 bytes laid out by the engine, which owns it.
struct plugin_info {
  char *plugin_name;                 // offset 0: the effect's name, the key to set up an instance
  unsigned char reserved_8[24];      // engine bytes 8-31
  char *_category;                   // offset 32: menu group the effect is listed under
  unsigned char reserved_40[28];     // engine bytes 40-67
  unsigned char use_prev_dest_p;     // offset 68: non-zero when the effect reads its previous output
  unsigned char dynamic_genotype_p;  // offset 69: non-zero when the descriptor is built at run time
  unsigned char reserved_70[50];     // engine bytes 70-119
};

// Number of entries in the effect catalogue.
TARSEL_API int get_n_tarsel_effects();

// Entry i of the effect catalogue, engine-owned; null outside the catalogue.
TARSEL_API plugin_info *get_tarsel_plugin_info_i(int i);

// Number of entries in the effect-builder catalogue.
TARSEL_API int get_n_tarsel_builder_effects();

// Entry i of the effect-builder catalogue, engine-owned; null outside the catalogue.
TARSEL_API plugin_info *get_tarsel_builder_info_i(int i);

static_assert(sizeof(plugin_info) == 120, "plugin_info is 120 bytes");
static_assert(offsetof(plugin_info, plugin_name) == 0, "plugin_info::plugin_name at 0");
static_assert(offsetof(plugin_info, _category) == 32, "plugin_info::_category at 32");
static_assert(offsetof(plugin_info, use_prev_dest_p) == 68, "plugin_info::use_prev_dest_p at 68");
static_assert(offsetof(plugin_info, dynamic_genotype_p) == 69, "plugin_info::dynamic_genotype_p at 69");
