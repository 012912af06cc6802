// Where the widgets sit: parameters to frame points, frame points to the
// viewer, and the mouse back to parameter values.
#include <algorithm>
#include <cmath>

#include "callbacks/widgets.h"
#include "catalogue/descriptor.h"
#include "catalogue/flare.h"
#include "catalogue/param_store.h"
#include "catalogue/param_values.h"

namespace tarsel_ref {
namespace widgets {
namespace {

// How a point's two channels place it in the frame.
enum class Placement {
  pixels,           // frame pixels from the top-left corner
  centre_pixels,    // frame pixels from the frame's centre
  fractions,        // fractions of the frame's size from the top-left corner
  centre_fractions  // fractions of the frame's size from the frame's centre
};

Placement placement(const Param &param) {
  switch (param.flags.screen_mode) {
    case screen_mode_screen: return Placement::pixels;
    case screen_mode_screen_center: return Placement::centre_pixels;
    case screen_mode_screen_center_to_norm: return Placement::centre_fractions;
    default: return Placement::fractions;  // normalize, screen_to_norm
  }
}

// The value as the effect reads it at `frame`: counters the engine animates
// add the frame number. (A ramp is per second; these calls know no frame
// rate, so it is taken as it stands.)
void shown_value(const Param &param, int frame, float out[MAX_CHANNELS]) {
  const ParamStore &store = store_of(param);
  const bool counts =
      param.flags.auto_animation_type == auto_anim_floor0 || param.flags.auto_animation_type == auto_anim_floor1;
  const int channels = value_channels(param);
  for (int c = 0; c < MAX_CHANNELS; ++c)
    out[c] = c < channels ? store.value[c] + (counts ? static_cast<float>(frame) : 0.0f) : 0.0f;
}

void frame_point(const Param &param, const View &view, double *fx, double *fy) {
  float v[MAX_CHANNELS];
  shown_value(param, view.frame, v);
  const double w = view.frame_width, h = view.frame_height;
  switch (placement(param)) {
    case Placement::pixels: *fx = v[0], *fy = v[1]; break;
    case Placement::centre_pixels: *fx = w / 2.0 + v[0], *fy = h / 2.0 + v[1]; break;
    case Placement::fractions: *fx = v[0] * w, *fy = v[1] * h; break;
    case Placement::centre_fractions: *fx = (0.5 + v[0]) * w, *fy = (0.5 + v[1]) * h; break;
  }
}

float unit_clamp(float v) { return std::isnan(v) ? 0.0f : std::clamp(v, 0.0f, 1.0f); }

// Multiplier of a flare's element sizes: the descriptor's "scale", or for a
// glare its "size", as the effect draws them; 1 when it has neither.
double flare_size_factor(const Genotype &genotype, const Param &flare, int frame) {
  const Param *factor = find_param(genotype, flare.flags.glare_p ? "size" : "scale");
  if (!factor || !holds_numbers(factor->ptype) || value_channels(*factor) < 1) return 1.0;
  float v[MAX_CHANNELS];
  shown_value(*factor, frame, v);
  return std::isfinite(v[0]) ? std::max(0.0, static_cast<double>(v[0])) : 0.0;
}

void lay_out_flare(const Genotype &genotype, const View &view, Widget &w) {
  double lx = view.frame_width / 2.0, ly = view.frame_height / 2.0;
  for (int i = 0; i < genotype.n_params; ++i)
    if (genotype.params[i] && is_point(*genotype.params[i])) {
      frame_point(*genotype.params[i], view, &lx, &ly);
      break;
    }
  const double cx = view.frame_width / 2.0, cy = view.frame_height / 2.0;
  std::vector<FlareElement> elements;
  const char *text = store_of(*w.param).text;
  parse_flare(text ? text : "", &elements);
  const double radius_unit = std::hypot(view.frame_width, view.frame_height) *
                             flare_size_factor(genotype, *w.param, view.frame) * view.scale_x;
  double first = 0.0, last = 1.0;  // the axis spans the light, the centre and every element
  for (const FlareElement &e : elements) {
    first = std::min(first, static_cast<double>(e.position));
    last = std::max(last, static_cast<double>(e.position));
    const double ex = lx + e.position * (cx - lx), ey = ly + e.position * (cy - ly);
    w.elements.push_back({view.screen_x(ex), view.screen_y(ey), static_cast<float>(e.size * radius_unit)});
  }
  w.x = view.screen_x(lx);
  w.y = view.screen_y(ly);
  w.axis_x = {view.screen_x(lx + first * (cx - lx)), view.screen_x(lx + last * (cx - lx))};
  w.axis_y = {view.screen_y(ly + first * (cy - ly)), view.screen_y(ly + last * (cy - ly))};
}

}  // namespace

bool make_view(int view_xsize, int view_ysize, float view_x, float view_y, float scale_x, float scale_y,
               const std::vector<float> &values, View *view, std::string *error) {
  if (!(std::isfinite(scale_x) && scale_x > 0.0f && std::isfinite(scale_y) && scale_y > 0.0f)) {
    *error = "the view scales must be positive and finite";
    return false;
  }
  if (!std::isfinite(view_x) || !std::isfinite(view_y)) {
    *error = "the view position must be finite";
    return false;
  }
  View v;
  v.view_x = view_x;
  v.view_y = view_y;
  v.scale_x = scale_x;
  v.scale_y = scale_y;
  v.frame_width = values.size() > 0 ? static_cast<double>(values[0]) : view_xsize / v.scale_x;
  v.frame_height = values.size() > 1 ? static_cast<double>(values[1]) : view_ysize / v.scale_y;
  if (!(std::isfinite(v.frame_width) && v.frame_width > 0.0 && std::isfinite(v.frame_height) && v.frame_height > 0.0)) {
    *error = "the frame size must be positive and finite";
    return false;
  }
  const double frame = values.size() > 2 ? static_cast<double>(values[2]) : 0.0;
  if (!std::isfinite(frame) || std::fabs(frame) > 1e9) {
    *error = "the frame number must be finite";
    return false;
  }
  v.frame = static_cast<int>(std::lround(frame));
  *view = v;
  return true;
}

bool is_point(const Param &param) {
  if (param.ptype != ptype_float && param.ptype != ptype_int) return false;
  if (param.n_channels < 2 || param.n_channels_c1 != 2) return false;
  switch (param.flags.screen_mode) {
    case screen_mode_screen:
    case screen_mode_screen_center:
    case screen_mode_normalize:
    case screen_mode_screen_to_norm:
    case screen_mode_screen_center_to_norm: return true;
    default: return false;
  }
}

bool is_colour(const Param &param) { return param.ptype == ptype_color && value_channels(param) > 0; }

bool is_flare(const Param &param) { return param.ptype == ptype_flare; }

std::vector<Widget> lay_out(const Genotype &genotype, const Param *only, const View &view) {
  std::vector<Widget> widgets;
  int swatch_slot = 0;
  for (int i = 0; i < genotype.n_params; ++i) {
    Param *param = genotype.params[i];
    if (!param || param->flags.hidden_p) continue;
    Widget w;
    if (is_point(*param)) {
      w.kind = Kind::point;
    } else if (is_colour(*param)) {
      w.kind = Kind::colour;
    } else if (is_flare(*param)) {
      w.kind = Kind::flare;
    } else {
      continue;
    }
    // A swatch keeps its slot whether or not the others are drawn.
    const int slot = w.kind == Kind::colour ? swatch_slot++ : 0;
    if (only && param != only) continue;
    w.index = i;
    w.param = param;
    w.label = param->name && *param->name ? param->name : param->get_canonical_name();
    switch (w.kind) {
      case Kind::point: {
        double fx, fy;
        frame_point(*param, view, &fx, &fy);
        w.x = view.screen_x(fx);
        w.y = view.screen_y(fy);
        break;
      }
      case Kind::colour: {
        float v[MAX_CHANNELS];
        shown_value(*param, view.frame, v);
        w.fill = {unit_clamp(v[0]), unit_clamp(v[1]), unit_clamp(v[2])};
        w.x1 = kSwatchLeft;
        w.y1 = kSwatchTop + static_cast<float>(slot) * kSwatchPitch;
        w.x2 = w.x1 + kSwatchWidth;
        w.y2 = w.y1 + kSwatchHeight;
        break;
      }
      case Kind::flare: lay_out_flare(genotype, view, w); break;
    }
    widgets.push_back(std::move(w));
  }
  return widgets;
}

int hit(const std::vector<Widget> &widgets, double x, double y) {
  for (int i = static_cast<int>(widgets.size()) - 1; i >= 0; --i) {
    const Widget &w = widgets[static_cast<std::size_t>(i)];
    switch (w.kind) {
      case Kind::point: {
        const double dx = x - w.x, dy = y - w.y;
        if (dx * dx + dy * dy <= static_cast<double>(kHandleRadius) * kHandleRadius) return i;
        break;
      }
      case Kind::colour:
        if (x >= w.x1 && x <= w.x2 && y >= w.y1 && y <= w.y2) return i;
        break;
      case Kind::flare: break;
    }
  }
  return -1;
}

void dragged_point(const Param &param, const float pressed[MAX_CHANNELS], double dx, double dy, const View &view,
                   float out[MAX_CHANNELS]) {
  std::copy(pressed, pressed + MAX_CHANNELS, out);
  double mx = dx / view.scale_x, my = dy / view.scale_y;  // frame pixels
  switch (placement(param)) {
    case Placement::pixels:
    case Placement::centre_pixels: break;
    case Placement::fractions:
    case Placement::centre_fractions:
      mx /= view.frame_width;
      my /= view.frame_height;
      break;
  }
  out[0] = static_cast<float>(pressed[0] + mx);
  out[1] = static_cast<float>(pressed[1] + my);
}

void dragged_colour(const float pressed[MAX_CHANNELS], double dx, float out[MAX_CHANNELS]) {
  std::copy(pressed, pressed + MAX_CHANNELS, out);
  const double factor = std::exp2(dx / 100.0);
  for (int c = 0; c < 3; ++c) out[c] = static_cast<float>(pressed[c] * factor);
}

}  // namespace widgets
}  // namespace tarsel_ref
