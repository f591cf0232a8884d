// Rate dematching plus HARQ chase combining of one code block of K = 6144 (transport block
// of 6120 bits, one code block), with E about 1.5 times the circular buffer so that part of
// the buffer is combined twice. Reports the time per call and soft values per second.
#include <benchmark/benchmark.h>

#include <cstdint>
#include <random>

#include "KRateDeMatch.h"

namespace {

using brannoc::KRateDeMatch;

void BM_RateDematchAndHarq6144(benchmark::State& state) {
  constexpr std::uint32_t kTbSize = 6120;
  constexpr std::uint32_t kE = 27660;  // QPSK, 1.5 x the 18444 real buffer positions
  const auto rv = static_cast<std::uint32_t>(state.range(0));
  KRateDeMatch rdm;
  rdm.setModulationParams(kE, 2, 1, 0);
  rdm.setParams(kTbSize, kE, 2, rv, 1);

  std::mt19937 random(1);
  std::uniform_int_distribution<std::int32_t> softValue(-128, 127);
  KRateDeMatch::SoftValues in(rdm.getCodeBlockE(0));
  for (auto& v : in) {
    v = softValue(random);
  }
  const std::uint32_t D = rdm.getCodeBlockBufferLength(0) / 3;
  KRateDeMatch::Streams harq(3, KRateDeMatch::SoftValues(D));
  for (auto& stream : harq) {
    for (auto& v : stream) {
      v = softValue(random);
    }
  }
  KRateDeMatch::Streams out;
  for (auto _ : state) {
    if (!rdm.rateDematchAndHARQ(in, harq, out, 0)) {
      state.SkipWithError("rate dematching failed");
      break;
    }
    benchmark::DoNotOptimize(out.data());
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * static_cast<std::int64_t>(in.size()));
  state.counters["soft values per call"] = static_cast<double>(in.size());
}
BENCHMARK(BM_RateDematchAndHarq6144)->Arg(0)->Arg(2)->Unit(benchmark::kMicrosecond);

}  // namespace
