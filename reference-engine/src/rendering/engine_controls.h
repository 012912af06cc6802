// Process-wide engine controls (colour tables, caches) and the instance
// queries that go with them.
#pragma once

#include "tarsel/effect_globals.h"

namespace tarsel_ref {

// Installs the colour look-up tables read from those files (null or "": none)
// and the exposure between them.
void set_luts(const char *input_lut_path, const char *output_lut_path, float lut_scale);

// 1 when the instance (or its parameter of that canonical name) varies over
// time, 0 when not, -1 for an unknown name or instance.
int time_varying(EffectGlobals_t *globals, const char *param_values);

// The instance's graphics-processor status text.
const char *gpu_status(EffectGlobals_t *globals);

// Lets go of the process-wide caches and the worker threads.
void release_caches();

}  // namespace tarsel_ref
