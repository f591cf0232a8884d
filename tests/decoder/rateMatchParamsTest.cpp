// rateMatchParams: k0, Ncb and interleaver rows of TS 36.212 5.1.4.1 for one and two code
// blocks and every redundancy version, the split of G into E per code block, and the size
// setters with their lines.
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

struct CircularBufferCase {
  std::uint32_t tbSize, rv;
  std::uint32_t rowMinus, NcbMinus, k0_0, rowPlus, NcbPlus, k0_1;
};

class CircularBuffer : public testing::TestWithParam<CircularBufferCase> {};

TEST_P(CircularBuffer, RowsNcbAndK0) {
  const CircularBufferCase& want = GetParam();
  const rateMatchParams p = configured(want.tbSize, 1200, 2, want.rv);
  EXPECT_EQ(p.rowMinus, want.rowMinus);
  EXPECT_EQ(p.NcbMinus, want.NcbMinus);
  EXPECT_EQ(p.k0_0, want.k0_0);
  EXPECT_EQ(p.rowPlus, want.rowPlus);
  EXPECT_EQ(p.NcbPlus, want.NcbPlus);
  EXPECT_EQ(p.k0_1, want.k0_1);
  EXPECT_TRUE(p.complete);
}

// k0 = R * (2 * ceil(Ncb / (8R)) * rv + 2): for K = 6144, R = 193, Ncb = 18528 and
// ceil(18528 / 1544) = 12, so k0 = 386 + 4632 * rv.
INSTANTIATE_TEST_SUITE_P(
    OneAndTwoCodeBlocks, CircularBuffer,
    testing::Values(CircularBufferCase{6120, 0, 191, 18336, 382, 193, 18528, 386},
                    CircularBufferCase{6120, 1, 191, 18336, 382 + 4584, 193, 18528, 386 + 4632},
                    CircularBufferCase{6120, 2, 191, 18336, 9550, 193, 18528, 9650},
                    CircularBufferCase{6120, 3, 191, 18336, 382 + 3 * 4584, 193, 18528, 14282},
                    CircularBufferCase{6121, 0, 97, 9312, 194, 99, 9504, 198},
                    // K = 40: D = 44, R = 2, Kw = 192, ceil(192 / 16) = 12 -> k0 = 4 + 48 rv
                    CircularBufferCase{16, 3, 1, 96, 2 + 3 * 24, 2, 192, 4 + 3 * 48}));

struct SplitCase {
  std::uint32_t tbSize, G, Qm;
  std::uint32_t Eidx, E0, E1;
};

class SplitOfG : public testing::TestWithParam<SplitCase> {};

TEST_P(SplitOfG, EarlyAndLateBlockLengths) {
  const SplitCase& want = GetParam();
  const rateMatchParams p = configured(want.tbSize, want.G, want.Qm, 0);
  EXPECT_EQ(p.Eidx, want.Eidx);
  EXPECT_EQ(p.E0, want.E0);
  EXPECT_EQ(p.E1, want.E1);
}

INSTANTIATE_TEST_SUITE_P(
    Blocks, SplitOfG,
    testing::Values(SplitCase{6120, 1200, 2, 0, 1200, 1200},
                    SplitCase{6121, 1002, 4, 1, 500, 500},   // G' 250, gamma 0
                    SplitCase{6121, 1004, 4, 0, 500, 504},   // G' 251, gamma 1
                    SplitCase{262143, 43 * 600 + 6 * 7, 6, 35, 600, 606},  // gamma 7 of 43
                    SplitCase{6120, 1, 2, 0, 0, 0}));        // G' 0: no wrap-around

TEST(rateMatchParams, SetTransmissionAloneDoesNotCompute) {
  rateMatchParams p;
  p.setTransmission(7200, 6, 1, 1);
  EXPECT_FALSE(p.complete);
  EXPECT_EQ(p.totalBits, 7200u);
  EXPECT_EQ(p.Qm, 6u);
  EXPECT_EQ(p.cpType, 1u);
  EXPECT_EQ(p.k0_1, 0u);
}

TEST(rateMatchParams, QSettersBeforeAnyModulationDoNotDivideByZero) {
  rateMatchParams p;
  EXPECT_TRUE(p.setCQIQ(40));
  EXPECT_EQ(p.cqiQ, 40u);
  EXPECT_FALSE(p.complete);
}

struct SizeSetterCase {
  bool (rateMatchParams::*setter)(std::uint32_t);
  std::uint32_t largestAccepted;
  const char* message;
};

class SizeSetters : public testing::TestWithParam<SizeSetterCase> {};

TEST_P(SizeSetters, AcceptUpToTheLimitThenRefuseWithTheirLine) {
  const SizeSetterCase& c = GetParam();
  rateMatchParams p;
  testing::internal::CaptureStderr();
  EXPECT_TRUE((p.*c.setter)(c.largestAccepted));
  EXPECT_FALSE((p.*c.setter)(c.largestAccepted + 1));
  const std::string line = testing::internal::GetCapturedStderr();
  // "../s/rateMatchParams.cpp(<line of the statement>)<message><value>\n"
  std::smatch parts;
  ASSERT_TRUE(std::regex_match(line, parts, std::regex(R"(\.\./s/rateMatchParams\.cpp\(\d+\)(.*)\n)")))
      << line;
  EXPECT_EQ(parts[1].str(), c.message + std::to_string(c.largestAccepted + 1));
}

INSTANTIATE_TEST_SUITE_P(
    CqiRiAck, SizeSetters,
    testing::Values(SizeSetterCase{&rateMatchParams::setCQISize, 127, "Error: CQI Size must be <128 :"},
                    SizeSetterCase{&rateMatchParams::setRISize, 2, "Error: RI Size must be <2 :"},
                    SizeSetterCase{&rateMatchParams::setACKSize, 2, "Error: ACK Size must be <2 : "}));

TEST(rateMatchParams, RefusedSizeKeepsTheOldValue) {
  rateMatchParams p;
  p.setCQISize(20);
  testing::internal::CaptureStderr();
  p.setCQISize(500);
  testing::internal::GetCapturedStderr();
  EXPECT_EQ(p.cqiSize, 20u);
}

}  // namespace
