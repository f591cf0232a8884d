// Failure paths that only an allocation or a turbo-model failure reaches: this program
// replaces the global operator new (and, outside the sanitizer build, malloc) and stands in
// front of the turbo-decoder model's create function, each able to fail on request. Every
// path must give its status code and line, return nothing half-made and leak nothing (the
// sanitizer build checks the leaks).
#include <dlfcn.h>
#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <functional>
#include <new>
#include <string>
#include <vector>

#include "../decoder/DecoderTestSupport.h"
#include "KLTE_PUCCH_Decoding.h"
#include "KLTE_PUSCH_Decoding.h"
#include "vexlon_ip_corvane_bitacc_cmodel.h"

namespace {

// The next allocations of exactly gFailSize bytes fail once gSkip of them have passed.
std::atomic<std::size_t> gFailSize{0};
std::atomic<int> gSkip{0};
// The next gCorvaneCreations turbo-model creations succeed, the one after fails.
std::atomic<int> gCorvaneCreations{-1};

bool failHere(std::size_t n) {
  if (n == 0 || n != gFailSize.load()) {
    return false;
  }
  if (gSkip.fetch_sub(1) > 0) {
    return false;
  }
  gFailSize = 0;
  return true;
}

void failAllocation(std::size_t bytes, int skip = 0) {
  gSkip = skip;
  gFailSize = bytes;
}

}  // namespace

void* operator new(std::size_t n) {
  if (failHere(n)) {
    throw std::bad_alloc();
  }
  if (void* p = std::malloc(n == 0 ? 1 : n)) {
    return p;
  }
  throw std::bad_alloc();
}
void* operator new(std::size_t n, const std::nothrow_t&) noexcept {
  return failHere(n) ? nullptr : std::malloc(n == 0 ? 1 : n);
}

// The replaced operator new takes its memory from malloc, so free releases it.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wmismatched-new-delete"
void operator delete(void* p) noexcept { std::free(p); }
void operator delete(void* p, std::size_t) noexcept { std::free(p); }
#pragma GCC diagnostic pop

#if !defined(__SANITIZE_ADDRESS__)
extern "C" void* __libc_malloc(std::size_t);
std::atomic<std::size_t> gFailMallocSize{0};
extern "C" void* malloc(std::size_t n) {
  std::size_t armed = n;
  if (n != 0 && gFailMallocSize.compare_exchange_strong(armed, 0)) {
    return nullptr;
  }
  return __libc_malloc(n);
}
#endif

extern "C" vexlon_ip_corvane_state* vexlon_ip_corvane_create_state(
    vexlon_ip_corvane_generics generics) {
  using Create = vexlon_ip_corvane_state* (*)(vexlon_ip_corvane_generics);
  static const auto real =
      reinterpret_cast<Create>(dlsym(RTLD_NEXT, "vexlon_ip_corvane_create_state"));
  if (gCorvaneCreations.load() == 0) {
    gCorvaneCreations = -1;
    return nullptr;
  }
  if (gCorvaneCreations.load() > 0) {
    --gCorvaneCreations;
  }
  return real(generics);
}

namespace brannoc::test {
namespace {

const std::string kIf = "File: ../s/brannoc_bitacc_cmodel.cpp(#)";
const std::string kUnhandled = kIf + "ERROR:decoder:Unhandled exception has occurred\n";

vexlon_ip_brannoc_state* createDefault() {
  return vexlon_ip_brannoc_create_state(vexlon_ip_brannoc_get_default_generics());
}

TEST(CreateStateFaults, EveryFailureGivesNullAndItsLine) {
  vexlon_ip_brannoc_state* state = nullptr;
#if !defined(__SANITIZE_ADDRESS__)
  gFailMallocSize = sizeof(vexlon_ip_brannoc_generics) + 2 * sizeof(void*);
  expectLines(stderrOf([&] { state = createDefault(); }),
              kIf + "ERROR:encoder:Could not allocate memory for dec state\n");
  EXPECT_EQ(state, nullptr);
  gFailMallocSize = 0;
#endif
  // Either decoder object's allocation throwing: the partly made instance is destroyed.
  for (const std::size_t bytes : {sizeof(KLTE_PUSCH_Decoding), sizeof(KLTE_PUCCH_Decoding)}) {
    failAllocation(bytes);
    expectLines(stderrOf([&] { state = createDefault(); }), kUnhandled);
    EXPECT_EQ(state, nullptr);
  }
  // A turbo model that cannot be made is reported, and the instance is still made: each
  // shared-channel call makes the model again.
  gCorvaneCreations = 0;
  expectLines(stderrOf([&] { state = createDefault(); }),
              "File: ../s/KTurboDecoderCModel(84)ERROR:KTurboDecoderCModel:Could not create "
              "decoder model\n");
  EXPECT_NE(state, nullptr);
  vexlon_ip_brannoc_destroy_state(state);
}

// The data-only call of TB 1000 (one block, HARQ length 1028), QPSK, 50 rows, 1200 values.
struct DataCall {
  std::vector<std::int32_t> llr = std::vector<std::int32_t>(1200, 20);
  std::vector<std::int32_t> harq = std::vector<std::int32_t>(1028, 0);
  std::vector<std::uint8_t> bits = std::vector<std::uint8_t>(1000);
  std::vector<std::int32_t> harqOut[3] = {std::vector<std::int32_t>(1028),
                                          std::vector<std::int32_t>(1028),
                                          std::vector<std::int32_t>(1028)};
  std::uint8_t small[8] = {};
  vexlon_ip_brannoc_SCH_inputs inputs{
      llr.data(), harq.data(), harq.data(), harq.data(), 1200, 1028, {0,    0, 1,  0, 0,    0,
                                                                      0,    0, 50, 0, 1200, 1200,
                                                                      1000, 8, 0,  0, 0,    0,
                                                                      0,    1, 0,  0, 7}};
  vexlon_ip_brannoc_SCH_outputs outputs = makeOutputs();

  vexlon_ip_brannoc_SCH_outputs makeOutputs() {
    vexlon_ip_brannoc_SCH_outputs o{};
    o.SCH_data_out = bits.data();
    o.SCH_ACK_out = o.SCH_RI_out = o.SCH_CQI_out = o.CW_CRC_out = small;
    o.sys_harq_buffer = harqOut[0].data();
    o.p0_harq_buffer = harqOut[1].data();
    o.p1_harq_buffer = harqOut[2].data();
    o.max_harq_buffer_size = 1028;
    o.max_SCH_data_out_size = 1000;
    o.max_SCH_ACK_out_size = o.max_SCH_RI_out_size = o.max_SCH_CQI_out_size = 2;
    o.max_CW_CRC_out_size = 8;
    return o;
  }

};

struct SchFault {
  const char* name;
  std::function<void()> arm;
  bool retransmission;
  std::int32_t status;
  std::string lines;
  // The instance's turbo units and algorithm: a call makes the turbo model again only for a
  // value other than the model's (2 units and algorithm 1 at first).
  std::uint32_t numPU = 2;
  std::uint32_t algorithm = 1;
};

class SharedChannelFaults : public testing::TestWithParam<SchFault> {};

TEST_P(SharedChannelFaults, GiveTheirCodeAndLine) {
  const SchFault& f = GetParam();
  vexlon_ip_brannoc_generics generics = vexlon_ip_brannoc_get_default_generics();
  generics.C_NUM_PU = f.numPU;
  generics.C_ALGORITHM_TYPE = f.algorithm;
  Instance instance(generics);
  DataCall call;
  call.inputs.controlData.SCH_ND = f.retransmission ? 0 : 1;
  std::int32_t status = -1;
  const std::string err = stderrOf([&] {
    f.arm();
    status = vexlon_ip_brannoc_SCH_bitacc_simulate(instance.get(), call.inputs, &call.outputs);
  });
  gFailSize = 0;
  gCorvaneCreations = -1;
  EXPECT_EQ(status, f.status);
  expectLines(err, f.lines);
  EXPECT_EQ(call.outputs.SCH_TAG_out, 0u);
}

const std::string kModelFailed =
    "File: ../s/KTurboDecoderCModel(117)ERROR:KTurboDecoderCModel:Could not create decoder model\n";

INSTANTIATE_TEST_SUITE_P(
    Allocation, SharedChannelFaults,
    testing::Values(
        SchFault{"ModelForUnits", [] { gCorvaneCreations = 0; }, false, 155,
                 kModelFailed + kIf +
                     "ERROR:decoder:Failed to setup Turbo Decoder Number Processing Units \n",
                 4, 1},
        SchFault{"ModelForAlgorithm", [] { gCorvaneCreations = 0; }, false, 156,
                 kModelFailed + kIf +
                     "ERROR:decoder:Failed to setup Turbo Decoder Algorithm Type \n",
                 2, 2},
        SchFault{"Llr", [] { failAllocation(1200 * sizeof(std::int32_t)); }, false, 164,
                 kIf + "ERROR:decoder:Out of memory caching input vector. Size expected:1200\n"},
        SchFault{"Harq", [] { failAllocation(1028 * sizeof(std::int32_t), 1); }, true, 165,
                 kIf + "ERROR:decoder:Out of memory caching input vector. Size expected:1028\n"},
        // The LLR cache, then the deinterleaver's CQI-and-data stream inside the decode.
        SchFault{"InsideDecode", [] { failAllocation(1200 * sizeof(std::int32_t), 1); }, false, 999,
                 kUnhandled}),
    [](const testing::TestParamInfo<SchFault>& info) { return std::string(info.param.name); });

TEST(ControlChannelFaults, AllocationFailuresGiveTheirCodes) {
  Instance instance;
  std::vector<std::int32_t> llr(22, 30);
  std::uint8_t cqi[13] = {};
  std::uint8_t ack[2] = {};
  const vexlon_ip_brannoc_CCH_inputs inputs{llr.data(), 22, {13, 0, 2, 1, 5}};
  vexlon_ip_brannoc_CCH_outputs outputs{cqi, ack, 13, 2, 0, 0, 0};
  std::int32_t status = -1;
  std::string err = stderrOf([&] {
    failAllocation(22 * sizeof(std::int32_t));
    status = vexlon_ip_brannoc_CCH_bitacc_simulate(instance.get(), inputs, &outputs);
  });
  EXPECT_EQ(status, 507);
  expectLines(err, kIf + "ERROR:decoder:Out of memory caching input vector. Size expected:22\n");
  // The 20-value codeword taken out inside the decode.
  err = stderrOf([&] {
    failAllocation(20 * sizeof(std::int32_t));
    status = vexlon_ip_brannoc_CCH_bitacc_simulate(instance.get(), inputs, &outputs);
  });
  gFailSize = 0;
  EXPECT_EQ(status, 999);
  expectLines(err, kUnhandled);
  EXPECT_EQ(outputs.CCH_TAG_out, 0u);
}

}  // namespace
}  // namespace brannoc::test
