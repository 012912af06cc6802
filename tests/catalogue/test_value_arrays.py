"""ValueArray and ShortInputArray: fixed arrays overlaying engine records."""

import ctypes
import math

import pytest

import renderlib


def test_new_arrays_have_their_fixed_length_and_read_zero():
    assert len(renderlib.ValueArray()) == 4 and list(renderlib.ValueArray()) == [0.0] * 4
    assert len(renderlib.ShortInputArray()) == 8 and list(renderlib.ShortInputArray()) == [0] * 8


def test_value_array_elements():
    values = renderlib.ValueArray()
    values[3] = 1.5
    values[0] = 2  # an int is taken as a float
    values[1] = float("inf")
    values[2] = float("nan")
    assert values[3] == 1.5 and values[0] == 2.0 and values[1] == math.inf and math.isnan(values[2])
    for access in (lambda: values[4], lambda: values.__setitem__(4, 0.0)):
        with pytest.raises(IndexError, match="^out of bounds access$"):
            access()
    with pytest.raises(OverflowError):
        values[0] = 1e39
    assert values[0] == 2.0  # a refused store changes nothing


def test_short_input_array_elements():
    shorts = renderlib.ShortInputArray()
    shorts[7] = 32767
    shorts[0] = -32768
    assert (shorts[7], shorts[0]) == (32767, -32768)


def test_data_is_a_pointer_and_assigning_one_copies_the_elements():
    source, target = renderlib.ValueArray(), renderlib.ValueArray()
    for i in range(4):
        source[i] = i + 0.5
    assert int(source.data) == int(source.this)
    target.data = source.data
    assert list(target) == [0.5, 1.5, 2.5, 3.5]
    for refused, error in ((None, ValueError), ([1.0, 2.0, 3.0, 4.0], TypeError)):  # no pointer to copy from
        with pytest.raises(error):
            target.data = refused
    assert list(target) == [0.5, 1.5, 2.5, 3.5]


def test_a_raster_descriptors_background_is_accepted_as_value_data():
    info = renderlib.T_RasterInfo()
    ctypes.memmove(int(info.this) + 60, (ctypes.c_float * 4)(0.1, 0.2, 0.3, 0.4), 16)
    values = renderlib.ValueArray()
    values.data = info.background_pixel
    assert list(values) == pytest.approx([0.1, 0.2, 0.3, 0.4])
