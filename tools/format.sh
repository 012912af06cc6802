#!/usr/bin/env bash
# Formats the code in place: clang-format for C and C++ and for the C++ blocks
# of the SWIG interface files. (Python is held to ruff's lint rules only: its
# formatter would re-wrap some 2,600 lines of hand-laid tables and calls.) With file arguments (as
# pre-commit gives them) only those files are formatted. tools/lint.sh checks
# that nothing is left to do, and for ruff's lint findings, which this leaves
# alone.
set -euo pipefail
cd "$(dirname "$0")/.."
source tools/lint_common.sh
sort_files "$@"

if ((${#cxx_files[@]})); then
  "$CLANG_FORMAT" -i "${cxx_files[@]}"
fi
if ((${#interface_files[@]})); then
  "$LINT_PYTHON" tools/format_interfaces.py "${interface_files[@]}"
fi
