// On-screen widgets of an effect instance: which parameters get one, where
// they sit on the host's viewer, how they are drawn and what the mouse does
// to them.
//
// Coordinates: the frame is measured in full-resolution pixels, the viewer in
// screen pixels, both y downwards. A frame point (fx, fy) is shown at
// ((fx - view_x) * scale_x, (fy - view_y) * scale_y).
//
// Widgets, in the descriptor's parameter table order, for parameters that are
// not hidden:
//   point    a two-channel number placed in image space (screen modes
//            screen, screen_center, normalize, screen_to_norm,
//            screen_center_to_norm): a handle, a cross of two lines and a
//            circle of kHandleRadius around the point, its name centred
//            below. Hit inside the circle (its edge included).
//   colour   a swatch: a filled rectangle in the colour with a stippled
//            outline, its name right of it. Swatches stack down the viewer's
//            left edge, one slot per colour parameter of the descriptor that
//            is not hidden, whichever widgets a call asks for. Hit inside the
//            rectangle (its edges included).
//   flare    the flare's elements on the axis from the light (the
//            descriptor's first point parameter, else the frame's centre)
//            through the frame's centre: the axis stippled, a dot at the
//            light, a circle per element. Never hit.
#pragma once

#include <string>
#include <vector>

#include "tarsel/genotype.h"
#include "tarsel/gfx.h"

namespace tarsel_ref {
namespace widgets {

// Geometry, in screen pixels.
constexpr float kHandleRadius = 10.0f;     // the handle's circle, and its hit radius
constexpr float kHandleArm = 14.0f;        // the cross's lines reach this far from the centre
constexpr float kHandleLabelDrop = 14.0f;  // the name's baseline lies this far below the circle
constexpr float kSwatchLeft = 10.0f;       // left edge of every swatch
constexpr float kSwatchTop = 10.0f;        // top edge of the first swatch
constexpr float kSwatchWidth = 24.0f;
constexpr float kSwatchHeight = 16.0f;
constexpr float kSwatchPitch = 24.0f;      // top edge to top edge of consecutive slots
constexpr float kSwatchLabelGap = 6.0f;    // from the swatch's right edge to its name
constexpr float kSwatchLabelRaise = 2.0f;  // the name's baseline above the swatch's bottom edge
constexpr float kLightDotSize = 6.0f;      // the flare's light

// Line stipple of the flare's axis and the swatches' outline: 4 pixels on, 4 off.
constexpr unsigned short kStippleMask = 0x0F0F;

// Line widths: the widget a drag holds, every other one.
constexpr float kHeldLineWidth = 2.0f;
constexpr float kLineWidth = 1.0f;

// Drawing colours; a swatch is filled with its own colour.
struct Rgb {
  float r, g, b;
};
constexpr Rgb kHandleColour = {1.0f, 1.0f, 0.0f};
constexpr Rgb kSwatchOutlineColour = {1.0f, 1.0f, 1.0f};
constexpr Rgb kFlareColour = {0.5f, 0.75f, 1.0f};

// What a call looks at: the viewer's placement over the frame, the frame's
// size and the frame number animated values are read at.
struct View {
  double view_x = 0.0, view_y = 0.0;    // frame position at the viewer's top-left corner
  double scale_x = 1.0, scale_y = 1.0;  // screen pixels per frame pixel
  double frame_width = 0.0, frame_height = 0.0;
  int frame = 0;

  float screen_x(double fx) const { return static_cast<float>((fx - view_x) * scale_x); }
  float screen_y(double fy) const { return static_cast<float>((fy - view_y) * scale_y); }
};

// The view of a call's arguments; false, with the reason in `error`, when
// they do not make one (scales not positive and finite, a frame size not
// positive and finite, a non-finite position or frame number).
bool make_view(int view_xsize, int view_ysize, float view_x, float view_y, float scale_x, float scale_y,
               const std::vector<float> &values, View *view, std::string *error);

enum class Kind { point, colour, flare };

struct Circle {
  float x, y, r;
};

// One widget as drawn, in screen pixels.
struct Widget {
  Kind kind = Kind::point;
  int index = -1;  // into the descriptor's parameter table
  Param *param = nullptr;
  std::string label;                                 // the parameter's display name (canonical when it has none)
  float x = 0.0f, y = 0.0f;                          // handle centre; flare light
  float x1 = 0.0f, y1 = 0.0f, x2 = 0.0f, y2 = 0.0f;  // swatch rectangle
  Rgb fill = {0.0f, 0.0f, 0.0f};                     // swatch colour
  std::vector<float> axis_x, axis_y;                 // flare axis: two points
  std::vector<Circle> elements;                      // flare elements
};

bool is_point(const Param &param);
bool is_colour(const Param &param);
bool is_flare(const Param &param);
inline bool draggable(Kind kind) { return kind != Kind::flare; }

// The widgets of a descriptor, in table order; `only` (a parameter of the
// descriptor) keeps just that parameter's widget, null keeps them all.
std::vector<Widget> lay_out(const Genotype &genotype, const Param *only, const View &view);

// The topmost widget (the last drawn) that (x, y) hits; -1 when none.
int hit(const std::vector<Widget> &widgets, double x, double y);

// A point's value after a drag of (dx, dy) screen pixels from the press,
// where it held `pressed`, in the parameter's own unit. Channels 0 and 1.
void dragged_point(const Param &param, const float pressed[MAX_CHANNELS], double dx, double dy, const View &view,
                   float out[MAX_CHANNELS]);

// A colour after a drag of dx screen pixels across from the press, where it
// held `pressed`: red, green and blue times 2^(dx / 100), alpha unchanged.
void dragged_colour(const float pressed[MAX_CHANNELS], double dx, float out[MAX_CHANNELS]);

// Draws one pass through `gfx`: set_graphics_context(context),
// start_drawing(widget count), the widgets, flush(), end_drawing(). `held`
// is the table index of the widget a drag holds, -1 for none. The first
// exception out of `gfx` ends the pass (no further calls into it) and leaves
// as TarselAbortException.
void paint(GfxInterface &gfx, void *context, const std::vector<Widget> &widgets, int held);

}  // namespace widgets
// The widget calls: installing the host's drawing object (null: none), drawing
// an instance's widgets through it, and a mouse event. Each refused call is
// an Err_Error message naming the entry point.
void install_gfx(GfxInterface *gfx);
void draw_widgets(EffectGlobals_t *globals, const char *param_name, int view_xsize, int view_ysize, float view_x,
                  float view_y, float view_scale_x, float view_scale_y, std::vector<float> values);
T_WidgetResult widget_mouse_event(EffectGlobals_t *globals, const char *param_name, int view_xsize, int view_ysize,
                                  float view_x, float view_y, float view_scale_x, float view_scale_y,
                                  std::vector<float> values, int mouse_x, int mouse_y, MouseEventType event);

// The values as the call log shows them; "" when no log wants arguments.
std::string values_text(const std::vector<float> &values);

}  // namespace tarsel_ref
