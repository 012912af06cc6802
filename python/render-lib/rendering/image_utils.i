// Native-image services of the engine: resizing, the size a resize needs,
// conversion to 8-bit BGRA for display, compositing, dimensions, and filling
// a raster descriptor. The module does no pixel work; buffers go by address
// and are not checked against their descriptors.

%{
#include "tarsel/image_utils.h"
%}

%threadallow tarsel_resize_native_image;
%threadallow tarsel_get_resized_image_size;
%threadallow tarsel_convert_to_bgra_8;
%threadallow tarsel_comp_bgra_8;

// [result width, result height]
%apply int *OUTPUT { int *out_xsize, int *out_ysize };
void tarsel_resize_native_image(T_RasterInfo *src_info, RawImage src, int new_xsize, int new_ysize,
                                int pixel_type, int extra_line_elts, float scale, T_RasterInfo *dst_info,
                                RawImage dst, int filter, float x_offset, float y_offset, float sharpness,
                                int *out_xsize, int *out_ysize);
void tarsel_get_native_image_dims(T_RasterInfo *info, int *out_xsize, int *out_ysize);
%clear int *out_xsize, int *out_ysize;

size_t tarsel_get_resized_image_size(T_RasterInfo *src_info, int new_xsize, int new_ysize, int pixel_type,
                                     int extra_line_elts, float scale, int flags);
void tarsel_convert_to_bgra_8(EffectGlobals_t *instance, T_RasterInfo *src_info, RawImage src, RawImage dst,
                              int alpha_mode, int dither, int flip, char const *src_colorspace,
                              char const *display_colorspace);
void tarsel_comp_bgra_8(RawImage image, int xsize, int ysize, int line_bytes, int background_argb,
                        int checker_size);

// Fills `info` in place for its pixel type and the given size; the engine
// returns the image's byte size.
int make_tarsel_raster_info(T_RasterInfo *info, int xsize, int ysize);
