#!/usr/bin/env bash
# Builds and tests the three configurations: 64-bit release, the 32-bit contract build and
# the 64-bit sanitizer build. Prints each ctest summary; exits non-zero on any failure.
set -euo pipefail
cd "$(dirname "$0")/.."
jobs=$(nproc)
status=0
for preset in release x86 asan; do
  echo "=== ${preset} ==="
  cmake --preset "${preset}" >/dev/null
  cmake --build --preset "${preset}" -j "${jobs}"
  if ! ctest --preset "${preset}" -j "${jobs}"; then
    status=1
  fi
done
exit "${status}"
