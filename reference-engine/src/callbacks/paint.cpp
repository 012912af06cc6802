// Drawing the widgets through the host's GfxInterface.
//
// Every call into the host may throw whatever the host throws (a scripting
// host's own error types included). The first one ends the pass: nothing more
// is asked of the host, and the entry point leaves with TarselAbortException.
#include <cmath>

#include "callbacks/widgets.h"
#include "core/thread_end.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace widgets {
namespace {

class Painter {
public:
  explicit Painter(GfxInterface &gfx) : gfx_(gfx) {}

  void set_graphics_context(void *context) {
    guard([&] { gfx_.set_graphics_context(context); });
  }
  void start_drawing(int n_widgets) {
    guard([&] { gfx_.start_drawing(n_widgets); });
  }
  void end_drawing() {
    guard([&] { gfx_.end_drawing(); });
  }
  void flush() {
    guard([&] { gfx_.flush(); });
  }
  void colour(const Rgb &c) {
    guard([&] { gfx_.color_3f(c.r, c.g, c.b); });
  }
  void line_width(float width) {
    guard([&] { gfx_.line_width(width); });
  }
  void line(float x1, float y1, float x2, float y2) {
    guard([&] { gfx_.line(x1, y1, x2, y2); });
  }
  void circle(float x, float y, float r) {
    guard([&] { gfx_.circle(x, y, r); });
  }
  void dot(float x, float y, float size) {
    guard([&] { gfx_.dot(x, y, size); });
  }
  void rect_filled(float x1, float y1, float x2, float y2) {
    guard([&] { gfx_.rect_filled(x1, y1, x2, y2); });
  }
  void text(const std::string &text, float x, float y) {
    guard([&] { gfx_.draw_text(text.c_str(), x, y); });
  }
  long text_width(const std::string &text) {
    long width = 0;
    guard([&] { width = gfx_.get_text_length_in_pixels(text.c_str()); });
    return width;
  }

  // One stippled polyline: stipple_pattern, stipple_on, begin_line, lines,
  // end_line, stipple_off. The host may change the points it is handed;
  // they are copies.
  void stippled_polyline(std::vector<float> xs, std::vector<float> ys) {
    guard([&] { gfx_.stipple_pattern(kStippleMask); });
    guard([&] { gfx_.stipple_on(); });
    guard([&] { gfx_.begin_line(); });
    guard([&] { gfx_.lines(xs, ys); });
    guard([&] { gfx_.end_line(); });
    guard([&] { gfx_.stipple_off(); });
  }

private:
  template <typename Call>
  static void guard(Call call) {
    try {
      call();
    }
    TARSEL_LET_THREAD_END catch (...) { throw TarselAbortException(); }
  }

  GfxInterface &gfx_;
};

// color_3f, line_width, line (across), line (down), circle,
// get_text_length_in_pixels, draw_text: the name centred below the circle.
void paint_handle(Painter &p, const Widget &w, float width) {
  p.colour(kHandleColour);
  p.line_width(width);
  p.line(w.x - kHandleArm, w.y, w.x + kHandleArm, w.y);
  p.line(w.x, w.y - kHandleArm, w.x, w.y + kHandleArm);
  p.circle(w.x, w.y, kHandleRadius);
  const long text_width = p.text_width(w.label);
  p.text(w.label, w.x - static_cast<float>(text_width) / 2.0f, w.y + kHandleRadius + kHandleLabelDrop);
}

// color_3f (the colour), line_width, rect_filled, color_3f (outline), the
// stippled outline (closed, from the top-left corner clockwise), draw_text:
// the name right of the swatch.
void paint_swatch(Painter &p, const Widget &w, float width) {
  p.colour(w.fill);
  p.line_width(width);
  p.rect_filled(w.x1, w.y1, w.x2, w.y2);
  p.colour(kSwatchOutlineColour);
  p.stippled_polyline({w.x1, w.x2, w.x2, w.x1, w.x1}, {w.y1, w.y1, w.y2, w.y2, w.y1});
  p.text(w.label, w.x2 + kSwatchLabelGap, w.y2 - kSwatchLabelRaise);
}

// color_3f, line_width, the stippled axis, dot (the light), circle per element.
void paint_flare(Painter &p, const Widget &w) {
  p.colour(kFlareColour);
  p.line_width(kLineWidth);
  p.stippled_polyline(w.axis_x, w.axis_y);
  p.dot(w.x, w.y, kLightDotSize);
  for (const Circle &c : w.elements) p.circle(c.x, c.y, c.r);
}

}  // namespace

void paint(GfxInterface &gfx, void *context, const std::vector<Widget> &widgets, int held) {
  Painter p(gfx);
  p.set_graphics_context(context);
  p.start_drawing(static_cast<int>(widgets.size()));
  for (const Widget &w : widgets) {
    const float width = w.index == held && draggable(w.kind) ? kHeldLineWidth : kLineWidth;
    switch (w.kind) {
      case Kind::point: paint_handle(p, w, width); break;
      case Kind::colour: paint_swatch(p, w, width); break;
      case Kind::flare: paint_flare(p, w); break;
    }
  }
  p.flush();
  p.end_drawing();
}

}  // namespace widgets
}  // namespace tarsel_ref
