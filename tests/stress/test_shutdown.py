"""The interpreter ends cleanly, every run within 5 s, while engine threads
are inside host callbacks or a Python thread draws widgets, and a render on
the thread that ends it, after the module's exit step, ends as an abort.
RENDERLIB_SHUTDOWN_RUNS sets the number of runs (100; the audit runs 1,000)."""

import concurrent.futures
import os
import pathlib

import pytest

from isolated import ending, run_cleanly, run_python

RUNS = int(os.environ.get("RENDERLIB_SHUTDOWN_RUNS", "100"))
SCRIPT = pathlib.Path(__file__).with_name("shutdown_script.py").read_text()


def check_endings(runs, modes):
    """Runs shutdown_script.py with modes(i), four at a time: each exits with 0 within 5 s."""

    def run(index):
        try:
            done = run_python(SCRIPT, timeout=5, args=modes(index))
        except AssertionError as hung:
            return str(hung)[:300]
        return None if done.returncode == 0 else "%s: %s" % (ending(done), done.stderr.strip()[-300:])

    with concurrent.futures.ThreadPoolExecutor(max_workers=4) as pool:
        failures = [what for what in pool.map(run, range(runs)) if what]
    assert failures == [], "%d of %d runs failed, first: %s" % (len(failures), runs, failures[:3])


def test_the_interpreter_ends_cleanly_with_engine_threads_in_callbacks():
    check_endings(RUNS, lambda index: ["frames", "messages"][: 1 + index % 2])


def test_the_interpreter_ends_cleanly_with_a_thread_drawing_widgets():
    check_endings(max(RUNS // 4, 10), lambda index: ["widgets"])


# A render whose frame requests come after the exit step, on the thread that
# ends the interpreter. The way each scenario gets there comes first; the
# render is the same.
RENDER_ON_ENDING_THREAD = """
import os, sys
{before}
import _renderlib, stress_frames
from renderlib import effects

frames = stress_frames.SharedFrameSource()
_renderlib.set_load_frame_impl(frames)
echo = effects.recreate(_renderlib.init_tarsel_effect("T_Echo", False), {{"echoes": "3"}})
dest, source = effects.raster(_renderlib.pixel_rgbaf, 16, 8), effects.raster(_renderlib.pixel_rgbaf, 16, 8)

def render_late(render=effects.render, write=os.write):
    try:
        render(echo, dest, [source])
        write(1, b"rendered\\n")
    except RuntimeError as error:
        write(1, ("%s: %s\\n" % (error, error.__cause__)).encode())
{after}
"""
ENDING_THREAD_SCENARIOS = {
    # an atexit function registered before the module's own exit step
    "atexit": ("import atexit\natexit.register(lambda: render_late())", ""),
    # a finalizer run by the interpreter's exit, registered before the module
    "finalize": (
        "import weakref\nclass Anchor: pass\nanchor = Anchor()\nweakref.finalize(anchor, lambda: None)",
        "weakref.finalize(anchor, render_late)",
    ),
    # a __del__ run while the interpreter tears its modules down
    "del": (
        "",
        "class Late:\n    def __del__(self, render_late=render_late):\n        render_late()\n"
        "late = Late()\nlate.cycle = late",
    ),
}


@pytest.mark.parametrize("scenario", sorted(ENDING_THREAD_SCENARIOS))
def test_a_render_on_the_ending_thread_ends_as_an_abort(scenario):
    before, after = ENDING_THREAD_SCENARIOS[scenario]
    out = run_cleanly(RENDER_ON_ENDING_THREAD.format(before=before, after=after), timeout=20)
    assert out.splitlines() == ["Tarsel Abort: a frame request was refused: the interpreter is ending"]
