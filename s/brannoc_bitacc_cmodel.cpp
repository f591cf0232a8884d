// The exported C interface of the decoder library: default generics, the generics check
// that every instance must pass, instance lifecycle and the two simulate calls.
// Every failure prints one line "File: ../s/brannoc_bitacc_cmodel.cpp(<line>)<message>",
// the line being that of the reporting statement in this file.
#include <cstdlib>
#include <exception>
#include <new>
#include <stdexcept>
#include <string>
#include <vector>

#include "KLTE_PUCCH_Decoding.h"
#include "KLTE_PUSCH_Decoding.h"
#include "errorLine.h"
#include "vexlon_ip_brannoc_bitacc_cmodel.h"

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

// Copies count values of a caller's array into a new vector; false when the vector cannot be
// had (allocation failure, or a length beyond what the container can hold).
template <typename T>
bool cacheInput(const T* values, std::uint32_t count, std::vector<T>& cached) {
  try {
    cached.assign(values, values + count);
  } catch (const std::bad_alloc&) {
    return false;
  } catch (const std::length_error&) {
    return false;
  }
  return true;
}

void reportUnhandledException() {
  brannoc::errorLineFile(kSource, __LINE__, "ERROR:decoder:Unhandled exception has occurred");
}

// Makes one of the instance's decoder objects through its factory; false, after one line,
// when the factory gives no object or throws.
template <typename Decoder>
bool createDecoder(Decoder*& decoder) {
  try {
    decoder = Decoder::create(std::string()).release();
  } catch (...) {
    reportUnhandledException();
    return false;
  }
  if (decoder == nullptr) {
    brannoc::errorLineFile(kSource, __LINE__, "ERROR:decoder:Could not create decoder");
    return false;
  }
  return true;
}

}  // namespace

// The instance: a copy of the generics and the two decoder objects it owns. The record comes
// from the C heap (a plain record: no constructor or destructor runs on it).
struct vexlon_ip_brannoc_state {
  vexlon_ip_brannoc_generics generics;
  brannoc::KLTE_PUSCH_Decoding* pusch_decoder;
  brannoc::KLTE_PUCCH_Decoding* pucch_decoder;
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
  auto* state = static_cast<vexlon_ip_brannoc_state*>(std::malloc(sizeof(vexlon_ip_brannoc_state)));
  if (state == nullptr) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:encoder:Could not allocate memory for dec state");
    return nullptr;
  }
  state->generics = generics;
  state->pusch_decoder = nullptr;
  state->pucch_decoder = nullptr;
  if (!createDecoder(state->pusch_decoder) || !createDecoder(state->pucch_decoder)) {
    vexlon_ip_brannoc_destroy_state(state);
    return nullptr;
  }
  return state;
}

void vexlon_ip_brannoc_destroy_state(vexlon_ip_brannoc_state* state) {
  if (state == nullptr) {
    return;
  }
  delete state->pusch_decoder;
  state->pusch_decoder = nullptr;
  delete state->pucch_decoder;
  state->pucch_decoder = nullptr;
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
                                              vexlon_ip_brannoc_CCH_inputs inputs,
                                              vexlon_ip_brannoc_CCH_outputs* outputs) {
  const vexlon_ip_brannoc_CCH_controlData& control = inputs.controlData;
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
  if (control.CCH_UCI_OP_SIZE > 13) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:PUCCH decoder:Simulate called with "
                           "inputs.controlData.CCH_UCI_OP_SIZE>13");
    return 502;
  }
  if (control.CCH_CP > 1) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:PUCCH decoder:Simulate called with inputs.controlData.CCH_CP>1");
    return 503;
  }
  if (control.CCH_ACK_OP_SIZE > 2) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:PUCCH decoder:Simulate called with "
                           "inputs.controlData.CCH_ACK_OP_SIZE>2");
    return 504;
  }
  if (control.CCH_USER_ID > 65535) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:PUCCH decoder:Simulate called with "
                           "inputs.controlData.CCH_USER_ID>65535");
    return 505;
  }
  // Arrays the call would read or write but cannot: refused before the decoder is touched.
  if (inputs.llr == nullptr && inputs.llr_size != 0) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:PUCCH decoder:Simulate called with null pointer for inputs.llr");
    return 508;
  }
  if (outputs->CCH_data_out == nullptr && control.CCH_UCI_OP_SIZE != 0) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:PUCCH decoder:Simulate called with null pointer for "
                           "outputs->CCH_data_out");
    return 509;
  }
  if (outputs->CCH_ACK_out == nullptr && control.CCH_ACK_OP_SIZE != 0) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:PUCCH decoder:Simulate called with null pointer for "
                           "outputs->CCH_ACK_out");
    return 510;
  }
  brannoc::KLTE_PUCCH_Decoding& decoder = *state->pucch_decoder;
  decoder.setUserId(control.CCH_USER_ID);
  if (!decoder.setCCHParams(control.CCH_UCI_OP_SIZE, control.CCH_ACK_OP_SIZE, control.CCH_CP,
                            state->generics.C_NUM_CQI_PU)) {
    brannoc::errorLineFile(kSource, __LINE__, "Error: UNABLE TO SET CCH PARAMETERS");
    return 506;
  }
  std::vector<std::int32_t> llr;
  if (!cacheInput(inputs.llr, inputs.llr_size, llr)) {
    brannoc::errorLineFile(
        kSource, __LINE__,
        "ERROR:decoder:Out of memory caching input vector. Size expected:", inputs.llr_size);
    return 507;
  }
  std::vector<std::uint8_t> ackBits;
  std::vector<std::uint8_t> cqiBits;
  bool decoded = false;
  try {
    decoded = decoder.decodeCCH(llr, ackBits, cqiBits);
  } catch (...) {
    reportUnhandledException();
    return 999;
  }
  if (!decoded) {
    brannoc::errorLineFile(kSource, __LINE__, "Error: Could not decode CCH");
    return 600;
  }
  if (cqiBits.size() > outputs->max_CCH_data_out_size) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:decoder:Insufficient allocated space for CCH Data output array");
    return 701;
  }
  std::copy(cqiBits.begin(), cqiBits.end(), outputs->CCH_data_out);
  outputs->CCH_data_out_size = static_cast<std::uint32_t>(cqiBits.size());
  if (ackBits.size() > outputs->max_CCH_ACK_out_size) {
    brannoc::errorLineFile(
        kSource, __LINE__,
        "ERROR:decoder:Insufficient allocated space for CCH ACK Data output array");
    return 702;
  }
  std::copy(ackBits.begin(), ackBits.end(), outputs->CCH_ACK_out);
  outputs->CCH_ACK_out_size = static_cast<std::uint32_t>(ackBits.size());
  outputs->CCH_TAG_out = control.CCH_TAG;
  return 0;
}

uint32_t IUO_set_debugfn_state(vexlon_ip_brannoc_state* state, uint32_t key, uint32_t channel,
                               const char* name, uint32_t nameLength) {
  if (key > 32 || channel > 1) {
    return 0;
  }
  // Nothing to switch on, or no name to read: refused like a key out of range.
  if (state == nullptr || (name == nullptr && nameLength != 0)) {
    return 0;
  }
  try {
    const std::string prefix(name == nullptr ? "" : name, nameLength);
    if (channel == 0) {
      state->pusch_decoder->openDumpFile(key, channel, prefix);
    } else {
      state->pucch_decoder->openDumpFile(key, channel, prefix);
    }
  } catch (...) {
    reportUnhandledException();
  }
  return 1;
}

}  // extern "C"
