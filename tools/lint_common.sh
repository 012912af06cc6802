# Sourced by tools/lint.sh and tools/format.sh, from the top of the tree.
#
# Makes sure .venv-lint holds ruff and clang-format at the versions pinned in
# pyproject.toml (the lint extra), installing them when it does not, and sets
# RUFF, CLANG_FORMAT and LINT_PYTHON (whose clang_format package
# tools/format_interfaces.py uses). The set-up script installs the same
# versions into .venv; this environment is apart so that the checks need no
# build and can run first in CI.
lint_pins=$(python3 - <<'PY'
import re
text = open("pyproject.toml").read()
try:
    import tomllib
    extra = tomllib.loads(text)["project"]["optional-dependencies"]["lint"]
except ImportError:  # before Python 3.11: the extra's line, read as it is written
    extra = re.findall(r'"([^"]+)"', re.search(r"^lint = \[(.*)\]$", text, re.M).group(1))
print(" ".join(pin for pin in extra if re.match(r"(ruff|clang-format)==", pin)))
PY
)
if [[ ! -x .venv-lint/bin/ruff || "$(cat .venv-lint/pins 2>/dev/null)" != "$lint_pins" ]]; then
  echo "installing $lint_pins into .venv-lint" >&2
  python3 -m venv .venv-lint
  # shellcheck disable=SC2086
  .venv-lint/bin/python -m pip install -q --disable-pip-version-check $lint_pins
  echo "$lint_pins" >.venv-lint/pins
fi
RUFF=.venv-lint/bin/ruff
CLANG_FORMAT=.venv-lint/bin/clang-format
LINT_PYTHON=.venv-lint/bin/python

# Sorts the files given (all the files git knows when none are) by language
# into python_files, cxx_files and interface_files. Ruff leaves out what
# pyproject.toml excludes (the generated stubs) itself.
sort_files() {
  local files=() file
  if (($#)); then files=("$@"); else mapfile -t files < <(git ls-files); fi
  python_files=() cxx_files=() interface_files=()
  for file in "${files[@]}"; do
    [[ -f $file ]] || continue
    case $file in
      *.py | *.pyi) python_files+=("$file") ;;
      *.c | *.cc | *.cpp | *.cxx | *.h | *.hh | *.hpp) cxx_files+=("$file") ;;
      *.i) interface_files+=("$file") ;;
    esac
  done
}
