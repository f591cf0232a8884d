// Whole control-channel calls through the exported interface: a 13-bit CQI report with two
// HARQ-ACK bits (normal cyclic prefix), noisy soft values from the transmitter, for each number
// of CQI processing units. Reported in microseconds per call.
#include <benchmark/benchmark.h>

#include <array>
#include <cstdint>
#include <vector>

#include "tx/PucchTransmitter.h"
#include "vexlon_ip_brannoc_bitacc_cmodel.h"

namespace {

void controlChannelCall(benchmark::State& state) {
  vexlon_ip_brannoc_generics generics = vexlon_ip_brannoc_get_default_generics();
  generics.C_NUM_CQI_PU = static_cast<std::uint32_t>(state.range(0));
  vexlon_ip_brannoc_state* instance = vexlon_ip_brannoc_create_state(generics);

  const brannoc::tx::Bits cqi{1, 0, 1, 1, 0, 0, 1, 0, 1, 1, 1, 0, 1};
  const brannoc::tx::Bits ack{1, 0};
  brannoc::tx::ChannelSettings channel;
  channel.mode = brannoc::tx::ChannelMode::Awgn;
  channel.esN0Db = 3.0;
  brannoc::tx::PucchTransmission sent;
  brannoc::tx::transmitPucch(cqi, ack, brannoc::tx::CyclicPrefix::Normal, channel, sent);

  const vexlon_ip_brannoc_CCH_inputs inputs{
      sent.softValues.data(),
      static_cast<std::uint32_t>(sent.softValues.size()),
      {static_cast<std::uint32_t>(cqi.size()), 0, static_cast<std::uint32_t>(ack.size()), 1, 0}};
  std::array<std::uint8_t, 13> cqiOut{};
  std::array<std::uint8_t, 2> ackOut{};
  vexlon_ip_brannoc_CCH_outputs outputs{cqiOut.data(), ackOut.data(), 13, 2, 0, 0, 0};
  for (auto _ : state) {
    benchmark::DoNotOptimize(vexlon_ip_brannoc_CCH_bitacc_simulate(instance, inputs, &outputs));
    benchmark::DoNotOptimize(cqiOut.data());
  }
  vexlon_ip_brannoc_destroy_state(instance);
}
BENCHMARK(controlChannelCall)
    ->ArgName("C_NUM_CQI_PU")
    ->DenseRange(1, 4)
    ->Unit(benchmark::kMicrosecond);

}  // namespace
