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

TEST(SubBlockInterleaver, OutputsReadTheWorkedInputPositions) {
  // D = 44 (K = 40): R = 2, Kpi = 64, ND = 20, v_k = y[P(k/2) + 32(k%2)]; the third turbo
  // stream reads one position further, wrapping at Kpi. D = 28 (20 CQI bits + CRC8): R = 1,
  // ND = 4, v_k = y[P(k)] with the convolutional pattern. Positions y < ND are dummies.
  struct Case {
    std::uint32_t D;
    SubBlockPattern pattern;
    bool third;
    std::uint32_t k, y;
  };
  const Case cases[] = {
      {44, SubBlockPattern::Turbo, false, 0, 0},   {44, SubBlockPattern::Turbo, false, 1, 32},
      {44, SubBlockPattern::Turbo, false, 2, 16},  {44, SubBlockPattern::Turbo, false, 3, 48},
      {44, SubBlockPattern::Turbo, false, 63, 63}, {44, SubBlockPattern::Turbo, true, 0, 1},
      {44, SubBlockPattern::Turbo, true, 1, 33},   {44, SubBlockPattern::Turbo, true, 62, 32},
      {44, SubBlockPattern::Turbo, true, 63, 0},
      {28, SubBlockPattern::Convolutional, false, 0, 1},
      {28, SubBlockPattern::Convolutional, false, 1, 17},
      {28, SubBlockPattern::Convolutional, false, 16, 0},
      {28, SubBlockPattern::Convolutional, false, 31, 30},
  };
  for (const auto& c : cases) {
    const Bits d = numbered(c.D);
    const Bits v = subBlockInterleave(d, c.pattern, c.third);
    const std::uint32_t ND = 32 * subBlockRows(c.D) - c.D;
    ASSERT_EQ(v.size(), c.D + ND);
    EXPECT_EQ(v[c.k], c.y < ND ? kNullBit : d[c.y - ND]) << c.D << " " << c.third << " " << c.k;
    EXPECT_EQ(std::count(v.begin(), v.end(), kNullBit), static_cast<std::ptrdiff_t>(ND));
  }
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

}  // namespace
}  // namespace brannoc::tx
