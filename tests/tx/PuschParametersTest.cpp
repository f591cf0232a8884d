// PUSCH transmission parameters: coded control symbols from beta offsets (TS 36.212
// 5.2.2.6, TS 36.213 8.6.3) for worked cases with and without a transport block, the
// interleaver size, G and the rate-matched lengths per code block, and refused combinations.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "tx/PuschParameters.h"

namespace brannoc::tx {
namespace {

TEST(BetaOffsets, TableValuesInEighths) {
  struct Case {
    BetaTable table;
    std::uint32_t index;
    std::uint32_t eighths;
  } cases[] = {{BetaTable::Ack, 0, 16},   {BetaTable::Ack, 8, 101},  {BetaTable::Ack, 14, 1008},
               {BetaTable::Ack, 15, 0},   {BetaTable::Ri, 0, 10},    {BetaTable::Ri, 12, 160},
               {BetaTable::Ri, 13, 0},    {BetaTable::Cqi, 1, 0},    {BetaTable::Cqi, 2, 9},
               {BetaTable::Cqi, 15, 50},  {BetaTable::Cqi, 16, 0}};
  for (const Case& c : cases) {
    EXPECT_EQ(betaOffsetEighths(c.table, c.index), c.eighths) << static_cast<int>(c.table)
                                                              << " index " << c.index;
  }
}

struct Expected {
  std::uint32_t QprimeCqi, QprimeAck, QprimeRi, G, totalBits, C, Eminus, Eplus, Eidx, harq;
};

void expectFields(const PuschParameters& p, const Expected& e, const char* name) {
  PuschControlFields f;
  const TxOutcome outcome = derivePuschControlFields(p, f);
  ASSERT_TRUE(outcome.ok()) << name << ": " << outcome.text;
  EXPECT_EQ(f.QprimeCqi, e.QprimeCqi) << name;
  EXPECT_EQ(f.QprimeAck, e.QprimeAck) << name;
  EXPECT_EQ(f.QprimeRi, e.QprimeRi) << name;
  EXPECT_EQ(f.Qcqi, p.Qm * e.QprimeCqi) << name;
  EXPECT_EQ(f.Qack, p.Qm * e.QprimeAck) << name;
  EXPECT_EQ(f.Qri, p.Qm * e.QprimeRi) << name;
  EXPECT_EQ(f.G, e.G) << name;
  EXPECT_EQ(f.totalBits, e.totalBits) << name;
  EXPECT_EQ(f.totalBits, f.G + f.Qcqi + f.Qri) << name;
  EXPECT_EQ(f.totalBits, p.Qm * f.Rmux * f.Cmux) << name;
  EXPECT_EQ(f.Rmux, 12 * p.numPrb) << name;
  EXPECT_EQ(f.C, e.C) << name;
  EXPECT_EQ(f.Eminus, e.Eminus) << name;
  EXPECT_EQ(f.Eplus, e.Eplus) << name;
  EXPECT_EQ(f.Eidx, e.Eidx) << name;
  EXPECT_EQ(f.harqBufferLength, e.harq) << name;
  if (f.C > 0) {
    EXPECT_EQ((f.Eidx + 1) * f.Eminus + (f.C - f.Eidx - 1) * f.Eplus, f.G) << name;
  }
}

PuschParameters base(std::uint32_t numPrb, std::uint32_t Qm, std::uint32_t tbSize) {
  PuschParameters p;
  p.numPrb = numPrb;
  p.Qm = Qm;
  p.tbSize = tbSize;
  return p;
}

TEST(PuschParameters, WorkedCaseWithTransportBlock) {
  // 10 PRBs (M_sc 120), QPSK, normal CP (N_symb 12), 1000 bits: one block, K = 1024.
  // ACK 1 bit, beta 6.25: ceil(1 * 1440 * 6.25 / 1024) = ceil(8.79) = 9.
  // RI 2 bits, beta 2.5: ceil(2 * 1440 * 2.5 / 1024) = ceil(7.03) = 8.
  // CQI 20 bits + 8 CRC, beta 2.0: ceil(28 * 1440 * 2 / 1024) = ceil(78.75) = 79.
  // G = 2 * (1440 - 79 - 8) = 2706.
  PuschParameters p = base(10, 2, 1000);
  p.ackBits = 1;
  p.ack.betaIndex = 5;
  p.riBits = 2;
  p.ri.betaIndex = 3;
  p.cqiBits = 20;
  p.cqi.betaIndex = 7;
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
  PuschParameters p = base(2, 2, 0);
  p.cqiBits = 10;
  p.cqi.betaIndex = 9;
  p.ackBits = 2;
  p.ack.betaIndex = 3;
  p.riBits = 1;
  p.ri.betaIndex = 8;
  expectFields(p, {195, 93, 93, 0, 576, 0, 0, 0, 0, 0}, "control only");
  // A larger O_CQI-MIN lowers the ACK and RI shares: ceil(2 * 288 * 4 / 50) = 47, and 47.
  p.cqiMinBits = 20;
  expectFields(p, {241, 47, 47, 0, 576, 0, 0, 0, 0, 0}, "O_CQI-MIN 20");
  // A huge ACK beta is capped at 4 * M_sc = 96 symbols.
  p.ack.betaIndex = 14;
  expectFields(p, {241, 96, 47, 0, 576, 0, 0, 0, 0, 0}, "ACK capped");
}

TEST(PuschParameters, ExplicitCountsAndFieldsForTheDecoder) {
  PuschParameters p = base(6, 6, 2000);
  p.cp = CyclicPrefix::Extended;
  p.cqiBits = 30;
  p.cqi.codedSymbols = 100;
  p.ackBits = 2;
  p.ack.codedSymbols = 24;
  p.riBits = 1;
  p.ri.codedSymbols = 4 * 72;  // exactly the limit
  PuschControlFields f;
  ASSERT_TRUE(derivePuschControlFields(p, f).ok());
  EXPECT_EQ(f.Cmux, 10u);
  EXPECT_EQ(f.Rmux, 72u);
  EXPECT_EQ(f.qamIndex, 2u);
  EXPECT_EQ(f.cpIndex, 1u);
  EXPECT_EQ(f.contentMask, 15u);
  EXPECT_EQ(f.Qcqi, 600u);
  EXPECT_EQ(f.Qack, 144u);
  EXPECT_EQ(f.Qri, 1728u);
  EXPECT_EQ(f.G, 6 * (720 - 100 - 288));
}

TEST(PuschParameters, RefusedCombinations) {
  struct Case {
    const char* name;
    void (*change)(PuschParameters&);
    TxStatus status;
  } cases[] = {
      {"no PRB", [](PuschParameters& p) { p.numPrb = 0; }, TxStatus::InvalidParameter},
      {"111 PRBs", [](PuschParameters& p) { p.numPrb = 111; }, TxStatus::InvalidParameter},
      {"Qm 8", [](PuschParameters& p) { p.Qm = 8; }, TxStatus::InvalidParameter},
      {"rv 4", [](PuschParameters& p) { p.rv = 4; }, TxStatus::InvalidParameter},
      {"3 ACK bits", [](PuschParameters& p) { p.ackBits = 3; }, TxStatus::InvalidParameter},
      {"no data, no CQI",
       [](PuschParameters& p) {
         p.tbSize = 0;
         p.cqiBits = 0;
       },
       TxStatus::InvalidParameter},
      {"reserved ACK beta", [](PuschParameters& p) { p.ack.betaIndex = 15; },
       TxStatus::ReservedBetaIndex},
      {"reserved RI beta", [](PuschParameters& p) { p.ri.betaIndex = 13; },
       TxStatus::ReservedBetaIndex},
      {"reserved CQI beta", [](PuschParameters& p) { p.cqi.betaIndex = 1; },
       TxStatus::ReservedBetaIndex},
      {"ACK beta 16", [](PuschParameters& p) { p.ack.betaIndex = 16; },
       TxStatus::UnknownBetaIndex},
      {"ACK Q' beyond 4 M_sc", [](PuschParameters& p) { p.ack.codedSymbols = 4 * 12 + 1; },
       TxStatus::ControlTooLarge},
      {"RI Q' of 0", [](PuschParameters& p) { p.ri.codedSymbols = 0; },
       TxStatus::InvalidParameter},
      {"Q' for an absent field",
       [](PuschParameters& p) {
         p.riBits = 0;
         p.ri.codedSymbols = 3;
       },
       TxStatus::InvalidParameter},
      // RI takes ceil(144 * 1.25 / 128) = 2 of the 144 symbols.
      {"CQI beyond the resource", [](PuschParameters& p) { p.cqi.codedSymbols = 143; },
       TxStatus::ControlTooLarge},
      {"no data symbol left", [](PuschParameters& p) { p.cqi.codedSymbols = 142; },
       TxStatus::NoRoomForData},
      {"CQI report beyond the allocation", [](PuschParameters& p) { p.cqiBits = 289; },
       TxStatus::ControlTooLarge},
      {"control only with a CQI count",
       [](PuschParameters& p) {
         p.tbSize = 0;
         p.cqi.codedSymbols = 100;
       },
       TxStatus::ControlTooLarge},
  };
  for (const Case& c : cases) {
    PuschParameters p = base(1, 2, 100);
    p.cqiBits = 4;
    p.cqi.betaIndex = 5;
    p.ackBits = 1;
    p.ack.betaIndex = 0;
    p.riBits = 1;
    p.ri.betaIndex = 0;
    p.ri.codedSymbols.reset();
    c.change(p);
    PuschControlFields f;
    f.G = 1234;
    const TxOutcome outcome = derivePuschControlFields(p, f);
    EXPECT_EQ(outcome.status, c.status) << c.name << ": " << outcome.text;
    EXPECT_FALSE(outcome.text.empty()) << c.name;
    EXPECT_EQ(outcome.text.find('\n'), std::string::npos) << c.name;
    EXPECT_EQ(f.G, 0u) << c.name << " left stale fields";
  }
}

}  // namespace
}  // namespace brannoc::tx
