// The four shapes of the decoder's error lines, and the factories' refusal of properties.
#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <string>

#include "DecoderTestSupport.h"
#include "KCRCGenerator.h"
#include "KDeSegment3GPPLTE.h"
#include "KRateDeMatch.h"
#include "errorLine.h"

namespace brannoc::test {
namespace {

TEST(ErrorLine, FourShapesWithValuesAppendedInDecimal) {
  EXPECT_EQ(stderrOf([] {
              errorLineFile("../s/KQuantized", 12, "value ", -3, " = ", 4u);
              errorLineFileSpaced("../s/KQuantized", 248, "Error in parsing");
              errorLineSource("../s/KLTE_PUSCH_Decoding", 306,
                              "Error: SCH channel is not enabled. ");
              errorLineBare("flag ", std::uint8_t{1}, " ", std::int8_t{-2});  // bytes as numbers
            }),
            "File: ../s/KQuantized(12)value -3 = 4\n"
            "File: ../s/KQuantized (248) Error in parsing\n"
            "../s/KLTE_PUSCH_Decoding(306)Error: SCH channel is not enabled. \n"
            "flag 1 -2\n");
}

// Each factory builds its object from empty properties and refuses anything else with a line.
TEST(Factories, RefuseNonEmptyPropertiesWithTheirLine) {
  const std::pair<std::string, std::function<bool(const std::string&)>> factories[] = {
      {"KCRCGenerator", [](const std::string& p) { return !!KCRCGenerator::create(p); }},
      {"KDeSegment3GPPLTE", [](const std::string& p) { return !!KDeSegment3GPPLTE::create(p); }},
      {"KRateDeMatch", [](const std::string& p) { return !!KRateDeMatch::create(p); }},
  };
  for (const auto& [name, create] : factories) {
    EXPECT_TRUE(create("")) << name;
    expectRefusals(
        {{[&] { return create("fast"); }, "ERROR:" + name + ":Unexpected properties:fast\n"}});
  }
}

}  // namespace
}  // namespace brannoc::test
