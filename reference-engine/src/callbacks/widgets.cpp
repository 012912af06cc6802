// The on-screen widget calls: installing the host's drawing
// implementation, drawing an instance's widgets, and its mouse events.
#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <optional>
#include <string>

#include "callbacks/widgets.h"
#include "catalogue/descriptor.h"
#include "catalogue/param_store.h"
#include "catalogue/param_values.h"
#include "core/abort.h"
#include "core/entry.h"
#include "core/messages.h"
#include "rendering/instance.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

std::atomic<GfxInterface *> installed_gfx{nullptr};

// The table index of the parameter a drag holds on the descriptor in use; -1 for none.
int held_index(EffectInstance &instance) {
  const WidgetHold &hold = instance.widget_hold;
  const Genotype *genotype = instance.effect_genotype;
  if (hold.descriptor != genotype || !genotype || hold.param_index < 0 || hold.param_index >= genotype->n_params)
    return -1;
  return hold.param_index;
}

// What both widget calls share: the live instance, its descriptor in use, the
// view and the one parameter asked about. False, with the message sent, when
// the call does nothing.
struct Call {
  std::optional<InstanceUse> use;  // the instance outlives the call, whoever frees it meanwhile
  EffectInstance *instance = nullptr;
  const Genotype *genotype = nullptr;
  const Param *only = nullptr;
  widgets::View view;
};

bool prepare(const char *entry, EffectGlobals_t *globals, const char *param_name, int view_xsize, int view_ysize,
             float view_x, float view_y, float scale_x, float scale_y, const std::vector<float> &values, Call *call) {
  throw_if_aborted();
  call->use.emplace(globals);
  call->instance = call->use->get();
  if (!call->instance || !call->instance->effect_genotype) {
    emit_message(Err_Error, (std::string(entry) + ": not a live effect instance of this engine").c_str());
    return false;
  }
  call->genotype = call->instance->effect_genotype;
  std::string error;
  if (!widgets::make_view(view_xsize, view_ysize, view_x, view_y, scale_x, scale_y, values, &call->view, &error)) {
    emit_message(Err_Error, (std::string(entry) + ": " + error).c_str());
    return false;
  }
  if (param_name && *param_name) {
    call->only = find_param(*call->genotype, param_name);
    if (!call->only) {
      emit_message(Err_Warning, (std::string(entry) + ": the effect has no parameter \"" + param_name + "\"").c_str());
      return false;
    }
  }
  return true;
}

// The held widget after the mouse went (dx, dy) screen pixels from the press,
// stored through the parameter's own set path; the value joins `changed`
// when it differs from what the parameter held before.
void move_held(const widgets::Widget &w, const WidgetHold &hold, int mouse_x, int mouse_y, const widgets::View &view,
               T_WidgetResult &result) {
  Param &param = *w.param;
  const double dx = static_cast<double>(mouse_x) - hold.press_x, dy = static_cast<double>(mouse_y) - hold.press_y;
  float next[MAX_CHANNELS];
  int channels;
  if (w.kind == widgets::Kind::point) {
    widgets::dragged_point(param, hold.press_value, dx, dy, view, next);
    channels = 2;
  } else {
    widgets::dragged_colour(hold.press_value, dx, next);
    channels = std::min(3, value_channels(param));
  }
  for (int c = 0; c < channels; ++c)
    if (!std::isfinite(next[c])) return;  // beyond what a float holds: the value stays
  const ParamStore &store = store_of(param);
  float before[MAX_CHANNELS];
  std::memcpy(before, store.value, sizeof before);
  param.set_values(nullptr, 0, channels, next, 0);
  if (std::memcmp(before, store.value, sizeof before) == 0) return;
  T_WidgetValue value{};
  for (int c = 0; c < value_channels(param); ++c) value[static_cast<std::size_t>(c)] = store.value[c];
  result.second.emplace_back(param.get_canonical_name(), value);
}

}  // namespace

std::string values_text(const std::vector<float> &values) {
  if (!call_log_enabled()) return std::string();
  std::string text = "[";
  for (std::size_t i = 0; i < values.size(); ++i) {
    char buffer[32];
    std::snprintf(buffer, sizeof buffer, "%s%g", i ? ", " : "", static_cast<double>(values[i]));
    text += buffer;
  }
  return text + "]";
}

// A plain pointer, process-wide; null removes it. The host keeps the object
// alive while it is installed.
void install_gfx(GfxInterface *gfx) { installed_gfx.store(gfx); }

void draw_widgets(EffectGlobals_t *globals, const char *param_name, int view_xsize, int view_ysize, float view_x,
                  float view_y, float view_scale_x, float view_scale_y, std::vector<float> values) {
  tarsel_ref::Call call;
  if (!tarsel_ref::prepare("tarsel_widget_draw", globals, param_name, view_xsize, view_ysize, view_x, view_y,
                           view_scale_x, view_scale_y, values, &call))
    return;
  GfxInterface *gfx = tarsel_ref::installed_gfx.load();
  if (!gfx) {
    tarsel_ref::emit_message(Err_Error,
                             "tarsel_widget_draw: no drawing implementation is installed "
                             "(tarsel_set_gfx_impl)");
    return;
  }
  const std::vector<tarsel_ref::widgets::Widget> widgets =
      tarsel_ref::widgets::lay_out(*call.genotype, call.only, call.view);
  tarsel_ref::widgets::paint(*gfx, globals, widgets, tarsel_ref::held_index(*call.instance));
}

// Status: 0 the event touched no widget, 1 over a widget or holding one, 2 a
// release ended a drag. The list: the parameters the event changed.
T_WidgetResult widget_mouse_event(EffectGlobals_t *globals, const char *param_name, int view_xsize, int view_ysize,
                                  float view_x, float view_y, float view_scale_x, float view_scale_y,
                                  std::vector<float> values, int mouse_x, int mouse_y, MouseEventType event) {
  namespace w = tarsel_ref::widgets;
  T_WidgetResult result{0, {}};
  tarsel_ref::Call call;
  if (!tarsel_ref::prepare("tarsel_widget_mouse_event", globals, param_name, view_xsize, view_ysize, view_x, view_y,
                           view_scale_x, view_scale_y, values, &call))
    return result;
  if (event != MouseEventType::MOVE && event != MouseEventType::DRAG && event != MouseEventType::PRESS &&
      event != MouseEventType::RELEASE) {
    tarsel_ref::emit_message(
        Err_Error,
        ("tarsel_widget_mouse_event: unknown mouse event " + std::to_string(static_cast<int>(event))).c_str());
    return result;
  }
  tarsel_ref::EffectInstance &instance = *call.instance;
  const std::vector<w::Widget> widgets = w::lay_out(*call.genotype, call.only, call.view);
  const int over = w::hit(widgets, mouse_x, mouse_y);

  // The held widget, when this call's widgets include it.
  const tarsel_ref::WidgetHold hold = instance.widget_hold;
  const int held = tarsel_ref::held_index(instance);
  const w::Widget *holding = nullptr;
  for (const w::Widget &widget : widgets)
    if (held >= 0 && widget.index == held && w::draggable(widget.kind)) holding = &widget;

  switch (event) {
    case MouseEventType::MOVE: result.first = holding || over >= 0 ? 1 : 0; break;
    case MouseEventType::PRESS:
      if (over >= 0) {
        const w::Widget &taken = widgets[static_cast<std::size_t>(over)];
        tarsel_ref::WidgetHold next;
        next.param_index = taken.index;
        next.descriptor = call.genotype;
        next.press_x = mouse_x;
        next.press_y = mouse_y;
        std::memcpy(next.press_value, tarsel_ref::store_of(*taken.param).value, sizeof next.press_value);
        instance.widget_hold = next;
        result.first = 1;
      } else {
        instance.widget_hold = tarsel_ref::WidgetHold();
      }
      break;
    case MouseEventType::DRAG:
      if (holding) {
        tarsel_ref::move_held(*holding, hold, mouse_x, mouse_y, call.view, result);
        result.first = 1;
      } else {
        result.first = over >= 0 ? 1 : 0;
      }
      break;
    case MouseEventType::RELEASE:
      if (holding) {
        tarsel_ref::move_held(*holding, hold, mouse_x, mouse_y, call.view, result);
        result.first = 2;
      } else {
        result.first = over >= 0 ? 1 : 0;
      }
      instance.widget_hold = tarsel_ref::WidgetHold();
      break;
  }
  return result;
}

}  // namespace tarsel_ref
