#include "catalogue/param_convert.h"

#include <cjson/cJSON.h>
#include <cmath>
#include <cstring>
#include <vector>

#include "catalogue/flare.h"
#include "catalogue/number_text.h"
#include "catalogue/param_store.h"
#include "catalogue/param_values.h"

namespace tarsel_ref {
namespace {

bool whole_type(param_type type) { return type == ptype_int || type == ptype_popup || type == ptype_boolean; }

float shown_number(const Param &param, float value, bool display_units) {
  return display_units ? value * param.normalize_scale : value;
}

std::string number_text(const Param &param, float value, bool display_units) {
  if (whole_type(param.ptype) && !(display_units && param.normalize_scale != 1.0f)) return format_whole(value);
  return format_number(shown_number(param, value, display_units));
}

int state_index(const StateList &states, const char *text) {
  for (int i = 0; i < states.count; ++i)
    if (states.names[i] && std::strcmp(states.names[i], text) == 0) return i;
  return -1;
}

bool read_popup(Param &param, const char *text) {
  const StateList states = popup_states(param);
  int index = state_index(states, text);
  if (index < 0) {
    float number;
    if (!parse_number(trim(text), &number) || number != std::floor(number) || number < 0.0f) return false;
    if (states.count > 0 && number >= static_cast<float>(states.count)) return false;
    index = static_cast<int>(number);
  }
  const float value = static_cast<float>(index);
  return store_numbers(param, &value, 1, 0);
}

bool read_boolean(Param &param, std::string_view text) {
  text = trim(text);
  float value;
  if (text == "true" || text == "1") {
    value = 1.0f;
  } else if (text == "false" || text == "0") {
    value = 0.0f;
  } else {
    return false;
  }
  return store_numbers(param, &value, 1, 0);
}

bool read_numbers(Param &param, std::string_view text, unsigned int flags) {
  const auto words = split_words(text);
  if (words.size() != static_cast<std::size_t>(value_channels(param))) return false;
  float values[MAX_CHANNELS];
  for (std::size_t i = 0; i < words.size(); ++i) {
    if (!parse_number(words[i], &values[i])) return false;
    if (whole_type(param.ptype) && !(flags & kDisplayUnits) && values[i] != std::floor(values[i])) return false;
  }
  return store_numbers(param, values, static_cast<int>(words.size()), flags);
}

bool read_flare(Param &param, const char *text) {
  std::vector<FlareElement> elements;
  if (!parse_flare(text, &elements)) return false;
  const std::string normalised = format_flare(elements);
  replace_text(store_of(param).text, normalised.empty() ? nullptr : normalised.c_str());
  return true;
}

cJSON *number_json(const Param &param) {
  const ParamStore &store = store_of(param);
  const int channels = value_channels(param);
  if (param.n_channels == 1) return cJSON_CreateNumber(store.value[0]);
  cJSON *array = cJSON_CreateArray();
  for (int c = 0; array && c < channels; ++c) cJSON_AddItemToArray(array, cJSON_CreateNumber(store.value[c]));
  return array;
}

bool read_number_json(Param &param, const cJSON *json, unsigned int flags) {
  float values[MAX_CHANNELS];
  const int channels = value_channels(param);
  if (cJSON_IsNumber(json) || cJSON_IsBool(json)) {
    if (channels != 1) return false;
    values[0] = cJSON_IsBool(json) ? (cJSON_IsTrue(json) ? 1.0f : 0.0f) : static_cast<float>(json->valuedouble);
  } else if (cJSON_IsArray(json)) {
    if (cJSON_GetArraySize(json) != channels) return false;
    for (int c = 0; c < channels; ++c) {
      const cJSON *item = cJSON_GetArrayItem(json, c);
      if (!cJSON_IsNumber(item)) return false;
      values[c] = static_cast<float>(item->valuedouble);
    }
  } else {
    return false;
  }
  for (int c = 0; c < channels; ++c)
    if (whole_type(param.ptype) && !(flags & kDisplayUnits) && values[c] != std::floor(values[c])) return false;
  return store_numbers(param, values, channels, flags);
}

}  // namespace

StateList popup_states(const Param &param) {
  StateList states;
  if (const auto *popup = dynamic_cast<const PopupParam *>(&param)) {
    states.count = popup->n_states > 0 ? popup->n_states : 0;
    states.names = popup->state_names;
  }
  return states;
}

bool store_numbers(Param &param, const float *values, int count, unsigned int flags) {
  if (count != value_channels(param)) return false;
  float stored[MAX_CHANNELS];
  for (int c = 0; c < count; ++c) {
    float value = values[c];
    if ((flags & kDisplayUnits) && param.normalize_scale != 0.0f) value /= param.normalize_scale;
    if (!storable_value(param, value, &stored[c])) return false;
  }
  std::memcpy(store_of(param).value, stored, sizeof(float) * static_cast<std::size_t>(count));
  return true;
}

std::string value_text(const Param &param, bool display_units) {
  const ParamStore &store = store_of(param);
  switch (param.ptype) {
    case ptype_boolean: return store.value[0] != 0.0f ? "true" : "false";
    case ptype_popup: {
      const StateList states = popup_states(param);
      const int index = static_cast<int>(store.value[0]);
      if (index >= 0 && index < states.count && states.names[index]) return states.names[index];
      return format_whole(store.value[0]);
    }
    case ptype_float:
    case ptype_int:
    case ptype_color: {
      std::string text;
      for (int c = 0; c < value_channels(param); ++c) {
        if (c) text += ' ';
        text += number_text(param, store.value[c], display_units);
      }
      return text;
    }
    case ptype_string:
    case ptype_flare: return store.text ? store.text : "";
    default: return "";
  }
}

bool read_value_text(Param &param, const char *text, unsigned int flags) {
  if (!text) return false;
  switch (param.ptype) {
    case ptype_boolean: return read_boolean(param, text);
    case ptype_popup: return read_popup(param, text);
    case ptype_float:
    case ptype_int:
    case ptype_color: return read_numbers(param, text, flags);
    case ptype_string: replace_text(store_of(param).text, *text ? text : nullptr); return true;
    case ptype_flare: return read_flare(param, text);
    default: return trim(text).empty();
  }
}

cJSON *value_json(const Param &param) {
  const ParamStore &store = store_of(param);
  switch (param.ptype) {
    case ptype_boolean: return cJSON_CreateBool(store.value[0] != 0.0f);
    case ptype_popup:
      if (popup_states(param).count > 0) return cJSON_CreateString(value_text(param, false).c_str());
      return cJSON_CreateNumber(store.value[0]);
    case ptype_float:
    case ptype_int:
    case ptype_color: return number_json(param);
    case ptype_string: return cJSON_CreateString(store.text ? store.text : "");
    case ptype_flare: {
      std::vector<FlareElement> elements;
      parse_flare(store.text ? store.text : "", &elements);
      return flare_to_json(elements);
    }
    default: return cJSON_CreateNull();
  }
}

bool read_value_json(Param &param, const cJSON *json, unsigned int flags) {
  if (!json) return false;
  if (cJSON_IsObject(json)) return read_value_json(param, cJSON_GetObjectItemCaseSensitive(json, "value"), flags);
  if (cJSON_IsString(json)) return json->valuestring && read_value_text(param, json->valuestring, flags);
  switch (param.ptype) {
    case ptype_boolean:
    case ptype_popup:
    case ptype_float:
    case ptype_int:
    case ptype_color: return read_number_json(param, json, flags);
    case ptype_flare: {
      std::vector<FlareElement> elements;
      if (!flare_from_json(json, &elements)) return false;
      const std::string text = format_flare(elements);
      replace_text(store_of(param).text, text.empty() ? nullptr : text.c_str());
      return true;
    }
    default: return cJSON_IsNull(json);
  }
}

}  // namespace tarsel_ref
