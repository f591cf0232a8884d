// The decoder's segmentation and rate-matching parameters against the transmitter's, which
// were written independently from TS 36.212: every transport-block size, every code-block
// size and redundancy version, and the split of G into E per code block.
#include <gtest/gtest.h>

#include "KDeSegment3GPPLTE.h"
#include "rateMatchParams.h"
#include "tx/QppInterleaver.h"
#include "tx/Segmentation.h"
#include "tx/TurboRateMatcher.h"
#include "tx/UlschEncoder.h"

namespace {

TEST(AgainstTransmitter, SegmentationOfEveryTransportBlockSize) {
  for (std::uint32_t tb = 0; tb <= 262143; ++tb) {
    brannoc::segmentationParams dec;
    dec.compute();
    dec.setTBSize(tb);
    const brannoc::tx::CodeBlockSegmentation tx = brannoc::tx::segmentTransportBlock(tb);
    ASSERT_EQ(dec.B, tx.B) << tb;
    ASSERT_EQ(dec.L, tx.L) << tb;
    ASSERT_EQ(dec.C, tx.C) << tb;
    ASSERT_EQ(dec.Bprime, tx.Bprime) << tb;
    ASSERT_EQ(dec.Kplus, tx.Kplus) << tb;
    ASSERT_EQ(dec.Cplus, tx.Cplus) << tb;
    ASSERT_EQ(dec.Cminus, tx.Cminus) << tb;
    ASSERT_EQ(dec.F, tx.F) << tb;
    // With one code block the standard's K- is 0; the decoder keeps the next smaller size,
    // which no block uses.
    if (tx.C > 1) {
      ASSERT_EQ(dec.Kminus, tx.Kminus) << tb;
    }
    for (std::uint32_t r = 0; r < tx.C; ++r) {
      ASSERT_EQ(dec.blockSize(r), brannoc::tx::codeBlockSize(tx, r)) << tb << " block " << r;
    }
  }
}

// A transport block whose single code block has size K: B = K, so tbSize = K - 24 (K >= 40
// needs no fillers; K = 40 is the smallest).
TEST(AgainstTransmitter, RowsNcbAndK0OfEveryCodeBlockSizeAndRedundancyVersion) {
  for (const brannoc::tx::QppParameters& row : brannoc::tx::qppTable()) {
    const brannoc::tx::TurboBufferLayout layout = brannoc::tx::turboBufferLayout(row.K + 4);
    for (std::uint32_t rv = 0; rv < 4; ++rv) {
      brannoc::rateMatchParams p;
      p.setTransmission(1200, 2, 1, 0);
      p.setDataParams(row.K - 24, 1200, 0, 2, rv, 1);
      ASSERT_EQ(p.seg.Kplus, row.K);
      EXPECT_EQ(p.rowPlus, layout.R) << row.K;
      EXPECT_EQ(p.NcbPlus, layout.Ncb) << row.K;
      EXPECT_EQ(p.k0_1, brannoc::tx::turboK0(layout.R, layout.Ncb, rv)) << row.K << " rv " << rv;
    }
  }
}

TEST(AgainstTransmitter, SplitOfGIntoCodeBlockLengths) {
  for (std::uint32_t tb : {1000u, 6121u, 20000u, 75376u, 262143u}) {
    for (std::uint32_t Qm : {2u, 4u, 6u}) {
      for (std::uint32_t G : {Qm * 1000, Qm * 7777, Qm * 43 * 50 + Qm * 13}) {
        brannoc::rateMatchParams p;
        p.setTransmission(G, Qm, 1, 0);
        p.setDataParams(tb, G, 0, Qm, 0, 1);
        const std::vector<std::uint32_t> E = brannoc::tx::rateMatchedLengths(G, Qm, p.seg.C);
        ASSERT_EQ(E.size(), p.seg.C);
        for (std::uint32_t r = 0; r < p.seg.C; ++r) {
          EXPECT_EQ(r <= p.Eidx ? p.E0 : p.E1, E[r]) << tb << " " << Qm << " " << G << " r " << r;
        }
      }
    }
  }
}

}  // namespace
