// raster_info.h: filling a raster descriptor.
#include "core/entry.h"
#include "rendering/image_utils.h"
#include "tarsel/raster_info.h"

int make_tarsel_raster_info(T_RasterInfo *info, int xsize, int ysize) {
  auto scope = tarsel_ref::enter("make_tarsel_raster_info", static_cast<const void *>(info), xsize, ysize);
  return tarsel_ref::fill_raster_info(info, xsize, ysize);
}
