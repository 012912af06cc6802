// gfx.h: the host's drawing object, and the widgets drawn through it.
#include "callbacks/widgets.h"
#include "core/entry.h"
#include "tarsel/gfx.h"

void tarsel_set_gfx_impl(GfxInterface *gfx) {
  auto scope = tarsel_ref::enter("tarsel_set_gfx_impl", static_cast<const void *>(gfx));
  tarsel_ref::install_gfx(gfx);
}

void tarsel_widget_draw(EffectGlobals_t *globals, const char *param_name, int view_xsize, int view_ysize, float view_x,
                        float view_y, float view_scale_x, float view_scale_y, std::vector<float> values) {
  auto scope =
      tarsel_ref::enter("tarsel_widget_draw", static_cast<const void *>(globals), param_name, view_xsize, view_ysize,
                        view_x, view_y, view_scale_x, view_scale_y, tarsel_ref::values_text(values).c_str());
  tarsel_ref::draw_widgets(globals, param_name, view_xsize, view_ysize, view_x, view_y, view_scale_x, view_scale_y,
                           values);
}

T_WidgetResult tarsel_widget_mouse_event(EffectGlobals_t *globals, const char *param_name, int view_xsize,
                                         int view_ysize, float view_x, float view_y, float view_scale_x,
                                         float view_scale_y, std::vector<float> values, int mouse_x, int mouse_y,
                                         MouseEventType event) {
  auto scope = tarsel_ref::enter("tarsel_widget_mouse_event", static_cast<const void *>(globals), param_name,
                                 view_xsize, view_ysize, view_x, view_y, view_scale_x, view_scale_y,
                                 tarsel_ref::values_text(values).c_str(), mouse_x, mouse_y, static_cast<int>(event));
  return tarsel_ref::widget_mouse_event(globals, param_name, view_xsize, view_ysize, view_x, view_y, view_scale_x,
                                        view_scale_y, values, mouse_x, mouse_y, event);
}
