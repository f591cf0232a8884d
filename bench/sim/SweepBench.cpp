// The simulation engine against a plain loop over the C interface, and the engine on one and
// two threads. Every case sends the blocks of the default link of `brannoc sim` (6 PRBs,
// MCS 10: QPSK, TBS 1032, 6 turbo iterations) at an SNR where every first transmission
// decodes, so that each block costs one transmitter pass and one shared-channel call in every
// case. Compare blocks/s: plainLoop with engine/threads:1 (the engine's cost per block), and
// engine/threads:2 with engine/threads:1 (the speedup of a second thread).
#include <benchmark/benchmark.h>

#include <cstdint>
#include <vector>

#include "sim/Sweep.h"
#include "tx/NoiseSource.h"
#include "tx/PuschTransmitter.h"
#include "vexlon_ip_brannoc_bitacc_cmodel.h"

namespace {

constexpr double kSnrDb = 6.0;
constexpr std::uint64_t kBlocks = 400;

// What a test bench would write: transmitter, then the shared-channel call, block by block.
void plainLoop(benchmark::State& state) {
  const brannoc::sim::LinkConfig link;
  brannoc::tx::PuschParameters params;
  params.numPrb = link.numPrb;
  params.Qm = link.Qm;
  params.tbSize = link.tbSize;
  brannoc::tx::ChannelSettings channel;
  channel.mode = brannoc::tx::ChannelMode::Awgn;
  channel.esN0Db = kSnrDb;
  brannoc::tx::PuschPayload payload;
  brannoc::tx::PuschTransmission sent;
  brannoc::sim::SharedOutputs buffers;
  vexlon_ip_brannoc_state* instance = vexlon_ip_brannoc_create_state(link.generics);
  std::uint64_t block = 0;
  for (auto _ : state) {
    brannoc::tx::Xoshiro256 random(block);
    payload.transportBlock.resize(link.tbSize);
    for (auto& bit : payload.transportBlock) bit = random.next() & 1U;
    channel.seed = ++block;
    if (!brannoc::tx::transmitPusch(params, payload, channel, sent).ok()) {
      state.SkipWithError("transmitter refused the parameters");
      break;
    }
    const brannoc::tx::PuschControlFields& f = sent.fields;
    const vexlon_ip_brannoc_SCH_inputs inputs{sent.softValues.data(),
                                              nullptr,
                                              nullptr,
                                              nullptr,
                                              static_cast<std::uint32_t>(sent.softValues.size()),
                                              0,
                                              {0,
                                               0,
                                               f.contentMask,
                                               0,
                                               0,
                                               0,
                                               0,
                                               f.Eidx,
                                               f.Rmux,
                                               f.cpIndex,
                                               f.Eminus,
                                               f.Eplus,
                                               f.tbSize,
                                               link.iterations,
                                               f.qamIndex,
                                               0,
                                               0,
                                               0,
                                               0,
                                               1,
                                               0,
                                               0,
                                               0}};
    vexlon_ip_brannoc_SCH_outputs& outputs =
        buffers.prepare(inputs.controlData, f.harqBufferLength);
    if (vexlon_ip_brannoc_SCH_bitacc_simulate(instance, inputs, &outputs) != 0 ||
        outputs.SCH_TB_crc_error != 0) {
      state.SkipWithError("the block did not decode");
      break;
    }
  }
  vexlon_ip_brannoc_destroy_state(instance);
  state.counters["blocks/s"] =
      benchmark::Counter(static_cast<double>(state.iterations()), benchmark::Counter::kIsRate);
}
BENCHMARK(plainLoop)->Unit(benchmark::kMillisecond)->UseRealTime();

// The engine on the same blocks: one curve, one point, kBlocks blocks per iteration.
void engine(benchmark::State& state) {
  brannoc::sim::SweepConfig config;
  config.curves = {{"default", brannoc::sim::LinkConfig{}}};
  config.snrDb = {kSnrDb};
  config.maxBlocks = kBlocks;
  config.targetErrors = 0;
  config.threads = static_cast<unsigned>(state.range(0));
  for (auto _ : state) {
    const brannoc::sim::SweepResult result = brannoc::sim::runSweep(config);
    if (!result.error.empty() || result.points[0].transmissions != kBlocks) {
      state.SkipWithError("the sweep failed or retransmitted");
      break;
    }
  }
  state.counters["blocks/s"] = benchmark::Counter(static_cast<double>(state.iterations() * kBlocks),
                                                  benchmark::Counter::kIsRate);
}
BENCHMARK(engine)->ArgName("threads")->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

}  // namespace
