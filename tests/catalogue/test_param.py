"""Param made from Python: construction, attributes, overloads, identity."""

import re

import pytest

import _renderlib
import renderlib


def test_a_param_made_from_a_name_and_type_has_one_channel_and_the_normal_mode():
    param = renderlib.Param("Radius", _renderlib.ptype_float)
    assert (param.name, param.ptype, param.n_channels, param.flags.screen_mode) == ("Radius", 1, 1, 0)
    assert repr(param) == 'Param("Radius" (1 ch) @0x%x)' % int(param.this)
    assert param.this.own()


def test_constructor_overloads_and_their_message():
    point = renderlib.Param("Center", _renderlib.ptype_float, 2, _renderlib.screen_mode_screen_center)
    assert (point.n_channels, point.flags.screen_mode) == (2, 2)
    assert renderlib.Param("Wide", _renderlib.ptype_float, 300).n_channels == 300 & 0xFF
    assert renderlib.Param("Masked", _renderlib.ptype_float, 1, 17).flags.screen_mode == 1
    for bad in [(), ("x",), (5, 1), ("x", 1.0), ("x", 1, True, 0.5), ("x", 1, 1, 0, 0)]:
        with pytest.raises(TypeError, match="overloaded function 'new_Param'"):
            renderlib.Param(*bad)


def test_name_assignment():
    param = renderlib.Param("Old", _renderlib.ptype_int)
    param.name = "New \u00e9"
    assert param.name == "New \u00e9"
    param.name = None
    assert param.name is None
    assert repr(param) == 'Param("(null)" (1 ch) @0x%x)' % int(param.this)


def test_channel_count_and_type_assignment_and_read_only_members():
    param = renderlib.Param("Count", _renderlib.ptype_int)
    param.n_channels = 255
    assert param.n_channels == 255
    param.ptype = _renderlib.ptype_boolean
    assert param.ptype == _renderlib.ptype_boolean
    for name in ("canonical_name", "n_channels_c1", "min_bound", "flags", "default_value", "param_group"):
        with pytest.raises(AttributeError):
            setattr(param, name, getattr(param, name))


def test_identity_equality_and_hash():
    a = renderlib.Param("Same", _renderlib.ptype_float)
    b = renderlib.Param("Same", _renderlib.ptype_float)
    assert a != b and not (a == b)  # equal contents, different objects
    assert _renderlib.Param___eq__(a, None) is NotImplemented  # and a stranger: tests/core/test_wrapper_leaks.py


def test_overloaded_methods_and_strict_booleans():
    param = renderlib.Param("Amount", _renderlib.ptype_float)
    assert param.to_string(None) == param.to_string(None, False)
    assert param.to_string_const(None) == param.to_string(None)
    with pytest.raises(TypeError, match="overloaded function 'Param_to_string'"):
        param.to_string(None, 1)  # an int is no bool, in an overload set too


def test_engine_members_of_a_param_made_from_python():
    param = renderlib.Param("Angle", _renderlib.ptype_float)
    assert param.ptype_name() == "float"
    assert param.numeric_p() is True
    assert isinstance(param.format(), int)
    assert re.fullmatch(r"<Swig Object of type 'cJSON \*' at 0x[0-9a-f]+>", repr(param.to_json(None)))
    assert param.get_state_names() == []  # not a popup
    assert param.is_point() is False
    assert param.get_limits() == (None, None, param.slider_min, param.slider_max)  # "no limit" both ways
