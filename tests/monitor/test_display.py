"""Displays: connecting, their virtual operations, and their lifetime; image
proxies: one reference each, given back exactly once."""

import gc

import pytest

import _renderlib as rl
from monitor_probe import address, wrap


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
    # One per call, in order; disconnect is connect with a null mode.
    calls = "devices() -> 2|device_modes(folder) -> 4|connect(preview, 640x360p25) -> 0|get_width(preview) -> 640|"
    calls += "get_height(preview) -> 360|display_frame(preview, null) -> 1|connect(dev, null) -> 2|"
    calls += "connect(preview, null) -> 0"
    assert probe.calls_of(display) == calls.split("|")


def test_two_displays_are_independent(probe):
    first, second = rl.EM_DisplayInit(), rl.EM_DisplayInit()
    assert probe.number(first) != probe.number(second)
    assert first.connect("preview", "640x360p25") == second.connect("preview", "1280x720p50") == rl.EM_errorNone
    assert first.get_width("preview") == 640 and second.get_width("preview") == 1280
    rl.release_external_monitor(first)
    assert second.get_width("preview") == 1280
    rl.release_external_monitor(second)


def make_image(display):
    return wrap(display, bytearray(8 * 4 * 4), width=8, height=4, row_bytes=32, name=None, gamma=0.0)


@pytest.mark.parametrize("deleted_first", [False, True])
def test_the_image_proxy_gives_its_reference_back_once(display, probe, deleted_first):
    image = make_image(display)
    number, at = probe.number(image), address(image)
    assert probe.image_refs(at) == 1
    probe.clear_calls()
    if deleted_first:
        rl.delete_EM_XIImage(image)
        assert not image.thisown
    del image
    gc.collect()
    assert probe.calls() == ["image%d.removeRef() -> 0" % number]
    assert probe.image_refs(at) == -1


def test_image_add_and_remove_pass_straight_through_to_the_last_reference(display, probe):
    image = make_image(display)
    at = address(image)
    assert (rl.EM_XIImage_addRef(image), image.addRef(), rl.EM_XIImage_removeRef(image)) == (2, 3, 2)
    assert image.thisown and probe.image_refs(at) == 2
    assert image.removeRef() == 1 and image.removeRef() == 0  # the proxy's own reference given back by the caller
    no_image = r"^in method 'EM_XIImage_getWidth', argument 1 of type 'EM_XIImage const \*': no image"
    with pytest.raises(ValueError, match=no_image):
        image.getWidth()
    with pytest.raises(ValueError, match=r"argument 3 of type 'EM_XIImage const \*': its last reference"):
        display.display_frame("preview", image)
    with pytest.raises(ValueError, match="^in method 'delete_EM_XIImage'"):
        rl.delete_EM_XIImage(image)
    del image  # disowned by the refused delete: nothing more happens
    assert probe.image_refs(at) == -1
