// image_utils.h: resizing, converting and compositing images.
#include "core/entry.h"
#include "rendering/image_utils.h"
#include "tarsel/image_utils.h"

size_t tarsel_get_resized_image_size(T_RasterInfo *src_info, int new_xsize, int new_ysize, int pixel_type,
                                     int extra_line_elts, float scale, int flags) {
  auto scope = tarsel_ref::enter("tarsel_get_resized_image_size", static_cast<const void *>(src_info), new_xsize,
                                 new_ysize, pixel_type, extra_line_elts, scale, flags);
  return tarsel_ref::resized_image_size(src_info, new_xsize, new_ysize, pixel_type, extra_line_elts, scale);
}

void tarsel_resize_native_image(T_RasterInfo *src_info, RawImage src, int new_xsize, int new_ysize, int pixel_type,
                                int extra_line_elts, float scale, T_RasterInfo *dst_info, RawImage dst, int filter,
                                float x_offset, float y_offset, float sharpness, int *out_xsize, int *out_ysize) {
  auto scope =
      tarsel_ref::enter("tarsel_resize_native_image", static_cast<const void *>(src_info),
                        static_cast<const void *>(src), new_xsize, new_ysize, pixel_type, extra_line_elts, scale,
                        static_cast<const void *>(dst_info), static_cast<const void *>(dst), filter, x_offset, y_offset,
                        sharpness, static_cast<const void *>(out_xsize), static_cast<const void *>(out_ysize));
  tarsel_ref::resize_image(src_info, src, new_xsize, new_ysize, pixel_type, extra_line_elts, scale, dst_info, dst,
                           filter, x_offset, y_offset, sharpness, out_xsize, out_ysize);
}

void tarsel_convert_to_bgra_8(EffectGlobals_t *instance, T_RasterInfo *src_info, RawImage src, RawImage dst,
                              int alpha_mode, int dither, int flip, const char *src_colorspace,
                              const char *display_colorspace) {
  auto scope =
      tarsel_ref::enter("tarsel_convert_to_bgra_8", static_cast<const void *>(instance),
                        static_cast<const void *>(src_info), static_cast<const void *>(src),
                        static_cast<const void *>(dst), alpha_mode, dither, flip, src_colorspace, display_colorspace);
  tarsel_ref::convert_to_bgra(src_info, src, dst, alpha_mode, dither, flip, src_colorspace, display_colorspace);
}

void tarsel_comp_bgra_8(RawImage image, int xsize, int ysize, int line_bytes, int background_argb, int checker_size) {
  auto scope = tarsel_ref::enter("tarsel_comp_bgra_8", static_cast<const void *>(image), xsize, ysize, line_bytes,
                                 background_argb, checker_size);
  tarsel_ref::composite_bgra(image, xsize, ysize, line_bytes, background_argb, checker_size);
}

void tarsel_get_native_image_dims(T_RasterInfo *info, int *out_xsize, int *out_ysize) {
  auto scope = tarsel_ref::enter("tarsel_get_native_image_dims", static_cast<const void *>(info),
                                 static_cast<const void *>(out_xsize), static_cast<const void *>(out_ysize));
  tarsel_ref::native_image_dims(info, out_xsize, out_ysize);
}
