// Process-wide engine controls and the instance queries that go with them.
#include "rendering/engine_controls.h"

#include <cmath>
#include <string>

#include "catalogue/descriptor.h"
#include "core/messages.h"
#include "rendering/buffers.h"
#include "rendering/instance.h"
#include "rendering/luts.h"
#include "rendering/stamps.h"
#include "rendering/workers.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

// A parameter animates when the engine drives it over time by itself.
bool animates(const Param &param) {
  return param.flags.auto_animation_type != auto_anim_none || param.flags.autotrans_type != autotrans_none;
}

void update_table(std::vector<float> &table, const char *path) {
  if (!path || !*path) {
    table.clear();
    return;
  }
  std::string error;
  if (!load_lut_file(path, &table, &error)) emit_message(Err_Error, error.c_str());
}

}  // namespace

void set_luts(const char *input_lut_path, const char *output_lut_path, float lut_scale) {
  LutSet next = *current_luts();
  update_table(next.input, input_lut_path);
  update_table(next.display, output_lut_path);
  if (std::isfinite(lut_scale) && lut_scale >= 0.0f)
    next.exposure = lut_scale;
  else
    emit_message(Err_Error, "set_tarsel_luts: the exposure must be a finite factor of 0 or more");
  install_luts(std::move(next));
}

// param_values null or "": the effect as a whole, which varies when it reads
// other frames or its previous output, or a parameter animates; otherwise the
// canonical name of one parameter of the descriptor in use, which varies when
// it animates (automatic animation or transition). -1 for an unknown name or
// instance. The answers hold for every frame.
int time_varying(EffectGlobals_t *globals, const char *param_values) {
  InstanceUse instance(globals);
  if (!instance) return -1;
  const Genotype &genotype = *instance->effect_genotype;
  if (param_values && *param_values) {
    const Param *param = find_param(genotype, param_values);
    return param ? (animates(*param) ? 1 : 0) : -1;
  }
  if (genotype.flags.need_other_frames_p || genotype.flags.use_prev_dest_p) return 1;
  for (int i = 0; i < genotype.n_params; ++i)
    if (animates(*genotype.params[i])) return 1;
  return 0;
}

const char *gpu_status(EffectGlobals_t *globals) {
  // The text lives in the instance: valid until the instance is freed.
  if (InstanceUse instance{globals}) return instance->gpu_status.c_str();
  return "CPU: the reference engine has no graphics-processor path";
}

// The engine runs no helper applications; what it lets go of are its
// process-wide caches (stamps, tables, kept pixel buffers) and its worker
// threads. Everything is made again on demand afterwards.
void release_caches() {
  clear_stamps();
  clear_luts();
  release_workers();
  release_buffer_cache();
}

}  // namespace tarsel_ref
