"""Both catalogues as the module hands them over, walked completely: every
effect created, read and freed."""

import pytest

import _renderlib
from effect_helpers import all_entries, all_params
from renderlib import effects


def read_every_field(record):
    """Reads every attribute its proxy class defines (each a field of the engine's record)."""
    for name, value in vars(type(record)).items():
        if isinstance(value, property):
            getattr(record, name)


def test_catalogues_hold_named_categorised_effects():
    regular, builder = effects.catalogue(), effects.catalogue(builder=True)
    assert len(regular) >= 8 and len(builder) >= 2
    for info in regular + builder:
        assert info.plugin_name.startswith(_renderlib.PLUGIN_NAME_PREFIX) and info._category
        assert info.use_prev_dest_p in (0, 1) and info.dynamic_genotype_p in (0, 1)
    assert any(info.use_prev_dest_p for info in regular)
    assert all(info.dynamic_genotype_p for info in builder)
    assert len({info.plugin_name for info in regular + builder}) == len(regular) + len(builder)


def test_every_effect_is_created_read_completely_and_freed(probe):
    before = probe.live_instances(), probe.live_params()
    for name, builder in all_entries():
        effect = _renderlib.init_tarsel_effect(name, builder)
        assert effect.plugin_name == name and effect.this.own()
        genotypes = effect._get_genotypes()
        assert len(genotypes) == effect.n_effects >= 1 and genotypes[0] == effect.effect_genotype
        for genotype in genotypes:
            read_every_field(genotype)
            assert len(genotype._get_input_names()) == len(genotype._get_canonical_input_names())
            list(genotype.input_optional_p), list(genotype.input_default_to)
            genotype._uses_host_data(), genotype._has_flare_param(), genotype._has_glare_param()
            definition = genotype.effect_info
            assert definition.name and len(definition.input_names) == len(definition.input_optional_p)
            definition.arg_names, definition.get_arg_hardcoded_values()
            for param in genotype._get_params():
                read_every_field(param)
                read_every_field(param.flags)
                list(param.default_value), list(param.old_default_value)
                assert isinstance(genotype.get_param_group_name(param), str)
                param.get_titles(), param.get_limits(), param.get_state_names(), param.get_fromfile_popup_names()
                param.is_point(), param.numeric_p(), param.format(), param.ptype_name()
                assert param.get_canonical_name() == param.canonical_name
                assert isinstance(param.to_string(None), str)
        effect._get_shared_params()
        _renderlib.free_tarsel_effect(effect)
        assert not effect.this.own()
    assert (probe.live_instances(), probe.live_params()) == before


def test_every_parameter_type_is_in_the_catalogue(instance):
    params = [param for name, builder in all_entries() for param in all_params(instance(name, builder))]
    names = "float int color popup boolean pushbutton string label flare".split()
    assert {getattr(_renderlib, "ptype_" + name) for name in names} <= {param.ptype for param in params}
    assert {3, 4} <= {param.n_channels for param in params if param.ptype == _renderlib.ptype_color}


@pytest.mark.parametrize("lookup, count", [("plugin", "effects"), ("builder", "builder_effects")])
def test_indices_reach_the_engine_unchecked_and_null_becomes_none(probe, lookup, count):
    lookup, count = "get_tarsel_%s_info_i" % lookup, "get_n_tarsel_%s" % count
    n = getattr(_renderlib, count)()
    assert probe.calls() == ["%s()" % count]
    probe.clear_calls()
    for index in (n, -1, 2147483647):
        assert getattr(_renderlib, lookup)(index) is None  # the reference engine returns null
    assert probe.calls() == ["%s(%d)" % (lookup, i) for i in (n, -1, 2147483647)]
