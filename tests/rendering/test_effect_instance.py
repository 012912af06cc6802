"""Effect instances: creation, saved text, queries, freeing, threads."""

import json
import threading

import pytest

import _renderlib
import renderlib
from effect_helpers import all_entries
from renderlib import effects


def test_an_unknown_name_gives_no_instance_and_a_message(error_handler_removed):
    messages = []
    _renderlib.set_error_handler(lambda level, text: messages.append((level, text)))
    assert _renderlib.init_tarsel_effect("T_NoSuchEffect", False) is None
    assert _renderlib.init_tarsel_effect("T_Blur", True) is None  # not in the builder catalogue
    assert _renderlib.init_tarsel_effect_from_string("not json") is None
    assert len(messages) == 3 and all(level == _renderlib.Err_Error for level, _ in messages)


def test_every_value_survives_the_saved_text(instance):
    for name, builder in all_entries():
        original = instance(name, builder)
        texts = effects.parameter_texts(original)
        copy = effects.recreate(original)
        assert copy is not None and copy.plugin_name == name, name
        assert effects.parameter_texts(copy) == texts, name
        _renderlib.free_tarsel_effect(copy)


def test_changed_values_are_kept_by_the_saved_text(instance):
    blur = instance("T_Blur")
    params = {p.canonical_name: p for p in blur.effect_genotype._get_params()}
    changes = {}
    for name, param in params.items():
        if param.ptype == _renderlib.ptype_float and param.n_channels == 1:
            changes[name] = "%.9g" % (float(param.to_string(None)) + 1)
        elif param.ptype == _renderlib.ptype_popup:
            changes[name] = param.get_state_names()[-1]
        elif param.ptype == _renderlib.ptype_boolean:
            changes[name] = "false" if param.to_string(None) == "true" else "true"
    assert changes
    changed = effects.recreate(blur, changes)
    try:
        texts = effects.parameter_texts(changed)
        assert {name: texts[name] for name in changes} == changes
        # A saved text read back gives the same text again.
        assert json.loads(effects.saved_text(changed))["params"] == texts
    finally:
        _renderlib.free_tarsel_effect(changed)
    with pytest.raises(KeyError):
        effects.saved_text(blur, {"no_such_parameter": "1"})


def test_instance_queries(instance):
    blur, echo = instance("T_Blur"), instance("T_Echo")
    assert "CPU" in _renderlib.tarsel_get_gpu_status(blur)
    assert _renderlib.tarsel_effect_is_time_varying(echo, "", 0) == 1
    assert _renderlib.tarsel_effect_is_time_varying(blur, "", 0) == 0
    assert _renderlib.tarsel_effect_is_time_varying(blur, "no_such_parameter", 0) == -1
    assert repr(blur) == 'Globals("T_Blur" @0x%x)' % int(blur.this)


def test_shared_parameters(instance):
    effect = instance("T_Blur")
    shared = effect._get_shared_params()
    assert shared and all(isinstance(p, renderlib.Param) and isinstance(g, renderlib.Genotype) for p, g in shared)
    first = effect._get_genotypes()[0]
    slot_params = [p for p, g in shared if g == first and p not in first._get_params()]
    assert slot_params and all(p.flags.wenable_p for p in slot_params)
    published = [p for p in effect.effect_genotype._get_params() if not p.flags.dont_publish_p]
    assert [p for p, _ in shared[: len(published)]] == published


def test_add_param_to_list_is_the_engines_collector(instance, shared_registry):
    genotype = instance("T_Blur").effect_genotype
    collected = []
    assert _renderlib.add_param_to_list(genotype, 0, shared_registry.object_address(collected)) == 0
    assert collected == [(genotype._get_params()[0], genotype)]
    assert _renderlib.add_param_to_list(genotype, 10_000, shared_registry.object_address(collected)) == 0
    assert collected[1] == (None, genotype)  # an index outside the table reads nothing


def test_engine_controls(probe, tmp_path, error_handler_removed):
    messages = []
    _renderlib.set_error_handler(lambda level, text: messages.append(text))
    lut = tmp_path / "gamma.lut"
    lut.write_text("\n".join("%.6f" % ((i / 255) ** (1 / 2.2)) for i in range(256)))
    _renderlib.set_tarsel_luts(str(lut), "", 1.0)
    _renderlib.set_tarsel_luts(str(tmp_path / "missing.lut"), "", 1.0)
    assert messages  # the missing file was reported
    _renderlib.tarsel_free_all_stamp_collections()
    assert probe.stamp_count() == 0
    _renderlib.tarsel_shutdown_apps()
    assert _renderlib.init_tarsel_effect("T_Blur", False) is not None  # usable again after shutdown


def test_creation_and_freeing_from_four_threads(probe):
    live = probe.live_instances()
    names = [name for name, builder in all_entries() if not builder]
    errors = []

    def work(seed):
        try:
            for i in range(150):
                effect = _renderlib.init_tarsel_effect(names[(seed + i) % len(names)], False)
                effect.effect_genotype._get_params()
                _renderlib.free_tarsel_effect(effect)
        except Exception as error:  # reported below
            errors.append(error)

    threads = [threading.Thread(target=work, args=(seed,)) for seed in range(4)]
    for thread in threads:
        thread.start()
    for thread in threads:
        thread.join()
    assert errors == [] and probe.live_instances() == live
