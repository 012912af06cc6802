"""Frames shown on the devices: pixels by address, converted exactly."""

import ctypes

import numpy as np
import pytest
from PIL import Image

import _renderlib as rl

WIDTH, HEIGHT = 640, 360


def wrap(
    display,
    pixels,
    row_bytes=WIDTH * 4,
    name="frame",
    bottom_up=False,
    fmt=rl.EM_ImageFormat_32BitIntBGRA,
    aspect=1.0,
    gamma=2.2,
    premultiplied=False,
    full_range=True,
    size=(WIDTH, HEIGHT),
):
    return rl.EM_Display_EM_XIImageWrapper(
        display, pixels, size[0], size[1], row_bytes, name, bottom_up, fmt, aspect, gamma, premultiplied, full_range
    )


def random_frame(seed, row_pixels=WIDTH):
    return np.random.default_rng(seed).integers(0, 256, (HEIGHT, row_pixels, 4), dtype=np.uint8)


def shown(probe, display):
    pixels, width, height, frames, name = probe.preview_frame(display)
    return np.frombuffer(pixels, np.uint8).reshape(height, width, 4), frames, name


@pytest.fixture
def preview(display):
    assert display.connect("preview", "640x360p25") == rl.EM_errorNone
    return display


@pytest.mark.parametrize(
    "fmt, bgra_order, bottom_up, padding",
    [
        (rl.EM_ImageFormat_32BitIntBGRA, [0, 1, 2, 3], False, 0),
        (rl.EM_ImageFormat_32BitIntARGB, [3, 2, 1, 0], False, 0),
        (rl.EM_ImageFormat_32BitIntBGRA, [0, 1, 2, 3], True, 5),  # rows bottom up, 20 bytes of padding a row
    ],
)
def test_a_frame_arrives_pixel_exact(preview, probe, fmt, bgra_order, bottom_up, padding):
    frame = random_frame(fmt + padding, row_pixels=WIDTH + padding)
    image = wrap(preview, frame, row_bytes=(WIDTH + padding) * 4, bottom_up=bottom_up, fmt=fmt, name="exact")
    assert rl.EM_Display_display_frame(preview, "preview", image) == rl.EM_errorNone
    pixels, frames, name = shown(probe, preview)
    np.testing.assert_array_equal(pixels, frame[:: -1 if bottom_up else 1, :WIDTH][:, :, bgra_order])
    assert (frames, name) == (1, "exact")


def test_premultiplied_video_range_is_shown_straight_full_range(preview, probe):
    frame = random_frame(4)
    image = wrap(preview, frame, premultiplied=True, full_range=False)
    assert preview.display_frame("preview", image) == rl.EM_errorNone
    colour = frame[:, :, :3].astype(np.int64)
    alpha = frame[:, :, 3:].astype(np.int64)
    full = np.clip(((colour - 16) * 255 + 109) // 219, 0, 255)
    full = np.where(colour < 16, 0, full)  # the library rounds towards zero below black
    straight = np.where(alpha == 0, 0, np.minimum(255, (full * 255 + alpha // 2) // np.maximum(alpha, 1)))
    straight = np.where(alpha == 255, full, straight)
    np.testing.assert_array_equal(shown(probe, preview)[0], np.concatenate([straight, alpha], axis=2))


def test_the_pixels_go_by_address_and_are_read_only_at_display_time(preview, probe):
    frame = bytearray(WIDTH * HEIGHT * 4)
    probe.clear_calls()
    image = wrap(preview, frame)
    buffer_address = ctypes.addressof((ctypes.c_char * len(frame)).from_buffer(frame))
    assert probe.calls_of(preview)[0].startswith(
        "EM_XIImageWrapper(%#x, 640, 360, 2560, frame, 0, 0, 1, 2.2, 0, 1)" % buffer_address
    )
    frame[:4] = b"\x01\x02\x03\x04"  # changed after wrapping, before showing: the device sees the change
    assert preview.display_frame("preview", image) == rl.EM_errorNone
    assert shown(probe, preview)[0][0, 0].tolist() == [1, 2, 3, 4]


def test_read_only_buffers_are_accepted(preview, probe):
    frame = bytes(random_frame(5))
    assert preview.display_frame("preview", wrap(preview, frame)) == rl.EM_errorNone
    assert shown(probe, preview)[0].tobytes() == frame


@pytest.mark.parametrize(
    "position, bad, ctype",
    [
        (2, 12, "(RawImage)"),
        (2, "pixels", "(RawImage)"),
        (2, None, "(RawImage)"),
        (3, 1.5, "EM_SInt32"),
        (4, "w", "EM_SInt32"),
        (5, None, "EM_SInt32"),
        (6, 5, "char *"),
        (7, 1, "bool"),
        (8, "BGRA", "EM_ImageFormat"),
        (9, "1", "double"),
        (10, None, "double"),
        (11, 0, "bool"),
        (12, None, "bool"),
    ],
)
def test_image_arguments_are_checked_in_order(preview, position, bad, ctype):
    args = [preview, bytearray(16), 2, 2, 8, "n", False, 0, 1.0, 0.0, False, True]
    args[position - 1] = bad
    args[-1] = None if position < 12 else bad  # a later bad argument must not be the one reported
    with pytest.raises(TypeError) as raised:
        rl.EM_Display_EM_XIImageWrapper(*args)
    assert str(raised.value) == "in method 'EM_Display_EM_XIImageWrapper', argument %d of type '%s'" % (position, ctype)


@pytest.mark.parametrize(
    "change",
    [
        dict(size=(0, 360)),
        dict(row_bytes=WIDTH * 4 - 1),
        dict(fmt=2),
        dict(aspect=0.0),
        dict(aspect=float("nan")),
        dict(gamma=-1.0),
    ],
)
def test_values_the_library_cannot_read_make_no_image(preview, change):
    assert wrap(preview, bytearray(WIDTH * HEIGHT * 4), **change) is None


def test_frames_are_refused_with_a_status(display, probe):
    image = wrap(display, random_frame(6))
    assert display.display_frame("nowhere", image) == rl.EM_errorNotFound
    display.connect("preview", "640x360p25")
    assert display.display_frame("preview", None) == display.display_frame(None, image) == rl.EM_errorParam
    assert probe.preview_frame(display)[3] == 0


def test_the_folder_device_writes_files_an_image_reader_opens(display, tmp_path, monkeypatch):
    monkeypatch.setenv("QRV_MONITOR_FOLDER", str(tmp_path / "out"))
    assert display.connect("folder", "320x180p25") == rl.EM_errorNone
    frames = [np.random.default_rng(seed).integers(0, 256, (180, 320, 4), dtype=np.uint8) for seed in range(3)]
    for frame in frames:
        image = wrap(display, frame, row_bytes=320 * 4, size=(320, 180), name="take 1", aspect=2.0)
        assert display.display_frame("folder", image) == rl.EM_errorNone
    files = sorted(p.name for p in (tmp_path / "out").iterdir())
    assert files == ["frame-000000.png", "frame-000001.png", "frame-000002.png"]
    for file, frame in zip(files, frames):
        with Image.open(tmp_path / "out" / file) as png:
            assert (png.mode, png.size) == ("RGBA", (320, 180))
            assert png.info["Title"] == "take 1"
            assert png.info["gamma"] == pytest.approx(1 / 2.2, abs=1e-5)
            np.testing.assert_array_equal(np.asarray(png), frame[:, :, [2, 1, 0, 3]])


def test_the_folder_device_reports_a_folder_it_cannot_make(display, tmp_path, monkeypatch):
    blocker = tmp_path / "a file"
    blocker.write_bytes(b"")
    monkeypatch.setenv("QRV_MONITOR_FOLDER", str(blocker / "frames"))
    assert display.connect("folder", "320x180p25") == rl.EM_errorDevice
    assert display.get_width("folder") == 0
