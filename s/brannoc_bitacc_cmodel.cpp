// The exported C interface of the decoder library: default generics, the generics check
// that every instance must pass, instance lifecycle and the two simulate calls.
// Every failure prints one line "File: ../s/brannoc_bitacc_cmodel.cpp(<line>)<message>",
// the line being that of the reporting statement in this file.
#include <algorithm>
#include <cstdlib>
#include <exception>
#include <new>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "KDeSegment3GPPLTE.h"
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

// ---------------------------------------------------------------------------------------------
// Shared-channel call
// ---------------------------------------------------------------------------------------------

// What the control fields imply: modulation order, interleaver columns, the expected HARQ
// buffer length of each stream, and G, the rate-matched data soft values of all code blocks.
constexpr std::uint32_t kMaxTransportBlock = 262143;

struct SchShape {
  std::uint32_t Qm = 0;
  std::uint32_t columns = 0;
  std::uint64_t harqLength = 0;
  std::uint64_t G = 0;
};

SchShape schShape(const vexlon_ip_brannoc_SCH_controlData& c) {
  SchShape shape;
  shape.Qm = c.SCH_QAM == 0 ? 2 : (c.SCH_QAM == 1 ? 4 : 6);
  shape.columns = c.SCH_CP == 0 ? 12 : 10;
  if (c.SCH_TBSIZE > kMaxTransportBlock) {
    return shape;  // refused by the field checks before anything reads the shape
  }
  brannoc::KDeSegment3GPPLTE segmentation;
  segmentation.setTBSize(c.SCH_TBSIZE);
  const brannoc::segmentationParams seg = segmentation.getSegmentationParams();
  if (c.SCH_TBSIZE != 0) {
    shape.harqLength =
        (std::uint64_t{seg.Kplus} + 4) * seg.Cplus + (std::uint64_t{seg.Kminus} + 4) * seg.Cminus;
  }
  // Blocks 0 .. SCH_RM_E_IDX take SCH_RM_E_MINUS soft values, the others SCH_RM_E_PLUS.
  const std::uint64_t minusBlocks =
      std::min<std::uint64_t>(seg.C, std::uint64_t{c.SCH_RM_E_IDX} + 1);
  shape.G = minusBlocks * c.SCH_RM_E_MINUS + (seg.C - minusBlocks) * c.SCH_RM_E_PLUS;
  return shape;
}

constexpr std::uint64_t kNoValue = ~std::uint64_t{0};

// One argument check of the shared-channel call: its outcome, status code and the message
// after "ERROR:decoder:Simulate called with ", with up to two values (first, then the
// separator and second).
struct FieldCheck {
  bool failed;
  std::int32_t code;
  const char* message;
  std::uint64_t first = kNoValue;
  const char* separator = nullptr;
  std::uint64_t second = kNoValue;
};

// The argument checks in their order; the first that fails, if any.
std::optional<FieldCheck> firstFailedCheck(const vexlon_ip_brannoc_SCH_inputs& in,
                                           const vexlon_ip_brannoc_SCH_outputs& out,
                                           const SchShape& shape) {
  const vexlon_ip_brannoc_SCH_controlData& c = in.controlData;
  const bool data = (c.SCH_IP_DATA_TYPE & 1) != 0;
  const bool cqi = (c.SCH_IP_DATA_TYPE & 2) != 0;
  const bool ack = (c.SCH_IP_DATA_TYPE & 4) != 0;
  const bool ri = (c.SCH_IP_DATA_TYPE & 8) != 0;
  const bool newData = c.SCH_ND == 1;
  const FieldCheck checks[] = {
      {c.SCH_CQI_IP_SIZE > 4095, 103, "inputs.controlData.SCH_CQI_IP_SIZE>4095"},
      {c.SCH_CQI_OP_SIZE > 127, 104, "inputs.controlData.SCH_CQI_OP_SIZE>127"},
      {c.SCH_CQI_IP_SIZE < c.SCH_CQI_OP_SIZE, 105,
       "inputs.controlData.SCH_CQI_IP_SIZE<SCH_CQI_OP_SIZE"},
      {cqi && c.SCH_CQI_OP_SIZE == 0, 106,
       "SCH_IP_DATA_TYPE=CQI and inputs.controlData.SCH_CQI_OP_SIZE=0"},
      {c.SCH_IP_DATA_TYPE > 15, 107, "inputs.controlData.SCH_IP_DATA_TYPE>15"},
      {c.SCH_ACK_IP_SIZE > 255, 108, "inputs.controlData.SCH_ACK_IP_SIZE>255"},
      {c.SCH_ACK_OP_SIZE > 2, 109, "inputs.controlData.SCH_ACK_OP_SIZE>2"},
      {c.SCH_ACK_IP_SIZE < c.SCH_ACK_OP_SIZE, 110,
       "inputs.controlData.SCH_ACK_IP_SIZE<SCH_ACK_OP_SIZE"},
      {ack && c.SCH_ACK_OP_SIZE == 0, 111,
       "SCH_IP_DATA_TYPE=ACK and inputs.controlData.SCH_ACK_OP_SIZE=0"},
      {c.SCH_RI_IP_SIZE > 255, 112, "inputs.controlData.SCH_RI_IP_SIZE>255"},
      {c.SCH_RI_OP_SIZE > 2, 113, "inputs.controlData.SCH_RI_OP_SIZE>2"},
      {c.SCH_RI_IP_SIZE < c.SCH_RI_OP_SIZE, 114,
       "inputs.controlData.SCH_RI_IP_SIZE<SCH_RI_OP_SIZE"},
      {ri && c.SCH_RI_OP_SIZE == 0, 115,
       "SCH_IP_DATA_TYPE=RI and inputs.controlData.SCH_RI_OP_SIZE=0"},
      {c.SCH_RM_E_IDX > 127, 116, "inputs.controlData.SCH_RM_E_IDX>127"},
      {c.SCH_CH_INT_ROWS > 2047, 117, "inputs.controlData.SCH_CH_INT_ROWS>2047"},
      {c.SCH_CH_INT_ROWS == 0, 118, "inputs.controlData.SCH_CH_INT_ROWS=0"},
      {c.SCH_CP > 1, 120, "inputs.controlData.SCH_CP>1"},
      {c.SCH_RM_E_MINUS > 65535, 121, "inputs.controlData.SCH_RM_E_MINUS>65535"},
      {c.SCH_RM_E_PLUS > 65535, 122, "inputs.controlData.SCH_RM_E_PLUS>65535"},
      {data && c.SCH_RM_E_MINUS == 0, 123,
       "SCH_IP_DATA_TYPE=DATA and inputs.controlData.SCH_RM_E_MINUS=0"},
      {c.SCH_TBSIZE > kMaxTransportBlock, 124, "inputs.controlData.SCH_TBSIZE>262143"},
      {data && c.SCH_TBSIZE == 0, 125, "SCH_IP_DATA_TYPE=DATA and inputs.controlData.SCH_TBSIZE=0"},
      {c.SCH_TD_ITER > 15, 127, "inputs.controlData.SCH_TD_ITER>15"},
      {data && c.SCH_TD_ITER == 0, 128,
       "SCH_IP_DATA_TYPE=DATA and inputs.controlData.SCH_TD_ITER=0"},
      {c.SCH_QAM > 2, 129, "inputs.controlData.SCH_QAM>2 = ", c.SCH_QAM, ""},
      {c.SCH_USER_ID > 65535, 130, "inputs.controlData.SCH_USER_ID>65535"},
      {c.SCH_SFRM > 15, 131, "inputs.controlData.SCH_SFRM>15"},
      {c.SCH_HARQ_SFRM > 15, 132, "inputs.controlData.SCH_HARQ_SFRM>15"},
      {c.SCH_RV > 3, 133, "inputs.controlData.SCH_RV>3"},
      {c.SCH_ND > 1, 134, "inputs.controlData.SCH_ND>1"},
      {c.SCH_HFC > 1, 135, "inputs.controlData.SCH_HFC>1"},
      {c.SCH_TD_FLUSH > 1, 167, "inputs.controlData.SCH_TD_FLUSH>1"},
      {out.SCH_data_out == nullptr, 136, "null pointer for outputs->SCH_data_out"},
      {out.SCH_ACK_out == nullptr, 137, "null pointer for outputs->SCH_ACK_out"},
      {out.SCH_RI_out == nullptr, 138, "null pointer for outputs->SCH_RI_out"},
      {out.sys_harq_buffer == nullptr, 139, "null pointer for outputs->sys_harq_buffer"},
      {out.p0_harq_buffer == nullptr, 140, "null pointer for outputs->p0_harq_buffer"},
      {out.p1_harq_buffer == nullptr, 141, "null pointer for outputs->p1_harq_buffer"},
      // Arrays that would be written but cannot be: CQI bits, and the code-block flags of a
      // transmission with data soft values.
      {out.SCH_CQI_out == nullptr && c.SCH_CQI_OP_SIZE != 0, 168,
       "null pointer for outputs->SCH_CQI_out"},
      {out.CW_CRC_out == nullptr && shape.G != 0, 169, "null pointer for outputs->CW_CRC_out"},
      {out.max_SCH_data_out_size < c.SCH_TBSIZE, 142,
       "outputs->max_SCH_data_out_size < inputs.controlData.SCH_TBSIZE"},
      {out.max_SCH_ACK_out_size < c.SCH_ACK_OP_SIZE, 143,
       "outputs->max_SCH_ACK_out_size < inputs.controlData.SCH_ACK_OP_SIZE"},
      {out.max_SCH_RI_out_size < c.SCH_RI_OP_SIZE, 144,
       "outputs->max_SCH_RI_out_size < inputs.controlData.SCH_RI_OP_SIZE"},
      {out.max_SCH_CQI_out_size < c.SCH_CQI_OP_SIZE, 145,
       "outputs->max_SCH_CQI_out_size < inputs.controlData.SCH_CQI_OP_SIZE"},
      {out.max_harq_buffer_size < in.harq_buffer_size, 146,
       "outputs->max_harq_buffer_size < inputs.harq_buffer_size ", out.max_harq_buffer_size, " < ",
       in.harq_buffer_size},
      {in.tb_llr == nullptr, 147, "null pointer for inputs.tb_llr"},
      {in.sys_harq_buffer == nullptr && !newData, 148,
       "null pointer for inputs.sys_harq_buffer and not new data"},
      {in.p0_harq_buffer == nullptr && !newData, 149,
       "null pointer for inputs.p0_harq_buffer and not new data"},
      {in.p1_harq_buffer == nullptr && !newData, 150,
       "null pointer for inputs.p1_harq_buffer and not new data"},
  };
  for (const FieldCheck& check : checks) {
    if (check.failed) {
      return check;
    }
  }
  return std::nullopt;
}

// The size checks between the fields, the generics and the segmentation; 0 when they pass.
std::int32_t checkSizes(const vexlon_ip_brannoc_SCH_inputs& in,
                        const vexlon_ip_brannoc_SCH_outputs& out, const SchShape& shape,
                        const vexlon_ip_brannoc_generics& generics) {
  const vexlon_ip_brannoc_SCH_controlData& c = in.controlData;
  const std::uint64_t matrix = std::uint64_t{shape.Qm} * c.SCH_CH_INT_ROWS * shape.columns;
  if (c.SCH_CP == 0 && in.llr_size != matrix) {
    brannoc::errorLineFile(kSource, __LINE__, "ERROR:decoder:llr_size (", in.llr_size,
                           ") must be same size as inputs.controlData.SCH_CH_INT_ROWS*Columns*Qm (",
                           c.SCH_CH_INT_ROWS, " * 12)");
    return 151;
  }
  if (c.SCH_CP == 1 && in.llr_size != matrix) {
    brannoc::errorLineFile(kSource, __LINE__, "ERROR:decoder:llr_size (", in.llr_size,
                           ") must be same size as inputs.controlData.SCH_CH_INT_ROWS*Columns*Qm (",
                           c.SCH_CH_INT_ROWS, " * 10 * ", shape.Qm, ")");
    return 152;
  }
  if (in.llr_size / shape.Qm > generics.C_INTERLEAVER_BUFFER_SIZE) {
    brannoc::errorLineFile(
        kSource, __LINE__,
        "ERROR:decoder:Simulate called with Input SCH block larger than input buffer size");
    return 166;
  }
  if (out.max_harq_buffer_size < shape.harqLength) {
    brannoc::errorLineFile(
        kSource, __LINE__,
        "ERROR:decoder:outputs.max_harq_out_size is not correct based on ControlData fields ",
        out.max_harq_buffer_size, " /= ", shape.harqLength);
    return 153;
  }
  if (c.SCH_ND == 0 && in.harq_buffer_size != shape.harqLength) {
    brannoc::errorLineFile(
        kSource, __LINE__,
        "ERROR:decoder:harq_buffer_size is not correct based on ControlData fields ",
        in.harq_buffer_size, " /= ", shape.harqLength);
    return 154;
  }
  return 0;
}

// Copies the decoded results into the caller's arrays, each checked against its capacity
// first; 0, or the code of the first result that does not fit.
std::int32_t copySchResults(const brannoc::KLTE_PUSCH_Decoding::SCHResults& results,
                            const vexlon_ip_brannoc_SCH_controlData& c,
                            vexlon_ip_brannoc_SCH_outputs& out) {
  if (!results.tbOut.empty()) {
    const std::size_t n = results.harqOut[0].size();
    if (n > out.max_harq_buffer_size) {
      brannoc::errorLineFile(kSource, __LINE__, "ERROR:decoder:Insufficient allocated space (",
                             out.max_harq_buffer_size, ") for SCH HARQ Data output array (", n,
                             ")");
      return 300;
    }
    std::int32_t* const targets[3] = {out.sys_harq_buffer, out.p0_harq_buffer, out.p1_harq_buffer};
    for (std::size_t s = 0; s < 3; ++s) {
      std::copy_n(results.harqOut[s].begin(), std::min(n, results.harqOut[s].size()), targets[s]);
    }
    out.harq_buffer_out_size = static_cast<std::uint32_t>(n);
  }
  struct BitsCopy {
    const std::vector<std::uint8_t>& bits;
    std::uint8_t* target;
    std::uint32_t capacity;
    std::uint32_t* size;
    std::int32_t code;
    const char* message;
  };
  const BitsCopy copies[] = {
      {results.tbOut, out.SCH_data_out, out.max_SCH_data_out_size, &out.SCH_data_out_size, 301,
       "ERROR:decoder:Insufficient allocated space for SCH Data output array"},
      {results.cqiOut, out.SCH_CQI_out, out.max_SCH_CQI_out_size, &out.SCH_CQI_out_size, 302,
       "ERROR:decoder:Insufficient allocated space for SCH CQI Data output array"},
      {results.ackOut, out.SCH_ACK_out, out.max_SCH_ACK_out_size, &out.SCH_ACK_out_size, 303,
       "ERROR:decoder:Insufficient allocated space for SCH ACK Data output array"},
      {results.riOut, out.SCH_RI_out, out.max_SCH_RI_out_size, &out.SCH_RI_out_size, 304,
       "ERROR:decoder:Insufficient allocated space for SCH RI Data output array"},
  };
  for (const BitsCopy& copy : copies) {
    if (copy.bits.size() > copy.capacity) {
      brannoc::errorLineFile(kSource, __LINE__, copy.message);
      return copy.code;
    }
    std::copy(copy.bits.begin(), copy.bits.end(), copy.target);
    *copy.size = static_cast<std::uint32_t>(copy.bits.size());
  }
  if (results.crc_CWs.size() > out.max_CW_CRC_out_size) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:decoder:Insufficient allocated space for CW CRC output array");
    return 305;
  }
  out.SCH_TB_crc_error = results.tbCrcPass == 0 ? 1 : 0;
  for (std::size_t i = 0; i < results.crc_CWs.size(); ++i) {
    out.CW_CRC_out[i] = results.crc_CWs[i] == 0 ? 1 : 0;
  }
  out.SCH_CQI_crc_error = results.cqiCrcPass == 0 ? 1 : 0;
  out.SCH_ACK_parity_error = results.ackFlag;
  out.SCH_RI_parity_error = results.riFlag;
  out.CW_CRC_out_size = static_cast<std::uint32_t>(results.crc_CWs.size());
  out.SCH_TAG_out = c.SCH_TAG;
  return 0;
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
                                              vexlon_ip_brannoc_SCH_inputs inputs,
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
  const vexlon_ip_brannoc_SCH_controlData& c = inputs.controlData;
  const SchShape shape = schShape(c);
  if (const std::optional<FieldCheck> failed = firstFailedCheck(inputs, *outputs, shape)) {
    if (failed->separator == nullptr) {
      brannoc::errorLineFile(kSource, __LINE__, "ERROR:decoder:Simulate called with ",
                             failed->message);
    } else if (failed->second == kNoValue) {
      brannoc::errorLineFile(kSource, __LINE__, "ERROR:decoder:Simulate called with ",
                             failed->message, failed->first);
    } else {
      brannoc::errorLineFile(kSource, __LINE__, "ERROR:decoder:Simulate called with ",
                             failed->message, failed->first, failed->separator, failed->second);
    }
    return failed->code;
  }
  if (std::int32_t code = checkSizes(inputs, *outputs, shape, state->generics); code != 0) {
    return code;
  }

  brannoc::KLTE_PUSCH_Decoding& decoder = *state->pusch_decoder;
  if (!decoder.turboDecoder().setNumPU(state->generics.C_NUM_PU)) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:decoder:Failed to setup Turbo Decoder Number Processing Units ");
    return 155;
  }
  if (!decoder.turboDecoder().setAlgorithmType(state->generics.C_ALGORITHM_TYPE)) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:decoder:Failed to setup Turbo Decoder Algorithm Type ");
    return 156;
  }
  if (!decoder.setTurboIterations(static_cast<std::int32_t>(c.SCH_TD_ITER))) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:decoder:Failed to setup Turbo Decoder Iterations ");
    return 157;
  }
  decoder.setCallIdentifiers(c.SCH_USER_ID, c.SCH_HFC != 0, c.SCH_SFRM);
  if (inputs.llr_size != std::uint64_t{shape.G} + c.SCH_CQI_IP_SIZE + c.SCH_RI_IP_SIZE) {
    brannoc::errorLineFile(
        kSource, __LINE__, "ERROR:decoder:llr_size must be same size as g+CQI_Q+RI_Q : ", shape.G,
        " + ", c.SCH_CQI_IP_SIZE, " + ", c.SCH_RI_IP_SIZE, " != ", inputs.llr_size);
    return 158;
  }
  if (!decoder.setModulationParams(inputs.llr_size, shape.Qm, 1, c.SCH_CP)) {
    brannoc::errorLineFile(kSource, __LINE__, "Error: UNABLE TO SET TX SCH PARAMETERS");
    return 159;
  }
  if (!decoder.setTransportBlockParams(c.SCH_TBSIZE, shape.G, 0, c.SCH_RV, c.SCH_TD_FLUSH)) {
    brannoc::errorLineFile(kSource, __LINE__, "Error: UNABLE TO SET TX SCH DATA PARAMETERS");
    return 160;
  }
  if (!decoder.setCQIParams(c.SCH_CQI_OP_SIZE, c.SCH_CQI_IP_SIZE, state->generics.C_NUM_CQI_PU)) {
    brannoc::errorLineFile(kSource, __LINE__, "Error: UNABLE TO SET TX SCH CQI PARAMETERS");
    return 161;
  }
  if (!decoder.setACKParams(c.SCH_ACK_OP_SIZE, c.SCH_ACK_IP_SIZE)) {
    brannoc::errorLineFile(kSource, __LINE__, "Error: UNABLE TO SET TX SCH ACK PARAMETERS");
    return 162;
  }
  if (!decoder.setRIParams(c.SCH_RI_OP_SIZE, c.SCH_RI_IP_SIZE)) {
    brannoc::errorLineFile(kSource, __LINE__, "Error: UNABLE TO SET TX SCH RI PARAMETERS");
    return 163;
  }

  brannoc::KLTE_PUSCH_Decoding::CallBuffers& buffers = decoder.callBuffers();
  if (!cacheInput(inputs.tb_llr, inputs.llr_size, buffers.llr)) {
    brannoc::errorLineFile(
        kSource, __LINE__,
        "ERROR:decoder:Out of memory caching input vector. Size expected:", inputs.llr_size);
    return 164;
  }
  // A first transmission never reads the caller's HARQ input: its three streams stay empty.
  const bool retransmission = c.SCH_ND == 0;
  brannoc::KLTE_PUSCH_Decoding::Streams& harqIn = buffers.harqIn;
  harqIn.resize(3);
  if (!retransmission) {
    for (std::vector<std::int32_t>& stream : harqIn) {
      stream.clear();
    }
  } else if ((!cacheInput(inputs.sys_harq_buffer, inputs.harq_buffer_size, harqIn[0]) ||
              !cacheInput(inputs.p0_harq_buffer, inputs.harq_buffer_size, harqIn[1]) ||
              !cacheInput(inputs.p1_harq_buffer, inputs.harq_buffer_size, harqIn[2]))) {
    brannoc::errorLineFile(kSource, __LINE__,
                           "ERROR:decoder:Out of memory caching input vector. Size expected:",
                           inputs.harq_buffer_size);
    return 165;
  }

  brannoc::KLTE_PUSCH_Decoding::SCHResults& results = buffers.results;
  results.tbCrcPass = 1;  // no transport block decoded: no transport-block CRC failed
  results.crc_CWs.clear();
  results.ackFlag = results.riFlag = results.cqiCrcPass = 0;
  bool decoded = false;
  try {
    decoded = decoder.decodeSCH(retransmission, buffers.llr, harqIn, results);
  } catch (...) {
    reportUnhandledException();
    return 999;
  }
  if (!decoded) {
    brannoc::errorLineFile(
        kSource, __LINE__,
        retransmission ? "Error: Could not decode SCH with HARQ" : "Error: Could not decode SCH");
    return retransmission ? 201 : 200;
  }
  return copySchResults(results, c, *outputs);
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
