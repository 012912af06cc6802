// The two render entry points: argument logging, timing, and turning every
// failure but an abort into a message and a failed result.
#include <atomic>
#include <cmath>
#include <chrono>
#include <exception>
#include <new>
#include <string>

#include "core/entry.h"
#include "core/messages.h"
#include "rendering/render_call.h"
#include "rendering/render_stats.h"
#include "tarsel/effect.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

std::atomic<double> last_seconds{0.0};
std::atomic<bool> immediate_return{false};

// Notes the call's wall time however it ends, an abort included.
class RenderClock {
public:
  RenderClock() : start_(std::chrono::steady_clock::now()) {}
  ~RenderClock() {
    note_render_seconds(std::chrono::duration<double>(std::chrono::steady_clock::now() - start_).count());
  }
  RenderClock(const RenderClock &) = delete;
  RenderClock &operator=(const RenderClock &) = delete;

private:
  std::chrono::steady_clock::time_point start_;
};

bool run(const RenderCall &call) {
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

bool basics_present(EffectGlobals_t *instance, T_RasterInfo **rasters, int n_rasters) {
  return instance && rasters && n_rasters >= 1;
}

// The call record with the arguments both entry points take; each adds its own.
RenderCall shared_call(const char *entry, EffectGlobals_t *instance, const char *descriptor, RawImage dest, int frame,
                       int field, int downsample, int quality, T_RasterInfo **rasters, RawImage *images,
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

}  // namespace

void note_render_seconds(double seconds) { last_seconds.store(seconds); }
double last_render_seconds() { return last_seconds.load(); }
void set_render_immediate_return(bool on) { immediate_return.store(on); }
bool render_immediate_return() { return immediate_return.load(); }

}  // namespace tarsel_ref

int render_tarsel_effect_to_native_image(EffectGlobals_t *instance, const char *descriptor, RawImage dest,
                                         int frame, int field, int downsample, int quality, T_RasterInfo **rasters,
                                         RawImage *images, float mix, int n_rasters, float pixel_aspect,
                                         int n_threads, int seed, int flags, int frame_rate, bool premultiplied,
                                         const char *input_colorspace, const char *output_colorspace,
                                         const char *working_colorspace) {
  auto scope = tarsel_ref::enter(
      "render_tarsel_effect_to_native_image", static_cast<const void *>(instance), descriptor,
      static_cast<const void *>(dest), frame, field, downsample, quality, static_cast<const void *>(rasters),
      static_cast<const void *>(images), mix, n_rasters, pixel_aspect, n_threads, seed, flags, frame_rate,
      premultiplied, input_colorspace, output_colorspace, working_colorspace);
  tarsel_ref::RenderClock clock;
  if (tarsel_ref::render_immediate_return()) return tarsel_ref::basics_present(instance, rasters, n_rasters) ? 1 : 0;
  tarsel_ref::RenderCall call = tarsel_ref::shared_call(
      "render_tarsel_effect_to_native_image", instance, descriptor, dest, frame, field, downsample, quality, rasters,
      images, n_rasters, pixel_aspect, n_threads, seed, premultiplied, input_colorspace, output_colorspace,
      working_colorspace);
  call.mix = mix;
  call.flags = flags;
  call.frame_rate = frame_rate;
  return tarsel_ref::run(call) ? 1 : 0;
}

bool render_tarsel_lensflare_to_native_image(EffectGlobals_t *instance, const char *descriptor, float center_x,
                                             float center_y, RawImage dest, int frame, int field, int downsample,
                                             int quality, T_RasterInfo **rasters, RawImage *images, float brightness,
                                             int n_rasters, float pixel_aspect, int n_threads, int seed,
                                             const char *input_colorspace, const char *output_colorspace,
                                             const char *working_colorspace, bool premultiplied) {
  auto scope = tarsel_ref::enter(
      "render_tarsel_lensflare_to_native_image", static_cast<const void *>(instance), descriptor, center_x,
      center_y, static_cast<const void *>(dest), frame, field, downsample, quality,
      static_cast<const void *>(rasters), static_cast<const void *>(images), brightness, n_rasters, pixel_aspect,
      n_threads, seed, input_colorspace, output_colorspace, working_colorspace, premultiplied);
  tarsel_ref::RenderClock clock;
  if (tarsel_ref::render_immediate_return()) return tarsel_ref::basics_present(instance, rasters, n_rasters);
  if (!std::isfinite(center_x) || !std::isfinite(center_y) || !std::isfinite(brightness) || brightness < 0.0f) {
    tarsel_ref::emit_message(Err_Error, "render_tarsel_lensflare_to_native_image: the centre must be a point and "
                                        "the brightness a number of 0 or more");
    return false;
  }
  tarsel_ref::FlareCall flare;
  flare.brightness = brightness;
  tarsel_ref::RenderCall call = tarsel_ref::shared_call(
      "render_tarsel_lensflare_to_native_image", instance, descriptor, dest, frame, field, downsample, quality,
      rasters, images, n_rasters, pixel_aspect, n_threads, seed, premultiplied, input_colorspace, output_colorspace,
      working_colorspace);
  // The centre is given in destination pixels; the kernel works in the frame.
  if (rasters && n_rasters >= 1 && rasters[0]) {
    flare.center_x = static_cast<double>(center_x) + rasters[0]->x_origin;
    flare.center_y = static_cast<double>(center_y) + rasters[0]->y_origin;
  }
  call.flare_call = &flare;
  return tarsel_ref::run(call);
}
