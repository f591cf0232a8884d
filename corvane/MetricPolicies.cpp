// The log-MAP correction table, evaluated in unsigned fixed point with 30 fraction bits:
// e^(-d/s) = e^(-1)^q * e^(-r/s) for d = q*s + r (Taylor series of e^-t, 0 <= t <= 1), then
// ln(1 + y) = 2 * atanh(y / (2 + y)) as the odd series in z = y / (2 + y) <= 1/3. Every
// product and quotient is rounded to nearest; the rounding of each entry is then at least
// 1.7e-6 from a half step for every s up to 64, far above the error of the evaluation.
#include "MetricPolicies.h"

namespace corvane {

namespace {

constexpr int kFractionBits = 30;
constexpr std::uint64_t kOne = std::uint64_t{1} << kFractionBits;

std::uint64_t multiply(std::uint64_t a, std::uint64_t b) {
  return (a * b + kOne / 2) >> kFractionBits;
}

std::uint64_t divideRounded(std::uint64_t numerator, std::uint64_t denominator) {
  return (numerator + denominator / 2) / denominator;
}

// e^-t for 0 <= t <= 1 (t in fixed point).
std::uint64_t expNegative(std::uint64_t t) {
  std::int64_t total = static_cast<std::int64_t>(kOne);
  std::uint64_t term = kOne;
  for (std::uint64_t n = 1; n < 30; ++n) {
    term = divideRounded(multiply(term, t), n);
    total += (n % 2 != 0) ? -static_cast<std::int64_t>(term) : static_cast<std::int64_t>(term);
  }
  return static_cast<std::uint64_t>(total);
}

// ln(1 + y) for 0 <= y <= 1 (fixed point in and out).
std::uint64_t logOnePlus(std::uint64_t y) {
  const std::uint64_t z = divideRounded(y << kFractionBits, 2 * kOne + y);
  const std::uint64_t zSquared = multiply(z, z);
  std::uint64_t sum = 0;
  std::uint64_t power = z;
  for (std::uint64_t k = 0; power != 0; ++k) {
    sum += divideRounded(power, 2 * k + 1);
    power = multiply(power, zSquared);
  }
  return 2 * sum;
}

}  // namespace

CorrectionTable::CorrectionTable(std::uint32_t stepsPerUnit) {
  const std::uint64_t s = stepsPerUnit;
  const std::uint64_t inverseE = expNegative(kOne);
  for (int d = 0; d < kMaxSize; ++d) {
    const std::uint64_t q = static_cast<std::uint64_t>(d) / s;
    const std::uint64_t r = static_cast<std::uint64_t>(d) % s;
    std::uint64_t y = expNegative(divideRounded(r << kFractionBits, s));
    for (std::uint64_t i = 0; i < q; ++i) y = multiply(y, inverseE);
    const std::uint64_t entry = (s * logOnePlus(y) + kOne / 2) >> kFractionBits;
    itsEntries[static_cast<std::size_t>(d)] = static_cast<std::uint8_t>(entry);
    itsSize = d + 1;
    if (entry == 0) break;
  }
}

}  // namespace corvane
