// The four shapes of the decoder's error lines, and the factories' refusal of properties.
#include "errorLine.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <string>

#include "KCRCGenerator.h"
#include "KDeSegment3GPPLTE.h"
#include "KRateDeMatch.h"

namespace {

TEST(ErrorLine, FourShapesWithValuesAppendedInDecimal) {
  testing::internal::CaptureStderr();
  brannoc::errorLineFile("../s/KQuantized", 12, "value ", -3, " = ", 4u);
  brannoc::errorLineFileSpaced("../s/KQuantized", 248, "Error in parsing");
  brannoc::errorLineSource("../s/KLTE_PUSCH_Decoding", 306, "Error: SCH channel is not enabled. ");
  brannoc::errorLineBare("flag ", std::uint8_t{1}, " ", std::int8_t{-2});  // bytes as numbers
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "File: ../s/KQuantized(12)value -3 = 4\n"
            "File: ../s/KQuantized (248) Error in parsing\n"
            "../s/KLTE_PUSCH_Decoding(306)Error: SCH channel is not enabled. \n"
            "flag 1 -2\n");
}

// Each factory builds its object from empty properties and refuses anything else with a line.
TEST(Factories, RefuseNonEmptyPropertiesWithTheirLine) {
  const std::pair<std::string, std::function<bool(const std::string&)>> factories[] = {
      {"KCRCGenerator", [](const std::string& p) { return !!brannoc::KCRCGenerator::create(p); }},
      {"KDeSegment3GPPLTE",
       [](const std::string& p) { return !!brannoc::KDeSegment3GPPLTE::create(p); }},
      {"KRateDeMatch", [](const std::string& p) { return !!brannoc::KRateDeMatch::create(p); }},
  };
  for (const auto& [name, create] : factories) {
    EXPECT_TRUE(create("")) << name;
    testing::internal::CaptureStderr();
    EXPECT_FALSE(create("fast")) << name;
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              "ERROR:" + name + ":Unexpected properties:fast\n");
  }
}

}  // namespace
