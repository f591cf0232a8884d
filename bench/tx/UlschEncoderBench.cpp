// Encoding throughput of the transmitter's data chain for one 6144-bit code block.
#include <benchmark/benchmark.h>

#include <cstdint>

#include "tx/TurboEncoder.h"
#include "tx/TurboRateMatcher.h"
#include "tx/UlschEncoder.h"

namespace {

using brannoc::tx::Bits;

Bits patternBits(std::uint32_t length) {
  Bits bits(length);
  std::uint32_t s = 1;
  for (auto& bit : bits) {
    s = s * 1664525u + 1013904223u;
    bit = (s >> 24) & 1u;
  }
  return bits;
}

// A 6120-bit transport block: one 6144-bit block, rate matched to 18432 bits (16QAM).
void BM_UlschEncodeOneFullBlock(benchmark::State& state) {
  const Bits tb = patternBits(6120);
  brannoc::tx::UlschEncoding out;
  for (auto _ : state) {
    benchmark::DoNotOptimize(brannoc::tx::encodeUlsch(tb, 18432, 4, 0, out));
  }
  state.SetItemsProcessed(state.iterations() * 6120);
}
BENCHMARK(BM_UlschEncodeOneFullBlock);

void BM_TurboEncode6144(benchmark::State& state) {
  const Bits c = patternBits(6144);
  brannoc::tx::TurboCodeword d;
  for (auto _ : state) benchmark::DoNotOptimize(brannoc::tx::turboEncode(c, d));
  state.SetItemsProcessed(state.iterations() * 6144);
}
BENCHMARK(BM_TurboEncode6144);

void BM_RateMatch6144(benchmark::State& state) {
  brannoc::tx::TurboCodeword d;
  brannoc::tx::turboEncode(patternBits(6144), d);
  Bits e;
  for (auto _ : state) benchmark::DoNotOptimize(brannoc::tx::rateMatchTurbo(d, 18432, 0, e));
  state.SetItemsProcessed(state.iterations() * 18432);
}
BENCHMARK(BM_RateMatch6144);

}  // namespace
