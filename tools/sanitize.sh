#!/usr/bin/env bash
# Builds the module and the reference engine with AddressSanitizer and
# UndefinedBehaviorSanitizer into .venv-sanitize and runs the whole test suite
# under them. Any report fails the run.
set -euo pipefail
cd "$(dirname "$0")/.."

python3 -m venv .venv-sanitize
.venv-sanitize/bin/python -m pip install -q --upgrade pip
.venv-sanitize/bin/python -m pip install -q '.[test]' \
  -C cmake.define.RENDERLIB_SANITIZE=ON -C cmake.build-type=RelWithDebInfo

# The interpreter is not instrumented, so the runtimes are preloaded, and its
# own allocator is bypassed so that object memory is checked too. Leaks are
# not judged here: the interpreter keeps memory until exit by design.
export LD_PRELOAD="$(gcc -print-file-name=libasan.so) $(gcc -print-file-name=libubsan.so)"
export PYTHONMALLOC=malloc
export ASAN_OPTIONS=detect_leaks=0:abort_on_error=1:strict_string_checks=1:check_initialization_order=1
export UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1
# Reports go to the terminal, not to pytest's captured output: a report ends the
# process, so the tests run in this one (-n 0), whose standard error is the terminal's.
.venv-sanitize/bin/python -m pytest -p no:cacheprovider --capture=sys -q -n 0 "$@"
