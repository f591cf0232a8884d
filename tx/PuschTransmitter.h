// One PUSCH subframe from payload to soft values: the UL-SCH data chain (TS 36.212 5.2.2.1
// to 5.2.2.5), channel coding of CQI, HARQ-ACK and RI (5.2.2.6), data and control
// multiplexing (5.2.2.7) and the channel interleaver (5.2.2.8), then the soft channel.
// Scrambling (TS 36.211 5.3.1) is not applied: the coded bits are what an ideal descrambling
// receiver sees, with "x" placeholders marked kPlaceholderBit (soft value 0).
#ifndef BRANNOC_TX_PUSCHTRANSMITTER_H
#define BRANNOC_TX_PUSCHTRANSMITTER_H

#include <cstdint>
#include <vector>

#include "tx/Bits.h"
#include "tx/PuschParameters.h"
#include "tx/SoftChannel.h"
#include "tx/TxStatus.h"

namespace brannoc::tx {

struct PuschPayload {
  Bits transportBlock;  // tbSize bits (empty for control only)
  Bits cqi;             // cqiBits bits, o_0 first
  Bits ack;             // ackBits bits
  Bits ri;              // riBits bits
};

struct PuschTransmission {
  PuschControlFields fields;
  Bits f;                               // G rate-matched data bits
  Bits qCqi;                            // Q_CQI coded CQI bits
  Bits qAck;                            // Q_ACK coded HARQ-ACK bits
  Bits qRi;                             // Q_RI coded RI bits
  Bits codedBits;                       // interleaver readout, fields.totalBits bits
  std::vector<std::int32_t> softValues; // one 8:5 soft value per coded bit
};

// Encodes, multiplexes and interleaves the payload and passes it through the channel. On
// failure `out` is reset and the outcome gives the reason in one line.
TxOutcome transmitPusch(const PuschParameters& params, const PuschPayload& payload,
                        const ChannelSettings& channel, PuschTransmission& out);

}  // namespace brannoc::tx

#endif
