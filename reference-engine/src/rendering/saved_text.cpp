#include "rendering/saved_text.h"

#include <cjson/cJSON.h>
#include <memory>
#include <string>

#include "catalogue/catalogue.h"
#include "core/messages.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

struct JsonDeleter {
  void operator()(cJSON *json) const { cJSON_Delete(json); }
};

EffectInstance *refuse(const std::string &why) {
  emit_message(Err_Error, ("cannot make an effect from its saved text: " + why).c_str());
  return nullptr;
}

void apply_value(EffectInstance &instance, const cJSON *item) {
  Param *param = find_param(*instance.effect_genotype, item->string);
  if (!param) {
    emit_message(Err_Warning, ("effect \"" + instance.plugin_name_text + "\" has no parameter \"" +
                               std::string(item->string ? item->string : "") + "\"; its saved value is skipped")
                                  .c_str());
    return;
  }
  // The parameter reports a value it cannot read itself.
  if (cJSON_IsString(item))
    param->set_value_from_string(nullptr, item->valuestring, 0);
  else
    param->set_value_from_json(nullptr, const_cast<cJSON *>(item), 0);
}

}  // namespace

EffectInstance *instance_from_saved_text(const char *text) {
  if (!text) return refuse("no text given");
  std::unique_ptr<cJSON, JsonDeleter> root(cJSON_Parse(text));
  if (!root || !cJSON_IsObject(root.get())) return refuse("it is not a JSON object");
  const cJSON *effect = cJSON_GetObjectItemCaseSensitive(root.get(), "effect");
  if (!cJSON_IsString(effect) || !effect->valuestring) return refuse("\"effect\" must name the effect");
  const cJSON *builder = cJSON_GetObjectItemCaseSensitive(root.get(), "builder");
  if (builder && !cJSON_IsBool(builder)) return refuse("\"builder\" must be true or false");
  const cJSON *params = cJSON_GetObjectItemCaseSensitive(root.get(), "params");
  if (params && !cJSON_IsObject(params)) return refuse("\"params\" must be an object");

  const bool from_builder = builder && cJSON_IsTrue(builder);
  const PluginDefinition *plugin = find_plugin(effect->valuestring, from_builder);
  if (!plugin)
    return refuse("no effect named \"" + std::string(effect->valuestring) + "\" in the " +
                  (from_builder ? "effect builder's catalogue" : "effect catalogue"));
  EffectInstance *instance = create_instance(*plugin);
  try {
    const cJSON *item = nullptr;
    if (params) cJSON_ArrayForEach(item, params) apply_value(*instance, item);
  } catch (...) {
    destroy_instance(instance);
    throw;
  }
  return instance;
}

}  // namespace tarsel_ref
