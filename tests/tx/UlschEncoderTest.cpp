// UL-SCH data encoding (TS 36.212 5.2.2): the E_r rule, the stages of the chain for one and
// for several code blocks, a known answer for a small block, and refused arguments.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "tx/Crc.h"
#include "tx/UlschEncoder.h"

namespace brannoc::tx {
namespace {

TEST(RateMatchedLengths, SplitsGOverTheBlocksInWholeSymbols) {
  struct Case {
    std::uint32_t G, Qm, C;
    std::vector<std::uint32_t> E;
  };
  const Case cases[] = {
      {1200, 2, 1, {1200}},
      {1200, 4, 3, {400, 400, 400}},
      // G' = 301, gamma = 1: the last block gets the extra symbol.
      {1806, 6, 3, {600, 600, 606}},
      // G' = 10, C = 4, gamma = 2: blocks 0, 1 get 2 symbols, blocks 2, 3 get 3.
      {20, 2, 4, {4, 4, 6, 6}},
      // Fewer symbols than blocks: the first blocks get nothing.
      {4, 2, 3, {0, 2, 2}},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(rateMatchedLengths(c.G, c.Qm, c.C), c.E) << c.G << " " << c.Qm << " " << c.C;
  }
  EXPECT_EQ(rateMatchedLengths(1200, 2, 2, 2), (std::vector<std::uint32_t>{600, 600}));
  EXPECT_EQ(rateMatchedLengths(1201, 2, 1), std::vector<std::uint32_t>{});
  EXPECT_EQ(rateMatchedLengths(1200, 0, 1), std::vector<std::uint32_t>{});
  EXPECT_EQ(rateMatchedLengths(1200, 2, 0), std::vector<std::uint32_t>{});
}

Bits pseudoRandomBits(std::uint32_t length) {
  Bits bits(length);
  std::uint32_t s = 12345;
  for (auto& bit : bits) {
    s = s * 1103515245u + 12345u;
    bit = (s >> 16) & 1u;
  }
  return bits;
}

TEST(UlschEncoder, KnownAnswerForOneFortyBitBlock) {
  // 16 data bits + CRC24A fill a 40-bit block; G = 132 takes each real bit of the circular
  // buffer once, rv 0 from k0 = 4 and rv 2 from k0 = 100.
  UlschEncoding out;
  ASSERT_TRUE(encodeUlsch(pseudoRandomBits(16), 132, 2, 0, out));
  std::string f;
  for (auto bit : out.f) f += static_cast<char>('0' + bit);
  EXPECT_EQ(f,
            "110101100101110100001111010011100100001110100001001001010100101000110010101110"
            "010110110110101101100001100101000010011010010011101101");
  ASSERT_TRUE(encodeUlsch(pseudoRandomBits(16), 132, 2, 2, out));
  f.clear();
  for (auto bit : out.f) f += static_cast<char>('0' + bit);
  EXPECT_EQ(f,
            "110010101110010110110110101101100001100101000010011010010011101101110101100101"
            "110100001111010011100100001110100001001001010100101000");
}

TEST(UlschEncoder, StagesOfATwoBlockTransportBlockAgree) {
  // 6121 bits: blocks of 3072 (15 fillers) and 3136 bits; G = 20000 with 16QAM.
  const Bits tb = pseudoRandomBits(6121);
  UlschEncoding out;
  ASSERT_TRUE(encodeUlsch(tb, 20000, 4, 1, out));
  EXPECT_EQ(out.segmentation.C, 2u);
  EXPECT_EQ(out.segmentation.F, 15u);
  EXPECT_EQ(out.b, attachCrc(tb, CrcType::Crc24A));
  EXPECT_EQ(out.E, (std::vector<std::uint32_t>{10000, 10000}));
  ASSERT_EQ(out.c.size(), 2u);
  ASSERT_EQ(out.d.size(), 2u);
  ASSERT_EQ(out.e.size(), 2u);
  Bits joined;
  for (std::uint32_t r = 0; r < 2; ++r) {
    EXPECT_EQ(out.c[r].size(), codeBlockSize(out.segmentation, r));
    EXPECT_EQ(out.d[r].d0.size(), out.c[r].size() + 4);
    EXPECT_EQ(out.e[r].size(), out.E[r]);
    joined.insert(joined.end(), out.e[r].begin(), out.e[r].end());
  }
  EXPECT_EQ(out.f, joined);
}

TEST(UlschEncoder, RefusesInvalidArguments) {
  UlschEncoding out;
  EXPECT_FALSE(encodeUlsch(Bits(16, 0), 132, 2, 4, out));  // rv above 3
  EXPECT_FALSE(encodeUlsch(Bits(16, 0), 133, 2, 0, out));  // G not whole symbols
  EXPECT_FALSE(encodeUlsch(Bits(16, 0), 132, 0, 0, out));  // no modulation order
  EXPECT_FALSE(encodeUlsch(Bits(16, kNullBit), 132, 2, 0, out));  // not bits
  EXPECT_TRUE(out.f.empty() && out.c.empty() && out.E.empty());
}

}  // namespace
}  // namespace brannoc::tx
