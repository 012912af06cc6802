"""A hostile host: threads render, draw widgets, free and re-make the
instances the others are using, swap the frame source, the drawing object
and the message handler, and abort renders, while the interpreter may end at
any moment. Run by test_hostile_host.py:

    python hostile_host.py SECONDS SEED [steady]

Without "steady" the main thread ends the interpreter after a random part of
SECONDS with every worker busy in a daemon thread. With it, the workers run
the whole time, are stopped, everything is freed and the process checks it
left nothing behind. Either way the last line of output is a JSON object of
counts; a render that gave other pixels than it gives alone, or any
exception other than those the host is told to expect, is a fault."""
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
WIDTH, HEIGHT = 48, 27
FRAMES = range(6)
RENDERED = [("T_Echo", {"echoes": "3"}), ("T_TimeBlur", {"frames_before": "1", "frames_after": "1"})]
VIEW = (480, 270, 0.0, 0.0, 0.25, 0.25, [1920, 1080, 0])

probe = EngineProbe()
probe.keep_call_log(False)
rng = random.Random(SEED)
counts = {"renders": 0, "aborted": 0, "refused": 0, "draws": 0, "draws refused": 0, "draws aborted": 0,
          "instances remade": 0, "sources swapped": 0, "drawings swapped": 0, "handlers swapped": 0,
          "aborts asked": 0, "messages sent": 0, "failed": 0, "wrong pixels": 0}
faults = []


class Drawing(SvgDrawing):
    """Draws nothing anywhere; now and then frees the instance it draws."""

    def start_drawing(self, mode):
        if rng.random() < 0.05:
            try:
                _renderlib.free_tarsel_effect(widget_slot[0])
            except ValueError:
                pass  # freed already by the remaker
        self.calls.clear()


def make(name, params):
    return effects.recreate(_renderlib.init_tarsel_effect(name, False), params)


def render(instance, frame):
    return stress_frames.render(instance, frame, WIDTH, HEIGHT)


def expected_error(error, *texts):
    return any(str(error).startswith(text) or str(error).endswith(text) for text in texts)


installed = {"frames": stress_frames.SharedFrameSource(), "drawing": Drawing()}
_renderlib.set_load_frame_impl(installed["frames"])
_renderlib.tarsel_set_gfx_impl(installed["drawing"])
_renderlib.set_error_handler(lambda level, text: None)
instances_before = probe.live_instances()
slots = [make(name, params) for name, params in RENDERED]
widget_slot = [_renderlib.init_tarsel_effect("T_LensFlare", False)]
expected = [{frame: render(instance, frame)[1] for frame in FRAMES} for instance in slots]
stop = threading.Event()


def renderer(index):
    local = random.Random(SEED * 10 + index)
    while not stop.is_set():
        slot, frame = local.randrange(len(slots)), local.choice(FRAMES)
        try:
            ok, pixels = render(slots[slot], frame)
        except RuntimeError as error:
            if str(error) != "Tarsel Abort":
                raise
            counts["aborted"] += 1
            continue
        except ValueError as error:
            if not expected_error(error, "no effect instance (freed by free_tarsel_effect)"):
                raise
            counts["refused"] += 1
            continue
        counts["renders"] += 1
        if not ok:
            counts["failed"] += 1
        elif pixels != expected[slot][frame]:
            counts["wrong pixels"] += 1


def drawer():
    while not stop.is_set():
        try:
            _renderlib.tarsel_widget_draw(widget_slot[0], "", *VIEW)
            counts["draws"] += 1
        except ValueError as error:
            if not expected_error(error, "no effect instance (freed by free_tarsel_effect)"):
                raise
            counts["draws refused"] += 1
            time.sleep(0.001)  # until the remaker puts a new instance in the slot
        except RuntimeError as error:
            if str(error) != "Tarsel Abort":
                raise
            counts["draws aborted"] += 1
            time.sleep(0.001)  # until the abort request is cleared


def remaker():
    local = random.Random(SEED + 1)
    while not stop.is_set():
        time.sleep(local.uniform(0.0, 0.01))
        if local.random() < 0.7:
            slot = local.randrange(len(slots))
            old, slots[slot] = slots[slot], make(*RENDERED[slot])
        else:
            old, widget_slot[0] = widget_slot[0], _renderlib.init_tarsel_effect("T_LensFlare", False)
        try:
            _renderlib.free_tarsel_effect(old)  # often while a render or a draw uses it
        except ValueError:
            pass  # a drawing method freed it first
        counts["instances remade"] += 1


def swapper():
    local = random.Random(SEED + 2)
    handlers = [lambda level, text: None, lambda level, text: 1 / 0]  # the second raises on engine threads
    while not stop.is_set():
        time.sleep(local.uniform(0.0, 0.005))
        choice = local.randrange(3)
        # Each new object is installed first; the one before then loses its
        # last reference, often while the engine is using it.
        if choice == 0:
            frames = stress_frames.SharedFrameSource()
            _renderlib.set_load_frame_impl(frames)
            installed["frames"] = frames
            counts["sources swapped"] += 1
        elif choice == 1:
            drawing = Drawing()
            _renderlib.tarsel_set_gfx_impl(drawing)
            installed["drawing"] = drawing
            counts["drawings swapped"] += 1
        else:
            _renderlib.set_error_handler(local.choice(handlers))
            counts["handlers swapped"] += 1


def aborter():
    local = random.Random(SEED + 3)
    while not stop.is_set():
        time.sleep(local.uniform(0.01, 0.1))
        _renderlib.tarsel_abort_render()
        counts["aborts asked"] += 1
        time.sleep(local.uniform(0.0, 0.003))
        _renderlib.tarsel_clear_abort()


def messenger():
    while not stop.is_set():
        counts["messages sent"] += probe.emit_from_worker(10, _renderlib.Err_Info, "hostile")


def guarded(body, *args):
    def run():
        try:
            body(*args)
        except BaseException as error:  # noqa: B902 - anything that escapes is a fault
            faults.append("%s: %r" % (body.__name__, error))
    return threading.Thread(target=run, daemon=True)


threads = [guarded(renderer, i) for i in range(3)] + [guarded(body) for body in
                                                       (drawer, remaker, swapper, aborter, messenger)]
for thread in threads:
    thread.start()


def report(**more):
    counts.update(more, faults=faults)
    print(json.dumps(counts), flush=True)


if not STEADY:
    time.sleep(rng.uniform(0.0, SECONDS))
    report()
    sys.exit(0)  # with every worker busy

time.sleep(SECONDS / 4)
rss_warm = resident_kib()
time.sleep(SECONDS * 3 / 4)
stop.set()
for thread in threads:
    thread.join(30)
hung = [thread.name for thread in threads if thread.is_alive()]
_renderlib.tarsel_clear_abort()
_renderlib.set_load_frame_impl(None)
_renderlib.tarsel_set_gfx_impl(None)
_renderlib.set_error_handler(None)
for instance in slots + widget_slot:
    if instance.thisown:  # not freed by a drawing method
        _renderlib.free_tarsel_effect(instance)
installed.clear()
gc.collect()
report(hung=hung, instances_left=probe.live_instances() - instances_before, rss_growth_kib=resident_kib() - rss_warm)
