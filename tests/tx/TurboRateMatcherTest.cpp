// Turbo rate matching (TS 36.212 5.1.4.1): refused arguments. Buffer sizes, k0, bit
// collection, the skipping of dummy and filler bits and the circular wrap are checked against
// the decoder's rate dematcher and its parameters in the decoder's tests.
#include <gtest/gtest.h>

#include "tx/TurboRateMatcher.h"

namespace brannoc::tx {
namespace {

TEST(TurboRateMatcher, RefusesBadRedundancyVersionAndUnequalStreams) {
  TurboCodeword d;
  ASSERT_TRUE(turboEncode(Bits(40, 1), d));
  Bits e{1};
  EXPECT_FALSE(rateMatchTurbo(d, 10, 4, e));
  EXPECT_TRUE(e.empty());
  d.d2.pop_back();
  EXPECT_FALSE(rateMatchTurbo(d, 10, 0, e));
  // A buffer with no real bit at all cannot give E bits (and must not loop for ever).
  EXPECT_FALSE(rateMatchTurbo({Bits(4, kNullBit), Bits(4, kNullBit), Bits(4, kNullBit)}, 1, 0, e));
}

}  // namespace
}  // namespace brannoc::tx
