// Code block segmentation (TS 36.212 5.1.2): the standard's conditions, which fix every figure,
// for every size up to 2^18 - 1, and the code blocks themselves. The figures are compared with
// the decoder's segmentation for every size in the decoder's tests.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "tx/Crc.h"
#include "tx/QppInterleaver.h"
#include "tx/Segmentation.h"

namespace brannoc::tx {
namespace {

// K+ is the smallest size that holds B' in C blocks, K- the size just below it (0 for one
// block); C- blocks of K- and C+ of K+ hold B' and F < K+ - K- fillers. Together these leave one
// choice for every figure.
TEST(Segmentation, FiguresMeetTheStandardsConditionsForEveryTransportBlockSize) {
  const auto table = qppTable();
  std::uint32_t failures = 0;
  for (std::uint32_t tbSize = 0; tbSize < (1u << 18) && failures < 5; ++tbSize) {
    const CodeBlockSegmentation s = segmentTransportBlock(tbSize);
    const bool single = s.B <= kMaxCodeBlockSize;
    const QppParameters* plus = findQpp(s.Kplus);
    bool ok = s.B == tbSize + 24 && s.C == (single ? 1 : (s.B + 6119) / 6120) &&
              s.L == (single ? 0 : 24) && s.Bprime == s.B + s.C * s.L && plus != nullptr &&
              s.C * s.Kplus >= s.Bprime && s.Cplus + s.Cminus == s.C &&
              s.Cplus * s.Kplus + s.Cminus * s.Kminus == s.Bprime + s.F;
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

// 6121 bits: block 0 (K- 3072) holds 15 fillers, input bits 0..3032 and its CRC; block 1
// (K+ 3136) input bits 3033..6144 and its CRC. One block has fillers and no block CRC.
TEST(Segmentation, CodeBlocksCarryFillersDataAndCrc24B) {
  const CodeBlockSegmentation seg = segmentTransportBlock(6121);
  Bits b(seg.B);
  for (std::uint32_t i = 0; i < seg.B; ++i) b[i] = (i * 7 + i / 5) % 3 == 0;
  std::vector<Bits> blocks;
  ASSERT_TRUE(segmentCodeBlocks(b, seg, blocks));
  ASSERT_EQ(blocks.size(), 2u);
  ASSERT_EQ(blocks[0].size(), 3072u);
  ASSERT_EQ(blocks[1].size(), 3136u);
  EXPECT_EQ(Bits(blocks[0].begin(), blocks[0].begin() + 15), Bits(15, kNullBit));
  EXPECT_TRUE(std::equal(b.begin(), b.begin() + 3033, blocks[0].begin() + 15));
  EXPECT_TRUE(std::equal(b.begin() + 3033, b.end(), blocks[1].begin()));
  for (Bits block : blocks) {
    for (auto& bit : block) bit = bit == kNullBit ? 0 : bit;
    EXPECT_EQ(crcParity(block, CrcType::Crc24B), Bits(24, 0));
  }
  ASSERT_TRUE(segmentCodeBlocks(Bits(24, 1), segmentTransportBlock(0), blocks));
  Bits expected(16, kNullBit);
  expected.insert(expected.end(), 24, 1);
  EXPECT_EQ(blocks, std::vector<Bits>{expected});
  EXPECT_FALSE(segmentCodeBlocks(Bits(63, 0), segmentTransportBlock(40), blocks));
  EXPECT_TRUE(blocks.empty()) << "wrong input length left blocks behind";
}

}  // namespace
}  // namespace brannoc::tx
