"""How arguments and results cross the boundary: integers, texts, argument counts and proxy objects."""

import re

import pytest

import _renderlib
import renderlib


REFUSED_INTS = [(v, OverflowError) for v in (2**31, -(2**31) - 1, 2**70)] + [(v, TypeError) for v in (1.0, "1", None)]


@pytest.mark.parametrize("value, error", REFUSED_INTS)
def test_32_bit_int_arguments_take_ints_in_range_only(value, error):
    info = renderlib.T_RasterInfo()
    info.ds_xsize = 7
    with pytest.raises(error, match=r"^in method 'T_RasterInfo_ds_xsize_set', argument 2 of type 'int'$"):
        info.ds_xsize = value
    assert info.ds_xsize == 7  # a failed conversion changes nothing


def test_32_bit_int_limits_and_int_subclasses_are_accepted():
    info = renderlib.T_RasterInfo()
    for value in (2147483647, -2147483648, True):
        info.ds_xsize = value
        assert info.ds_xsize == value and type(info.ds_xsize) is int


def test_an_out_of_range_index_is_refused_before_the_engine_is_called(probe):
    with pytest.raises(OverflowError, match=r"^in method 'get_tarsel_plugin_info_i', argument 1 of type 'int'$"):
        _renderlib.get_tarsel_plugin_info_i(2147483648)
    assert probe.calls() == []


def test_strict_booleans_and_unsigned_and_float_ranges(shared_registry):
    assert shared_registry.negate(False) is True
    assert shared_registry.echo_unsigned(4294967295) == 4294967295
    assert shared_registry.halve(3) == 1.5  # an int is taken as a float
    assert shared_registry.halve(float("inf")) == float("inf")
    refused = [("negate", value, TypeError, "bool") for value in (1, 0, None, 1.0)]
    refused += [("echo_unsigned", value, OverflowError, "unsigned int") for value in (-1, 2**32)]
    refused += [("halve", 1e39, OverflowError, "float"), ("halve", 2**1100, TypeError, "float")]
    for name, value, error, ctype in refused:
        with pytest.raises(error, match=r"^in method '%s', argument 1 of type '%s'$" % (name, ctype)):
            getattr(shared_registry, name)(value)


# The message of a refused call names the function and, for a count, what it
# takes; of a refused argument, the first one that fails. (An overload set's
# messages: tests/catalogue/test_param.py.)
@pytest.mark.parametrize(
    "arguments, message",
    [
        ([None], r"^T_RasterInfo_ds_xsize_set expected 2 arguments, got 1$"),
        ([None, 1, 2], r"^T_RasterInfo_ds_xsize_set expected 2 arguments, got 3$"),
        ([5, "not an int"], r"^in method 'T_RasterInfo_ds_xsize_set', argument 1 of type 'T_RasterInfo \*'$"),
    ],
)
def test_a_refused_call_names_the_function_and_what_it_takes(arguments, message):
    with pytest.raises(TypeError, match=message):
        _renderlib.T_RasterInfo_ds_xsize_set(*arguments)


def test_proxy_objects():
    info = renderlib.T_RasterInfo()
    proxy = info.this
    assert type(proxy).__name__ == "SwigPyObject"
    assert re.fullmatch(r"<Swig Object of type 'T_RasterInfo \*' at 0x[0-9a-f]+>", repr(proxy))
    assert proxy.own() is True
    proxy.disown()
    assert proxy.own() is False
    proxy.acquire()
    assert proxy.own(False) is True and proxy.own() is False
    proxy.own(True)
    assert proxy.next() is None
    with pytest.raises(TypeError, match="^Attempt to append a non SwigPyObject$"):
        proxy.append(5)
    # Equal when they hold the same address; anything else is not one (and is
    # not read as one: the sanitizer run watches that).
    assert proxy == info.this and proxy != renderlib.T_RasterInfo().this
    assert proxy.__eq__(5) is NotImplemented and proxy != object() and not proxy == "x"
    # A deleting function disowns its argument.
    _renderlib.delete_T_RasterInfo(info)
    assert proxy.own() is False  # dropping `info` now frees nothing twice
