// Sub-block interleaver (TS 36.212 5.1.4.1.1 and 5.1.4.2.1): the column patterns of
// Tables 5.1.4-1 and 5.1.4-2, dummy bits, and the read order of the three turbo streams.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <vector>

#include "tx/SubBlockInterleaver.h"

namespace brannoc::tx {
namespace {

TEST(SubBlockInterleaver, ColumnPatternsAreTheStandardTables) {
  const std::vector<std::uint8_t> turbo{0, 16, 8,  24, 4, 20, 12, 28, 2, 18, 10,
                                        26, 6, 22, 14, 30, 1, 17, 9,  25, 5, 21,
                                        13, 29, 3, 19, 11, 27, 7, 23, 15, 31};
  const std::vector<std::uint8_t> convolutional{1, 17, 9,  25, 5, 21, 13, 29, 3, 19, 11,
                                                27, 7, 23, 15, 31, 0, 16, 8,  24, 4, 20,
                                                12, 28, 2, 18, 10, 26, 6, 22, 14, 30};
  const auto& t = subBlockColumnPattern(SubBlockPattern::Turbo);
  const auto& c = subBlockColumnPattern(SubBlockPattern::Convolutional);
  EXPECT_EQ(std::vector<std::uint8_t>(t.begin(), t.end()), turbo);
  EXPECT_EQ(std::vector<std::uint8_t>(c.begin(), c.end()), convolutional);
}

// D input bits numbered 10, 11, ... so that each output names its source position.
Bits numbered(std::uint32_t D) {
  Bits d(D);
  for (std::uint32_t i = 0; i < D; ++i) d[i] = static_cast<std::uint8_t>(10 + i % 200);
  return d;
}

TEST(SubBlockInterleaver, FortyFourBitsGiveTwoRowsAndTwentyDummies) {
  // K = 40: D = 44, R = 2, Kpi = 64, ND = 20. Output k reads y[P(k/2) + 32(k%2)].
  const Bits d = numbered(44);
  const Bits v = subBlockInterleave(d, SubBlockPattern::Turbo);
  ASSERT_EQ(v.size(), 64u);
  EXPECT_EQ(v[0], kNullBit);   // y0
  EXPECT_EQ(v[1], d[32 - 20]); // y32
  EXPECT_EQ(v[2], kNullBit);   // y16
  EXPECT_EQ(v[3], d[48 - 20]); // y48
  EXPECT_EQ(v[63], d[63 - 20]);
  EXPECT_EQ(std::count(v.begin(), v.end(), kNullBit), 20);
  // The third stream reads one position further, wrapping at Kpi: v2[63] = y0.
  const Bits v2 = subBlockInterleave(d, SubBlockPattern::Turbo, true);
  EXPECT_EQ(v2[0], kNullBit);   // y1
  EXPECT_EQ(v2[1], d[33 - 20]); // y33
  EXPECT_EQ(v2[62], d[32 - 20]); // y(31 + 1)
  EXPECT_EQ(v2[63], kNullBit);  // y64 mod 64 = y0
  EXPECT_EQ(std::count(v2.begin(), v2.end(), kNullBit), 20);
}

TEST(SubBlockInterleaver, EveryInputBitAppearsOnceForAllShapes) {
  for (std::uint32_t D : {1u, 31u, 32u, 33u, 44u, 6148u}) {
    for (auto pattern : {SubBlockPattern::Turbo, SubBlockPattern::Convolutional}) {
      for (bool third : {false, true}) {
        const std::uint32_t R = subBlockRows(D);
        std::vector<std::uint32_t> seen(32 * R, 0);
        for (std::uint32_t k = 0; k < 32 * R; ++k) ++seen[subBlockReadIndex(k, R, pattern, third)];
        EXPECT_TRUE(std::all_of(seen.begin(), seen.end(), [](auto n) { return n == 1; }))
            << D << " " << third;
        const Bits v = subBlockInterleave(Bits(D, 1), pattern, third);
        EXPECT_EQ(v.size(), 32 * R);
        EXPECT_EQ(std::count(v.begin(), v.end(), 1), static_cast<std::ptrdiff_t>(D));
      }
    }
  }
}

TEST(SubBlockInterleaver, ConvolutionalReadsColumnOneFirst) {
  // D = 28 (20 CQI bits + CRC8): R = 1, ND = 4, so v_k = y[P(k)].
  const Bits d = numbered(28);
  const Bits v = subBlockInterleave(d, SubBlockPattern::Convolutional);
  ASSERT_EQ(v.size(), 32u);
  EXPECT_EQ(v[0], kNullBit);    // y1
  EXPECT_EQ(v[1], d[17 - 4]);   // y17
  EXPECT_EQ(v[16], kNullBit);   // y0
  EXPECT_EQ(v[31], d[30 - 4]);  // y30
}

}  // namespace
}  // namespace brannoc::tx
