// Throughput of the transmitter and channel model: a full PUSCH subframe (data and UCI) with
// AWGN soft values, and the soft demapper alone.
#include <benchmark/benchmark.h>

#include <cstdint>
#include <vector>

#include "tx/PuschTransmitter.h"
#include "tx/SoftChannel.h"

namespace {

using namespace brannoc::tx;

Bits patternBits(std::size_t length) {
  Bits bits(length);
  for (std::size_t i = 0; i < length; ++i) bits[i] = ((i * 13 + i / 5) % 7) < 3 ? 1 : 0;
  return bits;
}

void PuschSubframe50Prb16QamAwgn(benchmark::State& state) {
  PuschParameters p;
  p.numPrb = 50;
  p.Qm = 4;
  p.tbSize = 14112;
  p.cqiBits = 20;
  p.cqi.betaIndex = 8;
  p.ackBits = 2;
  p.ack.betaIndex = 5;
  p.riBits = 1;
  p.ri.betaIndex = 5;
  const PuschPayload payload = {patternBits(p.tbSize), patternBits(20), {1, 0}, {1}};
  ChannelSettings channel;
  channel.mode = ChannelMode::Awgn;
  channel.esN0Db = 12.0;
  PuschTransmission tx;
  for (auto _ : state) {
    benchmark::DoNotOptimize(transmitPusch(p, payload, channel, tx));
  }
  state.SetItemsProcessed(state.iterations() * tx.codedBits.size());
}
BENCHMARK(PuschSubframe50Prb16QamAwgn)->Unit(benchmark::kMillisecond);

void SoftValues64QamAwgn(benchmark::State& state) {
  const Bits bits = patternBits(60000);
  ChannelSettings channel;
  channel.mode = ChannelMode::Awgn;
  std::vector<std::int32_t> soft;
  for (auto _ : state) {
    benchmark::DoNotOptimize(makeSoftValues(bits, Constellation::Qam64, channel, soft));
  }
  state.SetItemsProcessed(state.iterations() * bits.size());
}
BENCHMARK(SoftValues64QamAwgn)->Unit(benchmark::kMillisecond);

}  // namespace
