// The four shapes of the decoder's error lines.
#include "errorLine.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <string>

namespace {

TEST(ErrorLine, FourShapesWithValuesAppendedInDecimal) {
  testing::internal::CaptureStderr();
  brannoc::errorLineFile("../s/KQuantized", 12, "value ", -3, " = ", 4u);
  brannoc::errorLineFileSpaced("../s/KQuantized", 248, "Error in parsing");
  brannoc::errorLineSource("../s/KLTE_PUSCH_Decoding", 306, "Error: SCH channel is not enabled. ");
  brannoc::errorLineBare("Saturation (LOW ) ocurred.");
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "File: ../s/KQuantized(12)value -3 = 4\n"
            "File: ../s/KQuantized (248) Error in parsing\n"
            "../s/KLTE_PUSCH_Decoding(306)Error: SCH channel is not enabled. \n"
            "Saturation (LOW ) ocurred.\n");
}

TEST(ErrorLine, ByteSizedIntegersAreWrittenAsNumbers) {
  testing::internal::CaptureStderr();
  brannoc::errorLineBare("flag ", std::uint8_t{1}, " ", std::int8_t{-2});
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "flag 1 -2\n");
}

}  // namespace
