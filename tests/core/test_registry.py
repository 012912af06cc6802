"""Type sharing between _renderlib and another module on the same registry, and the identity rule of engine records."""

import ctypes

import pytest

import _renderlib
import renderlib


def test_a_proxy_crosses_to_the_other_module_and_back_and_one_of_another_class_is_refused(shared_registry):
    info = renderlib.T_RasterInfo()
    info.ds_xsize = 1920
    assert shared_registry.raster_width(info) == shared_registry.raster_width(info.this) == 1920  # bare proxy too
    again = shared_registry.same_raster(info)
    assert type(again) is renderlib.T_RasterInfo and int(again.this) == int(info.this)
    assert not again.this.own()  # the other module did not create it
    again.ds_ysize = 1080
    assert info.ds_ysize == 1080
    # A proxy of another class is refused.
    with pytest.raises(TypeError, match=r"^in method 'raster_width', argument 1 of type 'T_RasterInfo const \*'$"):
        shared_registry.raster_width(renderlib.T_RenderInfo())


def low_32_bits_signed(address):
    return ctypes.c_int32(address & 0xFFFFFFFF).value


def test_records_are_equal_by_native_address_and_hash_by_its_low_bits(shared_registry):
    first, same, other = (shared_registry.context_handle(i) for i in (0, 0, 1))
    assert type(first) is renderlib.RenderContext
    assert first is not same and first == same and not (first != same)
    assert first != other and not (first == other)
    assert hash(first) == hash(same) == low_32_bits_signed(int(first.this))
    assert hash(other) == low_32_bits_signed(int(other.this))
    # Compared with anything else, a record leaves the answer to Python.
    for foreign in (None, 5, "context", renderlib.T_RasterInfo()):
        assert (first == foreign) is False and (first != foreign) is True, foreign
        assert _renderlib.RenderContext___eq__(first, foreign) is NotImplemented, foreign
        assert _renderlib.RenderContext___ne__(first, foreign) is NotImplemented, foreign
