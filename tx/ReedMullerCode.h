// The two block codes of the uplink control information, built from their basis sequences:
// the (32, O) code for CQI on PUSCH (TS 36.212 5.2.2.6.4, Table 5.2.2.6.4-1, O <= 11) and
// the (20, A) code for PUCCH (TS 36.212 5.2.3.3, Table 5.2.3.3-1, A <= 13).
#ifndef BRANNOC_TX_REEDMULLERCODE_H
#define BRANNOC_TX_REEDMULLERCODE_H

#include <cstdint>
#include <span>

#include "tx/Bits.h"

namespace brannoc::tx {

constexpr std::uint32_t kRm32Length = 32;
constexpr std::uint32_t kRm32MaxBits = 11;
constexpr std::uint32_t kRm20Length = 20;
constexpr std::uint32_t kRm20MaxBits = 13;

// b_i = (sum over n of o_n * M(i, n)) mod 2, i = 0..31. Any non-zero element counts as 1.
// Returns an empty vector when the message holds more than 11 bits.
Bits encodeRm32(std::span<const std::uint8_t> o);

// The same with the (20, A) basis, i = 0..19; empty when the message holds more than 13 bits.
Bits encodeRm20(std::span<const std::uint8_t> a);

}  // namespace brannoc::tx

#endif
