#include "catalogue/param_kinds.h"

#include <algorithm>
#include <cstdlib>
#include <memory>

#include "catalogue/param_store.h"
#include "catalogue/param_values.h"
#include "core/entry.h"

namespace tarsel_ref {
namespace {

// The common part of every kind's copy: the description and the value.
template <typename Kind, typename... Args>
Param *copy_of(const Param &original, Args &&...args) {
  auto scope = enter("Param::clone_impl", static_cast<const void *>(&original));
  std::unique_ptr<Kind> copy(new Kind(std::forward<Args>(args)...));
  static_cast<Param &>(*copy) = original;
  return copy.release();
}

}  // namespace

FloatParam::FloatParam(int channels) {
  ptype = ptype_float;
  n_channels = n_channels_c1 = static_cast<unsigned char>(channels);
}
Param *FloatParam::clone_impl() { return copy_of<FloatParam>(*this); }

IntParam::IntParam() {
  ptype = ptype_int;
  step = 1.0f;
  slider_max = 10.0f;
}
Param *IntParam::clone_impl() { return copy_of<IntParam>(*this); }

ColorParam::ColorParam(int channels) {
  ptype = ptype_color;
  n_channels = n_channels_c1 = static_cast<unsigned char>(channels == 4 ? 4 : 3);
  min_bound = 0.0f;
  big_slider_max = 1.0f;
}
Param *ColorParam::clone_impl() { return copy_of<ColorParam>(*this, n_channels); }

BooleanParam::BooleanParam() {
  ptype = ptype_boolean;
  min_bound = slider_min = big_slider_min = 0.0f;
  max_bound = slider_max = big_slider_max = 1.0f;
  step = 1.0f;
}
Param *BooleanParam::clone_impl() { return copy_of<BooleanParam>(*this); }

ChoiceParam::ChoiceParam(const std::vector<std::string> &states) {
  ptype = ptype_popup;
  step = 1.0f;
  n_states = 0;
  for (char *&state : state_names) state = nullptr;
  set_states(states);
}

ChoiceParam::~ChoiceParam() {
  for (char *&state : state_names) std::free(state);
}

void ChoiceParam::set_states(const std::vector<std::string> &states) {
  const std::size_t count = std::min<std::size_t>(states.size(), MAX_POPUP_STATES);
  for (std::size_t i = 0; i < MAX_POPUP_STATES; ++i)
    replace_text(state_names[i], i < count ? states[i].c_str() : nullptr);
  n_states = static_cast<signed char>(count);
  min_bound = slider_min = big_slider_min = 0.0f;
  max_bound = slider_max = big_slider_max = count ? static_cast<float>(count - 1) : 0.0f;
}

Param *ChoiceParam::clone_impl() {
  std::vector<std::string> states;
  for (int i = 0; i < n_states; ++i) states.emplace_back(state_names[i] ? state_names[i] : "");
  return copy_of<ChoiceParam>(*this, states);
}

PushButtonParam::PushButtonParam() { ptype = ptype_pushbutton; }

// A button keeps no value: a press is a set of its one channel to non-zero.
int PushButtonParam::set_values(RenderContext *ctx, int first_channel, int n, float *values, unsigned int flags) {
  auto scope = enter("Param::set_values", static_cast<const void *>(this), static_cast<const void *>(ctx),
                     first_channel, n, static_cast<const void *>(values), flags);
  if (ptype != ptype_pushbutton) return Param::set_values(ctx, first_channel, n, values, flags);
  if (first_channel != 0 || n != 1 || !values) return 0;
  if (values[0] != 0.0f && on_press) on_press();
  return 1;
}

Param *PushButtonParam::clone_impl() { return copy_of<PushButtonParam>(*this); }

// Puts a text-valued parameter (string, flare) back to its default text;
// true when the value changed.
static bool restore_default_text(Param &param, const std::string &default_text) {
  ParamStore &store = store_of(param);
  const std::string current = store.text ? store.text : "";
  replace_text(store.text, default_text.empty() ? nullptr : default_text.c_str());
  return current != default_text;
}

StringParam::StringParam(std::string text) : default_text(std::move(text)) { ptype = ptype_string; }

bool StringParam::set_to_default(RenderContext *ctx, unsigned int flags) {
  auto scope = enter("Param::set_to_default", static_cast<const void *>(this), static_cast<const void *>(ctx), flags);
  if (ptype != ptype_string) return Param::set_to_default(ctx, flags);
  return restore_default_text(*this, default_text);
}

Param *StringParam::clone_impl() { return copy_of<StringParam>(*this, default_text); }

LabelParam::LabelParam() { ptype = ptype_label; }
Param *LabelParam::clone_impl() { return copy_of<LabelParam>(*this); }

FlareParam::FlareParam(std::string text) : default_text(std::move(text)) { ptype = ptype_flare; }

bool FlareParam::set_to_default(RenderContext *ctx, unsigned int flags) {
  auto scope = enter("Param::set_to_default", static_cast<const void *>(this), static_cast<const void *>(ctx), flags);
  if (ptype != ptype_flare) return Param::set_to_default(ctx, flags);
  return restore_default_text(*this, default_text);
}

Param *FlareParam::clone_impl() { return copy_of<FlareParam>(*this, default_text); }

}  // namespace tarsel_ref
