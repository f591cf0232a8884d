// The shared-channel decoder object: factories of both decoder objects, construction, the
// setters and their refusals, and the data and HARQ lengths of a configured transport block.
#include <gtest/gtest.h>

#include "DecoderTestSupport.h"
#include "KLTE_PUCCH_Decoding.h"
#include "KLTE_PUSCH_Decoding.h"

namespace brannoc::test {
namespace {

TEST(DecoderObjects, FactoriesRefusePropertiesAndConstructorsWarnAboutTheWidth) {
  expectLines(stderrOf([] { EXPECT_EQ(KLTE_PUSCH_Decoding::create("x=1"), nullptr); }),
              "File: ../s/KLTE_PUSCH_Decoding(286)ERROR:KLTE_PUSCH_Decoding:Unexpected "
              "properties:x=1\n");
  expectLines(
      stderrOf([] { EXPECT_EQ(KLTE_PUCCH_Decoding::create("y"), nullptr); }),
      "File: ../s/KLTE_PUCCH_Decoding(#)ERROR:KLTE_PUCCH_Decoding:Unexpected properties:y\n");
  const char* warning =
      "WARNING llr bit width MUST be 8:5 or the code may have unexpected results.\n";
  expectLines(stderrOf([] { KLTE_PUCCH_Decoding decoder("16:5"); }), warning);
  expectLines(stderrOf([] {
                KLTE_PUSCH_Decoding decoder("8:8");
                EXPECT_EQ(decoder.llrFormat().getMinQ(), -128);
                EXPECT_EQ(decoder.llrFormat().getMaxQ(), 127);
                EXPECT_EQ(decoder.getNumColumns(), 14u);
              }),
              warning);
}

TEST(PuschDecoder, SettersStoreTheirParameters) {
  auto decoder = KLTE_PUSCH_Decoding::create("");
  EXPECT_TRUE(decoder->setModulationParams(7200, 4, 1, 3));
  EXPECT_EQ(decoder->getNumColumns(), 10u);
  EXPECT_TRUE(decoder->setModulationParams(7200, 4, 1, 0));
  EXPECT_EQ(decoder->getNumColumns(), 12u);
  // The third argument is not the modulation: Qm stays that of setModulationParams.
  EXPECT_TRUE(decoder->setTransportBlockParams(1000, 7200, 2, 2, 1));
  EXPECT_EQ(decoder->rateDematcher().getRMParams().Qm, 4u);
  EXPECT_EQ(decoder->rateDematcher().getRMParams().rvidx, 2u);
  EXPECT_EQ(decoder->getTurboFlush(), 1u);

  EXPECT_FALSE(decoder->setTurboIterations(0));
  EXPECT_FALSE(decoder->setTurboIterations(17));
  EXPECT_EQ(decoder->getTurboIterations(), 7u);
  EXPECT_TRUE(decoder->setTurboIterations(16));
  EXPECT_EQ(decoder->getTurboIterations(), 16u);

  decoder->setCallIdentifiers(0x12345, true, 17);
  decoder->setCallIdentifiers(0xFFFF, false, 3);
  EXPECT_EQ(decoder->getUserId(), 0xFFFFu);
  EXPECT_EQ(decoder->getHarqSubframeId(), 1u);
  EXPECT_EQ(decoder->getSubframeId(), 3u);
}

TEST(PuschDecoder, SizeSettersReportRefusalsAfterStoringWhatTheyCan) {
  auto decoder = KLTE_PUSCH_Decoding::create("");
  expectLines(stderrOf([&] { EXPECT_FALSE(decoder->setCQIParams(20, 96, 5)); }),
              "File: ../s/KLTE_CQI_Decoding(#)Error: NumPU must be between 1 and 4 (5)\n"
              "../s/KLTE_PUSCH_Decoding(346)UNABLE TO Set Number of PU\n");
  EXPECT_EQ(decoder->rateDematcher().getRMParams().cqiSize, 20u);
  EXPECT_EQ(decoder->rateDematcher().getRMParams().cqiQ, 96u);
  expectLines(stderrOf([&] { EXPECT_FALSE(decoder->setACKParams(3, 12)); }),
              "../s/rateMatchParams.cpp(#)Error: ACK Size must be <2 : 3\n");
  EXPECT_EQ(decoder->rateDematcher().getRMParams().ackQ, 12u);
  EXPECT_FALSE(stderrOf([&] { EXPECT_FALSE(decoder->setRIParams(4, 6)); }).empty());
  EXPECT_TRUE(decoder->setCQIParams(127, 4095, 4));
  EXPECT_TRUE(decoder->setRIParams(2, 6));
}

struct LengthCase {
  std::uint32_t tbSize, G, Qm;
  std::uint32_t dataLength, harqLength;
};

class PuschLengths : public testing::TestWithParam<LengthCase> {};

// G comes back as the sum of the code blocks' E (short by the part of G that no whole
// modulation symbol carries); the HARQ length is the sum of K_r + 4.
TEST_P(PuschLengths, FollowTheSegmentation) {
  const LengthCase& c = GetParam();
  auto decoder = KLTE_PUSCH_Decoding::create("");
  EXPECT_EQ(decoder->getDataLength(), 0u);
  EXPECT_EQ(decoder->getHarqLength(), 0u);
  ASSERT_TRUE(decoder->setModulationParams(c.G, c.Qm, 1, 0));
  ASSERT_TRUE(decoder->setTransportBlockParams(c.tbSize, c.G, 0, 0, 0));
  EXPECT_EQ(decoder->getDataLength(), c.dataLength);
  EXPECT_EQ(decoder->getHarqLength(), c.harqLength);
}

INSTANTIATE_TEST_SUITE_P(Sizes, PuschLengths,
                         testing::Values(LengthCase{16, 120, 2, 120, 44},
                                         LengthCase{1000, 1201, 2, 1200, 1028},
                                         LengthCase{6120, 7200, 6, 7200, 6148},
                                         LengthCase{6121, 7200, 4, 7200, 6216},
                                         LengthCase{75376, 86400, 6, 86400, 75376 + 24 * 14 + 52},
                                         LengthCase{16, 1, 2, 0, 44}));

}  // namespace
}  // namespace brannoc::test
