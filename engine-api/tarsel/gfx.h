// Drawing of on-screen effect controls (widgets) and their mouse events.
#pragma once

#include <array>
#include <string>
#include <utility>
#include <vector>

#include "tarsel/effect_globals.h"
#include "tarsel/export.h"
#include "tarsel/limits.h"

// Kind of a mouse event.
enum class MouseEventType : int {
  MOVE = 0,    // pointer moved with no button held
  DRAG = 1,    // pointer moved with a button held
  PRESS = 2,   // a button went down
  RELEASE = 3  // a button went up
};

// Host-side vector drawing that the engine draws its widgets with.
class GfxInterface {
public:
  // Destroys the drawing implementation.
  virtual ~GfxInterface() {}

  // Hands over the host's drawing context.
  virtual void set_graphics_context(void *context) = 0;

  // Starts a drawing pass.
  virtual void start_drawing(int mode) = 0;

  // Ends a drawing pass.
  virtual void end_drawing() = 0;

  // Starts a connected line.
  virtual void begin_line() = 0;

  // Ends a connected line.
  virtual void end_line() = 0;

  // Draws a line from (x1, y1) to (x2, y2).
  virtual void line(float x1, float y1, float x2, float y2) = 0;

  // Draws a polyline through the points (xs[i], ys[i]).
  virtual void lines(std::vector<float> &xs, std::vector<float> &ys) = 0;

  // Sets the drawing colour.
  virtual void color_3f(float red, float green, float blue) = 0;

  // Turns line stippling on.
  virtual void stipple_on() = 0;

  // Turns line stippling off.
  virtual void stipple_off() = 0;

  // Sets the 16-bit line-stipple mask.
  virtual void stipple_pattern(unsigned short pattern) = 0;

  // Sets the line width.
  virtual void line_width(float width) = 0;

  // Pushes pending drawing out.
  virtual void flush() = 0;

  // Draws a circle of radius r around (x, y).
  virtual void circle(float x, float y, float r) = 0;

  // Draws a dot of size `size` at (x, y).
  virtual void dot(float x, float y, float size) = 0;

  // Fills the rectangle with corners (x1, y1) and (x2, y2).
  virtual void rect_filled(float x1, float y1, float x2, float y2) = 0;

  // Draws text at (x, y).
  virtual void draw_text(const char *text, float x, float y) = 0;

  // Width of the text in pixels.
  virtual long get_text_length_in_pixels(const char *text) = 0;
};

// One value a widget interaction set: four channels.
typedef std::array<float, MAX_CHANNELS> T_WidgetValue;

// Result of a widget interaction: a status and the named values it set.
typedef std::pair<int, std::vector<std::pair<std::string, T_WidgetValue>>> T_WidgetResult;

// Installs the drawing implementation the engine draws widgets with (held by plain pointer).
TARSEL_API void tarsel_set_gfx_impl(GfxInterface *gfx);

// Draws the widgets of an instance through the installed drawing implementation.
TARSEL_API void tarsel_widget_draw(EffectGlobals_t *globals, const char *param_values,
                                   int view_xsize, int view_ysize,
                                   float view_x, float view_y, float view_scale_x, float view_scale_y,
                                   std::vector<float> values);

// Passes a mouse event at (mouse_x, mouse_y) to an instance's widgets; returns what the interaction set.
TARSEL_API T_WidgetResult tarsel_widget_mouse_event(EffectGlobals_t *globals, const char *param_values,
                                                    int view_xsize, int view_ysize,
                                                    float view_x, float view_y, float view_scale_x, float view_scale_y,
                                                    std::vector<float> values,
                                                    int mouse_x, int mouse_y, MouseEventType event);
