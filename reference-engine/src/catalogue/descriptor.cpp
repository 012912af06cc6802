#include "catalogue/descriptor.h"

#include <cstring>
#include <set>
#include <stdexcept>

#include "catalogue/flare.h"
#include "catalogue/param_kinds.h"
#include "catalogue/param_values.h"

namespace tarsel_ref {
namespace {

void definition_error(const std::string &effect, const std::string &what) {
  throw std::logic_error("effect \"" + effect + "\": " + what);
}

void copy_name(char *field, std::size_t size, const std::string &text, const std::string &effect) {
  if (text.size() >= size) definition_error(effect, "name \"" + text + "\" is too long");
  std::memcpy(field, text.c_str(), text.size() + 1);
}

// How a parameter's flag words shape the group table.
struct GroupMarks {
  bool opens = false;
  bool documents = false;
  int closes = 0;
};

GroupMarks apply_flag_words(Param &param, const std::string &words, const std::string &effect) {
  GroupMarks marks;
  std::size_t start = 0;
  while (start <= words.size()) {
    const std::size_t comma = std::min(words.find(',', start), words.size());
    const std::string word = words.substr(start, comma - start);
    start = comma + 1;
    if (word.empty()) continue;
    if (word == "hidden")
      param.flags.hidden_p = 1;
    else if (word == "group_start")
      marks.opens = true;
    else if (word == "open")
      param.flags.group_start_open_p = 1;
    else if (word == "group_end")
      ++marks.closes;
    else if (word == "doc_group")
      marks.documents = true;
    else if (word == "no_publish")
      param.flags.dont_publish_p = 1;
    else if (word == "builder_disable")
      param.flags.builder_disable_p = 1;
    else if (word == "builder_disable_one")
      param.flags.builder_disable_one_p = 1;
    else if (word == "fromfile")
      param.flags.fromfile_popup_p = 1;
    else if (word == "glare")
      param.flags.glare_p = 1;
    else if (word == "disabled")
      param.flags.wenable_p = 0;
    else
      definition_error(effect, "unknown flag \"" + word + "\" on \"" + param_label(param) + "\"");
  }
  param.flags.group_start_p = marks.opens ? 1 : 0;
  param.flags.group_end_p = static_cast<unsigned>(marks.closes) & 7u;
  param.flags.doc_group_p = marks.documents ? 1 : 0;
  return marks;
}

std::unique_ptr<Param> make_kind(const ParamDefinition &source, const std::string &effect) {
  switch (source.type) {
    case ptype_float: return std::make_unique<FloatParam>(source.channels);
    case ptype_int: return std::make_unique<IntParam>();
    case ptype_color: return std::make_unique<ColorParam>(source.channels);
    case ptype_boolean: return std::make_unique<BooleanParam>();
    case ptype_pushbutton: return std::make_unique<PushButtonParam>();
    case ptype_string: return std::make_unique<StringParam>(source.text);
    case ptype_label: return std::make_unique<LabelParam>();
    case ptype_popup:
      return std::make_unique<ChoiceParam>(source.list != kNoList ? from_file_list(source.list).names : source.states);
    case ptype_flare: {
      std::vector<FlareElement> elements;
      if (!parse_flare(source.text, &elements)) definition_error(effect, "malformed flare \"" + source.text + "\"");
      return std::make_unique<FlareParam>(format_flare(elements));
    }
    default: definition_error(effect, "parameter \"" + source.name + "\" has no kind"); return nullptr;
  }
}

std::unique_ptr<Param> build_param(const ParamDefinition &source, const std::string &effect, GroupMarks *marks) {
  std::unique_ptr<Param> param = make_kind(source, effect);
  replace_text(param->name, source.name.c_str());
  replace_text(param->canonical_name, source.canonical.c_str());
  replace_text(param->flags_string, source.flags.c_str());
  if (holds_numbers(source.type) && source.type != ptype_popup && source.type != ptype_boolean)
    param->n_channels = param->n_channels_c1 = static_cast<unsigned char>(source.channels);
  for (int c = 0; c < MAX_CHANNELS; ++c) {
    param->default_value.data[c] = source.def[c];
    param->old_default_value.data[c] = source.old_limit > 0 ? source.old_def[c] : 0.0f;
  }
  param->use_old_default_p = source.old_limit > 0 ? 1 : 0;
  param->old_default_version_limit = source.old_limit;
  if (source.type != ptype_popup) {  // a popup's range is its states
    param->min_bound = source.min;
    param->max_bound = source.max;
    param->slider_min = source.slider_lo;
    param->slider_max = source.slider_hi;
    param->big_slider_min = source.big_lo;
    param->big_slider_max = source.big_hi;
    param->step = source.step;
  }
  param->normalize_scale = source.norm;
  param->flags.wenable_p = 1;
  param->flags.screen_mode = static_cast<unsigned>(source.mode) & 15u;
  param->flags.autotrans_type = static_cast<unsigned>(source.trans) & 3u;
  param->flags.auto_animation_type = static_cast<short>(source.anim);
  param->flags.needs_input_n = source.needs_input;
  *marks = apply_flag_words(*param, source.flags, effect);
  ParamStore &store = store_of(*param);
  store.format = static_cast<signed char>(source.format);
  store.list_id = source.list;
  param->set_to_default(nullptr, 0);
  param->update_ui(nullptr);
  return param;
}

void build_params(Descriptor &d, const DescriptorDefinition &source) {
  std::set<std::string> canonical_names;
  std::vector<int> open_groups;
  for (const ParamDefinition &p : source.params) {
    if (!canonical_names.insert(p.canonical).second)
      definition_error(source.name, "two parameters named " + p.canonical);
    GroupMarks marks;
    std::unique_ptr<Param> param = build_param(p, source.name, &marks);
    if (marks.opens || marks.documents) {
      if (p.group.empty()) definition_error(source.name, "\"" + p.name + "\" names no group");
      if (d.group_names.size() == MAX_PARAM_GROUPS) definition_error(source.name, "too many groups");
      d.group_names.push_back(p.group);
    }
    if (marks.opens) open_groups.push_back(static_cast<int>(d.group_names.size()) - 1);
    if (marks.documents)
      param->param_group = static_cast<signed char>(d.group_names.size() - 1);
    else
      param->param_group = static_cast<signed char>(open_groups.empty() ? -1 : open_groups.back());
    for (int i = 0; i < marks.closes; ++i) {
      if (open_groups.empty()) definition_error(source.name, "\"" + p.name + "\" closes a group that is not open");
      open_groups.pop_back();
    }
    d.table.push_back(param.get());
    d.owned.push_back(std::move(param));
  }
  if (!open_groups.empty()) definition_error(source.name, "a group is left open");
  for (std::size_t g = 0; g < d.group_names.size(); ++g) d.genotype.param_groups[g].name = d.group_names[g].c_str();

  // A button restores parameters of its own descriptor, which lives as long as it does.
  for (std::size_t i = 0; i < source.params.size(); ++i) {
    if (source.params[i].resets.empty()) continue;
    if (source.params[i].type != ptype_pushbutton) definition_error(source.name, "only a button resets parameters");
    std::vector<Param *> targets;
    for (const std::string &name : source.params[i].resets) {
      Param *target = nullptr;
      for (Param *candidate : d.table)
        if (name == candidate->canonical_name) target = candidate;
      if (!target) definition_error(source.name, "button resets unknown parameter " + name);
      targets.push_back(target);
    }
    static_cast<PushButtonParam &>(*d.table[i]).on_press = [targets] {
      for (Param *target : targets) {
        target->set_to_default(nullptr, 0);
        target->update_ui(nullptr);
      }
    };
  }
  d.genotype.n_params = static_cast<int>(d.table.size());
  d.genotype.params = d.table.empty() ? nullptr : d.table.data();
}

void build_inputs(Descriptor &d, const DescriptorDefinition &source) {
  if (source.inputs.size() > MAX_INPUTS) definition_error(source.name, "too many inputs");
  Genotype &g = d.genotype;
  for (std::size_t i = 0; i < source.inputs.size(); ++i) {
    const InputDefinition &input = source.inputs[i];
    copy_name(g.input_names[i], MAX_INPUT_NAME_LEN, input.name, source.name);
    copy_name(g.canonical_input_names[i], MAX_INPUT_NAME_LEN, input.canonical, source.name);
    g.input_optional_p.data[i] = input.optional ? 1 : 0;
    g.input_default_to.data[i] = input.fallback;
    g.input_default_value[i] = input.fallback_value;
  }
  g.n_inputs = static_cast<signed char>(source.inputs.size());
}

void build_definition(Descriptor &d, const DescriptorDefinition &source) {
  effect_def &def = d.definition;
  def.name = source.name;
  for (const InputDefinition &input : source.inputs) {
    def.input_names.push_back(input.name);
    def.input_optional_p.push_back(input.optional);
  }
  for (const ParamDefinition &p : source.params)
    if (p.type != ptype_label && p.type != ptype_pushbutton) def.arg_names.push_back(p.canonical);
  for (const auto &fixed : source.hardcoded) def.arg_names.push_back(fixed.first);
  def.arg_hardcoded_values = source.hardcoded;
}

}  // namespace

std::unique_ptr<Descriptor> build_descriptor(const DescriptorDefinition &source) {
  auto d = std::make_unique<Descriptor>();
  Genotype &g = d->genotype;
  copy_name(g.name, MAX_EFFECT_NAME_LEN, source.name, source.name);
  build_inputs(*d, source);
  build_params(*d, source);
  build_definition(*d, source);
  if (!source.flare_param.empty()) {
    g.flare_param = find_param(g, source.flare_param.c_str());
    if (!g.flare_param || g.flare_param->ptype != ptype_flare)
      definition_error(source.name, "no flare parameter " + source.flare_param);
  }
  if (source.host_data) {
    d->host_data = std::make_unique<HostTextData>();
    g.host_data = d->host_data.get();
  }
  g.disable_gpu = 1;
  g.gpu_disable_reason = kGpuNotBuilt;
  g.rgba_mode = source.rgba_mode;
  g.rgba_ok_for_inputs = source.rgba_ok_for_inputs;
  g.transform_with_warp = source.transform_with_warp;
  g.alpha_z_source_input = source.alpha_z_source_input;
  g.flags.need_other_frames_p = source.need_other_frames;
  g.flags.use_prev_dest_p = source.use_prev_dest;
  g.flags.mask_color_p = source.mask_color;
  g.flags.transition_p = source.transition;
  g.flags.use_reduce_p = source.use_reduce;
  d->popup_name = source.popup_name.empty() ? source.name : source.popup_name;
  g.effect_popup_name = d->popup_name.data();
  g.old_default_effect = source.old_default_effect;
  g.old_default_version_limit = source.old_default_limit;
  g.effect_info = &d->definition;
  set_node_flags(g, source.node_flags);
  d->kernel = source.kernel;
  d->history = source.history;
  return d;
}

void add_instance_slots(Descriptor &d) {
  ParamDefinition mix =
      float_param("Effect Mix", "effect_mix", 1.0f).bounds(0.0f, 1.0f).shown_as(format_percent, 100.0f);
  ParamDefinition motion_blur = bool_param("Motion Blur", "motion_blur", false).with_flags("disabled");
  GroupMarks marks;
  d.slot_params.push_back(build_param(mix, d.genotype.name, &marks));
  d.slot_params.push_back(nullptr);
  d.slot_params.push_back(build_param(motion_blur, d.genotype.name, &marks));
  d.slots.assign(d.slot_params.size(), InstanceParamSlot{});
  for (std::size_t i = 0; i < d.slots.size(); ++i) d.slots[i].param = d.slot_params[i].get();
  d.genotype.n_instance_param_slots = static_cast<int>(d.slots.size());
  d.genotype.instance_param_slots = d.slots.data();
}

int node_flags(const Genotype &genotype) {
  int flags;
  std::memcpy(&flags, genotype.reserved_1316, sizeof flags);
  return flags;
}

void set_node_flags(Genotype &genotype, int flags) { std::memcpy(genotype.reserved_1316, &flags, sizeof flags); }

Param *find_param(const Genotype &genotype, const char *canonical) {
  if (!canonical) return nullptr;
  for (int i = 0; i < genotype.n_params; ++i) {
    Param *param = genotype.params[i];
    if (param && param->canonical_name && std::strcmp(param->canonical_name, canonical) == 0) return param;
  }
  return nullptr;
}

}  // namespace tarsel_ref
