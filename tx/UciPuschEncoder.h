// Channel coding of uplink control information multiplexed on PUSCH, TS 36.212 5.2.2.6:
// CQI/PMI (block code for up to 11 bits, otherwise CRC8 + tail-biting convolutional code and
// its rate matching), HARQ-ACK and RI of one or two bits (repetition and simplex codes).
#ifndef BRANNOC_TX_UCIPUSCHENCODER_H
#define BRANNOC_TX_UCIPUSCHENCODER_H

#include <cstdint>
#include <span>

#include "tx/Bits.h"

namespace brannoc::tx {

// Largest CQI report carried by the (32, O) block code; longer reports take the
// convolutional code with an 8-bit CRC.
constexpr std::uint32_t kCqiBlockCodeMaxBits = 11;
constexpr std::uint32_t kCqiCrcBits = 8;

// q_0..q_{Qcqi-1} for the report o_0..o_{O-1}. O <= 11: the (32, O) codeword repeated
// circularly, q_i = b_{i mod 32}. O >= 12: gCRC8 attached, tail-biting convolutional code,
// rate matching to E = Qcqi. An empty report gives an empty output.
Bits encodeCqiPusch(std::span<const std::uint8_t> o, std::uint32_t Qcqi);

// q_0..q_{Q-1} for a HARQ-ACK or RI field of one or two bits (5.2.2.6, 5.2.2.6.1,
// 5.2.2.6.2). One bit: the block [o0, y, x, ..., x] of Qm bits; two bits: the three
// Qm-bit groups [o0 o1 x..], [o2 o0 x..], [o1 o2 x..] with o2 = o0 xor o1. The blocks are
// concatenated, the last one cut short, up to Q bits. A "y" is written as the bit it
// repeats, an "x" as kPlaceholderBit (tx/UplinkTypes.h). Returns an empty vector for an
// empty field, a field of more than two bits, or Qm other than 2, 4, 6.
Bits encodeAckRiPusch(std::span<const std::uint8_t> o, std::uint32_t Qm, std::uint32_t Q);

}  // namespace brannoc::tx

#endif
