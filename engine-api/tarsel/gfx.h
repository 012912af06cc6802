// Drawing of on-screen effect controls (widgets) and their mouse events.
// Coordinates handed to the drawing implementation are viewer (screen)
// pixels from the viewer's top-left corner, y downwards.
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

// Host-side vector drawing that the engine draws its widgets with. The
// engine calls it on the thread of the widget call, inside that call; any
// exception thrown out of an operation ends the drawing (no further calls)
// and the widget call ends with TarselAbortException.
class GfxInterface {
public:
  // Destroys the drawing implementation.
  virtual ~GfxInterface() {}

  // Opens a drawing pass: `context` is the instance whose widgets are drawn.
  virtual void set_graphics_context(void *context) = 0;

  // Starts drawing `n_widgets` widgets (0 when the pass draws none).
  virtual void start_drawing(int n_widgets) = 0;

  // Ends the drawing pass (after flush).
  virtual void end_drawing() = 0;

  // Starts a connected line (the next lines call is one polyline).
  virtual void begin_line() = 0;

  // Ends the connected line.
  virtual void end_line() = 0;

  // Draws a line from (x1, y1) to (x2, y2).
  virtual void line(float x1, float y1, float x2, float y2) = 0;

  // Draws a polyline through the points (xs[i], ys[i]); both vectors are
  // the engine's, of equal length and valid during the call only.
  virtual void lines(std::vector<float> &xs, std::vector<float> &ys) = 0;

  // Sets the colour of what follows, each component 0..1.
  virtual void color_3f(float red, float green, float blue) = 0;

  // Turns line stippling on, with the last pattern set.
  virtual void stipple_on() = 0;

  // Turns line stippling off.
  virtual void stipple_off() = 0;

  // Sets the 16-bit line-stipple mask: bit i set draws pixel i of every 16
  // along a line.
  virtual void stipple_pattern(unsigned short pattern) = 0;

  // Sets the line width in pixels of what follows.
  virtual void line_width(float width) = 0;

  // Pushes pending drawing out (once per pass, before end_drawing).
  virtual void flush() = 0;

  // Draws the outline of a circle of radius r around (x, y).
  virtual void circle(float x, float y, float r) = 0;

  // Draws a filled dot `size` pixels across centred on (x, y).
  virtual void dot(float x, float y, float size) = 0;

  // Fills the rectangle with corners (x1, y1) and (x2, y2).
  virtual void rect_filled(float x1, float y1, float x2, float y2) = 0;

  // Draws one line of text, (x, y) the left end of its baseline.
  virtual void draw_text(const char *text, float x, float y) = 0;

  // Width in pixels that draw_text gives the text.
  virtual long get_text_length_in_pixels(const char *text) = 0;
};

// One value a widget interaction set: four channels.
typedef std::array<float, MAX_CHANNELS> T_WidgetValue;

// Result of a widget interaction: a status (0 no widget touched, 1 over a
// widget or holding one, 2 a release ended a drag) and the parameters the
// event changed, by canonical name, with their values (channels a
// parameter lacks are 0).
typedef std::pair<int, std::vector<std::pair<std::string, T_WidgetValue>>> T_WidgetResult;

// Installs the drawing implementation the engine draws widgets with, process-wide
// (held by plain pointer; the host keeps it alive); null removes it.
TARSEL_API void tarsel_set_gfx_impl(GfxInterface *gfx);

// Draws the widgets of an instance through the installed drawing implementation.
// param_name: canonical name of the one parameter whose widget is drawn, null
// or "" for all. The viewer is view_xsize x view_ysize screen pixels and shows
// frame position (view_x, view_y) at its top-left corner, view_scale_x and
// view_scale_y screen pixels per frame pixel. values: frame width, frame
// height (full-resolution pixels) and frame number; missing entries are the
// view size over the scale, and frame 0.
TARSEL_API void tarsel_widget_draw(EffectGlobals_t *globals, const char *param_name, int view_xsize, int view_ysize,
                                   float view_x, float view_y, float view_scale_x, float view_scale_y,
                                   std::vector<float> values);

// Passes a mouse event at (mouse_x, mouse_y), viewer pixels, to an instance's
// widgets (the other arguments as for tarsel_widget_draw); returns what the
// interaction set.
TARSEL_API T_WidgetResult tarsel_widget_mouse_event(EffectGlobals_t *globals, const char *param_name, int view_xsize,
                                                    int view_ysize, float view_x, float view_y, float view_scale_x,
                                                    float view_scale_y, std::vector<float> values, int mouse_x,
                                                    int mouse_y, MouseEventType event);
