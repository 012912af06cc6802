// The image utilities: resizing, conversion to 8-bit BGRA for display,
// compositing over a background, and the raster descriptor services. Each
// reports a refused call as an Err_Error message naming its entry point.
#pragma once

#include <cstddef>

#include "tarsel/effect_globals.h"
#include "tarsel/raster_info.h"

namespace tarsel_ref {

size_t resized_image_size(T_RasterInfo *src_info, int new_xsize, int new_ysize, int pixel_type, int extra_line_elts,
                          float scale);
void resize_image(T_RasterInfo *src_info, RawImage src, int new_xsize, int new_ysize, int pixel_type,
                  int extra_line_elts, float scale, T_RasterInfo *dst_info, RawImage dst, int filter, float x_offset,
                  float y_offset, float sharpness, int *out_xsize, int *out_ysize);
void convert_to_bgra(T_RasterInfo *src_info, RawImage src, RawImage dst, int alpha_mode, int dither, int flip,
                     const char *src_colorspace, const char *display_colorspace);
void composite_bgra(RawImage image, int xsize, int ysize, int line_bytes, int background_argb, int checker_size);

// Fills the descriptor for an image of that size in its pixel type; the
// image's bytes, or 0 when it cannot describe one.
int fill_raster_info(T_RasterInfo *info, int xsize, int ysize);
void native_image_dims(T_RasterInfo *info, int *out_xsize, int *out_ysize);

}  // namespace tarsel_ref
