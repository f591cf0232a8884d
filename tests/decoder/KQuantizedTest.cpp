// Tests of the fixed-point number KQuantized: the 8:5 LLR format, rounding and saturation,
// exact sums, format changes, the "A:B" format text, stream output, the vector forms, and
// the widest formats.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <sstream>
#include <string>

#include "DecoderTestSupport.h"
#include "KQuantized.h"

namespace brannoc::test {
namespace {

const std::string kHigh = "Saturation (HIGH) ocurred.\n";
const std::string kLow = "Saturation (LOW ) ocurred.\n";
const std::string kFormatWarning =
    ": Parameters do not describe a fixed number correctly. Format created may not match "
    "desired format.\n";

KQuantized llr(bool verbose = false) { return KQuantized(0.0, 3, 5, verbose); }

TEST(KQuantized, FormatTextParsingAcceptsOrRejectsWithTheRightLine) {
  const auto error = [](int line, const std::string& ending) {
    return "File: ../s/KQuantized (" + std::to_string(line) +
           ") Error in KQuantized::setTypeFromString. Need a string with a A:B format" + ending +
           "\n";
  };
  struct Case {
    const char* text;
    const char* format;  // format afterwards; a rejected text keeps 16:8 and the raw value
    std::string line;
  };
  const Case cases[] = {
      {"8:5", "8:5", ""},
      {"8:5:", "8:5", ""},
      {"\t8:\n5\n", "8:5", ""},
      {"0x8:5", "8:5", ""},
      {"010:5", "8:5", ""},
      {"54:5", "54:5", ""},
      {"8::5", "16:8", error(248, "")},
      {"8: ", "16:8", error(248, "")},
      {"", "16:8", error(248, "")},
      {"5:5", "16:8", error(252, ", where A > B")},
      {":5", "16:8", error(252, ", where A > B")},
      {"55:5", "16:8", error(254, ", where A <=54")},
  };
  for (const Case& c : cases) {
    KQuantized q(0.0, 8, 8, false);
    ASSERT_TRUE(q.setValueQ(-300));
    bool ok = false;
    EXPECT_EQ(stderrOf([&] { ok = q.setTypeFromString(c.text); }), c.line) << c.text;
    EXPECT_EQ(ok, c.line.empty()) << c.text;
    EXPECT_EQ(q.getTypeString(), c.format) << c.text;
    if (!ok) {
      EXPECT_EQ(q.getValueQ(), -300) << c.text;
    }
  }
}

// 3.97 rounds to raw 127 but lies above Max = 3.96875: it saturates HIGH all the same.
TEST(KQuantized, SetValueRoundsHalfAwayFromZeroAndJudgesSaturationOnTheInput) {
  struct Case {
    double x;
    std::int64_t raw;
    bool ok;
    std::string line;
  };
  const double inf = std::numeric_limits<double>::infinity();
  const Case cases[] = {
      {1.0, 32, true, ""},         {0.015625, 1, true, ""},
      {-0.015625, -1, true, ""},   {0.0468750, 2, true, ""},
      {-0.0, 0, true, ""},         {3.96875, 127, true, ""},
      {3.97, 127, false, kHigh},   {-4.0, -128, true, ""},
      {-4.001, -128, false, kLow}, {inf, 127, false, kHigh},
      {-inf, -128, false, kLow},   {std::nan(""), 0, false, ""},  // no information: raw 0, no line
  };
  for (const Case& c : cases) {
    KQuantized q = llr(true);
    ASSERT_TRUE(q.setValueQ(77));
    bool ok = true;
    EXPECT_EQ(stderrOf([&] { ok = q.setValue(c.x); }), c.line) << c.x;
    EXPECT_EQ(ok, c.ok) << c.x;
    EXPECT_EQ(q.getValueQ(), c.raw) << c.x;
    KQuantized quiet = llr();  // the same saturation is silent when not verbose
    EXPECT_EQ(stderrOf([&] { quiet.setValue(c.x); }), "") << c.x;
  }
  KQuantized q = llr(true);
  EXPECT_EQ(stderrOf([&] { EXPECT_FALSE(q.setValueQ(200)); }), kHigh);
  EXPECT_EQ(q.getValueQ(), 127);
  EXPECT_EQ(stderrOf([&] { EXPECT_FALSE(q.setValueQ(-129)); }), kLow);
  EXPECT_EQ(q.getValueQ(), -128);
}

TEST(KQuantized, SumIsExactInTheWiderFormatThenNarrowingClamps) {
  KQuantized a = llr(), b = llr();
  a.setValueQ(127);
  b.setValueQ(127);
  KQuantized sum = a + b;
  EXPECT_EQ(sum.getValueQ(), 254);
  EXPECT_EQ(sum.getTypeString(), "9:5");
  EXPECT_EQ(a.getTypeString(), "8:5");  // operands untouched
  EXPECT_FALSE(sum.setNINTBITS(3));
  EXPECT_EQ(sum.getValueQ(), 127);

  a.setValueQ(-128);
  a -= b;
  EXPECT_EQ(a.getValueQ(), -255);
  EXPECT_EQ(a.copyWithNINTBITS(3).getValueQ(), -128);

  KQuantized c(1.5, 2, 3, false);  // 5:3, raw 12: fraction bits align to 5
  b.setValueQ(-3);
  sum = b + c;
  EXPECT_EQ(sum.getTypeString(), "9:5");
  EXPECT_EQ(sum.getValueQ(), 48 - 3);
}

TEST(KQuantized, FewerFractionBitsRoundTowardMinusInfinityMoreShiftLeft) {
  const std::pair<std::int64_t, std::int64_t> cases[] = {
      {5, 2}, {-5, -3}, {-3, -2}, {127, 63}, {-128, -64}};
  for (const auto& [raw, expected] : cases) {
    KQuantized q = llr();
    q.setValueQ(raw);
    EXPECT_TRUE(q.changeFormat(3, 4)) << raw;
    EXPECT_EQ(q.getValueQ(), expected) << raw;
    EXPECT_EQ(q.copyWithFormat(3, 5).getValueQ(), expected * 2) << raw;
  }
  KQuantized q = llr();
  q.setValueQ(100);
  EXPECT_TRUE(q.setNFRACBITS(6));
  EXPECT_EQ(q.getTypeString(), "9:6");
  EXPECT_EQ(q.getValueQ(), 200);
}

TEST(KQuantized, StreamOutputOfRawFortyInEightFive) {
  KQuantized q = llr();
  q.setValueQ(40);
  std::ostringstream os;
  os << q;
  EXPECT_EQ(os.str(),
            "  NINTBITS: 3  NFRACBITS: 5  VerboseMode: 0  MinQ: -128  MaxQ: 127  Min: -4"
            "  Max: 3.96875  Scale: 32  valueQ: 40  value: 1.25");
}

TEST(KQuantized, VectorFormsConvertEveryElementAndReportAnySaturation) {
  KQuantized q = llr();
  std::vector<std::int64_t> raw = {9, 9, 9, 9, 9};
  EXPECT_FALSE(q.quantize(std::vector<double>{1.0, 5.0, -0.015625}, raw));
  EXPECT_EQ(raw, (std::vector<std::int64_t>{32, 127, -1}));

  std::vector<std::int64_t> im;
  EXPECT_FALSE(q.quantize(std::vector<std::complex<double>>{{1.0, -0.5}, {-9.0, 0.25}}, raw, im));
  EXPECT_EQ(raw, (std::vector<std::int64_t>{32, -128}));
  EXPECT_EQ(im, (std::vector<std::int64_t>{-16, 8}));

  std::vector<double> real;
  EXPECT_FALSE(q.dequantize(std::vector<std::int64_t>{40, 200}, real));
  EXPECT_EQ(real, (std::vector<double>{1.25, 3.96875}));

  std::vector<std::complex<double>> z;
  EXPECT_TRUE(q.dequantize({40, -32}, {16, 8, 99}, z));
  EXPECT_EQ(z, (std::vector<std::complex<double>>{{1.25, 0.5}, {-1.0, 0.25}}));
  EXPECT_FALSE(q.dequantize({40, -32}, {16}, z));  // a missing imaginary part is refused
  EXPECT_TRUE(z.empty());
}

TEST(KQuantized, WidthCapsCutTheNamedWidthAndWarn) {
  EXPECT_EQ(stderrOf([] { KQuantized(0.0, 3, 60, false); }), "KQuantized" + kFormatWarning);
  EXPECT_EQ(stderrOf([] { KQuantized(5.0, 3, 5, true); }), kHigh + "Saturation ocurred.\n");
  struct Case {
    const char* what;
    bool (*change)(KQuantized&);
    std::uint32_t NINTBITS, NFRACBITS;
    std::string line;
  };
  const Case cases[] = {
      {"frac 60", [](KQuantized& q) { return q.setNFRACBITS(60); }, 3, 50,
       "setNFRACBITS" + kFormatWarning},
      {"int 60", [](KQuantized& q) { return q.setNINTBITS(60); }, 48, 5,
       "setNINTBITS" + kFormatWarning},
      {"0:0", [](KQuantized& q) { return q.changeFormat(0, 0); }, 0, 0,
       "changeFormat" + kFormatWarning},
      {"1:53 fits", [](KQuantized& q) { return q.changeFormat(1, 53); }, 1, 53, ""},
  };
  for (const Case& c : cases) {
    KQuantized q = llr();
    EXPECT_EQ(stderrOf([&] { c.change(q); }), c.line) << c.what;
    EXPECT_EQ(q.getNINTBITS(), c.NINTBITS) << c.what;
    EXPECT_EQ(q.getNFRACBITS(), c.NFRACBITS) << c.what;
    EXPECT_EQ(q.getScale(), std::uint64_t{1} << c.NFRACBITS) << c.what;
    EXPECT_LE(q.getMinQ(), q.getValueQ()) << c.what;
    EXPECT_LE(q.getValueQ(), q.getMaxQ()) << c.what;
  }
}

TEST(KQuantized, WidestFormatStaysExact) {
  constexpr std::int64_t kMax54 = (std::int64_t{1} << 53) - 1;
  KQuantized q(0.0, 54, 0, false);
  EXPECT_EQ(q.getMax(), static_cast<double>(kMax54));
  // Adding one half to 2^53 - 1 rounds up to 2^53 in double; the result still fits.
  EXPECT_TRUE(q.setValue(q.getMax()));
  EXPECT_EQ(q.getValueQ(), kMax54);
  // Moving the largest integer to 53 fraction bits leaves 64 bits: it saturates instead.
  EXPECT_FALSE(q.changeFormat(1, 53));
  EXPECT_EQ(q.getValueQ(), kMax54);
  // A sum of two extremes of the widest format leaves its range but not 64 bits.
  KQuantized w(0.0, 54, 0, false);
  EXPECT_FALSE(w.setValueQ(std::numeric_limits<std::int64_t>::min()));
  KQuantized sum = w;
  EXPECT_EQ(stderrOf([&] { sum = w + w; }),
            "changeFormat" + kFormatWarning + "changeFormat" + kFormatWarning);
  EXPECT_EQ(sum.getValueQ(), -(std::int64_t{1} << 54));
}

}  // namespace
}  // namespace brannoc::test
