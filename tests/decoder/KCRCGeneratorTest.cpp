// KCRCGenerator: known answers of the four LTE generators, the transmitter's parities, masks,
// checking.
#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

#include "DecoderTestSupport.h"
#include "KCRCGenerator.h"
#include "tx/Crc.h"

namespace brannoc::test {
namespace {

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

// The check values of the digits are the CRC catalogue's (zero init, no reflection). Random
// messages get the transmitter's parity, which was written independently, pass the check and
// fail it after any single flip.
TEST(KCRCGenerator, KnownAnswersTheTransmittersParityAndEverySingleFlipDetected) {
  struct Case {
    void (KCRCGenerator::*select)();
    tx::CrcType type;
    std::uint32_t L, checkOf123456789;
  };
  const Case cases[] = {{&KCRCGenerator::setCRC24A, tx::CrcType::Crc24A, 24, 0xCDE703},
                        {&KCRCGenerator::setCRC24B, tx::CrcType::Crc24B, 24, 0x23EF52},
                        {&KCRCGenerator::setCRC16, tx::CrcType::Crc16, 16, 0x31C3},
                        {&KCRCGenerator::setCRC8, tx::CrcType::Crc8, 8, 0xEA}};
  const Bits digits = bitsOfText("123456789");
  std::mt19937 random(8);
  for (const Case& c : cases) {
    KCRCGenerator crc;
    (crc.*c.select)();
    Bits coded, out;
    ASSERT_TRUE(crc.generate(digits, coded, 0));
    EXPECT_EQ(parityWord(coded, digits.size(), c.L), c.checkOf123456789) << "L " << c.L;
    ASSERT_TRUE(crc.generate({}, coded, 0));  // empty input: L zero parity bits
    EXPECT_EQ(coded, Bits(c.L, 0));
    // Every remainder of the length by 8: the table handles whole bytes, the rest bit by bit.
    for (std::size_t length : {1u, 2u, 3u, 4u, 5u, 6u, 7u, 40u, 333u}) {
      const Bits message = randomBits(length, random);
      std::uint8_t pass = 0;
      ASSERT_TRUE(crc.generate(message, coded, 0));
      EXPECT_EQ(coded, tx::attachCrc(message, c.type)) << "L " << c.L << " length " << length;
      ASSERT_TRUE(crc.check(coded, out, pass, 0));
      EXPECT_TRUE(pass == 1 && out == message) << "L " << c.L << " length " << length;
      for (std::size_t i = 0; i < coded.size(); ++i) {
        coded[i] ^= 1;
        ASSERT_TRUE(crc.check(coded, out, pass, 0));
        EXPECT_EQ(pass, 0) << "L " << c.L << " length " << length << " flip at " << i;
        coded[i] ^= 1;
      }
    }
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

// Refused without a generator or without more than L elements; an element other than 0 or 1
// fails the check even when its low bit fits, and is kept.
TEST(KCRCGenerator, RefusesWithoutAGeneratorOrMoreThanLElementsAndFailsNonBits) {
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
  crc.generate({1, 0, 1}, coded, 0);
  coded[1] = 2;
  ASSERT_TRUE(crc.check(coded, out, pass, 0));
  EXPECT_EQ(pass, 0);
  EXPECT_EQ(out, (Bits{1, 2, 1}));
}

}  // namespace
}  // namespace brannoc::test
