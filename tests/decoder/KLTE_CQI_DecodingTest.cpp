// Tests of the (20,A) and (32,O) CQI block codes (TS 36.212 5.2.3.3, 5.2.2.6.4): the encoder
// and noise-free decoding against the transmitter's encoders, the processing-unit tie-break,
// and the setters' and size checks' messages.
#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <random>
#include <regex>
#include <string>
#include <vector>

#include "KLTE_CQI_Decoding.h"
#include "tx/ReedMullerCode.h"

namespace {

using brannoc::KLTE_CQI_Decoding;
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

Bits transmitterCodeword(std::int32_t type, std::uint32_t m, std::uint32_t numBits) {
  const Bits message = messageBits(m, numBits);
  return type == kPucch ? brannoc::tx::encodeRm20(message) : brannoc::tx::encodeRm32(message);
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

// Expects exactly the given error lines, each "File: ../s/KLTE_CQI_Decoding(<line>)<text>".
void expectErrorLines(const std::string& captured, const std::vector<std::string>& texts) {
  std::string pattern;
  for (const std::string& text : texts) {
    pattern += "File: \\.\\./s/KLTE_CQI_Decoding\\([0-9]+\\)" +
               std::regex_replace(text, std::regex(R"([()\[\]+.])"), R"(\$&)") + "\n";
  }
  EXPECT_TRUE(std::regex_match(captured, std::regex(pattern))) << captured;
}

TEST(KLTE_CQI_Decoding, EncodeAgreesWithTransmitter) {
  for (std::int32_t type : kTypes) {
    const KLTE_CQI_Decoding decoder(type, maxBits(type));
    for (std::uint32_t m = 0; m < (1U << maxBits(type)); m += 37) {
      Bits code(decoder.getEncodedSize());
      ASSERT_TRUE(decoder.encode(messageBits(m, maxBits(type)), code));
      EXPECT_EQ(code, transmitterCodeword(type, m, maxBits(type))) << "type " << type << " m " << m;
    }
  }
  const KLTE_CQI_Decoding decoder(kPucch, 2);  // any non-zero element counts as 1
  Bits code(20);
  ASSERT_TRUE(decoder.encode({2, 0}, code));
  EXPECT_EQ(code, Bits(20, 1));
}

// Noise-free soft values +k / -k of the transmitter's codeword decode to the message, for
// every message of every size.
TEST(KLTE_CQI_Decoding, DecodesEveryMessageFromTransmitterCodeword) {
  for (std::int32_t type : kTypes) {
    for (std::uint32_t numBits = 1; numBits <= maxBits(type); ++numBits) {
      const KLTE_CQI_Decoding decoder = makeDecoder(type, numBits, 1 + numBits % 4);
      std::uint32_t failures = 0;
      for (std::uint32_t m = 0; m < (1U << numBits); ++m) {
        const Bits code = transmitterCodeword(type, m, numBits);
        const std::int32_t k = 1 + static_cast<std::int32_t>(m % 127);
        Soft soft(code.size());
        for (std::size_t j = 0; j < code.size(); ++j) {
          soft[j] = code[j] ? k : -k;
        }
        failures += decodeToNumber(decoder, soft) != m;
      }
      EXPECT_EQ(failures, 0U) << "type " << type << " bits " << numBits;
    }
  }
  // Soft values at the ends of the 32-bit range must not overflow the correlation.
  const KLTE_CQI_Decoding decoder(kPusch, 11);
  const Bits code = transmitterCodeword(kPusch, 0x5A3, 11);
  Soft soft(32);
  for (std::size_t j = 0; j < 32; ++j) {
    soft[j] = code[j] ? INT32_MAX : INT32_MIN;
  }
  EXPECT_EQ(decodeToNumber(decoder, soft), 0x5A3U);
}

// All-zero soft values tie every candidate: the first candidate of the highest unit wins.
// Small random soft values give many ties; the decoder must pick exactly the candidate that
// the rule "largest metric, then highest unit (m >> 1) % NumPU, then smallest m" names.
TEST(KLTE_CQI_Decoding, TiesGoToTheHighestUnitThenTheSmallestMessage) {
  std::mt19937 random(20260603);
  std::uniform_int_distribution<std::int32_t> value(-2, 2);
  for (std::int32_t type : kTypes) {
    for (std::uint32_t numBits = 1; numBits <= maxBits(type); ++numBits) {
      std::vector<Bits> codewords;
      for (std::uint32_t m = 0; m < (1U << numBits); ++m) {
        codewords.push_back(transmitterCodeword(type, m, numBits));
      }
      for (std::uint32_t numPU = 1; numPU <= 4; ++numPU) {
        const KLTE_CQI_Decoding decoder = makeDecoder(type, numBits, numPU);
        if (numBits >= 3) {
          EXPECT_EQ(decodeToNumber(decoder, Soft(decoder.getEncodedSize(), 0)), 2 * (numPU - 1))
              << "type " << type << " bits " << numBits << " units " << numPU;
        }
        for (int trial = 0; trial < 4; ++trial) {
          Soft soft(decoder.getEncodedSize());
          for (std::int32_t& y : soft) {
            y = value(random);
          }
          std::int64_t bestMetric = INT64_MIN;
          std::uint32_t bestUnit = 0, best = 0;
          for (std::uint32_t m = 0; m < codewords.size(); ++m) {
            std::int64_t metric = 0;
            for (std::size_t j = 0; j < soft.size(); ++j) {
              metric += codewords[m][j] ? soft[j] : -soft[j];
            }
            const std::uint32_t unit = (m >> 1) % numPU;
            if (metric > bestMetric || (metric == bestMetric && unit > bestUnit)) {
              bestMetric = metric;
              bestUnit = unit;
              best = m;
            }
          }
          EXPECT_EQ(decodeToNumber(decoder, soft), best)
              << "type " << type << " bits " << numBits << " units " << numPU;
        }
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

TEST(KLTE_CQI_Decoding, RefusedSettersKeepValueAndReport) {
  KLTE_CQI_Decoding pucch(kPucch, 5);
  KLTE_CQI_Decoding pusch(kPusch, 5);
  pucch.setNumPU(3);
  const std::pair<std::function<bool()>, std::string> cases[] = {
      {[&] { return pucch.setNumBits(14); }, "Error: PUCCH CQI Number of bits invalid 14"},
      {[&] { return pusch.setNumBits(12); }, "Error: PUSCH CQI Number of bits invalid 12"},
      {[&] { return pucch.setNumPU(5); }, "Error: NumPU must be between 1 and 4 (5)"},
      {[&] { return pucch.setCQIType(2); }, "Error: PUCCH CQI type invalid 2"},
      {[&] { return pusch.setCQIType(-1); }, "Error: PUCCH CQI type invalid -1"},
  };
  for (const auto& [call, message] : cases) {
    testing::internal::CaptureStderr();
    EXPECT_FALSE(call());
    expectErrorLines(testing::internal::GetCapturedStderr(), {message});
  }
  EXPECT_EQ(pucch.getNumBits(), 5U);
  EXPECT_EQ(pusch.getNumBits(), 5U);
  EXPECT_EQ(pucch.getNumPU(), 3U);
  EXPECT_EQ(pusch.getCQIType(), 1U);
}

// Wrong vector sizes are refused with two lines and the output is neither resized nor
// written. The PUSCH decode messages have no blank before the size.
TEST(KLTE_CQI_Decoding, WrongSizesAreRefused) {
  struct Case {
    std::int32_t type;
    bool decoding;
    std::size_t infoSize, codeSize;
    std::vector<std::string> messages;
  };
  const Case cases[] = {
      {kPucch, false, 4, 20,
       {"Error: PUCCH CQI SrcData Size incorrect 4 Expected 5", "Error: PUCCH CQI encode Fail 0"}},
      {kPusch, false, 5, 20,
       {"Error: PUSCH CQI encData Size incorrect 20 Expected 32",
        "Error: PUSCH CQI encode Fail 1"}},
      {kPucch, true, 5, 32,
       {"Error: PUCCH CQI encData Size incorrect 32 Expected 20",
        "Error: PUCCH CQI decode Fail 0"}},
      {kPusch, true, 6, 32,
       {"Error: PUSCH CQI SrcData Size incorrect6 Expected 5", "Error: PUSCH CQI decode Fail 1"}},
      {kPusch, true, 5, 31,
       {"Error: PUSCH CQI encData Size incorrect31 Expected 32", "Error: PUSCH CQI decode Fail 1"}},
  };
  for (const Case& c : cases) {
    const KLTE_CQI_Decoding decoder(c.type, 5);
    Bits info(c.infoSize, 7), code(c.codeSize, 7);
    testing::internal::CaptureStderr();
    EXPECT_FALSE(c.decoding ? decoder.decode(Soft(c.codeSize, 3), info) : decoder.encode(info, code));
    expectErrorLines(testing::internal::GetCapturedStderr(), c.messages);
    EXPECT_EQ(info, Bits(c.infoSize, 7));
    EXPECT_EQ(code, Bits(c.codeSize, 7));
  }
}

}  // namespace
