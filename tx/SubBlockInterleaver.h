// Sub-block interleaver of TS 36.212 5.1.4.1.1 (turbo-coded streams, column permutation of
// Table 5.1.4-1) and 5.1.4.2.1 (convolutionally coded streams, Table 5.1.4-2): a matrix of
// 32 columns and R = ceil(D/32) rows, filled row by row with ND = 32R - D <NULL> dummy bits
// followed by the D input bits, read column by column after the inter-column permutation.
#ifndef BRANNOC_TX_SUBBLOCKINTERLEAVER_H
#define BRANNOC_TX_SUBBLOCKINTERLEAVER_H

#include <array>
#include <cstdint>
#include <span>

#include "tx/Bits.h"

namespace brannoc::tx {

enum class SubBlockPattern { Turbo, Convolutional };

constexpr std::uint32_t kSubBlockColumns = 32;

// Rows R = ceil(D/32) of the interleaver matrix for D input bits.
constexpr std::uint32_t subBlockRows(std::uint32_t D) {
  return (D + kSubBlockColumns - 1) / kSubBlockColumns;
}

// The inter-column permutation P(j), j = 0..31, of the pattern.
const std::array<std::uint8_t, kSubBlockColumns>& subBlockColumnPattern(SubBlockPattern pattern);

// Input position y read at output position k (0 <= k < Kpi = 32R) for a matrix of R rows:
// P(k/R) + 32(k mod R), or for the third turbo stream (P(k/R) + 32(k mod R) + 1) mod Kpi.
std::uint32_t subBlockReadIndex(std::uint32_t k, std::uint32_t R, SubBlockPattern pattern,
                                bool thirdTurboStream);

// The 32R output bits v; dummy positions hold kNullBit, and <NULL> inputs stay <NULL>.
Bits subBlockInterleave(std::span<const std::uint8_t> d, SubBlockPattern pattern,
                        bool thirdTurboStream = false);

}  // namespace brannoc::tx

#endif
