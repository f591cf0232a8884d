// The model library's C interface: the generics it accepts, the status of every refused
// call (with nothing written to the bit array), and the QPP permutation it builds.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "CorvaneTestSupport.h"
#include "MetricPolicies.h"
#include "QppInterleaver.h"
#include "VectorDecoder.h"

namespace corvane::test {
namespace {

TEST(CorvaneGenerics, DefaultsAndRefusedValues) {
  const vexlon_ip_corvane_generics defaults = vexlon_ip_corvane_get_default_generics();
  EXPECT_EQ(defaults.max_block_size, 6144u);
  EXPECT_EQ(defaults.processing_units, 2u);
  EXPECT_EQ(defaults.algorithm, 1u);
  EXPECT_EQ(defaults.extrinsic_bits, 10u);
  EXPECT_EQ(defaults.steps_per_unit, 32u);
  EXPECT_EQ(defaults.decoder_path, 0u);
  EXPECT_EQ(defaults.max_code_blocks, 1u);

  struct Case {
    const char* name;
    std::function<void(vexlon_ip_corvane_generics&)> change;
    bool accepted;
  };
  const Case cases[] = {
      {"P 1", [](auto& g) { g.processing_units = 1; }, true},
      {"P 8", [](auto& g) { g.processing_units = 8; }, true},
      {"P 0", [](auto& g) { g.processing_units = 0; }, false},
      {"P 3", [](auto& g) { g.processing_units = 3; }, false},
      {"P 16", [](auto& g) { g.processing_units = 16; }, false},
      {"algorithm 0", [](auto& g) { g.algorithm = 0; }, true},
      {"algorithm 2", [](auto& g) { g.algorithm = 2; }, true},
      {"algorithm 3", [](auto& g) { g.algorithm = 3; }, false},
      {"max K 40", [](auto& g) { g.max_block_size = 40; }, true},
      {"max K 0", [](auto& g) { g.max_block_size = 0; }, false},
      {"max K 41", [](auto& g) { g.max_block_size = 41; }, false},
      {"max K 6208", [](auto& g) { g.max_block_size = 6208; }, false},
      {"extrinsic 8", [](auto& g) { g.extrinsic_bits = 8; }, true},
      {"extrinsic 11", [](auto& g) { g.extrinsic_bits = 11; }, true},
      {"extrinsic 7", [](auto& g) { g.extrinsic_bits = 7; }, false},
      {"extrinsic 12", [](auto& g) { g.extrinsic_bits = 12; }, false},
      {"steps 0 (default)", [](auto& g) { g.steps_per_unit = 0; }, true},
      {"steps 4", [](auto& g) { g.steps_per_unit = 4; }, true},
      {"steps 64", [](auto& g) { g.steps_per_unit = 64; }, true},
      {"steps 65", [](auto& g) { g.steps_per_unit = 65; }, false},
      {"scalar path", [](auto& g) { g.decoder_path = 1; }, true},
      {"vectorised path", [](auto& g) { g.decoder_path = 2; }, vectorDecoderAvailable()},
      {"path 3", [](auto& g) { g.decoder_path = 3; }, false},
      {"blocks 0 (default)", [](auto& g) { g.max_code_blocks = 0; }, true},
      {"blocks 32", [](auto& g) { g.max_code_blocks = 32; }, true},
      {"blocks 33", [](auto& g) { g.max_code_blocks = 33; }, false},
      {"reserved 1", [](auto& g) { g.reserved_1 = 1; }, false},
      {"reserved 10", [](auto& g) { g.reserved_10 = 1; }, false},
      {"reserved 18", [](auto& g) { g.reserved_18 = 0x80000000u; }, false},
  };
  for (const Case& c : cases) {
    vexlon_ip_corvane_generics g = defaults;
    c.change(g);
    vexlon_ip_corvane_state* state = vexlon_ip_corvane_create_state(g);
    EXPECT_EQ(state != nullptr, c.accepted) << c.name;
    if (state != nullptr) {
      EXPECT_EQ(vexlon_ip_corvane_destroy_state(state), 0) << c.name;
    }
  }
  EXPECT_NE(vexlon_ip_corvane_destroy_state(nullptr), 0);
}

TEST(CorvaneSimulate, RefusedCallsReturnTheirStatusAndWriteNoBits) {
  vexlon_ip_corvane_generics small = vexlon_ip_corvane_get_default_generics();
  small.max_block_size = 1024;
  Model model(small);
  ASSERT_NE(model.get(), nullptr);
  const std::vector<std::int32_t> stream48(48, 10), stream44(44, 10), stream1060(1060, 10);
  const std::vector<std::int32_t> stream45(45, 10), stream43(43, 10);

  struct Case {
    const char* name;
    std::function<void(vexlon_ip_corvane_inputs&, vexlon_ip_corvane_outputs&)> change;
    std::int32_t status;
    bool nullState = false;
    bool nullOutputs = false;
  };
  const Case cases[] = {
      {"null state", [](auto&, auto&) {}, VEXLON_IP_CORVANE_NULL_STATE, true},
      {"null outputs", [](auto&, auto&) {}, VEXLON_IP_CORVANE_NULL_OUTPUTS, false, true},
      {"K 0", [](auto& in, auto&) { in.block_size = 0; }, VEXLON_IP_CORVANE_BAD_BLOCK_SIZE},
      {"K 41", [](auto& in, auto&) { in.block_size = 41; }, VEXLON_IP_CORVANE_BAD_BLOCK_SIZE},
      {"K 6145", [](auto& in, auto&) { in.block_size = 6145; }, VEXLON_IP_CORVANE_BAD_BLOCK_SIZE},
      {"K 0xFFFFFFFC", [](auto& in, auto&) { in.block_size = 0xFFFFFFFCu; },
       VEXLON_IP_CORVANE_BAD_BLOCK_SIZE},
      {"K above the state's maximum",
       [&](auto& in, auto&) {
         in.block_size = 1056;
         in.systematic = in.parity_1 = in.parity_2 = stream1060.data();
         in.systematic_size = in.parity_1_size = in.parity_2_size = 1060;
       },
       VEXLON_IP_CORVANE_BLOCK_TOO_LARGE},
      {"0 iterations", [](auto& in, auto&) { in.iterations = 0; },
       VEXLON_IP_CORVANE_BAD_ITERATIONS},
      {"17 iterations", [](auto& in, auto&) { in.iterations = 17; },
       VEXLON_IP_CORVANE_BAD_ITERATIONS},
      {"0 code blocks", [](auto& in, auto&) { in.num_code_blocks = 0; },
       VEXLON_IP_CORVANE_BAD_BLOCK_COUNT},
      {"2 code blocks", [](auto& in, auto&) { in.num_code_blocks = 2; },
       VEXLON_IP_CORVANE_BAD_BLOCK_COUNT},
      {"reserved word 3", [](auto& in, auto&) { in.reserved_3 = 1; },
       VEXLON_IP_CORVANE_BAD_RESERVED},
      {"reserved word 11", [](auto& in, auto&) { in.reserved_11 = 7; },
       VEXLON_IP_CORVANE_BAD_RESERVED},
      {"null d0", [](auto& in, auto&) { in.systematic = nullptr; }, VEXLON_IP_CORVANE_NULL_STREAM},
      {"null d2", [](auto& in, auto&) { in.parity_2 = nullptr; }, VEXLON_IP_CORVANE_NULL_STREAM},
      {"d0 K + 5",
       [&](auto& in, auto&) {
         in.systematic = stream45.data();
         in.systematic_size = 45;
       },
       VEXLON_IP_CORVANE_BAD_STREAM_SIZE},
      {"d1 K + 3",
       [&](auto& in, auto&) {
         in.parity_1 = stream43.data();
         in.parity_1_size = 43;
       },
       VEXLON_IP_CORVANE_BAD_STREAM_SIZE},
      {"d2 0", [](auto& in, auto&) { in.parity_2_size = 0; }, VEXLON_IP_CORVANE_BAD_STREAM_SIZE},
      {"all streams K",
       [](auto& in, auto&) { in.systematic_size = in.parity_1_size = in.parity_2_size = 40; },
       VEXLON_IP_CORVANE_BAD_STREAM_SIZE},
      {"null bits", [](auto&, auto& out) { out.bits = nullptr; }, VEXLON_IP_CORVANE_NULL_BITS},
      {"capacity K - 1", [](auto&, auto& out) { out.bits_capacity = 39; },
       VEXLON_IP_CORVANE_SMALL_CAPACITY},
      {"capacity 0", [](auto&, auto& out) { out.bits_capacity = 0; },
       VEXLON_IP_CORVANE_SMALL_CAPACITY},
  };
  for (const Case& c : cases) {
    vexlon_ip_corvane_inputs in{};
    in.block_size = 40;
    in.iterations = 4;
    in.num_code_blocks = 1;
    in.systematic = in.parity_1 = in.parity_2 = stream44.data();
    in.systematic_size = in.parity_1_size = in.parity_2_size = 44;
    std::vector<std::uint8_t> bits(64, 0xEE);
    vexlon_ip_corvane_outputs out{};
    out.iterations_done = 99;
    out.bits_stored = 99;
    out.bits = bits.data();
    out.bits_capacity = 40;
    c.change(in, out);
    const std::int32_t status = vexlon_ip_corvane_bitacc_simulate(
        c.nullState ? nullptr : model.get(), in, c.nullOutputs ? nullptr : &out);
    EXPECT_EQ(status, c.status) << c.name;
    EXPECT_EQ(bits, std::vector<std::uint8_t>(64, 0xEE)) << c.name;
    if (!c.nullOutputs) {
      EXPECT_EQ(out.bits_stored, 0u) << c.name;
      EXPECT_EQ(out.iterations_done, 0u) << c.name;
    }
  }
  // The base case of the table is a valid call.
  std::vector<std::uint8_t> bits(64, 0xEE);
  vexlon_ip_corvane_outputs out{0, 0, bits.data(), 40};
  vexlon_ip_corvane_inputs in{
      40, 16, 1, 0, stream44.data(), 44, stream44.data(), 44, stream44.data(), 44, 0, 0};
  ASSERT_EQ(vexlon_ip_corvane_bitacc_simulate(model.get(), in, &out), VEXLON_IP_CORVANE_OK);
  EXPECT_EQ(out.bits_stored, 40u);
  EXPECT_EQ(out.iterations_done, 16u);
  EXPECT_TRUE(std::all_of(bits.begin(), bits.begin() + 40, [](std::uint8_t b) { return b <= 1; }));
  EXPECT_EQ(bits[40], 0xEE);
}

TEST(CorvaneSimulate, RefusedBatchesDecodeNoBlock) {
  vexlon_ip_corvane_generics generics = vexlon_ip_corvane_get_default_generics();
  generics.max_code_blocks = 3;
  Model model(generics);
  ASSERT_NE(model.get(), nullptr);
  const std::vector<std::int32_t> stream(44, 10);
  vexlon_ip_corvane_inputs in[3];
  for (auto& i : in)
    i = {40, 2, 1, 0, stream.data(), 44, stream.data(), 44, stream.data(), 44, 0, 0};
  struct Case {
    const char* name;
    bool nullInputs;
    std::uint32_t count;
    std::uint32_t badBlock;  // 3: none
    std::int32_t status;
  };
  const Case cases[] = {
      {"null inputs", true, 2, 3, VEXLON_IP_CORVANE_NULL_INPUTS},
      {"no block", false, 0, 3, VEXLON_IP_CORVANE_BAD_BATCH_SIZE},
      {"above max_code_blocks", false, 4, 3, VEXLON_IP_CORVANE_BAD_BATCH_SIZE},
      {"third block refused", false, 3, 2, VEXLON_IP_CORVANE_BAD_ITERATIONS},
  };
  for (const Case& c : cases) {
    std::vector<std::uint8_t> bits(3 * 40, 0xEE);
    vexlon_ip_corvane_outputs out[4];
    for (std::uint32_t b = 0; b < 4; ++b) out[b] = {9, 9, bits.data() + 40 * (b % 3), 40};
    vexlon_ip_corvane_inputs blocks[4] = {in[0], in[1], in[2], in[0]};
    if (c.badBlock < 3) blocks[c.badBlock].iterations = 0;
    EXPECT_EQ(vexlon_ip_corvane_bitacc_simulate_batch(model.get(), c.nullInputs ? nullptr : blocks,
                                                      c.count, out),
              c.status)
        << c.name;
    EXPECT_EQ(bits, std::vector<std::uint8_t>(3 * 40, 0xEE)) << c.name;
    for (std::uint32_t b = 0; b < c.count; ++b) {
      EXPECT_EQ(out[b].bits_stored + out[b].iterations_done, 0u) << c.name;
    }
  }
}

// Entry d of the table at s steps per unit is round(s * ln(1 + e^(-d/s))) up to the first 0:
// two scales in full, and a fingerprint of every scale's entries (taken with 50-digit
// decimal arithmetic), which every build must reproduce.
TEST(CorvaneCorrection, TablesOfEveryScale) {
  const std::vector<int> eight = {6, 5, 5, 4, 4, 3, 3, 3, 3, 2, 2, 2,
                                  2, 1, 1, 1, 1, 1, 1, 1, 1, 1, 0};
  const std::vector<int> four = {3, 2, 2, 2, 1, 1, 1, 1, 1, 0};
  std::uint64_t hash = 0xCBF29CE484222325ull;
  for (std::uint32_t s = CorrectionTable::kMinStepsPerUnit; s <= CorrectionTable::kMaxStepsPerUnit;
       ++s) {
    const CorrectionTable table(s);
    std::vector<int> entries;
    for (int d = 0; d < table.size(); ++d) entries.push_back(table[d]);
    if (s == 8) {
      EXPECT_EQ(entries, eight);
    } else if (s == 4) {
      EXPECT_EQ(entries, four);
    } else if (s == 32) {
      EXPECT_EQ(table.size(), 134);
    }
    entries.insert(entries.begin(), table.size());
    for (int v : entries) hash = (hash ^ static_cast<std::uint64_t>(v)) * 0x100000001B3ull;
  }
  EXPECT_EQ(hash, 0xED8ED877CAB284D6ull) << std::hex << hash;
}

TEST(CorvaneInterleaver, PermutationOfEveryBlockSizeMatchesThePolynomial) {
  std::vector<std::uint16_t> pi(kMaxBlockSize);
  std::uint32_t rows = 0;
  for (std::uint32_t K = 0; K <= kMaxBlockSize + 64; ++K) {
    const QppRow* row = findQppRow(K);
    if (row == nullptr) continue;
    ++rows;
    ASSERT_EQ(row->K, K);
    buildQppPermutation(*row, pi.data());
    for (std::uint64_t i = 0; i < K; ++i) {
      ASSERT_EQ(pi[i], (row->f1 * i + row->f2 * i * i) % K) << "K " << K << ", i " << i;
    }
  }
  EXPECT_EQ(rows, 188u);
}

}  // namespace
}  // namespace corvane::test
