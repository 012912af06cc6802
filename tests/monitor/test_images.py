"""Image proxies: one reference each, given back exactly once."""
import gc

import pytest

import _renderlib as rl
from monitor_probe import address
from process_memory import UNDER_ADDRESS_SANITIZER, resident_kib


def make_image(display, pixels=None):
    pixels = bytearray(8 * 4 * 4) if pixels is None else pixels
    return rl.EM_Display_EM_XIImageWrapper(display, pixels, 8, 4, 32, None, False, 0, 1.0, 0.0, False, True)


def test_dropping_the_proxy_removes_its_reference_once(display, probe):
    image = make_image(display)
    number, at = probe.number(image), address(image)
    assert probe.image_refs(at) == 1
    probe.clear_calls()
    del image
    gc.collect()
    assert probe.calls() == ["image%d.removeRef() -> 0" % number]
    assert probe.image_refs(at) == -1


def test_delete_then_drop_removes_it_once_in_all(display, probe):
    image = make_image(display)
    number = probe.number(image)
    probe.clear_calls()
    rl.delete_EM_XIImage(image)
    assert not image.thisown
    del image
    gc.collect()
    assert probe.calls() == ["image%d.removeRef() -> 0" % number]


def test_add_and_remove_pass_straight_through(display, probe):
    image = make_image(display)
    at = address(image)
    assert (rl.EM_XIImage_addRef(image), image.addRef()) == (2, 3)
    assert rl.EM_XIImage_removeRef(image) == 2
    assert image.thisown and probe.image_refs(at) == 2
    assert (image.getWidth(), image.getHeight(), rl.EM_XIImage_getRowBytes(image)) == (8, 4, 32)
    image.removeRef()
    del image  # the proxy's own reference, the last
    assert probe.image_refs(at) == -1


def test_an_image_whose_last_reference_went_is_refused(display, probe):
    image = make_image(display)
    assert image.removeRef() == 0  # the caller gave back the proxy's reference itself
    message = r"^in method 'EM_XIImage_getWidth', argument 1 of type 'EM_XIImage const \*': no image"
    with pytest.raises(ValueError, match=message):
        image.getWidth()
    with pytest.raises(ValueError, match="argument 3 of type 'EM_XIImage const \\*': its last reference"):
        display.display_frame("preview", image)
    with pytest.raises(ValueError, match="^in method 'delete_EM_XIImage'"):
        rl.delete_EM_XIImage(image)
    del image  # disowned by the refused delete: nothing more happens


def test_an_image_outlives_its_display(probe):
    display = rl.EM_DisplayInit()
    image = make_image(display)
    rl.release_external_monitor(display)
    assert image.getWidth() == 8


def test_a_thousand_frames_leave_memory_flat(display, probe):
    display.connect("preview", "640x360p25")
    frame = bytearray(640 * 360 * 4)

    def show(count):
        for i in range(count):
            frame[0] = i & 255
            image = rl.EM_Display_EM_XIImageWrapper(display, frame, 640, 360, 2560, "f", False, 1, 1.0, 2.2,
                                                    True, False)
            assert rl.EM_Display_display_frame(display, "preview", image) == rl.EM_errorNone

    show(50)
    rss = resident_kib()
    show(1000)
    assert probe.live_images() == 0
    assert probe.preview_frame(display)[3] == 1050
    if not UNDER_ADDRESS_SANITIZER:
        assert resident_kib() - rss < 1024, "resident memory grew by %d KiB" % (resident_kib() - rss)
