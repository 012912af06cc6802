"""Displays: devices, modes, connecting, and their lifetime."""
import pytest

import _renderlib as rl
import renderlib

PREVIEW_MODES = ["1920x1080p25", "1920x1080p50", "1280x720p50", "1280x720p25", "640x360p25"]
FOLDER_MODES = ["1920x1080p25", "1280x720p25", "640x360p25", "320x180p25"]


def test_devices_and_their_modes(display):
    assert rl.EM_Display_devices(display) == ["preview", "folder"]
    assert display.devices() == ["preview", "folder"]
    assert rl.EM_Display_device_modes(display, "preview") == PREVIEW_MODES
    assert rl.EM_Display_device_modes(display, "folder") == FOLDER_MODES
    assert rl.EM_Display_device_modes(display, "no such device") == []


def test_a_display_made_without_devices_lists_none(probe):
    probe.no_devices(True)
    try:
        display = rl.EM_DisplayInit()
    finally:
        probe.no_devices(False)
    try:
        assert rl.EM_Display_devices(display) == []
        assert rl.EM_Display_connect(display, "preview", "640x360p25") == rl.EM_errorNotFound
    finally:
        rl.release_external_monitor(display)


def test_no_display_is_none(probe):
    probe.init_fails(True)
    try:
        assert rl.EM_DisplayInit() is None
    finally:
        probe.init_fails(False)


@pytest.mark.parametrize("device, mode, status", [
    ("preview", "1280x720p50", rl.EM_errorNone),
    ("folder", "320x180p25", rl.EM_errorNone),
    ("preview", "320x180p25", rl.EM_errorNotFound),   # a mode of the other device
    ("nowhere", "640x360p25", rl.EM_errorNotFound),
    (None, "640x360p25", rl.EM_errorParam),
])
def test_connect_answers_with_the_library_status(display, device, mode, status, tmp_path, monkeypatch):
    monkeypatch.setenv("QRV_MONITOR_FOLDER", str(tmp_path))
    assert rl.EM_Display_connect(display, device, mode) == status


def test_the_connected_mode_gives_the_frame_size(display):
    assert (display.get_width("preview"), display.get_height("preview")) == (0, 0)
    assert display.connect("preview", "1280x720p50") == rl.EM_errorNone
    assert (rl.EM_Display_get_width(display, "preview"), rl.EM_Display_get_height(display, "preview")) == (1280, 720)
    assert display.connect("preview", "1920x1080p25") == rl.EM_errorNone  # switching modes
    assert (display.get_width("preview"), display.get_height("preview")) == (1920, 1080)
    assert display.disconnect("preview") == rl.EM_errorNone
    assert (display.get_width("preview"), display.get_height("preview")) == (0, 0)
    assert display.get_width("nowhere") == 0


def test_disconnect_is_connect_with_a_null_mode(display, probe):
    probe.clear_calls()
    assert rl.EM_Display_disconnect(display, "dev") == rl.EM_errorNotFound
    assert rl.EM_Display_disconnect(display, "preview") == rl.EM_errorNone
    assert probe.calls_of(display) == ["connect(dev, null) -> 2", "connect(preview, null) -> 0"]


def test_each_function_calls_its_own_virtual_operation(display, probe):
    probe.clear_calls()
    display.devices()
    display.device_modes("folder")
    display.connect("preview", "640x360p25")
    display.get_width("preview")
    display.get_height("preview")
    display.display_frame("preview", None)
    assert probe.calls_of(display) == [
        "devices() -> 2", "device_modes(folder) -> 4", "connect(preview, 640x360p25) -> 0",
        "get_width(preview) -> 640", "get_height(preview) -> 360", "display_frame(preview, null) -> 1"]


def test_two_displays_are_independent(probe):
    first, second = rl.EM_DisplayInit(), rl.EM_DisplayInit()
    try:
        assert probe.number(first) != probe.number(second)
        assert first.connect("preview", "640x360p25") == rl.EM_errorNone
        assert second.connect("preview", "1280x720p50") == rl.EM_errorNone
        assert first.get_width("preview") == 640 and second.get_width("preview") == 1280
        rl.release_external_monitor(first)
        assert second.get_width("preview") == 1280
    finally:
        for display in (first, second):
            try:
                rl.release_external_monitor(display)
            except ValueError:
                pass


def test_release_destroys_the_display_and_the_proxy_is_refused_after(display, probe):
    live = probe.live_displays()
    number = probe.number(display)
    rl.release_external_monitor(display)
    assert probe.live_displays() == live - 1
    assert probe.calls()[-1] == "display%d.~EM_Display()" % number
    message = r"^in method 'EM_Display_get_width', argument 1 of type 'EM_Display \*': no display"
    with pytest.raises(ValueError, match=message):
        rl.EM_Display_get_width(display, "preview")
    with pytest.raises(ValueError, match="^in method 'release_external_monitor', argument 1"):
        rl.release_external_monitor(display)
    with pytest.raises(ValueError, match="^in method 'EM_Display_devices', argument 1 of type 'EM_Display \\*'"):
        rl.EM_Display_devices(None)


def test_displays_are_made_only_by_the_factory():
    with pytest.raises(AttributeError, match="No constructor defined"):
        renderlib.EM_Display()
    with pytest.raises(AttributeError, match="No constructor defined"):
        renderlib.EM_XIImage()
    assert not hasattr(rl, "delete_EM_Display") and not hasattr(rl, "new_EM_Display")
    with pytest.raises(TypeError, match="takes no arguments"):
        rl.EM_DisplayInit(1)


@pytest.mark.parametrize("function, args, position, ctype", [
    ("EM_Display_connect", ("D", "preview", "x"), 1, "EM_Display *"),
    ("EM_Display_connect", (None, 2, "x"), 2, "char const *"),
    ("EM_Display_connect", (None, "preview", b"x"), 3, "char const *"),
    ("EM_Display_display_frame", ("D", "preview", None), 1, "EM_Display *"),
    ("EM_Display_display_frame", (None, 7, None), 2, "char const *"),
    ("EM_Display_display_frame", (None, "preview", bytearray(4)), 3, "EM_XIImage const *"),
    ("EM_Display_get_width", (None, 1.5), 2, "char const *"),
    ("EM_Display_get_height", (None, []), 2, "char const *"),
    ("EM_Display_device_modes", (None, 0), 2, "char const *"),
    ("EM_Display_disconnect", (None, ()), 2, "char const *"),
    ("EM_Display_devices", ("D",), 1, "EM_Display *"),
    ("release_external_monitor", ("D",), 1, "EM_Display *"),
    ("EM_XIImage_addRef", ("I",), 1, "EM_XIImage *"),
    ("EM_XIImage_removeRef", ("I",), 1, "EM_XIImage *"),
    ("EM_XIImage_getWidth", ("I",), 1, "EM_XIImage const *"),
    ("EM_XIImage_getHeight", ("I",), 1, "EM_XIImage const *"),
    ("EM_XIImage_getRowBytes", ("I",), 1, "EM_XIImage const *"),
])
def test_argument_errors_name_function_position_and_type(display, function, args, position, ctype):
    args = tuple(display if a is None and i == 0 else a for i, a in enumerate(args))
    message = "in method '%s', argument %d of type '%s'" % (function, position, ctype)
    with pytest.raises(TypeError) as raised:
        getattr(rl, function)(*args)
    assert str(raised.value) == message
