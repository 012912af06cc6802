// The text and JSON operations of the base parameter.
#include <cjson/cJSON.h>
#include <string>

#include "catalogue/param_convert.h"
#include "catalogue/param_store.h"
#include "catalogue/param_values.h"
#include "core/entry.h"
#include "tarsel/param.h"

// The text stays the Param's until its next to_string or its destruction.
char *Param::to_string(RenderContext *ctx, bool flag) {
  auto scope =
      tarsel_ref::enter("Param::to_string", static_cast<const void *>(this), static_cast<const void *>(ctx), flag);
  const std::string text = tarsel_ref::value_text(*this, flag);
  tarsel_ref::ParamStore &store = tarsel_ref::store_of(*this);
  tarsel_ref::replace_text(store.shown, text.c_str());
  return store.shown;
}

int Param::set_value_from_string(RenderContext *ctx, const char *text, unsigned int flags) {
  auto scope = tarsel_ref::enter("Param::set_value_from_string", static_cast<const void *>(this),
                                 static_cast<const void *>(ctx), text, flags);
  if (tarsel_ref::read_value_text(*this, text, flags)) return 1;
  tarsel_ref::warn_about(*this, text ? "cannot read \"" + std::string(text) + "\" as a " + ptype_name() + " value"
                                     : std::string("no text given for its value"));
  return 0;
}

// The caller owns the node and frees it with cJSON_Delete.
cJSON *Param::to_json(RenderContext *ctx, bool flag) {
  auto scope =
      tarsel_ref::enter("Param::to_json", static_cast<const void *>(this), static_cast<const void *>(ctx), flag);
  cJSON *value = tarsel_ref::value_json(*this);
  if (!flag || !value) return value;
  cJSON *described = cJSON_CreateObject();
  if (!described) {
    cJSON_Delete(value);
    return nullptr;
  }
  cJSON_AddStringToObject(described, "name", get_canonical_name());
  cJSON_AddStringToObject(described, "type", ptype_name());
  cJSON_AddItemToObject(described, "value", value);
  return described;
}

int Param::set_value_from_json(RenderContext *ctx, cJSON *json, unsigned int flags) {
  auto scope = tarsel_ref::enter("Param::set_value_from_json", static_cast<const void *>(this),
                                 static_cast<const void *>(ctx), static_cast<const void *>(json), flags);
  if (tarsel_ref::read_value_json(*this, json, flags)) return 1;
  char *printed = json ? cJSON_PrintUnformatted(json) : nullptr;
  tarsel_ref::warn_about(*this, printed ? "cannot read " + std::string(printed) + " as a " + ptype_name() + " value"
                                        : std::string("no JSON value given"));
  cJSON_free(printed);
  return 0;
}
