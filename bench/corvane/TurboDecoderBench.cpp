// Decoding speed of the turbo-decoder model on one core, scalar reference against the
// vectorised decoder on each instruction set the processor runs (SSE4, AVX2, AVX-512):
// noisy code blocks (transmitter codewords, BPSK over AWGN at Eb/N0 0.8 dB, soft values at
// the library's default of 32 raw steps per natural-log unit), for every unit count,
// algorithm and 6 or 8 iterations; one block of K = 6144 or 40 per call, or a batch of the
// 13 blocks of K = 6144 of one transport block per call. The counter Mbit/s is the decoded
// information rate. Run one family with e.g. --benchmark_filter='Batch/AVX2/.*algorithm:1'.
#include <benchmark/benchmark.h>

#include <cstdint>
#include <string>
#include <vector>

#include "tx/SoftChannel.h"
#include "tx/TurboEncoder.h"
#include "vexlon_ip_corvane_bitacc_cmodel.h"

#if CORVANE_HAVE_HIGHWAY
#include <hwy/targets.h>
#endif

namespace {

struct Streams {
  std::vector<std::int32_t> d0, d1, d2;
};

Streams noisyBlock(std::uint32_t K, std::uint64_t seed) {
  std::vector<std::uint8_t> c(K);
  for (std::uint32_t k = 0; k < K; ++k) {
    c[k] = static_cast<std::uint8_t>((static_cast<std::uint32_t>(k + seed) * 2654435761u) >> 31);
  }
  brannoc::tx::TurboCodeword d;
  brannoc::tx::turboEncode(c, d);
  brannoc::tx::ChannelSettings settings;
  settings.mode = brannoc::tx::ChannelMode::Awgn;
  settings.esN0Db = 0.8 - 4.77;  // rate 1/3
  Streams s;
  settings.seed = 3 * seed + 1;
  brannoc::tx::makeSoftValues(d.d0, brannoc::tx::Constellation::PucchBpsk, settings, s.d0);
  settings.seed = 3 * seed + 2;
  brannoc::tx::makeSoftValues(d.d1, brannoc::tx::Constellation::PucchBpsk, settings, s.d1);
  settings.seed = 3 * seed + 3;
  brannoc::tx::makeSoftValues(d.d2, brannoc::tx::Constellation::PucchBpsk, settings, s.d2);
  return s;
}

// Arguments: K, blocks per call, processing units, algorithm, iterations. target is a
// Highway target, or 0 for the scalar decoder.
void decodeBench(benchmark::State& state, std::int64_t target) {
  const auto K = static_cast<std::uint32_t>(state.range(0));
  const auto count = static_cast<std::uint32_t>(state.range(1));
  vexlon_ip_corvane_generics generics = vexlon_ip_corvane_get_default_generics();
  generics.processing_units = static_cast<std::uint32_t>(state.range(2));
  generics.algorithm = static_cast<std::uint32_t>(state.range(3));
  generics.decoder_path = target == 0 ? 1 : 2;
  generics.max_code_blocks = count;
  const auto iterations = static_cast<std::uint32_t>(state.range(4));
#if CORVANE_HAVE_HIGHWAY
  if (target != 0) hwy::SetSupportedTargetsForTest(target);
#endif
  vexlon_ip_corvane_state* model = vexlon_ip_corvane_create_state(generics);
  std::vector<Streams> streams;
  std::vector<std::vector<std::uint8_t>> bits(count, std::vector<std::uint8_t>(K));
  std::vector<vexlon_ip_corvane_inputs> in;
  std::vector<vexlon_ip_corvane_outputs> out;
  for (std::uint32_t b = 0; b < count; ++b) streams.push_back(noisyBlock(K, b));
  for (std::uint32_t b = 0; b < count; ++b) {
    const Streams& s = streams[b];
    in.push_back(
        {K, iterations, 1, 0, s.d0.data(), K + 4, s.d1.data(), K + 4, s.d2.data(), K + 4, 0, 0});
    out.push_back({0, 0, bits[b].data(), K});
  }
  for (auto _ : state) {
    if (vexlon_ip_corvane_bitacc_simulate_batch(model, in.data(), count, out.data()) != 0) {
      state.SkipWithError(model == nullptr ? "no model" : "decode refused");
      break;
    }
    benchmark::DoNotOptimize(bits.data());
  }
  vexlon_ip_corvane_destroy_state(model);
#if CORVANE_HAVE_HIGHWAY
  hwy::SetSupportedTargetsForTest(0);
#endif
  state.counters["Mbit/s"] = benchmark::Counter(
      1e-6 * K * count * static_cast<double>(state.iterations()), benchmark::Counter::kIsRate);
}

// One family per decoder: BM_TurboDecode/<decoder> (one block per call) and
// BM_TurboDecodeBatch/<decoder> (13 blocks of K = 6144 per call).
int registerBenchmarks() {
  std::vector<std::pair<std::string, std::int64_t>> decoders = {{"scalar", 0}};
#if CORVANE_HAVE_HIGHWAY
  for (std::int64_t target : hwy::SupportedAndGeneratedTargets()) {
    const std::string name = hwy::TargetName(target);
    if (name == "SSE4" || name == "AVX2" || name == "AVX3") {
      decoders.emplace_back(name == "AVX3" ? "AVX512" : name, target);
    }
  }
#endif
  for (const auto& [name, target] : decoders) {
    benchmark::RegisterBenchmark(("BM_TurboDecode/" + name).c_str(), decodeBench, target)
        ->ArgNames({"K", "blocks", "P", "algorithm", "iterations"})
        ->ArgsProduct({{6144, 40}, {1}, {1, 2, 4, 8}, {0, 1, 2}, {6, 8}});
    benchmark::RegisterBenchmark(("BM_TurboDecodeBatch/" + name).c_str(), decodeBench, target)
        ->ArgNames({"K", "blocks", "P", "algorithm", "iterations"})
        ->ArgsProduct({{6144}, {13}, {1, 2, 4, 8}, {0, 1, 2}, {6, 8}});
  }
  return 0;
}

const int kRegistered = registerBenchmarks();

}  // namespace
