"""The README's host program runs as written."""

import pathlib
import re

import numpy as np
import tifffile

from renderlib.images import write_image
from renderlib.rendering import card_frame

README = pathlib.Path(__file__).parents[2] / "README.md"


def test_the_ten_line_host_renders(tmp_path, monkeypatch):
    program = re.search(r"## A host in ten lines\n\n```python\n(.*?)```", README.read_text(), re.S).group(1)
    assert len([line for line in program.splitlines() if line.strip()]) <= 10
    (tmp_path / "renders").mkdir()
    write_image(tmp_path / "renders" / "T_Gradient.png", card_frame(64, 36))
    monkeypatch.chdir(tmp_path)
    exec(compile(program, "README host", "exec"), {})
    glow = tifffile.imread(tmp_path / "glow.tif")
    assert glow.dtype == np.uint16 and glow.shape == (36, 64, 4) and glow[..., 3].min() == 65535
