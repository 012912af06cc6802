// Descriptor services: filling a descriptor for a size, and the frame area a
// buffer covers.
#include <climits>

#include "rendering/image_utils.h"
#include "rendering/pixels.h"

namespace tarsel_ref {

int fill_raster_info(T_RasterInfo *info, int xsize, int ysize) {
  if (!info) return 0;
  const tarsel_ref::PixelLayout *layout = tarsel_ref::pixel_layout(info->pixel_type);
  if (!layout || xsize < 0 || ysize < 0) return 0;
  const std::size_t bytes = tarsel_ref::image_bytes(*layout, xsize, ysize, info->extra_line_stride_elts);
  const bool empty = xsize == 0 || ysize == 0;
  if ((bytes == 0 && !empty) || bytes > static_cast<std::size_t>(INT_MAX) || info->extra_line_stride_elts < 0) return 0;
  info->ds_xsize = info->world_xsize = xsize;
  info->ds_ysize = info->world_ysize = ysize;
  info->x_origin = info->y_origin = 0;
  info->bit_depth = layout->bit_depth;
  info->raster_type = layout->raster_type;
  info->sizeof_pixel = layout->pixel_size();
  info->res_factor = 1;
  if (layout->integer()) info->clamp_p = 1;
  return static_cast<int>(bytes);
}

void native_image_dims(T_RasterInfo *info, int *out_xsize, int *out_ysize) {
  long long x = 0, y = 0;
  if (info) {
    const long long factor = info->res_factor == 0 ? 1 : info->res_factor;
    x = static_cast<long long>(info->ds_xsize) * factor;
    y = static_cast<long long>(info->ds_ysize) * factor;
  }
  auto narrow = [](long long v) { return static_cast<int>(v > INT_MAX ? INT_MAX : v < INT_MIN ? INT_MIN : v); };
  if (out_xsize) *out_xsize = narrow(x);
  if (out_ysize) *out_ysize = narrow(y);
}

}  // namespace tarsel_ref
