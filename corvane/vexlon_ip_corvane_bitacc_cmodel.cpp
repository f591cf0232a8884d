// The exported C interface of the turbo-decoder model: default generics, model states and
// the decode of one code block with its argument checks and status codes.
#include "vexlon_ip_corvane_bitacc_cmodel.h"

#include <new>

#include "QppInterleaver.h"
#include "TurboDecoder.h"

// A model state: the decoder with its working buffers.
struct vexlon_ip_corvane_state {
  corvane::TurboDecoder decoder;
};

namespace {

constexpr std::uint32_t kDefaultProcessingUnits = 2;
constexpr std::uint32_t kDefaultAlgorithm = 1;
constexpr std::uint32_t kDefaultExtrinsicBits = 10;

bool reservedGenericsAreZero(const vexlon_ip_corvane_generics& g) {
  const std::uint32_t reserved[] = {g.reserved_1,  g.reserved_2,  g.reserved_3,  g.reserved_5,
                                    g.reserved_6,  g.reserved_9,  g.reserved_10, g.reserved_11,
                                    g.reserved_12, g.reserved_13, g.reserved_14, g.reserved_15,
                                    g.reserved_16, g.reserved_17, g.reserved_18};
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

// The checks of one call, in the order their status codes are documented.
std::int32_t checkCall(const vexlon_ip_corvane_state* state,
                       const vexlon_ip_corvane_inputs& inputs,
                       const vexlon_ip_corvane_outputs* outputs, const corvane::QppRow*& row) {
  if (state == nullptr) {
    return VEXLON_IP_CORVANE_NULL_STATE;
  }
  if (outputs == nullptr) {
    return VEXLON_IP_CORVANE_NULL_OUTPUTS;
  }
  row = corvane::findQppRow(inputs.block_size);
  if (row == nullptr) {
    return VEXLON_IP_CORVANE_BAD_BLOCK_SIZE;
  }
  if (row->K > state->decoder.maxBlockSize()) {
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

}  // namespace

extern "C" {

vexlon_ip_corvane_generics vexlon_ip_corvane_get_default_generics(void) {
  vexlon_ip_corvane_generics generics{};
  generics.max_block_size = corvane::kMaxBlockSize;
  generics.processing_units = kDefaultProcessingUnits;
  generics.algorithm = kDefaultAlgorithm;
  generics.extrinsic_bits = kDefaultExtrinsicBits;
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
  if (!corvane::isValidConfig(config)) {
    return nullptr;
  }
  auto* state = new (std::nothrow) vexlon_ip_corvane_state;
  if (state == nullptr) {
    return nullptr;
  }
  if (!state->decoder.init(config)) {
    delete state;
    return nullptr;
  }
  return state;
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
  const corvane::QppRow* row = nullptr;
  const std::int32_t status = checkCall(state, inputs, outputs, row);
  if (status != VEXLON_IP_CORVANE_OK) {
    if (outputs != nullptr) {
      outputs->iterations_done = 0;
      outputs->bits_stored = 0;
    }
    return status;
  }
  state->decoder.decode(*row, inputs.systematic, inputs.parity_1, inputs.parity_2,
                        inputs.iterations, outputs->bits);
  outputs->iterations_done = inputs.iterations;
  outputs->bits_stored = row->K;
  return VEXLON_IP_CORVANE_OK;
}

}  // extern "C"
