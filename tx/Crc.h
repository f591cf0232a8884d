// Cyclic redundancy check attachment of TS 36.212 5.1.1: the generator polynomials gCRC24A,
// gCRC24B, gCRC16 and gCRC8, a zero initial register and no inversion. The parity bits are
// the remainder of a(D)·D^L divided by the polynomial, highest power (p0) first.
#ifndef BRANNOC_TX_CRC_H
#define BRANNOC_TX_CRC_H

#include <cstdint>
#include <span>

#include "tx/Bits.h"

namespace brannoc::tx {

enum class CrcType { Crc24A, Crc24B, Crc16, Crc8 };

// Number of parity bits L of the polynomial (24, 24, 16 or 8).
std::uint32_t crcLength(CrcType type);

// The L parity bits of the message. Elements other than 1 (a <NULL> filler bit included)
// count as 0, which is how code-block CRCs treat filler bits.
Bits crcParity(std::span<const std::uint8_t> bits, CrcType type);

// The message followed by its parity bits.
Bits attachCrc(std::span<const std::uint8_t> bits, CrcType type);

}  // namespace brannoc::tx

#endif
