// One render call, whichever entry point made it: the checks of its
// arguments, reading the inputs, running the kernel and writing the result.
#pragma once

#include <string>

#include "rendering/colour.h"
#include "rendering/kernels/kernel.h"
#include "tarsel/effect_globals.h"
#include "tarsel/raster_info.h"

namespace tarsel_ref {

// Bits of the render call's flags.
constexpr int kRenderClearDest = 1;  // clear the destination to transparent first
constexpr int kRenderKeepAlpha = 2;  // keep the destination's alpha

struct RenderCall {
  const char *entry = "";  // the entry point's name, for messages
  EffectGlobals_t *instance = nullptr;
  const char *descriptor = nullptr;
  RawImage dest = nullptr;
  T_RasterInfo **rasters = nullptr;
  RawImage *images = nullptr;
  int n_rasters = 0;
  int frame = 0;
  int field = 0;
  int downsample = 1;
  int quality = 1;
  float mix = 1.0f;
  float pixel_aspect = 0.0f;
  int n_threads = 0;
  int seed = 0;
  int flags = 0;
  int frame_rate = 0;
  bool premultiplied = false;
  const char *input_colorspace = nullptr;
  const char *output_colorspace = nullptr;
  const char *working_colorspace = nullptr;
  const FlareCall *flare_call = nullptr;  // set by the lens-flare render call
};

// Renders; false with `error` set when the arguments do not allow it. An
// abort request ends it with TarselAbortException.
bool render(const RenderCall &call, std::string *error);

}  // namespace tarsel_ref
