// Vector files: what the writer writes reads back, the fields land in their records, and
// every kind of malformed line is reported with its file, line and what was expected.
#include <gtest/gtest.h>

#include <string>

#include "vectors/VectorFile.h"

namespace brannoc::vectors {
namespace {

const std::string kPucch =
    "brannoc-vector 1\n"
    "channel pucch\n"
    "C_NUM_PU 2\n"
    "C_ALGORITHM_TYPE 1\n"
    "C_INTERLEAVER_BUFFER_SIZE 36864\n"
    "C_NUM_CQI_PU 1\n"
    "CCH_UCI_OP_SIZE 4\n"
    "CCH_CP 0\n"
    "CCH_ACK_OP_SIZE 0\n"
    "CCH_USER_ID 7\n"
    "CCH_TAG 0\n"
    "llr 4  # soft values\n"
    "1 -2\n"
    "\t3 -4\r\n"
    "expect.CCH_data_out 4\n"
    "0110\n";

TEST(VectorFile, FieldsLandInTheirRecords) {
  Vector v;
  ASSERT_EQ(parseVector(kPucch, "p.vec", v), "");
  EXPECT_EQ(v.channel, Channel::Control);
  EXPECT_EQ(v.generics.C_INTERLEAVER_BUFFER_SIZE, 36864u);
  EXPECT_EQ(v.control.control.CCH_UCI_OP_SIZE, 4u);
  EXPECT_EQ(v.control.control.CCH_USER_ID, 7u);
  EXPECT_EQ(v.control.llr, (SoftValues{1, -2, 3, -4}));
  EXPECT_EQ(v.control.cqi, (Bits{0, 1, 1, 0}));
  EXPECT_FALSE(v.control.ack.has_value());
}

// A retransmission with HARQ inputs and every expectation reads back as written; every cut
// of it reads (a cut before the optional arrays) or is refused with a message.
TEST(VectorFile, WrittenFilesReadBackAndCutsAreRefused) {
  Vector v;
  v.generics = {4, 2, 18432, 3};
  v.shared.control.SCH_TBSIZE = 40;
  v.shared.control.SCH_TAG = 0xFFFFFFFF;
  v.shared.maxHarqBufferSize = 3;
  v.shared.llr.assign(40, -128);
  v.shared.harq = {SoftValues{1, 2, 3}, SoftValues{-1, -2, -3},
                   SoftValues{127, 0, -2147483647 - 1}};
  v.shared.data = Bits(70, 1);
  v.shared.cqi = Bits{};
  v.shared.ri = Bits{1, 0};
  const std::string text = formatVector(v);
  Vector back;
  ASSERT_EQ(parseVector(text, "s.vec", back), "");
  EXPECT_EQ(formatVector(back), text);
  EXPECT_EQ(back.shared.harq[2][2], -2147483647 - 1);
  EXPECT_FALSE(back.shared.ack.has_value());
  for (std::size_t cut = 0; cut + 1 < text.size(); ++cut) {
    const std::string error = parseVector(text.substr(0, cut), "s.vec", back);
    EXPECT_TRUE(error.empty() || error.rfind("s.vec:", 0) == 0) << cut << ": " << error;
  }
}

TEST(VectorFile, MalformedLinesNameTheLineAndWhatWasExpected) {
  const struct {
    std::string from, to, message;
  } cases[] = {
      {"brannoc-vector 1", "brannoc-vector 2", "1: expected the first line 'brannoc-vector 1'"},
      {"channel pucch", "channel pdsch", "2: expected 'channel pusch' or 'channel pucch'"},
      {"CCH_CP 0", "CCH_CP x", "8: expected an unsigned 32-bit value after 'CCH_CP', found 'x'"},
      {"CCH_CP 0", "CCH_CP", "8: expected an unsigned 32-bit value after 'CCH_CP'"},
      {"CCH_CP 0", "CCH_CP 0 1", "8: expected the end of the line after 'CCH_CP 0', found '1'"},
      {"CCH_CP 0", "CCH_CP 4294967296",
       "8: expected an unsigned 32-bit value after 'CCH_CP', found '4294967296'"},
      {"CCH_CP 0", "SCH_CP 0", "8: expected a field name of a pucch vector, found 'SCH_CP'"},
      {"CCH_TAG 0", "CCH_CP 1", "11: 'CCH_CP' given a second time (first on line 8)"},
      {"CCH_TAG 0\n", "",
       "15: expected 'CCH_TAG' before the end of the file (a pucch vector gives every field)"},
      {"llr 4", "llr 4000000000",
       "12: expected at most 1048576 values of 'llr', found a count of 4000000000"},
      {"1 -2", "1 99999999999",
       "13: expected 3 more signed 32-bit soft values of 'llr' (4 in all), found '99999999999'"},
      {"3 -4", "3",
       "15: expected 1 more signed 32-bit soft values of 'llr' (4 in all), found "
       "'expect.CCH_data_out'"},
      {"3 -4", "3 -4 5", "14: expected no more soft values of 'llr' (4 in all), found '5'"},
      {"0110", "0120",
       "16: expected 2 more bits of 'expect.CCH_data_out' (4 in all), found '0120'"},
      {"0110", "01101",
       "16: expected no more bits of 'expect.CCH_data_out' (4 in all), found '01101'"},
      {"0110", "011",
       "16: expected 1 more values of 'expect.CCH_data_out' before the end of the file"},
  };
  for (const auto& c : cases) {
    std::string text = kPucch;
    text.replace(text.find(c.from), c.from.size(), c.to);
    Vector v;
    EXPECT_EQ(parseVector(text, "p.vec", v), "p.vec:" + c.message) << c.from << " -> " << c.to;
  }
  Vector v;
  EXPECT_EQ(parseVector("", "e.vec", v), "e.vec:1: expected the first line 'brannoc-vector 1'");
  EXPECT_EQ(readVectorFile("no/such.vec", v).rfind("no/such.vec: cannot be read", 0), 0u);
}

}  // namespace
}  // namespace brannoc::vectors
