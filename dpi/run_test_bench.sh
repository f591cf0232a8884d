#!/bin/sh
# Writes a set of vector files with the brannoc tool (PUSCH with and without UCI, a HARQ
# retransmission chain, CQI only, PUCCH with and without ACK), runs the Verilated test bench
# on them, compares every output it wrote through DPI with what `brannoc decode` writes for
# the same file, and checks that a corrupted vector fails the bench with its name.
# Usage: run_test_bench.sh BRANNOC TEST_BENCH FOLDER
set -eu
tool="$1"
bench="$2"
folder="$3"
rm -rf "${folder}"
mkdir -p "${folder}"
"${tool}" gen --prb 6 --mcs 10 --out "${folder}/data" >/dev/null
"${tool}" gen --prb 25 --mcs 15 --cqi 20 --ack 2 --ri 1 --snr 12 --out "${folder}/uci" >/dev/null
"${tool}" gen --prb 6 --mcs 10 --max-tx 3 --out "${folder}/harq" >/dev/null
"${tool}" gen --tbs 0 --modulation qpsk --prb 2 --cqi 30 --ack 1 --out "${folder}/cqi" >/dev/null
"${tool}" gen --channel pucch --cqi 11 --ack 2 --snr 4 --out "${folder}/pucch.vec" >/dev/null
"${tool}" gen --channel pucch --cqi 4 --out "${folder}/pucch-cqi.vec" >/dev/null
find "${folder}" -name '*.vec' | sort > "${folder}/list"
"${bench}" +vectors="${folder}/list" +outputs

# The outputs through DPI equal those of the C interface as the tool calls it.
while read -r vector; do
  "${tool}" decode --out "${folder}/decoded" "${vector}" >/dev/null
  name=$(basename "${vector}" .vec)
  cmp "${vector}.dpi.out" "${folder}/decoded/${name}.out"
done < "${folder}/list"

# A corrupted vector fails the bench, which names it.
broken="${folder}/broken.vec"
sed 's/^SCH_TBSIZE .*/SCH_TBSIZE 12x/' "${folder}/data/b0000-t1.vec" > "${broken}"
echo "${broken}" > "${folder}/broken-list"
if "${bench}" +vectors="${folder}/broken-list" > "${folder}/broken.log" 2>&1; then
  echo "the test bench passed a corrupted vector"
  exit 1
fi
grep -q "broken.vec:" "${folder}/broken.log"
echo "corrupted vector refused: $(grep "broken.vec:" "${folder}/broken.log")"
