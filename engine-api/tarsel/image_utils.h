// Services on native images (pixel buffers described by a T_RasterInfo).
#pragma once

#include <cstddef>

#include "tarsel/effect_globals.h"
#include "tarsel/export.h"
#include "tarsel/raster_info.h"

// Resizes `src` with a filter into `dst` (a width or height derived from
// the scale is rounded, and at least 1) and fills dst_info for the result as
// make_tarsel_raster_info does; writes the result's size through out_xsize
// and out_ysize (0 and 0, with an Err_Error message, when it cannot be done).
// Runs on the worker threads and ends with TarselAbortException on an abort.
TARSEL_API void tarsel_resize_native_image(T_RasterInfo *src_info, RawImage src,
                                           int new_xsize,        // width of the result; 0: scale times the source's
                                           int new_ysize,        // height of the result; 0: scale times the source's
                                           int pixel_type,       // pixel layout of the result; 0: the source's
                                           int extra_line_elts,  // padding elements after each line of the result
                                           float scale,          // size factor for a width or height given as 0
                                           T_RasterInfo *dst_info, RawImage dst,
                                           int filter,      // 0 box (area average), 1 bilinear, 2 bicubic
                                           float x_offset,  // sub-pixel shift of the sampling, in source pixels
                                           float y_offset,
                                           float sharpness,  // bicubic only: 0 smooth .. 1 sharp
                                           int *out_xsize, int *out_ysize);

// Byte size that tarsel_resize_native_image needs for its destination with
// the same arguments; 0 when the resize cannot be done.
TARSEL_API size_t tarsel_get_resized_image_size(T_RasterInfo *src_info,
                                                int new_xsize,  // as for tarsel_resize_native_image
                                                int new_ysize, int pixel_type, int extra_line_elts, float scale,
                                                int flags);  // reserved: 0

// Converts a native image to 8-bit BGRA of the same size for display; dst
// lines are xsize * 4 bytes, without padding. The colour is straight (not
// premultiplied). The look-up tables and exposure of set_tarsel_luts apply.
TARSEL_API void tarsel_convert_to_bgra_8(EffectGlobals_t *instance,  // an instance, or null
                                         T_RasterInfo *src_info, RawImage src, RawImage dst,
                                         int alpha_mode,  // a T_RgbaHandling: RGBA_NONE colour with alpha 255,
                                                          // RGBA_OK alpha as stored, RGBA_COPY_ALPHA alpha shown
                                                          // as grey (alpha 255), RGBA_SET_ALPHA_TO_ONE colour with
                                                          // alpha 255
                                         int dither,      // 1: ordered dithering of the 8-bit result
                                         int flip,        // 1: the result upside down
                                         const char *src_colorspace,       // "linear" or "srgb" (null or "": linear)
                                         const char *display_colorspace);  // the same, for the result

// Composites an 8-bit BGRA image (straight colour) in place over a
// background; the result is opaque.
TARSEL_API void tarsel_comp_bgra_8(RawImage image, int xsize, int ysize,
                                   int line_bytes,       // bytes from one line to the next; 0: xsize * 4
                                   int background_argb,  // background colour 0xAARRGGBB (its alpha is not used)
                                   int checker_size);    // 0: solid background; else a checkerboard of cells of
                                                         // this many pixels in the colour and a lighter one

// The frame area the buffer covers, in full-resolution pixels: the stored
// size times res_factor (0 counting as 1). Either output may be null.
TARSEL_API void tarsel_get_native_image_dims(T_RasterInfo *info, int *out_xsize, int *out_ysize);
