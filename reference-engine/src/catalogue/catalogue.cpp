#include "catalogue/catalogue.h"

#include "core/entry.h"
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

const plugin_info *entry_at(const std::vector<plugin_info> &list, int i) {
  if (i < 0 || static_cast<std::size_t>(i) >= list.size()) return nullptr;
  return &list[static_cast<std::size_t>(i)];
}

// The records point into the definitions, which live as long as the engine.
std::vector<plugin_info> entries_of(const std::vector<const PluginDefinition *> &plugins) {
  std::vector<plugin_info> entries;
  for (const PluginDefinition *plugin : plugins) {
    plugin_info info{};
    info.plugin_name = const_cast<char *>(plugin->name.c_str());
    info._category = const_cast<char *>(plugin->category.c_str());
    info.use_prev_dest_p = plugin->use_prev_dest ? 1 : 0;
    info.dynamic_genotype_p = plugin->dynamic ? 1 : 0;
    entries.push_back(info);
  }
  return entries;
}

}  // namespace

const Catalogues &catalogues() {
  static const Catalogues instance{entries_of(effect_plugins()), entries_of(builder_plugins())};
  return instance;
}

}  // namespace tarsel_ref

using tarsel_ref::catalogues;

int get_n_tarsel_effects() {
  auto scope = tarsel_ref::enter("get_n_tarsel_effects");
  return static_cast<int>(catalogues().effects.size());
}

// An index outside the catalogue gives null.
plugin_info *get_tarsel_plugin_info_i(int i) {
  auto scope = tarsel_ref::enter("get_tarsel_plugin_info_i", i);
  return const_cast<plugin_info *>(tarsel_ref::entry_at(catalogues().effects, i));
}

int get_n_tarsel_builder_effects() {
  auto scope = tarsel_ref::enter("get_n_tarsel_builder_effects");
  return static_cast<int>(catalogues().builder_effects.size());
}

plugin_info *get_tarsel_builder_info_i(int i) {
  auto scope = tarsel_ref::enter("get_tarsel_builder_info_i", i);
  return const_cast<plugin_info *>(tarsel_ref::entry_at(catalogues().builder_effects, i));
}
