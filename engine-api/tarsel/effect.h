// Effect instances: creation, queries, rendering, lens flares and flare textures.
#pragma once

#include <cstddef>

#include "tarsel/effect_globals.h"
#include "tarsel/export.h"
#include "tarsel/raster_info.h"

// Creates an instance of the named effect (from the effect-builder catalogue
// when `builder` is set); null when none can be made. Free it with free_tarsel_effect.
TARSEL_API EffectGlobals_t *init_tarsel_effect(const char *name, bool builder);

// Creates an instance from its saved text; null when none can be made.
TARSEL_API EffectGlobals_t *init_tarsel_effect_from_string(const char *saved);

// Installs the colour look-up tables (input and output table paths) and their scale.
TARSEL_API void set_tarsel_luts(const char *input_lut_path, const char *output_lut_path, float lut_scale);

// Non-zero when the instance's result changes over time for the given parameter values and frame.
TARSEL_API int tarsel_effect_is_time_varying(EffectGlobals_t *globals, const char *param_values, int frame);

// Text describing the instance's graphics-processor use, engine-owned.
TARSEL_API const char *tarsel_get_gpu_status(EffectGlobals_t *globals);

// Frees an instance and everything it owns.
TARSEL_API void free_tarsel_effect(EffectGlobals_t *globals);

// Asks the render in progress to stop; it then throws TarselAbortException.
// The request stands until tarsel_clear_abort.
TARSEL_API void tarsel_abort_render();

// Clears a pending abort request.
TARSEL_API void tarsel_clear_abort();

// Releases every stamp collection the engine holds.
TARSEL_API void tarsel_free_all_stamp_collections();

// Shuts down the engine's helper applications.
TARSEL_API void tarsel_shutdown_apps();

// Renders one frame of an instance into `dest`. Returns 1 on success, 0 on
// failure (with an Err_Error message saying why); an abort request ends it
// with TarselAbortException. The parameter values are the instance's own, as
// they stand when the call is made.
TARSEL_API int render_tarsel_effect_to_native_image(
    EffectGlobals_t *instance,        // the instance
    const char *descriptor,           // name of the instance's descriptor to render; null or "": effect_genotype
    RawImage dest,                    // destination pixels, described by rasters[0]
    int frame,                        // frame number
    int field,                        // 0 whole frame; 1 first field (even lines), 2 second field (odd lines):
                                      // the other lines are left untouched
    int downsample,                   // resolution factor of the render (1, 2, 4 ...): lengths in pixels
                                      // (radius, size, position) are divided by it
    int quality,                      // 0 draft, 1 normal, 2 best
    T_RasterInfo **rasters,           // [0] describes the destination, [1..] the inputs
    RawImage *images,                 // [0] the previous output frame (for effects that read it, else null),
                                      // [1..] the input pixels; null for an unconnected input
    float mix,                        // blend of the result over input 1: 1 the effect only, 0 the input unchanged
    int n_rasters,                    // entries of rasters and of images (at least 1)
    float pixel_aspect,               // pixel width over height; 0: square pixels
    int n_threads,                    // worker threads to use; 0: all
    int seed,                         // seed of effects with grain
    int flags,                        // bit 0: clear the destination to transparent first;
                                      // bit 1: keep the destination's existing alpha
    int frame_rate,                   // frames per second, for effects that think in seconds; 0: 25
    bool premultiplied,               // inputs and result carry colour premultiplied by alpha
    const char *input_colorspace,     // "linear" or "srgb" (null or "": linear): the inputs' colour space
    const char *output_colorspace,    // the same for the result
    const char *working_colorspace);  // the same for the space the effect computes in

// Renders the instance's lens flare (its flare or glare parameter) lit at
// (center_x, center_y) over a background into `dest`; true on success, false
// (with an Err_Error message) on failure. Conventions as for
// render_tarsel_effect_to_native_image.
TARSEL_API bool render_tarsel_lensflare_to_native_image(
    EffectGlobals_t *instance,       // the instance
    const char *descriptor,          // name of the instance's descriptor to draw; null or "": effect_genotype
    float center_x,                  // flare centre, in destination pixels from its left edge
    float center_y,                  // flare centre, in destination pixels from its top line
    RawImage dest,                   // destination pixels, described by rasters[0]
    int frame,                       // frame number
    int field,                       // 0 whole frame; 1 even lines, 2 odd lines
    int downsample,                  // resolution factor of the render (1, 2, 4 ...)
    int quality,                     // 0 draft, 1 normal, 2 best
    T_RasterInfo **rasters,          // [0] describes the destination, [1] the background
    RawImage *images,                // [0] the previous output frame or null, [1] the background or null
                                     // (transparent)
    float brightness,                // overall brightness factor
    int n_rasters,                   // entries of rasters and of images (at least 1)
    float pixel_aspect,              // pixel width over height; 0: square pixels
    int n_threads,                   // worker threads to use; 0: all
    int seed,                        // seed of effects with grain
    const char *input_colorspace,    // "linear" or "srgb" (null or "": linear): the background's colour space
    const char *output_colorspace,   // the same for the result
    const char *working_colorspace,  // the same for the space the flare is drawn in
    bool premultiplied);             // background and result carry colour premultiplied by alpha

// Loads a flare texture from a PNG file (8 or 16 bits, grey, grey and alpha,
// RGB or RGBA); returns its index (0, 1, ... in the order textures are
// added), or -1 (see tarsel_get_flare_texture_error).
TARSEL_API int tarsel_load_flare_texture(const char *path);

// Why the last flare-texture call of the calling thread failed, engine-owned;
// null when it succeeded.
TARSEL_API const char *tarsel_get_flare_texture_error();

// Adds a flare texture copied from caller pixels: xsize by ysize pixels of
// n_channels (1 grey, 2 grey and alpha, 3 RGB, 4 RGBA) channels of
// bytes_per_channel bytes (1, 2, or 4 for float), lines top to bottom without
// padding. Returns its index, or -1.
TARSEL_API int tarsel_register_flare_texture(int xsize, int ysize, int n_channels, int bytes_per_channel,
                                             RawImage pixels);

// Describes texture `index` through the outputs (each may be null); n_bytes
// is the size of its pixels. Returns 0, or -1 for an unknown index.
TARSEL_API int tarsel_get_texture_info(int index, int *xsize, int *ysize, int *n_channels, int *bytes_per_channel,
                                       size_t *n_bytes);

// Copies min(dest_size, n_bytes) bytes of texture `index`'s pixels into dest;
// returns the number copied, or -1 for an unknown index.
TARSEL_API int tarsel_get_texture_pixels(int index, void *dest, size_t dest_size);

// Empties the flare-texture store; indices start again at 0.
TARSEL_API void tarsel_free_all_flare_textures();
