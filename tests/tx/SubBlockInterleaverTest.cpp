// Sub-block interleaver (TS 36.212 5.1.4.1.1 and 5.1.4.2.1): worked positions of the column
// patterns of Tables 5.1.4-1 and 5.1.4-2, dummy bits, and the read order of the three turbo
// streams. That every bit comes back once, for the turbo and convolutional block sizes in use,
// is checked by the decoder's rate-dematcher round trips.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <vector>

#include "tx/SubBlockInterleaver.h"

namespace brannoc::tx {
namespace {

TEST(SubBlockInterleaver, OutputsReadTheWorkedInputPositions) {
  // D = 44 (K = 40): R = 2, Kpi = 64, ND = 20, v_k = y[P(k/2) + 32(k%2)]; the third turbo
  // stream reads one position further, wrapping at Kpi. D = 28 (20 CQI bits + CRC8): R = 1,
  // ND = 4, v_k = y[P(k)] with the convolutional pattern. Positions y < ND are dummies.
  const auto turbo = SubBlockPattern::Turbo, conv = SubBlockPattern::Convolutional;
  const struct {
    std::uint32_t D;
    SubBlockPattern pattern;
    bool third;
    std::uint32_t k, y;
  } cases[] = {
      {44, turbo, false, 0, 0},  {44, turbo, false, 1, 32},  {44, turbo, false, 2, 16},
      {44, turbo, false, 3, 48}, {44, turbo, false, 63, 63}, {44, turbo, true, 1, 33},
      {44, turbo, true, 62, 32}, {44, turbo, true, 63, 0},   {28, conv, false, 1, 17},
      {28, conv, false, 16, 0},  {28, conv, false, 31, 30},
  };
  for (const auto& c : cases) {
    Bits d(c.D);  // input bit i holds 10 + i, so each output names its source position
    for (std::uint32_t i = 0; i < c.D; ++i) d[i] = static_cast<std::uint8_t>(10 + i);
    const Bits v = subBlockInterleave(d, c.pattern, c.third);
    const std::uint32_t ND = 32 * subBlockRows(c.D) - c.D;
    ASSERT_EQ(v.size(), c.D + ND);
    EXPECT_EQ(v[c.k], c.y < ND ? kNullBit : d[c.y - ND]) << c.D << " " << c.third << " " << c.k;
    EXPECT_EQ(std::count(v.begin(), v.end(), kNullBit), static_cast<std::ptrdiff_t>(ND));
  }
}

}  // namespace
}  // namespace brannoc::tx
