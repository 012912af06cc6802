"""A hostile host (hostile_host.py): renders, widget draws, instances freed
under the calls using them, frame sources, drawing objects and handlers
swapped, aborts, and the interpreter ending at random moments, in processes
of their own. No process may crash or hang, no render may give other pixels
than it gives alone, and the steady run must leave nothing behind.

RENDERLIB_HOSTILE_SECONDS sets the steady run's length (16 by default) and,
a tenth of it each, the lives of the runs that end mid-way;
RENDERLIB_HOSTILE_ENDINGS their number (24)."""
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
    """The counts the run printed last, or what went wrong."""
    done = run_python(SCRIPT, timeout=seconds + 60, args=[seconds, seed] + list(mode))
    lines = done.stdout.strip().splitlines()
    if done.returncode != 0 or not lines:
        return "run %d: %s\n%s" % (seed, ending(done), done.stderr[-2000:])
    return json.loads(lines[-1])


def check(counts):
    assert isinstance(counts, dict), counts
    assert counts["faults"] == [] and counts["failed"] == counts["wrong pixels"] == 0, counts


def test_a_steady_hostile_host_leaves_nothing_behind():
    counts = run(SECONDS, 1, "steady")
    check(counts)
    print("\nsteady run:", json.dumps(counts))
    assert counts["hung"] == [] and counts["instances_left"] == 0, counts
    for done in ("renders", "aborted", "refused", "draws", "instances remade", "sources swapped",
                 "drawings swapped", "handlers swapped", "messages sent"):
        assert counts[done] > 0, (done, counts)
    if not UNDER_ADDRESS_SANITIZER:
        assert counts["rss_growth_kib"] < 8 * 1024, counts


def test_hostile_hosts_end_at_random_moments_without_a_crash_or_a_hang():
    with concurrent.futures.ThreadPoolExecutor(max_workers=2) as pool:
        results = list(pool.map(lambda seed: run(SECONDS / 10, seed), range(100, 100 + ENDINGS)))
    for counts in results:
        check(counts)
    total = {key: sum(c[key] for c in results) for key in results[0] if key != "faults"}
    print("\n%d runs ended mid-way:" % len(results), json.dumps(total))
