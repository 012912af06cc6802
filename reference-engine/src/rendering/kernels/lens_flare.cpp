// Lens Flare: the flare parameter's elements lit from the position (a point
// of the frame given in fractions of its size), at the brightness and scale
// the parameters set, over the background. The lens-flare render call draws
// the same way from the point and brightness it is given.
#include <algorithm>

#include "catalogue/param_store.h"
#include "rendering/kernels/flare_draw.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {

int render_lens_flare(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  FlareLight light;
  light.x = p.number("position", 0) * ctx.frame_width;
  light.y = p.number("position", 1) * ctx.frame_height;
  FlareLook look;
  look.elements = flare_elements(p.text("flare"));
  look.scale = std::max(0.0f, p.number("scale"));
  look.brightness = std::max(0.0f, p.number("brightness"));
  draw_flares(ctx, {light}, look, ctx.input(0), out);
  return kWrote;
}

// The flare or glare parameter of whichever descriptor is drawn; its scale
// and rotation parameters apply when it has them.
int render_flare_call(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  FlareLight light;
  light.x = ctx.flare_call->center_x;
  light.y = ctx.flare_call->center_y;
  FlareLook look;
  if (const Param *flare = ctx.genotype->flare_param) {
    const char *text = store_of(*flare).text;
    look.elements = flare_elements(text ? text : "");
  }
  if (p.has("scale")) look.scale = std::max(0.0f, p.number("scale"));
  if (p.has("rotation")) look.rotation = p.number("rotation");
  look.brightness = ctx.flare_call->brightness;
  draw_flares(ctx, {light}, look, ctx.input(0), out);
  return kWrote;
}

}  // namespace tarsel_ref
