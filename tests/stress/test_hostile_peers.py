"""Shared-memory peers killed at random moments while the survivor blocks in
its reads (hostile_peers.py): no message committed and lost, duplicated,
reordered or changed, and the survivor's descriptors, mappings and memory
stay flat. RENDERLIB_PEER_STRESS_SECONDS sets the length (12 by default)."""

import json
import os
import pathlib

from isolated import ending, run_python
from process_memory import UNDER_ADDRESS_SANITIZER

SECONDS = float(os.environ.get("RENDERLIB_PEER_STRESS_SECONDS", "12"))
SCRIPT = pathlib.Path(__file__).with_name("hostile_peers.py").read_text()


def test_peers_dying_at_random_lose_no_committed_message():
    name = "rltest-%d-peers" % os.getpid()
    done = run_python(SCRIPT, SECONDS + 60, [name, SECONDS, 7])
    assert done.returncode == 0 and done.stdout.strip(), "%s\n%s" % (ending(done), done.stderr[-3000:])
    counts = json.loads(done.stdout.strip().splitlines()[-1])
    print("\nhostile peers:", json.dumps(counts))
    assert counts["faults"] == [] and counts["lost"] == counts["out of order"] == counts["changed"] == 0, counts
    assert counts["peers"] > 3 and counts["left as zombies"] > 0, counts
    assert counts["files_growth"] <= 0 and counts["mappings_growth"] <= 0, counts
    assert UNDER_ADDRESS_SANITIZER or counts["rss_growth_kib"] < 4096, counts
    assert not pathlib.Path("/dev/shm/tarsel-ipc." + name).exists()
