// On-screen widgets: the engine draws an effect's controls through a host
// drawing object (a Python subclass of GfxInterface) and reacts to the mouse.
// Both widget calls keep the interpreter lock: the engine draws on the calling
// thread, inside the call.

%{
#include "tarsel/gfx.h"

// The drawing object last given to the engine, or null. The engine holds it
// by plain pointer; the module remembers it only to take it back from the
// engine when it goes away.
static GfxInterface *installed_drawing = NULL;

static void install_gfx_impl(GfxInterface *gfx)
{
  tarsel_set_gfx_impl(gfx);
  installed_drawing = gfx;
}
%}

// Kinds of mouse event passed to an effect's on-screen widgets.
enum class MouseEventType {
  MOVE = 0,
  DRAG = 1,
  PRESS = 2,
  RELEASE = 3
};

%feature("director") GfxInterface;

// A drawing object that goes away is taken back from the engine first, so the
// engine never draws through a freed object.
%feature("action") GfxInterface::~GfxInterface {
  if (installed_drawing == arg1) {
    installed_drawing = NULL;
    try {
      tarsel_set_gfx_impl(NULL);
    } catch (const TarselAbortException &) {
      // A collected object cannot report an abort; the object goes all the same.
    }
  }
  delete arg1;
}

class GfxInterface {
public:
  virtual ~GfxInterface();
  virtual void set_graphics_context(void *context) = 0;
  virtual void start_drawing(int mode) = 0;
  virtual void end_drawing() = 0;
  virtual void begin_line() = 0;
  virtual void end_line() = 0;
  virtual void line(float x1, float y1, float x2, float y2) = 0;
  virtual void lines(std::vector<float> &xs, std::vector<float> &ys) = 0;
  virtual void color_3f(float red, float green, float blue) = 0;
  virtual void stipple_on() = 0;
  virtual void stipple_off() = 0;
  virtual void stipple_pattern(unsigned short pattern) = 0;
  virtual void line_width(float width) = 0;
  virtual void flush() = 0;
  virtual void circle(float x, float y, float r) = 0;
  virtual void dot(float x, float y, float size) = 0;
  virtual void rect_filled(float x1, float y1, float x2, float y2) = 0;
  virtual void draw_text(const char *text, float x, float y) = 0;
  virtual long get_text_length_in_pixels(const char *text) = 0;
};

%rename(tarsel_set_gfx_impl) install_gfx_impl;
void install_gfx_impl(GfxInterface *gfx);

void tarsel_widget_draw(EffectGlobals_t *globals, const char *param_name,
                        int view_xsize, int view_ysize,
                        float view_x, float view_y, float view_scale_x, float view_scale_y,
                        std::vector<float> values);

%apply T_WidgetResult WidgetResult { T_WidgetResult };
T_WidgetResult tarsel_widget_mouse_event(EffectGlobals_t *globals, const char *param_name,
                                         int view_xsize, int view_ysize,
                                         float view_x, float view_y, float view_scale_x, float view_scale_y,
                                         std::vector<float> values,
                                         int mouse_x, int mouse_y, MouseEventType event);
