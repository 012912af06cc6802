// Services on native images (pixel buffers described by a T_RasterInfo).
#pragma once

#include <cstddef>

#include "tarsel/effect_globals.h"
#include "tarsel/export.h"
#include "tarsel/raster_info.h"

// Resizes the source region (src_x, src_y, src_xsize, src_ysize) of `src` by
// `scale` into `dst`; writes the size of the result through out_xsize and out_ysize.
TARSEL_API void tarsel_resize_native_image(T_RasterInfo *src_info, RawImage src,
                                           int src_x, int src_y, int src_xsize, int src_ysize, float scale,
                                           T_RasterInfo *dst_info, RawImage dst,
                                           int filter, float x_offset, float y_offset, float blur,
                                           int *out_xsize, int *out_ysize);

// Byte size that tarsel_resize_native_image needs for its destination.
TARSEL_API size_t tarsel_get_resized_image_size(T_RasterInfo *src_info,
                                                int src_x, int src_y, int src_xsize, int src_ysize, float scale,
                                                int dst_pixel_type);

// Converts a native image to 8-bit BGRA for display.
TARSEL_API void tarsel_convert_to_bgra_8(EffectGlobals_t *globals, T_RasterInfo *src_info,
                                         RawImage src, RawImage dst,
                                         int dst_line_stride, int rgba_handling, int flags,
                                         const char *src_colorspace, const char *display_colorspace);

// Composites an 8-bit BGRA image in place over its background.
TARSEL_API void tarsel_comp_bgra_8(RawImage image, int xsize, int ysize, int line_stride,
                                   int background, int mode);

// Width and height of the image a descriptor describes.
TARSEL_API void tarsel_get_native_image_dims(T_RasterInfo *info, int *xsize, int *ysize);
