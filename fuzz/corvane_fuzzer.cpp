// libFuzzer harness of the turbo-decoder model's C interface: generics (most inputs from a
// compact byte, some as 19 raw words), then one block through vexlon_ip_corvane_bitacc_simulate
// or up to four through the batch entry point, every array at exactly its declared size.
//
// Input: mode byte (bit 0 raw generics, bit 1 batch, bit 2 soft values of four bytes, bit 3
// raw block fields), the generics (compact byte: bits 0-1 units 1/2/4/8, bits 2-3
// algorithm, bits 4-5 decoder path, bits 6-7 max_code_blocks - 1; then a steps-per-unit
// byte; or 19 words), a block count byte (batch), then per block: K index byte (or, raw, the
// 12 input words with sizes), iteration byte, null-pointer byte, capacity word, soft values.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <map>
#include <memory>
#include <vector>

#include "FuzzInput.h"
#include "vexlon_ip_corvane_bitacc_cmodel.h"

namespace {

using brannoc::fuzz::FuzzInput;

[[noreturn]] void violated() { __builtin_trap(); }

// The block sizes of TS 36.212 Table 5.1.3-3.
std::uint32_t blockSize(std::uint8_t index) {
  const std::uint32_t i = index % 188;
  if (i < 60) return 40 + 8 * i;
  if (i < 92) return 528 + 16 * (i - 60);
  if (i < 124) return 1056 + 32 * (i - 92);
  return 2112 + 64 * (i - 124);
}

struct Block {
  vexlon_ip_corvane_inputs inputs{};
  std::vector<std::int32_t> streams[3];
  std::vector<std::uint8_t> bits;
  vexlon_ip_corvane_outputs outputs{};
};

constexpr std::uint32_t kMaxStream = 6148 + 64;

void readBlock(FuzzInput& in, std::uint8_t mode, Block& b) {
  vexlon_ip_corvane_inputs& x = b.inputs;
  std::uint32_t sizes[3];
  if ((mode & 8) != 0) {
    x.block_size = in.word();
    x.iterations = in.word();
    x.num_code_blocks = in.word();
    x.reserved_3 = in.word();
    for (std::uint32_t& size : sizes) size = std::min(in.word(), kMaxStream);
    x.reserved_10 = in.word();
    x.reserved_11 = in.word();
  } else {
    // Batches take blocks of at most 512 bits, so that a run stays short.
    const std::uint8_t index = in.byte();
    x.block_size = blockSize((mode & 2) != 0 ? index % 60 : index);
    x.iterations = 1 + in.byte() % 4;
    x.num_code_blocks = 1;
    for (std::uint32_t& size : sizes) size = x.block_size + 4;
  }
  const std::uint8_t nulls = in.byte();
  const std::uint32_t capacity = std::min(in.word(), kMaxStream);
  for (int s = 0; s < 3; ++s) {
    b.streams[s] = in.softValues(sizes[s], (mode & 4) != 0);
  }
  b.bits.assign(capacity, 0);
  x.systematic = (nulls & 1) != 0 ? nullptr : b.streams[0].data();
  x.systematic_size = sizes[0];
  x.parity_1 = (nulls & 2) != 0 ? nullptr : b.streams[1].data();
  x.parity_1_size = sizes[1];
  x.parity_2 = (nulls & 4) != 0 ? nullptr : b.streams[2].data();
  x.parity_2_size = sizes[2];
  b.outputs.bits = (nulls & 8) != 0 ? nullptr : b.bits.data();
  b.outputs.bits_capacity = capacity;
}

void checkBlock(const Block& b, std::int32_t status) {
  const vexlon_ip_corvane_outputs& o = b.outputs;
  if (status != 0) {
    if (o.iterations_done != 0 || o.bits_stored != 0) violated();
    return;
  }
  if (o.bits_stored != b.inputs.block_size || o.iterations_done != b.inputs.iterations) violated();
  for (std::uint32_t i = 0; i < o.bits_stored; ++i) {
    if (b.bits[i] > 1) violated();
  }
}

// States of the compact generics, made once and kept.
vexlon_ip_corvane_state* keptState(std::uint16_t key, const vexlon_ip_corvane_generics& g) {
  struct States {
    std::map<std::uint16_t, vexlon_ip_corvane_state*> byKey;
    ~States() {
      for (const auto& entry : byKey) vexlon_ip_corvane_destroy_state(entry.second);
    }
  };
  static States states;
  const auto found = states.byKey.find(key);
  if (found != states.byKey.end()) {
    return found->second;
  }
  if (states.byKey.size() == 64) {  // a few megabytes each: start again
    for (const auto& entry : states.byKey) vexlon_ip_corvane_destroy_state(entry.second);
    states.byKey.clear();
  }
  return states.byKey[key] = vexlon_ip_corvane_create_state(g);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  FuzzInput in(data, size);
  const std::uint8_t mode = in.byte();
  vexlon_ip_corvane_generics g = vexlon_ip_corvane_get_default_generics();
  vexlon_ip_corvane_state* state = nullptr;
  bool owned = false;
  if ((mode & 1) != 0) {
    std::uint32_t* words = &g.max_block_size;
    for (int k = 0; k < 19; ++k) words[k] = in.word();
    g.max_block_size = std::min<std::uint32_t>(g.max_block_size, 1U << 16);
    g.max_code_blocks = std::min<std::uint32_t>(g.max_code_blocks, 64);
    state = vexlon_ip_corvane_create_state(g);
    owned = true;
    if (state == nullptr) {
      return 0;
    }
  } else {
    const std::uint8_t compact = in.byte();
    const std::uint8_t steps = in.byte();
    constexpr std::uint32_t kUnits[] = {1, 2, 4, 8};
    g.processing_units = kUnits[compact & 3];
    g.algorithm = (compact >> 2) & 3;
    g.decoder_path = (compact >> 4) & 3;
    g.max_code_blocks = 1 + ((compact >> 6) & 3);
    g.steps_per_unit = steps % 65;
    state = keptState(static_cast<std::uint16_t>(compact | (g.steps_per_unit << 8)), g);
    if (state == nullptr) {
      return 0;  // a refused word (algorithm 3, path 3): nothing to decode with
    }
  }
  const std::uint32_t count = (mode & 2) != 0 ? in.byte() % 5 : 1;
  std::vector<std::unique_ptr<Block>> blocks;
  for (std::uint32_t n = 0; n < count; ++n) {
    blocks.push_back(std::make_unique<Block>());
    readBlock(in, mode, *blocks.back());
  }
  if ((mode & 2) == 0) {
    const std::int32_t status =
        vexlon_ip_corvane_bitacc_simulate(state, blocks[0]->inputs, &blocks[0]->outputs);
    if (status < 0 || status > 13) violated();
    checkBlock(*blocks[0], status);
  } else {
    std::vector<vexlon_ip_corvane_inputs> inputs;
    std::vector<vexlon_ip_corvane_outputs> outputs;
    for (const auto& b : blocks) {
      inputs.push_back(b->inputs);
      outputs.push_back(b->outputs);
    }
    const std::int32_t status = vexlon_ip_corvane_bitacc_simulate_batch(
        state, inputs.empty() ? nullptr : inputs.data(), count,
        outputs.empty() ? nullptr : outputs.data());
    if (status < 0 || status > 13) violated();
    for (std::uint32_t n = 0; n < count; ++n) {
      blocks[n]->outputs = outputs[n];
      checkBlock(*blocks[n], status);
    }
  }
  if (owned) {
    vexlon_ip_corvane_destroy_state(state);
  }
  return 0;
}
