#!/usr/bin/env bash
# Formats the code in place: ruff's formatter for Python, clang-format for C
# and C++ and for the C++ blocks of the SWIG interface files. With file
# arguments (as pre-commit gives them) only those files are formatted.
# tools/lint.sh checks that nothing is left to do, and for ruff's lint
# findings, which this leaves alone.
set -euo pipefail
cd "$(dirname "$0")/.."
source tools/lint_common.sh
sort_files "$@"

if ((${#python_files[@]})); then
  "$RUFF" format --force-exclude --quiet "${python_files[@]}"
fi
if ((${#cxx_files[@]})); then
  "$CLANG_FORMAT" -i "${cxx_files[@]}"
fi
if ((${#interface_files[@]})); then
  "$LINT_PYTHON" tools/format_interfaces.py "${interface_files[@]}"
fi
