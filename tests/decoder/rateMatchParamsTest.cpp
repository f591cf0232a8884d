// rateMatchParams: k0, Ncb and interleaver rows of TS 36.212 5.1.4.1 for the smaller code
// block of two (the larger one is checked against the transmitter for every size), the split
// of G into E per code block, and the size setters with their lines.
#include "rateMatchParams.h"

#include <gtest/gtest.h>

#include <regex>
#include <string>

namespace {

using brannoc::rateMatchParams;

rateMatchParams configured(std::uint32_t tbSize, std::uint32_t G, std::uint32_t Qm,
                           std::uint32_t rv) {
  rateMatchParams p;
  p.setTransmission(G, Qm, 1, 0);
  p.setDataParams(tbSize, G, 0, Qm, rv, 1);
  return p;
}

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
    const rateMatchParams p = configured(c.tbSize, 1200, 2, c.rv);
    EXPECT_TRUE(p.complete);
    EXPECT_EQ(p.rowMinus, c.rowMinus) << c.tbSize;
    EXPECT_EQ(p.NcbMinus, c.NcbMinus) << c.tbSize;
    EXPECT_EQ(p.k0_0, c.k0_0) << c.tbSize << " rv " << c.rv;
  }
}

TEST(rateMatchParams, SplitOfGIntoEarlyAndLateBlockLengths) {
  struct Case {
    std::uint32_t tbSize, G, Qm, Eidx, E0, E1;
  };
  const Case cases[] = {
      {6121, 1002, 4, 1, 500, 500},               // G' 250, gamma 0
      {6121, 1004, 4, 0, 500, 504},               // G' 251, gamma 1
      {262143, 43 * 600 + 6 * 7, 6, 35, 600, 606},  // gamma 7 of 43
      {6120, 1, 2, 0, 0, 0},                      // G' 0: no wrap-around
  };
  for (const Case& c : cases) {
    const rateMatchParams p = configured(c.tbSize, c.G, c.Qm, 0);
    EXPECT_EQ(p.Eidx, c.Eidx) << c.G;
    EXPECT_EQ(p.E0, c.E0) << c.G;
    EXPECT_EQ(p.E1, c.E1) << c.G;
  }
}

TEST(rateMatchParams, QSettersBeforeAnyModulationDoNotDivideByZero) {
  rateMatchParams p;
  EXPECT_TRUE(p.setCQIQ(40));
  EXPECT_EQ(p.cqiQ, 40u);
  EXPECT_FALSE(p.complete);
}

// Each size setter accepts up to its limit, then refuses with
// "../s/rateMatchParams.cpp(<line>)<message><value>" and keeps the old value.
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
      {&rateMatchParams::setACKSize, &rateMatchParams::ackSize, 2,
       "Error: ACK Size must be <2 : "},
  };
  for (const Case& c : cases) {
    rateMatchParams p;
    testing::internal::CaptureStderr();
    EXPECT_TRUE((p.*c.setter)(c.largestAccepted));
    EXPECT_FALSE((p.*c.setter)(c.largestAccepted + 1));
    const std::string line = testing::internal::GetCapturedStderr();
    EXPECT_EQ(p.*c.field, c.largestAccepted);
    std::smatch parts;
    ASSERT_TRUE(std::regex_match(line, parts,
                                 std::regex(R"(\.\./s/rateMatchParams\.cpp\(\d+\)(.*)\n)")))
        << line;
    EXPECT_EQ(parts[1].str(), c.message + std::to_string(c.largestAccepted + 1));
  }
}

}  // namespace
