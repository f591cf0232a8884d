#!/usr/bin/env bash
# Frame error rate tables of the turbo-decoder model: K = 6144, rate 1/3, BPSK over AWGN,
# soft values at the library's default of 32 raw steps per natural-log unit, 6 iterations,
# Eb/N0 0.4 to 1.0 dB in 0.1 dB steps, each point stopped after 50 frame errors or the frame
# cap, for algorithm 1 with 1 and 8 processing units and algorithm 2 with 1 unit. Builds the
# release preset's turbo_fer first. Takes long: not run by CI.
# Usage: scripts/turbo_fer.sh [frame cap (default 20000)] [threads (default: all cores)]
#                             [vector (default) | scalar | both]
# "both" decodes every table with the vectorised and the scalar decoder and checks that the
# two tables are identical (the decoders decide the same bits).
set -euo pipefail
cd "$(dirname "$0")/.."
frames="${1:-20000}"
threads="${2:-$(nproc)}"
path="${3:-vector}"
case "${path}" in
  vector | scalar) paths=("${path}") ;;
  both) paths=(vector scalar) ;;
  *) echo "usage: $0 [frame cap] [threads] [vector|scalar|both]" >&2; exit 2 ;;
esac
cmake --preset release >/dev/null
cmake --build build/release -j "${threads}" --target turbo_fer >/dev/null
status=0
for config in "1 1" "2 1" "1 8"; do
  set -- ${config}
  echo
  echo "## algorithm $1, $2 processing unit(s)"
  tables=()
  for p in "${paths[@]}"; do
    table=$(build/release/tools/turbo_fer --K 6144 --algorithm "$1" --units "$2" --iterations 6 \
      --from 0.4 --to 1.0 --step 0.1 --errors 50 --frames "${frames}" --threads "${threads}" \
      --path "${p}" --batch 8)
    echo "${table}"
    tables+=("$(grep '^| [0-9]' <<<"${table}")")
  done
  if [ "${#tables[@]}" -eq 2 ]; then
    if [ "${tables[0]}" == "${tables[1]}" ]; then
      echo "vector and scalar tables identical"
    else
      echo "vector and scalar tables DIFFER"
      status=1
    fi
  fi
done
exit "${status}"
