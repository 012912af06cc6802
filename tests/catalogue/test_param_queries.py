"""The engine's free parameter queries, called with pointer proxies."""

import _renderlib
import renderlib
from effect_helpers import all_entries, all_params


def a_param(instance, predicate):
    for name, builder in all_entries():
        for param in all_params(instance(name, builder)):
            if predicate(param):
                return param
    raise LookupError("no parameter matches")


def test_title_with_the_callers_buffer_matches_get_titles(instance):
    colour = a_param(instance, lambda p: p.ptype == _renderlib.ptype_color)
    titles = colour.get_titles()
    assert len(titles) == colour.n_channels_c1
    for channel, title in enumerate(titles):
        assert _renderlib.tarsel_get_param_title(colour, channel, " " * 255, 256) == title


def test_bounds_through_float_pointers(instance):
    param = a_param(instance, lambda p: p.ptype == _renderlib.ptype_float and p.get_limits()[0] is not None)
    outputs = [renderlib.ValueArray() for _ in range(4)]
    assert _renderlib.tarsel_get_param_bounds2(param, 1.0, 0, *[o.data for o in outputs], 0) is None
    lower, upper, third, fourth = param.get_limits()
    assert [o[0] for o in outputs] == [lower, upper if upper is not None else 1000000.0, third, fourth]


def test_node_flags_and_text(instance):
    hosted = next(g for n, b in all_entries() for g in instance(n, b)._get_genotypes() if g._uses_host_data())
    assert isinstance(_renderlib.tarsel_any_nodes_get_flag(hosted, 0x20000), int)
    param = a_param(instance, lambda p: p.ptype == _renderlib.ptype_int)
    assert _renderlib.tarsel_param_to_string(param) == param.to_string(None)


def test_popup_names_through_a_pointer(instance):
    param = a_param(instance, lambda p: p.flags.fromfile_popup_p)
    assert _renderlib.tarsel_get_fromfile_popup_names(param, None) == len(param.get_fromfile_popup_names())
