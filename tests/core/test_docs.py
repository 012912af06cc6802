"""The host guide in docs/ runs as doctests, one case per page.

A page's examples are its ```pycon blocks, plus any plain doctest text outside fenced blocks, run in page order in one
namespace against the reference engine. A page must have examples, and must leave the process as it found it: no
instance, display, image or shared-memory segment of its own left alive, no abort request standing, no message handler
or drawing object installed."""

import ctypes
import doctest
import gc
import os
import pathlib
import re

import pytest

import _renderlib
import renderlib  # noqa: F401  (registers the proxy classes)
from engine_probe import loaded_library_path

DOCS = pathlib.Path(__file__).resolve().parents[2] / "docs"
PAGES = sorted(DOCS.glob("*.md"))
OPTIONS = doctest.ELLIPSIS | doctest.NORMALIZE_WHITESPACE
FENCE = re.compile(r"^ {0,3}(`{3,}|~{3,})\s*([^`\s]*)")
SEGMENTS = pathlib.Path("/dev/shm")
SEGMENT_PREFIX = "tarsel-ipc."


def doctest_text(page):
    """The page's text with every line that is not an example blanked: fence lines and the lines of fenced blocks other
    than ```pycon. Line numbers stay those of the page, and a fence ends an example's expected output. A `>>>` line in
    another kind of fenced block would never run: refused."""
    kept, fence, language = [], None, None
    for number, line in enumerate(page.read_text(encoding="utf-8").splitlines(), start=1):
        match = FENCE.match(line)
        if fence is None and match:
            fence, language = match.group(1), match.group(2).lower()
        elif fence is not None and match and match.group(1).startswith(fence) and not match.group(2):
            fence = None
        elif fence is None or language == "pycon":
            kept.append(line)
            continue
        else:
            message = "%s:%d: an example in a ```%s block would not run; use ```pycon" % (page.name, number, language)
            assert not line.lstrip().startswith(">>>"), message
        kept.append("")
    assert fence is None, "%s: a fenced block is never closed" % page.name
    return "\n".join(kept) + "\n"


class LeftBehind:
    """What a page could leave alive in the process, counted from outside the module: the engine's and the monitor
    library's test probes, and the shared-memory segments named with this process's id (pages name theirs so; other
    processes' come and go meanwhile)."""

    def __init__(self, probe):
        self.probe = probe
        self.monitor = ctypes.CDLL(loaded_library_path("QRVExternalMonitor"))

    def counts(self):
        gc.collect()
        return {
            "effect instances": self.probe.live_instances(),
            "monitor displays": self.monitor.qrv_probe_live_displays(),
            "monitor images": self.monitor.qrv_probe_live_images(),
            "segments": self.segments(),
        }

    @staticmethod
    def segments():
        mine = SEGMENTS.glob("%s*%d*" % (SEGMENT_PREFIX, os.getpid()))
        return sorted(path.name[len(SEGMENT_PREFIX) :] for path in mine)

    def installed(self, entry):
        """Whether the last `entry(...)` call in the engine's log installed something."""
        calls = [call for call in self.probe.calls() if call.startswith(entry + "(")]
        return bool(calls) and calls[-1] != entry + "(null)"


@pytest.mark.parametrize("page", PAGES, ids=lambda page: page.name)
def test_page_examples(page, probe):
    test = doctest.DocTestParser().get_doctest(doctest_text(page), {"__name__": page.stem}, page.name, str(page), 0)
    assert test.examples, "%s has no examples" % page.name
    left = LeftBehind(probe)
    before = left.counts()
    report = []
    try:
        failed, attempted = doctest.DocTestRunner(optionflags=OPTIONS).run(test, out=report.append, clear_globs=False)
        assert failed == 0, "%d of %d examples of %s failed:\n%s" % (failed, attempted, page.name, "".join(report))
        assert left.counts() == before, "%s leaves objects alive" % page.name
        assert not probe.abort_requested(), "%s leaves an abort request standing" % page.name
        for entry in ("T_set_err_handler", "tarsel_set_gfx_impl"):
            assert not left.installed(entry), "%s leaves %s's object installed" % (page.name, entry)
    finally:
        # Whatever a failed page left, the rest of the suite runs without it.
        test.globs.clear()
        gc.collect()
        for remove in (_renderlib.set_error_handler, _renderlib.set_load_frame_impl, _renderlib.tarsel_set_gfx_impl):
            remove(None)
        for name in set(left.segments()) - set(before["segments"]):
            _renderlib.ShmemManager_reset(name, True)


def test_the_index_links_every_page():
    linked = set(re.findall(r"\]\(([\w.-]+\.md)(?:#[\w-]*)?\)", (DOCS / "index.md").read_text(encoding="utf-8")))
    assert {page.name for page in PAGES} - {"index.md"} <= linked


def test_only_pycon_blocks_and_plain_doctest_text_run(tmp_path):
    page = tmp_path / "page.md"
    page.write_text("Prose.\n\n```pycon\n>>> 1 + 1\n2\n```\n```sh\necho >>> not run\n```\n\n    >>> 2 + 2\n    4\n")
    test = doctest.DocTestParser().get_doctest(doctest_text(page), {}, page.name, str(page), 0)
    # The fence ends the first example's output; each example keeps its line.
    assert [(e.source, e.want, e.lineno) for e in test.examples] == [("1 + 1\n", "2\n", 3), ("2 + 2\n", "4\n", 10)]
    page.write_text("```python\n>>> 1 + 1\n2\n```\n")
    with pytest.raises(AssertionError, match="page.md:2: an example in a ```python block would not run"):
        doctest_text(page)
    page.write_text("No examples here.\n")
    assert doctest.DocTestParser().get_examples(doctest_text(page)) == []
