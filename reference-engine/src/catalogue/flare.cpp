#include "catalogue/flare.h"

#include <algorithm>
#include <cjson/cJSON.h>
#include <cmath>

#include "catalogue/number_text.h"

namespace tarsel_ref {
namespace {

bool known_kind(const std::string &kind) {
  const auto &kinds = flare_kinds();
  return std::find(kinds.begin(), kinds.end(), kind) != kinds.end() || texture_kind(kind);
}

// Sizes, brightnesses and colours are never negative; positions may be.
bool valid(const FlareElement &e) {
  if (!known_kind(e.kind)) return false;
  if (!std::isfinite(e.position) || !std::isfinite(e.size) || !std::isfinite(e.brightness)) return false;
  if (e.size < 0.0f || e.brightness < 0.0f) return false;
  for (float c : e.color)
    if (!std::isfinite(c) || c < 0.0f) return false;
  return true;
}

bool parse_element(std::string_view text, FlareElement *element) {
  const auto words = split_words(text);
  if (words.size() != 7) return false;
  FlareElement e;
  e.kind = std::string(words[0]);
  float *fields[] = {&e.size, &e.brightness, &e.position, &e.color[0], &e.color[1], &e.color[2]};
  for (int i = 0; i < 6; ++i)
    if (!parse_number(words[static_cast<std::size_t>(i) + 1], fields[i])) return false;
  if (!valid(e)) return false;
  *element = e;
  return true;
}

bool number_item(const cJSON *object, const char *key, float *value) {
  const cJSON *item = cJSON_GetObjectItemCaseSensitive(object, key);
  if (!cJSON_IsNumber(item)) return false;
  *value = static_cast<float>(item->valuedouble);
  return true;
}

}  // namespace

const std::vector<std::string> &flare_kinds() {
  static const std::vector<std::string> kinds = {"glow", "ring", "disc", "streak", "star", "iris"};
  return kinds;
}

bool texture_kind(const std::string &kind, int *index) {
  static const std::string prefix = "texture:";
  if (kind.compare(0, prefix.size(), prefix) != 0) return false;
  const std::string digits = kind.substr(prefix.size());
  const bool number = !digits.empty() && digits.size() <= 9 &&
                      std::all_of(digits.begin(), digits.end(), [](char c) { return c >= '0' && c <= '9'; });
  if (!number) return false;
  if (index) *index = std::stoi(digits);
  return true;
}

std::string format_flare(const std::vector<FlareElement> &elements) {
  std::string text;
  for (const FlareElement &e : elements) {
    if (!text.empty()) text += "; ";
    text += e.kind;
    for (float v : {e.size, e.brightness, e.position, e.color[0], e.color[1], e.color[2]})
      text += " " + format_number(v);
  }
  return text;
}

bool parse_flare(const std::string &text, std::vector<FlareElement> *elements) {
  std::vector<FlareElement> parsed;
  std::string_view rest = trim(text);
  while (!rest.empty()) {
    const std::size_t end = rest.find(';');
    FlareElement e;
    if (!parse_element(rest.substr(0, end), &e)) return false;
    parsed.push_back(e);
    if (parsed.size() > static_cast<std::size_t>(kMaxFlareElements)) return false;
    if (end == std::string_view::npos) break;
    rest = trim(rest.substr(end + 1));
    if (rest.empty()) return false;  // a trailing separator announces an element that is missing
  }
  *elements = std::move(parsed);
  return true;
}

cJSON *flare_to_json(const std::vector<FlareElement> &elements) {
  cJSON *array = cJSON_CreateArray();
  if (!array) return nullptr;
  for (const FlareElement &e : elements) {
    cJSON *item = cJSON_CreateObject();
    if (!item) break;
    cJSON_AddItemToArray(array, item);
    cJSON_AddStringToObject(item, "kind", e.kind.c_str());
    cJSON_AddNumberToObject(item, "size", e.size);
    cJSON_AddNumberToObject(item, "brightness", e.brightness);
    cJSON_AddNumberToObject(item, "position", e.position);
    const float color[3] = {e.color[0], e.color[1], e.color[2]};
    cJSON_AddItemToObject(item, "color", cJSON_CreateFloatArray(color, 3));
  }
  return array;
}

bool flare_from_json(const cJSON *json, std::vector<FlareElement> *elements) {
  if (!cJSON_IsArray(json) || cJSON_GetArraySize(json) > kMaxFlareElements) return false;
  std::vector<FlareElement> parsed;
  const cJSON *item = nullptr;
  cJSON_ArrayForEach(item, json) {
    FlareElement e;
    const cJSON *kind = cJSON_GetObjectItemCaseSensitive(item, "kind");
    if (!cJSON_IsString(kind) || !kind->valuestring) return false;
    e.kind = kind->valuestring;
    if (!number_item(item, "size", &e.size) || !number_item(item, "brightness", &e.brightness) ||
        !number_item(item, "position", &e.position))
      return false;
    const cJSON *color = cJSON_GetObjectItemCaseSensitive(item, "color");
    if (!cJSON_IsArray(color) || cJSON_GetArraySize(color) != 3) return false;
    for (int c = 0; c < 3; ++c) {
      const cJSON *channel = cJSON_GetArrayItem(color, c);
      if (!cJSON_IsNumber(channel)) return false;
      e.color[c] = static_cast<float>(channel->valuedouble);
    }
    if (!valid(e)) return false;
    parsed.push_back(e);
  }
  *elements = std::move(parsed);
  return true;
}

}  // namespace tarsel_ref
