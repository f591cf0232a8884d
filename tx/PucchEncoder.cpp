// Uplink control information on PUCCH (TS 36.212 5.2.3).
#include "tx/PucchEncoder.h"

#include "tx/ReedMullerCode.h"

namespace brannoc::tx {

Bits encodePucch(std::span<const std::uint8_t> cqi, std::span<const std::uint8_t> ack,
                 CyclicPrefix cp) {
  if (ack.size() > kPucchMaxAckBits || (cqi.empty() && ack.empty())) {
    return {};
  }
  Bits out;
  if (cqi.empty()) {
    for (std::uint8_t bit : ack) {
      out.push_back(bit != 0 ? 1 : 0);
    }
    return out;
  }
  if (cp == CyclicPrefix::Extended) {
    Bits message(cqi.begin(), cqi.end());
    message.insert(message.end(), ack.begin(), ack.end());
    return encodeRm20(message);  // empty when A > 13
  }
  out = encodeRm20(cqi);
  if (out.empty()) {
    return out;
  }
  for (std::uint8_t bit : ack) {
    out.push_back(bit != 0 ? 1 : 0);
  }
  return out;
}

}  // namespace brannoc::tx
