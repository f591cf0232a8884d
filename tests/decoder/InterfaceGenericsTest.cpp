// The C interface's generics: the check that create_state runs first, with its four
// messages in their order, and null arguments.
#include "vexlon_ip_brannoc_bitacc_cmodel.h"

#include <gtest/gtest.h>

#include <regex>
#include <string>

namespace {

// Runs create_state and returns the message of the interface's first error line,
// checking the line's "File: ../s/brannoc_bitacc_cmodel.cpp(<line>)" frame.
std::string firstCreateMessage(const vexlon_ip_brannoc_generics& generics) {
  testing::internal::CaptureStderr();
  vexlon_ip_brannoc_state* state = vexlon_ip_brannoc_create_state(generics);
  const std::string err = testing::internal::GetCapturedStderr();
  vexlon_ip_brannoc_destroy_state(state);
  std::smatch parts;
  if (!std::regex_search(err, parts,
                         std::regex(R"(^File: \.\./s/brannoc_bitacc_cmodel\.cpp\(\d+\))"
                                    R"(([^\n]*)\n)"))) {
    return "<no interface line in: " + err + ">";
  }
  return parts[1].str();
}

struct GenericsCase {
  std::uint32_t numPU, algorithm, bufferSize, numCqiPU;
  const char* message;  // nullptr: passes the check
};

class GenericsCheck : public testing::TestWithParam<GenericsCase> {};

TEST_P(GenericsCheck, FirstFailingFieldIsReported) {
  const GenericsCase& c = GetParam();
  const vexlon_ip_brannoc_generics generics{c.numPU, c.algorithm, c.bufferSize, c.numCqiPU};
  const std::string message = firstCreateMessage(generics);
  if (c.message == nullptr) {
    EXPECT_EQ(message.find("ERROR:encoder:"), std::string::npos) << message;
  } else {
    EXPECT_EQ(message, c.message);
  }
}

constexpr const char* kCqiPU = "ERROR:encoder:C_NUM_CQI_PU must be 1, 2, 3 or 4.";
constexpr const char* kPU = "ERROR:encoder:C_NUM_PU must be 1, 2, 4 or 8.";
constexpr const char* kAlgorithm = "ERROR:encoder:C_ALGORITHM_TYPE must be 0 or 1 or 2.";
constexpr const char* kBuffer = "ERROR:encoder:C_INTERLEAVER_BUFFER_SIZE must be 18432 or 36864.";

INSTANTIATE_TEST_SUITE_P(
    OrderAndRanges, GenericsCheck,
    testing::Values(GenericsCase{3, 1, 36864, 0, kCqiPU},  // CQI units are checked first
                    GenericsCase{2, 1, 36864, 5, kCqiPU},
                    GenericsCase{2, 1, 36864, 3, nullptr},
                    GenericsCase{3, 1, 36864, 4, kPU},
                    GenericsCase{0, 1, 36864, 1, kPU},
                    GenericsCase{8, 3, 36864, 1, kAlgorithm},
                    GenericsCase{1, 0, 36864, 1, nullptr},
                    GenericsCase{4, 2, 18432, 2, nullptr},
                    GenericsCase{2, 3, 0, 1, kAlgorithm},  // algorithm before buffer size
                    GenericsCase{2, 1, 36865, 1, kBuffer},
                    GenericsCase{2, 1, 18431, 1, kBuffer},
                    GenericsCase{2, 1, 36864, 1, nullptr}));  // the default generics

TEST(Interface, NullArgumentsAreRefusedWithTheirCodes) {
  vexlon_ip_brannoc_destroy_state(nullptr);
  testing::internal::CaptureStderr();
  EXPECT_EQ(vexlon_ip_brannoc_SCH_bitacc_simulate(nullptr, {}, nullptr), 101);
  EXPECT_EQ(vexlon_ip_brannoc_CCH_bitacc_simulate(nullptr, {}, nullptr), 500);
  const std::string err = testing::internal::GetCapturedStderr();
  EXPECT_NE(err.find(")ERROR:decoder:Simulate called with null state structure\n"),
            std::string::npos);
  EXPECT_NE(err.find(")ERROR:PUCCH decoder:Simulate called with null state structure\n"),
            std::string::npos);
  EXPECT_EQ(IUO_set_debugfn_state(nullptr, 33, 0, "x", 1), 0u);
  EXPECT_EQ(IUO_set_debugfn_state(nullptr, 0, 2, "x", 1), 0u);
}

}  // namespace
