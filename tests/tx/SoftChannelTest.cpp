// Channel model: the Gray mapping of TS 36.211 7.1 and Table 5.4.1-1, the deterministic
// ln/exp and Gaussian source, 8:5 quantisation, ideal and AWGN soft values, and the
// reproducibility of a seeded run (the same hash is asserted in the 32-bit and 64-bit builds).
#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <vector>

#include "tx/Bits.h"
#include "tx/Modulation.h"
#include "tx/NoiseSource.h"
#include "tx/SoftChannel.h"
#include "tx/UplinkTypes.h"

namespace brannoc::tx {
namespace {

TEST(Modulation, ConstellationPointsOfTheStandard) {
  // (label with b(i) as the most significant bit, I and Q before normalisation)
  struct Case {
    Constellation constellation;
    std::uint32_t label;
    double re, im, scale;
  } cases[] = {
      {Constellation::Qpsk, 0b00, 1, 1, 2},        {Constellation::Qpsk, 0b01, 1, -1, 2},
      {Constellation::Qpsk, 0b10, -1, 1, 2},       {Constellation::Qpsk, 0b11, -1, -1, 2},
      {Constellation::Qam16, 0b0000, 1, 1, 10},    {Constellation::Qam16, 0b0001, 1, 3, 10},
      {Constellation::Qam16, 0b0010, 3, 1, 10},    {Constellation::Qam16, 0b0111, 3, -3, 10},
      {Constellation::Qam16, 0b1101, -1, -3, 10},  {Constellation::Qam16, 0b1110, -3, -1, 10},
      {Constellation::Qam64, 0b000000, 3, 3, 42},  {Constellation::Qam64, 0b000001, 3, 1, 42},
      {Constellation::Qam64, 0b000010, 1, 3, 42},  {Constellation::Qam64, 0b000101, 3, 7, 42},
      {Constellation::Qam64, 0b001000, 5, 3, 42},  {Constellation::Qam64, 0b001010, 7, 3, 42},
      {Constellation::Qam64, 0b100111, -1, 7, 42}, {Constellation::Qam64, 0b111111, -7, -7, 42},
      {Constellation::PucchBpsk, 0, 1, 0, 1},      {Constellation::PucchBpsk, 1, -1, 0, 1},
      {Constellation::PucchQpsk, 0b01, 0, -1, 1},  {Constellation::PucchQpsk, 0b10, 0, 1, 1},
      {Constellation::PucchQpsk, 0b11, -1, 0, 1},
  };
  for (const Case& c : cases) {
    const Symbol s = constellationPoint(c.constellation, c.label);
    EXPECT_NEAR(s.re, c.re / std::sqrt(c.scale), 1e-15) << c.label;
    EXPECT_NEAR(s.im, c.im / std::sqrt(c.scale), 1e-15) << c.label;
  }
}

TEST(Modulation, UnitEnergyAndGrayNeighbours) {
  for (Constellation c : {Constellation::Qpsk, Constellation::Qam16, Constellation::Qam64,
                          Constellation::PucchQpsk}) {
    const std::uint32_t points = 1u << bitsPerSymbol(c);
    double energy = 0;
    double dmin = 1e9;
    for (std::uint32_t a = 0; a < points; ++a) {
      const Symbol s = constellationPoint(c, a);
      energy += s.re * s.re + s.im * s.im;
      for (std::uint32_t b = 0; b < a; ++b) {
        const Symbol t = constellationPoint(c, b);
        dmin = std::min(dmin, std::hypot(s.re - t.re, s.im - t.im));
      }
    }
    EXPECT_NEAR(energy / points, 1.0, 1e-12);
    for (std::uint32_t a = 0; a < points; ++a) {
      for (std::uint32_t b = 0; b < a; ++b) {
        const Symbol s = constellationPoint(c, a);
        const Symbol t = constellationPoint(c, b);
        if (std::hypot(s.re - t.re, s.im - t.im) < dmin * 1.0001) {
          EXPECT_EQ(std::popcount(a ^ b), 1) << "neighbours " << a << " and " << b;
        }
      }
    }
  }
}

TEST(NoiseSource, LogAndExpMatchTheLibraryClosely) {
  for (double x : {1e-300, 3e-17, 1e-5, 0.1, 0.5, 0.70710678, 0.9999999, 1.0, 1.5, 2.0, 1e10}) {
    EXPECT_NEAR(deterministicLog(x), std::log(x), 4e-16 * std::fabs(std::log(x)) + 1e-300) << x;
  }
  EXPECT_NEAR(deterministicLog(4.9e-324), std::log(4.9e-324), 1e-12);  // subnormal
  EXPECT_EQ(deterministicLog(1.0), 0.0);
  for (double x : {-690.0, -23.0, -2.302585, -0.3, 0.0, 0.2, 1.0, 6.9, 100.0, 690.0}) {
    EXPECT_NEAR(deterministicExp(x) / std::exp(x), 1.0, 1e-15) << x;
  }
}

TEST(NoiseSource, GaussianMoments) {
  GaussianSource source(12345);
  const int pairs = 20000;
  double sum = 0;
  double sumSquares = 0;
  double sumProducts = 0;
  for (int n = 0; n < pairs; ++n) {
    const GaussianSource::Pair p = source.nextPair();
    sum += p.first + p.second;
    sumSquares += p.first * p.first + p.second * p.second;
    sumProducts += p.first * p.second;
  }
  EXPECT_NEAR(sum / (2 * pairs), 0.0, 0.02);
  EXPECT_NEAR(sumSquares / (2 * pairs), 1.0, 0.03);
  EXPECT_NEAR(sumProducts / pairs, 0.0, 0.03);
}

TEST(SoftChannel, QuantisationTo8Point5) {
  struct Case {
    double llr, scale;
    std::int32_t raw;
  } cases[] = {{1.0, 1.0, 32},       {-1.0, 1.0, -32},   {0.5 / 32, 1.0, 1},
               {-0.5 / 32, 1.0, -1}, {0.49 / 32, 1.0, 0}, {3.96875, 1.0, 127},
               {4.0, 1.0, 127},      {-4.0, 1.0, -128},  {-1e9, 1.0, -128},
               {1.0, 0.25, 8},       {2.5, 0.5, 40}};
  for (const Case& c : cases) {
    EXPECT_EQ(quantizeLlr(c.llr, c.scale), c.raw) << c.llr << " x " << c.scale;
  }
  EXPECT_NEAR(noiseVarianceFromEsN0Db(10.0), 0.1, 1e-16);
  EXPECT_NEAR(noiseVarianceFromEsN0Db(-3.0), std::pow(10.0, 0.3), 1e-14);
}

TEST(SoftChannel, IdealValuesAndPlaceholders) {
  const Bits bits = {1, 0, kPlaceholderBit, 1, 0, 0};
  ChannelSettings settings;
  settings.idealAmplitude = 48;
  std::vector<std::int32_t> soft;
  ASSERT_TRUE(makeSoftValues(bits, Constellation::Qam16, settings, soft));
  EXPECT_EQ(soft, (std::vector<std::int32_t>{48, -48, 0, 48, -48, -48}));
  settings.idealAmplitude = 128;
  EXPECT_FALSE(makeSoftValues(bits, Constellation::Qam16, settings, soft));
  EXPECT_TRUE(soft.empty());
}

Bits patternBits(std::size_t length) {
  Bits bits(length);
  for (std::size_t i = 0; i < length; ++i) bits[i] = ((i * 37 + i / 7) % 11) < 5 ? 1 : 0;
  return bits;
}

TEST(SoftChannel, HighSnrSoftValuesFavourTheSentBitsPositiveForOne) {
  ChannelSettings settings;
  settings.mode = ChannelMode::Awgn;
  settings.esN0Db = 30.0;
  settings.llrScale = 0.01;
  for (Constellation c : {Constellation::Qpsk, Constellation::Qam16, Constellation::Qam64,
                          Constellation::PucchBpsk, Constellation::PucchQpsk}) {
    Bits bits = patternBits(600);
    bits[6] = kPlaceholderBit;
    std::vector<std::int32_t> soft;
    ASSERT_TRUE(makeSoftValues(bits, c, settings, soft));
    ASSERT_EQ(soft.size(), bits.size());
    for (std::size_t i = 0; i < bits.size(); ++i) {
      if (bits[i] == kPlaceholderBit) {
        EXPECT_EQ(soft[i], 0);
      } else {
        EXPECT_EQ(soft[i] > 0, bits[i] == 1) << "constellation " << static_cast<int>(c)
                                             << " bit " << i << " soft " << soft[i];
      }
    }
  }
}

std::uint64_t fnv1a(const std::vector<std::int32_t>& values) {
  std::uint64_t hash = 0xCBF29CE484222325ull;
  for (std::int32_t v : values) {
    for (int byte = 0; byte < 4; ++byte) {
      hash ^= (static_cast<std::uint32_t>(v) >> (8 * byte)) & 0xFFu;
      hash *= 0x100000001B3ull;
    }
  }
  return hash;
}

TEST(SoftChannel, SeededRunIsReproducibleOnEveryBuild) {
  // The recorded hash holds on the 32-bit and the 64-bit build alike.
  ChannelSettings settings;
  settings.mode = ChannelMode::Awgn;
  settings.esN0Db = 8.5;
  settings.seed = 20240607;
  settings.llrScale = 0.5;
  const Bits bits = patternBits(3000);
  std::vector<std::int32_t> soft;
  ASSERT_TRUE(makeSoftValues(bits, Constellation::Qam64, settings, soft));
  std::vector<std::int32_t> again;
  ASSERT_TRUE(makeSoftValues(bits, Constellation::Qam64, settings, again));
  EXPECT_EQ(soft, again);
  EXPECT_EQ(fnv1a(soft), 0x7813d97947e34e50ull) << std::hex << fnv1a(soft);
  settings.seed += 1;
  ASSERT_TRUE(makeSoftValues(bits, Constellation::Qam64, settings, again));
  EXPECT_NE(soft, again);
}

TEST(NoiseSource, SeededSamplesAreBitExactOnEveryBuild) {
  // Quantisation could hide a last-bit difference; the samples themselves must not differ.
  GaussianSource source(7);
  std::uint64_t hash = 0xCBF29CE484222325ull;
  for (int n = 0; n < 2000; ++n) {
    const GaussianSource::Pair p = source.nextPair();
    for (double sample : {p.first, p.second, deterministicExp(p.first)}) {
      hash = (hash ^ std::bit_cast<std::uint64_t>(sample)) * 0x100000001B3ull;
    }
  }
  EXPECT_EQ(hash, 0xde36ee46d8cfcc4dull) << std::hex << hash;
}

}  // namespace
}  // namespace brannoc::tx
