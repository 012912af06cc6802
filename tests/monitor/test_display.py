"""Displays: connecting, their virtual operations, and their lifetime."""

import pytest

import _renderlib as rl


def test_connect_answers_with_the_status_and_sets_the_frame_size(display, tmp_path, monkeypatch):
    monkeypatch.setenv("QRV_MONITOR_FOLDER", str(tmp_path))
    assert display.connect("preview", "320x180p25") == rl.EM_errorNotFound  # a mode of the other device
    assert (display.get_width("preview"), display.get_height("preview")) == (0, 0)
    assert rl.EM_Display_connect(display, "folder", "320x180p25") == rl.EM_errorNone
    assert display.connect("preview", "1280x720p50") == rl.EM_errorNone
    assert (rl.EM_Display_get_width(display, "preview"), rl.EM_Display_get_height(display, "preview")) == (1280, 720)
    assert display.connect("preview", "1920x1080p25") == rl.EM_errorNone  # switching modes
    assert (display.get_width("preview"), display.get_height("preview")) == (1920, 1080)
    assert display.get_width("folder") == 320 and display.get_width("nowhere") == 0


def test_each_function_calls_its_own_virtual_operation(display, probe):
    probe.clear_calls()
    display.devices()
    display.device_modes("folder")
    display.connect("preview", "640x360p25")
    display.get_width("preview")
    display.get_height("preview")
    display.display_frame("preview", None)
    rl.EM_Display_disconnect(display, "dev")
    rl.EM_Display_disconnect(display, "preview")
    assert probe.calls_of(display) == [
        "devices() -> 2",
        "device_modes(folder) -> 4",
        "connect(preview, 640x360p25) -> 0",
        "get_width(preview) -> 640",
        "get_height(preview) -> 360",
        "display_frame(preview, null) -> 1",
        "connect(dev, null) -> 2",
        "connect(preview, null) -> 0",
    ]  # disconnect is connect with a null mode


def test_two_displays_are_independent(probe):
    first, second = rl.EM_DisplayInit(), rl.EM_DisplayInit()
    assert probe.number(first) != probe.number(second)
    assert first.connect("preview", "640x360p25") == second.connect("preview", "1280x720p50") == rl.EM_errorNone
    assert first.get_width("preview") == 640 and second.get_width("preview") == 1280
    rl.release_external_monitor(first)
    assert second.get_width("preview") == 1280
    rl.release_external_monitor(second)


@pytest.mark.parametrize(
    "function, args, position, ctype",
    [
        ("EM_Display_connect", ("D", "preview", "x"), 1, "EM_Display *"),
        ("EM_Display_connect", (None, 2, "x"), 2, "char const *"),
        ("EM_Display_connect", (None, "preview", b"x"), 3, "char const *"),
        ("EM_Display_display_frame", (None, "preview", bytearray(4)), 3, "EM_XIImage const *"),
        ("EM_Display_get_height", (None, []), 2, "char const *"),
        ("EM_XIImage_removeRef", ("I",), 1, "EM_XIImage *"),
        ("EM_XIImage_getRowBytes", ("I",), 1, "EM_XIImage const *"),
    ],
)
def test_argument_errors_name_function_position_and_type(display, function, args, position, ctype):
    args = tuple(display if a is None and i == 0 else a for i, a in enumerate(args))
    with pytest.raises(TypeError) as raised:
        getattr(rl, function)(*args)
    assert str(raised.value) == "in method '%s', argument %d of type '%s'" % (function, position, ctype)
