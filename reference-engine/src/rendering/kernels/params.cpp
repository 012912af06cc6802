#include "rendering/kernels/params.h"

#include <cmath>
#include <stdexcept>

#include "catalogue/descriptor.h"
#include "catalogue/param_store.h"
#include "tarsel/effect_globals.h"

namespace tarsel_ref {

ParamReader::ParamReader(const Genotype &genotype, std::vector<bool> connected, int frame, double seconds)
    : genotype_(genotype), connected_(std::move(connected)), frame_(frame), seconds_(seconds) {}

const std::vector<float> *ParamReader::fixed(const char *name) const {
  if (!genotype_.effect_info) return nullptr;
  const auto &values = genotype_.effect_info->arg_hardcoded_values;
  const auto found = values.find(name);
  return found == values.end() ? nullptr : &found->second;
}

bool ParamReader::has(const char *name) const { return find_param(genotype_, name) || fixed(name); }

float ParamReader::number(const char *name, int channel) const {
  const Param *param = find_param(genotype_, name);
  if (!param) {
    const std::vector<float> *values = fixed(name);
    if (!values) throw std::logic_error(std::string("the effect has no parameter \"") + name + "\"");
    return static_cast<std::size_t>(channel) < values->size() ? (*values)[static_cast<std::size_t>(channel)] : 0.0f;
  }
  if (channel < 0 || channel >= MAX_CHANNELS) return 0.0f;
  // A parameter that only means something with its input connected reads as
  // its default while the input is not.
  const std::size_t needs = param->flags.needs_input_n > 0 ? static_cast<std::size_t>(param->flags.needs_input_n) : 0;
  if (needs > 0 && (needs > connected_.size() || !connected_[needs - 1])) return param->default_value.data[channel];
  const float value = store_of(*param).value[channel];
  switch (param->flags.auto_animation_type) {
    case auto_anim_floor0:
    case auto_anim_floor1: return value + static_cast<float>(frame_);
    case auto_anim_ramp_up: return static_cast<float>(value * seconds_);
    default: return value;
  }
}

int ParamReader::whole(const char *name, int channel) const {
  const float v = number(name, channel);
  if (!std::isfinite(v)) return 0;
  return static_cast<int>(std::lround(std::fmax(-2e9f, std::fmin(2e9f, v))));
}

std::string ParamReader::text(const char *name) const {
  const Param *param = find_param(genotype_, name);
  if (!param) throw std::logic_error(std::string("the effect has no parameter \"") + name + "\"");
  const char *t = store_of(*param).text;
  return t ? t : "";
}

}  // namespace tarsel_ref
