#!/usr/bin/env bash
# Runs the whole test suite under valgrind's memcheck, the child processes
# that run Python included (the peers of the shared-memory tests, the
# examples, the command line), and judges what it found in our own code:
# the module (_renderlib), the engine (libtarsel_ps) and the monitor library
# (libQRVExternalMonitor).
#
#   tools/valgrind.sh [pytest arguments]
#
# The run fails when a test fails, or when valgrind reports in our code
#   - any memory error: one of its stacks (where it happened, where the block
#     was allocated or freed) passes through one of our libraries;
#   - any definitely lost block allocated on a stack through one of them.
# The summary at the end counts both, with their stacks, and counts apart
# what was reported elsewhere (the interpreter, numpy, the C library), which
# is not judged. tools/valgrind-python.supp silences the interpreter's own
# known reports; each report in the XML carries the suppression that would
# silence it. A memory error also makes the process that had it exit with
# status 86 (leaks do not: the interpreter leaves blocks behind at exit by
# design), so a test that checks a child process's status fails too.
#
# PYTHON chooses the interpreter (default: .venv/bin/python, as tools/setup.sh
# makes it; stacks name our functions when its build keeps symbols);
# VALGRIND_OUT the folder for the per-process XML reports and the test log
# (default: build/valgrind, emptied first). valgrind reads VALGRIND_OPTS
# itself, e.g. VALGRIND_OPTS=--track-origins=yes. The whole suite takes some
# 15 minutes on two cores.
set -euo pipefail
cd "$(dirname "$0")/.."
repo=$(pwd)

python=${PYTHON:-$repo/.venv/bin/python}
out=${VALGRIND_OUT:-$repo/build/valgrind}
command -v valgrind >/dev/null || { echo "valgrind is not installed (apt-get install valgrind)" >&2; exit 2; }
[ -x "$python" ] || { echo "no interpreter at $python: run tools/setup.sh or set PYTHON" >&2; exit 2; }
rm -rf "$out"
mkdir -p "$out"

# Tests that cannot work under valgrind, which runs code some 20 to 50 times
# slower, one thread at a time, and keeps freed memory aside (resident memory
# grows by design):
deselect=(
  # A restarted peer process must start and answer within 5 s.
  tests/ipc/test_two_processes.py::test_a_peer_killed_holding_the_lock_or_a_reservation
  # An abort must end a 4K blur within 0.2 s of the request.
  tests/rendering/test_render_threads.py::test_an_abort_from_another_thread_ends_a_4k_render_quickly
  # Compares a Python thread's pace during two full-HD renders with its pace
  # alone; valgrind runs one thread at a time.
  tests/rendering/test_render_threads.py::test_two_renders_at_once_while_python_keeps_running
  # Timed waits must end within 20 ms of their timeout.
  tests/ipc/test_transport.py::test_nothing_to_read_is_none_without_an_error
  tests/ipc/test_transport.py::test_a_message_too_large_and_a_full_queue
  # Its child process has 30 s, less than an interpreter takes to start and render under valgrind.
  tests/callbacks/test_frame_loading.py::test_a_failed_request_ends_the_render_as_an_abort_caused_by_it
  # A hundred child interpreters must each start, run and exit within 5 s.
  tests/stress/test_shutdown.py::test_the_interpreter_ends_cleanly_with_engine_threads_in_callbacks
  # A touch of a segment page lost to truncation is contained by the engine's
  # SIGBUS handler mapping zero pages in its place; memcheck reports the touch
  # as an invalid read and does not let the handler map over the pages.
  tests/ipc/test_two_processes.py::test_a_segment_truncated_or_removed_under_its_transports
  # Needs the engine to hand a freed instance's address out again, which
  # memcheck's store of freed blocks prevents.
  tests/rendering/test_instance_sharing.py::test_a_freed_proxy_stays_refused_when_its_address_is_handed_out_again
)
deselect_args=()
for test in "${deselect[@]}"; do deselect_args+=(--deselect "$test"); done

# Build tools and the type checker run natively: they are not our code. The
# segment fuzz target carries AddressSanitizer, which cannot run under valgrind.
skip_programs='*/fuzz_segment,*/cmake,*/ninja,*/swig,*/c++,*/g++,*/gcc,*/cc,*/cc1plus,*/as,*/ld,*/collect2,*/sh,*/bash'

echo "valgrind memcheck over the test suite; deselected as unworkable under valgrind (see $0):"
printf '  %s\n' "${deselect[@]}"

export PYTHONMALLOC=malloc  # every object is a malloc block valgrind sees
export RENDERLIB_TEST_TIME_LIMIT=0  # tests run 20 to 50 times slower here
start=$(date +%s)
set +e
valgrind --tool=memcheck \
  --leak-check=full --show-leak-kinds=definite --errors-for-leak-kinds=none \
  --error-exitcode=86 --error-limit=no --num-callers=50 \
  --fair-sched=yes \
  --trace-children=yes --trace-children-skip="$skip_programs" \
  --trace-children-skip-by-arg='*mypy*' --child-silent-after-fork=yes \
  --suppressions="$repo/tools/valgrind-python.supp" --gen-suppressions=all \
  --xml=yes --xml-file="$out/memcheck.%p.xml" --log-file="$out/valgrind.%p.log" \
  "$python" -m pytest -p no:cacheprovider -q -o addopts=-ra \
  --junitxml="$out/tests.xml" "${deselect_args[@]}" "$@" 2>&1 | tee "$out/pytest.log"
status=${PIPESTATUS[0]}
set -e
echo "valgrind exit status $status after $(( ($(date +%s) - start) / 60 )) min"

verdict=0
"$python" - "$out" <<'EOF' || verdict=$?
"""Sorts the reports of every process: ours, and everybody else's."""
import glob
import os
import re
import sys
import xml.etree.ElementTree as ET

OURS = re.compile(r"(^|/)(_renderlib[^/]*\.so|libtarsel_ps\.so[^/]*|libQRVExternalMonitor\.so[^/]*)$")
out = sys.argv[1]


def stacks(error):
    return error.findall("stack")


def ours(error):
    return any(OURS.search(frame.findtext("obj") or "") for stack in stacks(error) for frame in stack)


def describe(error, indent="    "):
    lines = [error.findtext("what") or error.findtext("xwhat/text") or "?"]
    auxes = [a.text for a in error.findall("auxwhat")] + [x.findtext("text") for x in error.findall("xauxwhat")]
    for number, stack in enumerate(stacks(error)):
        if number:
            lines.append(auxes[number - 1] if number - 1 < len(auxes) else "and:")
        frames = list(stack)
        # Down to our last frame and the interpreter's few that called it.
        last = max([i for i, frame in enumerate(frames) if OURS.search(frame.findtext("obj") or "")] or [8])
        for frame in frames[:last + 4]:
            where = frame.findtext("fn") or os.path.basename(frame.findtext("obj") or "") or frame.findtext("ip")
            if frame.findtext("file"):
                where += " (%s:%s)" % (frame.findtext("file"), frame.findtext("line"))
            elif frame.findtext("obj") and frame.findtext("fn"):
                where += " (%s)" % os.path.basename(frame.findtext("obj"))
            lines.append("  " + where)
    return "\n".join(indent + line for line in lines)


def top(error):
    frame = stacks(error)[0].find("frame") if stacks(error) else None
    if frame is None:
        return "?"
    return "%s in %s" % (frame.findtext("fn") or "?", os.path.basename(frame.findtext("obj") or "?"))


processes = unfinished = 0
our_errors, our_leaks, other_errors, other_leaks = [], [], [], []
for path in sorted(glob.glob(os.path.join(out, "memcheck.*.xml"))):
    text = open(path, errors="replace").read()
    if "<valgrindoutput>" not in text:
        continue
    processes += 1
    if "</valgrindoutput>" not in text:
        unfinished += 1  # killed by a test: its errors are there, its leak check is not
    command = re.search(r"<argv>.*?</argv>", text, re.S)
    command = " ".join(re.findall(r"<arg>(.*?)</arg>", command.group(0))) if command else "?"
    counts = {m.group(2): int(m.group(1)) for m in
              re.finditer(r"<pair>\s*<count>(\d+)</count>\s*<unique>(0x[0-9a-f]+)</unique>", text)}
    for block in re.findall(r"<error>.*?</error>", text, re.S):
        error = ET.fromstring(block)
        kind = error.findtext("kind")
        record = (error, os.path.basename(path), command, counts.get(error.findtext("unique"), 1))
        if kind.startswith("Leak_"):
            if kind == "Leak_DefinitelyLost":
                (our_leaks if ours(error) else other_leaks).append(record)
        else:
            (our_errors if ours(error) else other_errors).append(record)


def lost(records):
    """(bytes definitely lost, bytes lost through them) of leak records."""
    direct = indirect = 0
    for error, *_ in records:
        total = int(error.findtext("xwhat/leakedbytes") or 0)  # both together
        split = re.search(r"\(([\d,]+) direct, ([\d,]+) indirect\)", error.findtext("xwhat/text") or "")
        inner = int(split.group(2).replace(",", "")) if split else 0
        direct, indirect = direct + total - inner, indirect + inner
    return direct, indirect


print()
print("valgrind memcheck summary (%d processes, %d ended before their leak check)" % (processes, unfinished))
print("  errors in our code (_renderlib, libtarsel_ps, libQRVExternalMonitor): %d (%d contexts)"
      % (sum(n for *_, n in our_errors), len(our_errors)))
print("  definitely lost in our code: %d bytes (and %d bytes indirectly) in %d records"
      % (lost(our_leaks) + (len(our_leaks),)))
print("  elsewhere (interpreter, numpy, system libraries), not judged: %d errors (%d contexts), "
      "%d bytes definitely lost in %d records" % (sum(n for *_, n in other_errors), len(other_errors),
                                                 lost(other_leaks)[0], len(other_leaks)))
if other_errors:
    tops = {}
    for error, *_ , n in other_errors:
        tops[(error.findtext("kind"), top(error))] = tops.get((error.findtext("kind"), top(error)), 0) + n
    print("  their kinds and first frames:")
    for (kind, where), n in sorted(tops.items(), key=lambda item: -item[1])[:15]:
        print("    %6d  %s at %s" % (n, kind, where))
for title, records in (("error in our code", our_errors), ("definitely lost in our code", our_leaks)):
    for error, file, command, n in records:
        print()
        print("%s (%s, %s; %d times):" % (title, file, command[:120], n))
        print(describe(error))
if processes == 0:
    print("no valgrind report was written")
    sys.exit(1)
sys.exit(1 if our_errors or our_leaks else 0)
EOF

# The test outcome, from the JUnit report (valgrind's exit status stands for
# its own errors whenever there are any, even outside our code).
tests_ok=$("$python" - "$out/tests.xml" <<'EOF'
import sys, xml.etree.ElementTree as ET
try:
    root = ET.parse(sys.argv[1]).getroot()
except (OSError, ET.ParseError):
    print("no"); sys.exit()
suites = [root] if root.tag == "testsuite" else root.findall("testsuite")
bad = sum(int(s.get("failures", 0)) + int(s.get("errors", 0)) for s in suites)
ran = sum(int(s.get("tests", 0)) for s in suites)
print("yes" if ran and not bad else "no")
EOF
)
if [ "$tests_ok" != yes ]; then
  echo "FAILED: the tests did not all pass under valgrind (see $out/pytest.log)"
  exit 1
fi
if [ "$verdict" != 0 ]; then
  echo "FAILED: valgrind found errors or definitely lost memory in our code (reports in $out)"
  exit 1
fi
echo "OK: no memory error and no definitely lost block in our code"
