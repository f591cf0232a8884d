// Whole shared-channel calls through the exported interface, no dumps: 64QAM, 100 PRBs
// (1200 rows), normal cyclic prefix, the largest one-layer transport block (75376 bits, 13
// code blocks), C_NUM_PU 2, noisy soft values from the transmitter, at 8 and 4 turbo
// iterations. The difference of the two gives the turbo decoder's share: the rest of the
// chain costs about 2 T(4) - T(8).
#include <benchmark/benchmark.h>

#include <array>
#include <cstdint>
#include <vector>

#include "tx/PuschTransmitter.h"
#include "vexlon_ip_brannoc_bitacc_cmodel.h"

namespace {

void sharedChannelCall(benchmark::State& state) {
  const auto iterations = static_cast<std::uint32_t>(state.range(0));
  brannoc::tx::PuschParameters params;
  params.numPrb = 100;
  params.Qm = 6;
  params.tbSize = 75376;
  brannoc::tx::PuschPayload payload;
  payload.transportBlock.resize(params.tbSize);
  for (std::size_t i = 0; i < payload.transportBlock.size(); ++i) {
    payload.transportBlock[i] = static_cast<std::uint8_t>((i * 7 + i / 3) % 5 < 2);
  }
  brannoc::tx::ChannelSettings channel;
  channel.mode = brannoc::tx::ChannelMode::Awgn;
  channel.esN0Db = 20.0;
  brannoc::tx::PuschTransmission sent;
  if (!brannoc::tx::transmitPusch(params, payload, channel, sent).ok()) {
    state.SkipWithError("transmitter refused the parameters");
    return;
  }
  const brannoc::tx::PuschControlFields& f = sent.fields;
  vexlon_ip_brannoc_state* instance =
      vexlon_ip_brannoc_create_state(vexlon_ip_brannoc_get_default_generics());
  const vexlon_ip_brannoc_SCH_inputs inputs{
      sent.softValues.data(),
      nullptr,
      nullptr,
      nullptr,
      static_cast<std::uint32_t>(sent.softValues.size()),
      0,
      {0,       0,        f.contentMask, 0,          0, 0, 0, f.Eidx, f.Rmux, f.cpIndex, f.Eminus,
       f.Eplus, f.tbSize, iterations,    f.qamIndex, 1, 0, 0, 0,      1,      0,         0,
       0}};
  std::vector<std::uint8_t> data(f.tbSize);
  std::array<std::vector<std::int32_t>, 3> harq;
  for (auto& h : harq) h.resize(f.harqBufferLength);
  std::array<std::uint8_t, 64> small{};
  vexlon_ip_brannoc_SCH_outputs outputs{};
  outputs.SCH_data_out = data.data();
  outputs.SCH_ACK_out = outputs.SCH_RI_out = outputs.SCH_CQI_out = outputs.CW_CRC_out =
      small.data();
  outputs.sys_harq_buffer = harq[0].data();
  outputs.p0_harq_buffer = harq[1].data();
  outputs.p1_harq_buffer = harq[2].data();
  outputs.max_harq_buffer_size = f.harqBufferLength;
  outputs.max_SCH_data_out_size = f.tbSize;
  outputs.max_CW_CRC_out_size = static_cast<std::uint32_t>(small.size());
  for (auto _ : state) {
    if (vexlon_ip_brannoc_SCH_bitacc_simulate(instance, inputs, &outputs) != 0 ||
        outputs.SCH_TB_crc_error != 0) {
      state.SkipWithError("the transport block did not decode");
      break;
    }
    benchmark::DoNotOptimize(data.data());
  }
  vexlon_ip_brannoc_destroy_state(instance);
  state.counters["Mbit/s"] = benchmark::Counter(
      static_cast<double>(f.tbSize) * static_cast<double>(state.iterations()) / 1e6,
      benchmark::Counter::kIsRate);
}
BENCHMARK(sharedChannelCall)
    ->ArgName("iterations")
    ->Arg(8)
    ->Arg(4)
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();

}  // namespace
