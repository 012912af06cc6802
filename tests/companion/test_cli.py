"""The command line: each command, its one-line errors and its exit codes."""

import pathlib
import subprocess
import sys

import numpy as np
import pytest
import tifffile
from PIL import Image

from renderlib import effects
from renderlib.cli import main
from renderlib.images import quantised, read_image, write_image
from renderlib.rendering import EffectRenderer, card_frame


def run(capsys, *argv):
    """(exit status, standard output, standard error) of the command."""
    return (main(list(argv)), *capsys.readouterr())


def render_centred(capsys, size, source, out, *options):
    """A quiet linear render of `source` to `out` by a transform that gives a frame of `size` back."""
    argv = ["render", "T_Transform", "-p", "position=%d %d" % (size[0] // 2, size[1] // 2)]
    return run(capsys, *argv, "-i", str(source), "-o", str(out), "--colorspace", "linear", "-q", *options)


def test_list_shows_both_catalogues_with_categories(capsys):
    status, out, _ = run(capsys, "list")
    assert status == 0
    assert out.startswith("Effects (11)\n  T_Gradient       Generators\n")
    assert "  T_Blur           Blur & Sharpen\n" in out
    assert "Effect builder (" in out and "T_BuilderMix" in out.split("Effect builder")[1]


def test_render_reads_inputs_and_writes_every_tiff_depth(capsys, tmp_path):
    source = card_frame(48, 32, 0)
    write_image(tmp_path / "in.tif", source, "16")
    for depth, dtype in (("8", np.uint8), ("16", np.uint16), ("float", np.float32)):
        out = tmp_path / ("out-%s.tif" % depth)
        status, _, err = render_centred(capsys, (48, 32), tmp_path / "in.tif", out, "--depth", depth)
        assert status == 0, err
        stored = tifffile.imread(out)
        assert stored.dtype == dtype and stored.shape == (32, 48, 4)
    # A transform that centres the frame gives the input back (to the 16-bit input's precision).
    np.testing.assert_allclose(read_image(tmp_path / "out-float.tif"), source, atol=1 / 30000)
    # A 16-bit file reads back as its stored values over 65535, exactly.
    assert np.array_equal(read_image(tmp_path / "in.tif"), tifffile.imread(tmp_path / "in.tif") / np.float32(65535))


def test_a_sequence_input_is_read_frame_by_frame(capsys, tmp_path):
    for frame in range(2):
        write_image(tmp_path / ("in%d.png" % frame), card_frame(40, 24, frame * 12))
    status, _, err = render_centred(capsys, (40, 24), tmp_path / "in#.png", tmp_path / "out#.png", "-f", "0-1")
    assert status == 0, err
    for frame in range(2):
        written, read = (np.asarray(Image.open(tmp_path / ("%s%d.png" % (kind, frame)))) for kind in ("out", "in"))
        np.testing.assert_array_equal(written, read)


# Command lines that fail, the exit status and a part of the one line on standard error.
FAILURES = [
    ("render T_Nothing -o x.png", 2, "renderlib: no effect 'T_Nothing' (see: renderlib list"),
    ("info T_Nothing", 2, "renderlib: no effect 'T_Nothing'"),
    ("render T_Blur -o x.png -p nothing=1", 2, "renderlib: T_Blur has no parameter 'nothing'"),
    ("render T_Blur -o x.png -f 0-3", 2, "needs an output pattern such as out.####.png"),
    ("render T_Blur -o x.png -i a.png -i b.png", 4, "renderlib: cannot read a.png"),
    ("render T_Gradient -o x.png -i {card}", 2, "T_Gradient takes 0 input(s), 1 given"),
    ("render T_Gradient -o {tmp}/no/such/folder/x.png --size 8x8", 4, "cannot write"),
    (
        "render T_Gradient -o {tmp}/x.png --depth 16 --size 8x8",
        2,
        ".png files are written at 8 bits a channel; use .tif for 16",
    ),
    ("monitor T_Glow --mode 800x600p60 -q", 5, "renderlib: connecting preview in 800x600p60 failed: EM_errorNotFound"),
]


@pytest.mark.parametrize("argv, status, message", FAILURES)
def test_failures_are_one_line_with_a_reliable_status(capsys, tmp_path, monkeypatch, argv, status, message):
    monkeypatch.chdir(tmp_path)  # nothing may be written, and nowhere but here
    card = tmp_path / "card.png"
    write_image(card, card_frame(8, 8))
    got, out, err = run(capsys, *(a.format(tmp=tmp_path, card=card) for a in argv.split()))
    assert got == status
    assert message in err and err.count("\n") == 1 and out == ""
    assert sorted(p.name for p in tmp_path.iterdir()) == ["card.png"]


# Command lines argparse refuses: no output, frames backwards, an empty size, a
# parameter without a value, no such command.
USAGE_ERRORS = (
    "render T_Blur; render T_Blur -o x -f 5-2; render T_Blur -o x --size 0x2; render T_Blur -o x -p radius; frobnicate"
).split("; ")


@pytest.mark.parametrize("argv", USAGE_ERRORS)
def test_bad_options_are_usage_errors(capsys, argv):
    with pytest.raises(SystemExit) as exited:
        main(argv.split())
    assert exited.value.code == 2
    assert "usage: renderlib" in capsys.readouterr().err


def test_contact_sheet_renders_every_effect(capsys, tmp_path):
    status, out, err = run(capsys, "contact-sheet", "-o", str(tmp_path), "--size", "64x36", "-q")
    assert (status, out) == (0, ""), err
    names = [e.plugin_name for builder in (False, True) for e in effects.catalogue(builder)]
    files = ["%s.png" % name for name in names] + ["contact-sheet.png", "widgets.png"]
    assert sorted(p.name for p in tmp_path.iterdir()) == sorted(files)
    with Image.open(tmp_path / "contact-sheet.png") as sheet:
        assert sheet.size == (4 * (64 + 8) + 8, (len(names) + 3) // 4 * (36 + 22 + 8) + 8)  # four to a row
        # Each cell holds its effect's render.
        blur = np.asarray(Image.open(tmp_path / ("%s.png" % names[1])).convert("RGB"))
        np.testing.assert_array_equal(np.asarray(sheet)[8 : 8 + 36, 8 + 72 : 8 + 72 + 64], blur)
    # The widgets are drawn over the flare's render at twice the size: lines here and there, the render elsewhere.
    with EffectRenderer("T_LensFlare", None, [lambda f: card_frame(128, 72, f)]) as renderer:
        plain = quantised(renderer.render(12, 128, 72), "8")[..., :3]
    with Image.open(tmp_path / "widgets.png") as widgets:
        drawn = (np.asarray(widgets) != plain).any(axis=2)
    assert 0.01 < drawn.mean() < 0.5


def test_the_installed_command_runs_the_same_program(tmp_path):
    def installed(*argv):
        return subprocess.run(
            [pathlib.Path(sys.executable).with_name("renderlib"), *argv], capture_output=True, text=True, timeout=60
        )

    done = installed("info", "T_Nothing")
    assert done.returncode == 2 and done.stderr.startswith("renderlib: no effect 'T_Nothing'")
    done = installed("render", "T_Gradient", "--size", "16x9", "-o", str(tmp_path / "g.png"))
    assert done.returncode == 0 and done.stdout == "%s: 1 frame(s) of 16x9\n" % (tmp_path / "g.png")
