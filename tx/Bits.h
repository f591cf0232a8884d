// Bit vectors of the transmitter: one bit per element, first bit at index 0, and the
// <NULL> marker that TS 36.212 uses for filler bits (5.1.2) and sub-block interleaver dummy
// bits (5.1.4.1.1), which occupy positions but are never transmitted.
#ifndef BRANNOC_TX_BITS_H
#define BRANNOC_TX_BITS_H

#include <cstdint>
#include <vector>

namespace brannoc::tx {

using Bits = std::vector<std::uint8_t>;

// <NULL>: a filler or dummy bit. Any element other than 0 or 1 is not a data bit.
constexpr std::uint8_t kNullBit = 2;

}  // namespace brannoc::tx

#endif
