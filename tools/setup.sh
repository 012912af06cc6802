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
  apt-get update -qq
  DEBIAN_FRONTEND=noninteractive apt-get install -y -qq "${missing[@]}"
fi

python3 -m venv .venv
.venv/bin/python -m pip install -q --upgrade pip
.venv/bin/python -m pip install -q '.[test,lint]'
