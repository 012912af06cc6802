"""A host that sends a rendered sequence to a monitor device: a glowing square
crosses the frame for 25 frames, rendered at the size of the device's mode
and shown frame by frame. The "folder" device writes each frame it is shown
as a PNG file; "preview" keeps the frames in memory.

    .venv/bin/python examples/monitor_sequence.py [device [mode [folder]]]

Defaults: folder 320x180p25 build/example-output/monitor.
"""

import os
import pathlib
import sys

import _renderlib
from renderlib import effects
from renderlib.monitor import Monitor, devices

FRAMES = 25


def square_clip(width, height, frame):
    """Frame `frame` of the source: a white square crossing a dark frame."""
    info, pixels = effects.raster(_renderlib.pixel_bgra8, width, height)
    pixels[:] = bytes([40, 24, 20, 255]) * (width * height)
    side = height // 6
    left = frame * (width - side) // (FRAMES - 1)
    for y in range((height - side) // 2, (height + side) // 2):
        start = (y * width + left) * 4
        pixels[start : start + side * 4] = bytes([255, 255, 255, 255]) * side
    return info, pixels


def main(device, mode, folder):
    os.environ["QRV_MONITOR_FOLDER"] = str(folder)  # where the folder device writes
    print("monitor devices:", devices())
    glow = _renderlib.init_tarsel_effect("T_Glow", False)
    try:
        with Monitor(device, mode) as monitor:
            dest = effects.raster(_renderlib.pixel_bgra8, monitor.width, monitor.height)
            for frame in range(FRAMES):
                source = square_clip(monitor.width, monitor.height, frame)
                if not effects.render(glow, dest, [source], frame=frame, colorspace="srgb"):
                    raise SystemExit("frame %d did not render" % frame)
                monitor.show(dest[1], name="glow %d" % frame)
        print("showed %d frames of %dx%d on %s" % (FRAMES, monitor.width, monitor.height, device))
    finally:
        _renderlib.free_tarsel_effect(glow)


if __name__ == "__main__":
    args = sys.argv[1:]
    device = args[0] if args else "folder"
    mode = args[1] if len(args) > 1 else "320x180p25"
    default = pathlib.Path(__file__).resolve().parents[1] / "build" / "example-output" / "monitor"
    main(device, mode, pathlib.Path(args[2]) if len(args) > 2 else default)
