// Decoding speed of the turbo-decoder model on one core: one noisy code block of K = 6144
// or K = 40 (transmitter codeword, BPSK over AWGN at Eb/N0 0.8 dB, 8 raw steps per
// natural-log LLR unit), for every unit count, algorithm and 6 or 8 iterations. The counter
// info_bits/s is the decoded information rate.
#include <benchmark/benchmark.h>

#include <cstdint>
#include <vector>

#include "tx/SoftChannel.h"
#include "tx/TurboEncoder.h"
#include "vexlon_ip_corvane_bitacc_cmodel.h"

namespace {

struct Streams {
  std::vector<std::int32_t> d0, d1, d2;
};

Streams noisyBlock(std::uint32_t K) {
  std::vector<std::uint8_t> c(K);
  for (std::uint32_t k = 0; k < K; ++k) c[k] = static_cast<std::uint8_t>((k * 2654435761u) >> 31);
  brannoc::tx::TurboCodeword d;
  brannoc::tx::turboEncode(c, d);
  brannoc::tx::ChannelSettings settings;
  settings.mode = brannoc::tx::ChannelMode::Awgn;
  settings.esN0Db = 0.8 - 4.77;  // rate 1/3
  settings.llrScale = 0.25;      // 8 raw steps per natural-log unit
  Streams s;
  settings.seed = 1;
  brannoc::tx::makeSoftValues(d.d0, brannoc::tx::Constellation::PucchBpsk, settings, s.d0);
  settings.seed = 2;
  brannoc::tx::makeSoftValues(d.d1, brannoc::tx::Constellation::PucchBpsk, settings, s.d1);
  settings.seed = 3;
  brannoc::tx::makeSoftValues(d.d2, brannoc::tx::Constellation::PucchBpsk, settings, s.d2);
  return s;
}

// Arguments: K, processing units, algorithm, iterations.
void BM_TurboDecode(benchmark::State& state) {
  const auto K = static_cast<std::uint32_t>(state.range(0));
  vexlon_ip_corvane_generics generics = vexlon_ip_corvane_get_default_generics();
  generics.processing_units = static_cast<std::uint32_t>(state.range(1));
  generics.algorithm = static_cast<std::uint32_t>(state.range(2));
  const auto iterations = static_cast<std::uint32_t>(state.range(3));
  vexlon_ip_corvane_state* model = vexlon_ip_corvane_create_state(generics);
  const Streams s = noisyBlock(K);
  std::vector<std::uint8_t> bits(K);
  const vexlon_ip_corvane_inputs in{K, iterations, 1, 0, s.d0.data(), K + 4, s.d1.data(), K + 4,
                                    s.d2.data(), K + 4, 0, 0};
  vexlon_ip_corvane_outputs out{0, 0, bits.data(), K};
  for (auto _ : state) {
    if (vexlon_ip_corvane_bitacc_simulate(model, in, &out) != 0) {
      state.SkipWithError("decode refused");
      break;
    }
    benchmark::DoNotOptimize(bits.data());
  }
  vexlon_ip_corvane_destroy_state(model);
  state.counters["info_bits/s"] = benchmark::Counter(
      static_cast<double>(K) * static_cast<double>(state.iterations()),
      benchmark::Counter::kIsRate, benchmark::Counter::kIs1000);
}

BENCHMARK(BM_TurboDecode)
    ->ArgNames({"K", "P", "algorithm", "iterations"})
    ->ArgsProduct({{6144, 40}, {1, 2, 4, 8}, {0, 1, 2}, {6, 8}});

}  // namespace
