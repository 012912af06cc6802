// What the two render entry points share: the call record, timing, and
// turning every failure but an abort into a message and a failed result.
#include <atomic>
#include <exception>
#include <new>
#include <string>

#include "core/messages.h"
#include "rendering/render_call.h"
#include "rendering/render_stats.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

std::atomic<double> last_seconds{0.0};
std::atomic<bool> immediate_return{false};

}  // namespace

void note_render_seconds(double seconds) { last_seconds.store(seconds); }
double last_render_seconds() { return last_seconds.load(); }
void set_render_immediate_return(bool on) { immediate_return.store(on); }
bool render_immediate_return() { return immediate_return.load(); }

bool run_render(const RenderCall &call) {
  std::string error;
  try {
    if (render(call, &error)) return true;
  } catch (const TarselAbortException &) {
    throw;
  } catch (const std::bad_alloc &) {
    error = "not enough memory for the render";
  } catch (const std::exception &failure) {
    error = failure.what();
  }
  emit_message(Err_Error, (std::string(call.entry) + ": " + error).c_str());
  return false;
}

bool render_basics_present(EffectGlobals_t *instance, T_RasterInfo **rasters, int n_rasters) {
  return instance && rasters && n_rasters >= 1;
}

RenderCall make_render_call(const char *entry, EffectGlobals_t *instance, const char *descriptor, RawImage dest,
                            int frame, int field, int downsample, int quality, T_RasterInfo **rasters, RawImage *images,
                            int n_rasters, float pixel_aspect, int n_threads, int seed, bool premultiplied,
                            const char *input_colorspace, const char *output_colorspace,
                            const char *working_colorspace) {
  RenderCall call;
  call.entry = entry;
  call.instance = instance;
  call.descriptor = descriptor;
  call.dest = dest;
  call.rasters = rasters;
  call.images = images;
  call.n_rasters = n_rasters;
  call.frame = frame;
  call.field = field;
  call.downsample = downsample;
  call.quality = quality;
  call.pixel_aspect = pixel_aspect;
  call.n_threads = n_threads;
  call.seed = seed;
  call.premultiplied = premultiplied;
  call.input_colorspace = input_colorspace;
  call.output_colorspace = output_colorspace;
  call.working_colorspace = working_colorspace;
  return call;
}

}  // namespace tarsel_ref
