// Tests of the (20,A) and (32,O) CQI block codes (TS 36.212 5.2.3.3, 5.2.2.6.4): known
// codewords, the processing-unit tie-break, round trips from the transmitter's encoders,
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

Bits bitsFromString(const std::string& text) {
  Bits bits;
  for (char ch : text) {
    bits.push_back(static_cast<std::uint8_t>(ch - '0'));
  }
  return bits;
}

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

Bits transmitterCodeword(std::int32_t type, const Bits& message) {
  return type == kPucch ? brannoc::tx::encodeRm20(message) : brannoc::tx::encodeRm32(message);
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

KLTE_CQI_Decoding makeDecoder(std::int32_t type, std::uint32_t numBits, std::uint32_t numPU) {
  KLTE_CQI_Decoding decoder(type, numBits);
  EXPECT_TRUE(decoder.setNumPU(numPU));
  return decoder;
}

// Modulo-2 row sums of the basis tables, and column 0 being all ones.
TEST(KLTE_CQI_Decoding, EncodeGivesStandardCodewords) {
  struct Case {
    std::int32_t type;
    std::uint32_t numBits;
    std::string message;
    std::string codeword;
  };
  const Case cases[] = {
      {kPucch, 13, "1111111111111", "00010110111111011111"},
      {kPusch, 11, "11111111111", "11010110111111101111011110000011"},
      {kPucch, 13, "1000000000000", std::string(20, '1')},
      {kPusch, 5, "10000", std::string(32, '1')},
      {kPucch, 2, "20", std::string(20, '1')},  // any non-zero element counts as 1
  };
  for (const Case& c : cases) {
    const KLTE_CQI_Decoding decoder(c.type, c.numBits);
    Bits code(decoder.getEncodedSize(), 7);
    ASSERT_TRUE(decoder.encode(bitsFromString(c.message), code));
    EXPECT_EQ(code, bitsFromString(c.codeword)) << c.message;
  }
}

TEST(KLTE_CQI_Decoding, EncodeAgreesWithTransmitter) {
  for (std::int32_t type : {kPucch, kPusch}) {
    const std::uint32_t maxBits = type == kPucch ? 13 : 11;
    const KLTE_CQI_Decoding decoder(type, maxBits);
    for (std::uint32_t m = 0; m < (1U << maxBits); m += 37) {
      const Bits message = messageBits(m, maxBits);
      Bits code(decoder.getEncodedSize());
      ASSERT_TRUE(decoder.encode(message, code));
      EXPECT_EQ(code, transmitterCodeword(type, message)) << "type " << type << " m " << m;
    }
  }
}

// Noise-free soft values +k / -k of the transmitter's codeword decode to the message, for
// every message of every size.
TEST(KLTE_CQI_Decoding, DecodesEveryMessageFromTransmitterCodeword) {
  for (std::int32_t type : {kPucch, kPusch}) {
    const std::uint32_t maxBits = type == kPucch ? 13 : 11;
    for (std::uint32_t numBits = 1; numBits <= maxBits; ++numBits) {
      const KLTE_CQI_Decoding decoder = makeDecoder(type, numBits, 1 + numBits % 4);
      std::uint32_t failures = 0;
      for (std::uint32_t m = 0; m < (1U << numBits); ++m) {
        const Bits code = transmitterCodeword(type, messageBits(m, numBits));
        const std::int32_t k = 1 + static_cast<std::int32_t>(m % 127);
        Soft soft(code.size());
        for (std::size_t j = 0; j < code.size(); ++j) {
          soft[j] = code[j] ? k : -k;
        }
        Bits decoded(numBits, 9);
        ASSERT_TRUE(decoder.decode(soft, decoded));
        failures += messageNumber(decoded) != m;
      }
      EXPECT_EQ(failures, 0U) << "type " << type << " bits " << numBits;
    }
  }
}

// All-zero soft values tie every candidate: the first candidate of the highest unit wins.
TEST(KLTE_CQI_Decoding, TieBreakPicksFirstCandidateOfHighestUnit) {
  const std::uint32_t expected[] = {0, 2, 4, 6};
  for (std::int32_t type : {kPucch, kPusch}) {
    const std::uint32_t maxBits = type == kPucch ? 13 : 11;
    for (std::uint32_t numBits = 3; numBits <= maxBits; ++numBits) {
      for (std::uint32_t numPU = 1; numPU <= 4; ++numPU) {
        const KLTE_CQI_Decoding decoder = makeDecoder(type, numBits, numPU);
        const Soft soft(decoder.getEncodedSize(), 0);
        Bits decoded(numBits, 1);
        ASSERT_TRUE(decoder.decode(soft, decoded));
        EXPECT_EQ(messageNumber(decoded), expected[numPU - 1])
            << "type " << type << " bits " << numBits << " units " << numPU;
      }
    }
  }
}

// Small random soft values give many ties; the decoder must pick exactly the candidate that
// the rule "largest metric, then highest unit, then smallest m" names, evaluated here
// candidate by candidate over the transmitter's codewords.
TEST(KLTE_CQI_Decoding, DecodeMatchesCandidateByCandidateRule) {
  std::mt19937 random(20260603);
  std::uniform_int_distribution<std::int32_t> value(-2, 2);
  for (std::int32_t type : {kPucch, kPusch}) {
    const std::uint32_t maxBits = type == kPucch ? 13 : 11;
    for (std::uint32_t numBits = 1; numBits <= maxBits; ++numBits) {
      std::vector<Bits> codewords;
      for (std::uint32_t m = 0; m < (1U << numBits); ++m) {
        codewords.push_back(transmitterCodeword(type, messageBits(m, numBits)));
      }
      for (std::uint32_t numPU = 1; numPU <= 4; ++numPU) {
        const KLTE_CQI_Decoding decoder = makeDecoder(type, numBits, numPU);
        for (int trial = 0; trial < 4; ++trial) {
          Soft soft(decoder.getEncodedSize());
          for (std::int32_t& y : soft) {
            y = value(random);
          }
          std::int64_t bestMetric = INT64_MIN;
          std::uint32_t bestUnit = 0;
          std::uint32_t best = 0;
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
          Bits decoded(numBits);
          ASSERT_TRUE(decoder.decode(soft, decoded));
          EXPECT_EQ(messageNumber(decoded), best)
              << "type " << type << " bits " << numBits << " units " << numPU;
        }
      }
    }
  }
}

// Soft values at the ends of the 32-bit range must not overflow the correlation.
TEST(KLTE_CQI_Decoding, ExtremeSoftValuesStillDecode) {
  const KLTE_CQI_Decoding decoder(kPusch, 11);
  const std::uint32_t m = 0x5A3;
  const Bits code = transmitterCodeword(kPusch, messageBits(m, 11));
  Soft soft(32);
  for (std::size_t j = 0; j < 32; ++j) {
    soft[j] = code[j] ? INT32_MAX : INT32_MIN;
  }
  Bits decoded(11);
  ASSERT_TRUE(decoder.decode(soft, decoded));
  EXPECT_EQ(messageNumber(decoded), m);
}

TEST(KLTE_CQI_Decoding, NoInformationBitsLeavesOutputsUntouched) {
  for (std::int32_t type : {kPucch, kPusch}) {
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
  struct Case {
    std::function<bool()> call;
    std::string message;
  };
  const Case cases[] = {
      {[&] { return pucch.setNumBits(14); }, "Error: PUCCH CQI Number of bits invalid 14"},
      {[&] { return pusch.setNumBits(12); }, "Error: PUSCH CQI Number of bits invalid 12"},
      {[&] { return pucch.setNumPU(0); }, "Error: NumPU must be between 1 and 4 (0)"},
      {[&] { return pucch.setNumPU(5); }, "Error: NumPU must be between 1 and 4 (5)"},
      {[&] { return pucch.setCQIType(2); }, "Error: PUCCH CQI type invalid 2"},
      {[&] { return pusch.setCQIType(-1); }, "Error: PUCCH CQI type invalid -1"},
  };
  for (const Case& c : cases) {
    testing::internal::CaptureStderr();
    EXPECT_FALSE(c.call());
    expectErrorLines(testing::internal::GetCapturedStderr(), {c.message});
  }
  EXPECT_EQ(pucch.getNumBits(), 5U);
  EXPECT_EQ(pusch.getNumBits(), 5U);
  EXPECT_EQ(pucch.getNumPU(), 3U);
  EXPECT_EQ(pucch.getCQIType(), 0U);
  EXPECT_EQ(pusch.getCQIType(), 1U);
  EXPECT_TRUE(pucch.setNumBits(13));
  EXPECT_TRUE(pusch.setNumBits(11));
  EXPECT_TRUE(pucch.setNumPU(4));
}

// Wrong vector sizes are refused with two lines and the output is neither resized nor
// written. The PUSCH decode messages have no blank before the size.
TEST(KLTE_CQI_Decoding, WrongSizesAreRefused) {
  struct Case {
    std::int32_t type;
    bool decoding;
    std::size_t infoSize;
    std::size_t codeSize;
    std::vector<std::string> messages;
  };
  const Case cases[] = {
      {kPucch, false, 4, 20,
       {"Error: PUCCH CQI SrcData Size incorrect 4 Expected 5", "Error: PUCCH CQI encode Fail 0"}},
      {kPucch, false, 5, 21,
       {"Error: PUCCH CQI encData Size incorrect 21 Expected 20",
        "Error: PUCCH CQI encode Fail 0"}},
      {kPusch, false, 6, 32,
       {"Error: PUSCH CQI SrcData Size incorrect 6 Expected 5", "Error: PUSCH CQI encode Fail 1"}},
      {kPusch, false, 5, 20,
       {"Error: PUSCH CQI encData Size incorrect 20 Expected 32",
        "Error: PUSCH CQI encode Fail 1"}},
      {kPucch, true, 4, 20,
       {"Error: PUCCH CQI SrcData Size incorrect 4 Expected 5", "Error: PUCCH CQI decode Fail 0"}},
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
    testing::internal::CaptureStderr();
    bool ok = true;
    if (c.decoding) {
      Bits decoded(c.infoSize, 7);
      ok = decoder.decode(Soft(c.codeSize, 3), decoded);
      EXPECT_EQ(decoded, Bits(c.infoSize, 7));
    } else {
      Bits code(c.codeSize, 7);
      ok = decoder.encode(Bits(c.infoSize, 1), code);
      EXPECT_EQ(code, Bits(c.codeSize, 7));
    }
    EXPECT_FALSE(ok);
    expectErrorLines(testing::internal::GetCapturedStderr(), c.messages);
  }
}

}  // namespace
