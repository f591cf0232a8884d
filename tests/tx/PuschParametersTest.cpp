// PUSCH transmission parameters: coded control symbols from beta offsets (TS 36.212
// 5.2.2.6, TS 36.213 8.6.3) for worked cases with and without a transport block, the
// interleaver size, G and the rate-matched lengths per code block, and refused combinations.
#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <string>
#include <tuple>

#include "tx/PuschParameters.h"

namespace brannoc::tx {
namespace {

// Q'_CQI, Q'_ACK, Q'_RI, G, total bits, C, E-, E+, Eidx, HARQ buffer length.
using Figures = std::array<std::uint32_t, 10>;

void expectFields(const PuschParameters& p, const Figures& expected, const char* name) {
  PuschControlFields f;
  const TxOutcome outcome = derivePuschControlFields(p, f);
  ASSERT_TRUE(outcome.ok()) << name << ": " << outcome.text;
  EXPECT_EQ((Figures{f.QprimeCqi, f.QprimeAck, f.QprimeRi, f.G, f.totalBits, f.C, f.Eminus,
                     f.Eplus, f.Eidx, f.harqBufferLength}),
            expected)
      << name;
  EXPECT_TRUE(f.Qcqi == p.Qm * f.QprimeCqi && f.Qack == p.Qm * f.QprimeAck &&
              f.Qri == p.Qm * f.QprimeRi)
      << name;
  EXPECT_TRUE(f.totalBits == f.G + f.Qcqi + f.Qri && f.totalBits == p.Qm * f.Rmux * f.Cmux &&
              f.Rmux == 12 * p.numPrb)
      << name;
  if (f.C > 0) {
    EXPECT_EQ((f.Eidx + 1) * f.Eminus + (f.C - f.Eidx - 1) * f.Eplus, f.G) << name;
  }
}

// Control fields given as {bits, beta-offset index}.
PuschParameters base(std::uint32_t numPrb, std::uint32_t Qm, std::uint32_t tbSize,
                     std::array<std::uint32_t, 2> cqi = {}, std::array<std::uint32_t, 2> ack = {},
                     std::array<std::uint32_t, 2> ri = {}) {
  PuschParameters p;
  p.numPrb = numPrb;
  p.Qm = Qm;
  p.tbSize = tbSize;
  std::tie(p.cqiBits, p.cqi.betaIndex) = std::pair(cqi[0], cqi[1]);
  std::tie(p.ackBits, p.ack.betaIndex) = std::pair(ack[0], ack[1]);
  std::tie(p.riBits, p.ri.betaIndex) = std::pair(ri[0], ri[1]);
  return p;
}

TEST(PuschParameters, WorkedCaseWithTransportBlock) {
  // 10 PRBs (M_sc 120), QPSK, normal CP (N_symb 12), 1000 bits: one block, K = 1024.
  // ACK 1 bit, beta 6.25: ceil(1 * 1440 * 6.25 / 1024) = ceil(8.79) = 9.
  // RI 2 bits, beta 2.5: ceil(2 * 1440 * 2.5 / 1024) = ceil(7.03) = 8.
  // CQI 20 bits + 8 CRC, beta 2.0: ceil(28 * 1440 * 2 / 1024) = ceil(78.75) = 79.
  // G = 2 * (1440 - 79 - 8) = 2706.
  PuschParameters p = base(10, 2, 1000, {20, 7}, {1, 5}, {2, 3});
  expectFields(p, {79, 9, 8, 2706, 2880, 1, 2706, 2706, 0, 1028}, "worked case");

  // The same report of 11 bits takes the block code: no CRC, ceil(11 * 1440 * 2 / 1024) = 31.
  p.cqiBits = 11;
  expectFields(p, {31, 9, 8, 2 * (1440 - 31 - 8), 2880, 1, 2802, 2802, 0, 1028}, "11-bit CQI");

  // Initial transmission on 5 PRBs: the formulas scale with M_sc-initial = 60.
  // ACK: ceil(720 * 6.25 / 1024) = 5; RI: ceil(2 * 720 * 2.5 / 1024) = 4;
  // CQI: ceil(11 * 720 * 2 / 1024) = 16.
  p.initialNumPrb = 5;
  expectFields(p, {16, 5, 4, 2 * (1440 - 16 - 4), 2880, 1, 2840, 2840, 0, 1028}, "initial");
}

TEST(PuschParameters, RateMatchedLengthsChangeAtCMinusGammaMinusOne) {
  // 6121 bits: two blocks (K- 3072, K+ 3136). 50 PRBs, 16QAM: 7200 symbols.
  PuschParameters p = base(50, 4, 6121);
  expectFields(p, {0, 0, 0, 28800, 28800, 2, 14400, 14400, 1, 3076 + 3140}, "even split");
  // One RI symbol leaves G' = 7199 = 2 * 3599 + 1: gamma 1, block 0 short, block 1 long.
  p.riBits = 1;
  p.ri.codedSymbols = 1;
  expectFields(p, {0, 0, 1, 28796, 28800, 2, 14396, 14400, 0, 3076 + 3140}, "gamma 1");
}

TEST(PuschParameters, ControlOnly) {
  // 2 PRBs (M_sc 24, 288 symbols), QPSK, CQI 10 bits with beta_CQI 2.5; O_CQI-MIN = 10.
  // ACK 2 bits, beta 4.0: ceil(2 * 288 * 4.0 / (10 * 2.5)) = ceil(92.16) = 93 (cap 96).
  // RI 1 bit, beta 8.0: ceil(288 * 8.0 / 25) = ceil(92.16) = 93. CQI: 288 - 93 = 195.
  PuschParameters p = base(2, 2, 0, {10, 9}, {2, 3}, {1, 8});
  expectFields(p, {195, 93, 93, 0, 576, 0, 0, 0, 0, 0}, "control only");
  // A larger O_CQI-MIN lowers the ACK and RI shares: ceil(2 * 288 * 4 / 50) = 47, and 47.
  p.cqiMinBits = 20;
  expectFields(p, {241, 47, 47, 0, 576, 0, 0, 0, 0, 0}, "O_CQI-MIN 20");
  // A huge ACK beta is capped at 4 * M_sc = 96 symbols.
  p.ack.betaIndex = 14;
  expectFields(p, {241, 96, 47, 0, 576, 0, 0, 0, 0, 0}, "ACK capped");
}

TEST(PuschParameters, ExplicitCountsAndFieldsForTheDecoder) {
  PuschParameters p = base(6, 6, 2000, {30}, {2}, {1});
  p.cp = CyclicPrefix::Extended;
  p.cqi.codedSymbols = 100;
  p.ack.codedSymbols = 24;
  p.ri.codedSymbols = 4 * 72;  // exactly the limit
  PuschControlFields f;
  ASSERT_TRUE(derivePuschControlFields(p, f).ok());
  // Cmux, Rmux, qamIndex, cpIndex, contentMask, Q_CQI, Q_ACK, Q_RI, G.
  EXPECT_EQ((std::array<std::uint32_t, 9>{f.Cmux, f.Rmux, f.qamIndex, f.cpIndex, f.contentMask,
                                          f.Qcqi, f.Qack, f.Qri, f.G}),
            (std::array<std::uint32_t, 9>{10, 72, 2, 1, 15, 600, 144, 1728, 6 * 332}));
}

TEST(PuschParameters, RefusedCombinations) {
  using P = PuschParameters&;
  const struct {
    const char* name;
    void (*change)(PuschParameters&);
    TxStatus status;
  } cases[] = {
      {"111 PRBs", [](P p) { p.numPrb = 111; }, TxStatus::InvalidParameter},
      {"Qm 8", [](P p) { p.Qm = 8; }, TxStatus::InvalidParameter},
      {"3 ACK bits", [](P p) { p.ackBits = 3; }, TxStatus::InvalidParameter},
      {"no data, no CQI", [](P p) { p.tbSize = p.cqiBits = 0; }, TxStatus::InvalidParameter},
      {"reserved ACK beta", [](P p) { p.ack.betaIndex = 15; }, TxStatus::ReservedBetaIndex},
      {"reserved CQI beta", [](P p) { p.cqi.betaIndex = 1; }, TxStatus::ReservedBetaIndex},
      {"ACK beta 16", [](P p) { p.ack.betaIndex = 16; }, TxStatus::UnknownBetaIndex},
      {"ACK Q' beyond 4 M_sc", [](P p) { p.ack.codedSymbols = 49; }, TxStatus::ControlTooLarge},
      {"Q' for an absent field", [](P p) { p.riBits = 0, p.ri.codedSymbols = 3; },
       TxStatus::InvalidParameter},
      // RI takes ceil(144 * 1.25 / 128) = 2 of the 144 symbols.
      {"CQI beyond the resource", [](P p) { p.cqi.codedSymbols = 143; },
       TxStatus::ControlTooLarge},
      {"no data symbol left", [](P p) { p.cqi.codedSymbols = 142; }, TxStatus::NoRoomForData},
  };
  for (const auto& c : cases) {
    PuschParameters p = base(1, 2, 100, {4, 5}, {1, 0}, {1, 0});
    c.change(p);
    PuschControlFields f;
    f.G = 1234;
    const TxOutcome outcome = derivePuschControlFields(p, f);
    EXPECT_EQ(outcome.status, c.status) << c.name << ": " << outcome.text;
    EXPECT_TRUE(!outcome.text.empty() && outcome.text.find('\n') == std::string::npos) << c.name;
    EXPECT_EQ(f.G, 0u) << c.name << " left stale fields";
  }
}

}  // namespace
}  // namespace brannoc::tx
