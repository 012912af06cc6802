// Blur Fast: the source reduced by averaging blocks of pixels, blurred once
// with a single box at the reduced size, and scaled back up bilinearly. Much
// cheaper than the full blur for large radii, at the cost of its smoothness.
#include <algorithm>
#include <cmath>

#include "core/abort.h"
#include "rendering/kernels/box_blur.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {

int render_blur_fast(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const double radius = ctx.length(std::max(0.0f, p.number("radius")));
  const int passes = std::clamp(p.whole("iterations"), 1, 8);
  const bool blur_alpha = p.flag("blur_alpha");
  if (radius <= 0.0) return 0;
  const WorkImage &src = ctx.input(0);
  const int w = ctx.width, h = ctx.height;

  // A block per quarter of the radius keeps several blocks under the box.
  const int k = std::clamp(static_cast<int>(radius / 4.0), 1, 64);
  const int rw = (w + k - 1) / k, rh = (h + k - 1) / k;
  WorkImage small(rw, rh);
  run_rows(rh, ctx.n_threads, [&](int sy) {
    float *d = small.row(sy);
    std::fill(d, d + static_cast<std::size_t>(rw) * 4, 0.0f);
    const int y1 = std::min(h, (sy + 1) * k);
    for (int y = sy * k; y < y1; ++y) {
      throw_if_aborted();
      const float *s = src.row(y);
      for (int x = 0; x < w; ++x)
        for (int c = 0; c < 4; ++c) d[(x / k) * 4 + c] += s[x * 4 + c];
    }
    for (int sx = 0; sx < rw; ++sx) {
      const int cells = (std::min(w, (sx + 1) * k) - sx * k) * (y1 - sy * k);
      for (int c = 0; c < 4; ++c) d[sx * 4 + c] /= static_cast<float>(cells);
    }
  });

  BoxBlur blur;
  blur.passes = passes;
  blur.edge = Edge::repeat;
  const double sigma = radius / 2.0 / k;
  blur.radius_x = box_radius_for_sigma(sigma / ctx.pixel_aspect, passes);
  blur.radius_y = box_radius_for_sigma(sigma, passes);
  KernelContext reduced = ctx;
  reduced.width = rw;
  reduced.height = rh;
  box_blur(reduced, small, small, blur);

  ctx.rows([&](int y) {
    float *d = out.row(y);
    const float *s = src.row(y);
    const double fy = std::clamp((y + 0.5) / k - 0.5, 0.0, static_cast<double>(rh - 1));
    const int y0 = static_cast<int>(fy), y1 = std::min(y0 + 1, rh - 1);
    const float ty = static_cast<float>(fy - y0);
    for (int x = 0; x < w; ++x) {
      const double fx = std::clamp((x + 0.5) / k - 0.5, 0.0, static_cast<double>(rw - 1));
      const int x0 = static_cast<int>(fx), x1 = std::min(x0 + 1, rw - 1);
      const float tx = static_cast<float>(fx - x0);
      for (int c = 0; c < 4; ++c) {
        const float top = small.row(y0)[x0 * 4 + c] * (1 - tx) + small.row(y0)[x1 * 4 + c] * tx;
        const float bottom = small.row(y1)[x0 * 4 + c] * (1 - tx) + small.row(y1)[x1 * 4 + c] * tx;
        d[x * 4 + c] = top * (1 - ty) + bottom * ty;
      }
      if (!blur_alpha) {
        const float a = d[x * 4 + 3], keep = s[x * 4 + 3];
        for (int c = 0; c < 3; ++c) d[x * 4 + c] = a > 0.0f ? d[x * 4 + c] / a * keep : 0.0f;
        d[x * 4 + 3] = keep;
      }
    }
  });
  return kWrote;
}

}  // namespace tarsel_ref
