#include "catalogue/catalogue.h"

namespace tarsel_ref {
namespace {

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

plugin_info *catalogue_entry(const std::vector<plugin_info> &list, int i) {
  if (i < 0 || static_cast<std::size_t>(i) >= list.size()) return nullptr;
  return const_cast<plugin_info *>(&list[static_cast<std::size_t>(i)]);
}

const Catalogues &catalogues() {
  static const Catalogues instance{entries_of(effect_plugins()), entries_of(builder_plugins())};
  return instance;
}

}  // namespace tarsel_ref
