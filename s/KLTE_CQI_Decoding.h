// KLTE_CQI_Decoding: encoder and exhaustive maximum-likelihood decoder of the two Reed-Muller
// block codes that carry short CQI reports, TS 36.212 clause 5.2.3.3 (the (20,A) code on
// PUCCH, up to 13 bits) and clause 5.2.2.6.4 (the (32,O) code on PUSCH, up to 11 bits).
// Decoding correlates the received soft values with every one of the 2^A codewords in
// increasing message order and breaks ties the way the hardware's 1 to 4 parallel
// processing units do.
#ifndef BRANNOC_KLTE_CQI_DECODING_H
#define BRANNOC_KLTE_CQI_DECODING_H

#include <cstdint>
#include <vector>

namespace brannoc {

class KLTE_CQI_Decoding {
 public:
  static constexpr std::uint32_t CQI_TYPE_PUCCH = 0;  // (20,A) code
  static constexpr std::uint32_t CQI_TYPE_PUSCH = 1;  // (32,O) code

  // Type PUCCH, no information bits, one processing unit.
  KLTE_CQI_Decoding();
  explicit KLTE_CQI_Decoding(std::int32_t type);
  KLTE_CQI_Decoding(std::int32_t type, std::uint32_t numBits);

  // Each setter prints one line and keeps the previous value when the value is refused.
  bool setCQIType(std::int32_t type);
  bool setNumBits(std::uint32_t numBits);
  bool setNumPU(std::uint32_t numPU);

  std::uint32_t getCQIType() const { return itsCQIType; }
  std::uint32_t getNumBits() const { return itsNumBits; }
  std::uint32_t getNumPU() const { return itsNumPU; }
  // 13 (PUCCH) or 11 (PUSCH).
  std::uint32_t getMaxNumBits() const;
  // 20 (PUCCH) or 32 (PUSCH).
  std::uint32_t getEncodedSize() const;

  // infoBits holds itsNumBits bits (any non-zero element counts as 1); codeBits must already
  // hold the encoded size. With no information bits nothing is checked or written.
  bool encode(const std::vector<std::uint8_t>& infoBits, std::vector<std::uint8_t>& codeBits) const;
  // softBits holds the encoded size of soft values (positive favours 1); infoBits must
  // already hold itsNumBits elements and receives the most likely message.
  bool decode(const std::vector<std::int32_t>& softBits, std::vector<std::uint8_t>& infoBits) const;

 private:
  bool acceptOperation(std::size_t infoSize, std::size_t codeSize, bool decoding) const;
  bool checkSizes(std::size_t infoSize, std::size_t codeSize, bool decoding) const;
  void encodeBits(const std::vector<std::uint8_t>& infoBits,
                  std::vector<std::uint8_t>& codeBits) const;
  void decodeBits(const std::vector<std::int32_t>& softBits,
                  std::vector<std::uint8_t>& infoBits) const;

  std::uint32_t itsCQIType;
  std::uint32_t itsNumBits;
  std::uint32_t itsNumPU;
};

}  // namespace brannoc

#endif  // BRANNOC_KLTE_CQI_DECODING_H
