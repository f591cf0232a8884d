// Tests of KRateDeMatch: turbo rate dematching (TS 36.212 5.1.4.1), HARQ chase combining,
// convolutional CQI dematching (5.1.4.2) and ACK/RI/CQI soft combining, with 8:5
// saturation.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <random>
#include <sstream>
#include <string>
#include <vector>

#include "DecoderTestSupport.h"
#include "KRateDeMatch.h"
#include "tx/ConvolutionalCode.h"
#include "tx/TurboEncoder.h"
#include "tx/TurboRateMatcher.h"

namespace brannoc::test {
namespace {

using SoftValues = KRateDeMatch::SoftValues;
using Streams = KRateDeMatch::Streams;

// One code block, one layer, normal cyclic prefix: G = E.
void configure(KRateDeMatch& rdm, std::uint32_t tbSize, std::uint32_t G, std::uint32_t rv = 0) {
  ASSERT_TRUE(rdm.setModulationParams(G, 2, 1, 0));
  ASSERT_TRUE(rdm.setParams(tbSize, G, 2, rv, 1));
}

// Sets the size and Q of the ACK ('A'), RI ('R') or CQI ('C') field and combines in.
bool combineUci(KRateDeMatch& rdm, char field, std::uint32_t size, std::uint32_t Q,
                const SoftValues& in, SoftValues& combined) {
  rateMatchParams& params = rdm.rmParams();
  if (field == 'A') {
    params.setACKSize(size);
    params.setACKQ(Q);
    return rdm.rateDematchACK(in, combined);
  }
  if (field == 'R') {
    params.setRISize(size);
    params.setRIQ(Q);
    return rdm.rateDematchRI(in, combined);
  }
  params.setCQISize(size);
  params.setCQIQ(Q);
  return rdm.rateDematchCQI(in, combined);
}

// Transport block of 16 bits: one code block of K = 40 (D 44), 132 real positions.
constexpr std::uint32_t kTb40 = 16;

TEST(KRateDeMatchHarq, ChaseCombiningSaturatesTo8Point5) {
  // Dematched, stored, expected.
  const std::array<std::int32_t, 3> cases[] = {
      {127, 1, 127}, {-50, 20, -30}, {-128, -128, -128}, {200, 0, 127}, {0, -129, -128}};
  KRateDeMatch rdm;
  configure(rdm, kTb40, 132);
  for (const auto& [dematched, stored, expected] : cases) {
    Streams out;
    ASSERT_TRUE(rdm.applyHARQ(Streams(3, SoftValues(44, stored)),
                              Streams(3, SoftValues(44, dematched)), out, 0));
    EXPECT_EQ(out, Streams(3, SoftValues(44, expected))) << dematched << " + " << stored;
  }
  // In one call, with 8 fillers (tbSize 8): fillers -128 + 100, data 50 + 100 saturates.
  configure(rdm, 8, 116);
  Streams out;
  ASSERT_TRUE(rdm.rateDematchAndHARQ(SoftValues(116, 50), Streams(3, SoftValues(44, 100)), out, 0));
  EXPECT_EQ(out[0][0], -28);
  EXPECT_EQ(out[1][7], -28);
  EXPECT_EQ(out[0][8], 127);
  EXPECT_EQ(out[2][0], 127);
}

// Each refusal prints its line; inconsistent inputs to the public steps fail with a line
// instead of reading or writing outside their vectors, or looping for ever.
TEST(KRateDeMatchData, RefusalsAndInconsistentInputsReportTheirLine) {
  KRateDeMatch fresh, rdm, conv;
  configure(rdm, kTb40, 132);
  ASSERT_TRUE(conv.setModulationParams(84, 2, 1, 0));
  ASSERT_TRUE(conv.rmParams().setCQISize(20));
  ASSERT_TRUE(conv.rmParams().setCQIQ(84));
  SoftValues nullMap, P, pi, d0, d1, d2, w, convMap, convP;
  ASSERT_TRUE(rdm.createInterleavingTables(0, 0, nullMap, P, pi));
  ASSERT_TRUE(conv.createConvInterleavingTables(1, convMap, convP));
  SoftValues p1Filler = nullMap;
  p1Filler[64 + 2 * 10 + 1] = 2;  // a filler mark in the second parity stream
  SoftValues realOnDummy = nullMap;
  realOnDummy[0] = 0;  // P[0] = 0 lies among the 20 dummies
  Streams out, shortHarq(3, SoftValues(44));
  shortHarq[2].pop_back();
  const std::string need = "Need to set RM parameters before calling RM data\n";
  expectRefusals({
      {[&] { return fresh.rateDematchData(SoftValues(116), out, 0); }, need},
      {[&] { return fresh.rateDematchConv(SoftValues(), w, d0, d1, d2); }, need},
      {[&] { return fresh.rateDematchRI({}, d0); }, "File: ../s/KRateDeMatch(#)" + need},
      {[&] { return fresh.setParams(16, 132, 0, 0, 1); },
       "Invalid combination of parameters: tbsize, g, qm, rvidx, nlayers\n"},
      {[&] { return rdm.rateDematchData(SoftValues(131), out, 0); },
       "LLR Input Size must be: 132\n"},
      {[&] { return rdm.rateDematchAndHARQ(SoftValues(131), Streams(3, SoftValues(44)), out, 0); },
       "LLR Input Size must be: 132\nERROR PERFORMING RATE DEMATCH\n"},
      {[&] { return rdm.rateDematchAndHARQ(SoftValues(132), shortHarq, out, 0); },
       "File: ../s/KRateDeMatch(#) HARQ stream 2*\nERROR PERFORMING HARQ\n"},
      {[&] { return conv.rateDematchConv(SoftValues(83), w, d0, d1, d2); },
       "LLR Input Size must be: 84\n"},
      {[&] { return rdm.deinterleaveData(SoftValues(191), nullMap, P, pi, d0, d1, d2, 0); },
       "File: ../s/KRateDeMatch(276) llr's size should be:192  size is:191\n"},
      {[&] { return rdm.deinterleaveData(SoftValues(192), p1Filler, P, pi, d0, d1, d2, 0); },
       "File: ../s/KRateDeMatch(331) No segmentation fillers for p1. ????\n"},
      {[&] { return conv.deinterleaveConvData(SoftValues(95), convMap, convP, d0, d1, d2); },
       "File: ../s/KRateDeMatch(361) llr's size should be:96  size is:95\n"},
      {[&] { return rdm.createInterleavingTables(2, 0, d0, d1, d2); },
       "File: ../s/KRateDeMatch(#) no column permutation for mode 2\n"},
      {[&] { return rdm.deinterleaveData(SoftValues(192), realOnDummy, P, pi, d0, d1, d2, 0); },
       "File: ../s/KRateDeMatch(#)*"},
      {[&] {
         return rdm.deinterleaveData(SoftValues(192), nullMap, SoftValues(10), pi, d0, d1, d2, 0);
       },
       "File: ../s/KRateDeMatch(#)*"},
      {[&] { return rdm.llrCollect(SoftValues(5, 1), SoftValues(192, 1), w, 0, 192, 5); },
       "File: ../s/KRateDeMatch(#)*"},
      {[&] { return rdm.llrCollect(SoftValues(5, 1), SoftValues(100), w, 0, 192, 5); },
       "File: ../s/KRateDeMatch(#)*"},
      {[&] { return rdm.applyHARQ(shortHarq, Streams(3, SoftValues(44)), out, 0); },
       "File: ../s/KRateDeMatch(#) HARQ stream 2*"},
      {[&] {
         return rdm.applyHARQ(Streams(2, SoftValues(44)), Streams(3, SoftValues(44)), out, 0);
       },
       "File: ../s/KRateDeMatch(#)*"},
  });
}

// ACK, RI and short-CQI accumulators: repetitions are summed onto one coded block, or the
// field is refused with a line naming the missing or wrong parameter.
TEST(KRateDeMatchUci, RepetitionsAreSummedOntoOneCodedBlockOrRefused) {
  SoftValues ramp24(24), rampSums(12);
  for (std::size_t i = 0; i < 24; ++i) {
    ramp24[i] = static_cast<std::int32_t>(i);
    rampSums[i / 2] = static_cast<std::int32_t>(i / 2 * 2 + 12);
  }
  SoftValues cqi70(32, 2), cqi20(32, 0);
  std::fill(cqi70.begin(), cqi70.begin() + 6, 3);
  std::fill(cqi20.begin(), cqi20.begin() + 20, -5);
  struct Case {
    const char* name;  // for a refusal, the line's message
    char field;
    std::uint32_t size, Qm, Q;
    SoftValues in, expected;
  };
  const Case cases[] = {
      {"1-bit ACK, Qm 2", 'A', 1, 2, 4, {10, -20, 30, 5}, {40, -15}},
      {"1-bit RI saturates low", 'R', 1, 2, 8, SoftValues(8, -100), {-128, -128}},
      {"input clamped before the sum", 'A', 1, 4, 4, {300, -300, 0, 1}, {127, -128, 0, 1}},
      {"2-bit RI, Qm 4", 'R', 2, 4, 24, ramp24, rampSums},
      {"2-bit ACK, Qm 6", 'A', 2, 6, 36, SoftValues(36, 7), SoftValues(18, 14)},
      {"CQI of 70 soft values", 'C', 5, 2, 70, SoftValues(70, 1), cqi70},
      {"CQI of 20 soft values leaves 12 positions 0", 'C', 5, 2, 20, SoftValues(20, -5), cqi20},
      {"CQI saturates", 'C', 5, 2, 64, SoftValues(64, 127), SoftValues(32, 127)},
      {"Need to set RI_Q parameter before calling RM data", 'R', 1, 2, 0, {}, {}},
      {"Need to set CQI_Q parameter before calling RM data", 'C', 4, 2, 0, {}, {}},
      {"ACK DataIn size must match ACK_Q", 'A', 1, 2, 8, SoftValues(7, 1), {}},
      {"CQI DataIn size must match CQI_Q", 'C', 4, 2, 40, SoftValues(41, 1), {}},
      {"RI size must be either 1 or 2 = 0", 'R', 0, 2, 8, SoftValues(8, 1), {}},
      {"ACK size must be either 1 or 2", 'A', 0, 2, 8, SoftValues(8, 1), {}},
      {" modulation order is 0: no positions to combine on", 'A', 1, 0, 8, SoftValues(8, 1), {}},
  };
  for (const Case& c : cases) {
    KRateDeMatch rdm;
    ASSERT_TRUE(rdm.setModulationParams(100, c.Qm, 1, 0));
    SoftValues combined;
    const auto combine = [&] { return combineUci(rdm, c.field, c.size, c.Q, c.in, combined); };
    if (c.expected.empty()) {
      expectRefusals({{combine, std::string("File: ../s/KRateDeMatch(#)") + c.name + "\n"}});
    } else {
      EXPECT_TRUE(combine()) << c.name;
      EXPECT_EQ(combined, c.expected) << c.name;
    }
  }
}

// Round trips: bits rate-matched by the transmitter, sent as ideal soft values (+A for 1,
// -A for 0), dematched. Each stream position must come back as A times the number of times
// it was sent (E / real positions, rounded down or up, adding up to E), with the sign of its
// bit; fillers come back as -128. With A * passes above 127 every value saturates, high for 1
// and low for 0.
// Returns the first wrong value, "" when all are right.
std::string checkStreams(const std::vector<const tx::Bits*>& sent, const Streams& out,
                         std::int32_t A, std::uint32_t E, std::uint32_t real, bool saturating) {
  if (out.size() != sent.size()) {
    return "wrong number of streams";
  }
  std::uint64_t total = 0;
  for (std::size_t s = 0; s < sent.size(); ++s) {
    if (out[s].size() != sent[s]->size()) {
      return "stream " + std::to_string(s) + " has " + std::to_string(out[s].size()) + " values";
    }
    for (std::size_t i = 0; i < out[s].size(); ++i) {
      const std::uint8_t bit = (*sent[s])[i];
      const std::int32_t v = out[s][i];
      const std::int32_t unit = bit == 1 ? A : -A;
      const std::int32_t count = v / unit;
      const bool ok = bit == tx::kNullBit ? v == -128
                      : saturating        ? v == (bit == 1 ? 127 : -128)
                                          : v == count * unit && count >= std::int32_t(E / real) &&
                                         count <= std::int32_t((E + real - 1) / real);
      if (!ok) {
        std::ostringstream where;  // a stream: GCC 12 at -O3 misreads chained string sums
        where << "d" << s << "[" << i << "] = " << v << " for bit " << int{bit};
        return where.str();
      }
      total += bit == tx::kNullBit || saturating ? 0 : count;
    }
  }
  return saturating || total == E ? "" : "counts add up to " + std::to_string(total);
}

SoftValues idealSoftValues(const tx::Bits& e, std::int32_t A) {
  SoftValues in(e.size());
  for (std::size_t m = 0; m < e.size(); ++m) {
    in[m] = e[m] == 1 ? A : -A;
  }
  return in;
}

// Transmit lengths relative to the real positions: half, all, two passes plus 38, and two
// passes with saturating amplitude.
struct LengthCase {
  std::uint32_t passes, half, extra;
  std::int32_t A;
};
constexpr LengthCase kLengths[] = {{0, 1, 0, 8}, {1, 0, 0, 8}, {2, 0, 38, 8}, {2, 0, 0, 100}};

TEST(KRateDeMatchRoundTrip, TurboCodeBlocksComeBackFromTheTransmitter) {
  // K 40, K 40 with 8 fillers, 104, 528 (8 fillers), 1056, 2048 (24 fillers), 4032 (8
  // fillers), 6144, and both blocks of a two-block transport block (K- 3072 with 15
  // fillers, K+ 3136).
  const std::pair<std::uint32_t, std::uint32_t> blocks[] = {
      // tbSize, r
      {16, 0},   {8, 0},    {80, 0},   {496, 0},  {1032, 0},
      {2000, 0}, {4000, 0}, {6120, 0}, {6121, 0}, {6121, 1}};
  std::mt19937 random(20240611);
  for (const auto& [tbSize, r] : blocks) {
    KRateDeMatch rdm;
    configure(rdm, tbSize, 1000);
    const segmentationParams seg = rdm.getRMParams().seg;
    const std::uint32_t K = seg.blockSize(r);
    const std::uint32_t F = r == 0 ? seg.F : 0;
    tx::Bits c(K);
    for (std::uint32_t i = 0; i < K; ++i) {
      c[i] = i < F ? tx::kNullBit : static_cast<std::uint8_t>(random() & 1u);
    }
    tx::TurboCodeword cw;
    ASSERT_TRUE(tx::turboEncode(c, cw)) << K;
    const std::uint32_t real = 3 * (K + 4) - 2 * F;
    for (const LengthCase& length : kLengths) {
      // QPSK: whole modulation symbols.
      const std::uint32_t E =
          (length.passes * real + length.half * (real / 2) + length.extra) & ~1u;
      for (std::uint32_t rv = 0; rv < 4; ++rv) {
        SCOPED_TRACE("K " + std::to_string(K) + " F " + std::to_string(F) + " block " +
                     std::to_string(r) + " rv " + std::to_string(rv) + " E " + std::to_string(E));
        configure(rdm, tbSize, E * seg.C, rv);
        ASSERT_EQ(rdm.getCodeBlockE(r), E);
        tx::Bits e;
        ASSERT_TRUE(tx::rateMatchTurbo(cw, E, rv, e));
        Streams out;
        ASSERT_TRUE(rdm.rateDematchData(idealSoftValues(e, length.A), out, r));
        EXPECT_EQ(checkStreams({&cw.d0, &cw.d1, &cw.d2}, out, length.A, E, real,
                               length.A * std::int32_t(length.passes) > 127),
                  "");
      }
    }
  }
}

TEST(KRateDeMatchRoundTrip, ConvolutionalCqiComesBackFromTheTransmitter) {
  std::mt19937 random(7);
  for (std::uint32_t O : {12u, 20u, 24u, 57u, 127u}) {
    const tx::ConvolutionalStreams d = tx::encodeTailBiting(randomBits(O + 8, random));
    const std::uint32_t real = 3 * (O + 8);
    for (const LengthCase& length : kLengths) {
      // Control fields need not fill whole symbols of this code: keep an odd length too.
      const std::uint32_t Q = length.passes * real + length.half * (real / 2 + 1) + length.extra;
      SCOPED_TRACE("O " + std::to_string(O) + " Q " + std::to_string(Q));
      KRateDeMatch rdm;
      ASSERT_TRUE(rdm.setModulationParams(Q, 2, 1, 0));
      ASSERT_TRUE(rdm.rmParams().setCQISize(O));
      ASSERT_TRUE(rdm.rmParams().setCQIQ(Q));
      const tx::Bits e = tx::rateMatchConvolutional(d, Q);
      SoftValues w, d0, d1, d2;
      ASSERT_TRUE(rdm.rateDematchConv(idealSoftValues(e, length.A), w, d0, d1, d2));
      EXPECT_EQ(w.size(), 3 * 32 * ((O + 8 + 31) / 32));
      EXPECT_EQ(checkStreams({&d[0], &d[1], &d[2]}, {d0, d1, d2}, length.A, Q, real,
                             length.A * std::int32_t(length.passes) > 127),
                "");
    }
  }
}

}  // namespace
}  // namespace brannoc::test
