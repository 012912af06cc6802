#include "catalogue/definition.h"

#include <algorithm>
#include <cmath>

namespace tarsel_ref {
namespace {

void append_word(std::string &words, const std::string &word) {
  if (!words.empty()) words += ",";
  words += word;
}

void copy_values(float *out, std::initializer_list<float> values) {
  std::copy_n(values.begin(), std::min<std::size_t>(values.size(), MAX_CHANNELS), out);
}

bool bounded(float lo, float hi) { return lo != kNoLowerBound && hi != kNoUpperBound; }

}  // namespace

ParamDefinition &ParamDefinition::bounds(float lo, float hi) {
  min = lo;
  max = hi;
  if (bounded(lo, hi)) {
    slider_lo = big_lo = lo;
    slider_hi = big_hi = hi;
  }
  return *this;
}

ParamDefinition &ParamDefinition::sliders(float lo, float hi) {
  slider_lo = lo;
  slider_hi = hi;
  return *this;
}

ParamDefinition &ParamDefinition::big_sliders(float lo, float hi) {
  big_lo = lo;
  big_hi = hi;
  return *this;
}

ParamDefinition &ParamDefinition::with_flags(const std::string &words) {
  append_word(flags, words);
  return *this;
}

ParamDefinition &ParamDefinition::in_group(const std::string &group_name, const std::string &words) {
  group = group_name;
  return with_flags(words);
}

ParamDefinition &ParamDefinition::old_default(std::initializer_list<float> values, short version_limit) {
  copy_values(old_def, values);
  old_limit = version_limit;
  return *this;
}

ParamDefinition &ParamDefinition::shown_as(const_format_tag tag, float normalize) {
  format = tag;
  norm = normalize;
  return *this;
}

ParamDefinition &ParamDefinition::animated(auto_anim_type type) {
  anim = type;
  return *this;
}

ParamDefinition &ParamDefinition::transition(autotrans_type type) {
  trans = type;
  return *this;
}

ParamDefinition &ParamDefinition::needs(short input_number) {
  needs_input = input_number;
  return *this;
}

ParamDefinition &ParamDefinition::stepping(float by) {
  step = by;
  return *this;
}

ParamDefinition float_param(const std::string &name, const std::string &canonical, float def) {
  ParamDefinition source;
  source.name = name;
  source.canonical = canonical;
  source.def[0] = def;
  return source;
}

ParamDefinition int_param(const std::string &name, const std::string &canonical, int def, int lo, int hi) {
  ParamDefinition source = float_param(name, canonical, static_cast<float>(def));
  source.type = ptype_int;
  source.step = 1.0f;
  source.bounds(static_cast<float>(lo), static_cast<float>(hi));
  return source;
}

ParamDefinition color_param(const std::string &name, const std::string &canonical, std::initializer_list<float> def) {
  ParamDefinition source;
  source.name = name;
  source.canonical = canonical;
  source.type = ptype_color;
  source.channels = def.size() == 4 ? 4 : 3;
  copy_values(source.def, def);
  source.min = 0.0f;
  source.big_hi = 1.0f;
  return source;
}

ParamDefinition pair_param(const std::string &name, const std::string &canonical, screen_mode mode, float x, float y) {
  ParamDefinition source = float_param(name, canonical, x);
  source.channels = 2;
  source.def[1] = y;
  source.mode = mode;
  return source;
}

ParamDefinition popup_param(const std::string &name, const std::string &canonical, std::vector<std::string> states,
                            int def) {
  ParamDefinition source = float_param(name, canonical, static_cast<float>(def));
  source.type = ptype_popup;
  source.states = std::move(states);
  source.step = 1.0f;
  return source;
}

ParamDefinition fromfile_popup(const std::string &name, const std::string &canonical, FromFileListId list) {
  ParamDefinition source = popup_param(name, canonical, {});
  source.list = list;
  return source.with_flags("fromfile");
}

ParamDefinition bool_param(const std::string &name, const std::string &canonical, bool def) {
  ParamDefinition source = float_param(name, canonical, def ? 1.0f : 0.0f);
  source.type = ptype_boolean;
  source.step = 1.0f;
  return source.bounds(0.0f, 1.0f);
}

ParamDefinition button_param(const std::string &name, const std::string &canonical, std::vector<std::string> resets) {
  ParamDefinition source = float_param(name, canonical, 0.0f);
  source.type = ptype_pushbutton;
  source.resets = std::move(resets);
  return source;
}

ParamDefinition string_param(const std::string &name, const std::string &canonical, const std::string &def) {
  ParamDefinition source = float_param(name, canonical, 0.0f);
  source.type = ptype_string;
  source.text = def;
  return source;
}

ParamDefinition label_param(const std::string &name, const std::string &canonical) {
  ParamDefinition source = float_param(name, canonical, 0.0f);
  source.type = ptype_label;
  return source;
}

ParamDefinition flare_param(const std::string &name, const std::string &canonical, const std::string &def, bool glare) {
  ParamDefinition source = float_param(name, canonical, 0.0f);
  source.type = ptype_flare;
  source.text = def;
  if (glare) source.with_flags("glare");
  return source;
}

}  // namespace tarsel_ref
