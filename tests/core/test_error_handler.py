"""The engine's message channel and the translation of engine aborts."""

import sys
import threading

import pytest

import _renderlib
from isolated import run_cleanly


def test_messages_from_an_engine_worker_reach_the_handler_in_order(probe, error_handler_removed):
    received = []
    _renderlib.set_error_handler(lambda level, message: received.append((level, message, threading.get_ident())))
    # The probe call releases the interpreter lock while the engine's worker
    # thread (which has no Python thread state) delivers the messages.
    assert probe.emit_from_worker(500, _renderlib.Err_Warning, "grain") == 500
    sent = [(_renderlib.Err_Warning, "grain %d" % i) for i in range(500)]
    assert [(level, message) for level, message, _ in received] == sent
    assert {thread for _, _, thread in received} != {threading.get_ident()}


def test_a_refused_or_aborted_change_keeps_the_old_handler(probe, error_handler_removed):
    received = []
    _renderlib.set_error_handler(lambda level, message: received.append(message))
    probe.clear_calls()
    for bad in (5, "print", object()):
        with pytest.raises(TypeError, match="^Callback must be callable$"):
            _renderlib.set_error_handler(bad)
    assert probe.calls() == []  # the engine was not asked
    probe.abort_next_call()
    with pytest.raises(RuntimeError, match="^Tarsel Abort$"):  # an engine abort becomes RuntimeError
        _renderlib.set_error_handler(None)
    probe.emit_here(_renderlib.Err_Info, "still here")
    assert received == ["still here"]
    assert _renderlib.get_n_tarsel_effects() > 0  # the next call is served


def test_installing_tells_the_engine_holding_one_reference_and_removing_passes_null(probe, error_handler_removed):
    def handler(level, message):
        pass

    before = sys.getrefcount(handler)
    assert _renderlib.set_error_handler(handler) is None
    assert _renderlib.set_error_handler(handler) is None  # replacing with itself keeps one reference
    assert sys.getrefcount(handler) == before + 1
    assert _renderlib.set_error_handler(None) is None
    assert sys.getrefcount(handler) == before
    assert _renderlib.set_error_handler(None) is None  # nothing installed: still told
    calls = probe.calls()
    assert calls[0].startswith("T_set_err_handler(0x") and calls == calls[:1] * 2 + ["T_set_err_handler(null)"] * 2
    assert probe.emit_from_worker(10, _renderlib.Err_Error, "lost") == 10  # without a handler: dropped


# Every engine call without arguments of its own, and one with.
NO_ARGUMENTS = """get_n_tarsel_effects get_n_tarsel_builder_effects get_tarsel_version_info get_tarsel_build_id
    check_build_id get_ocio_path tarsel_abort_render tarsel_clear_abort""".split()


@pytest.mark.parametrize("name, arguments", [("get_tarsel_plugin_info_i", (0,))] + [(n, ()) for n in NO_ARGUMENTS])
def test_every_engine_call_is_guarded(probe, name, arguments):
    probe.abort_next_call()
    with pytest.raises(RuntimeError, match="^Tarsel Abort$"):
        getattr(_renderlib, name)(*arguments)
    assert not probe.abort_armed()


# The engine's own call returns normally; the exception stays set in the
# thread that called the engine, so each call raises SystemError caused
# by it, as the interpreter reports a result returned with an exception
# set. On an engine worker the exception goes with the worker's temporary
# thread state, and the engine carries on. A fresh process: the first
# proxy of a class the module makes is the case that lost the exception.
HANDLER_RAISES = """
import _renderlib
from engine_probe import EngineProbe
from renderlib import effects

def handler(level, message):
    raise ValueError(message)

probe = EngineProbe()
made = probe.live_instances()
calls = {
    "proxy": lambda: _renderlib.init_tarsel_effect_from_string('{"effect": "T_Glow", "params": {"no_such": "1"}}'),
    "None": lambda: _renderlib.init_tarsel_effect("T_NoSuchEffect", False),
    "bool": lambda: effects.render(glow, effects.raster(_renderlib.pixel_rgba8, 4, 4), [None], colorspace="cmyk"),
    "tuple": lambda: _renderlib.tarsel_widget_mouse_event(glow, "no_such", 960, 540, 0.0, 0.0, 0.5, 0.5, [], 0, 0, 0),
    "engine": lambda: probe.emit_here(_renderlib.Err_Error, "frame 7"),
}
glow = None
_renderlib.set_error_handler(handler)
for kind, call in calls.items():
    try:
        print(kind, "returned", call())
    except SystemError as error:
        print(kind, type(error.__cause__).__name__)
    if glow is None:
        _renderlib.set_error_handler(None)
        glow = _renderlib.init_tarsel_effect("T_Glow", False)
        _renderlib.set_error_handler(handler)
print(probe.emit_from_worker(3, _renderlib.Err_Error, "worker"))
# The instance the failed call made went with its result.
print(probe.live_instances() - made)
"""


def test_a_handler_exception_surfaces_from_the_call_whatever_it_returns():
    out = run_cleanly(HANDLER_RAISES)
    assert out.splitlines() == ["%s ValueError" % kind for kind in "proxy None bool tuple engine".split()] + ["3", "1"]
