// KCRCGenerator: the cyclic redundancy checks of the LTE uplink (TS 36.212 clause 5.1.1):
// gCRC24A for transport blocks, gCRC24B for code blocks of a segmented transport block,
// gCRC8 for CQI reports of more than 11 bits on PUSCH, and gCRC16. Division over GF(2) with
// a zero initial register and no final inversion, eight bits a step through a table; the
// parity is written highest power first (p0, p1, ... of the standard).
#ifndef BRANNOC_KCRCGENERATOR_H
#define BRANNOC_KCRCGENERATOR_H

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace brannoc {

class KCRCGenerator {
 public:
  // Factory: only the empty properties text is accepted.
  static std::unique_ptr<KCRCGenerator> create(const std::string& properties);

  KCRCGenerator() = default;

  void setCRC24A();
  void setCRC24B();
  void setCRC16();
  void setCRC8();

  // codedBits = the low bit of each data element, then the L parity bits, parity bit i
  // exclusive-or bit i of crcMask. False only when no polynomial has been selected.
  bool generate(const std::vector<std::uint8_t>& dataBits, std::vector<std::uint8_t>& codedBits,
                std::uint32_t crcMask) const;
  // dataBits = codedBits without its last L elements; crcPass = 1 when the parity matches.
  // False when the input cannot carry a CRC (L or fewer elements) or no polynomial is set.
  bool check(const std::vector<std::uint8_t>& codedBits, std::vector<std::uint8_t>& dataBits,
             std::uint8_t& crcPass, std::uint32_t crcMask) const;

  std::uint32_t getLength() const { return itsLength; }
  const std::vector<std::uint8_t>& getPolynomial() const { return itsPolynomial; }

 private:
  // Selects the generator of degree length whose coefficients listed are 1 (x^length is
  // always 1).
  void setPolynomial(std::uint32_t length, std::initializer_list<std::uint32_t> ones);
  // The remainder of a(x) x^L divided by the generator, a(x) being the low bits of n elements
  // (highest power first); bit j of the result is the coefficient of x^j.
  std::uint32_t remainder(const std::uint8_t* bits, std::size_t n) const;

  std::vector<std::uint8_t> itsPolynomial;  // entry j: coefficient of x^j, L + 1 entries
  std::uint32_t itsLength = 0;              // L, the number of parity bits
  std::uint32_t itsTaps = 0;                // the generator's low L coefficients as a word
  // The remainder step of eight message bits at once, indexed by the bits entering it.
  std::array<std::uint32_t, 256> itsByteTable{};
};

}  // namespace brannoc

#endif  // BRANNOC_KCRCGENERATOR_H
