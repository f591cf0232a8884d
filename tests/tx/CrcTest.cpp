// CRC attachment (TS 36.212 5.1.1): single-bit parities equal the generator polynomials,
// and every message with its parity attached leaves a zero remainder.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <random>
#include <string>

#include "tx/Crc.h"

namespace brannoc::tx {
namespace {

Bits bitsOf(std::uint32_t value, std::uint32_t length) {
  Bits bits(length);
  for (std::uint32_t i = 0; i < length; ++i) bits[i] = (value >> (length - 1 - i)) & 1u;
  return bits;
}

struct SingleBitCase {
  CrcType type;
  std::uint32_t length;
  std::uint32_t taps;  // the polynomial without its leading term, highest power first
};

TEST(Crc, ParityOfSingleOneBitIsThePolynomial) {
  const SingleBitCase cases[] = {{CrcType::Crc24A, 24, 0x864CFB},
                                 {CrcType::Crc24B, 24, 0x800063},
                                 {CrcType::Crc16, 16, 0x1021},
                                 {CrcType::Crc8, 8, 0x9B}};
  for (const auto& c : cases) {
    const Bits one{1};
    EXPECT_EQ(crcLength(c.type), c.length);
    EXPECT_EQ(crcParity(one, c.type), bitsOf(c.taps, c.length)) << c.length;
  }
  EXPECT_EQ(crcParity(Bits{1}, CrcType::Crc8), (Bits{1, 0, 0, 1, 1, 0, 1, 1}));
  EXPECT_EQ(crcParity(Bits(100, 0), CrcType::Crc24A), Bits(24, 0));
}

TEST(Crc, Crc16MatchesTheZeroStartCheckValue) {
  // D16+D12+D5+1 with zero start and no inversion gives 0x31C3 for the ASCII text
  // "123456789", the check value quoted for this CRC everywhere.
  Bits message;
  for (char ch : std::string("123456789")) {
    const Bits byte = bitsOf(static_cast<std::uint8_t>(ch), 8);
    message.insert(message.end(), byte.begin(), byte.end());
  }
  EXPECT_EQ(crcParity(message, CrcType::Crc16), bitsOf(0x31C3, 16));
}

TEST(Crc, AttachedParityLeavesZeroRemainder) {
  std::mt19937 rng(7);
  for (CrcType type : {CrcType::Crc24A, CrcType::Crc24B, CrcType::Crc16, CrcType::Crc8}) {
    for (std::uint32_t length : {1u, 7u, 40u, 333u}) {
      Bits message(length);
      for (auto& bit : message) bit = rng() & 1u;
      const Bits coded = attachCrc(message, type);
      ASSERT_EQ(coded.size(), length + crcLength(type));
      EXPECT_TRUE(std::equal(message.begin(), message.end(), coded.begin()));
      EXPECT_EQ(crcParity(coded, type), Bits(crcLength(type), 0));
      Bits damaged = coded;
      damaged[length / 2] ^= 1u;
      EXPECT_NE(crcParity(damaged, type), Bits(crcLength(type), 0));
    }
  }
}

}  // namespace
}  // namespace brannoc::tx
