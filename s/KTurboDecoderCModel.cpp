// KTurboDecoderCModel: the adapter to the turbo-decoder model library. The model state is
// rebuilt on every change of the generics; each code block is copied once into plain arrays
// from the C allocator, which the library reads, and released before return.
#include "KTurboDecoderCModel.h"

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

KTurboDecoderCModel::KTurboDecoderCModel() : itsGenerics(vexlon_ip_corvane_get_default_generics()) {
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

bool KTurboDecoderCModel::setNumPU(std::uint32_t numPU) {
  itsGenerics.processing_units = numPU;
  return createModel(itsGenerics);
}

bool KTurboDecoderCModel::setAlgorithmType(std::uint32_t type) {
  itsGenerics.algorithm = type;
  return createModel(itsGenerics);
}

bool KTurboDecoderCModel::setExtrinsicBits(std::uint32_t bits) {
  itsGenerics.extrinsic_bits = bits;
  return createModel(itsGenerics);
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

}  // namespace brannoc
