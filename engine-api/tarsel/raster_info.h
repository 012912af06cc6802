// Descriptions of pixel buffers and of render geometry.
#pragma once

#include <cstddef>

#include "tarsel/export.h"
#include "tarsel/limits.h"

// Channel set of an image.
enum T_RasterType : int {
  raster_unknown = 0,  // not set
  raster_rgb = 1,      // red, green, blue
  raster_rgba = 2,     // red, green, blue, alpha
  raster_a = 3,        // alpha only
  raster_rgbaz = 4,    // red, green, blue, alpha, depth
  raster_l = 5,        // luminance
  raster_la = 6,       // luminance, alpha
  raster_ntypes = 7    // number of channel sets
};

// Memory layout of one pixel: channel order in memory and bits per channel
// (f: 32-bit float, 16f: 16-bit float, z: added depth channel). The values 16
// and 27 are engine-internal formats without a public name; they stay
// reserved so that stored values keep their meaning.
enum T_PixelType : int {
  pixel_unknown = 0,  // not set
  pixel_a8 = 1,       // alpha, 8 bits
  pixel_rgb8 = 2,     // R G B, 8 bits
  pixel_bgr8 = 3,     // B G R, 8 bits
  pixel_rgba8 = 4,    // R G B A, 8 bits
  pixel_bgra8 = 5,    // B G R A, 8 bits
  pixel_argb8 = 6,    // A R G B, 8 bits
  pixel_a16 = 7,      // alpha, 16 bits
  pixel_rgb16 = 8,    // R G B, 16 bits
  pixel_rgba16 = 9,   // R G B A, 16 bits
  pixel_bgra16 = 10,  // B G R A, 16 bits
  pixel_argb16 = 11,  // A R G B, 16 bits
  pixel_af = 12,      // alpha, float
  pixel_rgbf = 13,    // R G B, float
  pixel_rgbaf = 14,   // R G B A, float
  pixel_argbf = 15,   // A R G B, float
  // 16: engine-internal
  pixel_rgba16z = 17,  // R G B A, 16 bits, with depth
  pixel_l8 = 18,       // luminance, 8 bits
  pixel_l16 = 19,      // luminance, 16 bits
  pixel_lf = 20,       // luminance, float
  pixel_la8 = 21,      // luminance and alpha, 8 bits
  pixel_la16 = 22,     // luminance and alpha, 16 bits
  pixel_laf = 23,      // luminance and alpha, float
  pixel_rgb10 = 24,    // R G B, 10 bits
  pixel_rgb16f = 25,   // R G B, half float
  pixel_rgba16f = 26,  // R G B A, half float
  // 27: engine-internal
  pixel_a16f = 28,   // alpha, half float
  pixel_ntypes = 29  // one past the largest pixel layout
};

// Alpha handling of the native-image conversions, as option and as result.
enum T_RgbaHandling : int {
  RGBA_NONE = 0,             // no alpha handling
  RGBA_OK = 1,               // alpha is usable as it is
  RGBA_COPY_ALPHA = 2,       // alpha is copied
  RGBA_SET_ALPHA_TO_ONE = 3  // alpha is set to fully opaque
};

// Description of one pixel buffer: 104 bytes of 32-bit fields. Its memory
// image is also its serial form, so every word, the reserved ones included,
// is carried through copies as it is.
struct T_RasterInfo {
  int ds_xsize;                          // offset 0: stored width in pixels (after downsampling)
  int ds_ysize;                          // offset 4: stored height in pixels
  int x_origin;                          // offset 8: horizontal position of the first pixel in the frame
  int y_origin;                          // offset 12: vertical position of the first pixel in the frame
  int world_xsize;                       // offset 16: width of the whole frame
  int world_ysize;                       // offset 20: height of the whole frame
  T_PixelType pixel_type;                // offset 24: memory layout of one pixel
  int reserved_28;                       // offset 28: engine word
  int bit_depth;                         // offset 32: bits per channel
  T_RasterType raster_type;              // offset 36: channel set
  int sizeof_pixel;                      // offset 40: bytes per pixel
  int clamp_p;                           // offset 44: non-zero: values clamped to the legal range
  int res_factor;                        // offset 48: resolution factor relative to the frame
  int downsample_offset;                 // offset 52: offset used when downsampled
  int extra_line_stride_elts;            // offset 56: padding elements at the end of each line
  float background_pixel[MAX_CHANNELS];  // offset 60: background colour, one float per channel
  int reserved_76;                       // offset 76: engine word
  int flip_y_p;                          // offset 80: non-zero: lines stored bottom-up
  int levels_601_p;                      // offset 84: non-zero: Rec. 601 video levels
  int is_premultiplied;                  // offset 88: non-zero: colour premultiplied by alpha
  int reserved_92;                       // offset 92: engine word
  float x_origin_float;                  // offset 96: sub-pixel horizontal origin
  float y_origin_float;                  // offset 100: sub-pixel vertical origin
};

// Geometry of one render: full frame, crop window, downsampled crop window, scale.
struct T_RenderInfo {
  int full_x1;            // offset 0: left edge of the full frame
  int full_y1;            // offset 4: first line of the full frame
  int full_xsize;         // offset 8: width of the full frame
  int full_ysize;         // offset 12: height of the full frame
  int crop_x1;            // offset 16: left edge of the crop window
  int crop_y1;            // offset 20: first line of the crop window
  int crop_xsize;         // offset 24: width of the crop window
  int crop_ysize;         // offset 28: height of the crop window
  int ds_crop_x1;         // offset 32: left edge of the downsampled crop window
  int ds_crop_y1;         // offset 36: first line of the downsampled crop window
  int ds_crop_xsize;      // offset 40: width of the downsampled crop window
  int ds_crop_ysize;      // offset 44: height of the downsampled crop window
  double pixel_scale;     // offset 48: overall pixel scale
  double x_pixel_scale;   // offset 56: horizontal pixel scale
  double y_pixel_scale;   // offset 64: vertical pixel scale
  int res_factor;         // offset 72: resolution factor
  int downsample_offset;  // offset 76: downsampling offset
};

// Start address of a caller's pixel buffer.
typedef void *RawImage;

// Fills `info` for its current pixel_type and an image of xsize by ysize
// pixels: ds and world sizes, origin 0, bit_depth, raster_type, sizeof_pixel,
// res_factor 1 and clamp_p (set for integer layouts); the other fields are
// left as they are. Returns the image's size in bytes (ysize lines of xsize
// pixels plus the extra_line_stride_elts elements of padding already set),
// or 0 for a pixel type the engine does not support, a negative size or a
// size that an int cannot hold.
TARSEL_API int make_tarsel_raster_info(T_RasterInfo *info, int xsize, int ysize);

static_assert(sizeof(T_RasterType) == 4 && sizeof(T_PixelType) == 4, "raster enumerations are 32-bit");
static_assert(sizeof(T_RasterInfo) == 104, "T_RasterInfo is 104 bytes");
static_assert(alignof(T_RasterInfo) == 4, "T_RasterInfo is 4-byte aligned");
static_assert(offsetof(T_RasterInfo, ds_xsize) == 0, "T_RasterInfo::ds_xsize at 0");
static_assert(offsetof(T_RasterInfo, ds_ysize) == 4, "T_RasterInfo::ds_ysize at 4");
static_assert(offsetof(T_RasterInfo, x_origin) == 8, "T_RasterInfo::x_origin at 8");
static_assert(offsetof(T_RasterInfo, y_origin) == 12, "T_RasterInfo::y_origin at 12");
static_assert(offsetof(T_RasterInfo, world_xsize) == 16, "T_RasterInfo::world_xsize at 16");
static_assert(offsetof(T_RasterInfo, world_ysize) == 20, "T_RasterInfo::world_ysize at 20");
static_assert(offsetof(T_RasterInfo, pixel_type) == 24, "T_RasterInfo::pixel_type at 24");
static_assert(offsetof(T_RasterInfo, reserved_28) == 28, "T_RasterInfo::reserved_28 at 28");
static_assert(offsetof(T_RasterInfo, bit_depth) == 32, "T_RasterInfo::bit_depth at 32");
static_assert(offsetof(T_RasterInfo, raster_type) == 36, "T_RasterInfo::raster_type at 36");
static_assert(offsetof(T_RasterInfo, sizeof_pixel) == 40, "T_RasterInfo::sizeof_pixel at 40");
static_assert(offsetof(T_RasterInfo, clamp_p) == 44, "T_RasterInfo::clamp_p at 44");
static_assert(offsetof(T_RasterInfo, res_factor) == 48, "T_RasterInfo::res_factor at 48");
static_assert(offsetof(T_RasterInfo, downsample_offset) == 52, "T_RasterInfo::downsample_offset at 52");
static_assert(offsetof(T_RasterInfo, extra_line_stride_elts) == 56, "T_RasterInfo::extra_line_stride_elts at 56");
static_assert(offsetof(T_RasterInfo, background_pixel) == 60, "T_RasterInfo::background_pixel at 60");
static_assert(offsetof(T_RasterInfo, reserved_76) == 76, "T_RasterInfo::reserved_76 at 76");
static_assert(offsetof(T_RasterInfo, flip_y_p) == 80, "T_RasterInfo::flip_y_p at 80");
static_assert(offsetof(T_RasterInfo, levels_601_p) == 84, "T_RasterInfo::levels_601_p at 84");
static_assert(offsetof(T_RasterInfo, is_premultiplied) == 88, "T_RasterInfo::is_premultiplied at 88");
static_assert(offsetof(T_RasterInfo, reserved_92) == 92, "T_RasterInfo::reserved_92 at 92");
static_assert(offsetof(T_RasterInfo, x_origin_float) == 96, "T_RasterInfo::x_origin_float at 96");
static_assert(offsetof(T_RasterInfo, y_origin_float) == 100, "T_RasterInfo::y_origin_float at 100");

static_assert(sizeof(T_RenderInfo) == 80, "T_RenderInfo is 80 bytes");
static_assert(offsetof(T_RenderInfo, full_x1) == 0, "T_RenderInfo::full_x1 at 0");
static_assert(offsetof(T_RenderInfo, full_y1) == 4, "T_RenderInfo::full_y1 at 4");
static_assert(offsetof(T_RenderInfo, full_xsize) == 8, "T_RenderInfo::full_xsize at 8");
static_assert(offsetof(T_RenderInfo, full_ysize) == 12, "T_RenderInfo::full_ysize at 12");
static_assert(offsetof(T_RenderInfo, crop_x1) == 16, "T_RenderInfo::crop_x1 at 16");
static_assert(offsetof(T_RenderInfo, crop_y1) == 20, "T_RenderInfo::crop_y1 at 20");
static_assert(offsetof(T_RenderInfo, crop_xsize) == 24, "T_RenderInfo::crop_xsize at 24");
static_assert(offsetof(T_RenderInfo, crop_ysize) == 28, "T_RenderInfo::crop_ysize at 28");
static_assert(offsetof(T_RenderInfo, ds_crop_x1) == 32, "T_RenderInfo::ds_crop_x1 at 32");
static_assert(offsetof(T_RenderInfo, ds_crop_y1) == 36, "T_RenderInfo::ds_crop_y1 at 36");
static_assert(offsetof(T_RenderInfo, ds_crop_xsize) == 40, "T_RenderInfo::ds_crop_xsize at 40");
static_assert(offsetof(T_RenderInfo, ds_crop_ysize) == 44, "T_RenderInfo::ds_crop_ysize at 44");
static_assert(offsetof(T_RenderInfo, pixel_scale) == 48, "T_RenderInfo::pixel_scale at 48");
static_assert(offsetof(T_RenderInfo, x_pixel_scale) == 56, "T_RenderInfo::x_pixel_scale at 56");
static_assert(offsetof(T_RenderInfo, y_pixel_scale) == 64, "T_RenderInfo::y_pixel_scale at 64");
static_assert(offsetof(T_RenderInfo, res_factor) == 72, "T_RenderInfo::res_factor at 72");
static_assert(offsetof(T_RenderInfo, downsample_offset) == 76, "T_RenderInfo::downsample_offset at 76");
