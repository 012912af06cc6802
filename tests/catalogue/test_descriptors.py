"""Effect descriptors, definitions and instances read from the reference
engine's catalogue."""

import pytest

import _renderlib
import renderlib
from effect_helpers import all_entries, all_params


def find(instance, predicate):
    """The first (instance, descriptor) of the catalogue whose descriptor matches."""
    for name, builder in all_entries():
        effect = instance(name, builder)
        for genotype in effect._get_genotypes():
            if predicate(genotype):
                return effect, genotype
    raise LookupError("no descriptor matches")


def catalogue_params(instance):
    """Every parameter of every effect of both catalogues."""
    return [param for name, builder in all_entries() for param in all_params(instance(name, builder))]


def test_a_generator_has_no_inputs_and_a_transition_two(instance):
    _, generator = find(instance, lambda g: not g._get_input_names())
    assert generator._get_canonical_input_names() == ()
    _, transition = find(instance, lambda g: g.transition_p)
    assert len(transition._get_input_names()) == 2


def test_optional_inputs_fall_back_to_their_defaults(instance):
    _, genotype = find(instance, lambda g: any(g.input_optional_p))
    optional = [i for i in range(len(genotype._get_input_names())) if genotype.input_optional_p[i]]
    assert optional and all(genotype.effect_info.input_optional_p[i] for i in optional)
    assert genotype.effect_info.input_names == genotype._get_input_names()


def test_flare_and_glare_are_told_apart(instance):
    _, flare = find(instance, lambda g: g._has_flare_param())
    _, glare = find(instance, lambda g: g._has_glare_param())
    assert flare.flare_param.ptype == _renderlib.ptype_flare and not flare._has_glare_param()
    assert glare.flare_param is not None and not glare._has_flare_param()
    _, plain = find(instance, lambda g: g.flare_param is None)
    assert not plain._has_flare_param() and not plain._has_glare_param()


def test_time_and_host_data_flags(instance):
    find(instance, lambda g: g.need_other_frames_p)
    find(instance, lambda g: g.use_prev_dest_p)
    find(instance, lambda g: g._uses_host_data())


def test_group_names_follow_group_flags(instance):
    effect, genotype = find(instance, lambda g: any(p.flags.group_start_p for p in g._get_params()))
    params = genotype._get_params()
    opening = next(p for p in params if p.flags.group_start_p)
    assert opening.param_group >= 0 and genotype.get_param_group_name(opening)
    assert all(genotype.get_param_group_name(p) == "" for p in params if p.param_group < 0)
    assert any(p.flags.group_end_p for p in params)
    # A parameter that only documents its group (and opens none) names no group, though it has one.
    doc_only = lambda p: p.flags.doc_group_p and not p.flags.group_start_p and p.param_group >= 0  # noqa: E731
    _, documented = find(instance, lambda g: any(doc_only(p) for p in g._get_params()))
    assert documented.get_param_group_name(next(p for p in documented._get_params() if doc_only(p))) == ""


def test_every_screen_mode_and_the_point_rule(instance):
    modes = {param.flags.screen_mode: param for param in catalogue_params(instance) if param.n_channels_c1 == 2}
    assert set(range(10)) <= set(modes)
    for mode, param in modes.items():
        assert param.is_point() is (mode in (1, 2, 4, 6, 7)), mode
        assert len(param.get_titles()) == (1 if param.is_point() else 2)


def test_popup_states_and_names_from_a_file(instance):
    popups = [p for p in catalogue_params(instance) if p.ptype == _renderlib.ptype_popup]
    listed = [p for p in popups if not p.flags.fromfile_popup_p]
    assert listed and all(p.get_state_names() for p in listed)
    from_file = [p for p in popups if p.flags.fromfile_popup_p]
    assert from_file and all(p.get_fromfile_popup_names() for p in from_file)
    for param in listed:
        assert param.to_string(None) in param.get_state_names()


def test_limits_and_unlimited_bounds(instance):
    limits = [p.get_limits() for p in catalogue_params(instance) if p.numeric_p()]
    assert any(lower is None for lower, _, _, _ in limits) and any(upper is None for _, upper, _, _ in limits)
    assert any(lower is not None and upper is not None for lower, upper, _, _ in limits)
    assert all(isinstance(third, float) and isinstance(fourth, float) for _, _, third, fourth in limits)


def test_old_defaults_apply_below_their_version_limit(instance):
    param = next(p for p in catalogue_params(instance) if p.use_old_default_p and p.ptype == _renderlib.ptype_float)
    limit = param.old_default_version_limit
    assert param.needs_old_default(limit - 1) is True and param.needs_old_default(limit) is False
    assert param.maybe_set_to_old_default(None, limit) is False
    assert param.maybe_set_to_old_default(None, limit - 1) is True
    assert float(param.to_string(None).split()[0]) == pytest.approx(param.old_default_value[0])


def test_definitions_carry_hard_coded_values_of_any_count(instance):
    values = {}
    for name, builder in all_entries():
        for genotype in instance(name, builder)._get_genotypes():
            values.update(genotype.effect_info.get_arg_hardcoded_values())
    kinds = {type(v) if isinstance(v, float) else len(v) for v in values.values()}
    assert {float, 0, 3} <= kinds


def test_descriptors_compare_by_identity_and_print(instance):
    first = instance("T_Blur")._get_genotypes()[0]
    again = instance("T_Blur")._get_genotypes()[0]
    assert first != again  # two instances, two descriptors with equal contents
    effect = instance("T_Blur")
    assert effect._get_genotypes()[0] == effect.effect_genotype
    assert hash(effect._get_genotypes()[0]) == hash(effect.effect_genotype)
    assert repr(first) == 'Genotype("%s" @0x%x)' % (first.name, int(first.this))
    assert not first.this.own()


def test_an_empty_descriptor_made_from_python():
    genotype = renderlib.Genotype()
    assert genotype.name == "" and genotype._get_params() == () and genotype._get_input_names() == ()
    assert genotype.flare_param is None and genotype.effect_info is None
    assert not genotype._has_flare_param() and not genotype._has_glare_param()
