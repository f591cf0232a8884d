// Decode time of the CQI block codes (13-bit (20,A) on PUCCH, 11-bit (32,O) on PUSCH) and of
// the tail-biting Viterbi decoder (135-bit block, traceback 96, no traces).
#include <benchmark/benchmark.h>

#include <cstdint>
#include <fstream>
#include <random>
#include <vector>

#include "KLTE_CQI_Decoding.h"
#include "KLTE_DecoderViterbi.h"
#include "tx/ConvolutionalCode.h"
#include "tx/ReedMullerCode.h"

namespace {

using brannoc::KLTE_CQI_Decoding;
using brannoc::KLTE_DecoderViterbi;

std::vector<std::uint8_t> randomBits(std::size_t n, std::mt19937& random) {
  std::vector<std::uint8_t> bits(n);
  for (std::uint8_t& bit : bits) {
    bit = static_cast<std::uint8_t>(random() & 1U);
  }
  return bits;
}

// Soft values of a transmitted codeword with some noise: +-40 with offsets of up to 30.
std::vector<std::int32_t> noisySoft(const std::vector<std::uint8_t>& code, std::mt19937& random) {
  std::uniform_int_distribution<std::int32_t> noise(-30, 30);
  std::vector<std::int32_t> soft(code.size());
  for (std::size_t j = 0; j < code.size(); ++j) {
    soft[j] = (code[j] ? 40 : -40) + noise(random);
  }
  return soft;
}

void cqiDecode(benchmark::State& state, std::int32_t type, std::uint32_t numBits) {
  std::mt19937 random(11);
  const std::vector<std::uint8_t> message = randomBits(numBits, random);
  const std::vector<std::uint8_t> code = type == KLTE_CQI_Decoding::CQI_TYPE_PUCCH
                                             ? brannoc::tx::encodeRm20(message)
                                             : brannoc::tx::encodeRm32(message);
  const std::vector<std::int32_t> soft = noisySoft(code, random);
  KLTE_CQI_Decoding decoder(type, numBits);
  decoder.setNumPU(2);
  std::vector<std::uint8_t> decoded(numBits);
  for (auto _ : state) {
    benchmark::DoNotOptimize(decoder.decode(soft, decoded));
    benchmark::DoNotOptimize(decoded.data());
  }
}

void BM_CqiDecodePucch13(benchmark::State& state) {
  cqiDecode(state, KLTE_CQI_Decoding::CQI_TYPE_PUCCH, 13);
}
BENCHMARK(BM_CqiDecodePucch13);

void BM_CqiDecodePusch11(benchmark::State& state) {
  cqiDecode(state, KLTE_CQI_Decoding::CQI_TYPE_PUSCH, 11);
}
BENCHMARK(BM_CqiDecodePusch11);

void BM_ViterbiDecode135(benchmark::State& state) {
  std::mt19937 random(13);
  const std::vector<std::uint8_t> info = randomBits(135, random);
  const brannoc::tx::ConvolutionalStreams d = brannoc::tx::encodeTailBiting(info);
  std::vector<std::int32_t> q[3];
  std::uniform_int_distribution<std::int32_t> noise(0, 5);
  for (std::size_t k = 0; k < 3; ++k) {
    for (std::uint8_t bit : d[k]) {
      q[k].push_back(bit ? 15 - noise(random) : noise(random));
    }
  }
  const std::vector<std::int32_t> e(info.size(), 0);
  KLTE_DecoderViterbi decoder;
  std::vector<std::uint8_t> decoded(info.size());
  KLTE_DecoderViterbi::ExtendedRxData extended;
  std::ofstream closed;
  for (auto _ : state) {
    benchmark::DoNotOptimize(decoder.decode(q[0], q[1], q[2], e, e, e, decoded, closed, closed,
                                            closed, closed, false, extended));
    benchmark::DoNotOptimize(decoded.data());
  }
}
BENCHMARK(BM_ViterbiDecode135);

}  // namespace
