// The decoder's segmentation and rate-matching parameters against the transmitter's, which
// were written independently from TS 36.212: every transport-block size with the rows, Ncb
// and k0 of both of its code-block sizes, and the split of G into E per code block.
#include <gtest/gtest.h>

#include "KDeSegment3GPPLTE.h"
#include "rateMatchParams.h"
#include "tx/QppInterleaver.h"
#include "tx/Segmentation.h"
#include "tx/TurboRateMatcher.h"
#include "tx/UlschEncoder.h"

namespace brannoc {
namespace {

// With one code block the standard's K- is 0; the decoder keeps the table size just below K+
// (0 below the smallest), which no block uses but from which the K- rows, Ncb and k0 follow.
// Each size's redundancy version is its size mod 4.
TEST(AgainstTransmitter, SegmentationAndBufferOfEveryTransportBlockSize) {
  const auto table = tx::qppTable();
  for (std::uint32_t tb = 0; tb <= 262143; ++tb) {
    rateMatchParams p;
    p.setTransmission(1200, 2, 1, 0);
    p.setDataParams(tb, 1200, 0, 2, tb % 4, 1);
    const segmentationParams& dec = p.seg;
    const tx::CodeBlockSegmentation seg = tx::segmentTransportBlock(tb);
    const tx::QppParameters* plus = tx::findQpp(seg.Kplus);
    const std::uint32_t Kminus = seg.C > 1 ? seg.Kminus : plus == &table[0] ? 0 : (plus - 1)->K;
    ASSERT_TRUE(dec.TBsize == tb && dec.B == seg.B && dec.L == seg.L && dec.C == seg.C &&
                dec.Bprime == seg.Bprime && dec.Kplus == seg.Kplus && dec.Kminus == Kminus &&
                dec.Cplus == seg.Cplus && dec.Cminus == seg.Cminus && dec.F == seg.F)
        << tb;
    for (std::uint32_t r = 0; r < seg.C; ++r) {
      ASSERT_EQ(dec.blockSize(r), tx::codeBlockSize(seg, r)) << tb << " block " << r;
    }
    const tx::TurboBufferLayout minus = tx::turboBufferLayout(Kminus + 4),
                                big = tx::turboBufferLayout(seg.Kplus + 4);
    ASSERT_TRUE(p.rowMinus == minus.R && p.NcbMinus == minus.Ncb &&
                p.k0_0 == tx::turboK0(minus.R, minus.Ncb, tb % 4) && p.rowPlus == big.R &&
                p.NcbPlus == big.Ncb && p.k0_1 == tx::turboK0(big.R, big.Ncb, tb % 4))
        << tb;
  }
}

// G = 0 and G of one symbol leave blocks without any; the others split unevenly.
TEST(AgainstTransmitter, SplitOfGIntoCodeBlockLengths) {
  for (std::uint32_t tb : {1000u, 6121u, 20000u, 75376u, 262143u}) {
    for (std::uint32_t Qm : {2u, 4u, 6u}) {
      for (std::uint32_t G : {0u, Qm, Qm * 1000, Qm * 7777, Qm * 43 * 50 + Qm * 13}) {
        rateMatchParams p;
        p.setTransmission(G, Qm, 1, 0);
        p.setDataParams(tb, G, 0, Qm, 0, 1);
        const std::vector<std::uint32_t> E = tx::rateMatchedLengths(G, Qm, p.seg.C);
        ASSERT_EQ(E.size(), p.seg.C);
        for (std::uint32_t r = 0; r < p.seg.C; ++r) {
          EXPECT_EQ(r <= p.Eidx ? p.E0 : p.E1, E[r]) << tb << " " << Qm << " " << G << " r " << r;
        }
      }
    }
  }
}

}  // namespace
}  // namespace brannoc
