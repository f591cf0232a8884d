// The exported C interface of the turbo-decoder model: default generics, model states and
// the decode of one code block or a batch of them, with the argument checks and status codes.
#include "vexlon_ip_corvane_bitacc_cmodel.h"

#include <cstdlib>
#include <cstring>
#include <memory>
#include <new>

#include "QppInterleaver.h"
#include "TurboDecoder.h"
#include "VectorDecoder.h"

// A model state: the chosen decoder with its working buffers, and the block list of a call.
struct vexlon_ip_corvane_state {
  std::uint32_t maxBlockSize = 0;
  std::uint32_t maxCodeBlocks = 0;
  bool vectorised = false;
  corvane::TurboDecoder scalar;  // the scalar path's decoder (initialised on that path only)
  corvane::VectorDecoder vector;
  std::unique_ptr<corvane::CodeBlock[]> blocks;
};

namespace {

constexpr std::uint32_t kDefaultProcessingUnits = 2;
constexpr std::uint32_t kDefaultStepsPerUnit = 32;
constexpr std::uint32_t kDefaultAlgorithm = 1;
constexpr std::uint32_t kDefaultExtrinsicBits = 10;
constexpr std::uint32_t kDefaultMaxCodeBlocks = 1;

enum : std::uint32_t { kPathAutomatic = 0, kPathScalar = 1, kPathVectorised = 2 };

// Word 6 and the environment: true for the vectorised decoder, false for the scalar one.
bool choosesVectorised(std::uint32_t path) {
  if (path == kPathAutomatic) {
    const char* choice = std::getenv("CORVANE_TURBO_PATH");
    return corvane::vectorDecoderAvailable() &&
           !(choice != nullptr && std::strcmp(choice, "scalar") == 0);
  }
  return path == kPathVectorised;
}

bool reservedGenericsAreZero(const vexlon_ip_corvane_generics& g) {
  const std::uint32_t reserved[] = {g.reserved_1,  g.reserved_2,  g.reserved_3,  g.reserved_10,
                                    g.reserved_11, g.reserved_12, g.reserved_13, g.reserved_14,
                                    g.reserved_15, g.reserved_16, g.reserved_17, g.reserved_18};
  for (std::uint32_t word : reserved) {
    if (word != 0) {
      return false;
    }
  }
  return true;
}

bool streamSizesAre(const vexlon_ip_corvane_inputs& inputs, std::uint32_t N) {
  return inputs.systematic_size == N && inputs.parity_1_size == N && inputs.parity_2_size == N;
}

// The checks of one block, in the order their status codes are documented.
std::int32_t checkBlock(const vexlon_ip_corvane_state* state,
                        const vexlon_ip_corvane_inputs& inputs,
                        const vexlon_ip_corvane_outputs* outputs, const corvane::QppRow*& row) {
  row = corvane::findQppRow(inputs.block_size);
  if (row == nullptr) {
    return VEXLON_IP_CORVANE_BAD_BLOCK_SIZE;
  }
  if (row->K > state->maxBlockSize) {
    return VEXLON_IP_CORVANE_BLOCK_TOO_LARGE;
  }
  if (inputs.iterations < 1 || inputs.iterations > corvane::kMaxIterations) {
    return VEXLON_IP_CORVANE_BAD_ITERATIONS;
  }
  if (inputs.num_code_blocks != 1) {
    return VEXLON_IP_CORVANE_BAD_BLOCK_COUNT;
  }
  if (inputs.reserved_3 != 0 || inputs.reserved_10 != 0 || inputs.reserved_11 != 0) {
    return VEXLON_IP_CORVANE_BAD_RESERVED;
  }
  if (inputs.systematic == nullptr || inputs.parity_1 == nullptr || inputs.parity_2 == nullptr) {
    return VEXLON_IP_CORVANE_NULL_STREAM;
  }
  if (!streamSizesAre(inputs, row->K + 4)) {
    return VEXLON_IP_CORVANE_BAD_STREAM_SIZE;
  }
  if (outputs->bits == nullptr) {
    return VEXLON_IP_CORVANE_NULL_BITS;
  }
  if (outputs->bits_capacity < row->K) {
    return VEXLON_IP_CORVANE_SMALL_CAPACITY;
  }
  return VEXLON_IP_CORVANE_OK;
}

void reportFailure(vexlon_ip_corvane_outputs* outputs, std::uint32_t count) {
  for (std::uint32_t i = 0; outputs != nullptr && i < count; ++i) {
    outputs[i].iterations_done = 0;
    outputs[i].bits_stored = 0;
  }
}

// Checks every call of a batch (a single call is a batch of one), then decodes all blocks.
std::int32_t simulate(vexlon_ip_corvane_state* state, const vexlon_ip_corvane_inputs* inputs,
                      std::uint32_t count, vexlon_ip_corvane_outputs* outputs) {
  std::int32_t status = VEXLON_IP_CORVANE_OK;
  if (state == nullptr) {
    status = VEXLON_IP_CORVANE_NULL_STATE;
  } else if (outputs == nullptr) {
    status = VEXLON_IP_CORVANE_NULL_OUTPUTS;
  } else if (inputs == nullptr) {
    status = VEXLON_IP_CORVANE_NULL_INPUTS;
  } else if (count == 0 || count > state->maxCodeBlocks) {
    status = VEXLON_IP_CORVANE_BAD_BATCH_SIZE;
  }
  for (std::uint32_t i = 0; status == VEXLON_IP_CORVANE_OK && i < count; ++i) {
    const corvane::QppRow* row = nullptr;
    status = checkBlock(state, inputs[i], &outputs[i], row);
    state->blocks[i] = corvane::CodeBlock{row,
                                          inputs[i].systematic,
                                          inputs[i].parity_1,
                                          inputs[i].parity_2,
                                          inputs[i].iterations,
                                          outputs[i].bits};
  }
  if (status != VEXLON_IP_CORVANE_OK) {
    reportFailure(outputs, count);
    return status;
  }
  if (state->vectorised) {
    state->vector.decode(state->blocks.get(), count);
  } else {
    for (std::uint32_t i = 0; i < count; ++i) state->scalar.decode(state->blocks[i]);
  }
  for (std::uint32_t i = 0; i < count; ++i) {
    outputs[i].iterations_done = inputs[i].iterations;
    outputs[i].bits_stored = state->blocks[i].row->K;
  }
  return VEXLON_IP_CORVANE_OK;
}

}  // namespace

extern "C" {

vexlon_ip_corvane_generics vexlon_ip_corvane_get_default_generics(void) {
  vexlon_ip_corvane_generics generics{};
  generics.max_block_size = corvane::kMaxBlockSize;
  generics.processing_units = kDefaultProcessingUnits;
  generics.steps_per_unit = kDefaultStepsPerUnit;
  generics.decoder_path = kPathAutomatic;
  generics.algorithm = kDefaultAlgorithm;
  generics.extrinsic_bits = kDefaultExtrinsicBits;
  generics.max_code_blocks = kDefaultMaxCodeBlocks;
  return generics;
}

vexlon_ip_corvane_state* vexlon_ip_corvane_create_state(vexlon_ip_corvane_generics generics) {
  if (!reservedGenericsAreZero(generics)) {
    return nullptr;
  }
  corvane::DecoderConfig config;
  config.maxBlockSize = generics.max_block_size;
  config.processingUnits = generics.processing_units;
  config.algorithm = static_cast<corvane::Algorithm>(generics.algorithm);
  config.extrinsicBits = generics.extrinsic_bits;
  config.stepsPerUnit =
      generics.steps_per_unit != 0 ? generics.steps_per_unit : kDefaultStepsPerUnit;
  config.maxCodeBlocks =
      generics.max_code_blocks != 0 ? generics.max_code_blocks : kDefaultMaxCodeBlocks;
  if (!corvane::isValidConfig(config) || generics.decoder_path > kPathVectorised) {
    return nullptr;
  }
  std::unique_ptr<vexlon_ip_corvane_state> state(new (std::nothrow) vexlon_ip_corvane_state);
  if (state == nullptr) {
    return nullptr;
  }
  state->maxBlockSize = config.maxBlockSize;
  state->maxCodeBlocks = config.maxCodeBlocks;
  state->vectorised = choosesVectorised(generics.decoder_path);
  state->blocks.reset(new (std::nothrow) corvane::CodeBlock[config.maxCodeBlocks]);
  const bool ready = state->vectorised
                         ? state->vector.init(config, corvane::CorrectionTable(config.stepsPerUnit))
                         : state->scalar.init(config);
  if (state->blocks == nullptr || !ready) {
    return nullptr;
  }
  return state.release();
}

int32_t vexlon_ip_corvane_destroy_state(vexlon_ip_corvane_state* state) {
  if (state == nullptr) {
    return 1;
  }
  delete state;
  return 0;
}

int32_t vexlon_ip_corvane_bitacc_simulate(vexlon_ip_corvane_state* state,
                                          vexlon_ip_corvane_inputs inputs,
                                          vexlon_ip_corvane_outputs* outputs) {
  return simulate(state, &inputs, 1, outputs);
}

int32_t vexlon_ip_corvane_bitacc_simulate_batch(vexlon_ip_corvane_state* state,
                                                const vexlon_ip_corvane_inputs* inputs,
                                                uint32_t count,
                                                vexlon_ip_corvane_outputs* outputs) {
  return simulate(state, inputs, count, outputs);
}

}  // extern "C"
