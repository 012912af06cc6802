#include "rendering/kernels/flare_draw.h"

#include <algorithm>
#include <cmath>
#include <memory>
#include <set>
#include <string>

#include "catalogue/param_store.h"
#include "core/messages.h"
#include "rendering/stamps.h"
#include "rendering/textures.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

constexpr double kPi = 3.14159265358979323846;

// Elements drawn larger than this many pixels across use a finer stamp.
constexpr double kFineStampRadius = 96.0;
constexpr int kFineStampSize = 256;

struct Item {
  double cx, cy;        // centre, destination pixels
  double hx, hy;        // half extents, square units
  double bx, by;        // half extents of the bounding box, pixels
  double cos_t, sin_t;  // rotation
  float colour[3];
  std::shared_ptr<const Stamp> stamp;
  std::shared_ptr<const Texture> texture;
};

float stamp_at(const Stamp &s, double u, double v) {
  const double fx = (u + 1.0) * 0.5 * s.size - 0.5, fy = (v + 1.0) * 0.5 * s.size - 0.5;
  const int x0 = static_cast<int>(std::floor(fx)), y0 = static_cast<int>(std::floor(fy));
  const float tx = static_cast<float>(fx - x0), ty = static_cast<float>(fy - y0);
  auto at = [&](int x, int y) -> float {
    if (x < 0 || y < 0 || x >= s.size || y >= s.size) return 0.0f;
    return s.coverage[static_cast<std::size_t>(y) * static_cast<std::size_t>(s.size) + static_cast<std::size_t>(x)];
  };
  const float top = at(x0, y0) * (1 - tx) + at(x0 + 1, y0) * tx;
  const float bottom = at(x0, y0 + 1) * (1 - tx) + at(x0 + 1, y0 + 1) * tx;
  return top * (1 - ty) + bottom * ty;
}

void texture_at(const Texture &t, double u, double v, float rgb[3]) {
  const double fx = (u + 1.0) * 0.5 * t.xsize - 0.5, fy = (v + 1.0) * 0.5 * t.ysize - 0.5;
  const int x0 = static_cast<int>(std::floor(fx)), y0 = static_cast<int>(std::floor(fy));
  const float tx = static_cast<float>(fx - x0), ty = static_cast<float>(fy - y0);
  const float weights[4] = {(1 - tx) * (1 - ty), tx * (1 - ty), (1 - tx) * ty, tx * ty};
  const int xs[4] = {x0, x0 + 1, x0, x0 + 1}, ys[4] = {y0, y0, y0 + 1, y0 + 1};
  rgb[0] = rgb[1] = rgb[2] = 0.0f;
  for (int k = 0; k < 4; ++k) {
    if (xs[k] < 0 || ys[k] < 0 || xs[k] >= t.xsize || ys[k] >= t.ysize) continue;
    const float *p =
        t.light.data() +
        (static_cast<std::size_t>(ys[k]) * static_cast<std::size_t>(t.xsize) + static_cast<std::size_t>(xs[k])) * 3;
    for (int c = 0; c < 3; ++c) rgb[c] += p[c] * weights[k];
  }
}

std::vector<Item> prepare(const KernelContext &ctx, const std::vector<FlareLight> &lights, const FlareLook &look) {
  const double pa = ctx.pixel_aspect;
  const double diagonal = std::hypot(ctx.frame_width * pa, ctx.frame_height);
  const double centre_x = ctx.frame_width / 2.0, centre_y = ctx.frame_height / 2.0;
  const double angle = look.rotation * kPi / 180.0;
  std::vector<Item> items;
  std::set<int> missing;
  for (const FlareElement &e : look.elements) {
    int index = -1;
    std::shared_ptr<const Texture> texture;
    if (texture_kind(e.kind, &index)) {
      texture = find_texture(index);
      if (!texture) {
        if (missing.insert(index).second)
          emit_message(Err_Warning,
                       ("lens flare: there is no flare texture " + std::to_string(index) + "; its element is not drawn")
                           .c_str());
        continue;
      }
    }
    const double radius = e.size * look.scale * diagonal;
    if (!(radius > 1e-3) || e.brightness <= 0.0f) continue;
    std::shared_ptr<const Stamp> stamp;
    if (!texture) stamp = element_stamp(e.kind, radius > kFineStampRadius ? kFineStampSize : kElementStampSize);
    for (const FlareLight &light : lights) {
      Item item;
      item.cx = (light.x + e.position * (centre_x - light.x)) - ctx.x0;
      item.cy = (light.y + e.position * (centre_y - light.y)) - ctx.y0;
      item.hx = item.hy = radius;
      if (texture) {
        const double longest = std::max(texture->xsize, texture->ysize);
        item.hx = radius * texture->xsize / longest;
        item.hy = radius * texture->ysize / longest;
      }
      item.cos_t = std::cos(angle);
      item.sin_t = std::sin(angle);
      const double reach = angle != 0.0 ? std::hypot(item.hx, item.hy) : 0.0;
      item.bx = (angle != 0.0 ? reach : item.hx) / pa;
      item.by = angle != 0.0 ? reach : item.hy;
      bool lit = false;
      for (int c = 0; c < 3; ++c) {
        item.colour[c] = e.color[c] * e.brightness * light.colour[c] * look.brightness;
        lit = lit || item.colour[c] > 0.0f;
      }
      if (!lit) continue;
      item.stamp = stamp;
      item.texture = texture;
      items.push_back(std::move(item));
    }
  }
  return items;
}

}  // namespace

std::vector<FlareElement> flare_elements(const std::string &text) {
  std::vector<FlareElement> elements;
  parse_flare(text, &elements);
  return elements;
}

void draw_flares(const KernelContext &ctx, const std::vector<FlareLight> &lights, const FlareLook &look,
                 const WorkImage &background, WorkImage &out) {
  const std::vector<Item> items = prepare(ctx, lights, look);
  const double pa = ctx.pixel_aspect;
  ctx.rows([&](int y) {
    std::vector<float> light(static_cast<std::size_t>(ctx.width) * 3, 0.0f);
    const double py = y + 0.5;
    for (const Item &item : items) {
      const double dy = py - item.cy;
      if (std::fabs(dy) >= item.by) continue;
      const int x_begin = std::max(0, static_cast<int>(std::floor(item.cx - item.bx)));
      const int x_end = std::min(ctx.width, static_cast<int>(std::ceil(item.cx + item.bx)) + 1);
      for (int x = x_begin; x < x_end; ++x) {
        const double dx = (x + 0.5 - item.cx) * pa;
        const double u = (dx * item.cos_t + dy * item.sin_t) / item.hx;
        const double v = (-dx * item.sin_t + dy * item.cos_t) / item.hy;
        if (std::fabs(u) >= 1.0 || std::fabs(v) >= 1.0) continue;
        float *l = light.data() + static_cast<std::size_t>(x) * 3;
        if (item.texture) {
          float rgb[3];
          texture_at(*item.texture, u, v, rgb);
          for (int c = 0; c < 3; ++c) l[c] += rgb[c] * item.colour[c];
        } else {
          const float coverage = stamp_at(*item.stamp, u, v);
          if (coverage > 0.0f)
            for (int c = 0; c < 3; ++c) l[c] += coverage * item.colour[c];
        }
      }
    }
    const float *b = background.row(y);
    float *d = out.row(y);
    for (int x = 0; x < ctx.width; ++x) {
      const float *l = light.data() + static_cast<std::size_t>(x) * 3;
      const float *bp = b + x * 4;
      float *dp = d + x * 4;
      for (int c = 0; c < 3; ++c) dp[c] = bp[c] + l[c];
      dp[3] = bp[3] + std::min(std::max({l[0], l[1], l[2]}), 1.0f) * (1.0f - bp[3]);
    }
  });
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
