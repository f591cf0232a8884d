// Tests of the debug-dump descriptor, value formatters, record writers and dump-file opener.
#include "KFileIO.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
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

// A descriptor writing into an in-memory stream.
struct MemoryDump {
  std::ostringstream stream;
  DumpDescriptor descriptor;
  MemoryDump(std::uint32_t mode, std::uint32_t decWidth, std::uint32_t binWidth,
             std::uint32_t hexWidth, std::uint32_t address = 0, std::uint32_t step = 4)
      : descriptor(&stream, mode, address, step, decWidth, binWidth, hexWidth) {}
};

TEST(DumpDescriptor, WidthSettersAcceptTheirRangeAndRefuseOutsideIt) {
  using Setter = bool (DumpDescriptor::*)(std::uint32_t);
  using Getter = std::uint32_t (DumpDescriptor::*)() const;
  struct Case {
    Setter set;
    Getter get;
    std::uint32_t value;
    std::string line;  // empty when accepted
  };
  const std::string kept = " is unchanged. Width must be in ";
  const Setter dec = &DumpDescriptor::setDecWidth, bin = &DumpDescriptor::setBinWidth,
               hex = &DumpDescriptor::setHexWidth;
  const Getter decW = &DumpDescriptor::getDecWidth, binW = &DumpDescriptor::getBinWidth,
               hexW = &DumpDescriptor::getHexWidth;
  const Case cases[] = {
      {dec, decW, 0, "Invalid Witdh: 0. Value 20" + kept + "[1,32]\n"},
      {dec, decW, 33, "Invalid Witdh: 33. Value 20" + kept + "[1,32]\n"},
      {dec, decW, 1, ""},
      {dec, decW, 32, ""},
      {bin, binW, 0, "Invalid Witdh: 0. Value 16" + kept + "[1,39]\n"},
      {bin, binW, 40, "Invalid Witdh: 40. Value 16" + kept + "[1,39]\n"},
      {bin, binW, 39, ""},
      {hex, hexW, 0, "Invalid Witdh: 0. Value 8" + kept + "[1,15)\n"},
      {hex, hexW, 15, "Invalid Witdh: 15. Value 8" + kept + "[1,15)\n"},
      {hex, hexW, 14, ""},
  };
  for (const Case& c : cases) {
    DumpDescriptor descriptor;  // the decoders' descriptor: widths 20, 16, 8
    const std::uint32_t old = (descriptor.*c.get)();
    testing::internal::CaptureStderr();
    const bool accepted = (descriptor.*c.set)(c.value);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), c.line) << c.value;
    EXPECT_EQ(accepted, c.line.empty()) << c.value;
    EXPECT_EQ((descriptor.*c.get)(), accepted ? c.value : old) << c.value;
  }
}

TEST(DumpDescriptor, ConstructorRefusalKeepsTheFirstWidths) {
  testing::internal::CaptureStderr();
  const DumpDescriptor descriptor(nullptr, 0, 0, 4, 0, 40, 15);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "Invalid Witdh: 0. Value 32 is unchanged. Width must be in [1,32]\n"
            "Invalid Witdh: 40. Value 32 is unchanged. Width must be in [1,39]\n"
            "Invalid Witdh: 15. Value 12 is unchanged. Width must be in [1,15)\n");
  EXPECT_EQ(descriptor.getDecWidth(), 32u);
  EXPECT_EQ(descriptor.getBinWidth(), 32u);
  EXPECT_EQ(descriptor.getHexWidth(), 12u);
}

TEST(KFileIOFormat, BinaryTextIsTheLowWidthBitsOfTheTwosComplement) {
  struct Case {
    std::string text;
    std::string expected;
  };
  const Case cases[] = {
      {toBinary(-5, 16), "1111111111111011"},
      {toBinary(-1, 16), repeat('1', 16)},
      {toBinary(std::uint64_t{5}, 32), repeat('0', 29) + "101"},
      {toBinary(std::int64_t{-1}, 40), repeat('1', 40)},
      {toBinary(static_cast<short>(-2), 20), repeat('1', 19) + "0"},
      {toBinary(0xffffffffu, 40), repeat('0', 8) + repeat('1', 32)},
      {toBinary(0x1234L, 4), "0100"},
      {toBinary(0xf0UL, 8), "11110000"},
      {toBinary(-3LL, 3), "101"},
      {toBinary(6ULL, 3), "110"},
      // Bit types print 0 or 1 whatever the stored value.
      {toBinary(std::uint8_t{1}, 16), repeat('0', 15) + "1"},
      {toBinary(std::uint8_t{6}, 4), "0001"},
      {toBinary(true, 3), "001"},
      {toBinary('a', 2), "01"},
      {toBinary(7, 0), ""},
  };
  for (std::size_t i = 0; i < std::size(cases); ++i) {
    EXPECT_EQ(cases[i].text, cases[i].expected) << "case " << i;
  }
}

TEST(KFileIOFormat, HexTextIsPaddedLowercaseAndNegativesUseTheTypesWidth) {
  struct Case {
    std::string text;
    std::string expected;
  };
  const Case cases[] = {
      {toHex(0x2200u, 8), "0x00002200"},
      {toHex(0xabcdef, 2), "0xabcdef"},
      {toHex(-1, 8), "0xffffffff"},
      {toHex(-1, 4), "0xffffffff"},
      {toHex(static_cast<short>(-1), 8), "0x0000ffff"},
      {toHex(std::int64_t{-2}, 1), "0xfffffffffffffffe"},
      {toHex(std::uint64_t{0}, 3), "0x000"},
      {toHex(std::uint8_t{200}, 2), "0x01"},
      {toHex(false, 1), "0x0"},
  };
  for (std::size_t i = 0; i < std::size(cases); ++i) {
    EXPECT_EQ(cases[i].text, cases[i].expected) << "case " << i;
  }
}

TEST(KFileIOFormat, OversizedWidthsWarnAndAreCut) {
  testing::internal::CaptureStderr();
  const std::string binary = toBinary(1, 41);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "File: KFileIO(177)  Passing width larger than 40. Setting to 40\n");
  EXPECT_EQ(binary, repeat('0', 39) + "1");

  testing::internal::CaptureStderr();
  const std::string hex = toHex(1, 16);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "File: KFileIO(121)  Passing width larger than 15. Setting to 15\n");
  EXPECT_EQ(hex, "0x" + repeat('0', 14) + "1");
}

TEST(KFileIOFormat, UnsupportedTypesPrintTheirValueAndGiveCrosses) {
  testing::internal::CaptureStderr();
  const std::string binary = toBinary(1.5, 4);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "Invalid type. Can't print : 1.5 as bin. \n");
  EXPECT_EQ(binary, "xxxx");

  testing::internal::CaptureStderr();
  const std::string hex = toHex(static_cast<unsigned short>(9), 3);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "Invalid type. Can't print : 9 as hex. \n");
  EXPECT_EQ(hex, "0xxxx");
}

TEST(KFileIOWriteVector, SoftValuesInEveryFormat) {
  struct Case {
    std::uint32_t mode;
    std::string lines;
  };
  // Values 5 and -5; widths dec 4, bin 8, hex 4; address 0x10 step 8.
  const Case cases[] = {
      {kDumpDecimal, "   5\n  -5\n"},
      {kDumpDecimalTwoBits, "   5\n  -5\n"},
      {kDumpBinary, "00000101  #  5\n11111011  #  -5\n"},
      {kDumpHex, "0x0005  #  5\n0xfffffffb  #  -5\n"},
      {kDumpAddressDecimal, "W 0x00000010  5\nW 0x00000018  -5\n"},
      {kDumpAddressBinary, "W 0x00000010  00000101  #  5\nW 0x00000018  11111011  #  -5\n"},
      {kDumpAddressHex, "W 0x00000010  0x0005  #  5\nW 0x00000018  0xfffffffb  #  -5\n"},
      {7, ""},
  };
  for (const Case& c : cases) {
    MemoryDump dump(c.mode, 4, 8, 4, 0x10, 8);
    ASSERT_TRUE(writeVector(dump.descriptor, std::vector<std::int32_t>{5, -5}, ""));
    EXPECT_EQ(dump.stream.str(), "[ length: 2]\n" + c.lines) << "mode " << c.mode;
  }
}

TEST(KFileIOWriteVector, BitVectorsPrintOneBitOrTwoInFormat1) {
  struct Case {
    std::uint32_t mode;
    std::string lines;
  };
  const std::string zeros = repeat('0', 15);
  const Case cases[] = {
      {kDumpDecimal, "  0\n  1\n  1\n"},
      {kDumpDecimalTwoBits, "  0\n  1\n  3\n"},
      {kDumpBinary, zeros + "0  #  0\n" + zeros + "1  #  1\n" + zeros + "1  #  1\n"},
      {kDumpAddressDecimal, "W 0x00000000  0\nW 0x00000004  1\nW 0x00000008  1\n"},
  };
  for (const Case& c : cases) {
    MemoryDump dump(c.mode, 3, 16, 8);
    ASSERT_TRUE(writeVector(dump.descriptor, std::vector<std::uint8_t>{0, 1, 3}, "OUTPUT"));
    EXPECT_EQ(dump.stream.str(), "[OUTPUT]\n[ length: 3]\n" + c.lines) << "mode " << c.mode;
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
  EXPECT_EQ(dump.descriptor.getAddress(), 0x2200u);
}

TEST(KFileIOWriteVector, CommentFraming) {
  struct Case {
    std::string comment;
    std::string framed;
  };
  const Case cases[] = {
      {"", ""},
      {"CTRL", "[CTRL]\n"},
      {"first\nsecond", "[first]\n[second]\n"},
      {"first\n\nthird\n", "[first]\n[]\n[third]\n"},
  };
  for (const Case& c : cases) {
    MemoryDump dump(kDumpDecimal, 20, 16, 8);
    ASSERT_TRUE(writeVector(dump.descriptor, std::vector<std::int32_t>{}, c.comment));
    EXPECT_EQ(dump.stream.str(), c.framed + "[ length: 0]\n") << c.comment;
  }
}

TEST(KFileIOWriteVector, NothingIsWrittenWithoutAnOpenStream) {
  std::ofstream unopened;
  for (std::ostream* file : {static_cast<std::ostream*>(nullptr),
                             static_cast<std::ostream*>(&unopened)}) {
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
}

TEST(KFileIOWriteVector, AFailingStreamIsReportedAsNotWritten) {
  std::ostringstream broken;
  broken.setstate(std::ios::badbit);
  DumpDescriptor descriptor;
  descriptor.setFile(&broken);
  EXPECT_FALSE(writeVector(descriptor, std::vector<std::int32_t>{1}, "C"));
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

TEST(KFileIOWriteArrays, ThreeArraysInEveryFormat) {
  struct Case {
    std::uint32_t mode;
    std::string lines;
  };
  // Arrays {1, -2}, {3}, {} with widths dec 3, bin 4, hex 2; address 0x40 step 4.
  const Case cases[] = {
      {kDumpDecimal, "  1    3    X  \n -2    X    X  \n"},
      {kDumpDecimalTwoBits, ""},
      {kDumpBinary, "000100110000  #  1  3  X  \n111000000000  #  -2  X  X  \n"},
      {kDumpHex, "0x010x030x00  #  1  3  X  \n0xfffffffe0x000x00  #  -2  X  X  \n"},
      {kDumpAddressDecimal, "W 0x00000040  1  3  X  \nW 0x00000044  -2  X  X  \n"},
      {kDumpAddressBinary,
       "W 0x00000040  000100110000  #  1  3  X  \nW 0x00000044  111000000000  #  -2  X  X  \n"},
      {kDumpAddressHex,
       "W 0x00000040  0x010x030x00  #  1  3  X  \n"
       "W 0x00000044  0xfffffffe0x000x00  #  -2  X  X  \n"},
  };
  for (const Case& c : cases) {
    MemoryDump dump(c.mode, 3, 4, 2, 0x40, 4);
    ASSERT_TRUE(writeArrays(dump.descriptor, {1, -2}, {3}, {}, ""));
    EXPECT_EQ(dump.stream.str(),
              "[  Size of Array 1: 2 Size of Array 2: 1  Size of Array 3: 0]\n[ length: 2]\n" +
                  c.lines)
        << "mode " << c.mode;
  }
}

TEST(KFileIOWriteArrays, SixArraysSizeLine) {
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

class KFileIOOpen : public testing::Test {
 protected:
  void SetUp() override {
    const auto* info = testing::UnitTest::GetInstance()->current_test_info();
    directory = std::filesystem::path(testing::TempDir()) /
                (std::string("kfileio_") + info->name());
    std::filesystem::remove_all(directory);
    std::filesystem::create_directories(directory);
    prefix = (directory / "SCH_rx_").string();
  }
  void TearDown() override { std::filesystem::remove_all(directory); }

  std::filesystem::path directory;
  std::string prefix;
};

TEST_F(KFileIOOpen, NameIsPrefixPieceAndLogAndReopeningTruncatesOrAppends) {
  std::ofstream stream;
  ASSERT_TRUE(openOutputFile(stream, prefix, "CTRL", false));
  DumpDescriptor descriptor(nullptr, kDumpAddressBinary, 0x2234, 4, 20, 32, 8);
  descriptor.setFile(&stream);
  ASSERT_TRUE(writeVector(descriptor, std::vector<std::uint64_t>{1}, "CTRL"));
  ASSERT_TRUE(writeVector(descriptor, std::vector<std::uint64_t>{1}, "CTRL"));
  stream.flush();
  const std::string record = "[CTRL]\n[ length: 1]\nW 0x00002234  " + repeat('0', 31) + "1  #  1\n";
  EXPECT_EQ(readFile(directory / "SCH_rx_CTRL.log"), record + record);

  // Opening again under the same name starts the file afresh; with append it grows.
  ASSERT_TRUE(openOutputFile(stream, prefix, "CTRL", false));
  ASSERT_TRUE(writeVector(descriptor, std::vector<std::uint64_t>{1}, "CTRL"));
  ASSERT_TRUE(openOutputFile(stream, prefix, "CTRL", true));
  ASSERT_TRUE(writeVector(descriptor, std::vector<std::uint64_t>{1}, "CTRL"));
  // A new name closes the old file, which keeps what it received.
  ASSERT_TRUE(openOutputFile(stream, prefix, "STATUS", false));
  ASSERT_TRUE(writeVector(descriptor, std::vector<std::uint64_t>{1}, ""));
  stream.close();
  EXPECT_EQ(readFile(directory / "SCH_rx_CTRL.log"), record + record);
  EXPECT_EQ(readFile(directory / "SCH_rx_STATUS.log"),
            "[ length: 1]\nW 0x00002234  " + repeat('0', 31) + "1  #  1\n");
}

TEST_F(KFileIOOpen, MissingDirectoryFailsWithItsLineAndWritesNothing) {
  std::ofstream stream;
  const std::string missing = (directory / "absent" / "CCH_rx_").string();
  testing::internal::CaptureStderr();
  EXPECT_FALSE(openOutputFile(stream, missing, "Ctrl_Out", false));
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "ERROR:Could not open output file '" + missing + "Ctrl_Out.log'\n");
  DumpDescriptor descriptor;
  descriptor.setFile(&stream);
  EXPECT_FALSE(writeVector(descriptor, std::vector<std::int32_t>{1}, "CTRL"));
  EXPECT_FALSE(std::filesystem::exists(directory / "absent"));
}

}  // namespace
}  // namespace brannoc
