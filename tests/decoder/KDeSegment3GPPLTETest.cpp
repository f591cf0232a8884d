// Desegmentation: the decoded code blocks joined into the transport block without fillers and
// code-block CRCs, and blocks that do not match the segmentation refused. The segmentation
// itself is checked against the transmitter for every transport-block size elsewhere.
#include <gtest/gtest.h>

#include <algorithm>
#include <numeric>
#include <vector>

#include "KDeSegment3GPPLTE.h"

namespace {

using brannoc::KDeSegment3GPPLTE;
using Bits = std::vector<std::uint8_t>;

TEST(Desegment, DropsFillersOfBlockZeroAndTheCodeBlockCrcsAndRefusesOtherSizes) {
  KDeSegment3GPPLTE segmenter;
  segmenter.setTBSize(6121);  // K- 3072 (block 0), K+ 3136 (block 1), F 15, L 24
  Bits out{5};
  EXPECT_FALSE(segmenter.desegment({Bits(3072)}, out));
  EXPECT_FALSE(segmenter.desegment({Bits(3136), Bits(3072)}, out));
  EXPECT_EQ(out, Bits{5});
  // Block 0 carries ones in its data bits 15..3047, block 1 zeros in 0..3111: the join
  // order and both cuts are visible.
  std::vector<Bits> blocks{Bits(3072), Bits(3136, 1)};
  std::fill(blocks[0].begin() + 15, blocks[0].begin() + 3048, 1);
  std::fill(blocks[1].begin(), blocks[1].begin() + 3112, 0);
  ASSERT_TRUE(segmenter.desegment(blocks, out));
  ASSERT_EQ(out.size(), 6145u);
  EXPECT_EQ(std::accumulate(out.begin(), out.begin() + 3033, 0), 3033);
  EXPECT_EQ(std::accumulate(out.begin() + 3033, out.end(), 0), 0);

  segmenter.setTBSize(16);  // one block of 40 bits keeps its transport-block CRC
  ASSERT_TRUE(segmenter.desegment({Bits(40, 1)}, out));
  EXPECT_EQ(out, Bits(40, 1));
}

}  // namespace
