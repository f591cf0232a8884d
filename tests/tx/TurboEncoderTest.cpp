// Turbo encoder (TS 36.212 5.1.3.2): the QPP table and permutation, the trellis termination
// and tail-bit arrangement on hand-worked impulses, filler bits, and refused inputs.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <vector>

#include "tx/TurboEncoder.h"

namespace brannoc::tx {
namespace {

TEST(QppInterleaver, EveryTableSizeGivesAPermutation) {
  ASSERT_EQ(qppTable().size(), 188u);
  for (const QppParameters& row : qppTable()) {
    std::vector<std::uint32_t> pi;
    ASSERT_TRUE(qppPermutation(row.K, pi));
    ASSERT_EQ(pi.size(), row.K);
    EXPECT_EQ(findQpp(row.K), &row);
    // Spot values against the 64-bit form of (f1 i + f2 i^2) mod K.
    for (std::uint64_t i : {std::uint64_t{1}, std::uint64_t{row.K / 3}, std::uint64_t{row.K - 1}}) {
      EXPECT_EQ(pi[i], (row.f1 * i + row.f2 * i * i) % row.K) << row.K;
    }
    std::sort(pi.begin(), pi.end());
    EXPECT_TRUE(pi.front() == 0 && std::adjacent_find(pi.begin(), pi.end()) == pi.end() &&
                pi.back() == row.K - 1)
        << "not a permutation for K " << row.K;
  }
  for (auto [K, f1, f2] : {std::array<std::uint32_t, 3>{40, 3, 10}, {6144, 263, 480}}) {
    EXPECT_TRUE(findQpp(K)->f1 == f1 && findQpp(K)->f2 == f2) << "table row of K " << K;
  }
  for (std::uint32_t K : {0u, 39u, 41u, 6143u, 6208u}) EXPECT_EQ(findQpp(K), nullptr) << K;
  std::vector<std::uint32_t> pi{1};
  EXPECT_FALSE(qppPermutation(100, pi));
  EXPECT_TRUE(pi.empty());
}

const Bits& stream(const TurboCodeword& d, std::uint32_t i) {
  return i == 0 ? d.d0 : i == 1 ? d.d1 : d.d2;
}

TEST(TurboEncoder, TailBitsOfHandWorkedImpulses) {
  // K = 40. c_39 = 1: the first encoder sees 1 at k = 39 (state 1,0,0); terminating gives
  // x_40..42 = 0,1,1 and z_40..42 = 1,0,1 (the input 1,0,1,1 is g0, the parity 1,1,0,1 g1);
  // Pi(23) = 39, so c'_23 = 1 enters the second encoder. c_1 = 1: Pi(37) = 1, so c'_37 = 1;
  // the second encoder's input 1,0,0 then tail 1,1,1 is g0, its parity z'_37..42 =
  // 1,1,1,0,0,1 is g1. Tail order: d0 x_K z_K+1 x'_K z'_K+1, d1 z_K x_K+2 z'_K x'_K+2,
  // d2 x_K+1 z_K+2 x'_K+1 z'_K+2.
  const struct {
    std::uint32_t one;
    std::vector<std::array<std::uint32_t, 3>> bits;  // stream, position, value
  } cases[] = {
      {39, {{0, 39, 1}, {1, 39, 1}, {2, 23, 1}, {0, 40, 0}, {1, 40, 1}, {2, 40, 1},
            {0, 41, 0}, {1, 41, 1}, {2, 41, 1}}},
      {1, {{2, 37, 1}, {2, 38, 1}, {2, 39, 1}, {0, 42, 1}, {1, 42, 0}, {2, 42, 1},
           {0, 43, 0}, {1, 43, 1}, {2, 43, 1}}},
  };
  for (const auto& c : cases) {
    Bits input(40, 0);
    input[c.one] = 1;
    TurboCodeword d;
    ASSERT_TRUE(turboEncode(input, d));
    for (const auto& [i, k, value] : c.bits) {
      EXPECT_EQ(stream(d, i)[k], value) << "impulse at " << c.one << ": d" << i << "[" << k << "]";
    }
  }
}

// Fillers enter as 0 and leave as <NULL> in d0 and d1; sizes outside the table and elements
// other than bits and fillers are refused.
TEST(TurboEncoder, FillerBitsEnterAsZeroAndLeaveAsNullOtherInputsAreRefused) {
  Bits c(56, 0);
  for (std::uint32_t k = 8; k < 56; ++k) c[k] = (k * 5 + 3) % 7 < 3;
  Bits withFillers = c;
  std::fill(withFillers.begin(), withFillers.begin() + 8, kNullBit);
  TurboCodeword plain, filled;
  ASSERT_TRUE(turboEncode(c, plain));
  ASSERT_TRUE(turboEncode(withFillers, filled));
  for (std::uint32_t i = 0; i < 2; ++i) {
    Bits expected = stream(plain, i);
    std::fill(expected.begin(), expected.begin() + 8, kNullBit);
    EXPECT_EQ(stream(filled, i), expected) << "d" << i;
  }
  EXPECT_EQ(filled.d2, plain.d2);
  EXPECT_FALSE(turboEncode(Bits(41, 0), filled));
  EXPECT_TRUE(filled.d0.empty() && filled.d1.empty() && filled.d2.empty());
  EXPECT_FALSE(turboEncode(Bits{}, filled));
  c.resize(40);
  c[5] = 3;
  EXPECT_FALSE(turboEncode(c, filled));
}

}  // namespace
}  // namespace brannoc::tx
