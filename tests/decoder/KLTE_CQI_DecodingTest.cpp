// Tests of the (20,A) and (32,O) CQI block codes (TS 36.212 5.2.3.3, 5.2.2.6.4): the encoder
// and noise-free decoding against the transmitter's encoders, the processing-unit tie-break,
// and the setters' and size checks' messages.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "DecoderTestSupport.h"
#include "KLTE_CQI_Decoding.h"
#include "tx/ReedMullerCode.h"

namespace brannoc::test {
namespace {
using Bits = std::vector<std::uint8_t>;
using Soft = std::vector<std::int32_t>;

constexpr std::int32_t kPucch = KLTE_CQI_Decoding::CQI_TYPE_PUCCH;
constexpr std::int32_t kPusch = KLTE_CQI_Decoding::CQI_TYPE_PUSCH;
constexpr std::int32_t kTypes[] = {kPucch, kPusch};

std::uint32_t maxBits(std::int32_t type) { return type == kPucch ? 13 : 11; }

Bits messageBits(std::uint32_t m, std::uint32_t numBits) {
  Bits bits(numBits);
  for (std::uint32_t n = 0; n < numBits; ++n) {
    bits[n] = static_cast<std::uint8_t>((m >> n) & 1U);
  }
  return bits;
}

std::uint32_t messageNumber(const Bits& bits) {
  std::uint32_t m = 0;
  for (std::size_t n = 0; n < bits.size(); ++n) {
    m |= static_cast<std::uint32_t>(bits[n] != 0) << n;
  }
  return m;
}

// Decodes soft values into a message number.
std::uint32_t decodeToNumber(const KLTE_CQI_Decoding& decoder, const Soft& soft) {
  Bits decoded(decoder.getNumBits(), 9);
  EXPECT_TRUE(decoder.decode(soft, decoded));
  return messageNumber(decoded);
}

KLTE_CQI_Decoding makeDecoder(std::int32_t type, std::uint32_t numBits, std::uint32_t numPU) {
  KLTE_CQI_Decoding decoder(type, numBits);
  EXPECT_TRUE(decoder.setNumPU(numPU));
  return decoder;
}

// The decoder's error line around text.
std::string errorLine(const std::string& text) {
  return "File: ../s/KLTE_CQI_Decoding(#)" + text + "\n";
}

// Every message of every size: the encoder gives the transmitter's codeword (any non-zero
// element counting as 1), and noise-free soft values +k / -k of that codeword decode to the
// message.
TEST(KLTE_CQI_Decoding, EncodesAndDecodesEveryMessageLikeTheTransmitter) {
  for (std::int32_t type : kTypes) {
    for (std::uint32_t numBits = 1; numBits <= maxBits(type); ++numBits) {
      const KLTE_CQI_Decoding decoder = makeDecoder(type, numBits, 1 + numBits % 4);
      std::uint32_t failures = 0;
      for (std::uint32_t m = 0; m < (1U << numBits); ++m) {
        Bits message = messageBits(m, numBits), code(decoder.getEncodedSize());
        const Bits sent = type == kPucch ? tx::encodeRm20(message) : tx::encodeRm32(message);
        const std::int32_t k = 1 + static_cast<std::int32_t>(m % 127);
        Soft soft;
        for (std::uint8_t bit : sent) soft.push_back(bit ? k : -k);
        for (std::uint8_t& bit : message) bit = static_cast<std::uint8_t>(bit * (1 + m % 3));
        failures +=
            !decoder.encode(message, code) || code != sent || decodeToNumber(decoder, soft) != m;
      }
      EXPECT_EQ(failures, 0U) << "type " << type << " bits " << numBits;
    }
  }
  // Soft values at the ends of the 32-bit range must not overflow the correlation.
  const Bits code = tx::encodeRm32(messageBits(0x5A3, 11));
  Soft soft;
  for (std::uint8_t bit : code) soft.push_back(bit ? INT32_MAX : INT32_MIN);
  EXPECT_EQ(decodeToNumber(KLTE_CQI_Decoding(kPusch, 11), soft), 0x5A3U);
}

// All-zero soft values tie every candidate: the first candidate, m = 2 (NumPU - 1), of the
// highest unit (m >> 1) mod NumPU wins.
TEST(KLTE_CQI_Decoding, TiesGoToTheFirstCandidateOfTheHighestUnit) {
  for (std::int32_t type : kTypes) {
    for (std::uint32_t numBits = 3; numBits <= maxBits(type); ++numBits) {
      for (std::uint32_t numPU = 1; numPU <= 4; ++numPU) {
        const KLTE_CQI_Decoding decoder = makeDecoder(type, numBits, numPU);
        EXPECT_EQ(decodeToNumber(decoder, Soft(decoder.getEncodedSize(), 0)), 2 * (numPU - 1))
            << "type " << type << " bits " << numBits << " units " << numPU;
      }
    }
  }
}

TEST(KLTE_CQI_Decoding, NoInformationBitsLeavesOutputsUntouched) {
  for (std::int32_t type : kTypes) {
    const KLTE_CQI_Decoding decoder(type, 0);
    Bits code(3, 7);
    EXPECT_TRUE(decoder.encode(Bits(5, 1), code));
    EXPECT_EQ(code, Bits(3, 7));
    Bits decoded(2, 7);
    EXPECT_TRUE(decoder.decode(Soft(4, 1), decoded));
    EXPECT_EQ(decoded, Bits(2, 7));
  }
}

// Refused setters keep their value; wrong vector sizes are refused with two lines and the
// output is neither resized nor written. The PUSCH decode messages have no blank before the
// size.
TEST(KLTE_CQI_Decoding, RefusalsReportTheirLines) {
  KLTE_CQI_Decoding pucch(kPucch, 5), pusch(kPusch, 5);
  pucch.setNumPU(3);
  Bits info4(4, 7), info5(5, 7), info6(6, 7), code20(20, 7);
  expectRefusals({
      {[&] { return pucch.setNumBits(14); },
       errorLine("Error: PUCCH CQI Number of bits invalid 14")},
      {[&] { return pusch.setNumBits(12); },
       errorLine("Error: PUSCH CQI Number of bits invalid 12")},
      {[&] { return pucch.setNumPU(5); }, errorLine("Error: NumPU must be between 1 and 4 (5)")},
      {[&] { return pucch.setCQIType(2); }, errorLine("Error: PUCCH CQI type invalid 2")},
      {[&] { return pusch.setCQIType(-1); }, errorLine("Error: PUCCH CQI type invalid -1")},
      {[&] { return pucch.encode(info4, code20); },
       errorLine("Error: PUCCH CQI SrcData Size incorrect 4 Expected 5") +
           errorLine("Error: PUCCH CQI encode Fail 0")},
      {[&] { return pusch.encode(info5, code20); },
       errorLine("Error: PUSCH CQI encData Size incorrect 20 Expected 32") +
           errorLine("Error: PUSCH CQI encode Fail 1")},
      {[&] { return pucch.decode(Soft(32, 3), info5); },
       errorLine("Error: PUCCH CQI encData Size incorrect 32 Expected 20") +
           errorLine("Error: PUCCH CQI decode Fail 0")},
      {[&] { return pusch.decode(Soft(32, 3), info6); },
       errorLine("Error: PUSCH CQI SrcData Size incorrect6 Expected 5") +
           errorLine("Error: PUSCH CQI decode Fail 1")},
      {[&] { return pusch.decode(Soft(31, 3), info5); },
       errorLine("Error: PUSCH CQI encData Size incorrect31 Expected 32") +
           errorLine("Error: PUSCH CQI decode Fail 1")},
  });
  EXPECT_EQ(pucch.getNumBits(), 5U);
  EXPECT_EQ(pusch.getNumBits(), 5U);
  EXPECT_EQ(pucch.getNumPU(), 3U);
  EXPECT_EQ(pusch.getCQIType(), 1U);
  EXPECT_EQ(info5, Bits(5, 7));
  EXPECT_EQ(info6, Bits(6, 7));
  EXPECT_EQ(code20, Bits(20, 7));
}

}  // namespace
}  // namespace brannoc::test
