"""Drawing an effect's on-screen widgets into a picture.

``SvgDrawing`` is a ready-made graphics object: install it with
``tarsel_set_gfx_impl``, call ``tarsel_widget_draw``, and it has recorded every
drawing call the engine made (``calls``) and can give them as SVG text::

    drawing = SvgDrawing()
    _renderlib.tarsel_set_gfx_impl(drawing)
    _renderlib.tarsel_widget_draw(instance, "", 960, 540, 0, 0, 0.5, 0.5, [1920, 1080])
    pathlib.Path("widgets.svg").write_text(drawing.svg(960, 540))
"""

from __future__ import annotations

from typing import TYPE_CHECKING, Any
from xml.sax.saxutils import escape

import renderlib

if TYPE_CHECKING:
    from collections.abc import Iterable

    from PIL import Image

    from _renderlib import _SwigPyObject, _Wrapped


class SvgDrawing(renderlib.GfxInterface):
    """Records the engine's drawing calls as (operation, arguments) and turns
    them into SVG. Text is measured as a monospaced face `char_width` pixels
    wide."""

    def __init__(self, char_width: int = 6) -> None:
        super().__init__()
        self.char_width = char_width
        self.calls: list[tuple[str, tuple[Any, ...]]] = []

    def _record(self, name: str, *args: object) -> None:
        self.calls.append((name, args))

    def set_graphics_context(self, context: _SwigPyObject | _Wrapped | None) -> None:
        self._record("set_graphics_context", context)

    def start_drawing(self, mode: int) -> None:
        self._record("start_drawing", mode)

    def end_drawing(self) -> None:
        self._record("end_drawing")

    def begin_line(self) -> None:
        self._record("begin_line")

    def end_line(self) -> None:
        self._record("end_line")

    def line(self, x1: float, y1: float, x2: float, y2: float) -> None:
        self._record("line", x1, y1, x2, y2)

    # The vectors are the engine's own, valid during the call only: copied.
    def lines(self, xs: renderlib.float_vector, ys: renderlib.float_vector) -> None:
        self._record("lines", tuple(xs), tuple(ys))

    def color_3f(self, red: float, green: float, blue: float) -> None:
        self._record("color_3f", red, green, blue)

    def stipple_on(self) -> None:
        self._record("stipple_on")

    def stipple_off(self) -> None:
        self._record("stipple_off")

    def stipple_pattern(self, pattern: int) -> None:
        self._record("stipple_pattern", pattern)

    def line_width(self, width: float) -> None:
        self._record("line_width", width)

    def flush(self) -> None:
        self._record("flush")

    def circle(self, x: float, y: float, r: float) -> None:
        self._record("circle", x, y, r)

    def dot(self, x: float, y: float, size: float) -> None:
        self._record("dot", x, y, size)

    def rect_filled(self, x1: float, y1: float, x2: float, y2: float) -> None:
        self._record("rect_filled", x1, y1, x2, y2)

    def draw_text(self, text: str | None, x: float, y: float) -> None:
        self._record("draw_text", text, x, y)

    def get_text_length_in_pixels(self, text: str | None) -> int:
        self._record("get_text_length_in_pixels", text)
        return self.char_width * len(text or "")

    def operations(self) -> list[str]:
        """The names of the recorded calls, in order."""
        return [name for name, _ in self.calls]

    def svg(self, width: float, height: float, backdrop: str = "#404040") -> str:
        """The recorded drawing as an SVG document of width x height pixels."""
        return _Svg(self.char_width).document(self.calls, width, height, backdrop)

    def paint(self, image: Image.Image) -> Image.Image:
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

    def __init__(self, char_width: int) -> None:
        self.char_width = char_width
        self.colour = "#ffffff"
        self.width = 1.0
        self.pattern = 0xFFFF
        self.dashed = False

    def stroke(self) -> str:
        dash = ""
        if self.dashed:
            on = max(bin(self.pattern).count("1"), 1)
            dash = ' stroke-dasharray="%d %d"' % (on, max(16 - on, 1))
        return 'fill="none" stroke="%s" stroke-width="%g"%s' % (self.colour, self.width, dash)

    def document(self, calls: Iterable[tuple[str, tuple[Any, ...]]], width: float, height: float, backdrop: str) -> str:
        shapes = [shape for name, args in calls for shape in [self.replay(name, args)] if shape]
        return (
            '<svg xmlns="http://www.w3.org/2000/svg" width="%d" height="%d">\n'
            '<rect width="100%%" height="100%%" fill="%s"/>\n%s\n</svg>\n'
            % (width, height, backdrop, "\n".join(shapes))
        )

    def replay(self, name: str, args: tuple[Any, ...]) -> str | None:
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
            return '<rect x="%g" y="%g" width="%g" height="%g" fill="%s"/>' % (
                min(x1, x2),
                min(y1, y2),
                abs(x2 - x1),
                abs(y2 - y1),
                self.colour,
            )
        elif name == "draw_text":
            text, x, y = args
            return '<text x="%g" y="%g" fill="%s" font-family="monospace" font-size="%g">%s</text>' % (
                x,
                y,
                self.colour,
                self.char_width * 5 / 3,
                escape(text),
            )
        return None
