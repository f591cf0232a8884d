#!/usr/bin/env bash
# Runs a libFuzzer harness of the fuzz preset for a number of seconds (or 10 million
# executions, whichever comes first), starting from the seed corpus that make_corpus writes
# from the transmitter, and prints the executions and the coverage reached. HARNESS is one of
# the harnesses in build/fuzz/fuzz (sch, cch, dump, ...) or "all" (each in turn for SECONDS).
# A crash leaves its input in build/fuzz/findings.
# Usage: scripts/fuzz.sh HARNESS SECONDS
set -euo pipefail
cd "$(dirname "$0")/.."
harness="${1:?usage: scripts/fuzz.sh HARNESS SECONDS}"
seconds="${2:?usage: scripts/fuzz.sh HARNESS SECONDS}"
cmake --preset fuzz >/dev/null
cmake --build --preset fuzz -j "$(nproc)" >/dev/null
out="$(pwd)/build/fuzz"
rm -rf "${out}/seeds"
"${out}/fuzz/make_corpus" "${out}/seeds"
if [ "${harness}" = all ]; then
  harnesses=$(cd "${out}/fuzz" && ls ./*_fuzzer | sed 's|./||; s|_fuzzer||')
else
  harnesses="${harness}"
fi
mkdir -p "${out}/findings"
status=0
for h in ${harnesses}; do
  corpus="${out}/corpus/${h}"
  mkdir -p "${corpus}"
  seeds="${out}/seeds/${h}"
  [ -d "${seeds}" ] || seeds=""
  log="${out}/${h}.log"
  if ! "${out}/fuzz/${h}_fuzzer" "${corpus}" ${seeds} -max_total_time="${seconds}" -runs=10000000 \
      -print_final_stats=1 -artifact_prefix="${out}/findings/${h}-" >"${log}" 2>&1; then
    echo "${h}: FAILED, see ${log} and ${out}/findings"
    status=1
  fi
  runs=$(grep -a 'stat::number_of_executed_units' "${log}" | awk '{print $2}')
  cov=$(grep -a -E '^#[0-9]+' "${log}" | tail -1 | sed -E 's/.*cov: ([0-9]+).*/\1/')
  echo "${h}: ${runs:-?} executions, ${cov:-?} edges covered in ${seconds} s"
done
exit "${status}"
