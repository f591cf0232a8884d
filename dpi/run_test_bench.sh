#!/bin/sh
# Writes a set of vector files with the brannoc tool (PUSCH with and without UCI, a HARQ
# retransmission chain, CQI only, PUCCH with and without ACK) and runs the Verilated test
# bench on them. Usage: run_test_bench.sh BRANNOC TEST_BENCH FOLDER
set -eu
tool="$1"
bench="$2"
folder="$3"
rm -rf "${folder}"
mkdir -p "${folder}"
"${tool}" gen --prb 6 --mcs 10 --out "${folder}/data" >/dev/null
"${tool}" gen --prb 25 --mcs 15 --cqi 20 --ack 2 --ri 1 --out "${folder}/uci" >/dev/null
"${tool}" gen --prb 6 --mcs 10 --max-tx 3 --out "${folder}/harq" >/dev/null
"${tool}" gen --tbs 0 --modulation qpsk --prb 2 --cqi 30 --ack 1 --out "${folder}/cqi" >/dev/null
"${tool}" gen --channel pucch --cqi 11 --ack 2 --out "${folder}/pucch.vec" >/dev/null
"${tool}" gen --channel pucch --cqi 4 --out "${folder}/pucch-cqi.vec" >/dev/null
find "${folder}" -name '*.vec' | sort > "${folder}/list"
"${bench}" +vectors="${folder}/list"
