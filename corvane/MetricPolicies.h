// The three ways the turbo decoder combines path metrics and treats extrinsic values
// (TS 36.212 clause 5.1.3.2 code, decoded by the BCJR algorithm in the log domain): the
// constituent decoder is one recursion body templated on one of these policies.
//
// Units: one raw soft-value step. A soft value of v raw steps stands for the log-likelihood
// ratio ln(P(1)/P(0)) = v / s, s being the steps per natural-log unit (generics word 5;
// 32 by default, the 8:5 format's 1.0). Only the log-MAP correction depends on s; max-log-MAP,
// scaled or not, is the same at every scale.
#ifndef CORVANE_METRICPOLICIES_H
#define CORVANE_METRICPOLICIES_H

#include <array>
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

// The log-MAP correction ln(1 + e^-x) in raw steps at s steps per natural-log unit: entry d
// is round(s * ln(1 + e^(-d/s))), up to and including the first entry that is 0 (every
// larger difference also gets 0). The entries are evaluated once, in integer fixed point
// (30 fraction bits), so every build makes the same table; the largest, round(s * ln 2),
// is 22 at s = 32 and 44 at s = 64.
class CorrectionTable {
 public:
  static constexpr std::uint32_t kMinStepsPerUnit = 1;
  static constexpr std::uint32_t kMaxStepsPerUnit = 64;
  static constexpr int kMaxSize = 320;  // 312 entries at s = 64

  // A table for stepsPerUnit in kMinStepsPerUnit..kMaxStepsPerUnit.
  explicit CorrectionTable(std::uint32_t stepsPerUnit = 32);

  int size() const { return itsSize; }
  int operator[](int d) const { return itsEntries[static_cast<std::size_t>(d)]; }
  // The correction of a difference d >= 0.
  int correction(int d) const {
    return itsEntries[static_cast<std::size_t>(d < itsSize ? d : itsSize - 1)];
  }

 private:
  std::array<std::uint8_t, kMaxSize> itsEntries{};
  int itsSize = 0;
};

// Log-MAP: max*(a, b) = max(a, b) + ln(1 + e^-|a-b|), the correction read from the table.
struct LogMapPolicy {
  const CorrectionTable* table;
  int combine(int a, int b) const {
    const int difference = a > b ? a - b : b - a;
    return (a > b ? a : b) + table->correction(difference);
  }
  static int scaleExtrinsic(int e) { return e; }
};

}  // namespace corvane

#endif  // CORVANE_METRICPOLICIES_H
