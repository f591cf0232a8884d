// Helpers shared by the decoder library's tests: captured error lines matched against a
// pattern, tables of refused calls, random bits, an instance owned for the length of a test,
// a scratch folder for dump files.
#ifndef BRANNOC_TESTS_DECODERTESTSUPPORT_H
#define BRANNOC_TESTS_DECODERTESTSUPPORT_H

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <random>
#include <regex>
#include <sstream>
#include <string>
#include <vector>

#include "vexlon_ip_brannoc_bitacc_cmodel.h"

namespace brannoc::test {

// Compares captured text with an expected one in which "#" stands for a line number and "*"
// for any text.
inline void expectLines(const std::string& captured, const std::string& expected) {
  std::string pattern = std::regex_replace(expected, std::regex(R"([.^$|()\[\]{}+?\\])"), R"(\$&)");
  pattern = std::regex_replace(pattern, std::regex("#"), R"(\d+)");
  pattern = std::regex_replace(pattern, std::regex(R"(\*)"), R"([\s\S]*)");
  EXPECT_TRUE(std::regex_match(captured, std::regex(pattern))) << captured << "\nwanted\n"
                                                               << expected;
}

// What call() prints on the standard error stream.
template <typename Call>
std::string stderrOf(Call&& call) {
  testing::internal::CaptureStderr();
  call();
  return testing::internal::GetCapturedStderr();
}

// A call that must be refused (return false) and print exactly lines, a pattern of
// expectLines.
struct Refusal {
  std::function<bool()> call;
  std::string lines;
};

inline void expectRefusals(const std::vector<Refusal>& refusals) {
  for (std::size_t i = 0; i < refusals.size(); ++i) {
    SCOPED_TRACE("refusal " + std::to_string(i) + ": " + refusals[i].lines);
    bool accepted = true;
    expectLines(stderrOf([&] { accepted = refusals[i].call(); }), refusals[i].lines);
    EXPECT_FALSE(accepted);
  }
}

inline std::vector<std::uint8_t> randomBits(std::size_t n, std::mt19937& random) {
  std::vector<std::uint8_t> bits(n);
  for (std::uint8_t& bit : bits) {
    bit = static_cast<std::uint8_t>(random() & 1U);
  }
  return bits;
}

// An instance of the decoder library, destroyed with the object.
class Instance {
 public:
  explicit Instance(vexlon_ip_brannoc_generics generics = vexlon_ip_brannoc_get_default_generics())
      : itsState(vexlon_ip_brannoc_create_state(generics)) {}
  ~Instance() { vexlon_ip_brannoc_destroy_state(itsState); }
  Instance(const Instance&) = delete;
  Instance& operator=(const Instance&) = delete;
  vexlon_ip_brannoc_state* get() const { return itsState; }

  // Switches a dump on under prefix; the switch's result.
  std::uint32_t dump(std::uint32_t key, std::uint32_t channel, const std::string& prefix) const {
    return IUO_set_debugfn_state(itsState, key, channel, prefix.data(),
                                 static_cast<std::uint32_t>(prefix.size()));
  }

 private:
  vexlon_ip_brannoc_state* itsState;
};

// A new empty folder, removed with everything in it when the object goes.
class ScratchDir {
 public:
  ScratchDir() {
    std::string name = (std::filesystem::temp_directory_path() / "brannoc-XXXXXX").string();
    if (mkdtemp(name.data()) != nullptr) {
      itsPath = name;
    }
  }
  ~ScratchDir() {
    std::error_code ignored;
    std::filesystem::remove_all(itsPath, ignored);
  }
  ScratchDir(const ScratchDir&) = delete;
  ScratchDir& operator=(const ScratchDir&) = delete;
  // The folder's path with a trailing separator, ready to be a file-name prefix.
  std::string prefix() const { return itsPath.string() + "/"; }
  const std::filesystem::path& path() const { return itsPath; }

 private:
  std::filesystem::path itsPath;
};

inline std::string fileText(const std::filesystem::path& path) {
  std::ifstream in(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

}  // namespace brannoc::test

#endif  // BRANNOC_TESTS_DECODERTESTSUPPORT_H
