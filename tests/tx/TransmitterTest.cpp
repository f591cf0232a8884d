// PUSCH and PUCCH transmitters end to end: lengths, where the coded control bits end up in
// the interleaver readout, placeholder soft values, and refused payloads.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "tx/ChannelInterleaver.h"
#include "tx/PucchTransmitter.h"
#include "tx/PuschTransmitter.h"

namespace brannoc::tx {
namespace {

Bits patternBits(std::size_t length, std::uint32_t salt) {
  Bits bits(length);
  for (std::size_t i = 0; i < length; ++i) bits[i] = ((i * 13 + salt + i / 5) % 7) < 3 ? 1 : 0;
  return bits;
}

TEST(PuschTransmitter, ControlBitsSitInTheirCellsAndPlaceholdersAreZero) {
  const struct {
    const char* name;
    std::uint32_t numPrb, Qm;
    CyclicPrefix cp;
    std::uint32_t tbSize, cqiBits, ackBits, riBits;
  } scenarios[] = {
      {"QPSK normal CP, data + all UCI", 2, 2, CyclicPrefix::Normal, 256, 20, 2, 1},
      {"16QAM extended CP, data + ACK", 3, 4, CyclicPrefix::Extended, 1000, 0, 1, 2},
      {"64QAM normal CP, two code blocks", 30, 6, CyclicPrefix::Normal, 8000, 11, 2, 2},
      {"QPSK control only", 1, 2, CyclicPrefix::Normal, 0, 30, 1, 1},
  };
  for (const auto& s : scenarios) {
    const PuschParameters p{s.numPrb, s.Qm, s.cp, s.tbSize, 0, s.cqiBits, s.ackBits,
                            s.riBits, {8, {}}, {5, {}}, {5, {}}, 0, 0};
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
    EXPECT_TRUE(tx.f.size() == f.G && tx.qCqi.size() == f.Qcqi && tx.qAck.size() == f.Qack &&
                tx.qRi.size() == f.Qri)
        << s.name << ": field lengths";

    // Symbol i of ACK (RI) sits in its cell of the matrix, read out column by column.
    for (const auto& [q, set] : {std::pair{&tx.qAck, ackColumnSet(s.cp)},
                                 std::pair{&tx.qRi, riColumnSet(s.cp)}}) {
      for (std::uint32_t i = 0; i < q->size() / s.Qm; ++i) {
        const MatrixCell cell = controlSymbolCell(i, f.Rmux, set);
        const std::size_t first = (std::size_t{cell.column} * f.Rmux + cell.row) * s.Qm;
        ASSERT_EQ(Bits(tx.codedBits.begin() + first, tx.codedBits.begin() + first + s.Qm),
                  Bits(q->begin() + i * s.Qm, q->begin() + (i + 1) * s.Qm))
            << s.name << (q == &tx.qAck ? " ACK" : " RI") << " symbol " << i;
      }
    }

    std::size_t placeholders = 0;
    for (std::size_t n = 0; n < tx.codedBits.size(); ++n) {
      const std::uint8_t bit = tx.codedBits[n];
      ASSERT_EQ(tx.softValues[n], bit == kPlaceholderBit ? 0 : bit == 1 ? 40 : -40)
          << s.name << " position " << n;
      placeholders += bit == kPlaceholderBit;
    }
    // x placeholders come from ACK and RI only: Qm - 2 of every Qm bits for one-bit
    // fields, 3 (Qm - 2) of every 3 Qm bits for two-bit fields.
    EXPECT_EQ(placeholders, (f.Qack + f.Qri) / s.Qm * (s.Qm - 2)) << s.name;
  }
}

TEST(PuschTransmitter, RefusesPayloadsThatDoNotMatch) {
  PuschParameters p;
  p.tbSize = 100;
  p.ackBits = 1;
  PuschTransmission tx;
  tx.codedBits.assign(5, 1);
  EXPECT_EQ(transmitPusch(p, {Bits(100, 0), {}, {}, {}}, {}, tx).status,
            TxStatus::PayloadMismatch);
  EXPECT_TRUE(tx.codedBits.empty());
  EXPECT_EQ(transmitPusch(p, {Bits(100, 2), {}, {1}, {}}, {}, tx).status,
            TxStatus::InvalidParameter);
  EXPECT_TRUE(transmitPusch(p, {Bits(100, 0), {}, {1}, {}}, {}, tx).ok());
}

// Accepted PUCCH payloads are decoded back, noise-free and through noise, by the decoder's
// control-channel tests.
TEST(PucchTransmitter, RefusesAPayloadTooLongForTheCyclicPrefix) {
  PucchTransmission tx;
  tx.codedBits.assign(3, 1);
  EXPECT_EQ(transmitPucch(patternBits(12, 1), Bits{1, 0}, CyclicPrefix::Extended, {}, tx).status,
            TxStatus::InvalidParameter);
  EXPECT_TRUE(tx.codedBits.empty());
}

}  // namespace
}  // namespace brannoc::tx
