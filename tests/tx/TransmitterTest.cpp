// PUSCH and PUCCH transmitters end to end: lengths, where the coded control bits end up in
// the interleaver readout, placeholder soft values, and refused payloads.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "tx/ChannelInterleaver.h"
#include "tx/PucchTransmitter.h"
#include "tx/PuschTransmitter.h"
#include "tx/ReedMullerCode.h"

namespace brannoc::tx {
namespace {

Bits patternBits(std::size_t length, std::uint32_t salt) {
  Bits bits(length);
  for (std::size_t i = 0; i < length; ++i) bits[i] = ((i * 13 + salt + i / 5) % 7) < 3 ? 1 : 0;
  return bits;
}

struct Scenario {
  const char* name;
  std::uint32_t numPrb, Qm;
  CyclicPrefix cp;
  std::uint32_t tbSize, cqiBits, ackBits, riBits;
};

TEST(PuschTransmitter, ControlBitsSitInTheirCellsAndPlaceholdersAreZero) {
  const Scenario scenarios[] = {
      {"QPSK normal CP, data + all UCI", 2, 2, CyclicPrefix::Normal, 256, 20, 2, 1},
      {"16QAM extended CP, data + ACK", 3, 4, CyclicPrefix::Extended, 1000, 0, 1, 2},
      {"64QAM normal CP, two code blocks", 30, 6, CyclicPrefix::Normal, 8000, 11, 2, 2},
      {"QPSK control only", 1, 2, CyclicPrefix::Normal, 0, 30, 1, 1},
  };
  for (const Scenario& s : scenarios) {
    PuschParameters p;
    p.numPrb = s.numPrb;
    p.Qm = s.Qm;
    p.cp = s.cp;
    p.tbSize = s.tbSize;
    p.cqiBits = s.cqiBits;
    p.ackBits = s.ackBits;
    p.riBits = s.riBits;
    p.cqi.betaIndex = 8;
    p.ack.betaIndex = 5;
    p.ri.betaIndex = 5;
    const PuschPayload payload = {patternBits(s.tbSize, 1), patternBits(s.cqiBits, 2),
                                  patternBits(s.ackBits, 3), patternBits(s.riBits, 4)};
    ChannelSettings channel;
    channel.idealAmplitude = 40;
    PuschTransmission tx;
    const TxOutcome outcome = transmitPusch(p, payload, channel, tx);
    ASSERT_TRUE(outcome.ok()) << s.name << ": " << outcome.text;
    const PuschControlFields& f = tx.fields;
    ASSERT_EQ(tx.codedBits.size(), f.totalBits) << s.name;
    ASSERT_EQ(tx.softValues.size(), f.totalBits) << s.name;
    EXPECT_EQ(tx.f.size(), f.G) << s.name;
    EXPECT_EQ(tx.qCqi.size(), f.Qcqi) << s.name;
    EXPECT_EQ(tx.qAck.size(), f.Qack) << s.name;
    EXPECT_EQ(tx.qRi.size(), f.Qri) << s.name;

    // Symbol i of ACK (RI) sits in its cell of the matrix, read out column by column.
    auto checkControl = [&](const Bits& q, const std::array<std::uint32_t, 4>& set,
                            const char* field) {
      for (std::uint32_t i = 0; i < q.size() / s.Qm; ++i) {
        const MatrixCell cell = controlSymbolCell(i, f.Rmux, set);
        const std::size_t first =
            (static_cast<std::size_t>(cell.column) * f.Rmux + cell.row) * s.Qm;
        for (std::uint32_t k = 0; k < s.Qm; ++k) {
          ASSERT_EQ(tx.codedBits[first + k], q[i * s.Qm + k]) << s.name << " " << field << i;
        }
      }
    };
    checkControl(tx.qAck, ackColumnSet(s.cp), "ACK symbol ");
    checkControl(tx.qRi, riColumnSet(s.cp), "RI symbol ");

    std::size_t placeholders = 0;
    for (std::size_t n = 0; n < tx.codedBits.size(); ++n) {
      const std::uint8_t bit = tx.codedBits[n];
      const std::int32_t expected = bit == kPlaceholderBit ? 0 : bit == 1 ? 40 : -40;
      ASSERT_EQ(tx.softValues[n], expected) << s.name << " position " << n;
      placeholders += bit == kPlaceholderBit;
    }
    // x placeholders come from ACK and RI only: Qm - 2 of every Qm bits for one-bit
    // fields, 3 (Qm - 2) of every 3 Qm bits for two-bit fields.
    const std::size_t expectedPlaceholders = (f.Qack + f.Qri) / s.Qm * (s.Qm - 2);
    EXPECT_EQ(placeholders, expectedPlaceholders) << s.name;
  }
}

TEST(PuschTransmitter, RefusesPayloadsThatDoNotMatch) {
  PuschParameters p;
  p.numPrb = 1;
  p.tbSize = 100;
  p.ackBits = 1;
  PuschTransmission tx;
  tx.codedBits.assign(5, 1);
  EXPECT_EQ(transmitPusch(p, {Bits(100, 0), {}, {}, {}}, {}, tx).status,
            TxStatus::PayloadMismatch);
  EXPECT_TRUE(tx.codedBits.empty());
  EXPECT_EQ(transmitPusch(p, {Bits(100, 2), {}, {1}, {}}, {}, tx).status,
            TxStatus::InvalidParameter);
  ChannelSettings bad;
  bad.mode = ChannelMode::Awgn;
  bad.llrScale = 0.0;
  EXPECT_EQ(transmitPusch(p, {Bits(100, 0), {}, {1}, {}}, bad, tx).status,
            TxStatus::InvalidParameter);
  EXPECT_TRUE(transmitPusch(p, {Bits(100, 0), {}, {1}, {}}, {}, tx).ok());
}

TEST(PucchTransmitter, CodedBitsAndSoftValues) {
  const Bits cqi = patternBits(10, 5);
  const Bits ack = {1, 0};
  ChannelSettings channel;
  PucchTransmission tx;
  ASSERT_TRUE(transmitPucch(cqi, ack, CyclicPrefix::Normal, channel, tx).ok());
  ASSERT_EQ(tx.codedBits.size(), 22u);
  EXPECT_EQ(Bits(tx.codedBits.begin(), tx.codedBits.begin() + 20), encodeRm20(cqi));
  EXPECT_EQ(tx.softValues[20], 64);
  EXPECT_EQ(tx.softValues[21], -64);

  channel.mode = ChannelMode::Awgn;
  channel.esN0Db = 25.0;
  channel.llrScale = 0.02;
  for (const Bits& ackBits : {Bits{}, Bits{1}, Bits{0, 1}}) {
    ASSERT_TRUE(transmitPucch(cqi, ackBits, CyclicPrefix::Normal, channel, tx).ok());
    ASSERT_EQ(tx.softValues.size(), 20 + ackBits.size());
    for (std::size_t n = 0; n < tx.codedBits.size(); ++n) {
      EXPECT_EQ(tx.softValues[n] > 0, tx.codedBits[n] == 1) << n;
    }
    ASSERT_TRUE(transmitPucch({}, ackBits.empty() ? Bits{1} : ackBits, CyclicPrefix::Extended,
                              channel, tx)
                    .ok());
    for (std::size_t n = 0; n < tx.codedBits.size(); ++n) {
      EXPECT_EQ(tx.softValues[n] > 0, tx.codedBits[n] == 1) << "ACK alone " << n;
    }
  }
  EXPECT_EQ(transmitPucch(patternBits(12, 1), ack, CyclicPrefix::Extended, channel, tx).status,
            TxStatus::InvalidParameter);
  EXPECT_TRUE(tx.codedBits.empty());
}

}  // namespace
}  // namespace brannoc::tx
