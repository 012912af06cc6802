"""An effect instance freed while calls are using it: from another thread
during a render, from the render's own frame request, from a drawing method
of its own widget call, and behind the module's back by the engine's own
free. The instance lives until the last call using it returns; a call made
after the free is refused. Each case runs in a process of its own."""

import pytest

from isolated import run_cleanly
from process_memory import UNDER_ADDRESS_SANITIZER

# An Echo render whose one frame request waits inside the host, so that the
# instance is freed while the render is certainly under way. `free_it` is
# the way the instance is freed, called where the case says.
SCRIPT = """
import ctypes, sys, threading, numpy, _renderlib, renderlib
from engine_probe import EngineProbe
from renderlib import effects
from renderlib.widgets import SvgDrawing

case = sys.argv[1]
probe = EngineProbe()
settings = {"echoes": "2", "decay": "1", "frame_step": "-1", "combine": "Maximum"}
echo = effects.recreate(_renderlib.init_tarsel_effect("T_Echo", False), settings)
engine_free = getattr(probe.lib, "_Z18free_tarsel_effectP15EffectGlobals_t")  # the C++ entry point's symbol
free_it = {
    "free": lambda: _renderlib.free_tarsel_effect(echo),
    "delete": lambda: _renderlib.delete_EffectGlobals_t(echo),
    "engine": lambda: engine_free(ctypes.c_void_p(int(echo.this))),
    "frame request": lambda: _renderlib.free_tarsel_effect(echo),
}[case]
inside, freed = threading.Event(), threading.Event()

class Frames(renderlib.LoadFrameInterface):
    def load_frame(self, input, frame, width, height):
        self.info, self.pixels = effects.raster(_renderlib.pixel_rgbaf, width, height)
        numpy.frombuffer(self.pixels, numpy.float32)[:] = 0.25
        if case == "frame request":
            free_it()
        else:
            inside.set()
            freed.wait(10)
        return self.pixels
    def current_raster_info(self, input):
        return self.info

frames = Frames()
_renderlib.set_load_frame_impl(frames)
live = probe.live_instances()
dest, current = effects.raster(_renderlib.pixel_rgbaf, 64, 32), effects.raster(_renderlib.pixel_rgbaf, 64, 32)
results = []
renderer = threading.Thread(target=lambda: results.append(effects.render(echo, dest, [current], frame=10)))
renderer.start()
exists_while_rendering = True
if case != "frame request":
    inside.wait(10)
    free_it()
    exists_while_rendering = probe.live_instances() == live
    freed.set()
renderer.join()
pixels = sorted(set(numpy.frombuffer(dest[1], numpy.float32).tolist()))
print(results, pixels, exists_while_rendering, live - probe.live_instances())
print(repr(echo).startswith("Globals(freed @0x") if case != "engine" else "engine")
"""


@pytest.mark.parametrize("case", ["free", "delete", "frame request", "engine"])
def test_an_instance_freed_during_its_render_lives_until_the_render_returns(case):
    first, second = run_cleanly(SCRIPT, args=[case]).splitlines()
    # The render finished on the intact instance, which went with it.
    assert first == "[True] [0.25] True 1"
    assert second in ("True", "engine")


def test_an_instance_freed_by_its_own_drawing_method_is_drawn_to_the_end():
    out = run_cleanly("""
        import _renderlib
        from renderlib.widgets import SvgDrawing
        from engine_probe import EngineProbe

        class Freeing(SvgDrawing):
            def start_drawing(self, mode):
                _renderlib.free_tarsel_effect(flare)
                self.exists_while_drawing = probe.live_instances() == live
                super().start_drawing(mode)

        probe = EngineProbe()
        flare = _renderlib.init_tarsel_effect("T_LensFlare", False)
        live = probe.live_instances()
        drawing = Freeing()
        _renderlib.tarsel_set_gfx_impl(drawing)
        _renderlib.tarsel_widget_draw(flare, "", 960, 540, 0.0, 0.0, 0.5, 0.5, [1920, 1080, 0])
        print(drawing.operations()[-1], drawing.exists_while_drawing, live - probe.live_instances())
    """)
    assert out.split() == ["end_drawing", "True", "1"]


def test_every_call_refuses_a_freed_instance():
    out = run_cleanly("""
        import _renderlib
        from renderlib import effects
        effect = _renderlib.init_tarsel_effect("T_LensFlare", False)
        _renderlib.free_tarsel_effect(effect)
        info, pixels = effects.raster(_renderlib.pixel_rgba8, 4, 4)
        view = (960, 540, 0.0, 0.0, 0.5, 0.5, [1920, 1080, 0])
        calls = {
            "render_tarsel_effect_to_native_image": (effect, "", pixels, 0, 0, 1, 1, [info], [None], 1.0, 1,
                                                     1.0, 0, 0, 0, 25, False, "", "", ""),
            "render_tarsel_lensflare_to_native_image": (effect, "", 1.0, 1.0, pixels, 0, 0, 1, 1, [info], [None],
                                                        1.0, 1, 1.0, 0, 0, "", "", "", False),
            "tarsel_widget_draw": (effect, "") + view,
            "tarsel_widget_mouse_event": (effect, "") + view + (0, 0, 0),
            "tarsel_effect_is_time_varying": (effect, "", 0),
            "tarsel_convert_to_bgra_8": (effect, info, pixels, bytearray(64), 0, 0, 0, "", ""),
        }
        for name in ("tarsel_get_gpu_status free_tarsel_effect delete_EffectGlobals_t EffectGlobals_t_plugin_name_get "
                     "EffectGlobals_t_n_effects_get EffectGlobals_t_effect_genotype_get EffectGlobals_t__get_genotypes "
                     "EffectGlobals_t__get_shared_params").split():
            calls[name] = (effect,)
        for name, args in calls.items():
            try:
                getattr(_renderlib, name)(*args)
                print(name, "took it")
            except ValueError as error:
                assert str(error).startswith("in method '%s', argument 1 of type 'EffectGlobals_t *': " % name), error
                assert str(error).endswith("no effect instance (freed by free_tarsel_effect)"), error
        # Identity needs no engine memory: it keeps working.
        print(effect == effect, hash(effect) == hash(effect), repr(effect).startswith("Globals(freed @0x"))
    """)
    assert out.split() == ["True", "True", "True"]


@pytest.mark.skipif(UNDER_ADDRESS_SANITIZER, reason="its quarantine keeps freed addresses from coming back")
def test_a_freed_proxy_stays_refused_when_its_address_is_handed_out_again():
    out = run_cleanly("""
        import _renderlib, renderlib
        for _ in range(100):
            old = _renderlib.init_tarsel_effect("T_Blur", False)
            _renderlib.free_tarsel_effect(old)
            new = _renderlib.init_tarsel_effect("T_Blur", False)
            if int(old.this) == int(new.this):
                break
        else:
            raise SystemExit("the engine never reused an address")
        try:
            _renderlib.free_tarsel_effect(old)
        except ValueError:
            print("refused", new.plugin_name)
    """)
    assert out.split() == ["refused", "T_Blur"]
