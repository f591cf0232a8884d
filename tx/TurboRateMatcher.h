// Rate matching of turbo-coded transport channels, TS 36.212 5.1.4.1: sub-block
// interleaving of the three streams, bit collection into the circular buffer w, and bit
// selection of E bits from position k0 of the redundancy version, skipping <NULL> bits and
// wrapping round the buffer. Uplink: no soft-buffer limit, so Ncb = Kw.
#ifndef BRANNOC_TX_TURBORATEMATCHER_H
#define BRANNOC_TX_TURBORATEMATCHER_H

#include <cstdint>

#include "tx/Bits.h"
#include "tx/TurboEncoder.h"

namespace brannoc::tx {

// Sizes of the circular buffer of a code block whose streams hold D = K + 4 bits each.
struct TurboBufferLayout {
  std::uint32_t D;    // bits per stream
  std::uint32_t R;    // sub-block interleaver rows, ceil(D/32)
  std::uint32_t Kpi;  // 32R
  std::uint32_t ND;   // dummy bits per stream, Kpi - D
  std::uint32_t Kw;   // 3 Kpi
  std::uint32_t Ncb;  // Kw
};

TurboBufferLayout turboBufferLayout(std::uint32_t D);

// Starting position k0 = R (2 ceil(Ncb / (8R)) rv + 2) of redundancy version rv.
std::uint32_t turboK0(std::uint32_t R, std::uint32_t Ncb, std::uint32_t rv);

// The circular buffer w (Kw bits): v0, then v1 and v2 interlaced (w_Kpi+2k = v1_k,
// w_Kpi+2k+1 = v2_k). Dummy and filler bits are kNullBit. Empty when the three streams do not
// have the same length.
Bits turboCircularBuffer(const TurboCodeword& d);

// The E rate-matched bits e of redundancy version rv (0..3). False, with e empty, for an
// rv above 3, streams of unequal length, or a buffer without a single real bit.
bool rateMatchTurbo(const TurboCodeword& d, std::uint32_t E, std::uint32_t rv, Bits& e);

}  // namespace brannoc::tx

#endif
