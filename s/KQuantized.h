// KQuantized: the decoder's bit-accurate fixed-point number. One signed two's-complement raw
// value valueQ, read as valueQ / 2^NFRACBITS, in a format of NINTBITS integer bits (sign
// included) and NFRACBITS fraction bits, written "A:B" with A = NINTBITS + NFRACBITS. Every
// register of fixed width in the core (input LLRs, HARQ soft buffer, sums of repeated
// control bits) is modelled by passing the value through one of these, so that it rounds and
// saturates exactly where the hardware does. The LLR format of TS 36.212 soft values in this
// core is 8:5 (raw -128..127).
//
// Widths. The decoder uses formats of at most 16 bits. The class accepts widths up to its
// caps: 53 fraction bits, 54 integer bits, 54 bits in total. Within the caps everything is
// exact: the raw range (at most 2^53 in magnitude) fits a signed 64-bit integer and is
// exactly representable as a double, Scale is a power of two, so the real limits Min and Max
// are exact too. Widths beyond a cap are cut (see checkFormat) and the caller is warned.
// A format of zero bits in total describes no number; it is kept with the single raw value 0
// and reported like a cut width.
//
// The scalar operations run once per soft value in the rate dematcher: they live in this
// header so that a combine (two setValueQ, operator+, setNINTBITS) flattens into integer
// code, and they never allocate. Messages go to the error stream through out-of-line helpers.
#ifndef BRANNOC_KQUANTIZED_H
#define BRANNOC_KQUANTIZED_H

#include <algorithm>
#include <bit>
#include <complex>
#include <cstdint>
#include <ostream>
#include <string>
#include <vector>

namespace brannoc {

class KQuantized {
 public:
  // Largest widths the class carries; beyond them checkFormat cuts the width and warns.
  static constexpr std::uint32_t kMaxFracBits = 53;
  static constexpr std::uint32_t kMaxIntBits = 54;
  static constexpr std::uint32_t kMaxTotalBits = 54;

  // Builds the format NINTBITS:NFRACBITS (cutting the integer width if the total is too
  // large, with a warning whatever VerboseMode says) and quantizes value into it.
  KQuantized(double value, std::uint32_t NINTBITS, std::uint32_t NFRACBITS,
             bool VerboseMode) noexcept;

  // Quantizes x: round half away from zero, then saturation judged on x against Min and Max.
  // False when x lay outside [Min, Max] (valueQ is then MinQ or MaxQ) or was not a number
  // (valueQ is then 0, the soft value carrying no information; no line is printed).
  bool setValue(double x) noexcept;

  // Loads a raw value and clamps it into the format; false when it clamped.
  bool setValueQ(std::int64_t q) noexcept {
    valueQ = q;
    return saturate();
  }

  // Clamps valueQ into [MinQ, MaxQ]; false when it clamped.
  bool saturate() noexcept {
    if (valueQ > MaxQ) {
      return clampHigh();
    }
    if (valueQ < MinQ) {
      return clampLow();
    }
    return true;
  }

  double getValue() const noexcept {
    return static_cast<double>(valueQ) / static_cast<double>(Scale);
  }

  // Changes the range only: the raw value is not shifted, so narrowing clamps it.
  // Asking for the present width does nothing and returns true.
  bool setNINTBITS(std::uint32_t n) noexcept {
    if (n == NINTBITS) {
      return true;
    }
    NINTBITS = n;
    if (!checkFormat(true)) {
      reportFormat(kWhoSetNINTBITS);
    }
    return saturate();
  }

  bool setNFRACBITS(std::uint32_t f) noexcept;

  // Moves the value to the format n:f. Fewer fraction bits shift the raw value right
  // arithmetically (rounding toward minus infinity, as the hardware drops LSBs); more shift
  // it left. The result is then clamped to the new range. Asking for the present format does
  // nothing and returns true.
  bool changeFormat(std::uint32_t n, std::uint32_t f) noexcept {
    if (n == NINTBITS && f == NFRACBITS) {
      return true;
    }
    const std::uint32_t oldFracBits = NFRACBITS;
    NINTBITS = n;
    NFRACBITS = f;
    if (!checkFormat(false)) {
      reportFormat(kWhoChangeFormat);
    }
    rescale(oldFracBits);
    return saturate();
  }

  // Parses "A:B" (A total bits, B fraction bits, each read like strtoul with base 0) and
  // moves the value to that format. On a malformed text prints an error line and keeps the
  // format and value.
  bool setTypeFromString(const std::string& s);

  // "A:B", e.g. "8:5".
  std::string getTypeString() const;

  // NBITS one-bits: the raw value's bits within the register.
  std::uint64_t getMask() const noexcept { return (std::uint64_t{1} << NBITS) - 1; }

  bool updateScale() noexcept {
    Scale = std::uint64_t{1} << NFRACBITS;
    return true;
  }

  // Applies the width caps and recomputes NBITS, Scale and the limits. When the total is too
  // large, reduceIntBits chooses which width is cut. True when the widths were acceptable as
  // given; the caller prints its own warning otherwise.
  bool checkFormat(bool reduceIntBits) noexcept {
    bool ok = true;
    std::uint64_t total = std::uint64_t{NINTBITS} + NFRACBITS;
    if (NFRACBITS > kMaxFracBits) {
      NFRACBITS = kMaxFracBits;
      total = std::uint64_t{NINTBITS} + kMaxFracBits + 1;
      ok = false;
    }
    if (NINTBITS > kMaxIntBits) {
      NINTBITS = kMaxIntBits;
      total = std::uint64_t{NFRACBITS} + kMaxIntBits + 1;
      ok = false;
    }
    if (total > kMaxTotalBits) {
      // The cut width becomes one less than what the total leaves it; a width that would go
      // below zero stops at zero.
      total = kMaxTotalBits;
      std::uint32_t& cut = reduceIntBits ? NINTBITS : NFRACBITS;
      const std::uint32_t other = reduceIntBits ? NFRACBITS : NINTBITS;
      cut = other < kMaxTotalBits - 1 ? kMaxTotalBits - 1 - other : 0;
      ok = false;
    }
    NBITS = static_cast<std::uint32_t>(total);
    updateScale();
    if (NBITS == 0) {
      MinQ = 0;
      MaxQ = 0;
      ok = false;
    } else {
      const std::int64_t half = std::int64_t{1} << (NBITS - 1);
      MinQ = -half;
      MaxQ = half - 1;
    }
    // Dividing by Scale = 2^NFRACBITS is multiplying by the exact power of two 2^-NFRACBITS
    // (NFRACBITS <= 53 keeps it a normal double): the same limits, without two divisions in
    // every per-soft-value change of format.
    const double inverseScale =
        std::bit_cast<double>(static_cast<std::uint64_t>(1023 - NFRACBITS) << 52);
    Min = static_cast<double>(MinQ) * inverseScale;
    Max = static_cast<double>(MaxQ) * inverseScale;
    return ok;
  }

  // Adds or subtracts other exactly: both operands move to the format one integer bit wider
  // than the wider of the two, with the larger fraction width, and the result is not clamped.
  KQuantized& operator+=(const KQuantized& other) noexcept { return combine(other, false); }
  KQuantized& operator-=(const KQuantized& other) noexcept { return combine(other, true); }
  KQuantized operator+(const KQuantized& other) const noexcept {
    KQuantized sum(*this);
    sum += other;
    return sum;
  }
  KQuantized operator-(const KQuantized& other) const noexcept {
    KQuantized difference(*this);
    difference -= other;
    return difference;
  }

  // A copy of this value moved to the format n:f, or to the integer width n.
  KQuantized copyWithFormat(std::uint32_t n, std::uint32_t f) const noexcept {
    KQuantized copy(*this);
    copy.changeFormat(n, f);
    return copy;
  }
  KQuantized copyWithNINTBITS(std::uint32_t n) const noexcept {
    KQuantized copy(*this);
    copy.setNINTBITS(n);
    return copy;
  }

  // Vector forms: the output is resized to the input's length and filled element by element
  // with the scalar operation; true only when every element converted without saturating.
  // valueQ is left at the last element's value.
  bool quantize(const std::vector<double>& in, std::vector<std::int64_t>& out) noexcept;
  bool quantize(const std::vector<std::int32_t>& in, std::vector<std::int64_t>& out) noexcept;
  bool quantize(const std::vector<std::complex<double>>& in, std::vector<std::int64_t>& re,
                std::vector<std::int64_t>& im) noexcept;
  bool dequantize(const std::vector<std::int64_t>& in, std::vector<double>& out) noexcept;
  // The output has the length of re; an im shorter than re is refused (empty output, false).
  bool dequantize(const std::vector<std::int64_t>& re, const std::vector<std::int64_t>& im,
                  std::vector<std::complex<double>>& out) noexcept;

  std::uint32_t getNBITS() const noexcept { return NBITS; }
  std::uint32_t getNINTBITS() const noexcept { return NINTBITS; }
  std::uint32_t getNFRACBITS() const noexcept { return NFRACBITS; }
  std::uint64_t getScale() const noexcept { return Scale; }
  std::int64_t getValueQ() const noexcept { return valueQ; }
  std::int64_t getMinQ() const noexcept { return MinQ; }
  std::int64_t getMaxQ() const noexcept { return MaxQ; }
  double getMin() const noexcept { return Min; }
  double getMax() const noexcept { return Max; }
  bool getVerboseMode() const noexcept { return VerboseMode; }

  friend std::ostream& operator<<(std::ostream& os, const KQuantized& q);

 private:
  enum Who { kWhoConstructor, kWhoSetNINTBITS, kWhoSetNFRACBITS, kWhoChangeFormat };

  // Cold paths: the error-stream lines, kept out of line.
  static void reportFormat(Who who);
  static void reportSaturationHigh();
  static void reportSaturationLow();

  // valueQ becomes the top (bottom) of the range, with a line in VerboseMode; returns false.
  bool clampHigh() noexcept {
    valueQ = MaxQ;
    if (VerboseMode) {
      reportSaturationHigh();
    }
    return false;
  }
  bool clampLow() noexcept {
    valueQ = MinQ;
    if (VerboseMode) {
      reportSaturationLow();
    }
    return false;
  }

  // Moves valueQ from oldFracBits fraction bits to the present NFRACBITS. A left shift that
  // would leave 64 bits is replaced by the extreme of the sign, which saturate then clamps.
  void rescale(std::uint32_t oldFracBits) noexcept {
    if (NFRACBITS < oldFracBits) {
      valueQ >>= oldFracBits - NFRACBITS;
    } else if (NFRACBITS > oldFracBits) {
      const std::uint32_t d = NFRACBITS - oldFracBits;
      if (valueQ > (INT64_MAX >> d)) {
        valueQ = INT64_MAX;
      } else if (valueQ < (INT64_MIN >> d)) {
        valueQ = INT64_MIN;
      } else {
        valueQ *= std::int64_t{1} << d;
      }
    }
  }

  KQuantized& combine(const KQuantized& other, bool subtract) noexcept {
    const std::uint32_t fracBits = std::max(NFRACBITS, other.NFRACBITS);
    const std::uint32_t intBits = std::max(NINTBITS, other.NINTBITS) + 1;
    changeFormat(intBits, fracBits);
    KQuantized operand(other);
    operand.changeFormat(intBits, fracBits);
    // Both operands are clamped to at most 54 bits, so the sum cannot leave 64 bits.
    valueQ = subtract ? valueQ - operand.valueQ : valueQ + operand.valueQ;
    return *this;
  }

  std::uint32_t NBITS;
  std::uint32_t NINTBITS;
  std::uint32_t NFRACBITS;
  std::uint64_t Scale;
  std::int64_t valueQ;
  std::int64_t MinQ;
  std::int64_t MaxQ;
  double Min;
  double Max;
  bool VerboseMode;
};

std::ostream& operator<<(std::ostream& os, const KQuantized& q);

}  // namespace brannoc

#endif  // BRANNOC_KQUANTIZED_H
