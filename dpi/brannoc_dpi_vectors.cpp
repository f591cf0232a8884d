// Vector files (docs/vector-files.md, written by `brannoc gen`) for SystemVerilog test
// benches: a file read into a chandle, loaded into a decoder handle's next call, and its
// expected results read back value by value. Links the reader library brannoc_vectors.
#include <cstdint>
#include <cstdio>
#include <new>
#include <optional>
#include <string>

#include "VectorFile.h"

extern "C" {
// From brannoc_dpi.cpp.
void brannoc_dpi_sch_begin(void* h);
void brannoc_dpi_sch_set_field(void* h, int index, unsigned value);
void brannoc_dpi_sch_push_llr(void* h, int value);
void brannoc_dpi_sch_push_harq(void* h, int stream, int value);
void brannoc_dpi_cch_begin(void* h);
void brannoc_dpi_cch_set_field(void* h, int index, unsigned value);
void brannoc_dpi_cch_push_llr(void* h, int value);
const vexlon_ip_brannoc_SCH_outputs* brannoc_dpi_sch_last(void* h, std::int32_t* status);
const vexlon_ip_brannoc_CCH_outputs* brannoc_dpi_cch_last(void* h, std::int32_t* status);
}

namespace {

namespace vf = brannoc::vectors;

vf::Vector* vector(void* v) { return static_cast<vf::Vector*>(v); }

// Expected array which: pusch 0 data, 1 CQI, 2 ACK, 3 RI; pucch 0 CQI, 1 ACK.
const std::optional<vf::Bits>* expected(void* v, int which) {
  const vf::Vector& x = *vector(v);
  if (x.channel == vf::Channel::Shared) {
    const std::optional<vf::Bits>* arrays[] = {&x.shared.data, &x.shared.cqi, &x.shared.ack,
                                               &x.shared.ri};
    return which >= 0 && which < 4 ? arrays[which] : nullptr;
  }
  const std::optional<vf::Bits>* arrays[] = {&x.control.cqi, &x.control.ack};
  return which >= 0 && which < 2 ? arrays[which] : nullptr;
}

}  // namespace

extern "C" {

// Reads a vector file; null, after one line "FILE:LINE: what was expected", when it cannot.
void* brannoc_dpi_vector_read(const char* path) {
  auto* v = new (std::nothrow) vf::Vector;
  if (v == nullptr || path == nullptr) {
    delete v;
    return nullptr;
  }
  const std::string problem = vf::readVectorFile(path, *v);
  if (!problem.empty()) {
    std::fprintf(stderr, "%s\n", problem.c_str());
    delete v;
    return nullptr;
  }
  return v;
}

void brannoc_dpi_vector_free(void* v) { delete vector(v); }

// 0 shared channel (PUSCH), 1 control channel (PUCCH).
int brannoc_dpi_vector_channel(void* v) {
  return v != nullptr && vector(v)->channel == vf::Channel::Control ? 1 : 0;
}

// Generics word 0..3 (C_NUM_PU, C_ALGORITHM_TYPE, C_INTERLEAVER_BUFFER_SIZE, C_NUM_CQI_PU).
unsigned brannoc_dpi_vector_generic(void* v, int index) {
  return v != nullptr && index >= 0 && index < 4 ? (&vector(v)->generics.C_NUM_PU)[index] : 0;
}

// Control field index of the vector's call.
unsigned brannoc_dpi_vector_field(void* v, int index) {
  if (v == nullptr) return 0;
  const vf::Vector& x = *vector(v);
  if (x.channel == vf::Channel::Shared) {
    return index >= 0 && index < 23 ? (&x.shared.control.SCH_CQI_IP_SIZE)[index] : 0;
  }
  return index >= 0 && index < 5 ? (&x.control.control.CCH_UCI_OP_SIZE)[index] : 0;
}

// Makes the vector's call the decoder handle's next call: control fields, soft values and,
// with load_harq set, the file's HARQ inputs (a test bench keeping its own HARQ buffers
// passes 0 and calls brannoc_dpi_sch_keep_harq instead).
void brannoc_dpi_vector_load(void* v, void* decoder, int load_harq) {
  if (v == nullptr || decoder == nullptr) return;
  const vf::Vector& x = *vector(v);
  if (x.channel == vf::Channel::Shared) {
    brannoc_dpi_sch_begin(decoder);
    for (int k = 0; k < 23; ++k) {
      brannoc_dpi_sch_set_field(decoder, k, (&x.shared.control.SCH_CQI_IP_SIZE)[k]);
    }
    for (const std::int32_t value : x.shared.llr) brannoc_dpi_sch_push_llr(decoder, value);
    for (int s = 0; s < 3 && load_harq != 0; ++s) {
      for (const std::int32_t value : x.shared.harq[s])
        brannoc_dpi_sch_push_harq(decoder, s, value);
    }
  } else {
    brannoc_dpi_cch_begin(decoder);
    for (int k = 0; k < 5; ++k) {
      brannoc_dpi_cch_set_field(decoder, k, (&x.control.control.CCH_UCI_OP_SIZE)[k]);
    }
    for (const std::int32_t value : x.control.llr) brannoc_dpi_cch_push_llr(decoder, value);
  }
}

// Length of expected array which (see above), or -1 when the file expects nothing there.
int brannoc_dpi_vector_expected_size(void* v, int which) {
  const std::optional<vf::Bits>* e = v != nullptr ? expected(v, which) : nullptr;
  return e != nullptr && e->has_value() ? static_cast<int>((*e)->size()) : -1;
}

int brannoc_dpi_vector_expected_bit(void* v, int which, int i) {
  if (i < 0 || i >= brannoc_dpi_vector_expected_size(v, which)) return 0;
  return (**expected(v, which))[static_cast<std::size_t>(i)];
}

// The file's HARQ input: its length per stream, and value i of stream 0, 1 or 2.
int brannoc_dpi_vector_harq_size(void* v) {
  return v != nullptr ? static_cast<int>(vector(v)->shared.harq[0].size()) : 0;
}

int brannoc_dpi_vector_harq(void* v, int stream, int i) {
  if (v == nullptr || stream < 0 || stream > 2 || i < 0 ||
      i >= static_cast<int>(vector(v)->shared.harq[stream].size())) {
    return 0;
  }
  return vector(v)->shared.harq[stream][static_cast<std::size_t>(i)];
}

// Writes the decoder handle's last shared-channel (shared 1) or control-channel (0) call to
// path in the output-file format of `brannoc decode --out`; 1 when written, 0 (after one
// line) when not.
int brannoc_dpi_write_output(void* decoder, int shared, const char* path) {
  std::int32_t status = -1;
  std::string text;
  if (shared != 0) {
    const vexlon_ip_brannoc_SCH_outputs* out = brannoc_dpi_sch_last(decoder, &status);
    if (out != nullptr) text = vf::formatSharedOutput(status, *out);
  } else {
    const vexlon_ip_brannoc_CCH_outputs* out = brannoc_dpi_cch_last(decoder, &status);
    if (out != nullptr) text = vf::formatControlOutput(status, *out);
  }
  if (text.empty() || path == nullptr) {
    return 0;
  }
  const std::string problem = vf::writeTextFile(path, text);
  if (!problem.empty()) {
    std::fprintf(stderr, "%s\n", problem.c_str());
    return 0;
  }
  return 1;
}

}  // extern "C"
