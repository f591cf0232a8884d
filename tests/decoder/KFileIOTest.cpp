// Tests of the debug-dump descriptor, value formatters, record writers and dump-file opener.
#include "KFileIO.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <sstream>
#include <string>
#include <vector>

namespace brannoc {
namespace {

std::string repeat(char c, std::size_t n) { return std::string(n, c); }

std::string readFile(const std::filesystem::path& path) {
  std::ifstream in(path);
  return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

template <typename F>
std::string stderrOf(F&& f) {
  testing::internal::CaptureStderr();
  f();
  return testing::internal::GetCapturedStderr();
}

// A descriptor writing into an in-memory stream.
struct MemoryDump {
  std::ostringstream stream;
  DumpDescriptor descriptor;
  MemoryDump(std::uint32_t mode, std::uint32_t decWidth, std::uint32_t binWidth,
             std::uint32_t hexWidth, std::uint32_t address = 0, std::uint32_t step = 4)
      : descriptor(&stream, mode, address, step, decWidth, binWidth, hexWidth) {}
};

TEST(DumpDescriptor, WidthSettersRefuseOutsideTheirRangeAndKeepTheOldWidth) {
  const std::string kept = " is unchanged. Width must be in ";
  struct Case {
    bool (DumpDescriptor::*set)(std::uint32_t);
    std::uint32_t (DumpDescriptor::*get)() const;
    std::uint32_t value;
    std::string line;  // empty when accepted
  };
  const Case cases[] = {
      {&DumpDescriptor::setDecWidth, &DumpDescriptor::getDecWidth, 33,
       "Invalid Witdh: 33. Value 20" + kept + "[1,32]\n"},
      {&DumpDescriptor::setDecWidth, &DumpDescriptor::getDecWidth, 32, ""},
      {&DumpDescriptor::setBinWidth, &DumpDescriptor::getBinWidth, 40,
       "Invalid Witdh: 40. Value 16" + kept + "[1,39]\n"},
      {&DumpDescriptor::setBinWidth, &DumpDescriptor::getBinWidth, 39, ""},
      {&DumpDescriptor::setHexWidth, &DumpDescriptor::getHexWidth, 15,
       "Invalid Witdh: 15. Value 8" + kept + "[1,15)\n"},
      {&DumpDescriptor::setHexWidth, &DumpDescriptor::getHexWidth, 1, ""},
  };
  for (const Case& c : cases) {
    DumpDescriptor descriptor;  // the decoders' descriptor: widths 20, 16, 8
    const std::uint32_t old = (descriptor.*c.get)();
    bool accepted = false;
    EXPECT_EQ(stderrOf([&] { accepted = (descriptor.*c.set)(c.value); }), c.line) << c.value;
    EXPECT_EQ(accepted, c.line.empty()) << c.value;
    EXPECT_EQ((descriptor.*c.get)(), accepted ? c.value : old) << c.value;
  }
  // Refused in the constructor, the widths keep their first values 32, 32 and 12.
  EXPECT_EQ(stderrOf([] { DumpDescriptor(nullptr, 0, 0, 4, 0, 40, 15); }),
            "Invalid Witdh: 0. Value 32" + kept + "[1,32]\n"
            "Invalid Witdh: 40. Value 32" + kept + "[1,39]\n"
            "Invalid Witdh: 15. Value 12" + kept + "[1,15)\n");
}

// Binary text is the low width bits of the two's complement; hexadecimal text is padded,
// lowercase, and negatives use their type's width; bit types print 0 or 1.
TEST(KFileIOFormat, BinaryAndHexText) {
  const std::pair<std::string, std::string> cases[] = {
      {toBinary(-5, 16), "1111111111111011"},
      {toBinary(std::uint64_t{5}, 32), repeat('0', 29) + "101"},
      {toBinary(0xffffffffu, 40), repeat('0', 8) + repeat('1', 32)},
      {toBinary(-3LL, 3), "101"},
      {toBinary(std::uint8_t{6}, 4), "0001"},
      {toBinary(true, 3), "001"},
      {toBinary(7, 0), ""},
      {toHex(0x2200u, 8), "0x00002200"},
      {toHex(-1, 4), "0xffffffff"},
      {toHex(static_cast<short>(-1), 8), "0x0000ffff"},
      {toHex(std::int64_t{-2}, 1), "0xfffffffffffffffe"},
      {toHex(std::uint8_t{200}, 2), "0x01"},
  };
  for (std::size_t i = 0; i < std::size(cases); ++i) {
    EXPECT_EQ(cases[i].first, cases[i].second) << "case " << i;
  }
}

TEST(KFileIOFormat, OversizedWidthsAreCutAndUnsupportedTypesGiveCrosses) {
  struct Case {
    std::function<std::string()> format;
    std::string line, text;
  };
  const Case cases[] = {
      {[] { return toBinary(1, 41); },
       "File: KFileIO(177)  Passing width larger than 40. Setting to 40\n", repeat('0', 39) + "1"},
      {[] { return toHex(1, 16); },
       "File: KFileIO(121)  Passing width larger than 15. Setting to 15\n",
       "0x" + repeat('0', 14) + "1"},
      {[] { return toBinary(1.5, 4); }, "Invalid type. Can't print : 1.5 as bin. \n", "xxxx"},
      {[] { return toHex(static_cast<unsigned short>(9), 3); },
       "Invalid type. Can't print : 9 as hex. \n", "0xxxx"},
  };
  for (const Case& c : cases) {
    std::string text;
    EXPECT_EQ(stderrOf([&] { text = c.format(); }), c.line);
    EXPECT_EQ(text, c.text);
  }
}

TEST(KFileIOWriteVector, SoftValuesInEveryFormat) {
  // Values 5 and -5; widths dec 4, bin 8, hex 4; address 0x10 step 8.
  const std::pair<std::uint32_t, std::string> cases[] = {
      {kDumpDecimal, "   5\n  -5\n"},
      {kDumpBinary, "00000101  #  5\n11111011  #  -5\n"},
      {kDumpHex, "0x0005  #  5\n0xfffffffb  #  -5\n"},
      {kDumpAddressDecimal, "W 0x00000010  5\nW 0x00000018  -5\n"},
      {kDumpAddressBinary, "W 0x00000010  00000101  #  5\nW 0x00000018  11111011  #  -5\n"},
      {kDumpAddressHex, "W 0x00000010  0x0005  #  5\nW 0x00000018  0xfffffffb  #  -5\n"},
      {7, ""},
  };
  for (const auto& [mode, lines] : cases) {
    MemoryDump dump(mode, 4, 8, 4, 0x10, 8);
    ASSERT_TRUE(writeVector(dump.descriptor, std::vector<std::int32_t>{5, -5}, ""));
    EXPECT_EQ(dump.stream.str(), "[ length: 2]\n" + lines) << "mode " << mode;
  }
}

// Bit vectors print one bit, or two in mode 1; each comment line is framed in brackets.
TEST(KFileIOWriteVector, BitVectorsAndCommentLines) {
  const std::string zeros = repeat('0', 15);
  const std::pair<std::uint32_t, std::string> cases[] = {
      {kDumpDecimalTwoBits, "  0\n  1\n  3\n"},
      {kDumpBinary, zeros + "0  #  0\n" + zeros + "1  #  1\n" + zeros + "1  #  1\n"},
  };
  for (const auto& [mode, lines] : cases) {
    MemoryDump dump(mode, 3, 16, 8);
    ASSERT_TRUE(writeVector(dump.descriptor, std::vector<std::uint8_t>{0, 1, 3}, "OUT\n\nX\n"));
    EXPECT_EQ(dump.stream.str(), "[OUT]\n[]\n[X]\n[ length: 3]\n" + lines) << "mode " << mode;
  }
}

TEST(KFileIOWriteVector, RegisterWordsRestartTheirAddressEveryRecord) {
  MemoryDump dump(kDumpAddressBinary, 20, 32, 8, 0x2200, 4);
  const std::vector<std::uint64_t> words{5, 6};
  ASSERT_TRUE(writeVector(dump.descriptor, words, "CTRL"));
  ASSERT_TRUE(writeVector(dump.descriptor, words, "CTRL"));
  const std::string record = "[CTRL]\n[ length: 2]\n"
                             "W 0x00002200  " + repeat('0', 29) + "101  #  5\n"
                             "W 0x00002204  " + repeat('0', 29) + "110  #  6\n";
  EXPECT_EQ(dump.stream.str(), record + record);
}

TEST(KFileIOWriteVector, NothingIsWrittenWithoutAnOpenGoodStream) {
  std::ofstream unopened;
  std::ostringstream broken;
  broken.setstate(std::ios::badbit);
  for (std::ostream* file : {static_cast<std::ostream*>(nullptr),
                             static_cast<std::ostream*>(&unopened),
                             static_cast<std::ostream*>(&broken)}) {
    DumpDescriptor descriptor;
    descriptor.setFile(file);
    descriptor.setMode(kDumpBinary);
    EXPECT_FALSE(writeVector(descriptor, std::vector<std::uint8_t>{1}, "C"));
    EXPECT_FALSE(writeVector(descriptor, std::vector<std::int32_t>{1}, "C"));
    EXPECT_FALSE(writeVector(descriptor, std::vector<std::uint64_t>{1}, "C"));
    EXPECT_FALSE(writeArrays(descriptor, {1}, {2}, {3}, "C"));
    EXPECT_FALSE(writeArrays(descriptor, {1}, {2}, {3}, {4}, {5}, {6}, "C"));
  }
  EXPECT_TRUE(unopened.good());
  EXPECT_EQ(broken.str(), "");
}

TEST(KFileIOWriteArrays, ShortArrayShowsZeroBitsAndAnX) {
  MemoryDump dump(kDumpBinary, 20, 16, 8);
  ASSERT_TRUE(writeArrays(dump.descriptor, {1, 2, 3}, {-1, 0, 4}, {7, 8}, "d0 d1 d2"));
  const std::string zero = repeat('0', 16);
  EXPECT_EQ(dump.stream.str(),
            "[d0 d1 d2]\n"
            "[  Size of Array 1: 3 Size of Array 2: 3  Size of Array 3: 2]\n"
            "[ length: 3]\n" +
                repeat('0', 15) + "1" + repeat('1', 16) + repeat('0', 13) + "111  #  1  -1  7  \n" +
                repeat('0', 14) + "10" + zero + repeat('0', 12) + "1000  #  2  0  8  \n" +
                repeat('0', 14) + "11" + repeat('0', 13) + "100" + zero + "  #  3  4  X  \n");
}

TEST(KFileIOWriteArrays, ThreeArraysInOtherFormatsAndSixArrays) {
  // Arrays {1, -2}, {3}, {} with widths dec 3, bin 4, hex 2; address 0x40 step 4.
  const std::pair<std::uint32_t, std::string> cases[] = {
      {kDumpDecimal, "  1    3    X  \n -2    X    X  \n"},
      {kDumpDecimalTwoBits, ""},
      {kDumpHex, "0x010x030x00  #  1  3  X  \n0xfffffffe0x000x00  #  -2  X  X  \n"},
      {kDumpAddressBinary,
       "W 0x00000040  000100110000  #  1  3  X  \nW 0x00000044  111000000000  #  -2  X  X  \n"},
  };
  for (const auto& [mode, lines] : cases) {
    MemoryDump dump(mode, 3, 4, 2, 0x40, 4);
    ASSERT_TRUE(writeArrays(dump.descriptor, {1, -2}, {3}, {}, ""));
    EXPECT_EQ(dump.stream.str(),
              "[  Size of Array 1: 2 Size of Array 2: 1  Size of Array 3: 0]\n[ length: 2]\n" +
                  lines)
        << "mode " << mode;
  }
  MemoryDump dump(kDumpBinary, 20, 2, 8);
  ASSERT_TRUE(writeArrays(dump.descriptor, {1}, {0, 3}, {}, {2}, {}, {1}, "TB"));
  EXPECT_EQ(dump.stream.str(),
            "[TB]\n"
            "[  Size of Array 1: 1 Size of Array 2: 2  Size of Array 3: 0  Size of Array 4: 1"
            "  Size of Array 5: 0  Size of Array 6: 1]\n"
            "[ length: 2]\n"
            "010000100001  #  1  0  X  2  X  1  \n"
            "001100000000  #  X  3  X  X  X  X  \n");
}

TEST(KFileIOOpen, NameIsPrefixPieceAndLogAndReopeningTruncatesOrAppends) {
  const std::filesystem::path directory =
      std::filesystem::path(testing::TempDir()) / "kfileio_open";
  std::filesystem::remove_all(directory);
  std::filesystem::create_directories(directory);
  const std::string prefix = (directory / "SCH_rx_").string();
  std::ofstream stream;
  DumpDescriptor descriptor(nullptr, kDumpAddressBinary, 0x2234, 4, 20, 32, 8);
  descriptor.setFile(&stream);
  const auto write = [&](const char* comment) {
    ASSERT_TRUE(writeVector(descriptor, std::vector<std::uint64_t>{1}, comment));
  };
  const std::string line = "[ length: 1]\nW 0x00002234  " + repeat('0', 31) + "1  #  1\n";
  ASSERT_TRUE(openOutputFile(stream, prefix, "CTRL", false));
  write("CTRL");
  write("CTRL");
  // Opening again under the same name starts the file afresh; with append it grows.
  ASSERT_TRUE(openOutputFile(stream, prefix, "CTRL", false));
  write("CTRL");
  ASSERT_TRUE(openOutputFile(stream, prefix, "CTRL", true));
  write("CTRL");
  // A new name closes the old file, which keeps what it received.
  ASSERT_TRUE(openOutputFile(stream, prefix, "STATUS", false));
  write("");
  stream.close();
  EXPECT_EQ(readFile(directory / "SCH_rx_CTRL.log"), "[CTRL]\n" + line + "[CTRL]\n" + line);
  EXPECT_EQ(readFile(directory / "SCH_rx_STATUS.log"), line);

  const std::string missing = (directory / "absent" / "CCH_rx_").string();
  EXPECT_EQ(stderrOf([&] { EXPECT_FALSE(openOutputFile(stream, missing, "Ctrl_Out", false)); }),
            "ERROR:Could not open output file '" + missing + "Ctrl_Out.log'\n");
  EXPECT_FALSE(writeVector(descriptor, std::vector<std::int32_t>{1}, "CTRL"));
  EXPECT_FALSE(std::filesystem::exists(directory / "absent"));
  std::filesystem::remove_all(directory);
}

}  // namespace
}  // namespace brannoc
