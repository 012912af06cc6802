"""Image proxies: one reference each, given back exactly once."""

import gc

import pytest

import _renderlib as rl
from monitor_probe import address


def make_image(display):
    return rl.EM_Display_EM_XIImageWrapper(
        display, bytearray(8 * 4 * 4), 8, 4, 32, None, False, 0, 1.0, 0.0, False, True
    )


@pytest.mark.parametrize("deleted_first", [False, True])
def test_the_proxy_gives_its_reference_back_once(display, probe, deleted_first):
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


def test_add_and_remove_pass_straight_through_to_the_last_reference(display, probe):
    image = make_image(display)
    at = address(image)
    assert (rl.EM_XIImage_addRef(image), image.addRef(), rl.EM_XIImage_removeRef(image)) == (2, 3, 2)
    assert image.thisown and probe.image_refs(at) == 2
    assert (image.getWidth(), image.getHeight(), rl.EM_XIImage_getRowBytes(image)) == (8, 4, 32)
    assert image.removeRef() == 1 and image.removeRef() == 0  # the proxy's own reference given back by the caller
    with pytest.raises(
        ValueError,
        match=r"^in method 'EM_XIImage_getWidth', argument 1 of type "
        r"'EM_XIImage const \*': no image",
    ):
        image.getWidth()
    with pytest.raises(ValueError, match=r"argument 3 of type 'EM_XIImage const \*': its last reference"):
        display.display_frame("preview", image)
    with pytest.raises(ValueError, match="^in method 'delete_EM_XIImage'"):
        rl.delete_EM_XIImage(image)
    del image  # disowned by the refused delete: nothing more happens
    assert probe.image_refs(at) == -1
