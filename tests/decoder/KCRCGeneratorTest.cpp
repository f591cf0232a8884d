// KCRCGenerator: known answers of the four LTE generators, parity order, masks, checking.
#include "KCRCGenerator.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace {

using brannoc::KCRCGenerator;

using Bits = std::vector<std::uint8_t>;

Bits bitsOfText(const std::string& text) {
  Bits bits;
  for (unsigned char c : text) {
    for (int i = 7; i >= 0; --i) bits.push_back((c >> i) & 1u);
  }
  return bits;
}

std::uint32_t parityWord(const Bits& coded, std::size_t n, std::uint32_t L) {
  std::uint32_t word = 0;
  for (std::uint32_t i = 0; i < L; ++i) word = (word << 1) | coded[n + i];
  return word;
}

enum class Generator { A24, B24, C16, C8 };

void select(KCRCGenerator& crc, Generator g) {
  switch (g) {
    case Generator::A24: crc.setCRC24A(); break;
    case Generator::B24: crc.setCRC24B(); break;
    case Generator::C16: crc.setCRC16(); break;
    case Generator::C8: crc.setCRC8(); break;
  }
}

struct KnownAnswer {
  Generator generator;
  std::uint32_t length;
  std::uint32_t lowCoefficients;  // the generator without its top term
  std::uint32_t checkOf123456789;  // CRC catalogue check value (zero init, no reflection)
};

class CrcKnownAnswer : public testing::TestWithParam<KnownAnswer> {};

// x^L mod g(x) is g's low part: the parity of the single bit 1 spells the polynomial, highest
// power first.
TEST_P(CrcKnownAnswer, SingleOneBitGivesThePolynomialHighestPowerFirst) {
  KCRCGenerator crc;
  select(crc, GetParam().generator);
  Bits coded;
  ASSERT_TRUE(crc.generate({1}, coded, 0));
  ASSERT_EQ(coded.size(), 1 + GetParam().length);
  EXPECT_EQ(coded[0], 1);
  EXPECT_EQ(parityWord(coded, 1, GetParam().length), GetParam().lowCoefficients);
}

TEST_P(CrcKnownAnswer, CatalogueCheckValueOfAsciiDigits) {
  KCRCGenerator crc;
  select(crc, GetParam().generator);
  const Bits data = bitsOfText("123456789");
  Bits coded;
  ASSERT_TRUE(crc.generate(data, coded, 0));
  EXPECT_EQ(parityWord(coded, data.size(), GetParam().length), GetParam().checkOf123456789);
}

INSTANTIATE_TEST_SUITE_P(
    LteGenerators, CrcKnownAnswer,
    testing::Values(KnownAnswer{Generator::A24, 24, 0x864CFB, 0xCDE703},
                    KnownAnswer{Generator::B24, 24, 0x800063, 0x23EF52},
                    KnownAnswer{Generator::C16, 16, 0x1021, 0x31C3},
                    KnownAnswer{Generator::C8, 8, 0x9B, 0xEA}));

TEST(KCRCGenerator, Crc8OfOneBitIsTheDataBitThen0x9B) {
  KCRCGenerator crc;
  crc.setCRC8();
  Bits coded;
  ASSERT_TRUE(crc.generate({1}, coded, 0));
  EXPECT_EQ(coded, (Bits{1, 1, 0, 0, 1, 1, 0, 1, 1}));
}

TEST(KCRCGenerator, EmptyInputGivesLZeroParityBits) {
  KCRCGenerator crc;
  crc.setCRC24A();
  Bits coded{9, 9};
  ASSERT_TRUE(crc.generate({}, coded, 0));
  EXPECT_EQ(coded, Bits(24, 0));
}

TEST(KCRCGenerator, MaskBitITogglesParityBitI) {
  KCRCGenerator crc;
  crc.setCRC16();
  const Bits data = bitsOfText("LTE");
  Bits plain, masked;
  crc.generate(data, plain, 0);
  crc.generate(data, masked, 0x8001);
  ASSERT_EQ(plain.size(), masked.size());
  for (std::size_t i = 0; i < plain.size(); ++i) {
    const bool toggled = i == data.size() || i == data.size() + 15;
    EXPECT_EQ(masked[i], plain[i] ^ (toggled ? 1 : 0)) << "position " << i;
  }
  Bits out;
  std::uint8_t pass = 9;
  ASSERT_TRUE(crc.check(masked, out, pass, 0x8001));
  EXPECT_EQ(pass, 1);
  ASSERT_TRUE(crc.check(masked, out, pass, 0));
  EXPECT_EQ(pass, 0);
}

TEST(KCRCGenerator, CheckPassesOnGeneratedWordAndFailsOnEverySingleFlip) {
  KCRCGenerator crc;
  crc.setCRC24B();
  const Bits data = bitsOfText("code block");
  Bits coded;
  crc.generate(data, coded, 0);
  Bits out;
  std::uint8_t pass = 0;
  ASSERT_TRUE(crc.check(coded, out, pass, 0));
  EXPECT_EQ(pass, 1);
  EXPECT_EQ(out, data);
  for (std::size_t i = 0; i < coded.size(); ++i) {
    Bits flipped = coded;
    flipped[i] ^= 1;
    ASSERT_TRUE(crc.check(flipped, out, pass, 0));
    EXPECT_EQ(pass, 0) << "flip at " << i;
  }
}

TEST(KCRCGenerator, DataElementsOtherThanBitsFailTheCheckButAreKept) {
  KCRCGenerator crc;
  crc.setCRC8();
  Bits coded;
  crc.generate({1, 0, 1}, coded, 0);
  coded[1] = 2;  // low bit still 0
  Bits out;
  std::uint8_t pass = 1;
  ASSERT_TRUE(crc.check(coded, out, pass, 0));
  EXPECT_EQ(pass, 0);
  EXPECT_EQ(out, (Bits{1, 2, 1}));
}

TEST(KCRCGenerator, CheckNeedsMoreThanLElements) {
  KCRCGenerator crc;
  crc.setCRC8();
  Bits out;
  std::uint8_t pass = 7;
  EXPECT_FALSE(crc.check(Bits(8, 0), out, pass, 0));
  EXPECT_EQ(pass, 7);
  EXPECT_EQ(out.size(), 8u);
  EXPECT_TRUE(crc.check(Bits(9, 0), out, pass, 0));
  EXPECT_EQ(out.size(), 1u);
  EXPECT_EQ(pass, 1);
}

TEST(KCRCGenerator, NothingWorksBeforeAGeneratorIsSelected) {
  KCRCGenerator crc;
  Bits coded, out;
  std::uint8_t pass = 0;
  EXPECT_FALSE(crc.generate({1, 0}, coded, 0));
  EXPECT_FALSE(crc.check(Bits(30, 0), out, pass, 0));
}

TEST(KCRCGenerator, FactoryRefusesProperties) {
  EXPECT_NE(KCRCGenerator::create(""), nullptr);
  testing::internal::CaptureStderr();
  EXPECT_EQ(KCRCGenerator::create("fast"), nullptr);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "ERROR:KCRCGenerator:Unexpected properties:fast\n");
}

}  // namespace
