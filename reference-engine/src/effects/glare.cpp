// Glare: star-shaped streaks around the brightest points of the input, as a
// camera's aperture draws them.
#include <algorithm>
#include <cmath>
#include <vector>

#include "catalogue/catalogue.h"
#include "core/abort.h"
#include "rendering/kernels/flare_draw.h"
#include "rendering/kernels/kernel.h"
#include "rendering/pixels.h"

namespace tarsel_ref {
namespace {

// The kernel: the brightest points of the source each draw the glare's elements
// (stars and streaks around them, turned by the rotation and sized by the
// size), in the point's colour and by how far it exceeds the threshold.
//
// Points are found on a grid: each cell's brightest pixel above the
// threshold is a candidate, and it draws when it is brighter than the
// candidates of the eight cells around it. The brightest few draw.
// Points drawn at most, and the grid's cell size in full-resolution pixels.
constexpr std::size_t kMaxPoints = 48;
constexpr double kCellSize = 32.0;

struct Candidate {
  float strength = 0.0f;
  int x = 0, y = 0;
  float colour[3] = {0.0f, 0.0f, 0.0f};
};

// Cell order breaks ties, so the choice never depends on timing.
bool brighter(const Candidate &a, int ia, const Candidate &b, int ib) {
  return a.strength > b.strength || (a.strength == b.strength && ia < ib);
}

int render_glare(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const float threshold = std::clamp(p.number("threshold"), 0.0f, 1.0f);
  const WorkImage &src = ctx.input(0);
  const int cell = std::max(4, static_cast<int>(std::lround(ctx.length(kCellSize))));
  const int gw = (ctx.width + cell - 1) / cell, gh = (ctx.height + cell - 1) / cell;
  std::vector<Candidate> grid(static_cast<std::size_t>(gw) * static_cast<std::size_t>(gh));

  run_rows(gh, ctx.n_threads, [&](int gy) {
    Candidate *line = grid.data() + static_cast<std::size_t>(gy) * static_cast<std::size_t>(gw);
    const int y1 = std::min(ctx.height, (gy + 1) * cell);
    for (int y = gy * cell; y < y1; ++y) {
      throw_if_aborted();
      const float *s = src.row(y);
      for (int x = 0; x < ctx.width; ++x) {
        const float *px = s + x * 4;
        const float luma = kLumaR * px[0] + kLumaG * px[1] + kLumaB * px[2];
        if (!(luma > threshold)) continue;
        const float strength = (luma - threshold) / std::max(1.0f - threshold, 1e-3f);
        Candidate &c = line[x / cell];
        if (strength > c.strength) {
          c.strength = strength;
          c.x = x;
          c.y = y;
          for (int k = 0; k < 3; ++k) c.colour[k] = luma > 0.0f ? px[k] / luma : 0.0f;
        }
      }
    }
  });

  std::vector<int> peaks;
  for (int gy = 0; gy < gh; ++gy)
    for (int gx = 0; gx < gw; ++gx) {
      const int i = gy * gw + gx;
      const Candidate &c = grid[static_cast<std::size_t>(i)];
      if (c.strength <= 0.0f) continue;
      bool peak = true;
      for (int ny = std::max(0, gy - 1); peak && ny <= std::min(gh - 1, gy + 1); ++ny)
        for (int nx = std::max(0, gx - 1); nx <= std::min(gw - 1, gx + 1); ++nx) {
          const int j = ny * gw + nx;
          if (j != i && brighter(grid[static_cast<std::size_t>(j)], j, c, i)) {
            peak = false;
            break;
          }
        }
      if (peak) peaks.push_back(i);
    }
  std::sort(peaks.begin(), peaks.end(), [&](int a, int b) {
    return brighter(grid[static_cast<std::size_t>(a)], a, grid[static_cast<std::size_t>(b)], b);
  });
  if (peaks.size() > kMaxPoints) peaks.resize(kMaxPoints);

  std::vector<FlareLight> lights;
  for (int i : peaks) {
    const Candidate &c = grid[static_cast<std::size_t>(i)];
    FlareLight light;
    light.x = ctx.x0 + c.x + 0.5;
    light.y = ctx.y0 + c.y + 0.5;
    for (int k = 0; k < 3; ++k) light.colour[k] = c.colour[k] * std::min(c.strength, 4.0f);
    lights.push_back(light);
  }
  FlareLook look;
  look.elements = flare_elements(p.text("glare"));
  look.scale = std::max(0.0f, p.number("size"));
  look.rotation = p.number("rotation");
  draw_flares(ctx, lights, look, src, out);
  return kWrote;
}

DescriptorDefinition glare() {
  DescriptorDefinition d;
  d.name = "Glare";
  d.kernel = render_glare;
  d.popup_name = "Glare";
  d.inputs = {{"Source", "src"}};
  d.node_flags = kNodeDrawsFlare;
  d.flare_param = "glare";
  d.params = {
      float_param("Threshold", "threshold", 0.9f).bounds(0.0f, 1.0f).shown_as(format_percent, 100.0f),
      float_param("Size", "size", 0.2f).bounds(0.0f, 2.0f),
      float_param("Rotation", "rotation", 0.0f).shown_as(format_angle).sliders(-180.0f, 180.0f),
      flare_param("Glare", "glare", "star 0.4 1 0 1 1 1; streak 0.8 0.6 0 0.9 0.95 1", true),
  };
  return d;
}

}  // namespace

const PluginDefinition &glare_plugin() {
  static const PluginDefinition plugin{"T_Glare", "Light", false, false, {glare()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
