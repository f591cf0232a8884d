// KCRCGenerator: CRC generation and checking of TS 36.212 clause 5.1.1.
#include "KCRCGenerator.h"

#include "errorLine.h"

namespace brannoc {

std::unique_ptr<KCRCGenerator> KCRCGenerator::create(const std::string& properties) {
  if (!properties.empty()) {
    brannoc::errorLineBare("ERROR:KCRCGenerator:Unexpected properties:", properties);
    return nullptr;
  }
  return std::make_unique<KCRCGenerator>();
}

void KCRCGenerator::setPolynomial(std::uint32_t length,
                                  std::initializer_list<std::uint32_t> ones) {
  itsPolynomial.assign(length + 1, 0);
  for (std::uint32_t power : ones) {
    itsPolynomial[power] = 1;
  }
  itsLength = length;
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
  codedBits.clear();
  codedBits.reserve(n + L);
  for (std::uint8_t bit : dataBits) {
    codedBits.push_back(bit & 1u);
  }
  codedBits.resize(n + L, 0);

  // The remainder register as a word: bit j is the coefficient of x^j. The generator's
  // low L coefficients are the feedback taps.
  std::uint32_t taps = 0;
  for (std::uint32_t j = 0; j < L; ++j) {
    taps |= static_cast<std::uint32_t>(itsPolynomial[j] & 1u) << j;
  }
  const std::uint32_t top = 1u << (L - 1);
  const std::uint32_t mask = (L == 32) ? 0xFFFFFFFFu : ((1u << L) - 1u);
  std::uint32_t remainder = 0;
  for (std::uint8_t bit : codedBits) {
    const bool feedback = (remainder & top) != 0;
    remainder = ((remainder << 1) | bit) & mask;
    if (feedback) {
      remainder ^= taps;
    }
  }
  for (std::uint32_t i = 0; i < L; ++i) {
    const std::uint32_t parity = (remainder >> (L - 1 - i)) & 1u;
    codedBits[n + i] = static_cast<std::uint8_t>(parity ^ ((crcMask >> i) & 1u));
  }
  return true;
}

bool KCRCGenerator::check(const std::vector<std::uint8_t>& codedBits,
                          std::vector<std::uint8_t>& dataBits, std::uint8_t& crcPass,
                          std::uint32_t crcMask) const {
  dataBits = codedBits;
  if (itsLength == 0 || codedBits.size() <= itsLength) {
    return false;
  }
  dataBits.resize(codedBits.size() - itsLength);
  std::vector<std::uint8_t> regenerated;
  generate(dataBits, regenerated, crcMask);
  crcPass = (regenerated == codedBits) ? 1 : 0;
  return true;
}

}  // namespace brannoc
