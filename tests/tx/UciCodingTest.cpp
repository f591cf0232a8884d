// Control information coding: the (32, O) and (20, A) block codes against the basis tables,
// the tail-biting convolutional code and its rate matching, CQI on PUSCH, the HARQ-ACK/RI
// repetition and simplex codes with their placeholders, and PUCCH coding.
#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "tx/ConvolutionalCode.h"
#include "tx/PucchEncoder.h"
#include "tx/ReedMullerCode.h"
#include "tx/SubBlockInterleaver.h"
#include "tx/UciPuschEncoder.h"
#include "tx/UplinkTypes.h"

namespace brannoc::tx {
namespace {

constexpr std::uint8_t P = kPlaceholderBit;

// Basis columns read from the project's table file: basis[n][i] = M(i, n).
std::vector<Bits> readBasis(const char* name) {
  const auto path = std::filesystem::path(__FILE__).parent_path() / "../../tables" / name;
  std::ifstream file(path);
  std::string line;
  std::getline(file, line);  // header
  std::vector<Bits> columns;
  while (std::getline(file, line)) {
    std::istringstream cells(line);
    std::string cell;
    std::getline(cells, cell, ',');  // row index
    for (std::size_t n = 0; std::getline(cells, cell, ','); ++n) {
      if (columns.size() <= n) columns.emplace_back();
      columns[n].push_back(static_cast<std::uint8_t>(std::stoi(cell)));
    }
  }
  return columns;
}

Bits unitMessage(std::size_t length, std::size_t n) {
  Bits message(length, 0);
  message[n] = 1;
  return message;
}

Bits bitsOf(std::uint32_t value, std::uint32_t length) {  // bit n of value at index n
  Bits bits(length);
  for (std::uint32_t n = 0; n < length; ++n) bits[n] = (value >> n) & 1u;
  return bits;
}

TEST(BlockCodes, SingleBitMessagesGiveTheBasisColumns) {
  struct Case {
    const char* table;
    std::size_t maxBits;
    Bits (*encode)(std::span<const std::uint8_t>);
  } cases[] = {{"rm_32_o_basis.csv", kRm32MaxBits, encodeRm32},
               {"rm_20_a_basis.csv", kRm20MaxBits, encodeRm20}};
  for (const Case& c : cases) {
    const std::vector<Bits> basis = readBasis(c.table);
    ASSERT_EQ(basis.size(), c.maxBits) << c.table;
    for (std::size_t length = 1; length <= c.maxBits; ++length) {
      for (std::size_t n = 0; n < length; ++n) {
        EXPECT_EQ(c.encode(unitMessage(length, n)), basis[n]) << c.table << " n=" << n;
      }
    }
    EXPECT_TRUE(c.encode(Bits(c.maxBits + 1, 0)).empty()) << c.table << " accepts too many bits";
  }
}

TEST(BlockCodes, MinimumDistanceOfTheLongestMessages) {
  // From the tables' check list: (32, 11) has distance 10, (20, 13) distance 4. A wrong
  // column order or a bit taken from the wrong end would change the code.
  struct Case {
    std::uint32_t bits;
    Bits (*encode)(std::span<const std::uint8_t>);
    std::uint32_t distance;
  } cases[] = {{11, encodeRm32, 10}, {13, encodeRm20, 4}, {10, encodeRm20, 6}};
  for (const Case& c : cases) {
    std::uint32_t best = 1000;
    for (std::uint32_t m = 1; m < (1u << c.bits); ++m) {
      std::uint32_t weight = 0;
      for (std::uint8_t b : c.encode(bitsOf(m, c.bits))) weight += b;
      best = std::min(best, weight);
    }
    EXPECT_EQ(best, c.distance) << c.bits << " bits";
  }
}

TEST(TailBiting, RegisterStartsWithTheLastSixBits) {
  // A single 1 in the last position: the register holds it from the start, so the impulse
  // response of each generator wraps round to the beginning of the block. Taps (delay of
  // each 1 in the generator): G0 = 133: 0,2,3,5,6; G1 = 171: 0,1,2,3,6; G2 = 165: 0,1,2,4,6.
  const std::size_t K = 12;
  Bits c(K, 0);
  c[K - 1] = 1;
  const ConvolutionalStreams d = encodeTailBiting(c);
  const std::vector<std::vector<std::size_t>> ones = {
      {11, 1, 2, 4, 5}, {11, 0, 1, 2, 5}, {11, 0, 1, 3, 5}};
  for (std::size_t i = 0; i < 3; ++i) {
    Bits expected(K, 0);
    for (std::size_t k : ones[i]) expected[k] = 1;
    EXPECT_EQ(d[i], expected) << "stream d" << i;
  }
}

TEST(TailBiting, RotatingTheInputRotatesEveryStream) {
  Bits c = bitsOf(0xB5A3C2D1u, 32);
  c.resize(40, 1);
  const ConvolutionalStreams d = encodeTailBiting(c);
  Bits rotated(c.begin() + 7, c.end());
  rotated.insert(rotated.end(), c.begin(), c.begin() + 7);
  const ConvolutionalStreams dRotated = encodeTailBiting(rotated);
  for (std::size_t i = 0; i < 3; ++i) {
    Bits expected(d[i].begin() + 7, d[i].end());
    expected.insert(expected.end(), d[i].begin(), d[i].begin() + 7);
    EXPECT_EQ(dRotated[i], expected) << "stream d" << i;
  }
}

TEST(ConvolutionalRateMatching, CollectsTheThreeInterleavedStreamsCircularly) {
  for (std::size_t D : {32u, 20u, 45u}) {
    ConvolutionalStreams d;
    for (std::size_t i = 0; i < 3; ++i) {
      for (std::size_t k = 0; k < D; ++k) d[i].push_back(((k * 7 + i * 3) % 5) < 2 ? 1 : 0);
    }
    const std::uint32_t E = static_cast<std::uint32_t>(3 * D * 2 + 5);
    const Bits e = rateMatchConvolutional(d, E);
    ASSERT_EQ(e.size(), E);
    for (std::size_t k = 0; k + 3 * D < E; ++k) {
      ASSERT_EQ(e[k], e[k + 3 * D]) << "D=" << D << " period broken at " << k;
    }
    for (std::size_t i = 0; i < 3; ++i) {  // each stream's bits, dummies dropped, in turn
      Bits expected;
      for (std::uint8_t v : subBlockInterleave(d[i], SubBlockPattern::Convolutional)) {
        if (v != kNullBit) expected.push_back(v);
      }
      EXPECT_EQ(Bits(e.begin() + i * D, e.begin() + (i + 1) * D), expected) << "D=" << D;
    }
  }
  // With D = 32 there are no dummies: the first bits follow the column pattern 1, 17, 9, 25.
  ConvolutionalStreams d;
  for (Bits& stream : d) stream.assign(32, 0);
  d[0][17] = 1;
  d[1][1] = 1;
  const Bits e = rateMatchConvolutional(d, 96);
  EXPECT_EQ(e[1], 1);
  EXPECT_EQ(e[32], 1);
  EXPECT_EQ(std::count(e.begin(), e.end(), 1), 2);
}

TEST(CqiOnPusch, BlockCodeUpToElevenBitsConvolutionalBeyond) {
  const Bits eleven = bitsOf(0x5A3, 11);
  const Bits b = encodeRm32(eleven);
  const Bits q = encodeCqiPusch(eleven, 70);
  ASSERT_EQ(q.size(), 70u);
  for (std::size_t i = 0; i < q.size(); ++i) EXPECT_EQ(q[i], b[i % 32]) << i;

  const Bits twelve = bitsOf(0xA5C, 12);
  const Bits qConv = encodeCqiPusch(twelve, 70);
  ASSERT_EQ(qConv.size(), 70u);
  // 12 bits + 8 CRC bits make 60 coded bits before the rate matcher repeats them.
  EXPECT_EQ(Bits(qConv.begin(), qConv.begin() + 10), Bits(qConv.begin() + 60, qConv.end()));
  EXPECT_NE(Bits(qConv.begin(), qConv.begin() + 32), Bits(qConv.begin() + 32, qConv.begin() + 64));
  EXPECT_TRUE(encodeCqiPusch({}, 70).empty());
}

TEST(AckRiOnPusch, RepetitionAndSimplexPatterns) {
  struct Case {
    Bits o;
    std::uint32_t Qm;
    std::uint32_t Q;
    Bits expected;
  } cases[] = {
      {{1}, 2, 6, {1, 1, 1, 1, 1, 1}},
      {{0}, 4, 8, {0, 0, P, P, 0, 0, P, P}},
      {{1}, 6, 6, {1, 1, P, P, P, P}},
      {{1, 0}, 2, 8, {1, 0, 1, 1, 0, 1, 1, 0}},  // o2 = 1; last block cut short
      {{1, 1}, 4, 12, {1, 1, P, P, 0, 1, P, P, 1, 0, P, P}},
      {{0, 1}, 6, 24, {0, 1, P, P, P, P, 1, 0, P, P, P, P, 1, 1, P, P, P, P,
                       0, 1, P, P, P, P}},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(encodeAckRiPusch(c.o, c.Qm, c.Q), c.expected)
        << c.o.size() << " bits, Qm " << c.Qm << ", Q " << c.Q;
  }
  EXPECT_TRUE(encodeAckRiPusch(Bits{1, 0, 1}, 2, 6).empty());
  EXPECT_TRUE(encodeAckRiPusch(Bits{1}, 3, 6).empty());
}

TEST(Pucch, CodingByCyclicPrefix) {
  const Bits cqi13 = bitsOf(0x1ACE, 13);
  const Bits cqi11 = bitsOf(0x5A3, 11);
  const Bits ack2 = {1, 0};
  Bits normal = encodeRm20(cqi13);
  normal.insert(normal.end(), ack2.begin(), ack2.end());
  Bits joint = cqi11;
  joint.insert(joint.end(), ack2.begin(), ack2.end());
  struct Case {
    const char* name;
    Bits cqi;
    Bits ack;
    CyclicPrefix cp;
    Bits expected;  // empty: refused
  } cases[] = {
      {"normal CP, ACK after the codeword", cqi13, ack2, CyclicPrefix::Normal, normal},
      {"extended CP, joint coding", cqi11, ack2, CyclicPrefix::Extended, encodeRm20(joint)},
      {"extended CP without ACK", cqi13, {}, CyclicPrefix::Extended, encodeRm20(cqi13)},
      {"ACK alone", {}, {0, 1}, CyclicPrefix::Extended, {0, 1}},
      {"14 CQI bits", bitsOf(1, 14), {}, CyclicPrefix::Normal, {}},
      {"12 CQI + 2 ACK bits, extended CP", bitsOf(1, 12), ack2, CyclicPrefix::Extended, {}},
      {"three ACK bits", {}, {1, 1, 1}, CyclicPrefix::Normal, {}},
      {"nothing", {}, {}, CyclicPrefix::Normal, {}},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(encodePucch(c.cqi, c.ack, c.cp), c.expected) << c.name;
  }
}

}  // namespace
}  // namespace brannoc::tx
