// Data and control multiplexing and the channel interleaver (TS 36.212 5.2.2.7, 5.2.2.8):
// where RI and HARQ-ACK symbols land for normal and extended cyclic prefix, how data and CQI
// fill the rest, and the column-by-column readout.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "tx/ChannelInterleaver.h"

namespace brannoc::tx {
namespace {

// Matrix of 4 rows, Qm = 2. Each entry's value names its source: the multiplexed vector
// index k (CQI first, then data), or kRiTag + i / kAckTag + i for control symbol i. The cells
// of the first four symbols of each give the column sets of the standard's tables.
TEST(ChannelInterleaver, ControlSymbolsFillTheirColumnsFromTheBottomRow) {
  constexpr std::uint8_t kRiTag = 200, kAckTag = 220;
  const std::uint32_t Qm = 2, Rmux = 4;
  const struct {
    CyclicPrefix cp;
    std::uint32_t Cmux;
    std::vector<MatrixCell> ri, ack;  // cells of the RI and ACK symbols, in symbol order
    MatrixCell dataAfterRi;           // a data entry of row 2 after an RI entry
    std::uint32_t dataAfterRiK;       // the multiplexed vector it holds
  } layouts[] = {
      {CyclicPrefix::Normal, 12, {{3, 1}, {3, 10}, {3, 7}, {3, 4}, {2, 1}},
       {{3, 2}, {3, 9}, {3, 8}, {3, 3}, {2, 2}, {2, 9}}, {2, 3}, 26},
      {CyclicPrefix::Extended, 10, {{3, 0}, {3, 8}, {3, 5}, {3, 3}, {2, 0}, {2, 8}},
       {{3, 1}, {3, 7}, {3, 6}, {3, 2}, {2, 1}}, {2, 2}, 21},
  };
  for (const auto& layout : layouts) {
    const std::uint32_t Hprime = Rmux * layout.Cmux - layout.ri.size();
    Bits cqi, f, ri, ack;
    for (std::uint32_t k = 0; k < Hprime; ++k) {
      Bits& target = k < 3 ? cqi : f;  // three CQI entries, then data
      target.insert(target.end(), Qm, static_cast<std::uint8_t>(k));
    }
    for (std::uint32_t i = 0; i < layout.ri.size(); ++i) ri.insert(ri.end(), Qm, kRiTag + i);
    for (std::uint32_t i = 0; i < layout.ack.size(); ++i) ack.insert(ack.end(), Qm, kAckTag + i);

    const Bits h = multiplexAndInterleave(f, cqi, ack, ri, Qm, layout.cp);
    ASSERT_EQ(h.size(), Rmux * layout.Cmux * Qm);
    auto at = [&](std::uint32_t row, std::uint32_t column) {
      const std::uint32_t first = (column * Rmux + row) * Qm;  // column-by-column readout
      EXPECT_EQ(h[first], h[first + 1]) << "an entry's bits are split";
      return h[first];
    };
    for (std::uint32_t i = 0; i < layout.ri.size(); ++i) {
      EXPECT_EQ(at(layout.ri[i].row, layout.ri[i].column), kRiTag + i) << "RI symbol " << i;
    }
    for (std::uint32_t i = 0; i < layout.ack.size(); ++i) {
      EXPECT_EQ(at(layout.ack[i].row, layout.ack[i].column), kAckTag + i) << "ACK symbol " << i;
    }
    // Rows 0 and 1 hold no control, so entry (r, c) holds k = r * Cmux + c; CQI comes first.
    EXPECT_EQ(at(0, 1), 1);
    EXPECT_EQ(at(1, layout.Cmux - 1), 2 * layout.Cmux - 1);
    // In row 2 the multiplexed vectors skip the RI entry before them; the last entry is data.
    EXPECT_EQ(at(layout.dataAfterRi.row, layout.dataAfterRi.column), layout.dataAfterRiK);
    EXPECT_EQ(at(3, layout.Cmux - 1), Hprime - 1);
  }
}

TEST(ChannelInterleaver, RefusesInconsistentLengths) {
  const auto interleave = [](std::size_t f, std::size_t ack, std::uint32_t Qm) {
    return multiplexAndInterleave(Bits(f, 0), {}, Bits(ack, 1), {}, Qm, CyclicPrefix::Normal);
  };
  EXPECT_TRUE(interleave(23, 0, 2).empty()) << "odd length for Qm 2";
  EXPECT_TRUE(interleave(22, 0, 2).empty()) << "partial row";
  EXPECT_TRUE(interleave(36, 0, 3).empty()) << "Qm 3";
  EXPECT_TRUE(interleave(24, 10, 2).empty()) << "five rows of ACK in one row";
  EXPECT_EQ(interleave(24, 8, 2).size(), 24u);
}

}  // namespace
}  // namespace brannoc::tx
