// Raster and render descriptors: where a buffer's pixels live and how a render
// is framed. The module creates, reads and writes these records; only the
// engine interprets them.

%{
#include "tarsel/raster_info.h"
#include "tarsel/render_context.h"
%}

// Channel set of an image.
enum T_RasterType {
  raster_unknown = 0,
  raster_rgb = 1,
  raster_rgba = 2,
  raster_a = 3,
  raster_rgbaz = 4,
  raster_l = 5,
  raster_la = 6,
  raster_ntypes = 7
};

// Memory layout of one pixel. 16 and 27 are engine formats without a name
// here; leaving them out keeps every stored value's meaning.
enum T_PixelType {
  pixel_unknown = 0,
  pixel_a8 = 1,
  pixel_rgb8 = 2,
  pixel_bgr8 = 3,
  pixel_rgba8 = 4,
  pixel_bgra8 = 5,
  pixel_argb8 = 6,
  pixel_a16 = 7,
  pixel_rgb16 = 8,
  pixel_rgba16 = 9,
  pixel_bgra16 = 10,
  pixel_argb16 = 11,
  pixel_af = 12,
  pixel_rgbf = 13,
  pixel_rgbaf = 14,
  pixel_argbf = 15,
  pixel_rgba16z = 17,
  pixel_l8 = 18,
  pixel_l16 = 19,
  pixel_lf = 20,
  pixel_la8 = 21,
  pixel_la16 = 22,
  pixel_laf = 23,
  pixel_rgb10 = 24,
  pixel_rgb16f = 25,
  pixel_rgba16f = 26,
  pixel_a16f = 28,
  pixel_ntypes = 29
};

// Alpha handling of the native-image conversions.
enum T_RgbaHandling {
  RGBA_NONE = 0,
  RGBA_OK = 1,
  RGBA_COPY_ALPHA = 2,
  RGBA_SET_ALPHA_TO_ONE = 3
};

// One pixel buffer's description. The three words the binding does not name
// are left out here; they still travel with every copy of the record.
struct T_RasterInfo {
  int ds_xsize;
  int ds_ysize;
  int x_origin;
  int y_origin;
  int world_xsize;
  int world_ysize;
  T_PixelType pixel_type;
  int bit_depth;
  T_RasterType raster_type;
  int sizeof_pixel;
  int clamp_p;
  int res_factor;
  int downsample_offset;
  int extra_line_stride_elts;
%immutable;
  float background_pixel[MAX_CHANNELS];
  int flip_y_p;
  int levels_601_p;
  int is_premultiplied;
  float x_origin_float;
  float y_origin_float;
%mutable;
};

// The geometry of one render: full frame, crop window, downsampled crop window
// and pixel scales. Filled by the engine; read-only from Python.
%immutable;
struct T_RenderInfo {
  int full_x1;
  int full_y1;
  int full_xsize;
  int full_ysize;
  int crop_x1;
  int crop_y1;
  int crop_xsize;
  int crop_ysize;
  int ds_crop_x1;
  int ds_crop_y1;
  int ds_crop_xsize;
  int ds_crop_ysize;
  double pixel_scale;
  double x_pixel_scale;
  double y_pixel_scale;
  int res_factor;
  int downsample_offset;
};
%mutable;

// The engine's render state of one effect instance: an opaque handle that the
// engine creates; Python compares and hashes it by identity.
%nodefaultctor RenderContext;
%record_identity(RenderContext)
class RenderContext {
public:
  virtual ~RenderContext();
};
