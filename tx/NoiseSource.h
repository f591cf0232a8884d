// Reproducible Gaussian noise for the channel model. The same seed gives the same samples
// on every build (32-bit and 64-bit alike): the generator is integer-only (splitmix64 seeds
// a xoshiro256** state), and the Gaussian transform (Marsaglia's polar method) uses only
// + - * / and sqrt, which IEEE 754 rounds identically everywhere, together with this file's
// own natural logarithm and exponential. The C library's log/exp are not used, since the
// 32-bit and 64-bit libraries need not round them alike.
#ifndef BRANNOC_TX_NOISESOURCE_H
#define BRANNOC_TX_NOISESOURCE_H

#include <array>
#include <cstdint>

namespace brannoc::tx {

// ln(x) for finite x > 0, from the binary exponent and a fixed series on the mantissa;
// within a few ulp of the exact value. Returns -infinity for 0 and NaN for x < 0.
double deterministicLog(double x);

// e^x for |x| < 700, by reduction to 2^n * e^r with |r| <= ln(2)/2 and a fixed series.
double deterministicExp(double x);

// xoshiro256** (Blackman and Vigna), its 256-bit state filled from the seed by splitmix64.
class Xoshiro256 {
 public:
  explicit Xoshiro256(std::uint64_t seed);
  std::uint64_t next();
  // Uniform on [0, 1) with 53 random bits.
  double nextUniform();

 private:
  std::array<std::uint64_t, 4> itsState;
};

// Pairs of independent standard normal samples by the polar method.
class GaussianSource {
 public:
  explicit GaussianSource(std::uint64_t seed) : itsGenerator(seed) {}
  struct Pair {
    double first;
    double second;
  };
  Pair nextPair();

 private:
  Xoshiro256 itsGenerator;
};

}  // namespace brannoc::tx

#endif
