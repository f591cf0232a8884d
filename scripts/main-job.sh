#!/usr/bin/env bash
# The main job: installs what a fresh Debian 12 machine lacks, builds the brannoc tool (release
# preset, nothing else) and runs the default simulation. The table goes to the terminal;
# bler.csv, bler.json and bler.png go to results/. Extra arguments go to `brannoc sim`.
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/install-packages.sh g++ cmake make googletest libbenchmark-dev libhwy-dev libcli11-dev \
  libfmt-dev nlohmann-json3-dev python3-matplotlib libopenmpi-dev openmpi-bin
cmake --preset release >/dev/null
cmake --build --preset release -j "$(nproc)" --target brannoc
build/release/tools/brannoc/brannoc sim --out results "$@"
