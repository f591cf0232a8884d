// The C side of the SystemVerilog DPI-C bridge (brannoc_dpi_pkg.sv): an instance of the
// decoder library behind a chandle, with the soft values of one call pushed value by value
// and the results read back value by value. Only scalar DPI arguments (int, int unsigned,
// byte, string, chandle) are used, which every IEEE 1800 simulator passes the same way.
//
// A handle holds the instance, the inputs of the next call and the outputs of the last one:
// nothing is shared between handles, and the layer keeps no state of its own.
#include <algorithm>
#include <array>
#include <cstdint>
#include <new>
#include <string>
#include <vector>

#include "vexlon_ip_brannoc_bitacc_cmodel.h"

namespace {

struct SchCall {
  vexlon_ip_brannoc_SCH_controlData control{};
  std::vector<std::int32_t> llr;
  std::array<std::vector<std::int32_t>, 3> harqIn;
  // Outputs of the last call.
  std::int32_t status = -1;
  std::vector<std::uint8_t> data, ack, ri, cqi, cw;
  std::array<std::vector<std::int32_t>, 3> harqOut;
  vexlon_ip_brannoc_SCH_outputs outputs{};
};

struct CchCall {
  vexlon_ip_brannoc_CCH_controlData control{};
  std::vector<std::int32_t> llr;
  std::int32_t status = -1;
  std::array<std::uint8_t, 16> cqi{};
  std::array<std::uint8_t, 4> ack{};
  vexlon_ip_brannoc_CCH_outputs outputs{};
};

// The most soft values one array of a call may be given: far above any call the library
// accepts (about 150,000 soft values), low enough that a runaway loop cannot exhaust memory.
constexpr std::size_t kMaxPushed = std::size_t{1} << 20;

struct Handle {
  vexlon_ip_brannoc_state* state = nullptr;
  SchCall sch;
  CchCall cch;
  bool overflowed = false;  // more values pushed than kMaxPushed
};

// Every function refuses a null handle (a test bench that did not get one from
// brannoc_dpi_create): the simulate functions with the library's null-state codes.
Handle* handle(void* h) { return static_cast<Handle*>(h); }

template <typename T>
void push(Handle* h, std::vector<T>& values, T value) {
  if (values.size() < kMaxPushed) {
    values.push_back(value);
  } else {
    h->overflowed = true;
  }
}

template <typename T>
T at(const std::vector<T>& v, int i) {
  return i >= 0 && static_cast<std::size_t>(i) < v.size() ? v[static_cast<std::size_t>(i)] : T{};
}

// Room for the HARQ output of a transport block of tbSize bits: the sum of K + 4 over its
// code blocks is below tbSize + 24 bits of CRC, 28 more per code block (a CRC and the tail)
// for at most 44 blocks, and under 64 filler bits.
std::uint32_t harqRoom(std::uint32_t tbSize) { return tbSize + 24 + 44 * 28 + 64; }

}  // namespace

extern "C" {

void* brannoc_dpi_create(int num_pu, int algorithm, int interleaver_buffer_size, int num_cqi_pu) {
  const vexlon_ip_brannoc_generics generics{
      static_cast<std::uint32_t>(num_pu), static_cast<std::uint32_t>(algorithm),
      static_cast<std::uint32_t>(interleaver_buffer_size), static_cast<std::uint32_t>(num_cqi_pu)};
  vexlon_ip_brannoc_state* state = vexlon_ip_brannoc_create_state(generics);
  if (state == nullptr) {
    return nullptr;
  }
  Handle* h = new (std::nothrow) Handle;
  if (handle(h) == nullptr) {
    vexlon_ip_brannoc_destroy_state(state);
    return nullptr;
  }
  h->state = state;
  return h;
}

void brannoc_dpi_destroy(void* h) {
  if (Handle* x = handle(h)) {
    vexlon_ip_brannoc_destroy_state(x->state);
    delete x;
  }
}

int brannoc_dpi_set_dump(void* h, int key, int channel, const char* prefix) {
  if (handle(h) == nullptr || prefix == nullptr) {
    return 0;
  }
  const std::string name(prefix);
  return static_cast<int>(IUO_set_debugfn_state(handle(h)->state, static_cast<std::uint32_t>(key),
                                                static_cast<std::uint32_t>(channel), name.data(),
                                                static_cast<std::uint32_t>(name.size())));
}

// --- Shared channel ------------------------------------------------------------------------

// Clears the inputs of the next shared-channel call (control fields 0, no soft values, no
// HARQ input).
void brannoc_dpi_sch_begin(void* h) {
  if (handle(h) == nullptr) return;
  SchCall& c = handle(h)->sch;
  c.control = {};
  c.llr.clear();
  for (auto& stream : c.harqIn) stream.clear();
  handle(h)->overflowed = false;
}

// Sets control field index (0 SCH_CQI_IP_SIZE ... 22 SCH_TAG, in the order of the C record).
void brannoc_dpi_sch_set_field(void* h, int index, unsigned value) {
  if (handle(h) == nullptr || index < 0 || index > 22) return;
  (&handle(h)->sch.control.SCH_CQI_IP_SIZE)[index] = value;
}

void brannoc_dpi_sch_push_llr(void* h, int value) {
  if (Handle* x = handle(h)) push(x, x->sch.llr, std::int32_t{value});
}

// Appends a value to input HARQ stream 0 (systematic), 1 or 2 (parities).
void brannoc_dpi_sch_push_harq(void* h, int stream, int value) {
  Handle* x = handle(h);
  if (x != nullptr && stream >= 0 && stream < 3)
    push(x, x->sch.harqIn[stream], std::int32_t{value});
}

// The last call's HARQ output becomes the next call's HARQ input (a retransmission); call it
// after brannoc_dpi_sch_begin, which clears the HARQ input.
void brannoc_dpi_sch_keep_harq(void* h) {
  if (handle(h) == nullptr) return;
  SchCall& c = handle(h)->sch;
  for (std::size_t s = 0; s < 3; ++s) {
    c.harqIn[s].assign(c.harqOut[s].begin(),
                       c.harqOut[s].begin() + std::min<std::size_t>(c.outputs.harq_buffer_out_size,
                                                                    c.harqOut[s].size()));
  }
}

// Decodes with the pushed inputs; the library's status (0 on success): 101 for a null
// handle, 164 (the inputs could not be cached) when more values were pushed than
// kMaxPushed. The output arrays have room for what the control fields ask for.
int brannoc_dpi_sch_run(void* h) {
  if (handle(h) == nullptr) return 101;
  SchCall& c = handle(h)->sch;
  if (handle(h)->overflowed) {
    c.status = 164;
    c.outputs = {};
    return c.status;
  }
  const std::uint32_t harq = std::max<std::uint32_t>(
      harqRoom(c.control.SCH_TBSIZE), static_cast<std::uint32_t>(c.harqIn[0].size()));
  c.data.assign(std::max<std::uint32_t>(c.control.SCH_TBSIZE, 1), 0);
  c.ack.assign(4, 0);
  c.ri.assign(4, 0);
  c.cqi.assign(128, 0);
  c.cw.assign(64, 0);
  for (auto& stream : c.harqOut) stream.assign(std::max<std::uint32_t>(harq, 1), 0);
  c.outputs = {};
  c.outputs.SCH_data_out = c.data.data();
  c.outputs.SCH_ACK_out = c.ack.data();
  c.outputs.SCH_RI_out = c.ri.data();
  c.outputs.SCH_CQI_out = c.cqi.data();
  c.outputs.CW_CRC_out = c.cw.data();
  c.outputs.sys_harq_buffer = c.harqOut[0].data();
  c.outputs.p0_harq_buffer = c.harqOut[1].data();
  c.outputs.p1_harq_buffer = c.harqOut[2].data();
  c.outputs.max_harq_buffer_size = harq;
  c.outputs.max_SCH_data_out_size = static_cast<std::uint32_t>(c.data.size());
  c.outputs.max_SCH_ACK_out_size = 4;
  c.outputs.max_SCH_RI_out_size = 4;
  c.outputs.max_SCH_CQI_out_size = 128;
  c.outputs.max_CW_CRC_out_size = 64;
  const auto ptr = [](const std::vector<std::int32_t>& v) {
    return v.empty() ? nullptr : v.data();
  };
  const vexlon_ip_brannoc_SCH_inputs inputs{ptr(c.llr),
                                            ptr(c.harqIn[0]),
                                            ptr(c.harqIn[1]),
                                            ptr(c.harqIn[2]),
                                            static_cast<std::uint32_t>(c.llr.size()),
                                            static_cast<std::uint32_t>(c.harqIn[0].size()),
                                            c.control};
  c.status = vexlon_ip_brannoc_SCH_bitacc_simulate(handle(h)->state, inputs, &c.outputs);
  return c.status;
}

// Sizes of the last call's outputs: 0 data, 1 CQI, 2 ACK, 3 RI, 4 code-block flags, 5 HARQ.
int brannoc_dpi_sch_size(void* h, int which) {
  if (handle(h) == nullptr) return 0;
  const vexlon_ip_brannoc_SCH_outputs& o = handle(h)->sch.outputs;
  const std::uint32_t sizes[] = {o.SCH_data_out_size, o.SCH_CQI_out_size, o.SCH_ACK_out_size,
                                 o.SCH_RI_out_size,   o.CW_CRC_out_size,  o.harq_buffer_out_size};
  return which >= 0 && which < 6 ? static_cast<int>(sizes[which]) : 0;
}

// Bit i of output which (0 data, 1 CQI, 2 ACK, 3 RI, 4 code-block flags).
int brannoc_dpi_sch_bit(void* h, int which, int i) {
  if (handle(h) == nullptr) return 0;
  const SchCall& c = handle(h)->sch;
  const std::vector<std::uint8_t>* bits[] = {&c.data, &c.cqi, &c.ack, &c.ri, &c.cw};
  return which >= 0 && which < 5 && i < brannoc_dpi_sch_size(h, which) ? at(*bits[which], i) : 0;
}

// Value i of HARQ output stream 0, 1 or 2.
int brannoc_dpi_sch_harq(void* h, int stream, int i) {
  if (handle(h) == nullptr || stream < 0 || stream > 2 || i >= brannoc_dpi_sch_size(h, 5)) return 0;
  return at(handle(h)->sch.harqOut[stream], i);
}

// Flags of the last call: 0 transport-block CRC failed, 1 CQI CRC failed, 2 ACK parity,
// 3 RI parity; 4 the tag.
unsigned brannoc_dpi_sch_flag(void* h, int which) {
  if (handle(h) == nullptr) return 0;
  const vexlon_ip_brannoc_SCH_outputs& o = handle(h)->sch.outputs;
  const unsigned flags[] = {o.SCH_TB_crc_error, o.SCH_CQI_crc_error, o.SCH_ACK_parity_error,
                            o.SCH_RI_parity_error, o.SCH_TAG_out};
  return which >= 0 && which < 5 ? flags[which] : 0;
}

// --- Control channel -----------------------------------------------------------------------

void brannoc_dpi_cch_begin(void* h) {
  if (handle(h) == nullptr) return;
  handle(h)->cch.control = {};
  handle(h)->cch.llr.clear();
  handle(h)->overflowed = false;
}

// Sets control field index (0 CCH_UCI_OP_SIZE ... 4 CCH_TAG).
void brannoc_dpi_cch_set_field(void* h, int index, unsigned value) {
  if (handle(h) == nullptr || index < 0 || index > 4) return;
  (&handle(h)->cch.control.CCH_UCI_OP_SIZE)[index] = value;
}

void brannoc_dpi_cch_push_llr(void* h, int value) {
  if (Handle* x = handle(h)) push(x, x->cch.llr, std::int32_t{value});
}

// The library's status: 500 for a null handle, 507 (the soft values could not
// be cached) when more values were pushed than kMaxPushed.
int brannoc_dpi_cch_run(void* h) {
  if (handle(h) == nullptr) return 500;
  CchCall& c = handle(h)->cch;
  if (handle(h)->overflowed) {
    c.status = 507;
    c.outputs = {};
    return c.status;
  }
  c.outputs = {c.cqi.data(), c.ack.data(), 16, 4, 0, 0, 0};
  const vexlon_ip_brannoc_CCH_inputs inputs{c.llr.empty() ? nullptr : c.llr.data(),
                                            static_cast<std::uint32_t>(c.llr.size()), c.control};
  c.status = vexlon_ip_brannoc_CCH_bitacc_simulate(handle(h)->state, inputs, &c.outputs);
  return c.status;
}

// Sizes of the last call's outputs: 0 CQI, 1 ACK.
int brannoc_dpi_cch_size(void* h, int which) {
  if (handle(h) == nullptr) return 0;
  const vexlon_ip_brannoc_CCH_outputs& o = handle(h)->cch.outputs;
  return which == 0   ? static_cast<int>(o.CCH_data_out_size)
         : which == 1 ? static_cast<int>(o.CCH_ACK_out_size)
                      : 0;
}

// Bit i of output which (0 CQI, 1 ACK).
int brannoc_dpi_cch_bit(void* h, int which, int i) {
  if (handle(h) == nullptr || i < 0 || i >= brannoc_dpi_cch_size(h, which)) return 0;
  const CchCall& c = handle(h)->cch;
  return which == 0 ? c.cqi[static_cast<std::size_t>(i)] : c.ack[static_cast<std::size_t>(i)];
}

unsigned brannoc_dpi_cch_tag(void* h) {
  return handle(h) == nullptr ? 0 : handle(h)->cch.outputs.CCH_TAG_out;
}

// The last call's status and outputs record (for brannoc_dpi_vectors.cpp, which writes them
// as an output file); null for a bad handle.
const vexlon_ip_brannoc_SCH_outputs* brannoc_dpi_sch_last(void* h, std::int32_t* status) {
  if (handle(h) == nullptr) return nullptr;
  *status = handle(h)->sch.status;
  return &handle(h)->sch.outputs;
}

const vexlon_ip_brannoc_CCH_outputs* brannoc_dpi_cch_last(void* h, std::int32_t* status) {
  if (handle(h) == nullptr) return nullptr;
  *status = handle(h)->cch.status;
  return &handle(h)->cch.outputs;
}

}  // extern "C"
