"""The command line renders a frame of an effect into a PNG file."""
import struct
import subprocess
import sys
import zlib


def run(*arguments):
    return subprocess.run([sys.executable, "-m", "renderlib"] + list(arguments), capture_output=True, text=True)


def test_render_writes_a_png_of_the_asked_size(tmp_path):
    out = tmp_path / "caption.png"
    result = run("render", "T_Caption", "-o", str(out), "--size", "64x36", "--frame", "2")
    assert result.returncode == 0, result.stderr
    data = out.read_bytes()
    assert data[:8] == b"\x89PNG\r\n\x1a\n"
    width, height = struct.unpack(">II", data[16:24])
    assert (width, height) == (64, 36)
    idat = data[data.index(b"IDAT") + 4:data.index(b"IEND") - 8]
    assert len(zlib.decompress(idat)) == 36 * (1 + 64 * 4)


def test_an_unknown_effect_or_size_fails_with_one_line(tmp_path):
    result = run("render", "T_Nothing", "-o", str(tmp_path / "x.png"))
    assert result.returncode == 2 and result.stderr.strip().startswith("renderlib: no effect 'T_Nothing'")
    result = run("render", "T_Blur", "-o", str(tmp_path / "x.png"), "--size", "big")
    assert result.returncode == 2 and "WIDTHxHEIGHT" in result.stderr
