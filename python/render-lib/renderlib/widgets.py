"""Drawing an effect's on-screen widgets into a picture.

``SvgDrawing`` is a ready-made graphics object: install it with
``tarsel_set_gfx_impl``, call ``tarsel_widget_draw``, and it has recorded every
drawing call the engine made (``calls``) and can give them as SVG text::

    drawing = SvgDrawing()
    _renderlib.tarsel_set_gfx_impl(drawing)
    _renderlib.tarsel_widget_draw(instance, "", 960, 540, 0, 0, 0.5, 0.5, [1920, 1080])
    pathlib.Path("widgets.svg").write_text(drawing.svg(960, 540))
"""
from xml.sax.saxutils import escape

import renderlib


class SvgDrawing(renderlib.GfxInterface):
    """Records the engine's drawing calls as (operation, arguments) and turns
    them into SVG. Text is measured as a monospaced face `char_width` pixels
    wide."""

    def __init__(self, char_width=6):
        super().__init__()
        self.char_width = char_width
        self.calls = []

    def _record(self, name, *args):
        self.calls.append((name, args))

    def set_graphics_context(self, context): self._record("set_graphics_context", context)
    def start_drawing(self, mode): self._record("start_drawing", mode)
    def end_drawing(self): self._record("end_drawing")
    def begin_line(self): self._record("begin_line")
    def end_line(self): self._record("end_line")
    def line(self, x1, y1, x2, y2): self._record("line", x1, y1, x2, y2)
    # The vectors are the engine's own, valid during the call only: copied.
    def lines(self, xs, ys): self._record("lines", tuple(xs), tuple(ys))
    def color_3f(self, red, green, blue): self._record("color_3f", red, green, blue)
    def stipple_on(self): self._record("stipple_on")
    def stipple_off(self): self._record("stipple_off")
    def stipple_pattern(self, pattern): self._record("stipple_pattern", pattern)
    def line_width(self, width): self._record("line_width", width)
    def flush(self): self._record("flush")
    def circle(self, x, y, r): self._record("circle", x, y, r)
    def dot(self, x, y, size): self._record("dot", x, y, size)
    def rect_filled(self, x1, y1, x2, y2): self._record("rect_filled", x1, y1, x2, y2)
    def draw_text(self, text, x, y): self._record("draw_text", text, x, y)

    def get_text_length_in_pixels(self, text):
        self._record("get_text_length_in_pixels", text)
        return self.char_width * len(text or "")

    def operations(self):
        """The names of the recorded calls, in order."""
        return [name for name, _ in self.calls]

    def svg(self, width, height, backdrop="#404040"):
        """The recorded drawing as an SVG document of width x height pixels."""
        return _Svg(self.char_width).document(self.calls, width, height, backdrop)

    def paint(self, image):
        """Draws the recorded calls over a Pillow image (RGB or RGBA), in place."""
        from PIL import ImageDraw
        draw = ImageDraw.Draw(image)
        state = _Svg(self.char_width)
        for name, args in self.calls:
            state.replay(name, args)
            colour, width = state.colour, max(1, round(state.width))
            if name == "line":
                draw.line(args, fill=colour, width=width)
            elif name == "lines":
                draw.line(list(zip(*args)), fill=colour, width=width)
            elif name == "circle":
                x, y, r = args
                draw.ellipse((x - r, y - r, x + r, y + r), outline=colour, width=width)
            elif name == "dot":
                x, y, size = args
                draw.ellipse((x - size / 2, y - size / 2, x + size / 2, y + size / 2), fill=colour)
            elif name == "rect_filled":
                x1, y1, x2, y2 = args
                draw.rectangle((min(x1, x2), min(y1, y2), max(x1, x2), max(y1, y2)), fill=colour)
            elif name == "draw_text":
                text, x, y = args
                draw.text((x, y), text, fill=colour, anchor="ls")
        return image


class _Svg:
    """Replays drawing calls with the state they set (colour, width, stipple)."""

    def __init__(self, char_width):
        self.char_width = char_width
        self.colour = "#ffffff"
        self.width = 1.0
        self.pattern = 0xFFFF
        self.dashed = False

    def stroke(self):
        dash = ""
        if self.dashed:
            on = max(bin(self.pattern).count("1"), 1)
            dash = ' stroke-dasharray="%d %d"' % (on, max(16 - on, 1))
        return 'fill="none" stroke="%s" stroke-width="%g"%s' % (self.colour, self.width, dash)

    def document(self, calls, width, height, backdrop):
        shapes = [shape for name, args in calls for shape in [self.replay(name, args)] if shape]
        return ('<svg xmlns="http://www.w3.org/2000/svg" width="%d" height="%d">\n'
                '<rect width="100%%" height="100%%" fill="%s"/>\n%s\n</svg>\n'
                % (width, height, backdrop, "\n".join(shapes)))

    def replay(self, name, args):
        if name == "color_3f":
            self.colour = "#%02x%02x%02x" % tuple(max(0, min(255, round(c * 255))) for c in args)
        elif name == "line_width":
            self.width = args[0]
        elif name == "stipple_pattern":
            self.pattern = args[0]
        elif name in ("stipple_on", "stipple_off"):
            self.dashed = name == "stipple_on"
        elif name == "line":
            return '<line x1="%g" y1="%g" x2="%g" y2="%g" %s/>' % (*args, self.stroke())
        elif name == "lines":
            return '<polyline points="%s" %s/>' % (" ".join("%g,%g" % p for p in zip(*args)), self.stroke())
        elif name == "circle":
            return '<circle cx="%g" cy="%g" r="%g" %s/>' % (*args, self.stroke())
        elif name == "dot":
            return '<circle cx="%g" cy="%g" r="%g" fill="%s"/>' % (args[0], args[1], args[2] / 2, self.colour)
        elif name == "rect_filled":
            x1, y1, x2, y2 = args
            return ('<rect x="%g" y="%g" width="%g" height="%g" fill="%s"/>'
                    % (min(x1, x2), min(y1, y2), abs(x2 - x1), abs(y2 - y1), self.colour))
        elif name == "draw_text":
            text, x, y = args
            return ('<text x="%g" y="%g" fill="%s" font-family="monospace" font-size="%g">%s</text>'
                    % (x, y, self.colour, self.char_width * 5 / 3, escape(text)))
        return None
