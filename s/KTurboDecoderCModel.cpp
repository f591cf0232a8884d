// KTurboDecoderCModel: the adapter to the turbo-decoder model library. The model state is
// rebuilt on every change of the generics; each code block is copied once into plain arrays
// from the C allocator, which the library reads, and released before return.
#include "KTurboDecoderCModel.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <utility>

#include "errorLine.h"

namespace brannoc {

namespace {

constexpr const char* kSource = "../s/KTurboDecoderCModel";
constexpr const char* kCouldNotCreate = "ERROR:KTurboDecoderCModel:Could not create decoder model";

// The soft values of one stream and the decided bits, in C-allocated arrays released on
// every path. A zero-length request still gets a one-byte block, so that an empty stream
// is not mistaken for a failed allocation.
struct ModelArrays {
  std::int32_t* streams[3] = {nullptr, nullptr, nullptr};
  std::uint8_t* bits = nullptr;

  bool allocate(std::size_t N, std::size_t bitBytes) {
    for (std::int32_t*& stream : streams) {
      stream = static_cast<std::int32_t*>(std::malloc(N == 0 ? 1 : N * sizeof(std::int32_t)));
    }
    bits = static_cast<std::uint8_t*>(std::malloc(bitBytes == 0 ? 1 : bitBytes));
    return streams[0] != nullptr && streams[1] != nullptr && streams[2] != nullptr &&
           bits != nullptr;
  }
  ~ModelArrays() {
    for (std::int32_t* stream : streams) {
      std::free(stream);
    }
    std::free(bits);
  }
};

}  // namespace

namespace {

vexlon_ip_corvane_generics batchGenerics() {
  vexlon_ip_corvane_generics generics = vexlon_ip_corvane_get_default_generics();
  generics.max_code_blocks = KTurboDecoderCModel::kBatchBlocks;
  return generics;
}

}  // namespace

KTurboDecoderCModel::KTurboDecoderCModel() : itsGenerics(batchGenerics()) {
  itsModel = vexlon_ip_corvane_create_state(itsGenerics);
  if (itsModel == nullptr) {
    errorLineFile(kSource, 84, kCouldNotCreate);
  }
}

KTurboDecoderCModel::KTurboDecoderCModel(const vexlon_ip_corvane_generics& generics)
    : itsGenerics(generics) {
  itsModel = vexlon_ip_corvane_create_state(itsGenerics);
  if (itsModel == nullptr) {
    errorLineFile(kSource, 98, kCouldNotCreate);
  }
}

KTurboDecoderCModel::~KTurboDecoderCModel() { destroyModel(); }

KTurboDecoderCModel::KTurboDecoderCModel(KTurboDecoderCModel&& other) noexcept
    : itsGenerics(other.itsGenerics), itsModel(std::exchange(other.itsModel, nullptr)) {}

KTurboDecoderCModel& KTurboDecoderCModel::operator=(KTurboDecoderCModel&& other) noexcept {
  if (this != &other) {
    destroyModel();
    itsGenerics = other.itsGenerics;
    itsModel = std::exchange(other.itsModel, nullptr);
  }
  return *this;
}

std::unique_ptr<KTurboDecoderCModel> KTurboDecoderCModel::create() {
  return std::make_unique<KTurboDecoderCModel>();
}

std::unique_ptr<KTurboDecoderCModel> KTurboDecoderCModel::create(
    const vexlon_ip_corvane_generics& generics) {
  return std::make_unique<KTurboDecoderCModel>(generics);
}

bool KTurboDecoderCModel::createModel(const vexlon_ip_corvane_generics& generics) {
  destroyModel();
  itsModel = vexlon_ip_corvane_create_state(generics);
  itsGenerics = generics;
  if (itsModel == nullptr) {
    errorLineFile(kSource, 117, kCouldNotCreate);
    return false;
  }
  return true;
}

bool KTurboDecoderCModel::setWord(std::uint32_t vexlon_ip_corvane_generics::*word,
                                  std::uint32_t value) {
  if (itsModel != nullptr && itsGenerics.*word == value) {
    return true;
  }
  itsGenerics.*word = value;
  return createModel(itsGenerics);
}

bool KTurboDecoderCModel::setNumPU(std::uint32_t numPU) {
  return setWord(&vexlon_ip_corvane_generics::processing_units, numPU);
}

bool KTurboDecoderCModel::setAlgorithmType(std::uint32_t type) {
  return setWord(&vexlon_ip_corvane_generics::algorithm, type);
}

bool KTurboDecoderCModel::setExtrinsicBits(std::uint32_t bits) {
  return setWord(&vexlon_ip_corvane_generics::extrinsic_bits, bits);
}

std::int32_t KTurboDecoderCModel::destroyModel() {
  if (itsModel == nullptr) {
    return 0;
  }
  const std::int32_t result = vexlon_ip_corvane_destroy_state(itsModel);
  itsModel = nullptr;
  return result;
}

bool KTurboDecoderCModel::decode(const std::vector<std::int32_t>& sys,
                                 const std::vector<std::int32_t>& p1,
                                 const std::vector<std::int32_t>& p2,
                                 std::vector<std::uint8_t>& out, std::uint32_t iterations) {
  if (itsModel == nullptr) {
    errorLineFile(kSource, 142, "ERROR:KTurboDecoderCModel:Decoder not yet created");
    return false;
  }
  const std::size_t N = sys.size();
  if (p1.size() != N || p2.size() != N) {
    errorLineFile(kSource, 151, "ERROR:KTurboDecoderCModel:LLRs should all be the same size");
    return false;
  }
  // Streams shorter than the 4 tail positions give K = 0, which the model refuses, rather
  // than a wrapped-around block size.
  const std::uint32_t streamLength = static_cast<std::uint32_t>(N);
  const std::uint32_t K = streamLength >= 4 ? streamLength - 4 : 0;
  ModelArrays arrays;
  if (!arrays.allocate(N, 4 * static_cast<std::size_t>(K))) {
    errorLineBare("Error: Unable to allocate enough space for turbo decoder arrays");
    return false;
  }
  const std::vector<std::int32_t>* sources[3] = {&sys, &p1, &p2};
  for (int s = 0; s < 3; ++s) {
    if (N != 0) {
      std::memcpy(arrays.streams[s], sources[s]->data(), N * sizeof(std::int32_t));
    }
  }
  vexlon_ip_corvane_inputs inputs{};
  inputs.block_size = K;
  inputs.iterations = iterations;
  inputs.num_code_blocks = 1;
  inputs.reserved_3 = 0;
  inputs.systematic = arrays.streams[0];
  inputs.systematic_size = streamLength;
  inputs.parity_1 = arrays.streams[1];
  inputs.parity_1_size = streamLength;
  inputs.parity_2 = arrays.streams[2];
  inputs.parity_2_size = streamLength;
  vexlon_ip_corvane_outputs outputs{};
  outputs.bits = arrays.bits;
  outputs.bits_capacity = K;
  const std::int32_t code = vexlon_ip_corvane_bitacc_simulate(itsModel, inputs, &outputs);
  if (code != 0) {
    errorLineFile(kSource, 203, "ERROR:KTurboDecoderCModel:Model returned error code ", code);
    return false;
  }
  // A library storing more than the capacity it was given is not believed beyond it.
  const std::uint32_t stored = outputs.bits_stored <= K ? outputs.bits_stored : K;
  out.assign(arrays.bits, arrays.bits + stored);
  return true;
}

bool KTurboDecoderCModel::decodeBlocks(
    const std::vector<std::vector<std::vector<std::int32_t>>>& blocks,
    std::vector<std::vector<std::uint8_t>>& out, std::uint32_t iterations) {
  out.resize(blocks.size());
  const auto alone = [&](std::size_t first, std::size_t last) {
    bool ok = true;
    for (std::size_t i = first; i < last; ++i) {
      ok = decode(blocks[i][0], blocks[i][1], blocks[i][2], out[i], iterations) && ok;
    }
    return ok;
  };
  const std::size_t batch = std::max<std::uint32_t>(itsGenerics.max_code_blocks, 1);
  const bool threeStreams = std::all_of(blocks.begin(), blocks.end(),
                                        [](const auto& streams) { return streams.size() == 3; });
  if (itsModel == nullptr || batch == 1 || !threeStreams) {
    return alone(0, blocks.size());
  }
  bool ok = true;
  std::vector<vexlon_ip_corvane_inputs> inputs;
  std::vector<vexlon_ip_corvane_outputs> outputs;
  for (std::size_t first = 0; first < blocks.size(); first += batch) {
    const std::size_t last = std::min(first + batch, blocks.size());
    inputs.assign(last - first, vexlon_ip_corvane_inputs{});
    outputs.assign(last - first, vexlon_ip_corvane_outputs{});
    std::size_t bits = 0;
    for (std::size_t i = first; i < last; ++i) {
      bits += blocks[i][0].size();
    }
    itsBits.resize(bits);
    std::size_t offset = 0;
    for (std::size_t i = first; i < last; ++i) {
      // The model checks every length; a block it refuses sends the whole batch below.
      const std::vector<std::vector<std::int32_t>>& streams = blocks[i];
      const auto N = static_cast<std::uint32_t>(streams[0].size());
      vexlon_ip_corvane_inputs& in = inputs[i - first];
      in.block_size = N >= 4 ? N - 4 : 0;
      in.iterations = iterations;
      in.num_code_blocks = 1;
      in.systematic = streams[0].data();
      in.systematic_size = N;
      in.parity_1 = streams[1].data();
      in.parity_1_size = static_cast<std::uint32_t>(streams[1].size());
      in.parity_2 = streams[2].data();
      in.parity_2_size = static_cast<std::uint32_t>(streams[2].size());
      outputs[i - first].bits = itsBits.data() + offset;
      outputs[i - first].bits_capacity = in.block_size;
      offset += N;
    }
    const std::int32_t code = vexlon_ip_corvane_bitacc_simulate_batch(
        itsModel, inputs.data(), static_cast<std::uint32_t>(inputs.size()), outputs.data());
    if (code != 0) {
      ok = alone(first, last) && ok;  // each block then says what is wrong with it
      continue;
    }
    for (std::size_t i = first; i < last; ++i) {
      const vexlon_ip_corvane_outputs& o = outputs[i - first];
      out[i].assign(o.bits, o.bits + std::min(o.bits_stored, o.bits_capacity));
    }
  }
  return ok;
}

}  // namespace brannoc
