#!/usr/bin/env bash
# Builds the wheel with `pip wheel .`, installs it into a fresh virtual
# environment (.venv-wheel) with the test tools, and runs the whole test suite
# against that installation rather than the source tree.
set -euo pipefail
cd "$(dirname "$0")/.."

rm -rf dist .venv-wheel
python3 -m venv .venv-wheel
.venv-wheel/bin/python -m pip install -q --upgrade pip
.venv-wheel/bin/python -m pip wheel -q --no-deps -w dist .
wheel=$(ls dist/renderlib-*.whl)
.venv-wheel/bin/python -c "import sys, zipfile; names = zipfile.ZipFile(sys.argv[1]).namelist()
sys.exit(not any(name.endswith('.dist-info/licenses/LICENSE') for name in names))" "$wheel" ||
  { echo "wheel_check: $wheel carries no LICENSE" >&2; exit 1; }
.venv-wheel/bin/python -m pip install -q "${wheel}[test]"
echo "installed $wheel"
# From another folder, so nothing of the source tree can be imported by accident.
cd tests && ../.venv-wheel/bin/python -m pytest -q -p no:cacheprovider --rootdir=.. -c ../pyproject.toml "$@"
