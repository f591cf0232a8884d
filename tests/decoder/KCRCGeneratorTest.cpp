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

// The L parity bits after the n data bits, first one highest.
std::uint32_t parityWord(const Bits& coded, std::size_t n, std::uint32_t L) {
  std::uint32_t word = 0;
  for (std::uint32_t i = 0; i < L; ++i) word = (word << 1) | coded[n + i];
  return word;
}

// x^L mod g(x) is g's low part: the parity of the single bit 1 spells the polynomial, highest
// power first. The check values are the CRC catalogue's (zero init, no reflection).
TEST(KCRCGenerator, SingleBitSpellsThePolynomialAndDigitsGiveTheCatalogueCheckValue) {
  struct Case {
    void (KCRCGenerator::*select)();
    std::uint32_t L, lowCoefficients, checkOf123456789;
  };
  const Case cases[] = {{&KCRCGenerator::setCRC24A, 24, 0x864CFB, 0xCDE703},
                        {&KCRCGenerator::setCRC24B, 24, 0x800063, 0x23EF52},
                        {&KCRCGenerator::setCRC16, 16, 0x1021, 0x31C3},
                        {&KCRCGenerator::setCRC8, 8, 0x9B, 0xEA}};
  const Bits digits = bitsOfText("123456789");
  for (const Case& c : cases) {
    KCRCGenerator crc;
    (crc.*c.select)();
    Bits coded;
    ASSERT_TRUE(crc.generate({1}, coded, 0));
    ASSERT_EQ(coded.size(), 1 + c.L);
    EXPECT_EQ(coded[0], 1);
    EXPECT_EQ(parityWord(coded, 1, c.L), c.lowCoefficients) << "L " << c.L;
    ASSERT_TRUE(crc.generate(digits, coded, 0));
    EXPECT_EQ(parityWord(coded, digits.size(), c.L), c.checkOf123456789) << "L " << c.L;
    ASSERT_TRUE(crc.generate({}, coded, 0));  // empty input: L zero parity bits
    EXPECT_EQ(coded, Bits(c.L, 0));
  }
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
  // An element other than 0 or 1 fails the check even when its low bit fits, and is kept.
  crc.setCRC8();
  crc.generate({1, 0, 1}, coded, 0);
  coded[1] = 2;
  ASSERT_TRUE(crc.check(coded, out, pass, 0));
  EXPECT_EQ(pass, 0);
  EXPECT_EQ(out, (Bits{1, 2, 1}));
}

TEST(KCRCGenerator, RefusesWithoutAGeneratorOrWithoutMoreThanLElements) {
  KCRCGenerator crc;
  Bits coded, out;
  std::uint8_t pass = 7;
  EXPECT_FALSE(crc.generate({1, 0}, coded, 0));
  EXPECT_FALSE(crc.check(Bits(30, 0), out, pass, 0));
  crc.setCRC8();
  EXPECT_FALSE(crc.check(Bits(8, 0), out, pass, 0));
  EXPECT_EQ(pass, 7);
  EXPECT_TRUE(crc.check(Bits(9, 0), out, pass, 0));
  EXPECT_EQ(out.size(), 1u);
  EXPECT_EQ(pass, 1);
}

}  // namespace
