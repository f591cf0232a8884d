// The C layer of the DPI-C bridge driven from C++ (in the sanitizer build too): a PUSCH
// retransmission chain and a PUCCH call pushed and read value by value, and every refusal:
// null handles, refused generics, out-of-range indices, more values than a call can take.
#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "tx/PucchTransmitter.h"
#include "tx/PuschTransmitter.h"

extern "C" {
void* brannoc_dpi_create(int, int, int, int);
void brannoc_dpi_destroy(void*);
int brannoc_dpi_set_dump(void*, int, int, const char*);
void brannoc_dpi_sch_begin(void*);
void brannoc_dpi_sch_set_field(void*, int, unsigned);
void brannoc_dpi_sch_push_llr(void*, int);
void brannoc_dpi_sch_push_harq(void*, int, int);
void brannoc_dpi_sch_keep_harq(void*);
int brannoc_dpi_sch_run(void*);
int brannoc_dpi_sch_size(void*, int);
int brannoc_dpi_sch_bit(void*, int, int);
int brannoc_dpi_sch_harq(void*, int, int);
unsigned brannoc_dpi_sch_flag(void*, int);
void brannoc_dpi_cch_begin(void*);
void brannoc_dpi_cch_set_field(void*, int, unsigned);
void brannoc_dpi_cch_push_llr(void*, int);
int brannoc_dpi_cch_run(void*);
int brannoc_dpi_cch_size(void*, int);
int brannoc_dpi_cch_bit(void*, int, int);
}

namespace {

namespace tx = brannoc::tx;

std::vector<std::uint8_t> bitsOf(void* h, int which) {
  std::vector<std::uint8_t> bits;
  for (int i = 0; i < brannoc_dpi_sch_size(h, which); ++i)
    bits.push_back(brannoc_dpi_sch_bit(h, which, i));
  return bits;
}

TEST(DpiBridge, RetransmissionsKeepTheirHarqBuffersInTheHandle) {
  void* h = brannoc_dpi_create(2, 1, 36864, 1);
  ASSERT_NE(h, nullptr);
  const tx::Bits tb(1000, 1);
  tx::PuschParameters p;
  p.numPrb = 12;
  p.tbSize = 1000;
  p.cqiBits = 5;
  p.cqi.betaIndex = 8;
  tx::ChannelSettings channel;
  channel.mode = tx::ChannelMode::Awgn;
  channel.esN0Db = -1.0;
  for (std::uint32_t n = 0; n < 3; ++n) {
    p.rv = n == 0 ? 0 : 2;
    channel.seed = 10 + n;
    tx::PuschTransmission t;
    ASSERT_TRUE(tx::transmitPusch(p, {tb, {1, 0, 1, 1, 0}, {}, {}}, channel, t).ok());
    const tx::PuschControlFields& f = t.fields;
    const std::uint32_t fields[23] = {f.Qcqi,
                                      f.cqiBits,
                                      f.contentMask,
                                      0,
                                      0,
                                      0,
                                      0,
                                      f.Eidx,
                                      f.Rmux,
                                      f.cpIndex,
                                      f.Eminus,
                                      f.Eplus,
                                      f.tbSize,
                                      8,
                                      f.qamIndex,
                                      1,
                                      0,
                                      0,
                                      f.rv,
                                      n == 0 ? 1u : 0u,
                                      0,
                                      0,
                                      77};
    brannoc_dpi_sch_begin(h);
    for (int k = 0; k < 23; ++k) brannoc_dpi_sch_set_field(h, k, fields[k]);
    if (n > 0) brannoc_dpi_sch_keep_harq(h);  // what the last call returned
    for (const std::int32_t v : t.softValues) brannoc_dpi_sch_push_llr(h, v);
    ASSERT_EQ(brannoc_dpi_sch_run(h), 0) << "transmission " << n;
  }
  EXPECT_EQ(bitsOf(h, 0), tb);
  EXPECT_EQ(bitsOf(h, 1), (std::vector<std::uint8_t>{1, 0, 1, 1, 0}));
  EXPECT_EQ(brannoc_dpi_sch_flag(h, 0), 0u);
  EXPECT_EQ(brannoc_dpi_sch_flag(h, 4), 77u);
  EXPECT_EQ(brannoc_dpi_sch_size(h, 5), 1028);
  brannoc_dpi_destroy(h);
}

TEST(DpiBridge, RefusesNullHandlesBadIndicesAndOversizedCalls) {
  testing::internal::CaptureStderr();
  EXPECT_EQ(brannoc_dpi_create(3, 1, 36864, 1), nullptr);
  testing::internal::GetCapturedStderr();
  EXPECT_EQ(brannoc_dpi_sch_run(nullptr), 101);
  EXPECT_EQ(brannoc_dpi_cch_run(nullptr), 500);
  EXPECT_EQ(brannoc_dpi_set_dump(nullptr, 0, 0, "x"), 0);
  EXPECT_EQ(brannoc_dpi_sch_size(nullptr, 0), 0);
  brannoc_dpi_sch_push_llr(nullptr, 1);
  brannoc_dpi_sch_keep_harq(nullptr);
  brannoc_dpi_destroy(nullptr);

  void* h = brannoc_dpi_create(2, 1, 36864, 1);
  ASSERT_NE(h, nullptr);
  EXPECT_EQ(brannoc_dpi_set_dump(h, 33, 0, "x"), 0);
  brannoc_dpi_sch_set_field(h, 23, 5);  // no such field: ignored
  brannoc_dpi_sch_set_field(h, -1, 5);
  EXPECT_EQ(brannoc_dpi_sch_bit(h, 0, 5), 0);  // nothing decoded yet
  EXPECT_EQ(brannoc_dpi_sch_harq(h, 3, 0), 0);
  // A PUCCH call, then more soft values than any call takes: refused as uncacheable.
  tx::PucchTransmission t;
  ASSERT_TRUE(
      tx::transmitPucch(tx::Bits{1, 0, 1}, tx::Bits{1}, tx::CyclicPrefix::Normal, {}, t).ok());
  brannoc_dpi_cch_begin(h);
  const unsigned fields[5] = {3, 0, 1, 9, 4};
  for (int k = 0; k < 5; ++k) brannoc_dpi_cch_set_field(h, k, fields[k]);
  for (const std::int32_t v : t.softValues) brannoc_dpi_cch_push_llr(h, v);
  ASSERT_EQ(brannoc_dpi_cch_run(h), 0);
  EXPECT_EQ(brannoc_dpi_cch_size(h, 0), 3);
  EXPECT_EQ(brannoc_dpi_cch_bit(h, 1, 0), 1);
  EXPECT_EQ(brannoc_dpi_cch_bit(h, 1, 1), 0);  // beyond the ACK bits
  for (int i = 0; i < (1 << 20) + 1; ++i) brannoc_dpi_cch_push_llr(h, 0);
  EXPECT_EQ(brannoc_dpi_cch_run(h), 507);
  brannoc_dpi_sch_begin(h);
  for (int i = 0; i < (1 << 20) + 1; ++i) brannoc_dpi_sch_push_llr(h, 0);
  EXPECT_EQ(brannoc_dpi_sch_run(h), 164);
  brannoc_dpi_destroy(h);
}

}  // namespace
