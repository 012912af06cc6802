#include "core/catalogue.h"

#include "core/entry.h"

namespace tarsel_ref {
namespace {

const plugin_info *entry_at(const std::vector<plugin_info> &list, int i) {
  if (i < 0 || static_cast<std::size_t>(i) >= list.size()) return nullptr;
  return &list[static_cast<std::size_t>(i)];
}

}  // namespace

// No effect modules are registered yet, so both catalogues are empty.
const Catalogues &catalogues() {
  static const Catalogues instance;
  return instance;
}

}  // namespace tarsel_ref

using tarsel_ref::catalogues;

int get_n_tarsel_effects() {
  tarsel_ref::enter("get_n_tarsel_effects");
  return static_cast<int>(catalogues().effects.size());
}

// An index outside the catalogue gives null.
plugin_info *get_tarsel_plugin_info_i(int i) {
  tarsel_ref::enter("get_tarsel_plugin_info_i", i);
  return const_cast<plugin_info *>(tarsel_ref::entry_at(catalogues().effects, i));
}

int get_n_tarsel_builder_effects() {
  tarsel_ref::enter("get_n_tarsel_builder_effects");
  return static_cast<int>(catalogues().builder_effects.size());
}

plugin_info *get_tarsel_builder_info_i(int i) {
  tarsel_ref::enter("get_tarsel_builder_info_i", i);
  return const_cast<plugin_info *>(tarsel_ref::entry_at(catalogues().builder_effects, i));
}
