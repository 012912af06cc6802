"""A host with a clip: the engine fetches the clip's other frames through a
frame source while it renders an echo, and draws the lens flare's widgets into
an SVG picture; a mouse drag moves the flare, and the result is rendered.

    .venv/bin/python examples/clip_and_widgets.py [output folder, build/example-output by default]
"""

import pathlib
import sys

import _renderlib
import renderlib
from renderlib import effects, png
from renderlib.widgets import SvgDrawing

WIDTH, HEIGHT = 320, 180


def clip_frame(frame):
    """Frame `frame` of the clip: a white square crossing a dark frame."""
    info, pixels = effects.raster(_renderlib.pixel_rgba8, WIDTH, HEIGHT)
    pixels[:] = bytes([20, 24, 40, 255]) * (WIDTH * HEIGHT)
    left = (frame * 12) % (WIDTH - 24)
    for y in range(78, 102):
        start = (y * WIDTH + left) * 4
        pixels[start : start + 24 * 4] = bytes([255, 255, 255, 255]) * 24
    return info, pixels


class Clip(renderlib.LoadFrameInterface):
    """Serves the clip's frames; keeps each handed out until the render returns."""

    def __init__(self):
        super().__init__()
        self.kept = {}

    def load_frame(self, input, frame, width, height):
        self.kept[input] = clip_frame(frame)
        return self.kept[input][1]

    def current_raster_info(self, input):
        return self.kept[input][0]


def main(folder):
    folder.mkdir(parents=True, exist_ok=True)
    clip = Clip()
    _renderlib.set_load_frame_impl(clip)
    try:
        echo = effects.recreate(
            _renderlib.init_tarsel_effect("T_Echo", False), {"echoes": "6", "decay": "0.7", "combine": "Maximum"}
        )
        dest = effects.raster(_renderlib.pixel_rgba8, WIDTH, HEIGHT)
        for frame in (10, 20):
            clip.kept.clear()
            effects.render(echo, dest, [clip_frame(frame)], frame=frame, colorspace="srgb")
            png.write_rgba8(folder / ("echo-%02d.png" % frame), dest[1], WIDTH, HEIGHT)
        _renderlib.free_tarsel_effect(echo)
    finally:
        _renderlib.set_load_frame_impl(None)

    flare = _renderlib.init_tarsel_effect("T_LensFlare", False)
    drawing = SvgDrawing()
    _renderlib.tarsel_set_gfx_impl(drawing)
    view = (WIDTH, HEIGHT, 0.0, 0.0, 1.0, 1.0)  # the frame shown at full size
    try:
        _renderlib.tarsel_widget_draw(flare, "", *view, [WIDTH, HEIGHT])
        (folder / "flare-widgets.svg").write_text(drawing.svg(WIDTH, HEIGHT))
        # Drag the flare's position handle 80 pixels to the right.
        handle = next(args for name, args in drawing.calls if name == "circle")
        x, y = int(handle[0]), int(handle[1])
        for kind, at in (
            (_renderlib.MouseEventType_PRESS, x),
            (_renderlib.MouseEventType_DRAG, x + 40),
            (_renderlib.MouseEventType_RELEASE, x + 80),
        ):
            status, changed = _renderlib.tarsel_widget_mouse_event(flare, "", *view, [WIDTH, HEIGHT], at, y, kind)
            for name, value in changed:
                print("%s -> %.3f %.3f" % (name, value[0], value[1]))
    finally:
        _renderlib.tarsel_set_gfx_impl(None)
    dest = effects.raster(_renderlib.pixel_rgba8, WIDTH, HEIGHT)
    effects.render(flare, dest, [clip_frame(0)], colorspace="srgb")
    png.write_rgba8(folder / "flare-dragged.png", dest[1], WIDTH, HEIGHT)
    _renderlib.free_tarsel_effect(flare)
    print("wrote", ", ".join(sorted(path.name for path in folder.iterdir())))


if __name__ == "__main__":
    default = pathlib.Path(__file__).resolve().parents[1] / "build" / "example-output"
    main(pathlib.Path(sys.argv[1]) if len(sys.argv) > 1 else default)
