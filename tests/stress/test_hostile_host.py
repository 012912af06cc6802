"""A hostile host (hostile_host.py) in processes of their own, once steady and
then ending the interpreter at random moments: no crash or hang, every render
gives the pixels it gives alone, the steady run leaves nothing behind.
RENDERLIB_HOSTILE_SECONDS sets the steady run's length (16 by default; the
others live a tenth of it), RENDERLIB_HOSTILE_ENDINGS their number (24)."""

import collections
import concurrent.futures
import json
import os
import pathlib

from isolated import ending, run_python
from process_memory import UNDER_ADDRESS_SANITIZER

SECONDS = float(os.environ.get("RENDERLIB_HOSTILE_SECONDS", "16"))
ENDINGS = int(os.environ.get("RENDERLIB_HOSTILE_ENDINGS", "24"))
SCRIPT = pathlib.Path(__file__).with_name("hostile_host.py").read_text()


def run(seconds, seed, *mode):
    """The counts the run printed last, checked for faults."""
    done = run_python(SCRIPT, timeout=seconds + 60, args=[seconds, seed] + list(mode))
    assert done.returncode == 0 and done.stdout.strip(), "run %d: %s\n%s" % (seed, ending(done), done.stderr[-2000:])
    counts = collections.Counter(json.loads(done.stdout.strip().splitlines()[-1]))
    assert counts.pop("faults") == [] and counts["failed"] == counts["wrong pixels"] == 0, counts
    return counts


def test_a_steady_hostile_host_leaves_nothing_behind():
    counts = run(SECONDS, 1, "steady")
    print("\nsteady run:", json.dumps(counts))
    assert counts["hung"] == [] and counts["instances_left"] == 0, counts
    done = "renders, renders aborted, renders refused, draws, instances remade, messages sent"
    swapped = ["%s swapped" % what for what in ("sources", "drawings", "handlers")]
    for what in done.split(", ") + swapped:
        assert counts[what] > 0, (what, counts)
    assert UNDER_ADDRESS_SANITIZER or counts["rss_growth_kib"] < 8 * 1024, counts


def test_hostile_hosts_end_at_random_moments_without_a_crash_or_a_hang():
    with concurrent.futures.ThreadPoolExecutor(max_workers=2) as pool:
        total = sum(pool.map(lambda seed: run(SECONDS / 10, seed), range(100, 100 + ENDINGS)), collections.Counter())
    print("\n%d runs ended mid-way:" % ENDINGS, json.dumps(total))
