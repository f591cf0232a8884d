#!/usr/bin/env bash
# Frame error rate tables of the turbo-decoder model: K = 6144, rate 1/3, BPSK over AWGN,
# 6 iterations, Eb/N0 0.4 to 1.0 dB in 0.1 dB steps, each point stopped after 50 frame
# errors or the frame cap, for algorithm 1 with 1 and 8 processing units and algorithm 2
# with 1 unit. Builds the release preset's turbo_fer first. Takes long: not run by CI.
# Usage: scripts/turbo_fer.sh [frame cap (default 20000)] [threads (default: all cores)]
set -euo pipefail
cd "$(dirname "$0")/.."
frames="${1:-20000}"
threads="${2:-$(nproc)}"
cmake --preset release >/dev/null
cmake --build build/release -j "${threads}" --target turbo_fer >/dev/null
for config in "1 1" "2 1" "1 8"; do
  set -- ${config}
  echo
  echo "## algorithm $1, $2 processing unit(s)"
  build/release/tools/turbo_fer --K 6144 --algorithm "$1" --units "$2" --iterations 6 \
    --from 0.4 --to 1.0 --step 0.1 --errors 50 --frames "${frames}" --threads "${threads}"
done
