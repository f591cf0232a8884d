// PUSCH transmitter: data and control coding, multiplexing, interleaving and soft channel.
#include "tx/PuschTransmitter.h"

#include <algorithm>
#include <string>

#include "tx/ChannelInterleaver.h"
#include "tx/UciPuschEncoder.h"
#include "tx/UlschEncoder.h"

namespace brannoc::tx {

namespace {

TxOutcome checkPayload(const PuschParameters& params, const PuschPayload& payload) {
  const struct {
    const char* name;
    const Bits& bits;
    std::uint32_t expected;
  } parts[] = {{"transport block", payload.transportBlock, params.tbSize},
               {"CQI", payload.cqi, params.cqiBits},
               {"HARQ-ACK", payload.ack, params.ackBits},
               {"RI", payload.ri, params.riBits}};
  for (const auto& part : parts) {
    if (part.bits.size() != part.expected) {
      return txFailure(TxStatus::PayloadMismatch,
                       std::string(part.name) + " payload has " +
                           std::to_string(part.bits.size()) + " bits, the parameters say " +
                           std::to_string(part.expected));
    }
    if (std::any_of(part.bits.begin(), part.bits.end(), [](std::uint8_t b) { return b > 1; })) {
      return txFailure(TxStatus::InvalidParameter,
                       std::string(part.name) + " payload holds a value other than 0 or 1");
    }
  }
  return {};
}

}  // namespace

TxOutcome transmitPusch(const PuschParameters& params, const PuschPayload& payload,
                        const ChannelSettings& channel, PuschTransmission& out) {
  out = PuschTransmission{};
  PuschTransmission result;
  if (TxOutcome outcome = derivePuschControlFields(params, result.fields); !outcome.ok()) {
    return outcome;
  }
  if (TxOutcome outcome = checkPayload(params, payload); !outcome.ok()) {
    return outcome;
  }
  const PuschControlFields& fields = result.fields;
  if (params.tbSize > 0) {
    UlschEncoding data;
    if (!encodeUlsch(payload.transportBlock, fields.G, params.Qm, params.rv, data)) {
      return txFailure(TxStatus::InvalidParameter, "the UL-SCH data chain refused G = " +
                                                       std::to_string(fields.G));
    }
    result.f = std::move(data.f);
  }
  result.qCqi = encodeCqiPusch(payload.cqi, fields.Qcqi);
  result.qAck = encodeAckRiPusch(payload.ack, params.Qm, fields.Qack);
  result.qRi = encodeAckRiPusch(payload.ri, params.Qm, fields.Qri);
  result.codedBits = multiplexAndInterleave(result.f, result.qCqi, result.qAck, result.qRi,
                                            params.Qm, params.cp);
  if (result.codedBits.size() != fields.totalBits) {
    return txFailure(TxStatus::InvalidParameter,
                     "the coded fields do not fill the interleaver matrix of " +
                         std::to_string(fields.totalBits) + " bits");
  }
  Constellation constellation = Constellation::Qpsk;
  constellationForQm(params.Qm, constellation);
  if (!makeSoftValues(result.codedBits, constellation, channel, result.softValues)) {
    return txFailure(TxStatus::InvalidParameter, "the channel settings are unusable");
  }
  out = std::move(result);
  return {};
}

}  // namespace brannoc::tx
