// Data and control multiplexing (TS 36.212 5.2.2.7) and the PUSCH channel interleaver
// (5.2.2.8) for one layer: CQI and UL-SCH data are multiplexed into Qm-bit column vectors,
// written row by row into a matrix of R'mux rows and Cmux columns around the RI symbols,
// which take the RI columns from the bottom row upwards; the ACK symbols then overwrite the
// entries of the ACK columns, likewise from the bottom row upwards. The matrix is read out
// column by column, each entry as its Qm bits.
#ifndef BRANNOC_TX_CHANNELINTERLEAVER_H
#define BRANNOC_TX_CHANNELINTERLEAVER_H

#include <array>
#include <cstdint>
#include <span>

#include "tx/Bits.h"
#include "tx/UplinkTypes.h"

namespace brannoc::tx {

// Column sets of Tables 5.2.2.8-1 (RI) and 5.2.2.8-2 (HARQ-ACK), in table order. The
// symbols take them in the order j = 0, 3, 2, 1, 0, ... (j = (j + 3) mod 4).
std::array<std::uint32_t, 4> riColumnSet(CyclicPrefix cp);
std::array<std::uint32_t, 4> ackColumnSet(CyclicPrefix cp);

// Row and column of control symbol i (RI or ACK) in a matrix of Rmux rows: row
// Rmux - 1 - floor(i / 4), column columnSet[(3 * i) mod 4].
struct MatrixCell {
  std::uint32_t row;
  std::uint32_t column;
};
MatrixCell controlSymbolCell(std::uint32_t i, std::uint32_t Rmux,
                             const std::array<std::uint32_t, 4>& columnSet);

// h_0..h_{Qm*R'mux*Cmux - 1}: multiplexes qCqi (first) and f, places qRi and qAck, and reads
// the matrix out. Element values are moved, not interpreted. Returns an empty vector when
// the lengths are inconsistent: Qm not 2, 4 or 6; a length that is not a multiple of Qm;
// a total that does not fill whole rows; more than four rows' worth of ACK or RI symbols.
Bits multiplexAndInterleave(std::span<const std::uint8_t> f, std::span<const std::uint8_t> qCqi,
                            std::span<const std::uint8_t> qAck,
                            std::span<const std::uint8_t> qRi, std::uint32_t Qm,
                            CyclicPrefix cp);

}  // namespace brannoc::tx

#endif
