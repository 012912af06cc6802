"""Frames shown on the devices: pixels by address, converted exactly; and
through the companion layer's Monitor, whole frames of the mode's size with
failures raised."""

import ctypes

import numpy as np
import pytest
from PIL import Image

import _renderlib as rl
from monitor_probe import HEIGHT, WIDTH, wrap
from renderlib.monitor import Monitor, MonitorError


def random_frame(seed, row_pixels=WIDTH, height=HEIGHT):
    return np.random.default_rng(seed).integers(0, 256, (height, row_pixels, 4), dtype=np.uint8)


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
    colour, alpha = np.split(frame.astype(np.int64), [3], axis=2)
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
    logged = "EM_XIImageWrapper(%#x, 640, 360, 2560, frame, 0, 0, 1, 2.2, 0, 1)" % buffer_address
    assert probe.calls_of(preview)[0].startswith(logged)
    frame[:4] = b"\x01\x02\x03\x04"  # changed after wrapping, before showing: the device sees the change
    assert preview.display_frame("preview", image) == rl.EM_errorNone
    assert shown(probe, preview)[0][0, 0].tolist() == [1, 2, 3, 4]


def test_read_only_buffers_are_accepted(preview, probe):
    frame = bytes(random_frame(5))
    assert preview.display_frame("preview", wrap(preview, frame)) == rl.EM_errorNone
    assert shown(probe, preview)[0].tobytes() == frame


@pytest.mark.parametrize(
    "field, value",
    [("width", 0), ("row_bytes", WIDTH * 4 - 1), ("fmt", 2), ("aspect", 0.0), ("aspect", np.nan), ("gamma", -1.0)],
)
def test_values_the_library_cannot_read_make_no_image(preview, field, value):
    assert wrap(preview, bytearray(WIDTH * HEIGHT * 4), **{field: value}) is None


def test_frames_are_refused_with_a_status(display, probe):
    image = wrap(display, random_frame(6))
    display.connect("preview", "640x360p25")
    assert display.display_frame("preview", None) == display.display_frame(None, image) == rl.EM_errorParam
    assert probe.preview_frame(display)[3] == 0


def test_the_folder_device_writes_files_an_image_reader_opens(display, tmp_path, monkeypatch):
    monkeypatch.setenv("QRV_MONITOR_FOLDER", str(tmp_path / "out"))
    assert display.connect("folder", "320x180p25") == rl.EM_errorNone
    frames = [random_frame(seed, 320, 180) for seed in range(3)]
    for frame in frames:
        image = wrap(display, frame, width=320, height=180, row_bytes=320 * 4, name="take 1", aspect=2.0)
        assert display.display_frame("folder", image) == rl.EM_errorNone
    files = sorted(p.name for p in (tmp_path / "out").iterdir())
    assert files == ["frame-000000.png", "frame-000001.png", "frame-000002.png"]
    for file, frame in zip(files, frames):
        with Image.open(tmp_path / "out" / file) as png:
            assert (png.mode, png.size, png.info["Title"]) == ("RGBA", (320, 180), "take 1")
            assert png.info["gamma"] == pytest.approx(1 / 2.2, abs=1e-5)
            np.testing.assert_array_equal(np.asarray(png), frame[:, :, [2, 1, 0, 3]])


def test_the_folder_device_reports_a_folder_it_cannot_make(display, tmp_path, monkeypatch):
    blocker = tmp_path / "a file"
    blocker.write_bytes(b"")
    monkeypatch.setenv("QRV_MONITOR_FOLDER", str(blocker / "frames"))
    assert display.connect("folder", "320x180p25") == rl.EM_errorDevice
    assert display.get_width("folder") == 0


def test_a_frame_shown_through_the_monitor_reaches_the_device(probe):
    frame = random_frame(1)
    with Monitor("preview", "640x360p25") as monitor:
        monitor.show(frame, name="first")
        pixels, width, height, frames, name = probe.preview_frame(monitor._display)
        assert (width, height, frames, name) == (640, 360, 1, "first") and pixels == frame.tobytes()
        with pytest.raises(MonitorError, match="describing the frame"):
            monitor.show(frame, pixel_aspect=0.0)
