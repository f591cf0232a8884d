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

TEST(Crc, ParityOfSingleOneBitIsThePolynomial) {
  // The polynomial without its leading term, highest power first.
  const std::pair<CrcType, Bits> cases[] = {{CrcType::Crc24A, bitsOf(0x864CFB, 24)},
                                            {CrcType::Crc24B, bitsOf(0x800063, 24)},
                                            {CrcType::Crc16, bitsOf(0x1021, 16)},
                                            {CrcType::Crc8, bitsOf(0x9B, 8)}};
  for (const auto& [type, taps] : cases) EXPECT_EQ(crcParity(Bits{1}, type), taps);
}

TEST(Crc, Crc16MatchesTheZeroStartCheckValue) {
  // D16+D12+D5+1 with zero start and no inversion gives 0x31C3 for the ASCII "123456789".
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
    const Bits zero(crcLength(type), 0);
    for (std::uint32_t length : {1u, 40u, 333u}) {
      Bits message(length);
      for (auto& bit : message) bit = rng() & 1u;
      Bits coded = attachCrc(message, type);
      ASSERT_EQ(coded.size(), length + zero.size());
      EXPECT_TRUE(std::equal(message.begin(), message.end(), coded.begin()));
      EXPECT_EQ(crcParity(coded, type), zero);
      coded[length / 2] ^= 1u;
      EXPECT_NE(crcParity(coded, type), zero);
    }
  }
}

}  // namespace
}  // namespace brannoc::tx
