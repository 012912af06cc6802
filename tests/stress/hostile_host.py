"""A hostile host: threads render, draw widgets, free and re-make the instances
the others use, swap the frame source, the drawing object and the handler,
send engine messages and abort renders. Run by test_hostile_host.py:

    python hostile_host.py SECONDS SEED [steady]

Without "steady" the interpreter ends after a random part of SECONDS with
every worker busy; with it, the workers stop and everything is freed at the
end. The last line of output is a JSON object of counts and faults."""

import collections
import gc
import json
import random
import sys
import threading
import time

import _renderlib
import stress_frames
from engine_probe import EngineProbe
from process_memory import resident_kib
from renderlib import effects
from renderlib.widgets import SvgDrawing

SECONDS, SEED, STEADY = float(sys.argv[1]), int(sys.argv[2]), sys.argv[3:] == ["steady"]
FRAMES = range(6)
RENDERED = [("T_Echo", {"echoes": "3"}), ("T_TimeBlur", {"frames_before": "1", "frames_after": "1"})]

probe = EngineProbe()
probe.keep_call_log(False)
rng = random.Random(SEED)
counts, faults = collections.Counter(), []


class Drawing(SvgDrawing):
    """Draws nothing anywhere; now and then frees the instance it draws."""

    def start_drawing(self, mode):
        if rng.random() < 0.05:
            try:
                _renderlib.free_tarsel_effect(widget[0])
            except ValueError:
                pass  # freed already by the remaker
        self.calls.clear()


def make(name, params):
    return effects.recreate(_renderlib.init_tarsel_effect(name, False), params)


def attempt(call, what):
    """Counts `what` done, refused (a freed instance) or aborted; anything else is a fault."""
    try:
        result = call()
    except RuntimeError as error:
        if str(error) != "Tarsel Abort":
            raise
        counts[what + " aborted"] += 1
    except ValueError as error:
        if not str(error).endswith("no effect instance (freed by free_tarsel_effect)"):
            raise
        counts[what + " refused"] += 1
    else:
        counts[what] += 1
        return result


installed = {"sources swapped": stress_frames.SharedFrameSource(), "drawings swapped": Drawing()}  # kept alive here
_renderlib.set_load_frame_impl(installed["sources swapped"])
_renderlib.tarsel_set_gfx_impl(installed["drawings swapped"])
_renderlib.set_error_handler(lambda level, text: None)
instances_before = probe.live_instances()
slots = [make(name, params) for name, params in RENDERED]
widget = [_renderlib.init_tarsel_effect("T_LensFlare", False)]
expected = [{frame: stress_frames.render(instance, frame, 48, 27)[1] for frame in FRAMES} for instance in slots]
stop = threading.Event()


# The workers, each a step repeated until the run stops, with a random
# generator of its own.
def renderer(local):
    slot, frame = local.randrange(len(slots)), local.choice(FRAMES)
    done = attempt(lambda: stress_frames.render(slots[slot], frame, 48, 27), "renders")
    if done:
        counts["failed"] += not done[0]
        counts["wrong pixels"] += done[0] and done[1] != expected[slot][frame]


def draw():
    return _renderlib.tarsel_widget_draw(widget[0], "", 480, 270, 0.0, 0.0, 0.25, 0.25, [1920, 1080, 0]) or True


def drawer(local):
    if attempt(draw, "draws") is None:
        time.sleep(0.001)  # until the remaker puts a new instance in place, or the abort is cleared


def remaker(local):
    time.sleep(local.uniform(0.0, 0.01))
    if local.random() < 0.7:
        slot = local.randrange(len(slots))
        old, slots[slot] = slots[slot], make(*RENDERED[slot])
    else:
        old, widget[0] = widget[0], _renderlib.init_tarsel_effect("T_LensFlare", False)
    try:
        _renderlib.free_tarsel_effect(old)  # often while a render or a draw uses it
    except ValueError:
        pass  # a drawing method freed it first
    counts["instances remade"] += 1


HANDLERS = [lambda level, text: None, lambda level, text: 1 / 0]  # the second raises on engine threads
SWAPS = [
    (_renderlib.set_load_frame_impl, stress_frames.SharedFrameSource, "sources swapped"),
    (_renderlib.tarsel_set_gfx_impl, Drawing, "drawings swapped"),
    (_renderlib.set_error_handler, lambda: rng.choice(HANDLERS), "handlers swapped"),
]


def swapper(local):
    time.sleep(local.uniform(0.0, 0.005))
    install, new, what = local.choice(SWAPS)
    # The new object is installed first; the one before then loses its last
    # reference, often while the engine is using it.
    obj = new()
    install(obj)
    installed[what] = obj
    counts[what] += 1


def aborter(local):
    time.sleep(local.uniform(0.01, 0.1))
    _renderlib.tarsel_abort_render()
    counts["aborts asked"] += 1
    time.sleep(local.uniform(0.0, 0.003))
    _renderlib.tarsel_clear_abort()


def messenger(local):
    counts["messages sent"] += probe.emit_from_worker(10, _renderlib.Err_Info, "hostile")


def work(step, seed):  # a worker thread's body
    local = random.Random(seed)
    try:
        while not stop.is_set():
            step(local)
    except BaseException as error:  # noqa: B902 - anything that escapes is a fault
        faults.append("%s: %r" % (step.__name__, error))


steps = [renderer] * 3 + [drawer, remaker, swapper, aborter, messenger]
threads = [threading.Thread(target=work, args=(step, SEED * 10 + i), daemon=True) for i, step in enumerate(steps)]
for thread in threads:
    thread.start()
if not STEADY:
    time.sleep(rng.uniform(0.0, SECONDS))
    print(json.dumps(dict(counts, faults=faults)), flush=True)
    sys.exit(0)  # with every worker busy

time.sleep(SECONDS / 4)
rss_warm = resident_kib()
time.sleep(SECONDS * 3 / 4)
stop.set()
for thread in threads:
    thread.join(30)
_renderlib.tarsel_clear_abort()
for install, _, _ in SWAPS:
    install(None)
for instance in slots + widget:
    if instance.thisown:  # not freed by a drawing method
        _renderlib.free_tarsel_effect(instance)
installed.clear()
gc.collect()
counts.update(instances_left=probe.live_instances() - instances_before, rss_growth_kib=resident_kib() - rss_warm)
hung = [thread.name for thread in threads if thread.is_alive()]
print(json.dumps(dict(counts, faults=faults, hung=hung)), flush=True)
