"""The plug-in catalogues as the module hands them over."""
import pytest

import _renderlib
import renderlib


def test_counts_come_from_the_engine(probe):
    assert _renderlib.get_n_tarsel_effects() >= 0
    assert _renderlib.get_n_tarsel_builder_effects() >= 0
    assert probe.calls() == ["get_n_tarsel_effects()", "get_n_tarsel_builder_effects()"]


@pytest.mark.parametrize("lookup", ["get_tarsel_plugin_info_i", "get_tarsel_builder_info_i"])
def test_indices_reach_the_engine_unchecked_and_null_becomes_none(probe, lookup):
    count = (_renderlib.get_n_tarsel_effects() if lookup == "get_tarsel_plugin_info_i"
             else _renderlib.get_n_tarsel_builder_effects())
    probe.clear_calls()
    for index in (count, -1, 2147483647):
        assert getattr(_renderlib, lookup)(index) is None  # the reference engine returns null
    assert probe.calls() == ["%s(%d)" % (lookup, i) for i in (count, -1, 2147483647)]
    with pytest.raises(TypeError, match=r"^in method '%s', argument 1 of type 'int'$" % lookup):
        getattr(_renderlib, lookup)("0")


def test_a_record_made_from_python_is_zero_filled_and_read_only():
    info = renderlib.Plugin_Info()
    assert info.plugin_name is None and info._category is None
    assert info.use_prev_dest_p == 0 and info.dynamic_genotype_p == 0
    with pytest.raises(AttributeError):
        info.plugin_name = "T_Blur"
    assert info.this.own()


@pytest.mark.parametrize("getter", ["plugin_name", "_category", "use_prev_dest_p", "dynamic_genotype_p"])
def test_accessors_name_the_record_type(getter):
    with pytest.raises(TypeError, match=r"^in method 'Plugin_Info_%s_get', argument 1 of type 'plugin_info \*'$" % getter):
        getattr(_renderlib, "Plugin_Info_%s_get" % getter)(renderlib.T_RasterInfo())
