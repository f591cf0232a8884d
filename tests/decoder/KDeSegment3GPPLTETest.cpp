// Code-block segmentation: the figures of TS 36.212 5.1.2 for sizes around one block
// (6120/6121), at the ends of the range, the invariants over every size, and desegmentation.
#include "KDeSegment3GPPLTE.h"

#include <gtest/gtest.h>

#include <numeric>
#include <set>
#include <vector>

namespace {

using brannoc::KDeSegment3GPPLTE;
using brannoc::segmentationParams;

struct SegmentationCase {
  std::uint32_t tbSize, B, L, C, Bprime, Kplus, Kminus, Cminus, Cplus, F;
};

class Segmentation : public testing::TestWithParam<SegmentationCase> {};

TEST_P(Segmentation, MatchesTheStandardsFigures) {
  const SegmentationCase& want = GetParam();
  KDeSegment3GPPLTE segmenter;
  ASSERT_TRUE(segmenter.setTBSize(want.tbSize));
  const segmentationParams got = segmenter.getSegmentationParams();
  EXPECT_EQ(got.TBsize, want.tbSize);
  EXPECT_EQ(got.B, want.B);
  EXPECT_EQ(got.L, want.L);
  EXPECT_EQ(got.C, want.C);
  EXPECT_EQ(got.Bprime, want.Bprime);
  EXPECT_EQ(got.Kplus, want.Kplus);
  EXPECT_EQ(got.Kminus, want.Kminus);
  EXPECT_EQ(got.Cminus, want.Cminus);
  EXPECT_EQ(got.Cplus, want.Cplus);
  EXPECT_EQ(got.F, want.F);
}

INSTANTIATE_TEST_SUITE_P(
    TransportBlockSizes, Segmentation,
    testing::Values(
        //               tb      B    L   C  B'      K+    K-    C-  C+  F
        SegmentationCase{0, 24, 0, 1, 24, 40, 0, 0, 1, 16},
        SegmentationCase{16, 40, 0, 1, 40, 40, 0, 0, 1, 0},
        SegmentationCase{40, 64, 0, 1, 64, 64, 56, 0, 1, 0},
        SegmentationCase{1000, 1024, 0, 1, 1024, 1024, 1008, 0, 1, 0},
        SegmentationCase{6119, 6143, 0, 1, 6143, 6144, 6080, 0, 1, 1},
        SegmentationCase{6120, 6144, 0, 1, 6144, 6144, 6080, 0, 1, 0},
        SegmentationCase{6121, 6145, 24, 2, 6193, 3136, 3072, 1, 1, 15},
        SegmentationCase{12216, 12240, 24, 2, 12288, 6144, 6080, 0, 2, 0},
        SegmentationCase{12217, 12241, 24, 3, 12313, 4160, 4096, 2, 1, 39},
        SegmentationCase{75376, 75400, 24, 13, 75712, 5824, 5760, 0, 13, 0},
        SegmentationCase{262143, 262167, 24, 43, 263199, 6144, 6080, 15, 28, 33}));

TEST(Segmentation, NewRecordComputesFromZeroBAndThenAnEmptyTransportBlock) {
  segmentationParams params;
  params.compute();
  EXPECT_EQ(params.TBsize, 4294967272u);
  EXPECT_EQ(params.C, 1u);
  EXPECT_EQ(params.Kplus, 40u);
  EXPECT_EQ(params.Cminus, 1u);
  params.setTBSize(0);
  EXPECT_EQ(params.B, 24u);
  EXPECT_EQ(params.F, 16u);
  EXPECT_EQ(params.Cplus, 1u);
}

TEST(Segmentation, SameSizeDoesNotRecompute) {
  segmentationParams params;
  params.setTBSize(1000);
  params.F = 777;  // a recompute would restore 0
  params.setTBSize(1000);
  EXPECT_EQ(params.F, 777u);
}

// Interleaver sizes of TS 36.212 Table 5.1.3-3 as its ranges define them.
std::set<std::uint32_t> interleaverSizes() {
  std::set<std::uint32_t> sizes;
  for (std::uint32_t k = 40; k <= 512; k += 8) sizes.insert(k);
  for (std::uint32_t k = 528; k <= 1024; k += 16) sizes.insert(k);
  for (std::uint32_t k = 1056; k <= 2048; k += 32) sizes.insert(k);
  for (std::uint32_t k = 2112; k <= 6144; k += 64) sizes.insert(k);
  return sizes;
}

// Over every transport-block size: K+ is the smallest interleaver size with C blocks that
// hold B', K- the next smaller one, the blocks hold exactly B' + F bits, and C is the
// smallest count of blocks of at most 6144 bits.
TEST(Segmentation, InvariantsHoldForEverySize) {
  const std::set<std::uint32_t> sizes = interleaverSizes();
  ASSERT_EQ(sizes.size(), 188u);
  for (std::uint32_t tb = 0; tb <= 262143; ++tb) {
    segmentationParams p;
    p.compute();
    p.setTBSize(tb);
    ASSERT_EQ(p.B, tb + 24);
    ASSERT_EQ(p.C, p.B <= 6144 ? 1u : (p.B + 6119) / 6120) << tb;
    ASSERT_EQ(p.L, p.C > 1 ? 24u : 0u) << tb;
    ASSERT_EQ(p.Bprime, p.B + p.C * p.L) << tb;
    ASSERT_TRUE(sizes.count(p.Kplus)) << tb;
    ASSERT_GE(static_cast<std::uint64_t>(p.C) * p.Kplus, p.Bprime) << tb;
    const auto it = sizes.find(p.Kplus);
    ASSERT_EQ(p.Kminus, it == sizes.begin() ? 0u : *std::prev(it)) << tb;
    if (it != sizes.begin()) {
      ASSERT_LT(static_cast<std::uint64_t>(p.C) * p.Kminus, p.Bprime) << tb;
    }
    ASSERT_EQ(p.Cminus + p.Cplus, p.C) << tb;
    ASSERT_EQ(p.Cminus * p.Kminus + p.Cplus * p.Kplus, p.Bprime + p.F) << tb;
    ASSERT_LT(p.F, p.Kplus - p.Kminus + (p.Cminus == 0 ? p.Kplus : 0)) << tb;
  }
}

TEST(Desegment, DropsFillersOfBlockZeroAndTheCodeBlockCrcs) {
  KDeSegment3GPPLTE segmenter;
  segmenter.setTBSize(6121);  // K- 3072 (block 0), K+ 3136 (block 1), F 15, L 24
  std::vector<std::vector<std::uint8_t>> blocks{std::vector<std::uint8_t>(3072),
                                                std::vector<std::uint8_t>(3136)};
  // Mark each bit with its block (bit 0/1) so that the join order is visible.
  for (std::size_t i = 0; i < 3072; ++i) blocks[0][i] = (i >= 15 && i < 3048) ? 1 : 0;
  for (std::size_t i = 0; i < 3136; ++i) blocks[1][i] = (i < 3112) ? 0 : 1;
  std::vector<std::uint8_t> out;
  ASSERT_TRUE(segmenter.desegment(blocks, out));
  ASSERT_EQ(out.size(), 6145u);
  EXPECT_EQ(std::accumulate(out.begin(), out.begin() + 3033, 0), 3033);  // bits 15..3047
  EXPECT_EQ(std::accumulate(out.begin() + 3033, out.end(), 0), 0);        // bits 0..3111
}

TEST(Desegment, SingleBlockKeepsItsTransportBlockCrc) {
  KDeSegment3GPPLTE segmenter;
  segmenter.setTBSize(16);  // one block of 40 bits, no fillers, no code-block CRC
  std::vector<std::vector<std::uint8_t>> blocks{std::vector<std::uint8_t>(40, 1)};
  std::vector<std::uint8_t> out;
  ASSERT_TRUE(segmenter.desegment(blocks, out));
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

TEST(KDeSegment3GPPLTE, FactoryRefusesProperties) {
  EXPECT_NE(KDeSegment3GPPLTE::create(""), nullptr);
  testing::internal::CaptureStderr();
  EXPECT_EQ(KDeSegment3GPPLTE::create("x"), nullptr);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "ERROR:KDeSegment3GPPLTE:Unexpected properties:x\n");
}

}  // namespace
