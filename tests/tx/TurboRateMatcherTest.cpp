// Turbo rate matching (TS 36.212 5.1.4.1): buffer sizes and k0 of every redundancy version,
// bit collection, skipping of dummy and filler bits, and circular wrap.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>

#include "tx/TurboRateMatcher.h"

namespace brannoc::tx {
namespace {

TEST(TurboRateMatcher, BufferLayoutAndK0ForKnownBlockSizes) {
  struct Case {
    std::uint32_t K, R, ND, Kw;
    std::uint32_t k0[4];
  };
  // k0 = R (2 ceil(96R / 8R) rv + 2) = R (24 rv + 2).
  const Case cases[] = {{6144, 193, 28, 18528, {386, 5018, 9650, 14282}},
                        {40, 2, 20, 192, {4, 52, 100, 148}},
                        {3136, 99, 28, 9504, {198, 2574, 4950, 7326}},
                        {480, 16, 28, 1536, {32, 416, 800, 1184}}};
  for (const auto& c : cases) {
    const TurboBufferLayout layout = turboBufferLayout(c.K + 4);
    EXPECT_EQ(layout.R, c.R) << c.K;
    EXPECT_EQ(layout.Kpi, 32 * c.R) << c.K;
    EXPECT_EQ(layout.ND, c.ND) << c.K;
    EXPECT_EQ(layout.Kw, c.Kw) << c.K;
    EXPECT_EQ(layout.Ncb, c.Kw) << c.K;
    for (std::uint32_t rv = 0; rv < 4; ++rv) {
      EXPECT_EQ(turboK0(layout.R, layout.Ncb, rv), c.k0[rv]) << c.K << " rv " << rv;
    }
  }
}

// The turbo codeword of a K-bit block whose first F bits are fillers.
TurboCodeword codewordOf(std::uint32_t K, std::uint32_t F) {
  Bits c(K);
  for (std::uint32_t k = 0; k < K; ++k) c[k] = k < F ? kNullBit : (k * 7 + k / 3) % 2;
  TurboCodeword d;
  EXPECT_TRUE(turboEncode(c, d));
  return d;
}

TEST(TurboRateMatcher, SelectsRealBitsFromK0AndWrapsRound) {
  const TurboCodeword d = codewordOf(40, 8);
  const Bits w = turboCircularBuffer(d);
  Bits real;  // the real bits of w in circular order from position 0
  for (std::uint8_t bit : w) if (bit != kNullBit) real.push_back(bit);
  // 3 x 20 dummies and 2 x 8 fillers (d0 and d1 only) are <NULL>.
  ASSERT_EQ(w.size(), 192u);
  ASSERT_EQ(real.size(), 192u - 76u);
  for (std::uint32_t rv = 0; rv < 4; ++rv) {
    const std::uint32_t k0 = turboK0(2, 192, rv);
    const auto skipped = static_cast<std::uint32_t>(
        std::count_if(w.begin(), w.begin() + k0, [](auto b) { return b != kNullBit; }));
    // E below, equal to and above the number of real bits (two and a half wraps).
    for (std::uint32_t E : {0u, 1u, 115u, 116u, 117u, 290u}) {
      Bits e;
      ASSERT_TRUE(rateMatchTurbo(d, E, rv, e));
      ASSERT_EQ(e.size(), E);
      for (std::uint32_t k = 0; k < E; ++k) {
        ASSERT_EQ(e[k], real[(skipped + k) % real.size()])
            << "rv " << rv << " E " << E << " k " << k;
      }
    }
  }
}

TEST(TurboRateMatcher, RefusesBadRedundancyVersionAndUnequalStreams) {
  TurboCodeword d = codewordOf(40, 0);
  Bits e{1};
  EXPECT_FALSE(rateMatchTurbo(d, 10, 4, e));
  EXPECT_TRUE(e.empty());
  d.d2.pop_back();
  EXPECT_TRUE(turboCircularBuffer(d).empty());
  EXPECT_FALSE(rateMatchTurbo(d, 10, 0, e));
  // A buffer with no real bit at all cannot give E bits.
  TurboCodeword empty{Bits(4, kNullBit), Bits(4, kNullBit), Bits(4, kNullBit)};
  EXPECT_FALSE(rateMatchTurbo(empty, 1, 0, e));
}

}  // namespace
}  // namespace brannoc::tx
