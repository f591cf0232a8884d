// Tail-biting convolutional code of TS 36.212 5.1.3.1 (constraint length 7, rate 1/3,
// generators G0 = 133, G1 = 171, G2 = 165 octal) and the rate matching for convolutionally
// coded transport channels and control information of TS 36.212 5.1.4.2.
#ifndef BRANNOC_TX_CONVOLUTIONALCODE_H
#define BRANNOC_TX_CONVOLUTIONALCODE_H

#include <array>
#include <cstdint>
#include <span>

#include "tx/Bits.h"

namespace brannoc::tx {

// The three output streams d(0), d(1), d(2), each as long as the input.
using ConvolutionalStreams = std::array<Bits, 3>;

// Encodes c_0..c_{K-1}. The shift register starts with the last six input bits
// (s_i = c_{K-1-i}), so the encoder ends in the state it started from. Elements other
// than 0 count as 1. An empty input gives three empty streams.
ConvolutionalStreams encodeTailBiting(std::span<const std::uint8_t> c);

// 5.1.4.2: each stream through the sub-block interleaver with the convolutional
// permutation, the three interleaved streams collected one after another into the circular
// buffer w (K_w = 3 * K_Pi), and E bits read from it starting at k = 0, skipping <NULL>
// dummy bits and wrapping round as often as E requires. Returns an empty vector when the
// streams are empty or of unequal length.
Bits rateMatchConvolutional(const ConvolutionalStreams& d, std::uint32_t E);

}  // namespace brannoc::tx

#endif
