// The two render calls: an effect frame, and a lens flare, into a caller's
// buffer. Both convert their lists with the same typemaps, release the
// interpreter lock around the engine call and keep nothing afterwards.
// docs/reference-engine.md and engine-api/tarsel/effect.h say what each value means.

%{
#include "tarsel/effect.h"
%}

typedef void *RawImage;

%apply T_RasterInfo **RasterInfoList { T_RasterInfo **rasters };
%apply RawImage *RawImageList { RawImage *images };
%apply RawImage RenderDestination { RawImage dest };

%threadallow render_tarsel_effect_to_native_image;
%threadallow render_tarsel_lensflare_to_native_image;

// The engine answers non-zero for a rendered frame.
%render_list_count(8, 9)
bool render_tarsel_effect_to_native_image(EffectGlobals_t *instance, char const *descriptor, RawImage dest,
                                          int frame, int field, int downsample, int quality,
                                          T_RasterInfo **rasters, RawImage *images, float mix, int n_rasters,
                                          float pixel_aspect, int n_threads, int seed, int flags, int frame_rate,
                                          bool premultiplied, char const *input_colorspace,
                                          char const *output_colorspace, char const *working_colorspace);

%render_list_count(10, 11)
bool render_tarsel_lensflare_to_native_image(EffectGlobals_t *instance, char const *descriptor, float center_x,
                                             float center_y, RawImage dest, int frame, int field, int downsample,
                                             int quality, T_RasterInfo **rasters, RawImage *images,
                                             float brightness, int n_rasters, float pixel_aspect, int n_threads,
                                             int seed, char const *input_colorspace,
                                             char const *output_colorspace, char const *working_colorspace,
                                             bool premultiplied);

%clear T_RasterInfo **rasters;
%clear RawImage *images;
%clear RawImage dest;
%clear int n_rasters;
