// The three ways the turbo decoder combines path metrics and treats extrinsic values
// (TS 36.212 clause 5.1.3.2 code, decoded by the BCJR algorithm in the log domain): the
// constituent decoder is one recursion body templated on one of these policies.
//
// Units: one raw 8:5 soft-value step. The log-MAP correction assumes soft values scaled as
// 8 raw steps per natural-log unit of likelihood ratio (raw = round(8 * ln(P(1)/P(0)))).
// Max-log-MAP, scaled or not, does not depend on that scale.
#ifndef CORVANE_METRICPOLICIES_H
#define CORVANE_METRICPOLICIES_H

#include <cstdint>

namespace corvane {

// Max-log-MAP: max(a, b) stands for ln(e^a + e^b); extrinsic values pass unscaled.
struct MaxLogPolicy {
  static int combine(int a, int b) { return a > b ? a : b; }
  static int scaleExtrinsic(int e) { return e; }
};

// Max-log-MAP whose extrinsic values are scaled by 0.75 before they become the other
// decoder's a priori values, which offsets most of the max-log over-estimation. The product
// is rounded to the nearest integer, halves away from zero: (3e + 2 - [3e < 0]) >> 2.
struct ScaledMaxLogPolicy {
  static int combine(int a, int b) { return a > b ? a : b; }
  static int scaleExtrinsic(int e) {
    const int triple = 3 * e;
    return (triple + 2 - (triple < 0 ? 1 : 0)) >> 2;
  }
};

// Log-MAP: max*(a, b) = max(a, b) + ln(1 + e^-|a-b|), the correction read from a table in
// raw steps (8 per natural-log unit): entry d is round(8 * ln(1 + e^(-d/8))), and is 0 from
// d = 22 on.
struct LogMapPolicy {
  static constexpr int kCorrectionSize = 23;
  static constexpr std::int8_t kCorrection[kCorrectionSize] = {
      6, 5, 5, 4, 4, 3, 3, 3, 3, 2, 2, 2, 2, 1, 1, 1, 1, 1, 1, 1, 1, 1, 0};
  static int combine(int a, int b) {
    const int difference = a > b ? a - b : b - a;
    const int index = difference < kCorrectionSize - 1 ? difference : kCorrectionSize - 1;
    return (a > b ? a : b) + kCorrection[index];
  }
  static int scaleExtrinsic(int e) { return e; }
};

}  // namespace corvane

#endif  // CORVANE_METRICPOLICIES_H
