// Tests of the debug-dump descriptor, value formatters, record writers and dump-file opener.
#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <sstream>
#include <string>
#include <vector>

#include "DecoderTestSupport.h"
#include "KFileIO.h"

namespace brannoc {
namespace {

using test::fileText;
using test::stderrOf;

std::string repeat(char c, std::size_t n) { return std::string(n, c); }

TEST(DumpDescriptor, WidthSettersRefuseOutsideTheirRangeAndKeepTheOldWidth) {
  const auto refusal = [](std::uint32_t width, std::uint32_t old, const char* range) {
    return "Invalid Witdh: " + std::to_string(width) + ". Value " + std::to_string(old) +
           " is unchanged. Width must be in " + range + "\n";
  };
  struct Case {
    bool (DumpDescriptor::*set)(std::uint32_t);
    std::uint32_t (DumpDescriptor::*get)() const;
    std::uint32_t value;
    std::string line;  // empty when accepted
  };
  const Case cases[] = {
      {&DumpDescriptor::setDecWidth, &DumpDescriptor::getDecWidth, 33, refusal(33, 20, "[1,32]")},
      {&DumpDescriptor::setDecWidth, &DumpDescriptor::getDecWidth, 32, ""},
      {&DumpDescriptor::setBinWidth, &DumpDescriptor::getBinWidth, 40, refusal(40, 16, "[1,39]")},
      {&DumpDescriptor::setBinWidth, &DumpDescriptor::getBinWidth, 39, ""},
      {&DumpDescriptor::setHexWidth, &DumpDescriptor::getHexWidth, 15, refusal(15, 8, "[1,15)")},
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
            refusal(0, 32, "[1,32]") + refusal(40, 32, "[1,39]") + refusal(15, 12, "[1,15)"));
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

TEST(KFileIOWriteVector, NothingIsWrittenWithoutAnOpenGoodStream) {
  std::ofstream unopened;
  std::ostringstream broken;
  broken.setstate(std::ios::badbit);
  for (std::ostream* file :
       {static_cast<std::ostream*>(nullptr), static_cast<std::ostream*>(&unopened),
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

// Each writer in the formats it offers. Vector records: soft values 5 and -5 (widths dec 4,
// bin 8, hex 4; address 0x10 step 8; mode 7 prints no lines), bits in one or (mode 1) two
// digits with comment lines framed in brackets, register words whose address restarts every
// record. Array records: side by side, a short array shows zero bits and an X, mode 1 prints
// no lines.
TEST(KFileIOWrite, RecordsInEveryFormat) {
  using Write = std::function<bool(DumpDescriptor&)>;
  const Write soft = [](DumpDescriptor& d) {
    return writeVector(d, std::vector<std::int32_t>{5, -5}, "");
  };
  const Write bits = [](DumpDescriptor& d) {
    return writeVector(d, std::vector<std::uint8_t>{0, 1, 3}, "OUT\n\nX\n");
  };
  const Write words = [](DumpDescriptor& d) {
    return writeVector(d, std::vector<std::uint64_t>{5, 6}, "CTRL") &&
           writeVector(d, std::vector<std::uint64_t>{5, 6}, "CTRL");
  };
  const Write three = [](DumpDescriptor& d) { return writeArrays(d, {1, -2}, {3}, {}, ""); };
  const std::string z15 = repeat('0', 15), z16 = repeat('0', 16), z29 = repeat('0', 29);
  const std::string word = "[CTRL]\n[ length: 2]\nW 0x00002200  " + z29 +
                           "101  #  5\nW 0x00002204  " + z29 + "110  #  6\n";
  const std::string sizes = "[  Size of Array 1: 2 Size of Array 2: 1  Size of Array 3: 0]\n";
  struct Case {
    std::uint32_t mode, decWidth, binWidth, hexWidth, address, step;
    Write write;
    std::string text;
  };
  const Case cases[] = {
      {kDumpDecimal, 4, 8, 4, 0x10, 8, soft, "[ length: 2]\n   5\n  -5\n"},
      {kDumpBinary, 4, 8, 4, 0x10, 8, soft, "[ length: 2]\n00000101  #  5\n11111011  #  -5\n"},
      {kDumpHex, 4, 8, 4, 0x10, 8, soft, "[ length: 2]\n0x0005  #  5\n0xfffffffb  #  -5\n"},
      {kDumpAddressDecimal, 4, 8, 4, 0x10, 8, soft,
       "[ length: 2]\nW 0x00000010  5\nW 0x00000018  -5\n"},
      {kDumpAddressBinary, 4, 8, 4, 0x10, 8, soft,
       "[ length: 2]\nW 0x00000010  00000101  #  5\nW 0x00000018  11111011  #  -5\n"},
      {kDumpAddressHex, 4, 8, 4, 0x10, 8, soft,
       "[ length: 2]\nW 0x00000010  0x0005  #  5\nW 0x00000018  0xfffffffb  #  -5\n"},
      {7, 4, 8, 4, 0x10, 8, soft, "[ length: 2]\n"},
      {kDumpDecimalTwoBits, 3, 16, 8, 0, 4, bits, "[OUT]\n[]\n[X]\n[ length: 3]\n  0\n  1\n  3\n"},
      {kDumpBinary, 3, 16, 8, 0, 4, bits,
       "[OUT]\n[]\n[X]\n[ length: 3]\n" + z15 + "0  #  0\n" + z15 + "1  #  1\n" + z15 +
           "1  #  1\n"},
      {kDumpAddressBinary, 20, 32, 8, 0x2200, 4, words, word + word},
      {kDumpBinary, 20, 16, 8, 0, 4,
       [](DumpDescriptor& d) {
         return writeArrays(d, {1, 2, 3}, {-1, 0, 4}, {7, 8}, "d0 d1 d2");
       },
       "[d0 d1 d2]\n[  Size of Array 1: 3 Size of Array 2: 3  Size of Array 3: 2]\n[ length: 3]\n" +
           z15 + "1" + repeat('1', 16) + repeat('0', 13) + "111  #  1  -1  7  \n" +
           repeat('0', 14) + "10" + z16 + repeat('0', 12) + "1000  #  2  0  8  \n" +
           repeat('0', 14) + "11" + repeat('0', 13) + "100" + z16 + "  #  3  4  X  \n"},
      {kDumpDecimal, 3, 4, 2, 0x40, 4, three,
       sizes + "[ length: 2]\n  1    3    X  \n -2    X    X  \n"},
      {kDumpDecimalTwoBits, 3, 4, 2, 0x40, 4, three, sizes + "[ length: 2]\n"},
      {kDumpHex, 3, 4, 2, 0x40, 4, three,
       sizes + "[ length: 2]\n0x010x030x00  #  1  3  X  \n0xfffffffe0x000x00  #  -2  X  X  \n"},
      {kDumpAddressBinary, 3, 4, 2, 0x40, 4, three,
       sizes + "[ length: 2]\nW 0x00000040  000100110000  #  1  3  X  \n"
               "W 0x00000044  111000000000  #  -2  X  X  \n"},
      {kDumpBinary, 20, 2, 8, 0, 4,
       [](DumpDescriptor& d) {
         return writeArrays(d, {1}, {0, 3}, {}, {2}, {}, {1}, "TB");
       },
       "[TB]\n[  Size of Array 1: 1 Size of Array 2: 2  Size of Array 3: 0  Size of Array 4: 1"
       "  Size of Array 5: 0  Size of Array 6: 1]\n[ length: 2]\n"
       "010000100001  #  1  0  X  2  X  1  \n001100000000  #  X  3  X  X  X  X  \n"},
  };
  for (std::size_t i = 0; i < std::size(cases); ++i) {
    const Case& c = cases[i];
    std::ostringstream stream;
    DumpDescriptor descriptor(&stream, c.mode, c.address, c.step, c.decWidth, c.binWidth,
                              c.hexWidth);
    ASSERT_TRUE(c.write(descriptor)) << "case " << i;
    EXPECT_EQ(stream.str(), c.text) << "case " << i << ", mode " << c.mode;
  }
}

TEST(KFileIOOpen, NameIsPrefixPieceAndLogAndReopeningTruncatesOrAppends) {
  const test::ScratchDir scratch;
  const std::filesystem::path& directory = scratch.path();
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
  EXPECT_EQ(fileText(directory / "SCH_rx_CTRL.log"), "[CTRL]\n" + line + "[CTRL]\n" + line);
  EXPECT_EQ(fileText(directory / "SCH_rx_STATUS.log"), line);

  const std::string missing = (directory / "absent" / "CCH_rx_").string();
  EXPECT_EQ(stderrOf([&] { EXPECT_FALSE(openOutputFile(stream, missing, "Ctrl_Out", false)); }),
            "ERROR:Could not open output file '" + missing + "Ctrl_Out.log'\n");
  EXPECT_FALSE(writeVector(descriptor, std::vector<std::int32_t>{1}, "CTRL"));
  EXPECT_FALSE(std::filesystem::exists(directory / "absent"));
}

}  // namespace
}  // namespace brannoc
