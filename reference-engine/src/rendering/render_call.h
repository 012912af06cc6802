// One render call, whichever entry point made it: the checks of its
// arguments, reading the inputs, running the kernel and writing the result.
#pragma once

#include <functional>
#include <memory>
#include <string>

#include "rendering/colour.h"
#include "rendering/kernels/kernel.h"
#include "tarsel/effect_globals.h"
#include "tarsel/load_frame.h"
#include "tarsel/raster_info.h"

namespace tarsel_ref {

// Bits of the render call's flags.
constexpr int kRenderClearDest = 1;  // clear the destination to transparent first
constexpr int kRenderKeepAlpha = 2;  // keep the destination's alpha

// Reads the pixels a frame request returned into the render's working form,
// as the render reads its inputs; null with `error` set when the descriptor
// does not describe pixels the render can read.
using FrameReader =
    std::function<std::shared_ptr<const WorkImage>(const T_RasterInfo &info, void *pixels, std::string *error)>;

// Makes the frame requests of one render: `state` is what the host's callback
// receives as the render state, `instance` and `genotype` the two engine
// values. Null when the host answers none.
using OtherFramesMaker = std::unique_ptr<OtherFrames> (*)(const T_RenderState &state, void *instance,
                                                          const Genotype &genotype, FrameReader read);

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
  const FlareCall *flare_call = nullptr;    // set by the lens-flare render call
  OtherFramesMaker other_frames = nullptr;  // how to ask the host for other frames; null: never asked
};

// Renders; false with `error` set when the arguments do not allow it. An
// abort request ends it with TarselAbortException.
bool render(const RenderCall &call, std::string *error);

// The call record with the arguments both render entry points take; each adds its own.
RenderCall make_render_call(const char *entry, EffectGlobals_t *instance, const char *descriptor, RawImage dest,
                            int frame, int field, int downsample, int quality, T_RasterInfo **rasters, RawImage *images,
                            int n_rasters, float pixel_aspect, int n_threads, int seed, bool premultiplied,
                            const char *input_colorspace, const char *output_colorspace,
                            const char *working_colorspace);

// Whether the arguments every render needs are there (an instance, at least
// one descriptor).
bool render_basics_present(EffectGlobals_t *instance, T_RasterInfo **rasters, int n_rasters);

// Renders; an error becomes an Err_Error message naming the entry point and a
// false result. An abort is passed on as TarselAbortException.
bool run_render(const RenderCall &call);

}  // namespace tarsel_ref
