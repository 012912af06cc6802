#!/usr/bin/env bash
# The style checks, which change nothing: ruff's lint rules and formatter for
# the Python code, clang-format for the C and C++ files and for the C++ blocks
# of the SWIG interface files (tools/format_interfaces.py). With file
# arguments (as pre-commit gives them) only those files are checked.
# tools/format.sh applies the formatters.
set -euo pipefail
cd "$(dirname "$0")/.."
source tools/lint_common.sh
sort_files "$@"

status=0
if ((${#python_files[@]})); then
  "$RUFF" check --force-exclude "${python_files[@]}" || status=1
  "$RUFF" format --check --force-exclude "${python_files[@]}" || status=1
fi
if ((${#cxx_files[@]})); then
  "$CLANG_FORMAT" --dry-run --Werror --ferror-limit=3 "${cxx_files[@]}" || status=1
fi
if ((${#interface_files[@]})); then
  "$LINT_PYTHON" tools/format_interfaces.py --check "${interface_files[@]}" || status=1
fi
if ((status)); then
  echo "lint: failed (tools/format.sh applies the formatters; lint findings are fixed by hand)" >&2
fi
exit $status
