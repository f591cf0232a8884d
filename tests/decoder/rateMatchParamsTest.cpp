// rateMatchParams: k0, Ncb and interleaver rows of TS 36.212 5.1.4.1 worked by hand for the
// smaller code block of two (every size is checked against the transmitter elsewhere), and the
// size setters with their lines.
#include <gtest/gtest.h>

#include <string>

#include "DecoderTestSupport.h"
#include "rateMatchParams.h"

namespace brannoc::test {
namespace {

// k0 = R * (2 * ceil(Ncb / (8R)) * rv + 2).
TEST(rateMatchParams, RowsNcbAndK0OfTheSmallerBlock) {
  struct Case {
    std::uint32_t tbSize, rv, rowMinus, NcbMinus, k0_0;
  };
  const Case cases[] = {
      {6120, 1, 191, 18336, 382 + 4584},  // K- 6080: R 191, ceil(18336 / 1528) = 12
      {6121, 0, 97, 9312, 194},           // K- 3072
      {6121, 3, 97, 9312, 194 + 3 * 2328},
      {16, 3, 1, 96, 2 + 3 * 24},  // K- 0 (no such block): D 4, R 1, Kw 96
  };
  for (const Case& c : cases) {
    rateMatchParams p;
    p.setTransmission(1200, 2, 1, 0);
    p.setDataParams(c.tbSize, 1200, 0, 2, c.rv, 1);
    EXPECT_TRUE(p.complete && p.rowMinus == c.rowMinus && p.NcbMinus == c.NcbMinus &&
                p.k0_0 == c.k0_0)
        << c.tbSize << " rv " << c.rv;
  }
  rateMatchParams p;  // Q before any modulation must not divide by zero
  EXPECT_TRUE(p.setCQIQ(40));
  EXPECT_EQ(p.cqiQ, 40u);
  EXPECT_FALSE(p.complete);
}

// Each size setter accepts up to its limit, then refuses with its line and keeps the old value.
TEST(rateMatchParams, SizeSettersRefuseAboveTheirLimitWithTheirLine) {
  struct Case {
    bool (rateMatchParams::*setter)(std::uint32_t);
    std::uint32_t rateMatchParams::*field;
    std::uint32_t largestAccepted;
    const char* message;
  };
  const Case cases[] = {
      {&rateMatchParams::setCQISize, &rateMatchParams::cqiSize, 127,
       "Error: CQI Size must be <128 :"},
      {&rateMatchParams::setRISize, &rateMatchParams::riSize, 2, "Error: RI Size must be <2 :"},
      {&rateMatchParams::setACKSize, &rateMatchParams::ackSize, 2, "Error: ACK Size must be <2 : "},
  };
  for (const Case& c : cases) {
    rateMatchParams p;
    EXPECT_TRUE((p.*c.setter)(c.largestAccepted));
    expectRefusals({{[&] { return (p.*c.setter)(c.largestAccepted + 1); },
                     "../s/rateMatchParams.cpp(#)" +
                         (c.message + std::to_string(c.largestAccepted + 1)) + "\n"}});
    EXPECT_EQ(p.*c.field, c.largestAccepted);
  }
}

}  // namespace
}  // namespace brannoc::test
