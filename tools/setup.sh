#!/usr/bin/env bash
# Prepares a fresh Debian machine: system packages, then a virtual environment
# in .venv with the package (module and reference engine), its test tools and
# its lint tools (ruff, clang-format, pre-commit).
set -euo pipefail
cd "$(dirname "$0")/.."

packages=(g++ python3-dev python3-venv libcjson-dev libpng-dev)
missing=()
for p in "${packages[@]}"; do
  dpkg -s "$p" >/dev/null 2>&1 || missing+=("$p")
done
if ((${#missing[@]})); then
  echo "setup: installing ${missing[*]}"
  apt-get update -qq
  DEBIAN_FRONTEND=noninteractive apt-get install -y -qq "${missing[@]}"
fi

echo "setup: the virtual environment .venv"
python3 -m venv .venv
.venv/bin/python -m pip install -q --upgrade pip
# The first build takes a few minutes on two cores; later ones reuse
# build/<wheel tag>/ and rebuild what changed.
echo "setup: building and installing the package with its test and lint tools"
.venv/bin/python -m pip install --progress-bar off '.[test,lint]'
