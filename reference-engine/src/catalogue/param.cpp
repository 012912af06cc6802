// The base parameter. Hosts construct bare Params and set their type and
// channel count afterwards, so every operation here follows the current ptype
// and keeps the value in the engine bytes (see param_store.h).
#include <atomic>
#include <cctype>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>

#include "catalogue/param_store.h"
#include "catalogue/param_values.h"
#include "core/entry.h"
#include "tarsel/param.h"

namespace tarsel_ref {
namespace {
std::atomic<int> param_count{0};
}

int live_params() { return param_count.load(); }

}  // namespace tarsel_ref

using tarsel_ref::store_of;

// Bounds start at the no-limit values; the slider defaults suit a 0..1
// quantity, the wide slider a 0..100 one.
Param::Param()
    : ptype(ptype_unknown), reserved_12{}, name(nullptr), canonical_name(nullptr), reserved_32{}, n_channels(1),
      n_channels_c1(1), reserved_42{}, default_value{}, old_default_value{}, use_old_default_p(0),
      old_default_version_limit(0), min_bound(tarsel_ref::kNoLowerBound), max_bound(tarsel_ref::kNoUpperBound),
      step(0.01f), normalize_scale(1.0f), reserved_96{}, flags{}, slider_min(0.0f), slider_max(1.0f),
      big_slider_min(0.0f), big_slider_max(100.0f), param_group(-1), reserved_209{}, flags_string(nullptr),
      reserved_224{} {
  auto scope = tarsel_ref::enter("Param::Param", static_cast<const void *>(this));
  tarsel_ref::ParamStore *store = new (reserved_96) tarsel_ref::ParamStore{};
  store->format = -1;
  new (reserved_224) char *(nullptr);
  ++tarsel_ref::param_count;
}

// Destructors cannot throw, so the fault switch is left for the next call.
Param::~Param() {
  tarsel_ref::note_entry("Param::~Param", static_cast<const void *>(this));
  tarsel_ref::ParamStore &store = store_of(*this);
  std::free(store.text);
  std::free(store.shown);
  std::free(tarsel_ref::ParamAccess::derived_name(*this));
  std::free(name);
  std::free(canonical_name);
  std::free(flags_string);
  --tarsel_ref::param_count;
}

// The copy takes the description and the value; the text cache and the
// derived name are the copy's own and start empty.
Param &Param::operator=(const Param &other) {
  auto scope =
      tarsel_ref::enter("Param::operator=", static_cast<const void *>(this), static_cast<const void *>(&other));
  if (this == &other) return *this;
  tarsel_ref::replace_text(name, other.name);
  tarsel_ref::replace_text(canonical_name, other.canonical_name);
  tarsel_ref::replace_text(flags_string, other.flags_string);
  ptype = other.ptype;
  n_channels = other.n_channels;
  n_channels_c1 = other.n_channels_c1;
  default_value = other.default_value;
  old_default_value = other.old_default_value;
  use_old_default_p = other.use_old_default_p;
  old_default_version_limit = other.old_default_version_limit;
  min_bound = other.min_bound;
  max_bound = other.max_bound;
  step = other.step;
  normalize_scale = other.normalize_scale;
  flags = other.flags;
  slider_min = other.slider_min;
  slider_max = other.slider_max;
  big_slider_min = other.big_slider_min;
  big_slider_max = other.big_slider_max;
  param_group = other.param_group;

  tarsel_ref::ParamStore &mine = store_of(*this);
  const tarsel_ref::ParamStore &theirs = store_of(other);
  tarsel_ref::replace_text(mine.text, theirs.text);
  tarsel_ref::replace_text(mine.shown, nullptr);
  tarsel_ref::replace_text(tarsel_ref::ParamAccess::derived_name(*this), nullptr);
  std::memcpy(mine.value, theirs.value, sizeof mine.value);
  std::memcpy(mine.controls, theirs.controls, sizeof mine.controls);
  mine.format = theirs.format;
  mine.list_id = theirs.list_id;
  return *this;
}

bool Param::needs_old_default(float version) {
  auto scope = tarsel_ref::enter("Param::needs_old_default", static_cast<const void *>(this), version);
  return use_old_default_p != 0 && version < static_cast<float>(old_default_version_limit);
}

const char *Param::ptype_name() const {
  auto scope = tarsel_ref::enter("Param::ptype_name", static_cast<const void *>(this));
  switch (ptype) {
    case ptype_float: return "float";
    case ptype_int: return "int";
    case ptype_color: return "color";
    case ptype_popup: return "popup";
    case ptype_boolean: return "boolean";
    case ptype_pushbutton: return "pushbutton";
    case ptype_string: return "string";
    case ptype_label: return "label";
    case ptype_flare: return "flare";
    case ptype_pellam_data: return "data";
    case ptype_none: return "none";
    default: return "unknown";
  }
}

// Without a canonical name of its own (a parameter the host made), the name
// is derived from the display name the way definitions write them: lowercase
// letters and digits, other runs of characters as one "_".
const char *Param::get_canonical_name() const {
  auto scope = tarsel_ref::enter("Param::get_canonical_name", static_cast<const void *>(this));
  if (canonical_name) return canonical_name;
  std::string derived;
  for (const char *c = name ? name : ""; *c; ++c) {
    const unsigned char ch = static_cast<unsigned char>(*c);
    if (std::isalnum(ch)) {
      derived += static_cast<char>(std::tolower(ch));
    } else if (!derived.empty() && derived.back() != '_') {
      derived += '_';
    }
  }
  while (!derived.empty() && derived.back() == '_') derived.pop_back();
  char *&kept = tarsel_ref::ParamAccess::derived_name(const_cast<Param &>(*this));
  tarsel_ref::replace_text(kept, derived.c_str());
  return kept;
}

bool Param::numeric_p() {
  auto scope = tarsel_ref::enter("Param::numeric_p", static_cast<const void *>(this));
  return tarsel_ref::holds_numbers(ptype);
}

const_format_tag Param::format() {
  auto scope = tarsel_ref::enter("Param::format", static_cast<const void *>(this));
  const signed char chosen = store_of(*this).format;
  if (chosen >= 0) return static_cast<const_format_tag>(chosen);
  return ptype == ptype_int ? format_integer : format_plain;
}

void *Param::get_value_object_nosync() {
  auto scope = tarsel_ref::enter("Param::get_value_object_nosync", static_cast<const void *>(this));
  tarsel_ref::ParamStore &store = store_of(*this);
  if (tarsel_ref::holds_numbers(ptype)) return store.value;
  if (tarsel_ref::holds_text(ptype)) return store.text;
  return nullptr;
}

int Param::set_value(RenderContext *ctx, int channel, float value, unsigned int flags) {
  auto scope = tarsel_ref::enter("Param::set_value", static_cast<const void *>(this), static_cast<const void *>(ctx),
                                 channel, value, flags);
  return set_values(ctx, channel, 1, &value, flags);
}

// All or nothing: one channel that cannot be stored leaves the value as it was.
int Param::set_values(RenderContext *ctx, int first_channel, int n, float *values, unsigned int flags) {
  auto scope = tarsel_ref::enter("Param::set_values", static_cast<const void *>(this), static_cast<const void *>(ctx),
                                 first_channel, n, static_cast<const void *>(values), flags);
  const int channels = tarsel_ref::value_channels(*this);
  if (n < 0 || first_channel < 0 || first_channel + n > channels || (n > 0 && !values)) return 0;
  float stored[MAX_CHANNELS];
  for (int i = 0; i < n; ++i) {
    float value = values[i];
    if ((flags & tarsel_ref::kDisplayUnits) && normalize_scale != 0.0f) value /= normalize_scale;
    if (!tarsel_ref::storable_value(*this, value, &stored[i])) return 0;
  }
  tarsel_ref::ParamStore &store = store_of(*this);
  for (int i = 0; i < n; ++i) store.value[first_channel + i] = stored[i];
  return 1;
}

// Text values default to empty here; the string and flare kinds carry
// defaults of their own.
bool Param::set_to_default(RenderContext *ctx, unsigned int flags) {
  auto scope = tarsel_ref::enter("Param::set_to_default", static_cast<const void *>(this),
                                 static_cast<const void *>(ctx), flags);
  tarsel_ref::ParamStore &store = store_of(*this);
  if (tarsel_ref::holds_text(ptype)) {
    const bool changed = store.text != nullptr;
    tarsel_ref::replace_text(store.text, nullptr);
    return changed;
  }
  bool changed = false;
  for (int c = 0; c < tarsel_ref::value_channels(*this); ++c) {
    float value;
    if (!tarsel_ref::storable_value(*this, default_value.data[c], &value)) continue;
    changed = changed || store.value[c] != value;
    store.value[c] = value;
  }
  return changed;
}

bool Param::maybe_set_to_old_default(RenderContext *ctx, float version, unsigned int flags) {
  auto scope = tarsel_ref::enter("Param::maybe_set_to_old_default", static_cast<const void *>(this),
                                 static_cast<const void *>(ctx), version, flags);
  if (!needs_old_default(version) || !tarsel_ref::holds_numbers(ptype)) return false;
  tarsel_ref::ParamStore &store = store_of(*this);
  for (int c = 0; c < tarsel_ref::value_channels(*this); ++c) {
    float value;
    if (tarsel_ref::storable_value(*this, old_default_value.data[c], &value)) store.value[c] = value;
  }
  return true;
}

// The controls are the value as the host's widgets show it; widget drags
// change them, and get_value_from_buttons takes them back.
void Param::update_ui(RenderContext *ctx) {
  auto scope = tarsel_ref::enter("Param::update_ui", static_cast<const void *>(this), static_cast<const void *>(ctx));
  tarsel_ref::ParamStore &store = store_of(*this);
  std::memcpy(store.controls, store.value, sizeof store.controls);
}

bool Param::get_value_from_buttons(RenderContext *ctx) {
  auto scope = tarsel_ref::enter("Param::get_value_from_buttons", static_cast<const void *>(this),
                                 static_cast<const void *>(ctx));
  tarsel_ref::ParamStore &store = store_of(*this);
  bool changed = false;
  for (int c = 0; c < tarsel_ref::value_channels(*this); ++c) {
    float value;
    if (!tarsel_ref::storable_value(*this, store.controls[c], &value) || value == store.value[c]) continue;
    store.value[c] = value;
    changed = true;
  }
  return changed;
}

// What the host may change about how a parameter is presented: its display
// name, visibility, enabling, screen mode, group expansion and slider ranges.
// Type, canonical name, bounds and value stay.
void Param::clone_host_properties(const Param *other) {
  auto scope = tarsel_ref::enter("Param::clone_host_properties", static_cast<const void *>(this),
                                 static_cast<const void *>(other));
  if (!other || other == this) return;
  tarsel_ref::replace_text(name, other->name);
  flags.hidden_p = other->flags.hidden_p;
  flags.wenable_p = other->flags.wenable_p;
  flags.screen_mode = other->flags.screen_mode;
  flags.group_start_open_p = other->flags.group_start_open_p;
  slider_min = other->slider_min;
  slider_max = other->slider_max;
  big_slider_min = other->big_slider_min;
  big_slider_max = other->big_slider_max;
}

Param *Param::clone_impl() {
  auto scope = tarsel_ref::enter("Param::clone_impl", static_cast<const void *>(this));
  std::unique_ptr<Param> copy(new Param());
  *copy = *this;
  return copy.release();
}
