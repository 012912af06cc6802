"""Every effect of both catalogues rendered over the test card, one image
file each, laid out on one contact sheet; and the lens flare's on-screen
widgets drawn over its render."""

from __future__ import annotations

import pathlib
from typing import TYPE_CHECKING, Any

import numpy

import _renderlib
from renderlib import effects
from renderlib.images import quantised, write_image
from renderlib.rendering import EffectRenderer, card_frame
from renderlib.widgets import SvgDrawing

if TYPE_CHECKING:
    from collections.abc import Callable, Iterable, Sequence

    from _typeshed import StrPath
    from numpy.typing import NDArray
    from PIL import Image
    from typing_extensions import TypeAlias

    # Shows progress over the plug-in names while passing them on, as tqdm does.
    _Progress: TypeAlias = "Callable[[list[str]], Iterable[str]]"

COLUMNS = 4
LABEL_HEIGHT = 22


def showcase_params(name: str | None, width: float, height: float) -> dict[str, str]:
    """Values that show what an effect does at this size (positions are in
    frame pixels); the engine's defaults for the rest."""
    centre = "%g %g" % (width / 2, height / 2)
    return {
        "T_Transform": {"position": centre, "scale": "0.7 0.7", "rotation": "15"},
        "T_Caption": {"text": "renderlib", "size": "%g" % (height / 6), "position": "0 %g" % (height / 4)},
        "T_Dissolve": {"mix": "0.5"},
        "T_Blur": {"radius": "%g" % (height / 40)},
        "T_Glow": {"radius": "%g" % (height / 12)},
    }.get(name or "", {})


def second_card(width: int, height: int, frame: int) -> NDArray[numpy.float32]:
    """The card a second input sees: the test card mirrored and warmed."""
    card = card_frame(width, height, frame)[:, ::-1].copy()
    card[:, :, 0] = numpy.minimum(1, card[:, :, 0] * 1.6)
    return card


def render_every_effect(
    folder: pathlib.Path, size: tuple[int, int], frame: int, progress: _Progress = iter
) -> list[tuple[str, NDArray[numpy.float32]]]:
    """Renders each effect to <folder>/<plug-in>.png; [(name, rgba)]."""
    width, height = size
    inputs = [lambda f: card_frame(width, height, f), lambda f: second_card(width, height, f)]
    renders = []
    names = [
        entry.plugin_name
        for builder in (False, True)
        for entry in effects.catalogue(builder)
        if entry is not None and entry.plugin_name is not None
    ]
    for name in progress(names):
        with EffectRenderer(name, showcase_params(name, width, height), inputs) as renderer:
            rgba = renderer.render(frame, width, height)
        write_image(folder / ("%s.png" % name), rgba)
        renders.append((name, rgba))
    return renders


def sheet_image(renders: Sequence[tuple[str, NDArray[Any]]]) -> Image.Image:
    """The renders in a grid, each labelled with its plug-in name."""
    from PIL import Image, ImageDraw

    height, width = renders[0][1].shape[:2]
    rows = (len(renders) + COLUMNS - 1) // COLUMNS
    sheet = Image.new("RGB", (COLUMNS * (width + 8) + 8, rows * (height + LABEL_HEIGHT + 8) + 8), (24, 24, 28))
    draw = ImageDraw.Draw(sheet)
    for i, (name, rgba) in enumerate(renders):
        x = 8 + (i % COLUMNS) * (width + 8)
        y = 8 + (i // COLUMNS) * (height + LABEL_HEIGHT + 8)
        sheet.paste(Image.fromarray(quantised(rgba, "8"), "RGBA").convert("RGB"), (x, y))
        draw.text((x + 2, y + height + 5), name, fill=(230, 230, 230))
    return sheet


def widget_overlay(size: tuple[int, int], frame: int) -> Image.Image:
    """The lens flare rendered, with its widgets drawn over it (Pillow image)."""
    from PIL import Image

    width, height = size
    with EffectRenderer("T_LensFlare", None, [lambda f: card_frame(width, height, f)]) as renderer:
        rgba = renderer.render(frame, width, height)
        drawing = SvgDrawing()
        _renderlib.tarsel_set_gfx_impl(drawing)
        try:
            # The viewer shows the whole frame at one screen pixel per frame pixel.
            _renderlib.tarsel_widget_draw(
                renderer.instance, "", width, height, 0.0, 0.0, 1.0, 1.0, [width, height, frame]
            )
        finally:
            _renderlib.tarsel_set_gfx_impl(None)
    return drawing.paint(Image.fromarray(quantised(rgba, "8"), "RGBA").convert("RGB"))


def make_contact_sheet(
    folder: StrPath, size: tuple[int, int] = (320, 180), frame: int = 12, progress: _Progress = iter
) -> pathlib.Path:
    """Writes every effect's render, contact-sheet.png and widgets.png into
    `folder`; returns the contact sheet's path."""
    folder = pathlib.Path(folder)
    folder.mkdir(parents=True, exist_ok=True)
    sheet = folder / "contact-sheet.png"
    sheet_image(render_every_effect(folder, size, frame, progress)).save(sheet)
    widget_overlay((size[0] * 2, size[1] * 2), frame).save(folder / "widgets.png")
    return sheet
