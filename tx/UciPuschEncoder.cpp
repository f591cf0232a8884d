// Channel coding of CQI, HARQ-ACK and RI on PUSCH (TS 36.212 5.2.2.6).
#include "tx/UciPuschEncoder.h"

#include "tx/ConvolutionalCode.h"
#include "tx/Crc.h"
#include "tx/ReedMullerCode.h"
#include "tx/UplinkTypes.h"

namespace brannoc::tx {

Bits encodeCqiPusch(std::span<const std::uint8_t> o, std::uint32_t Qcqi) {
  if (o.empty()) {
    return {};
  }
  if (o.size() <= kCqiBlockCodeMaxBits) {
    const Bits b = encodeRm32(o);
    Bits q(Qcqi, 0);
    for (std::uint32_t i = 0; i < Qcqi; ++i) {
      q[i] = b[i % b.size()];
    }
    return q;
  }
  const Bits withCrc = attachCrc(o, CrcType::Crc8);
  return rateMatchConvolutional(encodeTailBiting(withCrc), Qcqi);
}

Bits encodeAckRiPusch(std::span<const std::uint8_t> o, std::uint32_t Qm, std::uint32_t Q) {
  if (o.empty() || o.size() > 2 || (Qm != 2 && Qm != 4 && Qm != 6)) {
    return {};
  }
  const std::uint8_t o0 = o[0] != 0 ? 1 : 0;
  Bits block;
  if (o.size() == 1) {
    block.assign(Qm, kPlaceholderBit);
    block[0] = o0;
    block[1] = o0;  // y: repeats o0
  } else {
    const std::uint8_t o1 = o[1] != 0 ? 1 : 0;
    const std::uint8_t o2 = o0 ^ o1;
    block.assign(3 * Qm, kPlaceholderBit);
    const std::uint8_t pairs[3][2] = {{o0, o1}, {o2, o0}, {o1, o2}};
    for (std::uint32_t g = 0; g < 3; ++g) {
      block[g * Qm] = pairs[g][0];
      block[g * Qm + 1] = pairs[g][1];
    }
  }
  Bits q(Q, 0);
  for (std::uint32_t i = 0; i < Q; ++i) {
    q[i] = block[i % block.size()];
  }
  return q;
}

}  // namespace brannoc::tx
