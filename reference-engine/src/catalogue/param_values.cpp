#include "catalogue/param_values.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>

#include "core/messages.h"
#include "tarsel/errors.h"

namespace tarsel_ref {

bool holds_numbers(param_type type) {
  switch (type) {
    case ptype_float:
    case ptype_int:
    case ptype_color:
    case ptype_popup:
    case ptype_boolean: return true;
    default: return false;
  }
}

bool holds_text(param_type type) { return type == ptype_string || type == ptype_flare; }

// A popup state and a switch are one value whatever the channel count says.
int value_channels(const Param &param) {
  if (!holds_numbers(param.ptype)) return 0;
  if (param.ptype == ptype_popup || param.ptype == ptype_boolean) return 1;
  return std::min<int>(param.n_channels, MAX_CHANNELS);
}

bool storable_value(const Param &param, float value, float *stored) {
  if (!holds_numbers(param.ptype) || std::isnan(value)) return false;
  const bool whole = param.ptype != ptype_float && param.ptype != ptype_color;
  if (whole && !std::isfinite(value)) return false;
  if (param.ptype == ptype_boolean) {
    *stored = value != 0.0f ? 1.0f : 0.0f;
    return true;
  }
  if (param.min_bound != kNoLowerBound && value < param.min_bound) value = param.min_bound;
  if (param.max_bound != kNoUpperBound && value > param.max_bound) value = param.max_bound;
  if (whole) value = std::round(value);
  // A popup state is an index: never below the first.
  if (param.ptype == ptype_popup && value < 0.0f) value = 0.0f;
  *stored = value;
  return true;
}

void replace_text(char *&slot, const char *text) {
  char *copy = nullptr;
  if (text) {
    const std::size_t n = std::strlen(text) + 1;
    copy = static_cast<char *>(std::malloc(n));
    if (!copy) throw std::bad_alloc();
    std::memcpy(copy, text, n);
  }
  std::free(slot);
  slot = copy;
}

std::string param_label(const Param &param) {
  if (param.name) return param.name;
  if (param.canonical_name) return param.canonical_name;
  return "(unnamed)";
}

void warn_about(const Param &param, const std::string &what) {
  emit_message(Err_Warning, ("Parameter \"" + param_label(param) + "\": " + what).c_str());
}

}  // namespace tarsel_ref
