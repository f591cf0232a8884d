// Seeded uniform and Gaussian generators and the deterministic ln and exp they rely on.
#include "tx/NoiseSource.h"

#include <bit>
#include <cmath>
#include <limits>

namespace brannoc::tx {

namespace {

// ln 2 split in two (Cody and Waite): kLn2Hi has its low mantissa bits zero, so n * kLn2Hi is
// exact for the exponents met here, and kLn2Lo carries the rest.
constexpr double kLn2Hi = 6.93147180369123816490e-01;
constexpr double kLn2Lo = 1.90821492927058770002e-10;
constexpr double kLn2 = 0.6931471805599453094172321;
constexpr double kSqrtHalf = 0.7071067811865475244008444;

std::uint64_t splitmix64(std::uint64_t& x) {
  x += 0x9E3779B97F4A7C15ull;
  std::uint64_t z = x;
  z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9ull;
  z = (z ^ (z >> 27)) * 0x94D049BB133111EBull;
  return z ^ (z >> 31);
}

std::uint64_t rotateLeft(std::uint64_t x, int k) { return (x << k) | (x >> (64 - k)); }

// 2^n for the normal range, built from the exponent bits.
double powerOfTwo(int n) {
  return std::bit_cast<double>(static_cast<std::uint64_t>(n + 1023) << 52);
}

}  // namespace

double deterministicLog(double x) {
  if (x < 0.0 || x != x) {
    return std::numeric_limits<double>::quiet_NaN();
  }
  if (x == 0.0) {
    return -std::numeric_limits<double>::infinity();
  }
  if (x == std::numeric_limits<double>::infinity()) {
    return x;
  }
  int extra = 0;
  if (x < std::numeric_limits<double>::min()) {  // subnormal: scale into the normal range
    x *= powerOfTwo(54);
    extra = -54;
  }
  const std::uint64_t bits = std::bit_cast<std::uint64_t>(x);
  int exponent = static_cast<int>((bits >> 52) & 0x7FF) - 1023 + extra;
  // Mantissa m in [1, 2), moved to [sqrt(1/2), sqrt(2)) so that |f| below stays small.
  double m = std::bit_cast<double>((bits & 0x000FFFFFFFFFFFFFull) | 0x3FF0000000000000ull);
  if (m > 2.0 * kSqrtHalf) {
    m *= 0.5;
    ++exponent;
  }
  // ln(m) = 2 atanh(f) = 2 (f + f^3/3 + f^5/5 + ...), f = (m - 1) / (m + 1), |f| <= 0.172.
  const double f = (m - 1.0) / (m + 1.0);
  const double f2 = f * f;
  double series = 0.0;
  for (int k = 23; k >= 1; k -= 2) {  // f2^11 < 1e-16: the terms beyond do not count
    series = series * f2 + 1.0 / k;
  }
  return exponent * kLn2Hi + (exponent * kLn2Lo + 2.0 * f * series);
}

double deterministicExp(double x) {
  // x = n ln2 + r, |r| <= ln2 / 2; e^r by its Taylor series (r^18 / 18! < 1e-17).
  const double scaled = x / kLn2;
  const int n = static_cast<int>(scaled < 0.0 ? scaled - 0.5 : scaled + 0.5);
  const double r = (x - n * kLn2Hi) - n * kLn2Lo;
  double series = 1.0;
  for (int k = 18; k >= 1; --k) {
    series = 1.0 + series * r / k;
  }
  // Split 2^n in two factors so that neither leaves the normal range for |x| < 700.
  const int half = n / 2;
  return series * powerOfTwo(half) * powerOfTwo(n - half);
}

Xoshiro256::Xoshiro256(std::uint64_t seed) {
  for (std::uint64_t& word : itsState) {
    word = splitmix64(seed);
  }
}

std::uint64_t Xoshiro256::next() {
  const std::uint64_t result = rotateLeft(itsState[1] * 5, 7) * 9;
  const std::uint64_t t = itsState[1] << 17;
  itsState[2] ^= itsState[0];
  itsState[3] ^= itsState[1];
  itsState[1] ^= itsState[2];
  itsState[0] ^= itsState[3];
  itsState[2] ^= t;
  itsState[3] = rotateLeft(itsState[3], 45);
  return result;
}

double Xoshiro256::nextUniform() {
  return static_cast<double>(next() >> 11) * (1.0 / 9007199254740992.0);  // 2^-53
}

GaussianSource::Pair GaussianSource::nextPair() {
  double v1 = 0.0;
  double v2 = 0.0;
  double s = 0.0;
  do {
    v1 = 2.0 * itsGenerator.nextUniform() - 1.0;
    v2 = 2.0 * itsGenerator.nextUniform() - 1.0;
    s = v1 * v1 + v2 * v2;
  } while (s >= 1.0 || s == 0.0);
  const double factor = std::sqrt(-2.0 * deterministicLog(s) / s);
  return {v1 * factor, v2 * factor};
}

}  // namespace brannoc::tx
