// CRC parity of TS 36.212 5.1.1, computed bit-serially with a shift register that holds the
// running remainder (bit L-1 is the coefficient of the highest power).
#include "tx/Crc.h"

namespace brannoc::tx {

namespace {

struct Polynomial {
  std::uint32_t length;
  std::uint32_t taps;  // the coefficients of D^(L-1) .. D^0; D^L is implied
};

Polynomial polynomial(CrcType type) {
  switch (type) {
    case CrcType::Crc24A:  // D24+D23+D18+D17+D14+D11+D10+D7+D6+D5+D4+D3+D+1
      return {24, 0x864CFBu};
    case CrcType::Crc24B:  // D24+D23+D6+D5+D+1
      return {24, 0x800063u};
    case CrcType::Crc16:  // D16+D12+D5+1
      return {16, 0x1021u};
    case CrcType::Crc8:  // D8+D7+D4+D3+D+1
      return {8, 0x9Bu};
  }
  return {24, 0x864CFBu};
}

}  // namespace

std::uint32_t crcLength(CrcType type) { return polynomial(type).length; }

Bits crcParity(std::span<const std::uint8_t> bits, CrcType type) {
  const Polynomial poly = polynomial(type);
  const std::uint32_t top = poly.length - 1;
  const std::uint32_t mask = (poly.length == 32) ? 0xFFFFFFFFu : ((1u << poly.length) - 1u);
  std::uint32_t reg = 0;
  for (std::uint8_t bit : bits) {
    const std::uint32_t feedback = ((reg >> top) & 1u) ^ (bit == 1 ? 1u : 0u);
    reg = (reg << 1) & mask;
    if (feedback != 0) reg ^= poly.taps;
  }
  Bits parity(poly.length);
  for (std::uint32_t i = 0; i < poly.length; ++i) {
    parity[i] = static_cast<std::uint8_t>((reg >> (top - i)) & 1u);
  }
  return parity;
}

Bits attachCrc(std::span<const std::uint8_t> bits, CrcType type) {
  Bits out(bits.begin(), bits.end());
  const Bits parity = crcParity(bits, type);
  out.insert(out.end(), parity.begin(), parity.end());
  return out;
}

}  // namespace brannoc::tx
