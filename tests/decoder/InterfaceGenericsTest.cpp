// The C interface's generics: the check that create_state runs first, with its four
// messages in their order, and the shared-channel call without a state.
#include <gtest/gtest.h>

#include <string>

#include "DecoderTestSupport.h"

namespace brannoc::test {
namespace {

TEST(Interface, GenericsCheckReportsTheFirstFailingField) {
  const char* kCqiPU = "ERROR:encoder:C_NUM_CQI_PU must be 1, 2, 3 or 4.";
  const char* kPU = "ERROR:encoder:C_NUM_PU must be 1, 2, 4 or 8.";
  const char* kAlgorithm = "ERROR:encoder:C_ALGORITHM_TYPE must be 0 or 1 or 2.";
  const char* kBuffer = "ERROR:encoder:C_INTERLEAVER_BUFFER_SIZE must be 18432 or 36864.";
  const std::pair<vexlon_ip_brannoc_generics, const char*> cases[] = {
      // nullptr: passes
      {{3, 1, 36864, 0}, kCqiPU},  // CQI units are checked first
      {{2, 1, 36864, 5}, kCqiPU},
      {{2, 1, 36864, 3}, nullptr},
      {{3, 1, 36864, 4}, kPU},
      {{0, 1, 36864, 1}, kPU},
      {{8, 3, 36864, 1}, kAlgorithm},
      {{1, 0, 36864, 1}, nullptr},
      {{4, 2, 18432, 2}, nullptr},
      {{2, 3, 0, 1}, kAlgorithm},  // algorithm before buffer size
      {{2, 1, 36865, 1}, kBuffer},
      {{2, 1, 18431, 1}, kBuffer},
      {vexlon_ip_brannoc_get_default_generics(), nullptr},
  };
  for (const auto& [generics, message] : cases) {
    const std::string err = stderrOf([&] { Instance instance(generics); });
    if (message == nullptr) {
      EXPECT_EQ(err.find("ERROR:encoder:"), std::string::npos) << err;
    } else {
      expectLines(err, "File: ../s/brannoc_bitacc_cmodel.cpp(#)" + std::string(message) + "\n*");
    }
  }
}

// The control-channel call and the dump switch are refused a null state in their own tests.
TEST(Interface, SharedChannelCallRefusesANullState) {
  vexlon_ip_brannoc_destroy_state(nullptr);
  expectLines(
      stderrOf([] { EXPECT_EQ(vexlon_ip_brannoc_SCH_bitacc_simulate(nullptr, {}, nullptr), 101); }),
      "File: ../s/brannoc_bitacc_cmodel.cpp(#)ERROR:decoder:Simulate called with null "
      "state structure\n");
}

}  // namespace
}  // namespace brannoc::test
