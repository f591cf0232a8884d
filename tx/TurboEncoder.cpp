// Rate-1/3 turbo encoding with trellis termination, TS 36.212 5.1.3.2.
#include "tx/TurboEncoder.h"

#include <vector>

namespace brannoc::tx {

namespace {

// One 8-state recursive systematic constituent encoder; s1 is the most recent register.
class ConstituentEncoder {
 public:
  // Shifts in the information bit u and returns the parity bit z.
  std::uint8_t encode(std::uint8_t u) {
    const std::uint8_t a = u ^ s2_ ^ s3_;  // feedback g0 = 1 + D^2 + D^3
    const std::uint8_t z = a ^ s1_ ^ s3_;  // forward g1 = 1 + D + D^3
    s3_ = s2_;
    s2_ = s1_;
    s1_ = a;
    return z;
  }
  // One termination step: the input is the feedback, which drives the register to zero in
  // three steps. Returns the systematic tail bit x and sets the parity tail bit z.
  std::uint8_t terminate(std::uint8_t& z) {
    const std::uint8_t x = s2_ ^ s3_;
    z = encode(x);
    return x;
  }

 private:
  std::uint8_t s1_ = 0, s2_ = 0, s3_ = 0;
};

}  // namespace

bool turboEncode(std::span<const std::uint8_t> c, TurboCodeword& out) {
  out = TurboCodeword{};
  const auto K = static_cast<std::uint32_t>(c.size());
  const QppParameters* qpp = findQpp(K);
  if (qpp == nullptr) return false;
  std::vector<std::uint8_t> input(K);
  for (std::uint32_t k = 0; k < K; ++k) {
    if (c[k] > 1 && c[k] != kNullBit) return false;
    input[k] = c[k] == 1 ? 1 : 0;  // a filler enters the encoder as 0
  }

  out.d0.resize(K + kTurboTailBits);
  out.d1.resize(K + kTurboTailBits);
  out.d2.resize(K + kTurboTailBits);
  ConstituentEncoder first, second;
  for (std::uint32_t k = 0; k < K; ++k) {
    const std::uint8_t z = first.encode(input[k]);
    const bool filler = c[k] == kNullBit;
    out.d0[k] = filler ? kNullBit : input[k];
    out.d1[k] = filler ? kNullBit : z;
    out.d2[k] = second.encode(input[qppIndex(*qpp, k)]);
  }

  // Tail: x_K..x_K+2 and z_K..z_K+2 close the first encoder, then x'_K..x'_K+2 and
  // z'_K..z'_K+2 close the second; the twelve bits are read out round-robin over d0, d1, d2.
  std::uint8_t x[3], z[3], xi[3], zi[3];
  for (int i = 0; i < 3; ++i) x[i] = first.terminate(z[i]);
  for (int i = 0; i < 3; ++i) xi[i] = second.terminate(zi[i]);
  const std::uint8_t tail[12] = {x[0], z[0], x[1], z[1], x[2], z[2],
                                 xi[0], zi[0], xi[1], zi[1], xi[2], zi[2]};
  for (std::uint32_t i = 0; i < kTurboTailBits; ++i) {
    out.d0[K + i] = tail[3 * i];
    out.d1[K + i] = tail[3 * i + 1];
    out.d2[K + i] = tail[3 * i + 2];
  }
  return true;
}

}  // namespace brannoc::tx
