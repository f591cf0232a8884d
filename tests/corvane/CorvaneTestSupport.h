// Helpers of the turbo-decoder model tests: code blocks from the transmitter's turbo
// encoder, soft streams made from them, and one decode through the library's C interface.
#ifndef CORVANE_TESTS_CORVANETESTSUPPORT_H
#define CORVANE_TESTS_CORVANETESTSUPPORT_H

#include <algorithm>
#include <cstdint>
#include <vector>

#include "tx/TurboEncoder.h"
#include "vexlon_ip_corvane_bitacc_cmodel.h"

namespace corvane::test {

struct SoftStreams {
  std::vector<std::int32_t> d0, d1, d2;
};

// Owns a model state.
class Model {
 public:
  explicit Model(const vexlon_ip_corvane_generics& generics)
      : itsState(vexlon_ip_corvane_create_state(generics)) {}
  Model(std::uint32_t processingUnits, std::uint32_t algorithm)
      : Model(generics(processingUnits, algorithm)) {}
  ~Model() { vexlon_ip_corvane_destroy_state(itsState); }
  Model(const Model&) = delete;
  Model& operator=(const Model&) = delete;
  vexlon_ip_corvane_state* get() const { return itsState; }

  static vexlon_ip_corvane_generics generics(std::uint32_t processingUnits,
                                             std::uint32_t algorithm) {
    vexlon_ip_corvane_generics g = vexlon_ip_corvane_get_default_generics();
    g.processing_units = processingUnits;
    g.algorithm = algorithm;
    return g;
  }

 private:
  vexlon_ip_corvane_state* itsState;
};

// A well-formed inputs record over the three streams.
inline vexlon_ip_corvane_inputs inputsFor(const SoftStreams& s, std::uint32_t iterations) {
  vexlon_ip_corvane_inputs in{};
  in.block_size = static_cast<std::uint32_t>(s.d0.size()) - 4;
  in.iterations = iterations;
  in.num_code_blocks = 1;
  in.systematic = s.d0.data();
  in.systematic_size = static_cast<std::uint32_t>(s.d0.size());
  in.parity_1 = s.d1.data();
  in.parity_1_size = static_cast<std::uint32_t>(s.d1.size());
  in.parity_2 = s.d2.data();
  in.parity_2_size = static_cast<std::uint32_t>(s.d2.size());
  return in;
}

// Decodes the streams; returns the status and leaves the K bits in bits.
inline std::int32_t decodeStreams(const Model& model, const SoftStreams& s,
                                  std::uint32_t iterations, std::vector<std::uint8_t>& bits) {
  bits.assign(s.d0.size() - 4, 0xEE);
  vexlon_ip_corvane_outputs out{};
  out.bits = bits.data();
  out.bits_capacity = static_cast<std::uint32_t>(bits.size());
  return vexlon_ip_corvane_bitacc_simulate(model.get(), inputsFor(s, iterations), &out);
}

// splitmix64: a fixed integer generator, the same on every build.
class SplitMix64 {
 public:
  explicit SplitMix64(std::uint64_t seed) : itsState(seed) {}
  std::uint64_t next() {
    std::uint64_t z = (itsState += 0x9E3779B97F4A7C15ull);
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9ull;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBull;
    return z ^ (z >> 31);
  }

 private:
  std::uint64_t itsState;
};

inline std::vector<std::uint8_t> randomBits(SplitMix64& rng, std::uint32_t K) {
  std::vector<std::uint8_t> c(K);
  for (std::uint8_t& bit : c) bit = static_cast<std::uint8_t>(rng.next() >> 63);
  return c;
}

// Soft values of a BPSK-like channel made with integers only: amplitude +-mean plus
// approximately Gaussian noise, the centred sum of four uniform 16-bit values (standard
// deviation 65536 / sqrt(3)) times spread / 65536, saturated to 8 bits. The standard
// deviation in raw steps is about 0.577 * spread.
inline std::vector<std::int32_t> noisy(const brannoc::tx::Bits& bits, SplitMix64& rng,
                                       std::int32_t mean, std::int64_t spread) {
  std::vector<std::int32_t> soft(bits.size());
  for (std::size_t n = 0; n < bits.size(); ++n) {
    const std::uint64_t r = rng.next();
    const std::int64_t sum = static_cast<std::int64_t>(r & 0xFFFF) + ((r >> 16) & 0xFFFF) +
                             ((r >> 32) & 0xFFFF) + (r >> 48);
    const std::int64_t noise = ((sum - 2 * 65535) * spread) >> 16;
    const std::int64_t value = (bits[n] != 0 ? mean : -mean) + noise;
    soft[n] = static_cast<std::int32_t>(std::clamp<std::int64_t>(value, -128, 127));
  }
  return soft;
}

inline SoftStreams noisyStreams(const brannoc::tx::TurboCodeword& d, SplitMix64& rng,
                                std::int32_t mean, std::int64_t spread) {
  SoftStreams s;
  s.d0 = noisy(d.d0, rng, mean, spread);
  s.d1 = noisy(d.d1, rng, mean, spread);
  s.d2 = noisy(d.d2, rng, mean, spread);
  return s;
}

// The transmitter's codeword of c.
inline brannoc::tx::TurboCodeword encode(const std::vector<std::uint8_t>& c) {
  brannoc::tx::TurboCodeword d;
  brannoc::tx::turboEncode(c, d);
  return d;
}

}  // namespace corvane::test

#endif  // CORVANE_TESTS_CORVANETESTSUPPORT_H
