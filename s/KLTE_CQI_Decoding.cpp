// KLTE_CQI_Decoding: the (20,A) and (32,O) Reed-Muller block codes of TS 36.212 clauses
// 5.2.3.3 and 5.2.2.6.4, and their exhaustive maximum-likelihood decoder.
#include "KLTE_CQI_Decoding.h"

#include <array>
#include <bit>
#include <string_view>

#include "errorLine.h"

namespace brannoc {

namespace {

constexpr std::string_view kSource = "../s/KLTE_CQI_Decoding";

// TS 36.212 Table 5.2.3.3-1: basis sequences M(i,0..12) of the (20,A) code.
struct Rm20Row {
  std::uint8_t i;
  std::uint8_t M[13];
};
constexpr Rm20Row kRm20Basis[] = {
#include "tables/rm_20_a_basis.inc"
};

// TS 36.212 Table 5.2.2.6.4-1: basis sequences M(i,0..10) of the (32,O) code.
struct Rm32Row {
  std::uint8_t i;
  std::uint8_t M[11];
};
constexpr Rm32Row kRm32Basis[] = {
#include "tables/rm_32_o_basis.inc"
};

constexpr std::uint32_t kPucchEncodedSize = 20;
constexpr std::uint32_t kPucchMaxBits = 13;
constexpr std::uint32_t kPuschEncodedSize = 32;
constexpr std::uint32_t kPuschMaxBits = 11;
static_assert(std::size(kRm20Basis) == kPucchEncodedSize);
static_assert(std::size(kRm32Basis) == kPuschEncodedSize);

// Column 0 of both basis tables is all ones: every codeword's complement is a codeword.
template <typename Row, std::size_t Rows>
constexpr bool firstColumnAllOnes(const Row (&table)[Rows]) {
  for (const Row& row : table) {
    if (row.M[0] != 1) {
      return false;
    }
  }
  return true;
}
static_assert(firstColumnAllOnes(kRm20Basis) && firstColumnAllOnes(kRm32Basis));

// The starting best metric; the all-zero and all-one codewords have opposite metrics, so
// one of them always reaches 0 or more and beats it.
constexpr std::int64_t kInitialBestMetric = -10000;

// Column n of the basis table as a mask of code positions (bit i set when M(i,n) = 1).
template <typename Row, std::size_t Rows>
std::uint32_t columnMask(const Row (&table)[Rows], std::uint32_t n) {
  std::uint32_t mask = 0;
  for (std::size_t i = 0; i < Rows; ++i) {
    mask |= static_cast<std::uint32_t>(table[i].M[n] & 1U) << i;
  }
  return mask;
}

std::uint32_t basisColumn(std::uint32_t type, std::uint32_t n) {
  return type == KLTE_CQI_Decoding::CQI_TYPE_PUCCH ? columnMask(kRm20Basis, n)
                                                   : columnMask(kRm32Basis, n);
}

}  // namespace

KLTE_CQI_Decoding::KLTE_CQI_Decoding() : itsCQIType(CQI_TYPE_PUCCH), itsNumBits(0), itsNumPU(1) {}

KLTE_CQI_Decoding::KLTE_CQI_Decoding(std::int32_t type) : KLTE_CQI_Decoding() { setCQIType(type); }

KLTE_CQI_Decoding::KLTE_CQI_Decoding(std::int32_t type, std::uint32_t numBits)
    : KLTE_CQI_Decoding() {
  setCQIType(type);
  setNumBits(numBits);
}

bool KLTE_CQI_Decoding::setCQIType(std::int32_t type) {
  if (type != static_cast<std::int32_t>(CQI_TYPE_PUCCH) &&
      type != static_cast<std::int32_t>(CQI_TYPE_PUSCH)) {
    errorLineFile(kSource, __LINE__, "Error: PUCCH CQI type invalid ", type);
    return false;
  }
  itsCQIType = static_cast<std::uint32_t>(type);
  return true;
}

bool KLTE_CQI_Decoding::setNumBits(std::uint32_t numBits) {
  if (itsCQIType == CQI_TYPE_PUCCH) {
    if (numBits > kPucchMaxBits) {
      errorLineFile(kSource, __LINE__, "Error: PUCCH CQI Number of bits invalid ", numBits);
      return false;
    }
  } else if (itsCQIType == CQI_TYPE_PUSCH) {
    if (numBits > kPuschMaxBits) {
      errorLineFile(kSource, __LINE__, "Error: PUSCH CQI Number of bits invalid ", numBits);
      return false;
    }
  } else {
    errorLineFile(kSource, __LINE__, "Error: INCORRECT Type set ", itsCQIType);
    return false;
  }
  itsNumBits = numBits;
  return true;
}

bool KLTE_CQI_Decoding::setNumPU(std::uint32_t numPU) {
  if (numPU < 1 || numPU > 4) {
    errorLineFile(kSource, __LINE__, "Error: NumPU must be between 1 and 4 (", numPU, ")");
    return false;
  }
  itsNumPU = numPU;
  return true;
}

std::uint32_t KLTE_CQI_Decoding::getMaxNumBits() const {
  if (itsCQIType == CQI_TYPE_PUCCH) {
    return kPucchMaxBits;
  }
  if (itsCQIType == CQI_TYPE_PUSCH) {
    return kPuschMaxBits;
  }
  errorLineFile(kSource, __LINE__, "Error: Invalid CQI Type ");
  return 0;
}

std::uint32_t KLTE_CQI_Decoding::getEncodedSize() const {
  if (itsCQIType == CQI_TYPE_PUCCH) {
    return kPucchEncodedSize;
  }
  if (itsCQIType == CQI_TYPE_PUSCH) {
    return kPuschEncodedSize;
  }
  errorLineFile(kSource, __LINE__, "Error: Invalid CQI Type ");
  return 0;
}

// The size checks of encode (information bits in, code bits out) and decode (code soft
// values in, information bits out). The two PUSCH decode messages carry no blank before the
// size, unlike all the others.
bool KLTE_CQI_Decoding::checkSizes(std::size_t infoSize, std::size_t codeSize,
                                   bool decoding) const {
  const bool pucch = itsCQIType == CQI_TYPE_PUCCH;
  const std::string_view code = pucch ? "PUCCH" : "PUSCH";
  const std::string_view gap = !pucch && decoding ? "" : " ";
  const std::uint32_t encodedSize = pucch ? kPucchEncodedSize : kPuschEncodedSize;
  if (infoSize != itsNumBits) {
    errorLineFile(kSource, __LINE__, "Error: ", code, " CQI SrcData Size incorrect", gap, infoSize,
                  " Expected ", itsNumBits);
    return false;
  }
  if (codeSize != encodedSize) {
    errorLineFile(kSource, __LINE__, "Error: ", code, " CQI encData Size incorrect", gap, codeSize,
                  " Expected ", encodedSize);
    return false;
  }
  return true;
}

// The type dispatch shared by encode and decode: an unknown type, or wrong sizes followed by
// the type's "encode Fail" or "decode Fail" line.
bool KLTE_CQI_Decoding::acceptOperation(std::size_t infoSize, std::size_t codeSize,
                                        bool decoding) const {
  if (itsCQIType != CQI_TYPE_PUCCH && itsCQIType != CQI_TYPE_PUSCH) {
    errorLineFile(kSource, __LINE__, "Error: Incorrect Type Set ", itsCQIType);
    return false;
  }
  if (!checkSizes(infoSize, codeSize, decoding)) {
    const std::string_view code = itsCQIType == CQI_TYPE_PUCCH ? "PUCCH" : "PUSCH";
    errorLineFile(kSource, __LINE__, "Error: ", code, " CQI ", decoding ? "decode" : "encode",
                  " Fail ", itsCQIType);
    return false;
  }
  return true;
}

bool KLTE_CQI_Decoding::encode(const std::vector<std::uint8_t>& infoBits,
                               std::vector<std::uint8_t>& codeBits) const {
  if (itsNumBits == 0) {
    return true;
  }
  if (!acceptOperation(infoBits.size(), codeBits.size(), false)) {
    return false;
  }
  encodeBits(infoBits, codeBits);
  return true;
}

bool KLTE_CQI_Decoding::decode(const std::vector<std::int32_t>& softBits,
                               std::vector<std::uint8_t>& infoBits) const {
  if (itsNumBits == 0) {
    return true;
  }
  if (!acceptOperation(infoBits.size(), softBits.size(), true)) {
    return false;
  }
  decodeBits(softBits, infoBits);
  return true;
}

// b_i = (sum over n < A of a_n * M(i,n)) mod 2, i over the code positions.
void KLTE_CQI_Decoding::encodeBits(const std::vector<std::uint8_t>& infoBits,
                                   std::vector<std::uint8_t>& codeBits) const {
  std::uint32_t codeword = 0;
  for (std::uint32_t n = 0; n < itsNumBits; ++n) {
    if (infoBits[n] != 0) {
      codeword ^= basisColumn(itsCQIType, n);
    }
  }
  for (std::size_t i = 0; i < codeBits.size(); ++i) {
    codeBits[i] = static_cast<std::uint8_t>((codeword >> i) & 1U);
  }
}

// Exhaustive correlation over the candidate messages m = 0 .. 2^A - 1 in increasing order
// (candidate bit n = bit n of m). The metric of a candidate is the sum of +y_j where its
// codeword has a 1 and -y_j where it has a 0. Candidates are dealt to the processing units
// in pairs, unit (m >> 1) mod NumPU; a strictly larger metric wins, and an equal metric wins
// when it comes from a higher unit.
//
// A codeword is held as a mask of code positions, the XOR of the basis columns of the set
// message bits, taken from two small tables (low six and high seven message bits); its
// metric is the sum of four per-byte partial correlations. Both are exact rearrangements of
// the per-candidate encoding and correlation, built once per call.
//
// The metric is accumulated in 64 bits: for soft values that fit the 8:5 format this is the
// hardware's 32-bit sum, and for any 32-bit soft values it cannot overflow.
void KLTE_CQI_Decoding::decodeBits(const std::vector<std::int32_t>& softBits,
                                   std::vector<std::uint8_t>& infoBits) const {
  const std::uint32_t numBits = itsNumBits;
  const std::uint32_t numCandidates = 1U << numBits;
  constexpr std::uint32_t kLowBits = 6;

  std::array<std::uint32_t, 13> column{};
  for (std::uint32_t n = 0; n < numBits; ++n) {
    column[n] = basisColumn(itsCQIType, n);
  }
  // Codeword masks of the low six and the high message bits.
  std::array<std::uint32_t, 1U << kLowBits> lowMask{};
  std::array<std::uint32_t, 1U << (13 - kLowBits)> highMask{};
  for (std::uint32_t x = 1; x < lowMask.size(); ++x) {
    const auto n = static_cast<std::uint32_t>(std::countr_zero(x));
    lowMask[x] = lowMask[x & (x - 1)] ^ (n < numBits ? column[n] : 0U);
  }
  for (std::uint32_t x = 1; x < highMask.size(); ++x) {
    const auto n = kLowBits + static_cast<std::uint32_t>(std::countr_zero(x));
    highMask[x] = highMask[x & (x - 1)] ^ (n < numBits ? column[n] : 0U);
  }
  // partial[g][b]: correlation of code positions 8g .. 8g+7 with the byte b of a codeword.
  std::array<std::array<std::int64_t, 256>, 4> partial{};
  for (std::size_t g = 0; g < partial.size(); ++g) {
    std::int64_t allZero = 0;
    for (std::size_t j = 8 * g; j < 8 * g + 8 && j < softBits.size(); ++j) {
      allZero -= softBits[j];
    }
    partial[g][0] = allZero;
    for (std::uint32_t b = 1; b < 256; ++b) {
      const std::size_t j = 8 * g + static_cast<std::size_t>(std::countr_zero(b));
      const std::int64_t flip = j < softBits.size() ? 2 * std::int64_t{softBits[j]} : 0;
      partial[g][b] = partial[g][b & (b - 1)] + flip;
    }
  }

  std::int64_t bestMetric = kInitialBestMetric;
  std::uint32_t bestUnit = 0;
  std::uint32_t bestCandidate = 0;
  bool found = false;
  auto consider = [&](std::uint32_t m, std::int64_t metric, std::uint32_t unit) {
    if (metric > bestMetric) {
      bestMetric = metric;
      bestUnit = unit;
      bestCandidate = m;
      found = true;
    } else if (metric == bestMetric && itsNumPU > 1 && unit > bestUnit) {
      bestUnit = unit;
      bestCandidate = m;
      found = true;
    }
  };
  // Candidates go in pairs (m, m + 1) through one unit, unit = (m >> 1) mod NumPU. Message
  // bit 0 multiplies the all-ones column, so the odd candidate's codeword is the complement
  // of the even one's and its metric the negative.
  std::uint32_t unit = 0;
  for (std::uint32_t m = 0; m < numCandidates; m += 2) {
    const std::uint32_t codeword = lowMask[m & ((1U << kLowBits) - 1)] ^ highMask[m >> kLowBits];
    const std::int64_t metric = partial[0][codeword & 0xFF] + partial[1][(codeword >> 8) & 0xFF] +
                                partial[2][(codeword >> 16) & 0xFF] + partial[3][codeword >> 24];
    consider(m, metric, unit);
    consider(m + 1, -metric, unit);
    if (++unit == itsNumPU) {
      unit = 0;
    }
  }
  if (found) {
    for (std::uint32_t n = 0; n < numBits; ++n) {
      infoBits[n] = static_cast<std::uint8_t>((bestCandidate >> n) & 1U);
    }
  }
}

}  // namespace brannoc
