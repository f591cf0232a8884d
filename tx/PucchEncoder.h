// Channel coding of uplink control information on PUCCH, TS 36.212 5.2.3: the CQI report
// (up to 13 bits) coded with the (20, A) block code (5.2.3.3), and HARQ-ACK:
// - normal cyclic prefix (formats 2a/2b): the ACK bits are not coded; they follow the 20
//   coded bits (5.2.3.4, b_20.. = the ACK bits) and modulate the reference symbol;
// - extended cyclic prefix (format 2): CQI and ACK are coded together, the ACK bits
//   appended to the CQI report as a (20, A) message of A = CQI + ACK bits (5.2.3.4);
// - ACK alone (formats 1a/1b): the one or two ACK bits themselves.
#ifndef BRANNOC_TX_PUCCHENCODER_H
#define BRANNOC_TX_PUCCHENCODER_H

#include <cstdint>
#include <span>

#include "tx/Bits.h"
#include "tx/UplinkTypes.h"

namespace brannoc::tx {

constexpr std::uint32_t kPucchMaxAckBits = 2;

// The bits to transmit: 20 coded bits followed by the ACK bits (normal CP), 20 coded bits
// (extended CP with CQI), or the ACK bits (no CQI). Returns an empty vector when there is
// nothing to send or the payload does not fit: more than 13 CQI bits (normal CP), more than
// 13 CQI + ACK bits (extended CP), more than two ACK bits.
Bits encodePucch(std::span<const std::uint8_t> cqi, std::span<const std::uint8_t> ack,
                 CyclicPrefix cp);

}  // namespace brannoc::tx

#endif
