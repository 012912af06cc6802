// effect.h: effect instances, engine controls, the two render calls and the
// flare-texture store.
#include <cmath>
#include <exception>
#include <string>

#include "callbacks/frame_requests.h"
#include "catalogue/catalogue.h"
#include "core/abort.h"
#include "core/entry.h"
#include "core/messages.h"
#include "rendering/engine_controls.h"
#include "rendering/instance.h"
#include "rendering/render_call.h"
#include "rendering/render_stats.h"
#include "rendering/saved_text.h"
#include "rendering/stamps.h"
#include "rendering/textures.h"
#include "tarsel/effect.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

// A failure while building is the engine's, never the host's: it becomes a
// message and no instance.
template <typename Make>
EffectGlobals_t *guarded(const char *what, Make make) {
  try {
    return make();
  } catch (const std::exception &error) {
    emit_message(Err_Error, (std::string(what) + ": " + error.what()).c_str());
  }
  return nullptr;
}

}  // namespace
}  // namespace tarsel_ref

EffectGlobals_t *init_tarsel_effect(const char *name, bool builder) {
  auto scope = tarsel_ref::enter("init_tarsel_effect", name, builder);
  const tarsel_ref::PluginDefinition *plugin = tarsel_ref::find_plugin(name, builder);
  if (!plugin) {
    tarsel_ref::emit_message(Err_Error, ("no effect named \"" + std::string(name ? name : "") + "\" in the " +
                                         (builder ? "effect builder's catalogue" : "effect catalogue"))
                                            .c_str());
    return nullptr;
  }
  return tarsel_ref::guarded("cannot make an effect", [&] { return tarsel_ref::create_instance(*plugin); });
}

EffectGlobals_t *init_tarsel_effect_from_string(const char *saved) {
  auto scope = tarsel_ref::enter("init_tarsel_effect_from_string", saved);
  return tarsel_ref::guarded("cannot make an effect from its saved text",
                             [&] { return tarsel_ref::instance_from_saved_text(saved); });
}

void free_tarsel_effect(EffectGlobals_t *globals) {
  auto scope = tarsel_ref::enter("free_tarsel_effect", static_cast<const void *>(globals));
  if (globals && !tarsel_ref::destroy_instance(globals))
    tarsel_ref::emit_message(Err_Error, "free_tarsel_effect: not a live effect instance of this engine");
}

void set_tarsel_luts(const char *input_lut_path, const char *output_lut_path, float lut_scale) {
  auto scope = tarsel_ref::enter("set_tarsel_luts", input_lut_path, output_lut_path, lut_scale);
  tarsel_ref::set_luts(input_lut_path, output_lut_path, lut_scale);
}

// The answers hold for every frame.
int tarsel_effect_is_time_varying(EffectGlobals_t *globals, const char *param_values, int frame) {
  auto scope =
      tarsel_ref::enter("tarsel_effect_is_time_varying", static_cast<const void *>(globals), param_values, frame);
  return tarsel_ref::time_varying(globals, param_values);
}

const char *tarsel_get_gpu_status(EffectGlobals_t *globals) {
  auto scope = tarsel_ref::enter("tarsel_get_gpu_status", static_cast<const void *>(globals));
  return tarsel_ref::gpu_status(globals);
}

// The request stays set until cleared: every render started meanwhile ends as
// an abort too, which is what a host cancelling a batch wants.
void tarsel_abort_render() {
  tarsel_ref::enter("tarsel_abort_render");
  tarsel_ref::request_abort();
}

void tarsel_clear_abort() {
  tarsel_ref::enter("tarsel_clear_abort");
  tarsel_ref::clear_abort_request();
}

void tarsel_free_all_stamp_collections() {
  auto scope = tarsel_ref::enter("tarsel_free_all_stamp_collections");
  tarsel_ref::clear_stamps();
}

// The engine runs no helper applications; what it lets go of are its
// process-wide caches (stamps, tables, kept pixel buffers) and its worker
// threads. Everything is made again on demand afterwards.
void tarsel_shutdown_apps() {
  auto scope = tarsel_ref::enter("tarsel_shutdown_apps");
  tarsel_ref::release_caches();
}

int render_tarsel_effect_to_native_image(EffectGlobals_t *instance, const char *descriptor, RawImage dest, int frame,
                                         int field, int downsample, int quality, T_RasterInfo **rasters,
                                         RawImage *images, float mix, int n_rasters, float pixel_aspect, int n_threads,
                                         int seed, int flags, int frame_rate, bool premultiplied,
                                         const char *input_colorspace, const char *output_colorspace,
                                         const char *working_colorspace) {
  auto scope = tarsel_ref::enter("render_tarsel_effect_to_native_image", static_cast<const void *>(instance),
                                 descriptor, static_cast<const void *>(dest), frame, field, downsample, quality,
                                 static_cast<const void *>(rasters), static_cast<const void *>(images), mix, n_rasters,
                                 pixel_aspect, n_threads, seed, flags, frame_rate, premultiplied, input_colorspace,
                                 output_colorspace, working_colorspace);
  tarsel_ref::RenderClock clock;
  if (tarsel_ref::render_immediate_return())
    return tarsel_ref::render_basics_present(instance, rasters, n_rasters) ? 1 : 0;
  tarsel_ref::RenderCall call =
      tarsel_ref::make_render_call("render_tarsel_effect_to_native_image", instance, descriptor, dest, frame, field,
                                   downsample, quality, rasters, images, n_rasters, pixel_aspect, n_threads, seed,
                                   premultiplied, input_colorspace, output_colorspace, working_colorspace);
  call.mix = mix;
  call.flags = flags;
  call.frame_rate = frame_rate;
  call.other_frames = tarsel_ref::host_frame_requests;
  return tarsel_ref::run_render(call) ? 1 : 0;
}

bool render_tarsel_lensflare_to_native_image(EffectGlobals_t *instance, const char *descriptor, float center_x,
                                             float center_y, RawImage dest, int frame, int field, int downsample,
                                             int quality, T_RasterInfo **rasters, RawImage *images, float brightness,
                                             int n_rasters, float pixel_aspect, int n_threads, int seed,
                                             const char *input_colorspace, const char *output_colorspace,
                                             const char *working_colorspace, bool premultiplied) {
  auto scope = tarsel_ref::enter("render_tarsel_lensflare_to_native_image", static_cast<const void *>(instance),
                                 descriptor, center_x, center_y, static_cast<const void *>(dest), frame, field,
                                 downsample, quality, static_cast<const void *>(rasters),
                                 static_cast<const void *>(images), brightness, n_rasters, pixel_aspect, n_threads,
                                 seed, input_colorspace, output_colorspace, working_colorspace, premultiplied);
  tarsel_ref::RenderClock clock;
  if (tarsel_ref::render_immediate_return()) return tarsel_ref::render_basics_present(instance, rasters, n_rasters);
  if (!std::isfinite(center_x) || !std::isfinite(center_y) || !std::isfinite(brightness) || brightness < 0.0f) {
    tarsel_ref::emit_message(Err_Error,
                             "render_tarsel_lensflare_to_native_image: the centre must be a point and "
                             "the brightness a number of 0 or more");
    return false;
  }
  tarsel_ref::FlareCall flare;
  flare.brightness = brightness;
  tarsel_ref::RenderCall call =
      tarsel_ref::make_render_call("render_tarsel_lensflare_to_native_image", instance, descriptor, dest, frame, field,
                                   downsample, quality, rasters, images, n_rasters, pixel_aspect, n_threads, seed,
                                   premultiplied, input_colorspace, output_colorspace, working_colorspace);
  // The centre is given in destination pixels; the kernel works in the frame.
  if (rasters && n_rasters >= 1 && rasters[0]) {
    flare.center_x = static_cast<double>(center_x) + rasters[0]->x_origin;
    flare.center_y = static_cast<double>(center_y) + rasters[0]->y_origin;
  }
  call.flare_call = &flare;
  return tarsel_ref::run_render(call);
}

int tarsel_load_flare_texture(const char *path) {
  auto scope = tarsel_ref::enter("tarsel_load_flare_texture", path);
  return tarsel_ref::load_texture(path);
}

const char *tarsel_get_flare_texture_error() {
  auto scope = tarsel_ref::enter("tarsel_get_flare_texture_error");
  return tarsel_ref::texture_error();
}

int tarsel_register_flare_texture(int xsize, int ysize, int n_channels, int bytes_per_channel, RawImage pixels) {
  auto scope = tarsel_ref::enter("tarsel_register_flare_texture", xsize, ysize, n_channels, bytes_per_channel,
                                 static_cast<const void *>(pixels));
  return tarsel_ref::register_texture(xsize, ysize, n_channels, bytes_per_channel, pixels);
}

int tarsel_get_texture_info(int index, int *xsize, int *ysize, int *n_channels, int *bytes_per_channel,
                            size_t *n_bytes) {
  auto scope = tarsel_ref::enter("tarsel_get_texture_info", index, static_cast<const void *>(xsize),
                                 static_cast<const void *>(ysize), static_cast<const void *>(n_channels),
                                 static_cast<const void *>(bytes_per_channel), static_cast<const void *>(n_bytes));
  return tarsel_ref::texture_info(index, xsize, ysize, n_channels, bytes_per_channel, n_bytes);
}

int tarsel_get_texture_pixels(int index, void *dest, size_t dest_size) {
  auto scope = tarsel_ref::enter("tarsel_get_texture_pixels", index, static_cast<const void *>(dest), dest_size);
  return tarsel_ref::texture_pixels(index, dest, dest_size);
}

void tarsel_free_all_flare_textures() {
  auto scope = tarsel_ref::enter("tarsel_free_all_flare_textures");
  tarsel_ref::free_textures();
}
