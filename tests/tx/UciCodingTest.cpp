// Control information coding: the (32, O) and (20, A) block codes against the basis tables,
// the tail-biting convolutional code, CQI on PUSCH, the HARQ-ACK/RI repetition and simplex
// codes with their placeholders, and PUCCH payloads refused.
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

Bits bitsOf(std::uint32_t value, std::uint32_t length) {  // bit n of value at index n
  Bits bits(length);
  for (std::uint32_t n = 0; n < length; ++n) bits[n] = (value >> n) & 1u;
  return bits;
}

// The generated tables the encoders use against the project's table files. The codewords of
// every message of every size are compared with the decoder's encoder in the decoder's tests.
TEST(BlockCodes, SingleBitMessagesGiveTheBasisColumns) {
  const struct {
    const char* code;
    std::uint32_t maxBits;
    Bits (*encode)(std::span<const std::uint8_t>);
    std::vector<Bits> basis;
  } cases[] = {{"(32, O)", kRm32MaxBits, encodeRm32, readBasis("rm_32_o_basis.csv")},
               {"(20, A)", kRm20MaxBits, encodeRm20, readBasis("rm_20_a_basis.csv")}};
  for (const auto& c : cases) {
    ASSERT_EQ(c.basis.size(), c.maxBits) << c.code;
    for (std::uint32_t n = 0; n < c.maxBits; ++n) {
      EXPECT_EQ(c.encode(bitsOf(1u << n, c.maxBits)), c.basis[n]) << c.code << " n=" << n;
    }
    EXPECT_TRUE(c.encode(Bits(c.maxBits + 1, 0)).empty()) << c.code << " accepts too many bits";
  }
}

TEST(TailBiting, RegisterStartsWithTheLastSixBits) {
  // An input 1 at position p sets output k = (p + delay) mod K for each delay (tap) of the
  // generator: G0 = 133: 0,2,3,5,6; G1 = 171: 0,1,2,3,6; G2 = 165: 0,1,2,4,6. A 1 in the
  // last position sits in the register from the start, so its response wraps round to the
  // beginning of the block; two 1s give the sum of their responses.
  const std::size_t K = 12;
  const std::size_t taps[3][5] = {{0, 2, 3, 5, 6}, {0, 1, 2, 3, 6}, {0, 1, 2, 4, 6}};
  for (const std::vector<std::size_t>& ones : {std::vector<std::size_t>{11}, {11, 8}}) {
    Bits c(K, 0);
    for (std::size_t p : ones) c[p] = 1;
    const ConvolutionalStreams d = encodeTailBiting(c);
    for (std::size_t i = 0; i < 3; ++i) {
      Bits expected(K, 0);
      for (std::size_t p : ones) {
        for (std::size_t t : taps[i]) expected[(p + t) % K] ^= 1;
      }
      EXPECT_EQ(d[i], expected) << "stream d" << i << " with " << ones.size() << " ones";
    }
  }
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
  const struct {
    Bits o;
    std::uint32_t Qm, Q;
    Bits expected;
  } cases[] = {
      {{1}, 2, 6, {1, 1, 1, 1, 1, 1}},
      {{0}, 4, 8, {0, 0, P, P, 0, 0, P, P}},
      {{1}, 6, 6, {1, 1, P, P, P, P}},
      {{1, 0}, 2, 8, {1, 0, 1, 1, 0, 1, 1, 0}},  // o2 = 1; last block cut short
      {{1, 1}, 4, 12, {1, 1, P, P, 0, 1, P, P, 1, 0, P, P}},
      {{0, 1}, 6, 24, {0, 1, P, P, P, P, 1, 0, P, P, P, P, 1, 1, P, P, P, P, 0, 1, P, P, P, P}},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(encodeAckRiPusch(c.o, c.Qm, c.Q), c.expected)
        << c.o.size() << " bits, Qm " << c.Qm << ", Q " << c.Q;
  }
  EXPECT_TRUE(encodeAckRiPusch(Bits{1, 0, 1}, 2, 6).empty());
  EXPECT_TRUE(encodeAckRiPusch(Bits{1}, 3, 6).empty());
}

// Accepted payloads are decoded back by the decoder's control-channel tests.
TEST(Pucch, RefusesPayloadsTheFormatCannotCarry) {
  EXPECT_TRUE(encodePucch(bitsOf(1, 14), {}, CyclicPrefix::Normal).empty()) << "14 CQI bits";
  EXPECT_TRUE(encodePucch(bitsOf(1, 12), Bits{1, 0}, CyclicPrefix::Extended).empty())
      << "12 CQI + 2 ACK bits, extended CP";
  EXPECT_TRUE(encodePucch({}, Bits{1, 1, 1}, CyclicPrefix::Normal).empty()) << "three ACK bits";
}

}  // namespace
}  // namespace brannoc::tx
