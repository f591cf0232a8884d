// KTurboDecoderCModel: a code block of the transmitter decoded through the model library,
// the error lines of every failure, and the model re-created on each generics change.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "KTurboDecoderCModel.h"
#include "tx/TurboEncoder.h"

namespace {

using brannoc::KTurboDecoderCModel;

const std::string kPrefix = "File: ../s/KTurboDecoderCModel(";

std::vector<std::int32_t> softOf(const brannoc::tx::Bits& bits) {
  std::vector<std::int32_t> soft;
  for (std::uint8_t b : bits) soft.push_back(b != 0 ? 64 : -64);
  return soft;
}

struct Block {
  std::vector<std::uint8_t> c;
  std::vector<std::int32_t> sys, p1, p2;
};

Block encodedBlock(std::uint32_t K) {
  Block block;
  for (std::uint32_t k = 0; k < K; ++k) {
    block.c.push_back(static_cast<std::uint8_t>((k * 7 + k / 3) % 2));
  }
  brannoc::tx::TurboCodeword d;
  EXPECT_TRUE(brannoc::tx::turboEncode(block.c, d));
  block.sys = softOf(d.d0);
  block.p1 = softOf(d.d1);
  block.p2 = softOf(d.d2);
  return block;
}

TEST(KTurboDecoderCModel, FortyFourValueStreamsDecodeAFortyBitBlock) {
  testing::internal::CaptureStderr();
  KTurboDecoderCModel adapter;
  const Block block = encodedBlock(40);
  ASSERT_EQ(block.sys.size(), 44u);
  std::vector<std::uint8_t> out;
  EXPECT_TRUE(adapter.decode(block.sys, block.p1, block.p2, out, 4));
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
  EXPECT_EQ(out, block.c);
}

TEST(KTurboDecoderCModel, LargestBlockWithEveryAlgorithmAndUnitCount) {
  KTurboDecoderCModel adapter;
  const Block block = encodedBlock(6144);
  for (std::uint32_t P : {1u, 2u, 4u, 8u}) {
    for (std::uint32_t type : {0u, 1u, 2u}) {
      ASSERT_TRUE(adapter.setNumPU(P));
      ASSERT_TRUE(adapter.setAlgorithmType(type));
      EXPECT_EQ(adapter.getGenerics().processing_units, P);
      EXPECT_EQ(adapter.getGenerics().algorithm, type);
      std::vector<std::uint8_t> out;
      ASSERT_TRUE(adapter.decode(block.sys, block.p1, block.p2, out, 1));
      EXPECT_EQ(out, block.c) << "P " << P << ", algorithm " << type;
    }
  }
}

TEST(KTurboDecoderCModel, StreamsOfDifferentLengthsAreRefused) {
  KTurboDecoderCModel adapter;
  const Block block = encodedBlock(40);
  std::vector<std::int32_t> shorter = block.p2;
  shorter.pop_back();
  const std::string line =
      kPrefix + "151)ERROR:KTurboDecoderCModel:LLRs should all be the same size\n";
  for (int which = 0; which < 2; ++which) {
    std::vector<std::uint8_t> out{7, 7};
    testing::internal::CaptureStderr();
    const bool decoded = which == 0 ? adapter.decode(block.sys, shorter, block.p2, out, 4)
                                    : adapter.decode(block.sys, block.p1, shorter, out, 4);
    EXPECT_FALSE(decoded);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), line);
    EXPECT_EQ(out, (std::vector<std::uint8_t>{7, 7}));
  }
}

TEST(KTurboDecoderCModel, ModelErrorCodesAreReported) {
  KTurboDecoderCModel adapter;
  const Block block = encodedBlock(40);
  const std::vector<std::int32_t> length45(45, 3);
  const std::vector<std::int32_t> empty;
  struct Case {
    const char* name;
    const std::vector<std::int32_t>* streams;  // the same for all three, or null for block
    std::uint32_t iterations;
    std::int32_t code;
  };
  const Case cases[] = {
      {"K 41 is no block size", &length45, 4, VEXLON_IP_CORVANE_BAD_BLOCK_SIZE},
      {"empty streams give K 0", &empty, 4, VEXLON_IP_CORVANE_BAD_BLOCK_SIZE},
      {"no iterations", nullptr, 0, VEXLON_IP_CORVANE_BAD_ITERATIONS},
      {"17 iterations", nullptr, 17, VEXLON_IP_CORVANE_BAD_ITERATIONS},
  };
  for (const Case& c : cases) {
    std::vector<std::uint8_t> out{5};
    testing::internal::CaptureStderr();
    const bool decoded =
        c.streams != nullptr
            ? adapter.decode(*c.streams, *c.streams, *c.streams, out, c.iterations)
            : adapter.decode(block.sys, block.p1, block.p2, out, c.iterations);
    EXPECT_FALSE(decoded) << c.name;
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              kPrefix + "203)ERROR:KTurboDecoderCModel:Model returned error code " +
                  std::to_string(c.code) + "\n")
        << c.name;
    EXPECT_EQ(out, std::vector<std::uint8_t>{5}) << c.name;
  }
}

TEST(KTurboDecoderCModel, FailedCreationLeavesNoDecoderUntilACreationSucceeds) {
  KTurboDecoderCModel adapter;
  const Block block = encodedBlock(40);
  testing::internal::CaptureStderr();
  EXPECT_FALSE(adapter.setNumPU(3));
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            kPrefix + "117)ERROR:KTurboDecoderCModel:Could not create decoder model\n");
  EXPECT_EQ(adapter.getGenerics().processing_units, 3u);

  std::vector<std::uint8_t> out;
  testing::internal::CaptureStderr();
  EXPECT_FALSE(adapter.decode(block.sys, block.p1, block.p2, out, 4));
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            kPrefix + "142)ERROR:KTurboDecoderCModel:Decoder not yet created\n");
  EXPECT_TRUE(out.empty());

  testing::internal::CaptureStderr();
  EXPECT_FALSE(adapter.setAlgorithmType(9));  // P is still 3
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            kPrefix + "117)ERROR:KTurboDecoderCModel:Could not create decoder model\n");
  vexlon_ip_corvane_generics generics = adapter.getGenerics();
  generics.processing_units = 4;
  generics.algorithm = 2;
  EXPECT_TRUE(adapter.createModel(generics));
  EXPECT_TRUE(adapter.decode(block.sys, block.p1, block.p2, out, 4));
  EXPECT_EQ(out, block.c);

  EXPECT_EQ(adapter.destroyModel(), 0);
  EXPECT_EQ(adapter.destroyModel(), 0);
  testing::internal::CaptureStderr();
  EXPECT_FALSE(adapter.decode(block.sys, block.p1, block.p2, out, 4));
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            kPrefix + "142)ERROR:KTurboDecoderCModel:Decoder not yet created\n");
}

TEST(KTurboDecoderCModel, ConstructorsReportAModelThatCannotBeCreated) {
  vexlon_ip_corvane_generics generics = vexlon_ip_corvane_get_default_generics();
  generics.extrinsic_bits = 3;
  testing::internal::CaptureStderr();
  const auto adapter = KTurboDecoderCModel::create(generics);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            kPrefix + "98)ERROR:KTurboDecoderCModel:Could not create decoder model\n");
  ASSERT_NE(adapter, nullptr);
  EXPECT_EQ(adapter->getGenerics().extrinsic_bits, 3u);
  EXPECT_TRUE(adapter->setExtrinsicBits(9));

  testing::internal::CaptureStderr();
  const auto byDefault = KTurboDecoderCModel::create();
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
  EXPECT_EQ(byDefault->getGenerics().processing_units, 2u);
  EXPECT_EQ(byDefault->getGenerics().algorithm, 1u);
}

}  // namespace
