// Tail-biting convolutional encoder (TS 36.212 5.1.3.1) and its rate matching (5.1.4.2).
#include "tx/ConvolutionalCode.h"

#include <bit>
#include <cstddef>

#include "tx/SubBlockInterleaver.h"

namespace brannoc::tx {

namespace {

// Generator taps, written as in the standard: the most significant of the seven bits
// multiplies the current input c_k, the least significant c_{k-6}.
constexpr std::array<unsigned, 3> kGenerators = {0133, 0171, 0165};
constexpr unsigned kConstraintLength = 7;

}  // namespace

ConvolutionalStreams encodeTailBiting(std::span<const std::uint8_t> c) {
  const std::size_t K = c.size();
  ConvolutionalStreams d;
  for (Bits& stream : d) {
    stream.assign(K, 0);
  }
  if (K == 0) {
    return d;
  }
  // While bit k is encoded, window holds c_k in bit 6 and c_{k-j} in bit 6-j. Before the
  // first shift it holds c_{-j} = c_{K-j} in bit 7-j: the register s_{j-1} of the standard.
  // Indices are taken modulo K, which also covers blocks shorter than six bits.
  unsigned window = 0;
  for (unsigned j = 1; j < kConstraintLength; ++j) {
    const std::size_t index = (K - (j % K)) % K;
    window |= (c[index] != 0 ? 1u : 0u) << (kConstraintLength - j);
  }
  for (std::size_t k = 0; k < K; ++k) {
    window = (window >> 1) | ((c[k] != 0 ? 1u : 0u) << (kConstraintLength - 1));
    for (std::size_t i = 0; i < kGenerators.size(); ++i) {
      d[i][k] = static_cast<std::uint8_t>(std::popcount(window & kGenerators[i]) & 1);
    }
  }
  return d;
}

Bits rateMatchConvolutional(const ConvolutionalStreams& d, std::uint32_t E) {
  const std::size_t D = d[0].size();
  if (D == 0 || d[1].size() != D || d[2].size() != D) {
    return {};
  }
  Bits w;
  for (const Bits& stream : d) {
    const Bits v = subBlockInterleave(stream, SubBlockPattern::Convolutional);
    w.insert(w.end(), v.begin(), v.end());
  }
  Bits e;
  e.reserve(E);
  // Every stream holds D > 0 real bits, so each pass over w yields 3D bits and the loop ends.
  for (std::size_t k = 0; e.size() < E; k = (k + 1) % w.size()) {
    if (w[k] != kNullBit) {
      e.push_back(w[k]);
    }
  }
  return e;
}

}  // namespace brannoc::tx
