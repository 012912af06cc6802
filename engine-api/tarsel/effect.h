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

// Renders one frame of an instance into `dest`. `input_infos` and `inputs`
// hold one entry per input (null entries for unconnected inputs, null arrays
// for none). Returns non-zero on success. The exact meaning of every argument
// is documented with the engine's render implementation.
TARSEL_API int render_tarsel_effect_to_native_image(
    EffectGlobals_t *globals,         // the instance
    const char *param_values,         // the parameter values to render with, as text
    RawImage dest,                    // destination pixels
    int dest_xsize,                   // destination width in pixels
    int dest_ysize,                   // destination height in pixels
    int dest_pixel_type,              // destination pixel layout (a T_PixelType)
    int dest_line_stride,             // destination line length
    T_RasterInfo **input_infos,       // descriptor of each input
    RawImage *inputs,                 // pixels of each input
    float frame_time,                 // the frame to render
    int field,                        // field of an interlaced frame
    float pixel_aspect,               // pixel aspect ratio
    int downsample,                   // downsampling factor
    int quality,                      // render quality
    int n_inputs,                     // entries of input_infos and inputs
    int render_flags,                 // render options
    bool use_gpu,                     // whether the graphics processor may be used
    const char *input_colorspace,     // colour space of the inputs
    const char *output_colorspace,    // colour space of the destination
    const char *working_colorspace);  // colour space the effect works in

// Renders a lens flare centred at (center_x, center_y) into `dest`; true on
// success. Arguments as for render_tarsel_effect_to_native_image.
TARSEL_API bool render_tarsel_lensflare_to_native_image(
    EffectGlobals_t *globals,         // the instance
    const char *param_values,         // the parameter values to render with, as text
    float center_x,                   // horizontal flare position
    float center_y,                   // vertical flare position
    RawImage dest,                    // destination pixels
    int dest_xsize,                   // destination width in pixels
    int dest_ysize,                   // destination height in pixels
    int dest_pixel_type,              // destination pixel layout (a T_PixelType)
    int dest_line_stride,             // destination line length
    T_RasterInfo **input_infos,       // descriptor of each input
    RawImage *inputs,                 // pixels of each input
    float frame_time,                 // the frame to render
    int field,                        // field of an interlaced frame
    float pixel_aspect,               // pixel aspect ratio
    int downsample,                   // downsampling factor
    int n_inputs,                     // entries of input_infos and inputs
    const char *input_colorspace,     // colour space of the inputs
    const char *output_colorspace,    // colour space of the destination
    const char *working_colorspace,   // colour space the flare works in
    bool use_gpu);                    // whether the graphics processor may be used

// Loads a flare texture from an image file; returns its index, or a negative
// value (see tarsel_get_flare_texture_error).
TARSEL_API int tarsel_load_flare_texture(const char *path);

// Text of the last flare-texture failure, engine-owned; null when there is none.
TARSEL_API const char *tarsel_get_flare_texture_error();

// Adds a flare texture copied from caller pixels; returns its index, or a negative value.
TARSEL_API int tarsel_register_flare_texture(int xsize, int ysize, int n_channels, int bytes_per_channel,
                                             RawImage pixels);

// Describes texture `index` through the outputs; returns 0 on success.
TARSEL_API int tarsel_get_texture_info(int index, int *xsize, int *ysize, int *n_channels,
                                       int *bytes_per_channel, size_t *n_bytes);

// Copies texture `index`'s pixels into dest (dest_size bytes); returns 0 on success.
TARSEL_API int tarsel_get_texture_pixels(int index, void *dest, size_t dest_size);

// Empties the flare-texture store.
TARSEL_API void tarsel_free_all_flare_textures();
