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
  // Label with b(i) as the most significant bit; I and Q before normalisation by sqrt(scale).
  const auto qpsk = Constellation::Qpsk, qam16 = Constellation::Qam16;
  const auto qam64 = Constellation::Qam64, pucch = Constellation::PucchQpsk;
  const struct {
    Constellation constellation;
    std::uint32_t label;
    double re, im, scale;
  } cases[] = {
      {qpsk, 0b01, 1, -1, 2},        {qpsk, 0b10, -1, 1, 2},         {qam16, 0b0001, 1, 3, 10},
      {qam16, 0b0010, 3, 1, 10},     {qam16, 0b0111, 3, -3, 10},     {qam16, 0b1101, -1, -3, 10},
      {qam64, 0b000000, 3, 3, 42},   {qam64, 0b000101, 3, 7, 42},    {qam64, 0b001010, 7, 3, 42},
      {qam64, 0b100111, -1, 7, 42},  {qam64, 0b111111, -7, -7, 42},  {pucch, 0b01, 0, -1, 1},
      {pucch, 0b10, 0, 1, 1},        {pucch, 0b11, -1, 0, 1},
      {Constellation::PucchBpsk, 1, -1, 0, 1},
  };
  for (const auto& c : cases) {
    const Symbol s = constellationPoint(c.constellation, c.label);
    EXPECT_NEAR(s.re, c.re / std::sqrt(c.scale), 1e-15) << c.label;
    EXPECT_NEAR(s.im, c.im / std::sqrt(c.scale), 1e-15) << c.label;
  }
}

TEST(Modulation, UnitEnergyAndGrayNeighbours) {
  // Nearest points lie 2 / sqrt(scale) apart and must differ in exactly one bit.
  for (auto [c, scale] : {std::pair{Constellation::Qpsk, 2.0}, {Constellation::Qam16, 10.0},
                          {Constellation::Qam64, 42.0}}) {
    const std::uint32_t points = 1u << bitsPerSymbol(c);
    const double dmin = 2 / std::sqrt(scale);
    double energy = 0;
    for (std::uint32_t a = 0; a < points; ++a) {
      const Symbol s = constellationPoint(c, a);
      energy += s.re * s.re + s.im * s.im;
      for (std::uint32_t b = 0; b < a; ++b) {
        const Symbol t = constellationPoint(c, b);
        const double distance = std::hypot(s.re - t.re, s.im - t.im);
        EXPECT_GT(distance, dmin * 0.9999) << "points " << a << " and " << b << " too close";
        EXPECT_TRUE(distance > dmin * 1.0001 || std::popcount(a ^ b) == 1)
            << "neighbours " << a << " and " << b << " differ in more than one bit";
      }
    }
    EXPECT_NEAR(energy / points, 1.0, 1e-12);
  }
}

TEST(NoiseSource, LogAndExpMatchTheLibraryClosely) {
  for (double x : {1e-300, 3e-17, 0.1, 0.70710678, 0.9999999, 1.0, 1.5, 1e10}) {
    EXPECT_NEAR(deterministicLog(x), std::log(x), 4e-16 * std::fabs(std::log(x)) + 1e-300) << x;
  }
  EXPECT_NEAR(deterministicLog(4.9e-324), std::log(4.9e-324), 1e-12);  // subnormal
  for (double x : {-690.0, -2.302585, -0.3, 0.0, 0.2, 6.9, 690.0}) {
    EXPECT_NEAR(deterministicExp(x) / std::exp(x), 1.0, 1e-15) << x;
  }
}

TEST(SoftChannel, QuantisationTo8Point5) {
  const struct {
    double llr, scale;
    std::int32_t raw;
  } cases[] = {{-1.0, 1.0, -32},   {0.5 / 32, 1.0, 1},  {-0.5 / 32, 1.0, -1}, {0.49 / 32, 1.0, 0},
               {3.96875, 1.0, 127}, {4.0, 1.0, 127},    {-4.0, 1.0, -128},    {-1e9, 1.0, -128},
               {1.0, 0.25, 8},      {2.5, 0.5, 40}};
  for (const auto& c : cases) {
    EXPECT_EQ(quantizeLlr(c.llr, c.scale), c.raw) << c.llr << " x " << c.scale;
  }
  EXPECT_NEAR(noiseVarianceFromEsN0Db(10.0), 0.1, 1e-16);
  EXPECT_NEAR(noiseVarianceFromEsN0Db(-3.0), std::pow(10.0, 0.3), 1e-14);
}

// Ideal values (+-A, 0 for a placeholder) are checked through the PUSCH transmitter.
TEST(SoftChannel, IdealAmplitudeAboveTheFormatIsRefused) {
  ChannelSettings settings;
  settings.idealAmplitude = 128;
  std::vector<std::int32_t> soft{1};
  EXPECT_FALSE(makeSoftValues(Bits{1, 0}, Constellation::Qam16, settings, soft));
  EXPECT_TRUE(soft.empty());
}

Bits patternBits(std::size_t length) {
  Bits bits(length);
  for (std::size_t i = 0; i < length; ++i) bits[i] = ((i * 37 + i / 7) % 11) < 5 ? 1 : 0;
  return bits;
}

ChannelSettings awgn(double esN0Db, double llrScale, std::uint64_t seed = 1) {
  return {ChannelMode::Awgn, 64, esN0Db, seed, llrScale};
}

TEST(SoftChannel, HighSnrSoftValuesFavourTheSentBitsPositiveForOne) {
  const ChannelSettings settings = awgn(30.0, 0.01);
  for (Constellation c : {Constellation::Qpsk, Constellation::Qam16, Constellation::Qam64,
                          Constellation::PucchBpsk, Constellation::PucchQpsk}) {
    Bits bits = patternBits(600);
    bits[6] = kPlaceholderBit;
    std::vector<std::int32_t> soft;
    ASSERT_TRUE(makeSoftValues(bits, c, settings, soft));
    ASSERT_EQ(soft.size(), bits.size());
    for (std::size_t i = 0; i < bits.size(); ++i) {
      const int sign = bits[i] == kPlaceholderBit ? 0 : bits[i] == 1 ? 1 : -1;
      EXPECT_EQ((soft[i] > 0) - (soft[i] < 0), sign)
          << "constellation " << static_cast<int>(c) << " bit " << i << " soft " << soft[i];
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
  const Bits bits = patternBits(3000);
  std::vector<std::int32_t> soft, otherSeed;
  ASSERT_TRUE(makeSoftValues(bits, Constellation::Qam64, awgn(8.5, 0.5, 20240607), soft));
  EXPECT_EQ(fnv1a(soft), 0x7813d97947e34e50ull) << std::hex << fnv1a(soft);
  ASSERT_TRUE(makeSoftValues(bits, Constellation::Qam64, awgn(8.5, 0.5, 20240608), otherSeed));
  EXPECT_NE(soft, otherSeed);
}

TEST(NoiseSource, SeededSamplesAreBitExactOnEveryBuildAndGaussian) {
  // Quantisation could hide a last-bit difference; the samples themselves must not differ.
  GaussianSource source(7);
  std::uint64_t hash = 0xCBF29CE484222325ull;
  const int pairs = 2000;
  double sum = 0, sumSquares = 0, sumProducts = 0;
  for (int n = 0; n < pairs; ++n) {
    const GaussianSource::Pair p = source.nextPair();
    for (double sample : {p.first, p.second, deterministicExp(p.first)}) {
      hash = (hash ^ std::bit_cast<std::uint64_t>(sample)) * 0x100000001B3ull;
    }
    sum += p.first + p.second;
    sumSquares += p.first * p.first + p.second * p.second;
    sumProducts += p.first * p.second;
  }
  EXPECT_EQ(hash, 0xde36ee46d8cfcc4dull) << std::hex << hash;
  EXPECT_NEAR(sum / (2 * pairs), 0.0, 0.05);  // about three standard deviations
  EXPECT_NEAR(sumSquares / (2 * pairs), 1.0, 0.07);
  EXPECT_NEAR(sumProducts / pairs, 0.0, 0.07);
}

}  // namespace
}  // namespace brannoc::tx
