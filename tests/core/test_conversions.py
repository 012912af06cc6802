"""How arguments and results cross the boundary: integers, texts, argument
counts and proxy objects."""

import re

import pytest

import _renderlib
import renderlib


@pytest.mark.parametrize(
    "value, error",
    [
        (2147483648, OverflowError),
        (-2147483649, OverflowError),
        (2**70, OverflowError),
        (1.0, TypeError),
        ("1", TypeError),
        (None, TypeError),
    ],
)
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


def test_strict_booleans(shared_registry):
    assert shared_registry.negate(False) is True
    for value in (1, 0, None, 1.0):
        with pytest.raises(TypeError, match=r"^in method 'negate', argument 1 of type 'bool'$"):
            shared_registry.negate(value)


def test_unsigned_and_float_ranges(shared_registry):
    assert shared_registry.echo_unsigned(4294967295) == 4294967295
    for value in (-1, 4294967296):
        with pytest.raises(OverflowError, match=r"argument 1 of type 'unsigned int'$"):
            shared_registry.echo_unsigned(value)
    assert shared_registry.halve(3) == 1.5  # an int is taken as a float
    assert shared_registry.halve(float("inf")) == float("inf")
    with pytest.raises(OverflowError, match=r"argument 1 of type 'float'$"):
        shared_registry.halve(1e39)
    with pytest.raises(TypeError, match=r"argument 1 of type 'float'$"):
        shared_registry.halve(2**1100)


# The message of a refused call names the function and, for a count, what it
# takes (an overload set adds its prototypes); of a refused argument, the
# first one that fails.
@pytest.mark.parametrize(
    "call, message",
    [
        (
            lambda helpers: _renderlib.T_RasterInfo_ds_xsize_set(renderlib.T_RasterInfo()),
            r"^T_RasterInfo_ds_xsize_set expected 2 arguments, got 1$",
        ),
        (
            lambda helpers: _renderlib.T_RasterInfo_ds_xsize_set(renderlib.T_RasterInfo(), 1, 2),
            r"^T_RasterInfo_ds_xsize_set expected 2 arguments, got 3$",
        ),
        (lambda helpers: helpers.scaled(), r"^scaled expected at least 1 arguments, got 0$"),
        (lambda helpers: helpers.scaled(1, 2, 3), r"^scaled expected at most 2 arguments, got 3$"),
        (
            lambda helpers: helpers.arity(1, 2, 3),
            r"^arity expected at most 2 arguments, got 3\nAdditional information:\n"
            r"Wrong number or type of arguments for overloaded function 'arity'",
        ),
        (lambda helpers: helpers.arity(), r"^Wrong number or type of arguments for overloaded function 'arity'"),
        (
            lambda helpers: _renderlib.T_RasterInfo_ds_xsize_set(5, "not an int"),
            r"argument 1 of type 'T_RasterInfo \*'$",
        ),
    ],
)
def test_a_refused_call_names_the_function_and_what_it_takes(shared_registry, call, message):
    with pytest.raises(TypeError, match=message):
        call(shared_registry)


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


def test_a_deleting_function_disowns_its_argument():
    info = renderlib.T_RasterInfo()
    proxy = info.this
    _renderlib.delete_T_RasterInfo(info)
    assert proxy.own() is False  # dropping `info` now frees nothing twice
