// Turbo-decoder model round trips: the transmitter's codewords of every block size of
// TS 36.212 Table 5.1.3-3 decoded without noise for every number of processing units and
// every algorithm, error correction on noisy blocks, saturation of the soft values, and a
// fingerprint of many noisy decodes that must be the same on every build.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <memory>
#include <vector>

#include "CorvaneTestSupport.h"
#include "tx/QppInterleaver.h"

namespace corvane::test {
namespace {

constexpr std::int32_t kNoiseFreeAmplitude = 64;  // 2.0 in 8:5

std::vector<std::int32_t> noiseFree(const brannoc::tx::Bits& bits) {
  std::vector<std::int32_t> soft(bits.size());
  std::transform(bits.begin(), bits.end(), soft.begin(), [](std::uint8_t b) {
    return b != 0 ? kNoiseFreeAmplitude : -kNoiseFreeAmplitude;
  });
  return soft;
}

SoftStreams noiseFreeStreams(const brannoc::tx::TurboCodeword& d) {
  return {noiseFree(d.d0), noiseFree(d.d1), noiseFree(d.d2)};
}

std::size_t bitErrors(const std::vector<std::uint8_t>& a, const std::vector<std::uint8_t>& b) {
  std::size_t errors = 0;
  for (std::size_t k = 0; k < a.size(); ++k) errors += a[k] != b[k] ? 1 : 0;
  return errors;
}

TEST(TurboDecoderRoundTrip, EveryBlockSizeEveryUnitCountEveryAlgorithmWithoutNoise) {
  std::vector<std::unique_ptr<Model>> models;
  for (std::uint32_t algorithm : {0u, 1u, 2u}) {
    for (std::uint32_t P : {1u, 2u, 4u, 8u}) {
      models.push_back(std::make_unique<Model>(P, algorithm));
      ASSERT_NE(models.back()->get(), nullptr);
    }
  }
  SplitMix64 rng(36212);
  std::vector<std::uint8_t> bits;
  for (const brannoc::tx::QppParameters& row : brannoc::tx::qppTable()) {
    const std::vector<std::uint8_t> c = randomBits(rng, row.K);
    const SoftStreams streams = noiseFreeStreams(encode(c));
    for (std::size_t m = 0; m < models.size(); ++m) {
      // Two iterations: the second decoder's extrinsic values feed the first once.
      ASSERT_EQ(decodeStreams(*models[m], streams, 2, bits), VEXLON_IP_CORVANE_OK);
      ASSERT_EQ(bits, c) << "K " << row.K << ", algorithm " << m / 4 << ", model " << m;
    }
  }
}

TEST(TurboDecoderRoundTrip, NoisyBlocksAreCorrectedByEveryAlgorithm) {
  // About 2 dB Eb/N0: many systematic values have the wrong sign, all are corrected. With
  // mean 20 and standard deviation 15, a soft value y is the LLR 2 * 20 * y / 15^2, about 6
  // steps per natural-log unit.
  SplitMix64 rng(5132);
  const std::vector<std::uint8_t> c = randomBits(rng, 2048);
  const SoftStreams streams = noisyStreams(encode(c), rng, 20, 26);
  std::vector<std::uint8_t> hardSystematic(c.size());
  for (std::size_t k = 0; k < c.size(); ++k) hardSystematic[k] = streams.d0[k] >= 0 ? 1 : 0;
  ASSERT_GT(bitErrors(hardSystematic, c), 100u);
  std::vector<std::uint8_t> bits;
  for (std::uint32_t algorithm : {0u, 1u, 2u}) {
    for (std::uint32_t P : {1u, 8u}) {
      vexlon_ip_corvane_generics generics = Model::generics(P, algorithm);
      generics.steps_per_unit = 6;
      Model model(generics);
      ASSERT_EQ(decodeStreams(model, streams, 6, bits), VEXLON_IP_CORVANE_OK);
      EXPECT_EQ(bitErrors(bits, c), 0u) << "algorithm " << algorithm << ", P " << P;
    }
  }
}

TEST(TurboDecoderRoundTrip, SoftValuesBeyondEightBitsAreSaturated) {
  SplitMix64 rng(77);
  const std::vector<std::uint8_t> c = randomBits(rng, 512);
  const SoftStreams streams = noisyStreams(encode(c), rng, 14, 30);
  SoftStreams widened = streams;
  for (auto* stream : {&widened.d0, &widened.d1, &widened.d2}) {
    for (std::int32_t& v : *stream) v = v >= 127 ? v + 100000 : (v <= -128 ? v - 100000 : v);
  }
  Model model(2, 1);
  std::vector<std::uint8_t> expected, bits;
  ASSERT_EQ(decodeStreams(model, streams, 4, expected), VEXLON_IP_CORVANE_OK);
  ASSERT_EQ(decodeStreams(model, widened, 4, bits), VEXLON_IP_CORVANE_OK);
  EXPECT_EQ(bits, expected);
}

TEST(TurboDecoderRoundTrip, AStateGivesTheSameBitsOnEveryCall) {
  // Nothing of one block (window boundary metrics, a priori values) leaks into the next.
  SplitMix64 rng(4);
  const std::vector<std::uint8_t> c = randomBits(rng, 1024);
  const SoftStreams first = noisyStreams(encode(c), rng, 12, 28);
  const SoftStreams other = noisyStreams(encode(randomBits(rng, 6144)), rng, 12, 28);
  Model reused(8, 2);
  Model fresh(8, 2);
  std::vector<std::uint8_t> expected, bits;
  ASSERT_EQ(decodeStreams(fresh, first, 3, expected), VEXLON_IP_CORVANE_OK);
  ASSERT_EQ(decodeStreams(reused, other, 3, bits), VEXLON_IP_CORVANE_OK);
  ASSERT_EQ(decodeStreams(reused, first, 3, bits), VEXLON_IP_CORVANE_OK);
  EXPECT_EQ(bits, expected);
}

// FNV-1a over the decisions of noisy blocks of several sizes, noise levels, unit counts,
// iteration counts and all three algorithms. Every operation of the decoder is integer,
// so the 32-bit and 64-bit builds must both give the recorded value.
TEST(TurboDecoderReproducibility, DecisionsOfNoisyBlocksHashToTheRecordedValue) {
  SplitMix64 rng(20261206);
  std::uint64_t hash = 0xCBF29CE484222325ull;
  std::size_t errors = 0;
  std::size_t decided = 0;
  std::vector<std::uint8_t> bits;
  for (std::uint32_t algorithm : {0u, 1u, 2u}) {
    for (std::uint32_t P : {1u, 2u, 8u}) {
      // The value was recorded with the correction table of 8 steps per unit.
      vexlon_ip_corvane_generics generics = Model::generics(P, algorithm);
      generics.steps_per_unit = 8;
      Model model(generics);
      for (std::uint32_t K : {40u, 208u, 1056u, 3200u}) {
        for (std::int64_t spread : {18, 22, 26}) {
          const std::vector<std::uint8_t> c = randomBits(rng, K);
          const SoftStreams streams = noisyStreams(encode(c), rng, 14, spread);
          const std::uint32_t iterations = 1 + static_cast<std::uint32_t>(rng.next() % 6);
          ASSERT_EQ(decodeStreams(model, streams, iterations, bits), VEXLON_IP_CORVANE_OK);
          for (std::uint8_t bit : bits) hash = (hash ^ bit) * 0x100000001B3ull;
          errors += bitErrors(bits, c);
          decided += bits.size();
        }
      }
    }
  }
  // Some blocks keep errors, so the hash depends on the soft arithmetic, not only on c.
  EXPECT_GT(errors, 0u);
  EXPECT_LT(errors, decided / 10);
  EXPECT_EQ(hash, 0x2251C1167261C7CCull) << std::hex << hash << std::dec << ", errors " << errors;
}

}  // namespace
}  // namespace corvane::test
