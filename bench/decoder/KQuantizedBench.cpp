// Cost of the soft-value combine of the rate dematcher: two 8:5 values loaded with
// setValueQ, added exactly, narrowed back to 8:5 (and, for HARQ, moved to its own format).
#include <benchmark/benchmark.h>

#include <cstdint>
#include <vector>

#include "KQuantized.h"

namespace {

using brannoc::KQuantized;

std::vector<std::int32_t> softValues(std::size_t n, std::uint32_t seed) {
  std::vector<std::int32_t> values(n);
  for (auto& v : values) {
    seed = seed * 1664525u + 1013904223u;
    v = static_cast<std::int32_t>(seed >> 24) - 128;
  }
  return values;
}

void BM_CombineSoftValues(benchmark::State& state, bool harq) {
  const auto n = static_cast<std::size_t>(state.range(0));
  const std::vector<std::int32_t> a = softValues(n, 1), b = softValues(n, 2);
  std::vector<std::int32_t> out(n);
  const KQuantized format(0.0, 3, 5, false);
  for (auto _ : state) {
    for (std::size_t i = 0; i < n; ++i) {
      KQuantized x = format, y = format;
      x.setValueQ(a[i]);
      y.setValueQ(b[i]);
      KQuantized sum = x + y;
      sum.setNINTBITS(format.getNINTBITS());
      if (harq) {
        sum.changeFormat(format.getNINTBITS(), format.getNFRACBITS());
      }
      out[i] = static_cast<std::int32_t>(sum.getValueQ());
    }
    benchmark::DoNotOptimize(out.data());
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * n));
}

BENCHMARK_CAPTURE(BM_CombineSoftValues, chase, false)->Arg(6144 * 3);
BENCHMARK_CAPTURE(BM_CombineSoftValues, harq, true)->Arg(6144 * 3);

void BM_QuantizeDoubles(benchmark::State& state) {
  const auto n = static_cast<std::size_t>(state.range(0));
  std::vector<double> in(n);
  for (std::size_t i = 0; i < n; ++i) {
    in[i] = static_cast<double>(i % 301) / 32.0 - 4.5;
  }
  std::vector<std::int64_t> out;
  KQuantized q(0.0, 3, 5, false);
  for (auto _ : state) {
    benchmark::DoNotOptimize(q.quantize(in, out));
  }
  state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * n));
}

BENCHMARK(BM_QuantizeDoubles)->Arg(6144 * 3);

}  // namespace
