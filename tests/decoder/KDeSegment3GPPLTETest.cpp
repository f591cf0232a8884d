// Code-block segmentation: the figures of TS 36.212 5.1.2 for sizes around one block
// (6120/6121) and at the ends of the range, and desegmentation with its size checks. Every
// transport-block size is cross-checked against the transmitter elsewhere.
#include "KDeSegment3GPPLTE.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <iterator>
#include <numeric>
#include <vector>

namespace {

using brannoc::KDeSegment3GPPLTE;
using Blocks = std::vector<std::vector<std::uint8_t>>;

TEST(Segmentation, MatchesTheStandardsFigures) {
  struct Case {
    std::uint32_t tbSize, B, L, C, Bprime, Kplus, Kminus, Cminus, Cplus, F;
  };
  const Case cases[] = {
      //  tb      B       L   C   B'      K+    K-    C-  C+  F
      {0, 24, 0, 1, 24, 40, 0, 0, 1, 16},
      {6119, 6143, 0, 1, 6143, 6144, 6080, 0, 1, 1},
      {6120, 6144, 0, 1, 6144, 6144, 6080, 0, 1, 0},
      {6121, 6145, 24, 2, 6193, 3136, 3072, 1, 1, 15},
      {12217, 12241, 24, 3, 12313, 4160, 4096, 2, 1, 39},
      {262143, 262167, 24, 43, 263199, 6144, 6080, 15, 28, 33},
  };
  for (const Case& want : cases) {
    KDeSegment3GPPLTE segmenter;
    ASSERT_TRUE(segmenter.setTBSize(want.tbSize));
    const brannoc::segmentationParams got = segmenter.getSegmentationParams();
    const std::uint32_t gotFields[] = {got.TBsize, got.B,      got.L,      got.C,     got.Bprime,
                                       got.Kplus,  got.Kminus, got.Cminus, got.Cplus, got.F};
    const std::uint32_t wantFields[] = {want.tbSize, want.B,      want.L,      want.C,
                                        want.Bprime, want.Kplus,  want.Kminus, want.Cminus,
                                        want.Cplus,  want.F};
    EXPECT_TRUE(std::equal(std::begin(gotFields), std::end(gotFields), wantFields))
        << want.tbSize;
  }
}

TEST(Desegment, DropsFillersOfBlockZeroAndTheCodeBlockCrcs) {
  KDeSegment3GPPLTE segmenter;
  segmenter.setTBSize(6121);  // K- 3072 (block 0), K+ 3136 (block 1), F 15, L 24
  // Block 0 carries ones in its data bits 15..3047, block 1 zeros in 0..3111: the join
  // order and both cuts are visible.
  Blocks blocks{std::vector<std::uint8_t>(3072), std::vector<std::uint8_t>(3136, 1)};
  std::fill(blocks[0].begin() + 15, blocks[0].begin() + 3048, 1);
  std::fill(blocks[1].begin(), blocks[1].begin() + 3112, 0);
  std::vector<std::uint8_t> out;
  ASSERT_TRUE(segmenter.desegment(blocks, out));
  ASSERT_EQ(out.size(), 6145u);
  EXPECT_EQ(std::accumulate(out.begin(), out.begin() + 3033, 0), 3033);
  EXPECT_EQ(std::accumulate(out.begin() + 3033, out.end(), 0), 0);

  segmenter.setTBSize(16);  // one block of 40 bits keeps its transport-block CRC
  ASSERT_TRUE(segmenter.desegment({std::vector<std::uint8_t>(40, 1)}, out));
  EXPECT_EQ(out, std::vector<std::uint8_t>(40, 1));
}

TEST(Desegment, RefusesBlocksThatDoNotMatchTheSegmentation) {
  KDeSegment3GPPLTE segmenter;
  segmenter.setTBSize(6121);
  std::vector<std::uint8_t> out{5};
  EXPECT_FALSE(segmenter.desegment({std::vector<std::uint8_t>(3072)}, out));
  EXPECT_FALSE(segmenter.desegment(
      {std::vector<std::uint8_t>(3136), std::vector<std::uint8_t>(3072)}, out));
  EXPECT_EQ(out, std::vector<std::uint8_t>{5});
}

}  // namespace
