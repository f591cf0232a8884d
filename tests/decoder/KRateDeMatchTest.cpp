// Tests of KRateDeMatch: turbo rate dematching (TS 36.212 5.1.4.1), HARQ chase combining,
// convolutional CQI dematching (5.1.4.2) and ACK/RI/CQI soft combining, with 8:5
// saturation.
#include "KRateDeMatch.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <sstream>
#include <cctype>
#include <cstdlib>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "tx/ConvolutionalCode.h"
#include "tx/TurboEncoder.h"
#include "tx/TurboRateMatcher.h"

namespace {

namespace tx = brannoc::tx;
using brannoc::KRateDeMatch;
using brannoc::rateMatchParams;
using brannoc::segmentationParams;

using SoftValues = KRateDeMatch::SoftValues;
using Streams = KRateDeMatch::Streams;

// One code block, one layer, normal cyclic prefix: G = E.
void configure(KRateDeMatch& rdm, std::uint32_t tbSize, std::uint32_t G, std::uint32_t Qm = 2,
               std::uint32_t rv = 0) {
  ASSERT_TRUE(rdm.setModulationParams(G, Qm, 1, 0));
  ASSERT_TRUE(rdm.setParams(tbSize, G, Qm, rv, 1));
}

// "File: ../s/KRateDeMatch(<line>)" message, for the lines whose number is the statement's.
void expectNumberedLine(const std::string& captured, const std::string& message) {
  const std::string prefix = "File: ../s/KRateDeMatch(";
  ASSERT_EQ(captured.compare(0, prefix.size(), prefix), 0) << captured;
  std::size_t pos = prefix.size();
  const std::size_t digits = pos;
  while (pos < captured.size() && std::isdigit(static_cast<unsigned char>(captured[pos]))) {
    ++pos;
  }
  ASSERT_GT(pos, digits) << captured;
  EXPECT_EQ(captured.substr(pos), ")" + message + "\n");
}

// Transport block of 16 bits: one code block of K = 40 (D 44, R 2, Kpi 64, ND 20), no
// fillers: 132 real positions in the circular buffer.
constexpr std::uint32_t kTb40 = 16;
// Transport block of 8 bits: K = 40 with F = 8 fillers: 132 - 16 = 116 real positions.
constexpr std::uint32_t kTb40Fill8 = 8;

TEST(KRateDeMatchFactory, AcceptsOnlyEmptyProperties) {
  EXPECT_NE(KRateDeMatch::create(""), nullptr);
  testing::internal::CaptureStderr();
  EXPECT_EQ(KRateDeMatch::create("fast"), nullptr);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "ERROR:KRateDeMatch:Unexpected properties:fast\n");
}

TEST(KRateDeMatchTables, SmallestBlockHasTwentyDummiesPerStream) {
  KRateDeMatch rdm;
  configure(rdm, kTb40, 132);
  EXPECT_EQ(rdm.getCodeBlockBufferLength(0), 132u);
  EXPECT_EQ(rdm.getCodeBlockE(0), 132u);
  SoftValues nullMap, P, pi;
  ASSERT_TRUE(rdm.createInterleavingTables(0, 0, nullMap, P, pi));
  ASSERT_EQ(P.size(), 64u);
  ASSERT_EQ(pi.size(), 64u);
  ASSERT_EQ(nullMap.size(), 192u);
  // Column 0 of the permutation is input column 0: rows 0 and 1 give y0 (dummy) and y32.
  EXPECT_EQ(P[0], 0);
  EXPECT_EQ(P[1], 32);
  EXPECT_EQ(P[2], 16);
  EXPECT_EQ(nullMap[0], 1);
  EXPECT_EQ(nullMap[1], 0);
  int dummies[3] = {0, 0, 0};
  for (std::size_t k = 0; k < 64; ++k) {
    EXPECT_EQ(pi[k], (P[k] + 1) % 64) << k;
    dummies[0] += nullMap[k] == 1;
    dummies[1] += nullMap[64 + 2 * k] == 1;
    dummies[2] += nullMap[64 + 2 * k + 1] == 1;
  }
  EXPECT_EQ(dummies[0], 20);
  EXPECT_EQ(dummies[1], 20);
  EXPECT_EQ(dummies[2], 20);
}

TEST(KRateDeMatchData, FillersComeOutAsStrongestZeroInSystematicAndFirstParity) {
  KRateDeMatch rdm;
  configure(rdm, kTb40Fill8, 116);
  Streams out;
  ASSERT_TRUE(rdm.rateDematchData(SoftValues(116, 50), out, 0));
  ASSERT_EQ(out.size(), 3u);
  for (std::size_t s = 0; s < 3; ++s) {
    ASSERT_EQ(out[s].size(), 44u);
    for (std::size_t i = 0; i < 44; ++i) {
      const std::int32_t expected = (s < 2 && i < 8) ? -128 : 50;
      EXPECT_EQ(out[s][i], expected) << "stream " << s << " position " << i;
    }
  }
}

TEST(KRateDeMatchData, RepeatedPositionsAreSummedWithSaturation) {
  struct Case {
    std::int32_t in;
    std::int32_t expected;
  };
  // E = 264 = twice the 132 real positions: every position receives two soft values.
  for (const Case& c : {Case{100, 127}, Case{-100, -128}, Case{30, 60}, Case{-64, -128},
                        Case{300, 127}}) {
    KRateDeMatch rdm;
    configure(rdm, kTb40, 264);
    Streams out;
    ASSERT_TRUE(rdm.rateDematchData(SoftValues(264, c.in), out, 0));
    for (const SoftValues& stream : out) {
      for (std::int32_t v : stream) {
        ASSERT_EQ(v, c.expected) << "input " << c.in;
      }
    }
  }
}

TEST(KRateDeMatchData, RefusesBeforeParametersAndWrongInputLength) {
  KRateDeMatch fresh;
  Streams out;
  testing::internal::CaptureStderr();
  EXPECT_FALSE(fresh.rateDematchData(SoftValues(116, 0), out, 0));
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "Need to set RM parameters before calling RM data\n");

  KRateDeMatch rdm;
  configure(rdm, kTb40Fill8, 116);
  testing::internal::CaptureStderr();
  EXPECT_FALSE(rdm.rateDematchData(SoftValues(115, 0), out, 0));
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "LLR Input Size must be: 116\n");
  EXPECT_EQ(out, Streams(3));

  testing::internal::CaptureStderr();
  EXPECT_FALSE(rdm.rateDematchAndHARQ(SoftValues(115, 0), Streams(3, SoftValues(44)), out, 0));
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "LLR Input Size must be: 116\nERROR PERFORMING RATE DEMATCH\n");
}

TEST(KRateDeMatchData, SizeLinesOfTheDeinterleavers) {
  KRateDeMatch rdm;
  configure(rdm, kTb40, 132);
  SoftValues nullMap, P, pi, d0, d1, d2;
  ASSERT_TRUE(rdm.createInterleavingTables(0, 0, nullMap, P, pi));
  testing::internal::CaptureStderr();
  EXPECT_FALSE(rdm.deinterleaveData(SoftValues(191), nullMap, P, pi, d0, d1, d2, 0));
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "File: ../s/KRateDeMatch(276) llr's size should be:192  size is:191\n");

  // A filler mark in the second parity stream cannot come from segmentation.
  nullMap[64 + 2 * 10 + 1] = 2;
  testing::internal::CaptureStderr();
  EXPECT_FALSE(rdm.deinterleaveData(SoftValues(192), nullMap, P, pi, d0, d1, d2, 0));
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "File: ../s/KRateDeMatch(331) No segmentation fillers for p1. ????\n");

  ASSERT_TRUE(rdm.rmParams().setCQISize(20));
  ASSERT_TRUE(rdm.createConvInterleavingTables(1, nullMap, P));
  testing::internal::CaptureStderr();
  EXPECT_FALSE(rdm.deinterleaveConvData(SoftValues(95), nullMap, P, d0, d1, d2));
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "File: ../s/KRateDeMatch(361) llr's size should be:96  size is:95\n");
}

// Inconsistent inputs to the public steps fail with a line instead of reading or writing
// outside their vectors, or looping for ever.
TEST(KRateDeMatchData, InconsistentTablesAndStreamsFailCleanly) {
  KRateDeMatch rdm;
  configure(rdm, kTb40, 132);
  SoftValues nullMap, P, pi, d0, d1, d2, w;
  ASSERT_TRUE(rdm.createInterleavingTables(0, 0, nullMap, P, pi));

  const std::vector<std::pair<const char*, std::function<bool()>>> cases = {
      {"unknown column permutation",
       [&] {
         SoftValues m, p, q;
         return rdm.createInterleavingTables(2, 0, m, p, q);
       }},
      {"real mark on a dummy position",
       [&] {
         SoftValues m = nullMap;
         m[0] = 0;  // P[0] = 0 lies among the 20 dummies
         return rdm.deinterleaveData(SoftValues(192), m, P, pi, d0, d1, d2, 0);
       }},
      {"permutation shorter than the interleaver",
       [&] {
         return rdm.deinterleaveData(SoftValues(192), nullMap, SoftValues(10), pi, d0, d1, d2,
                                     0);
       }},
      {"buffer without real positions",
       [&] { return rdm.llrCollect(SoftValues(5, 1), SoftValues(192, 1), w, 0, 192, 5); }},
      {"null map shorter than the buffer",
       [&] { return rdm.llrCollect(SoftValues(5, 1), SoftValues(100), w, 0, 192, 5); }},
      {"HARQ input stream shorter than D",
       [&] {
         Streams harq(3, SoftValues(44));
         harq[2].pop_back();
         Streams out;
         return rdm.applyHARQ(harq, Streams(3, SoftValues(44)), out, 0);
       }},
      {"HARQ input with two streams",
       [&] {
         Streams out;
         return rdm.applyHARQ(Streams(2, SoftValues(44)), Streams(3, SoftValues(44)), out, 0);
       }},
  };
  for (const auto& [name, call] : cases) {
    testing::internal::CaptureStderr();
    EXPECT_FALSE(call()) << name;
    const std::string captured = testing::internal::GetCapturedStderr();
    EXPECT_EQ(captured.rfind("File: ../s/KRateDeMatch(", 0), 0u) << name << ": " << captured;
  }

  Streams out;
  Streams harq(3, SoftValues(44));
  harq[1].resize(43);
  testing::internal::CaptureStderr();
  EXPECT_FALSE(rdm.rateDematchAndHARQ(SoftValues(132), harq, out, 0));
  const std::string captured = testing::internal::GetCapturedStderr();
  EXPECT_NE(captured.find("\nERROR PERFORMING HARQ\n"), std::string::npos) << captured;
}

TEST(KRateDeMatchParams, ZeroModulationOrderIsAnInvalidCombination) {
  KRateDeMatch rdm;
  testing::internal::CaptureStderr();
  EXPECT_FALSE(rdm.setParams(16, 132, 0, 0, 1));
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "Invalid combination of parameters: tbsize, g, qm, rvidx, nlayers\n");
  Streams out;
  testing::internal::CaptureStderr();
  EXPECT_FALSE(rdm.rateDematchData(SoftValues(), out, 0));
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "Need to set RM parameters before calling RM data\n");
}

TEST(KRateDeMatchHarq, ChaseCombiningSaturatesTo8Point5) {
  struct Case {
    std::int32_t dematched, stored, expected;
  };
  const Case cases[] = {{127, 1, 127},   {-50, 20, -30}, {-128, -128, -128},
                        {200, 0, 127},   {-3, 3, 0},     {0, -129, -128}};
  KRateDeMatch rdm;
  configure(rdm, kTb40, 132);
  for (const Case& c : cases) {
    Streams out;
    ASSERT_TRUE(rdm.applyHARQ(Streams(3, SoftValues(44, c.stored)),
                              Streams(3, SoftValues(44, c.dematched)), out, 0));
    EXPECT_EQ(out, Streams(3, SoftValues(44, c.expected)))
        << c.dematched << " + " << c.stored;
  }
}

TEST(KRateDeMatchHarq, DematchAndCombineInOneCall) {
  KRateDeMatch rdm;
  configure(rdm, kTb40Fill8, 116);
  Streams out;
  ASSERT_TRUE(rdm.rateDematchAndHARQ(SoftValues(116, 50), Streams(3, SoftValues(44, 100)), out,
                                     0));
  // Fillers: -128 + 100; data: 50 + 100 saturates.
  EXPECT_EQ(out[0][0], -28);
  EXPECT_EQ(out[1][7], -28);
  EXPECT_EQ(out[0][8], 127);
  EXPECT_EQ(out[2][0], 127);
}

TEST(KRateDeMatchConv, TwentyBitCqiUsesOneRowOfThirtyTwoColumns) {
  KRateDeMatch rdm;
  ASSERT_TRUE(rdm.setModulationParams(84, 2, 1, 0));
  ASSERT_TRUE(rdm.rmParams().setCQISize(20));
  ASSERT_TRUE(rdm.rmParams().setCQIQ(84));
  // D 28, R 1, Kpi 32, ND 4: 84 real positions; soft value m + 1 at the m-th of them.
  SoftValues in(84);
  for (std::size_t m = 0; m < in.size(); ++m) {
    in[m] = static_cast<std::int32_t>(m) + 1;
  }
  SoftValues w, d0, d1, d2;
  ASSERT_TRUE(rdm.rateDematchConv(in, w, d0, d1, d2));
  ASSERT_EQ(w.size(), 96u);
  ASSERT_EQ(d0.size(), 28u);
  ASSERT_EQ(d1.size(), 28u);
  ASSERT_EQ(d2.size(), 28u);
  // Columns 1, 3, 0, 2 (output positions 0, 8, 16, 24 of each stream) hold the dummies.
  for (std::size_t s = 0; s < 3; ++s) {
    for (std::size_t k : {0u, 8u, 16u, 24u}) {
      EXPECT_EQ(w[32 * s + k], 0) << s << " " << k;
    }
  }
  EXPECT_EQ(w[1], 1);
  EXPECT_EQ(d0[17 - 4], 1);  // output position 1 reads input column 17
  std::vector<int> seen(85, 0);
  for (const SoftValues* d : {&d0, &d1, &d2}) {
    for (std::int32_t v : *d) {
      ASSERT_GE(v, 1);
      ASSERT_LE(v, 84);
      ++seen[static_cast<std::size_t>(v)];
    }
  }
  for (std::size_t v = 1; v <= 84; ++v) {
    EXPECT_EQ(seen[v], 1) << v;
  }

  testing::internal::CaptureStderr();
  EXPECT_FALSE(rdm.rateDematchConv(SoftValues(83), w, d0, d1, d2));
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "LLR Input Size must be: 84\n");
  KRateDeMatch fresh;
  testing::internal::CaptureStderr();
  EXPECT_FALSE(fresh.rateDematchConv(SoftValues(), w, d0, d1, d2));
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "Need to set RM parameters before calling RM data\n");
}

// ACK, RI and short-CQI accumulators.
struct UciCase {
  const char* name;
  char field;  // 'A' ACK, 'R' RI, 'C' CQI
  std::uint32_t size, Qm;
  SoftValues in;
  SoftValues expected;
};

TEST(KRateDeMatchUci, RepetitionsAreSummedOntoOneCodedBlock) {
  SoftValues ramp24(24);
  SoftValues rampSums(12);
  for (std::size_t i = 0; i < 24; ++i) {
    ramp24[i] = static_cast<std::int32_t>(i);
  }
  for (std::size_t j = 0; j < 12; ++j) {
    rampSums[j] = static_cast<std::int32_t>(2 * j + 12);
  }
  SoftValues cqi70Expected(32, 2);
  std::fill(cqi70Expected.begin(), cqi70Expected.begin() + 6, 3);
  SoftValues cqi20Expected(32, 0);
  std::fill(cqi20Expected.begin(), cqi20Expected.begin() + 20, -5);

  const UciCase cases[] = {
      {"1-bit ACK, Qm 2", 'A', 1, 2, {10, -20, 30, 5}, {40, -15}},
      {"1-bit ACK saturates high", 'A', 1, 2, SoftValues(8, 100), {127, 127}},
      {"1-bit RI saturates low", 'R', 1, 2, SoftValues(8, -100), {-128, -128}},
      {"input clamped before the sum", 'A', 1, 4, {300, -300, 0, 1}, {127, -128, 0, 1}},
      {"2-bit RI, Qm 4", 'R', 2, 4, ramp24, rampSums},
      {"2-bit ACK, Qm 6", 'A', 2, 6, SoftValues(36, 7), SoftValues(18, 14)},
      {"CQI of 70 soft values", 'C', 5, 2, SoftValues(70, 1), cqi70Expected},
      {"CQI of 20 soft values leaves 12 positions 0", 'C', 5, 2, SoftValues(20, -5),
       cqi20Expected},
      {"CQI saturates", 'C', 5, 2, SoftValues(64, 127), SoftValues(32, 127)},
  };
  for (const UciCase& c : cases) {
    KRateDeMatch rdm;
    ASSERT_TRUE(rdm.setModulationParams(100, c.Qm, 1, 0));
    rateMatchParams& params = rdm.rmParams();
    const auto Q = static_cast<std::uint32_t>(c.in.size());
    SoftValues combined;
    bool ok = false;
    if (c.field == 'A') {
      ASSERT_TRUE(params.setACKSize(c.size) && params.setACKQ(Q));
      ok = rdm.rateDematchACK(c.in, combined);
    } else if (c.field == 'R') {
      ASSERT_TRUE(params.setRISize(c.size) && params.setRIQ(Q));
      ok = rdm.rateDematchRI(c.in, combined);
    } else {
      ASSERT_TRUE(params.setCQISize(c.size) && params.setCQIQ(Q));
      ok = rdm.rateDematchCQI(c.in, combined);
    }
    EXPECT_TRUE(ok) << c.name;
    EXPECT_EQ(combined, c.expected) << c.name;
  }
}

TEST(KRateDeMatchUci, RefusalsNameTheMissingOrWrongParameter) {
  struct Case {
    const char* name;
    std::uint32_t Qm, size, Q, inputs;
    char field;
    const char* message;
  };
  const Case cases[] = {
      {"RI_Q 0", 2, 1, 0, 0, 'R', "Need to set RI_Q parameter before calling RM data"},
      {"ACK_Q 0", 2, 1, 0, 0, 'A', "Need to set ACK_Q parameter before calling RM data"},
      {"CQI_Q 0", 2, 4, 0, 0, 'C', "Need to set CQI_Q parameter before calling RM data"},
      {"RI input longer", 2, 1, 8, 9, 'R', "RI DataIn size must match RI_Q"},
      {"ACK input shorter", 2, 1, 8, 7, 'A', "ACK DataIn size must match ACK_Q"},
      {"CQI input longer", 2, 4, 40, 41, 'C', "CQI DataIn size must match CQI_Q"},
      {"RI size 0", 2, 0, 8, 8, 'R', "RI size must be either 1 or 2 = 0"},
      {"ACK size 0", 2, 0, 8, 8, 'A', "ACK size must be either 1 or 2"},
      {"Qm 0", 0, 1, 8, 8, 'A', " modulation order is 0: no positions to combine on"},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    KRateDeMatch rdm;
    ASSERT_TRUE(rdm.setModulationParams(100, c.Qm, 1, 0));
    rateMatchParams& params = rdm.rmParams();
    SoftValues combined;
    const SoftValues in(c.inputs, 1);
    testing::internal::CaptureStderr();
    bool ok = true;
    if (c.field == 'A') {
      params.setACKSize(c.size);
      params.setACKQ(c.Q);
      ok = rdm.rateDematchACK(in, combined);
    } else if (c.field == 'R') {
      params.setRISize(c.size);
      params.setRIQ(c.Q);
      ok = rdm.rateDematchRI(in, combined);
    } else {
      params.setCQISize(c.size);
      params.setCQIQ(c.Q);
      ok = rdm.rateDematchCQI(in, combined);
    }
    EXPECT_FALSE(ok);
    expectNumberedLine(testing::internal::GetCapturedStderr(), c.message);
  }

  KRateDeMatch fresh;
  SoftValues combined;
  for (const auto& call : std::vector<std::function<bool()>>{
           [&] { return fresh.rateDematchRI({}, combined); },
           [&] { return fresh.rateDematchACK({}, combined); },
           [&] { return fresh.rateDematchCQI({}, combined); }}) {
    testing::internal::CaptureStderr();
    EXPECT_FALSE(call());
    expectNumberedLine(testing::internal::GetCapturedStderr(),
                       "Need to set RM parameters before calling RM data");
  }
}

// Round trips: bits rate-matched by the transmitter, sent as ideal soft values (+A for 1,
// -A for 0), dematched. Each stream position must come back as A times the number of times
// it was sent, with the sign of its bit: a misplaced soft value shows as a sign mismatch
// (random bits), a wrong count as a broken distribution. Over the whole buffer the counts
// add up to E and differ by at most one (the transmitter reads the circular buffer round and
// round). With amplitude 100 and E twice the real positions every value saturates.
struct RoundTripCheck {
  std::int32_t A;
  std::uint32_t E;
  std::uint32_t realPositions;
  bool saturating;
};

std::string checkStreams(const std::vector<const tx::Bits*>& sent, const Streams& out,
                         const RoundTripCheck& c) {
  std::ostringstream problems;
  if (out.size() != sent.size()) {
    return "wrong number of streams";
  }
  std::vector<std::uint32_t> histogram(8, 0);
  std::uint64_t total = 0;
  int mismatches = 0;
  for (std::size_t s = 0; s < sent.size(); ++s) {
    const tx::Bits& bits = *sent[s];
    if (out[s].size() != bits.size()) {
      return "stream " + std::to_string(s) + " has " + std::to_string(out[s].size()) +
             " values for " + std::to_string(bits.size()) + " bits";
    }
    for (std::size_t i = 0; i < bits.size(); ++i) {
      const std::int32_t v = out[s][i];
      if (bits[i] == tx::kNullBit) {
        if (v != -128 && mismatches++ < 5) {
          problems << " filler d" << s << "[" << i << "]=" << v;
        }
        continue;
      }
      const bool one = bits[i] == 1;
      if (c.saturating) {
        if (v != (one ? 127 : -128) && mismatches++ < 5) {
          problems << " d" << s << "[" << i << "]=" << v;
        }
        continue;
      }
      const bool signOk = v == 0 || (v > 0) == one;
      if (!signOk || v % c.A != 0 || std::abs(v / c.A) >= 8) {
        if (mismatches++ < 5) {
          problems << " d" << s << "[" << i << "]=" << v << " bit " << int{bits[i]};
        }
        continue;
      }
      ++histogram[static_cast<std::size_t>(std::abs(v / c.A))];
      total += static_cast<std::uint64_t>(std::abs(v / c.A));
    }
  }
  if (mismatches > 0) {
    problems << " (" << mismatches << " wrong values)";
    return problems.str();
  }
  if (c.saturating) {
    return "";
  }
  const std::uint32_t low = c.E / c.realPositions;
  const std::uint32_t highCount = c.E % c.realPositions;
  std::vector<std::uint32_t> expected(8, 0);
  expected[low] = c.realPositions - highCount;
  if (highCount > 0) {
    expected[low + 1] = highCount;
  }
  if (total != c.E || histogram != expected) {
    problems << " counts add up to " << total << " for E " << c.E << "; positions sent";
    for (std::size_t n = 0; n < histogram.size(); ++n) {
      problems << " " << n << "x:" << histogram[n] << "/" << expected[n];
    }
  }
  return problems.str();
}

SoftValues idealSoftValues(const tx::Bits& e, std::int32_t A) {
  SoftValues in(e.size());
  for (std::size_t m = 0; m < e.size(); ++m) {
    in[m] = e[m] == 1 ? A : -A;
  }
  return in;
}

// Transmit lengths relative to the real positions of the buffer: half, all, all twice plus
// a few more, and twice with saturating amplitude.
struct LengthCase {
  const char* name;
  std::uint32_t twice;   // whole passes over the buffer
  std::uint32_t half;    // 1: add half a pass
  std::uint32_t extra;   // further positions
  std::int32_t A;
};
constexpr LengthCase kLengths[] = {
    {"half the buffer", 0, 1, 0, 8},
    {"the whole buffer", 1, 0, 0, 8},
    {"two passes and more", 2, 0, 38, 8},
    {"two passes saturating", 2, 0, 0, 100},
};

std::uint32_t evenLength(const LengthCase& l, std::uint32_t real) {
  const std::uint32_t E = l.twice * real + l.half * (real / 2) + l.extra;
  return E & ~1u;  // QPSK: whole modulation symbols
}

TEST(KRateDeMatchRoundTrip, TurboCodeBlocksComeBackFromTheTransmitter) {
  struct Block {
    std::uint32_t tbSize;
    std::uint32_t r;
  };
  // K 40, K 40 with 8 fillers, 104, 528 (8 fillers), 1056, 2048 (24 fillers), 4032 (8
  // fillers), 6144, and both blocks of a two-block transport block (K- 3072 with 15
  // fillers, K+ 3136).
  const Block blocks[] = {{16, 0},   {8, 0},    {80, 0},   {496, 0},  {1032, 0},
                          {2000, 0}, {4000, 0}, {6120, 0}, {6121, 0}, {6121, 1}};
  std::mt19937 random(20240611);
  for (const Block& block : blocks) {
    KRateDeMatch rdm;
    configure(rdm, block.tbSize, 1000);
    const segmentationParams seg = rdm.getRMParams().seg;
    const std::uint32_t K = seg.blockSize(block.r);
    const std::uint32_t F = block.r == 0 ? seg.F : 0;
    tx::Bits c(K);
    for (std::uint32_t i = 0; i < K; ++i) {
      c[i] = i < F ? tx::kNullBit : static_cast<std::uint8_t>(random() & 1u);
    }
    tx::TurboCodeword cw;
    ASSERT_TRUE(tx::turboEncode(c, cw)) << K;
    const std::uint32_t real = 3 * (K + 4) - 2 * F;
    for (const LengthCase& length : kLengths) {
      const std::uint32_t E = evenLength(length, real);
      for (std::uint32_t rv = 0; rv < 4; ++rv) {
        SCOPED_TRACE("K " + std::to_string(K) + " F " + std::to_string(F) + " block " +
                     std::to_string(block.r) + " rv " + std::to_string(rv) + ", " +
                     length.name + " (E " + std::to_string(E) + ")");
        configure(rdm, block.tbSize, E * seg.C, 2, rv);
        ASSERT_EQ(rdm.getCodeBlockE(block.r), E);
        tx::Bits e;
        ASSERT_TRUE(tx::rateMatchTurbo(cw, E, rv, e));
        Streams out;
        ASSERT_TRUE(rdm.rateDematchData(idealSoftValues(e, length.A), out, block.r));
        const bool saturating = length.A * static_cast<std::int32_t>(length.twice) > 127;
        EXPECT_EQ(checkStreams({&cw.d0, &cw.d1, &cw.d2}, out,
                               {length.A, E, real, saturating}),
                  "");
      }
    }
  }
}

TEST(KRateDeMatchRoundTrip, ConvolutionalCqiComesBackFromTheTransmitter) {
  std::mt19937 random(7);
  for (std::uint32_t O : {12u, 20u, 24u, 57u, 127u}) {
    tx::Bits c(O + 8);
    for (auto& bit : c) {
      bit = static_cast<std::uint8_t>(random() & 1u);
    }
    const tx::ConvolutionalStreams d = tx::encodeTailBiting(c);
    const std::uint32_t real = 3 * (O + 8);
    for (const LengthCase& length : kLengths) {
      // Control fields need not fill whole symbols of this code: keep an odd length too.
      const std::uint32_t Q = length.twice * real + length.half * (real / 2 + 1) + length.extra;
      SCOPED_TRACE("O " + std::to_string(O) + ", " + length.name);
      KRateDeMatch rdm;
      ASSERT_TRUE(rdm.setModulationParams(Q, 2, 1, 0));
      ASSERT_TRUE(rdm.rmParams().setCQISize(O));
      ASSERT_TRUE(rdm.rmParams().setCQIQ(Q));
      const tx::Bits e = tx::rateMatchConvolutional(d, Q);
      ASSERT_EQ(e.size(), Q);
      SoftValues w, d0, d1, d2;
      ASSERT_TRUE(rdm.rateDematchConv(idealSoftValues(e, length.A), w, d0, d1, d2));
      const std::uint32_t Kpi = 32 * ((O + 8 + 31) / 32);
      EXPECT_EQ(w.size(), 3 * Kpi);
      const bool saturating = length.A * static_cast<std::int32_t>(length.twice) > 127;
      EXPECT_EQ(checkStreams({&d[0], &d[1], &d[2]}, {d0, d1, d2},
                             {length.A, Q, real, saturating}),
                "");
    }
  }
}

}  // namespace
