// Data and control multiplexing and the channel interleaver (TS 36.212 5.2.2.7, 5.2.2.8):
// where RI and HARQ-ACK symbols land for normal and extended cyclic prefix, how data and CQI
// fill the rest, and the column-by-column readout.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "tx/ChannelInterleaver.h"

namespace brannoc::tx {
namespace {

constexpr std::uint8_t kRiTag = 200;
constexpr std::uint8_t kAckTag = 220;

struct Layout {
  CyclicPrefix cp;
  std::uint32_t Cmux;
  std::uint32_t QprimeRi;
  std::uint32_t QprimeAck;
  std::vector<MatrixCell> ri;   // cells of the RI symbols, in symbol order
  std::vector<MatrixCell> ack;  // cells of the ACK symbols
  MatrixCell dataAfterRi;       // a data entry of row 2 after an RI entry
  std::uint32_t dataAfterRiK;   // the multiplexed vector it holds
};

// Matrix of 4 rows, Qm = 2. Each entry's value names its source: the multiplexed vector
// index k (CQI first, then data), or kRiTag + i / kAckTag + i for control symbol i.
TEST(ChannelInterleaver, ControlSymbolsFillTheirColumnsFromTheBottomRow) {
  const std::uint32_t Qm = 2;
  const std::uint32_t Rmux = 4;
  const Layout layouts[] = {
      {CyclicPrefix::Normal, 12, 5, 6,
       {{3, 1}, {3, 10}, {3, 7}, {3, 4}, {2, 1}},
       {{3, 2}, {3, 9}, {3, 8}, {3, 3}, {2, 2}, {2, 9}},
       {2, 3},
       26},
      {CyclicPrefix::Extended, 10, 6, 5,
       {{3, 0}, {3, 8}, {3, 5}, {3, 3}, {2, 0}, {2, 8}},
       {{3, 1}, {3, 7}, {3, 6}, {3, 2}, {2, 1}},
       {2, 2},
       21},
  };
  for (const Layout& layout : layouts) {
    const std::uint32_t entries = Rmux * layout.Cmux;
    const std::uint32_t Hprime = entries - layout.QprimeRi;
    const std::uint32_t cqiEntries = 3;
    Bits cqi;
    Bits f;
    for (std::uint32_t k = 0; k < Hprime; ++k) {
      Bits& target = k < cqiEntries ? cqi : f;
      target.insert(target.end(), Qm, static_cast<std::uint8_t>(k));
    }
    Bits ri;
    Bits ack;
    for (std::uint32_t i = 0; i < layout.QprimeRi; ++i) ri.insert(ri.end(), Qm, kRiTag + i);
    for (std::uint32_t i = 0; i < layout.QprimeAck; ++i) ack.insert(ack.end(), Qm, kAckTag + i);

    const Bits h = multiplexAndInterleave(f, cqi, ack, ri, Qm, layout.cp);
    ASSERT_EQ(h.size(), entries * Qm);
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
    // Row-major fill around RI: rows 0 and 1 hold no control, so entry (r, c) holds
    // k = r * Cmux + c; CQI comes first.
    EXPECT_EQ(at(0, 0), 0);
    EXPECT_EQ(at(0, 1), 1);
    EXPECT_EQ(at(1, 0), layout.Cmux);
    EXPECT_EQ(at(1, layout.Cmux - 1), 2 * layout.Cmux - 1);
    // In row 2 the multiplexed vectors skip the RI entry before them.
    EXPECT_EQ(at(layout.dataAfterRi.row, layout.dataAfterRi.column), layout.dataAfterRiK);
    // The last entry of the matrix, row 3 column Cmux-1, is data: it holds k = H' - 1.
    EXPECT_EQ(at(3, layout.Cmux - 1), Hprime - 1);
  }
}

TEST(ChannelInterleaver, ColumnSetsAndSymbolWalk) {
  using Set = std::array<std::uint32_t, 4>;
  EXPECT_EQ(riColumnSet(CyclicPrefix::Normal), (Set{1, 4, 7, 10}));
  EXPECT_EQ(riColumnSet(CyclicPrefix::Extended), (Set{0, 3, 5, 8}));
  EXPECT_EQ(ackColumnSet(CyclicPrefix::Normal), (Set{2, 3, 8, 9}));
  EXPECT_EQ(ackColumnSet(CyclicPrefix::Extended), (Set{1, 2, 6, 7}));
  const Set set = ackColumnSet(CyclicPrefix::Normal);
  const std::uint32_t expectedColumns[] = {2, 9, 8, 3, 2, 9, 8, 3, 2};
  for (std::uint32_t i = 0; i < 9; ++i) {
    const MatrixCell cell = controlSymbolCell(i, 12, set);
    EXPECT_EQ(cell.row, 11 - i / 4) << i;
    EXPECT_EQ(cell.column, expectedColumns[i]) << i;
  }
}

TEST(ChannelInterleaver, RefusesInconsistentLengths) {
  const Bits f24(24, 0);
  struct Case {
    const char* name;
    std::size_t f, cqi, ack, ri;
    std::uint32_t Qm;
  } cases[] = {
      {"odd length for Qm 2", 23, 0, 0, 0, 2},
      {"partial row", 22, 0, 0, 0, 2},
      {"Qm 3", 36, 0, 0, 0, 3},
      {"five rows of RI in one row", 0, 4, 0, 20, 2},
      {"five rows of ACK in one row", 24, 0, 10, 0, 2},
  };
  for (const Case& c : cases) {
    EXPECT_TRUE(multiplexAndInterleave(Bits(c.f, 0), Bits(c.cqi, 0), Bits(c.ack, 0),
                                       Bits(c.ri, 0), c.Qm, CyclicPrefix::Normal)
                    .empty())
        << c.name;
  }
  EXPECT_EQ(multiplexAndInterleave(f24, {}, Bits(8, 1), {}, 2, CyclicPrefix::Normal).size(), 24u);
}

}  // namespace
}  // namespace brannoc::tx
