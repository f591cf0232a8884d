// Turbo encoder (TS 36.212 5.1.3.2): the QPP table and permutation, the trellis termination
// and tail-bit arrangement on hand-worked impulses, filler bits, and refused inputs.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <vector>

#include "tx/TurboEncoder.h"

namespace brannoc::tx {
namespace {

TEST(QppInterleaver, TableHoldsTheStandardSizes) {
  const auto table = qppTable();
  ASSERT_EQ(table.size(), 188u);
  EXPECT_EQ(table.front().K, 40u);
  EXPECT_EQ(table.back().K, 6144u);
  // Rows 1, 2 and 188 of Table 5.1.3-3.
  EXPECT_EQ(findQpp(40)->f1, 3u);
  EXPECT_EQ(findQpp(40)->f2, 10u);
  EXPECT_EQ(findQpp(48)->f1, 7u);
  EXPECT_EQ(findQpp(6144)->f1, 263u);
  EXPECT_EQ(findQpp(6144)->f2, 480u);
  for (std::uint32_t K : {0u, 39u, 41u, 520u, 6143u, 6208u}) EXPECT_EQ(findQpp(K), nullptr) << K;
}

TEST(QppInterleaver, EveryTableSizeGivesAPermutation) {
  for (const QppParameters& row : qppTable()) {
    std::vector<std::uint32_t> pi;
    ASSERT_TRUE(qppPermutation(row.K, pi));
    ASSERT_EQ(pi.size(), row.K);
    EXPECT_EQ(findQpp(row.K), &row);
    // Spot values against the 64-bit form of (f1 i + f2 i^2) mod K.
    for (std::uint64_t i : {std::uint64_t{1}, std::uint64_t{row.K / 3}, std::uint64_t{row.K - 1}}) {
      EXPECT_EQ(pi[i], (row.f1 * i + row.f2 * i * i) % row.K) << row.K;
    }
    std::vector<bool> seen(row.K, false);
    for (std::uint32_t p : pi) seen[p] = true;
    EXPECT_TRUE(std::all_of(seen.begin(), seen.end(), [](bool s) { return s; })) << row.K;
  }
  std::vector<std::uint32_t> pi{1};
  EXPECT_FALSE(qppPermutation(100, pi));
  EXPECT_TRUE(pi.empty());
}

TEST(TurboEncoder, AllZeroBlockGivesAllZeroStreams) {
  TurboCodeword d;
  ASSERT_TRUE(turboEncode(Bits(40, 0), d));
  EXPECT_EQ(d.d0, Bits(44, 0));
  EXPECT_EQ(d.d1, Bits(44, 0));
  EXPECT_EQ(d.d2, Bits(44, 0));
}

TEST(TurboEncoder, FirstEncoderTailOfAnImpulseAtTheLastBit) {
  // K = 40, c_39 = 1: the first encoder sees 1 at k = 39 (state 1,0,0); terminating gives
  // x_40..42 = 0,1,1 and z_40..42 = 1,0,1 (the input 1,0,1,1 is g0, the parity 1,1,0,1 g1).
  // Pi(23) = 39, so the second encoder is not involved at the end of the block.
  Bits c(40, 0);
  c[39] = 1;
  TurboCodeword d;
  ASSERT_TRUE(turboEncode(c, d));
  EXPECT_EQ(d.d0[39], 1);
  EXPECT_EQ(d.d1[39], 1);
  EXPECT_EQ(d.d0[40], 0);  // x_K
  EXPECT_EQ(d.d1[40], 1);  // z_K
  EXPECT_EQ(d.d2[40], 1);  // x_K+1
  EXPECT_EQ(d.d0[41], 0);  // z_K+1
  EXPECT_EQ(d.d1[41], 1);  // x_K+2
  EXPECT_EQ(d.d2[41], 1);  // z_K+2
  EXPECT_EQ(d.d2[23], 1);  // c'_23 = c_39 enters the second encoder
}

TEST(TurboEncoder, SecondEncoderTailOfAnInterleavedImpulse) {
  // K = 40, c_1 = 1: Pi(37) = 1, so c'_37 = 1. The second encoder's input 1,0,0 then tail
  // 1,1,1 is g0 (1 + D^2); its parity z'_37..42 = 1,1,1,0,0,1 is g1 (1 + D^2).
  Bits c(40, 0);
  c[1] = 1;
  TurboCodeword d;
  ASSERT_TRUE(turboEncode(c, d));
  EXPECT_EQ((Bits{d.d2[37], d.d2[38], d.d2[39]}), (Bits{1, 1, 1}));
  EXPECT_EQ(d.d0[42], 1);  // x'_K
  EXPECT_EQ(d.d1[42], 0);  // z'_K
  EXPECT_EQ(d.d2[42], 1);  // x'_K+1
  EXPECT_EQ(d.d0[43], 0);  // z'_K+1
  EXPECT_EQ(d.d1[43], 1);  // x'_K+2
  EXPECT_EQ(d.d2[43], 1);  // z'_K+2
}

TEST(TurboEncoder, FillerBitsEnterAsZeroAndLeaveAsNull) {
  Bits c(56, 0);
  for (std::uint32_t k = 0; k < 56; ++k) c[k] = (k * 5 + 3) % 7 < 3;
  Bits withFillers = c;
  for (std::uint32_t k = 0; k < 8; ++k) {
    withFillers[k] = kNullBit;
    c[k] = 0;
  }
  TurboCodeword plain, filled;
  ASSERT_TRUE(turboEncode(c, plain));
  ASSERT_TRUE(turboEncode(withFillers, filled));
  for (std::uint32_t k = 0; k < 60; ++k) {
    EXPECT_EQ(filled.d0[k], k < 8 ? kNullBit : plain.d0[k]) << k;
    EXPECT_EQ(filled.d1[k], k < 8 ? kNullBit : plain.d1[k]) << k;
  }
  EXPECT_EQ(filled.d2, plain.d2);
}

TEST(TurboEncoder, RefusesSizesOutsideTheTableAndNonBits) {
  TurboCodeword d;
  EXPECT_FALSE(turboEncode(Bits(41, 0), d));
  EXPECT_TRUE(d.d0.empty() && d.d1.empty() && d.d2.empty());
  EXPECT_FALSE(turboEncode(Bits{}, d));
  Bits c(40, 0);
  c[5] = 3;
  EXPECT_FALSE(turboEncode(c, d));
}

}  // namespace
}  // namespace brannoc::tx
