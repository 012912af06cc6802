// Repeated box blurs, the engine's Gaussian: n passes of a box of the right
// width have the Gaussian's spread and approach its shape as n grows, at a
// cost that does not depend on the radius. Horizontal passes run line by
// line, vertical ones on strips of columns going down the image, so that each
// pass is a running sum whatever the radius; sums are kept in double, which
// also makes the result the same however the work is shared out.
#pragma once

#include "rendering/image.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {

// What lies beyond the image's edges.
enum class Edge {
  transparent,  // nothing
  repeat,       // the edge pixels, repeated
  mirror,       // the image reflected
};

struct BoxBlur {
  double radius_x = 0.0, radius_y = 0.0;  // box radius per pass, in pixels
  int passes = 3;
  bool whole_pixels = false;  // round radii to whole pixels (draft)
  double bias = 0.0;          // -1..1: moves the box's weight to one side
  Edge edge = Edge::transparent;
};

// Box radius that `passes` passes need to spread like a Gaussian of
// standard deviation `sigma`.
double box_radius_for_sigma(double sigma, int passes);

// Blurs `src` into `dst`, which have the same size (and may be one image).
void box_blur(const KernelContext &ctx, const WorkImage &src, WorkImage &dst, const BoxBlur &blur);

}  // namespace tarsel_ref
