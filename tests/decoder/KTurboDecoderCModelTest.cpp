// KTurboDecoderCModel: code blocks of the transmitter decoded through the model library, the
// error lines of every failure, and the model re-created on each generics change.
#include <gtest/gtest.h>

#include <cstdint>
#include <random>
#include <string>
#include <vector>

#include "DecoderTestSupport.h"
#include "KTurboDecoderCModel.h"
#include "tx/TurboEncoder.h"

namespace brannoc::test {
namespace {

// A code block of K bits and its three streams from the transmitter as soft values +-64.
struct Block {
  std::vector<std::uint8_t> c;
  std::vector<std::int32_t> sys, p1, p2;
};

Block encodedBlock(std::uint32_t K) {
  Block block;
  for (std::uint32_t k = 0; k < K; ++k) {
    block.c.push_back(static_cast<std::uint8_t>((k * 7 + k / 3) % 2));
  }
  tx::TurboCodeword d;
  EXPECT_TRUE(tx::turboEncode(block.c, d));
  for (auto [bits, soft] : {std::pair{&d.d0, &block.sys}, {&d.d1, &block.p1}, {&d.d2, &block.p2}}) {
    for (std::uint8_t b : *bits) soft->push_back(b != 0 ? 64 : -64);
  }
  return block;
}

// The smallest block quietly with the defaults, the largest with every unit count and algorithm:
// each change creates the model again.
TEST(KTurboDecoderCModel, DecodesTransmitterBlocksWithEveryUnitCountAndAlgorithm) {
  KTurboDecoderCModel adapter;
  const Block small = encodedBlock(40), large = encodedBlock(6144);
  std::vector<std::uint8_t> out;
  EXPECT_EQ(stderrOf([&] { EXPECT_TRUE(adapter.decode(small.sys, small.p1, small.p2, out, 4)); }),
            "");
  EXPECT_EQ(out, small.c);
  for (std::uint32_t P : {1u, 2u, 4u, 8u}) {
    for (std::uint32_t type : {0u, 1u, 2u}) {
      ASSERT_TRUE(adapter.setNumPU(P));
      ASSERT_TRUE(adapter.setAlgorithmType(type));
      ASSERT_TRUE(adapter.decode(large.sys, large.p1, large.p2, out, 1));
      EXPECT_EQ(out, large.c) << "P " << P << ", algorithm " << type;
    }
  }
}

// Every failure prints its line and leaves the output alone. A refused generics word stays:
// with 3 units every later change fails too, until a creation with good generics.
TEST(KTurboDecoderCModel, FailuresPrintTheirLineAndLeaveTheOutput) {
  KTurboDecoderCModel adapter, broken;
  const Block b = encodedBlock(40);
  std::vector<std::int32_t> shorter = b.p2;
  shorter.pop_back();
  const std::vector<std::int32_t> length45(45, 3), empty;
  std::vector<std::uint8_t> out{7, 7};
  const auto decode = [&](KTurboDecoderCModel& a, const std::vector<std::int32_t>& sys,
                          const std::vector<std::int32_t>& p1, const std::vector<std::int32_t>& p2,
                          std::uint32_t iterations) {
    return
        [&a, &sys, &p1, &p2, iterations, &out] { return a.decode(sys, p1, p2, out, iterations); };
  };
  const std::string line = "File: ../s/KTurboDecoderCModel(";
  const std::string sameSize =
      line + "151)ERROR:KTurboDecoderCModel:LLRs should all be the same size\n";
  const std::string code = line + "203)ERROR:KTurboDecoderCModel:Model returned error code ";
  const std::string notCreated = line + "142)ERROR:KTurboDecoderCModel:Decoder not yet created\n";
  const std::string notCreatable =
      line + "117)ERROR:KTurboDecoderCModel:Could not create decoder model\n";
  expectRefusals({
      {decode(adapter, b.sys, shorter, b.p2, 4), sameSize},
      {decode(adapter, b.sys, b.p1, shorter, 4), sameSize},
      {decode(adapter, length45, length45, length45, 4),  // K 41 is no block size
       code + std::to_string(VEXLON_IP_CORVANE_BAD_BLOCK_SIZE) + "\n"},
      {decode(adapter, empty, empty, empty, 4),  // K 0
       code + std::to_string(VEXLON_IP_CORVANE_BAD_BLOCK_SIZE) + "\n"},
      {decode(adapter, b.sys, b.p1, b.p2, 0),
       code + std::to_string(VEXLON_IP_CORVANE_BAD_ITERATIONS) + "\n"},
      {decode(adapter, b.sys, b.p1, b.p2, 17),
       code + std::to_string(VEXLON_IP_CORVANE_BAD_ITERATIONS) + "\n"},
      {[&] { return broken.setNumPU(3); }, notCreatable},
      {decode(broken, b.sys, b.p1, b.p2, 4), notCreated},
      {[&] { return broken.setAlgorithmType(2); }, notCreatable},
  });
  EXPECT_EQ(out, (std::vector<std::uint8_t>{7, 7}));

  vexlon_ip_corvane_generics generics = broken.getGenerics();
  generics.processing_units = 4;
  EXPECT_TRUE(broken.createModel(generics));
  EXPECT_TRUE(broken.decode(b.sys, b.p1, b.p2, out, 4));
  EXPECT_EQ(out, b.c);
  EXPECT_EQ(broken.destroyModel(), 0);
  EXPECT_EQ(broken.destroyModel(), 0);
  expectRefusals({{decode(broken, b.sys, b.p1, b.p2, 4), notCreated}});

  // The constructors report a model that cannot be made; a later change can make one.
  generics = vexlon_ip_corvane_get_default_generics();
  generics.extrinsic_bits = 3;
  std::unique_ptr<KTurboDecoderCModel> made;
  EXPECT_EQ(stderrOf([&] { made = KTurboDecoderCModel::create(generics); }),
            line + "98)ERROR:KTurboDecoderCModel:Could not create decoder model\n");
  ASSERT_NE(made, nullptr);
  EXPECT_TRUE(made->setExtrinsicBits(9));
  EXPECT_EQ(stderrOf([&] { made = KTurboDecoderCModel::create(); }), "");
}

// Blocks decoded in batches give each block what decoding it alone gives: the same bits, and
// for a batch the model refuses (a block of an unknown size), the same lines and result.
TEST(KTurboDecoderCModel, BatchesEqualBlockByBlock) {
  std::mt19937 rng(4);
  const std::uint32_t sizes[] = {40, 1024, 6144, 3136, 512, 6144};
  std::vector<std::vector<std::vector<std::int32_t>>> blocks;
  for (int n = 0; n < 20; ++n) {
    Block block = encodedBlock(sizes[n % 6]);
    for (auto* stream : {&block.sys, &block.p1, &block.p2}) {
      for (std::int32_t& v : *stream) v += static_cast<std::int32_t>(rng() % 161) - 80;
    }
    blocks.push_back({block.sys, block.p1, block.p2});
  }
  KTurboDecoderCModel batched;
  KTurboDecoderCModel single;
  std::vector<std::vector<std::uint8_t>> out;
  for (const bool refused : {false, true}) {
    if (refused) {
      blocks[17][0].push_back(0);  // K = 6141 is no interleaver size; and a length mismatch
      blocks[18] = {std::vector<std::int32_t>(45), std::vector<std::int32_t>(45),
                    std::vector<std::int32_t>(45)};
    }
    bool batchResult = false;
    const std::string batchLines =
        stderrOf([&] { batchResult = batched.decodeBlocks(blocks, out, 3); });
    std::vector<std::uint8_t> alone;
    bool singleResult = true;
    const std::string singleLines = stderrOf([&] {
      for (std::size_t i = 0; i < blocks.size(); ++i) {
        const bool ok = single.decode(blocks[i][0], blocks[i][1], blocks[i][2], alone, 3);
        singleResult = ok && singleResult;
        if (ok) {
          EXPECT_EQ(out[i], alone) << "block " << i;
        }
      }
    });
    EXPECT_EQ(batchResult, singleResult);
    EXPECT_EQ(batchLines, singleLines);
    EXPECT_EQ(batchResult, !refused);
  }
}

}  // namespace
}  // namespace brannoc::test
