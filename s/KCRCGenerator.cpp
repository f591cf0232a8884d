// KCRCGenerator: CRC generation and checking of TS 36.212 clause 5.1.1.
#include "KCRCGenerator.h"

#include <algorithm>
#include <bit>
#include <cstring>

#include "errorLine.h"

namespace brannoc {

std::unique_ptr<KCRCGenerator> KCRCGenerator::create(const std::string& properties) {
  if (!properties.empty()) {
    brannoc::errorLineBare("ERROR:KCRCGenerator:Unexpected properties:", properties);
    return nullptr;
  }
  return std::make_unique<KCRCGenerator>();
}

void KCRCGenerator::setPolynomial(std::uint32_t length, std::initializer_list<std::uint32_t> ones) {
  itsPolynomial.assign(length + 1, 0);
  for (std::uint32_t power : ones) {
    itsPolynomial[power] = 1;
  }
  itsLength = length;
  itsTaps = 0;
  for (std::uint32_t j = 0; j < length; ++j) {
    itsTaps |= static_cast<std::uint32_t>(itsPolynomial[j]) << j;
  }
  // Entry b: the register after eight message bits whose exclusive-or with the register's
  // top eight bits is b, from a register holding only those.
  const std::uint32_t top = 1U << (length - 1);
  const std::uint32_t mask = length == 32 ? 0xFFFFFFFFU : (1U << length) - 1U;
  for (std::uint32_t b = 0; b < 256; ++b) {
    std::uint32_t reg = b << (length - 8);
    for (int k = 0; k < 8; ++k) {
      reg = (reg & top) != 0 ? ((reg << 1) ^ itsTaps) & mask : (reg << 1) & mask;
    }
    itsByteTable[b] = reg;
  }
}

namespace {

// Eight one-bit elements (their low bits) as one byte, the first element the most significant
// bit: a little-endian load moves element j to bit 8j, and the multiplication gathers bit 8j
// to bit 63 - j.
std::uint32_t packEight(const std::uint8_t* bits) {
  if constexpr (std::endian::native == std::endian::little) {
    std::uint64_t word;
    std::memcpy(&word, bits, sizeof word);
    return static_cast<std::uint32_t>(((word & 0x0101010101010101ULL) * 0x8040201008040201ULL) >>
                                      56);
  } else {
    std::uint32_t byte = 0;
    for (int k = 0; k < 8; ++k) {
      byte = (byte << 1) | (bits[k] & 1U);
    }
    return byte;
  }
}

}  // namespace

std::uint32_t KCRCGenerator::remainder(const std::uint8_t* bits, std::size_t n) const {
  const std::uint32_t L = itsLength;
  const std::uint32_t mask = L == 32 ? 0xFFFFFFFFU : (1U << L) - 1U;
  std::uint32_t reg = 0;
  std::size_t i = 0;
  for (; i + 8 <= n; i += 8) {
    reg = ((reg << 8) & mask) ^ itsByteTable[((reg >> (L - 8)) ^ packEight(bits + i)) & 0xFFU];
  }
  for (; i < n; ++i) {
    const bool feedback = (((reg >> (L - 1)) ^ bits[i]) & 1U) != 0;
    reg = (reg << 1) & mask;
    if (feedback) {
      reg ^= itsTaps;
    }
  }
  return reg;
}

// gCRC24A(D) = D^24 + D^23 + D^18 + D^17 + D^14 + D^11 + D^10 + D^7 + D^6 + D^5 + D^4 + D^3 + D + 1
void KCRCGenerator::setCRC24A() {
  setPolynomial(24, {24, 23, 18, 17, 14, 11, 10, 7, 6, 5, 4, 3, 1, 0});
}

// gCRC24B(D) = D^24 + D^23 + D^6 + D^5 + D + 1
void KCRCGenerator::setCRC24B() { setPolynomial(24, {24, 23, 6, 5, 1, 0}); }

// gCRC16(D) = D^16 + D^12 + D^5 + 1
void KCRCGenerator::setCRC16() { setPolynomial(16, {16, 12, 5, 0}); }

// gCRC8(D) = D^8 + D^7 + D^4 + D^3 + D + 1
void KCRCGenerator::setCRC8() { setPolynomial(8, {8, 7, 4, 3, 1, 0}); }

bool KCRCGenerator::generate(const std::vector<std::uint8_t>& dataBits,
                             std::vector<std::uint8_t>& codedBits, std::uint32_t crcMask) const {
  if (itsLength == 0) {
    return false;
  }
  const std::size_t n = dataBits.size();
  const std::uint32_t L = itsLength;
  const std::uint32_t parity = remainder(dataBits.data(), n);
  codedBits.resize(n + L);
  for (std::size_t i = 0; i < n; ++i) {
    codedBits[i] = dataBits[i] & 1U;
  }
  for (std::uint32_t i = 0; i < L; ++i) {
    codedBits[n + i] = static_cast<std::uint8_t>(((parity >> (L - 1 - i)) ^ (crcMask >> i)) & 1U);
  }
  return true;
}

bool KCRCGenerator::check(const std::vector<std::uint8_t>& codedBits,
                          std::vector<std::uint8_t>& dataBits, std::uint8_t& crcPass,
                          std::uint32_t crcMask) const {
  const std::uint32_t L = itsLength;
  if (L == 0 || codedBits.size() <= L) {
    dataBits = codedBits;
    return false;
  }
  const std::size_t n = codedBits.size() - L;
  dataBits.assign(codedBits.begin(), codedBits.begin() + static_cast<std::ptrdiff_t>(n));
  // The received parity must equal the one generated from the received data; the data bits
  // themselves are compared as generate writes them (their low bit).
  const std::uint32_t parity = remainder(codedBits.data(), n);
  // An element other than 0 or 1 is not the bit generate would have written there.
  const bool pass =
      std::all_of(codedBits.begin(), codedBits.begin() + static_cast<std::ptrdiff_t>(n),
                  [](std::uint8_t b) { return b <= 1; });
  bool parityMatches = true;
  for (std::uint32_t i = 0; i < L; ++i) {
    parityMatches =
        parityMatches && codedBits[n + i] == (((parity >> (L - 1 - i)) ^ (crcMask >> i)) & 1U);
  }
  crcPass = pass && parityMatches ? 1 : 0;
  return true;
}

}  // namespace brannoc
