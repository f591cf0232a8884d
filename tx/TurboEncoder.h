// Turbo encoder of TS 36.212 5.1.3.2: a rate-1/3 parallel concatenated convolutional code of
// two 8-state constituent encoders, G(D) = [1, g1(D)/g0(D)] with g0 = 1 + D^2 + D^3 and
// g1 = 1 + D + D^3, the QPP internal interleaver of 5.1.3.2.3, and trellis termination
// (5.1.3.2.2) with the twelve tail bits spread over the three output streams.
#ifndef BRANNOC_TX_TURBOENCODER_H
#define BRANNOC_TX_TURBOENCODER_H

#include <cstdint>
#include <span>

#include "tx/Bits.h"
#include "tx/QppInterleaver.h"

namespace brannoc::tx {

constexpr std::uint32_t kTurboTailBits = 4;  // tail bits per output stream

// The three output streams d(0), d(1), d(2) of one code block, K + 4 bits each.
struct TurboCodeword {
  Bits d0;  // systematic x_k, then x_K, z_K+1, x'_K, z'_K+1
  Bits d1;  // first parity z_k, then z_K, x_K+2, z'_K, x'_K+2
  Bits d2;  // second parity z'_k, then x_K+1, z_K+2, x'_K+1, z'_K+2
};

// Encodes the K bits c of a code block; K must be a size of Table 5.1.3-3. Filler bits
// (kNullBit) enter both constituent encoders as 0 and leave as <NULL> at their positions of
// d0 and d1 (d2 carries the interleaved block and has no <NULL>). False, with the codeword
// emptied, when K is not a code block size or c holds a value other than 0, 1 or kNullBit.
bool turboEncode(std::span<const std::uint8_t> c, TurboCodeword& out);

}  // namespace brannoc::tx

#endif
