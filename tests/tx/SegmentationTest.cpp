// Code block segmentation (TS 36.212 5.1.2): the figures of known transport block sizes,
// the standard's invariants for every size up to 2^18 - 1, and the code blocks themselves.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "tx/Crc.h"
#include "tx/QppInterleaver.h"
#include "tx/Segmentation.h"

namespace brannoc::tx {
namespace {

struct SegmentationCase {
  std::uint32_t tbSize;
  CodeBlockSegmentation expected;  // B, L, C, B', K+, K-, C+, C-, F
};

TEST(Segmentation, KnownTransportBlockSizes) {
  const SegmentationCase cases[] = {
      {0, {24, 0, 1, 24, 40, 0, 1, 0, 16}},
      {16, {40, 0, 1, 40, 40, 0, 1, 0, 0}},
      {40, {64, 0, 1, 64, 64, 0, 1, 0, 0}},
      {6120, {6144, 0, 1, 6144, 6144, 0, 1, 0, 0}},
      {6121, {6145, 24, 2, 6193, 3136, 3072, 1, 1, 15}},
      {262143, {262167, 24, 43, 263199, 6144, 6080, 28, 15, 33}},
  };
  for (const auto& c : cases) {
    const CodeBlockSegmentation seg = segmentTransportBlock(c.tbSize);
    const CodeBlockSegmentation& e = c.expected;
    SCOPED_TRACE(c.tbSize);
    EXPECT_EQ(seg.B, e.B);
    EXPECT_EQ(seg.L, e.L);
    EXPECT_EQ(seg.C, e.C);
    EXPECT_EQ(seg.Bprime, e.Bprime);
    EXPECT_EQ(seg.Kplus, e.Kplus);
    EXPECT_EQ(seg.Kminus, e.Kminus);
    EXPECT_EQ(seg.Cplus, e.Cplus);
    EXPECT_EQ(seg.Cminus, e.Cminus);
    EXPECT_EQ(seg.F, e.F);
  }
}

TEST(Segmentation, InvariantsHoldForEveryTransportBlockSize) {
  std::vector<std::uint32_t> previousK;  // the table size just below each K+
  const auto table = qppTable();
  std::uint32_t failures = 0;
  for (std::uint32_t tbSize = 0; tbSize < (1u << 18) && failures < 5; ++tbSize) {
    const CodeBlockSegmentation s = segmentTransportBlock(tbSize);
    const bool single = s.B <= kMaxCodeBlockSize;
    bool ok = s.B == tbSize + 24 && s.C == (single ? 1 : (s.B + 6119) / 6120) &&
              s.L == (single ? 0 : 24) && s.Bprime == s.B + s.C * s.L &&
              findQpp(s.Kplus) != nullptr && s.C * s.Kplus >= s.Bprime &&
              s.Cplus + s.Cminus == s.C &&
              s.Cplus * s.Kplus + s.Cminus * s.Kminus == s.Bprime + s.F;
    // K+ is the smallest fitting size, and K- the size just below it.
    const QppParameters* plus = findQpp(s.Kplus);
    ok = ok && (plus == &table[0] || s.C * (plus - 1)->K < s.Bprime);
    if (single) {
      ok = ok && s.Kminus == 0 && s.Cminus == 0 && s.Cplus == 1 && s.F == s.Kplus - s.B;
    } else {
      ok = ok && s.Kminus == (plus - 1)->K && s.Cplus >= 1 && s.F < s.Kplus - s.Kminus &&
           s.F + s.L < codeBlockSize(s, 0);
    }
    if (!ok) {
      ++failures;
      ADD_FAILURE() << "segmentation of " << tbSize << " breaks an invariant";
    }
  }
}

TEST(Segmentation, BlockSizesFollowTheMinusBlocksFirst) {
  const CodeBlockSegmentation seg = segmentTransportBlock(262143);
  for (std::uint32_t r = 0; r < seg.C; ++r) {
    EXPECT_EQ(codeBlockSize(seg, r), r < 15 ? 6080u : 6144u) << r;
  }
}

TEST(Segmentation, CodeBlocksCarryFillersDataAndCrc24B) {
  const CodeBlockSegmentation seg = segmentTransportBlock(6121);
  Bits b(seg.B);
  for (std::uint32_t i = 0; i < seg.B; ++i) b[i] = (i * 7 + i / 5) % 3 == 0;
  std::vector<Bits> blocks;
  ASSERT_TRUE(segmentCodeBlocks(b, seg, blocks));
  ASSERT_EQ(blocks.size(), 2u);
  ASSERT_EQ(blocks[0].size(), 3072u);
  ASSERT_EQ(blocks[1].size(), 3136u);
  // Block 0: 15 fillers, input bits 0..3032, CRC; block 1: input bits 3033..6144, CRC.
  for (std::uint32_t k = 0; k < 15; ++k) EXPECT_EQ(blocks[0][k], kNullBit);
  EXPECT_TRUE(std::equal(b.begin(), b.begin() + 3033, blocks[0].begin() + 15));
  EXPECT_TRUE(std::equal(b.begin() + 3033, b.end(), blocks[1].begin()));
  for (const Bits& block : blocks) {
    Bits zeroFilled = block;
    for (auto& bit : zeroFilled) bit = bit == kNullBit ? 0 : bit;
    EXPECT_EQ(crcParity(zeroFilled, CrcType::Crc24B), Bits(24, 0));
  }
}

TEST(Segmentation, SingleBlockHasFillersAndNoBlockCrc) {
  const CodeBlockSegmentation seg = segmentTransportBlock(0);
  const Bits b(24, 1);
  std::vector<Bits> blocks;
  ASSERT_TRUE(segmentCodeBlocks(b, seg, blocks));
  ASSERT_EQ(blocks.size(), 1u);
  Bits expected(16, kNullBit);
  expected.insert(expected.end(), 24, 1);
  EXPECT_EQ(blocks[0], expected);
}

TEST(Segmentation, RejectsInputOfTheWrongLength) {
  const CodeBlockSegmentation seg = segmentTransportBlock(40);
  std::vector<Bits> blocks{Bits{1}};
  EXPECT_FALSE(segmentCodeBlocks(Bits(63, 0), seg, blocks));
  EXPECT_TRUE(blocks.empty());
}

}  // namespace
}  // namespace brannoc::tx
