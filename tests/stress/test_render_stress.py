"""Everything at once for a minute: four threads render instances that ask
for other frames, a fifth aborts at random and clears, engine threads send
messages, and instances are made and freed meanwhile. Every render either
gives exactly the pixels it gives alone or ends in "Tarsel Abort"; nothing
hangs, crashes or is left behind.

RENDERLIB_STRESS_SECONDS sets the duration (60 by default)."""
import os
import random
import threading
import time

import _renderlib
import stress_frames
from engine_probe import EngineProbe
from process_memory import UNDER_ADDRESS_SANITIZER, resident_kib
from renderlib import effects

SECONDS = float(os.environ.get("RENDERLIB_STRESS_SECONDS", "60"))
WIDTH, HEIGHT = 96, 54
FRAMES = range(8)
EFFECTS = [("T_Echo", {"echoes": "3"}), ("T_TimeBlur", {"frames_before": "2", "frames_after": "1"}),
           ("T_Echo", {"combine": "Maximum", "frame_step": "2"}), ("T_TimeBlur", {"amount": "0.5"})]


def render(instance, frame):
    return stress_frames.render(instance, frame, WIDTH, HEIGHT)


def test_renders_aborts_messages_and_instances_all_at_once():
    probe = EngineProbe()
    instances_before = probe.live_instances()
    source = stress_frames.SharedFrameSource()
    messages = [0]  # counted, not kept: a list of every message would grow by megabytes

    def count_message(level, text):
        messages[0] += 1

    _renderlib.set_load_frame_impl(source)
    _renderlib.set_error_handler(count_message)
    instances = [effects.recreate(_renderlib.init_tarsel_effect(name, False), params) for name, params in EFFECTS]
    try:
        expected = [{frame: render(instance, frame) for frame in FRAMES} for instance in instances]
        assert all(ok for table in expected for ok, _ in table.values())
        outcomes = [{"ok": 0, "aborted": 0, "wrong": [], "failed": 0} for _ in instances]
        faults = []
        stop = threading.Event()

        def renderer(index):
            rng = random.Random(index)
            counts = outcomes[index]
            while not stop.is_set():
                frame = rng.choice(FRAMES)
                try:
                    ok, pixels = render(instances[index], frame)
                except RuntimeError as error:
                    if str(error) != "Tarsel Abort":
                        faults.append(repr(error))
                    counts["aborted"] += 1
                    continue
                if not ok:
                    counts["failed"] += 1
                elif pixels != expected[index][frame][1]:
                    counts["wrong"].append(frame)
                else:
                    counts["ok"] += 1

        def aborter():
            rng = random.Random(99)
            while not stop.is_set():
                time.sleep(rng.uniform(0.005, 0.05))
                _renderlib.tarsel_abort_render()
                time.sleep(rng.uniform(0.0, 0.005))
                _renderlib.tarsel_clear_abort()

        def messenger():
            while not stop.is_set():
                probe.emit_from_worker(20, _renderlib.Err_Info, "stress")

        made = [0]

        def maker():
            while not stop.is_set():
                try:
                    instance = _renderlib.init_tarsel_effect("T_Blur", False)
                except RuntimeError:
                    continue  # an abort request stood
                if instance is not None:
                    _renderlib.free_tarsel_effect(instance)
                    made[0] += 1

        def guarded(body):
            def run():
                try:
                    body()
                except BaseException as error:  # noqa: B902 - any escape is a fault to report
                    faults.append(repr(error))
            return run

        threads = [threading.Thread(target=guarded(lambda i=i: renderer(i))) for i in range(len(instances))]
        threads += [threading.Thread(target=guarded(body)) for body in (aborter, messenger, maker)]
        for thread in threads:
            thread.start()
        time.sleep(min(10.0, SECONDS / 6))
        rss_warm = resident_kib()
        time.sleep(SECONDS - min(10.0, SECONDS / 6))
        stop.set()
        for thread in threads:
            thread.join(30)
        assert not [t for t in threads if t.is_alive()], "a thread hung"
        _renderlib.tarsel_clear_abort()
        rss_growth = resident_kib() - rss_warm
    finally:
        _renderlib.tarsel_clear_abort()
        _renderlib.set_load_frame_impl(None)
        _renderlib.set_error_handler(None)
        for instance in instances:
            _renderlib.free_tarsel_effect(instance)

    assert faults == []
    for index, counts in enumerate(outcomes):
        assert counts["wrong"] == [], "%s gave other pixels for frames %s" % (EFFECTS[index][0], counts["wrong"])
        assert counts["failed"] == 0 and counts["ok"] > 0 and counts["aborted"] > 0, counts
    assert made[0] > 0 and messages[0] > 0
    assert probe.live_instances() == instances_before
    if not UNDER_ADDRESS_SANITIZER:
        assert rss_growth < 8 * 1024, "resident memory grew by %d KiB after warming up" % rss_growth
