// One PUCCH transmission from payload to soft values: the coding of TS 36.212 5.2.3
// (tx/PucchEncoder.h), the 20 coded bits mapped as QPSK (TS 36.211 5.4.2, 7.1.2) and
// HARQ-ACK bits sent alone or beside them mapped as in TS 36.211 Table 5.4.1-1 (one bit
// BPSK, two bits QPSK), then the soft channel.
#ifndef BRANNOC_TX_PUCCHTRANSMITTER_H
#define BRANNOC_TX_PUCCHTRANSMITTER_H

#include <cstdint>
#include <span>
#include <vector>

#include "tx/Bits.h"
#include "tx/SoftChannel.h"
#include "tx/TxStatus.h"
#include "tx/UplinkTypes.h"

namespace brannoc::tx {

struct PucchTransmission {
  Bits codedBits;                        // 20 coded bits then separate ACK bits, as sent
  std::vector<std::int32_t> softValues;  // one 8:5 soft value per coded bit, same order
};

TxOutcome transmitPucch(std::span<const std::uint8_t> cqi, std::span<const std::uint8_t> ack,
                        CyclicPrefix cp, const ChannelSettings& channel,
                        PucchTransmission& out);

}  // namespace brannoc::tx

#endif
