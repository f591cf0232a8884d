// KQuantized: the parts of the fixed-point number that are not per soft value: construction,
// quantization of real values, the "A:B" format text, stream output, the vector forms and
// the error-stream lines.
#include "KQuantized.h"

#include <cmath>
#include <cstdlib>

#include "errorLine.h"

namespace brannoc {

namespace {

constexpr std::string_view kSource = "../s/KQuantized";
constexpr const char* kNeedFormat =
    "Error in KQuantized::setTypeFromString. Need a string with a A:B format";

// Splits a format text into its colon-separated fields. Blanks, tabs and newlines before a
// field are skipped (trailing ones stay in it); adjacent colons give an empty field; a colon
// at the very end starts no field. Stops early once more than two fields are found, since
// that is already malformed.
std::vector<std::string> splitFormatText(const std::string& s) {
  std::vector<std::string> fields;
  std::string::size_type pos = 0;
  while (fields.size() <= 2) {
    pos = s.find_first_not_of(" \t\n", pos);
    if (pos == std::string::npos) {
      break;
    }
    const std::string::size_type colon = s.find(':', pos);
    fields.push_back(s.substr(pos, colon == std::string::npos ? colon : colon - pos));
    if (colon == std::string::npos) {
      break;
    }
    pos = colon + 1;
  }
  return fields;
}

}  // namespace

KQuantized::KQuantized(double value, std::uint32_t intBits, std::uint32_t fracBits,
                       bool verbose) noexcept
    : NBITS(0),
      NINTBITS(intBits),
      NFRACBITS(fracBits),
      Scale(0),
      valueQ(0),
      MinQ(0),
      MaxQ(0),
      Min(0.0),
      Max(0.0),
      VerboseMode(verbose) {
  if (!checkFormat(true)) {
    reportFormat(kWhoConstructor);
  }
  if (!setValue(value) && VerboseMode) {
    errorLineBare("Saturation ocurred.");
  }
}

bool KQuantized::setValue(double x) noexcept {
  if (std::isnan(x)) {
    valueQ = 0;
    return false;
  }
  // Saturation is judged on the real input, so a value just above Max is reported even
  // when it would round to MaxQ. Infinities land here too.
  if (x < Min) {
    return clampLow();
  }
  if (x > Max) {
    return clampHigh();
  }
  // Round half away from zero in double arithmetic (-0.0 counts as non-negative). x lies in
  // [Min, Max], so the rounded value is within one step of the raw range and converts to a
  // 64-bit integer without overflow. Only at the widest formats (54 bits) can the addition of
  // one half round up past MaxQ; the clamp keeps the result inside the range the input was in.
  const double scaled = x * static_cast<double>(Scale);
  const double rounded = x >= 0.0 ? scaled + 0.5 : scaled - 0.5;
  valueQ = std::clamp(static_cast<std::int64_t>(rounded), MinQ, MaxQ);
  return true;
}

bool KQuantized::setNFRACBITS(std::uint32_t f) noexcept {
  if (f == NFRACBITS) {
    return true;
  }
  const std::uint32_t oldFracBits = NFRACBITS;
  NFRACBITS = f;
  if (!checkFormat(false)) {
    reportFormat(kWhoSetNFRACBITS);
  }
  rescale(oldFracBits);
  return saturate();
}

bool KQuantized::setTypeFromString(const std::string& s) {
  const std::vector<std::string> fields = splitFormatText(s);
  if (fields.size() != 2) {
    errorLineFileSpaced(kSource, 248, kNeedFormat);
    return false;
  }
  const unsigned long A = std::strtoul(fields[0].c_str(), nullptr, 0);
  const unsigned long B = std::strtoul(fields[1].c_str(), nullptr, 0);
  if (A <= B) {
    errorLineFileSpaced(kSource, 252, kNeedFormat, ", where A > B");
    return false;
  }
  if (A > kMaxTotalBits) {
    errorLineFileSpaced(kSource, 254, kNeedFormat, ", where A <=", kMaxTotalBits);
    return false;
  }
  // A warning from changeFormat does not fail the parse: the text itself was well formed.
  changeFormat(static_cast<std::uint32_t>(A - B), static_cast<std::uint32_t>(B));
  return true;
}

std::string KQuantized::getTypeString() const {
  return std::to_string(NBITS) + ":" + std::to_string(NFRACBITS);
}

bool KQuantized::quantize(const std::vector<double>& in, std::vector<std::int64_t>& out) noexcept {
  out.assign(in.size(), 0);
  bool ok = true;
  for (std::size_t i = 0; i < in.size(); ++i) {
    ok = setValue(in[i]) && ok;
    out[i] = valueQ;
  }
  return ok;
}

bool KQuantized::quantize(const std::vector<std::int32_t>& in,
                          std::vector<std::int64_t>& out) noexcept {
  out.assign(in.size(), 0);
  bool ok = true;
  for (std::size_t i = 0; i < in.size(); ++i) {
    ok = setValue(static_cast<double>(in[i])) && ok;
    out[i] = valueQ;
  }
  return ok;
}

bool KQuantized::quantize(const std::vector<std::complex<double>>& in,
                          std::vector<std::int64_t>& re, std::vector<std::int64_t>& im) noexcept {
  re.assign(in.size(), 0);
  im.assign(in.size(), 0);
  bool ok = true;
  for (std::size_t i = 0; i < in.size(); ++i) {
    ok = setValue(in[i].real()) && ok;
    re[i] = valueQ;
    ok = setValue(in[i].imag()) && ok;
    im[i] = valueQ;
  }
  return ok;
}

bool KQuantized::dequantize(const std::vector<std::int64_t>& in,
                            std::vector<double>& out) noexcept {
  out.assign(in.size(), 0.0);
  bool ok = true;
  for (std::size_t i = 0; i < in.size(); ++i) {
    ok = setValueQ(in[i]) && ok;
    out[i] = getValue();
  }
  return ok;
}

bool KQuantized::dequantize(const std::vector<std::int64_t>& re,
                            const std::vector<std::int64_t>& im,
                            std::vector<std::complex<double>>& out) noexcept {
  out.clear();
  if (im.size() < re.size()) {
    return false;
  }
  out.resize(re.size());
  bool ok = true;
  for (std::size_t i = 0; i < re.size(); ++i) {
    ok = setValueQ(re[i]) && ok;
    const double real = getValue();
    ok = setValueQ(im[i]) && ok;
    out[i] = {real, getValue()};
  }
  return ok;
}

void KQuantized::reportFormat(Who who) {
  static constexpr const char* kWhoNames[] = {"KQuantized", "setNINTBITS", "setNFRACBITS",
                                              "changeFormat"};
  errorLineBare(kWhoNames[who],
                ": Parameters do not describe a fixed number correctly. Format created may "
                "not match desired format.");
}

void KQuantized::reportSaturationHigh() { errorLineBare("Saturation (HIGH) ocurred."); }

void KQuantized::reportSaturationLow() { errorLineBare("Saturation (LOW ) ocurred."); }

std::ostream& operator<<(std::ostream& os, const KQuantized& q) {
  return os << "  NINTBITS: " << q.NINTBITS << "  NFRACBITS: " << q.NFRACBITS
            << "  VerboseMode: " << (q.VerboseMode ? 1 : 0) << "  MinQ: " << q.MinQ
            << "  MaxQ: " << q.MaxQ << "  Min: " << q.Min << "  Max: " << q.Max
            << "  Scale: " << q.Scale << "  valueQ: " << q.valueQ << "  value: " << q.getValue();
}

}  // namespace brannoc
