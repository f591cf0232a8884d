// The exported C interface of the decoder library: default generics, the generics check
// that every instance must pass, instance lifecycle and the two simulate calls.
// Every failure prints one line "File: ../s/brannoc_bitacc_cmodel.cpp(<line>)<message>",
// the line being that of the reporting statement in this file.
#include "vexlon_ip_brannoc_bitacc_cmodel.h"

#include <cstdlib>

#include "errorLine.h"

namespace {

constexpr std::string_view kSource = "../s/brannoc_bitacc_cmodel.cpp";

// The four generics are checked in this order; the first failure is reported.
bool checkGenerics(const vexlon_ip_brannoc_generics& generics) {
  if (generics.C_NUM_CQI_PU < 1 || generics.C_NUM_CQI_PU > 4) {
    brannoc::errorLineFile(kSource, __LINE__, "ERROR:encoder:C_NUM_CQI_PU must be 1, 2, 3 or 4.");
    return false;
  }
  const std::uint32_t numPU = generics.C_NUM_PU;
  if (numPU != 1 && numPU != 2 && numPU != 4 && numPU != 8) {
    brannoc::errorLineFile(kSource, __LINE__, "ERROR:encoder:C_NUM_PU must be 1, 2, 4 or 8.");
    return false;
  }
  if (generics.C_ALGORITHM_TYPE > 2) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:encoder:C_ALGORITHM_TYPE must be 0 or 1 or 2.");
    return false;
  }
  if (generics.C_INTERLEAVER_BUFFER_SIZE != 18432 && generics.C_INTERLEAVER_BUFFER_SIZE != 36864) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:encoder:C_INTERLEAVER_BUFFER_SIZE must be 18432 or 36864.");
    return false;
  }
  return true;
}

}  // namespace

// The instance: a copy of the generics and the two decoder objects it owns.
struct vexlon_ip_brannoc_state {
  vexlon_ip_brannoc_generics generics;
};

extern "C" {

vexlon_ip_brannoc_generics vexlon_ip_brannoc_get_default_generics(void) {
  vexlon_ip_brannoc_generics generics;
  generics.C_NUM_PU = 2;
  generics.C_ALGORITHM_TYPE = 1;
  generics.C_INTERLEAVER_BUFFER_SIZE = 36864;
  generics.C_NUM_CQI_PU = 1;
  return generics;
}

vexlon_ip_brannoc_state* vexlon_ip_brannoc_create_state(vexlon_ip_brannoc_generics generics) {
  if (!checkGenerics(generics)) {
    return nullptr;
  }
  // The PUSCH and PUCCH decoder objects are not part of this build yet, so no instance can
  // be made: report it as the failure of the decoder factory.
  brannoc::errorLineFile(kSource, __LINE__, "ERROR:decoder:Could not create decoder");
  return nullptr;
}

void vexlon_ip_brannoc_destroy_state(vexlon_ip_brannoc_state* state) {
  if (state == nullptr) {
    return;
  }
  std::free(state);
}

int32_t vexlon_ip_brannoc_SCH_bitacc_simulate(vexlon_ip_brannoc_state* state,
                                              vexlon_ip_brannoc_SCH_inputs /*inputs*/,
                                              vexlon_ip_brannoc_SCH_outputs* outputs) {
  if (state == nullptr) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:decoder:Simulate called with null state structure");
    return 101;
  }
  if (outputs == nullptr) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:decoder:Simulate called with null output structure");
    return 102;
  }
  brannoc::errorLineFile(kSource, __LINE__, "Error: Could not decode SCH");
  return 200;
}

int32_t vexlon_ip_brannoc_CCH_bitacc_simulate(vexlon_ip_brannoc_state* state,
                                              vexlon_ip_brannoc_CCH_inputs /*inputs*/,
                                              vexlon_ip_brannoc_CCH_outputs* outputs) {
  if (state == nullptr) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:PUCCH decoder:Simulate called with null state structure");
    return 500;
  }
  if (outputs == nullptr) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:PUCCH decoder:Simulate called with null output structure");
    return 501;
  }
  brannoc::errorLineFile(kSource, __LINE__, "Error: Could not decode CCH");
  return 600;
}

uint32_t IUO_set_debugfn_state(vexlon_ip_brannoc_state* state, uint32_t key, uint32_t channel,
                               const char* name, uint32_t nameLength) {
  if (key > 32 || channel > 1) {
    return 0;
  }
  if (state == nullptr || (name == nullptr && nameLength != 0)) {
    return 0;
  }
  return 1;
}

}  // extern "C"
