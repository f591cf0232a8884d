// PUCCH transmitter: coding, modulation of the coded and the separate ACK bits, soft channel.
#include "tx/PucchTransmitter.h"

#include <algorithm>
#include <string>

#include "tx/PucchEncoder.h"
#include "tx/ReedMullerCode.h"

namespace brannoc::tx {

TxOutcome transmitPucch(std::span<const std::uint8_t> cqi, std::span<const std::uint8_t> ack,
                        CyclicPrefix cp, const ChannelSettings& channel,
                        PucchTransmission& out) {
  out = PucchTransmission{};
  auto notBit = [](std::uint8_t b) { return b > 1; };
  if (std::any_of(cqi.begin(), cqi.end(), notBit) || std::any_of(ack.begin(), ack.end(), notBit)) {
    return txFailure(TxStatus::InvalidParameter, "PUCCH payload holds a value other than 0 or 1");
  }
  PucchTransmission result;
  result.codedBits = encodePucch(cqi, ack, cp);
  if (result.codedBits.empty()) {
    return txFailure(TxStatus::InvalidParameter,
                     "PUCCH cannot carry " + std::to_string(cqi.size()) + " CQI and " +
                         std::to_string(ack.size()) + " HARQ-ACK bits with this cyclic prefix");
  }
  // The part coded with the (20, A) code, and the ACK bits that travel beside it.
  const std::size_t codedLength = cqi.empty() ? 0 : kRm20Length;
  const std::span<const std::uint8_t> coded(result.codedBits.data(), codedLength);
  const std::span<const std::uint8_t> separate(result.codedBits.data() + codedLength,
                                               result.codedBits.size() - codedLength);
  GaussianSource noise(channel.seed);
  const Constellation ackConstellation =
      separate.size() == 1 ? Constellation::PucchBpsk : Constellation::PucchQpsk;
  if (!appendSoftValues(coded, Constellation::Qpsk, channel, noise, result.softValues) ||
      !appendSoftValues(separate, ackConstellation, channel, noise, result.softValues)) {
    return txFailure(TxStatus::InvalidParameter, "the channel settings are unusable");
  }
  out = std::move(result);
  return {};
}

}  // namespace brannoc::tx
