// Drawing flare elements as light. Each light source draws every element of
// a flare on the axis from the source through the frame's centre (flare.h):
// the drawn kinds from their cached stamps, textures from the texture store,
// each scaled to the element's radius and coloured by the element, the
// source and the overall brightness. The light is added to a background.
#pragma once

#include <vector>

#include "catalogue/flare.h"
#include "rendering/image.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {

struct FlareLight {
  double x = 0.0, y = 0.0;               // frame position
  float colour[3] = {1.0f, 1.0f, 1.0f};  // the source's colour and strength
};

struct FlareLook {
  std::vector<FlareElement> elements;
  double scale = 1.0;     // multiplies every element's size
  double rotation = 0.0;  // turns every element, in degrees
  float brightness = 1.0f;
};

// The elements of a flare parameter's text (none when it does not read).
std::vector<FlareElement> flare_elements(const std::string &text);

// Adds the light of `look` drawn for every source to `background` into `out`.
// Must be called on the render's calling thread: it fetches stamps and
// textures and reports missing textures (one Err_Warning each).
void draw_flares(const KernelContext &ctx, const std::vector<FlareLight> &lights, const FlareLook &look,
                 const WorkImage &background, WorkImage &out);

}  // namespace tarsel_ref
