// Fuzzer calls of the two simulate functions: reading, writing, consistency and the checks
// every call must pass.
#include "FuzzCalls.h"

#include <algorithm>
#include <map>
#include <memory>

#include "KDeSegment3GPPLTE.h"

namespace brannoc::fuzz {

namespace {

[[noreturn]] void violated() { __builtin_trap(); }

void check(bool condition) {
  if (!condition) {
    violated();
  }
}

std::uint32_t capped(std::uint32_t n, std::uint32_t cap) { return n < cap ? n : cap; }

constexpr std::uint32_t kNumPU[] = {1, 2, 4, 8};

// Null-pointer bits of a shared-channel call.
enum NullBit : std::uint16_t {
  kNullLlr = 1 << 0,
  kNullSysIn = 1 << 1,
  kNullP0In = 1 << 2,
  kNullP1In = 1 << 3,
  kNullData = 1 << 4,
  kNullAck = 1 << 5,
  kNullRi = 1 << 6,
  kNullCqi = 1 << 7,
  kNullSysOut = 1 << 8,
  kNullP0Out = 1 << 9,
  kNullP1Out = 1 << 10,
  kNullCw = 1 << 11,
  kNullOutputs = 1 << 12,
  kNullState = 1 << 13,
};

bool knownSchStatus(std::int32_t s) {
  return s == 0 || (s >= 101 && s <= 169 && s != 119 && s != 126) || s == 200 || s == 201 ||
         (s >= 300 && s <= 305);
}

}  // namespace

vexlon_ip_brannoc_generics genericsFromByte(std::uint8_t g) {
  vexlon_ip_brannoc_generics generics;
  generics.C_NUM_PU = kNumPU[g & 3];
  generics.C_ALGORITHM_TYPE = ((g >> 2) & 3) == 3 ? 1 : (g >> 2) & 3;
  generics.C_INTERLEAVER_BUFFER_SIZE = (g & 0x10) != 0 ? 18432 : 36864;
  generics.C_NUM_CQI_PU = 1 + ((g >> 5) & 3);
  return generics;
}

std::uint8_t byteFromGenerics(const vexlon_ip_brannoc_generics& g) {
  const auto pu = static_cast<std::uint8_t>(
      std::find(std::begin(kNumPU), std::end(kNumPU), g.C_NUM_PU) - std::begin(kNumPU));
  return static_cast<std::uint8_t>((pu & 3) | (g.C_ALGORITHM_TYPE & 3) << 2 |
                                   (g.C_INTERLEAVER_BUFFER_SIZE == 18432 ? 0x10 : 0) |
                                   ((g.C_NUM_CQI_PU - 1) & 3) << 5);
}

SchCall SchCall::read(FuzzInput& in) {
  SchCall c;
  c.generics = genericsFromByte(in.byte());
  c.flags = in.byte();
  c.nulls = static_cast<std::uint16_t>(in.byte() | in.byte() << 8);
  std::uint32_t* fields = &c.control.SCH_CQI_IP_SIZE;
  for (int k = 0; k < 23; ++k) fields[k] = in.word();
  c.llrSize = capped(in.word(), kMaxSoftValues);
  c.harqSize = capped(in.word(), kMaxSoftValues);
  for (std::uint32_t& capacity : c.capacities) capacity = capped(in.word(), kMaxCapacity);
  c.keepShort();
  if ((c.flags & 2) != 0) {
    c.makeConsistent();
  }
  const bool wide = (c.flags & 1) != 0;
  c.llr = in.softValues(c.llrSize, wide);
  for (auto& stream : c.harqIn) stream = in.softValues(c.harqSize, wide);
  return c;
}

void SchCall::write(FuzzOutput& out) const {
  out.byte(byteFromGenerics(generics));
  out.byte(flags);
  out.byte(static_cast<std::uint8_t>(nulls));
  out.byte(static_cast<std::uint8_t>(nulls >> 8));
  const std::uint32_t* fields = &control.SCH_CQI_IP_SIZE;
  for (int k = 0; k < 23; ++k) out.word(fields[k]);
  out.word(llrSize);
  out.word(harqSize);
  for (const std::uint32_t capacity : capacities) out.word(capacity);
  out.softValues(llr, (flags & 1) != 0);
  for (const auto& stream : harqIn) out.softValues(stream, (flags & 1) != 0);
}

void SchCall::keepShort() {
  std::uint32_t& iterations = control.SCH_TD_ITER;
  if (iterations >= 1 && iterations <= 15) {
    iterations = 1 + (iterations - 1) % 2;
  }
  std::uint32_t& tb = control.SCH_TBSIZE;
  if (tb >= 1 && tb < 262000) {
    tb = 1 + (tb - 1) % 12288;
  }
}

void SchCall::makeConsistent() {
  vexlon_ip_brannoc_SCH_controlData& c = control;
  if (c.SCH_QAM > 2 || c.SCH_CP > 1 || c.SCH_CH_INT_ROWS == 0 || c.SCH_CH_INT_ROWS > 2047 ||
      c.SCH_TBSIZE > 262143) {
    return;
  }
  const std::uint32_t Qm = 2 + 2 * c.SCH_QAM;
  const std::uint32_t columns = c.SCH_CP == 0 ? 12 : 10;
  llrSize = capped(Qm * c.SCH_CH_INT_ROWS * columns, kMaxSoftValues);
  KDeSegment3GPPLTE segmentation;
  segmentation.setTBSize(c.SCH_TBSIZE);
  const segmentationParams seg = segmentation.getSegmentationParams();
  const std::uint64_t control = std::uint64_t{c.SCH_CQI_IP_SIZE} + c.SCH_RI_IP_SIZE;
  if (control <= llrSize && seg.C > 0) {
    // Blocks 0 .. SCH_RM_E_IDX = 0 take the remainder: G = E- + (C - 1) E+.
    const std::uint32_t G = llrSize - static_cast<std::uint32_t>(control);
    c.SCH_RM_E_IDX = 0;
    c.SCH_RM_E_PLUS = G / seg.C;
    c.SCH_RM_E_MINUS = G - (seg.C - 1) * c.SCH_RM_E_PLUS;
  }
  const std::uint32_t harqLength =
      c.SCH_TBSIZE == 0 ? 0 : (seg.Kplus + 4) * seg.Cplus + (seg.Kminus + 4) * seg.Cminus;
  harqSize = c.SCH_ND == 0 ? harqLength : harqSize;
  capacities[0] = std::max(capacities[0], std::max(harqLength, harqSize));
  capacities[1] = std::max(capacities[1], c.SCH_TBSIZE);
  capacities[2] = std::max(capacities[2], c.SCH_ACK_OP_SIZE);
  capacities[3] = std::max(capacities[3], c.SCH_RI_OP_SIZE);
  capacities[4] = std::max(capacities[4], c.SCH_CQI_OP_SIZE);
  capacities[5] = std::max(capacities[5], seg.C);
}

vexlon_ip_brannoc_state* instanceFor(const vexlon_ip_brannoc_generics& generics) {
  struct Instances {
    std::map<std::uint8_t, vexlon_ip_brannoc_state*> byGenerics;
    ~Instances() {
      for (const auto& entry : byGenerics) vexlon_ip_brannoc_destroy_state(entry.second);
    }
  };
  static Instances instances;
  vexlon_ip_brannoc_state*& state = instances.byGenerics[byteFromGenerics(generics)];
  if (state == nullptr) {
    state = vexlon_ip_brannoc_create_state(generics);
  }
  check(state != nullptr);
  return state;
}

void runAndCheck(const SchCall& call, vexlon_ip_brannoc_state* state) {
  // Each array exactly as large as declared, in its own allocation, up to 2^20 values: no
  // call may write more (a transport block has at most 262143 bits and 43 code blocks of
  // 6148 HARQ values), and a declared capacity of up to 2^32 - 1 must not make the harness
  // itself run out of memory.
  static constexpr std::uint32_t kLargestWrite = 1U << 20;
  const auto allocated = [](std::uint32_t capacity) { return std::min(capacity, kLargestWrite); };
  std::vector<std::int32_t> llr = call.llr;
  std::array<std::vector<std::int32_t>, 3> harqIn = call.harqIn;
  const auto& cap = call.capacities;
  std::vector<std::uint8_t> data(allocated(cap[1])), ack(allocated(cap[2])), ri(allocated(cap[3])),
      cqi(allocated(cap[4])), cw(allocated(cap[5]));
  std::array<std::vector<std::int32_t>, 3> harqOut{std::vector<std::int32_t>(allocated(cap[0])),
                                                   std::vector<std::int32_t>(allocated(cap[0])),
                                                   std::vector<std::int32_t>(allocated(cap[0]))};
  const auto ptr = [&call](auto& v, std::uint16_t bit) {
    return (call.nulls & bit) != 0 ? nullptr : v.data();
  };
  const vexlon_ip_brannoc_SCH_inputs inputs{ptr(llr, kNullLlr),
                                            ptr(harqIn[0], kNullSysIn),
                                            ptr(harqIn[1], kNullP0In),
                                            ptr(harqIn[2], kNullP1In),
                                            call.llrSize,
                                            call.harqSize,
                                            call.control};
  vexlon_ip_brannoc_SCH_outputs outputs{};
  outputs.SCH_data_out = ptr(data, kNullData);
  outputs.SCH_ACK_out = ptr(ack, kNullAck);
  outputs.SCH_RI_out = ptr(ri, kNullRi);
  outputs.SCH_CQI_out = ptr(cqi, kNullCqi);
  outputs.sys_harq_buffer = ptr(harqOut[0], kNullSysOut);
  outputs.p0_harq_buffer = ptr(harqOut[1], kNullP0Out);
  outputs.p1_harq_buffer = ptr(harqOut[2], kNullP1Out);
  outputs.CW_CRC_out = ptr(cw, kNullCw);
  outputs.max_harq_buffer_size = cap[0];
  outputs.max_SCH_data_out_size = cap[1];
  outputs.max_SCH_ACK_out_size = cap[2];
  outputs.max_SCH_RI_out_size = cap[3];
  outputs.max_SCH_CQI_out_size = cap[4];
  outputs.max_CW_CRC_out_size = cap[5];
  const std::int32_t status = vexlon_ip_brannoc_SCH_bitacc_simulate(
      (call.nulls & kNullState) != 0 ? nullptr : state, inputs,
      (call.nulls & kNullOutputs) != 0 ? nullptr : &outputs);
  check(knownSchStatus(status));
  check(outputs.harq_buffer_out_size <= cap[0] && outputs.SCH_data_out_size <= cap[1] &&
        outputs.SCH_ACK_out_size <= cap[2] && outputs.SCH_RI_out_size <= cap[3] &&
        outputs.SCH_CQI_out_size <= cap[4] && outputs.CW_CRC_out_size <= cap[5]);
  if (status == 0) {
    const vexlon_ip_brannoc_SCH_controlData& c = call.control;
    check(outputs.SCH_CQI_out_size == c.SCH_CQI_OP_SIZE &&
          outputs.SCH_ACK_out_size == c.SCH_ACK_OP_SIZE &&
          outputs.SCH_RI_out_size == c.SCH_RI_OP_SIZE && outputs.SCH_TAG_out == c.SCH_TAG);
    check(outputs.SCH_data_out_size == 0 || outputs.SCH_data_out_size == c.SCH_TBSIZE);
  }
}

CchCall CchCall::read(FuzzInput& in) {
  CchCall c;
  c.generics = genericsFromByte(in.byte());
  c.flags = in.byte();
  c.nulls = in.byte();
  std::uint32_t* fields = &c.control.CCH_UCI_OP_SIZE;
  for (int k = 0; k < 5; ++k) fields[k] = in.word();
  c.llrSize = capped(in.word(), 4096);
  c.maxData = capped(in.word(), 64);
  c.maxAck = capped(in.word(), 64);
  c.llr = in.softValues(c.llrSize, (c.flags & 1) != 0);
  return c;
}

void CchCall::write(FuzzOutput& out) const {
  out.byte(byteFromGenerics(generics));
  out.byte(flags);
  out.byte(nulls);
  const std::uint32_t* fields = &control.CCH_UCI_OP_SIZE;
  for (int k = 0; k < 5; ++k) out.word(fields[k]);
  out.word(llrSize);
  out.word(maxData);
  out.word(maxAck);
  out.softValues(llr, (flags & 1) != 0);
}

void runAndCheck(const CchCall& call, vexlon_ip_brannoc_state* state) {
  std::vector<std::int32_t> llr = call.llr;
  std::vector<std::uint8_t> data(call.maxData), ack(call.maxAck);
  vexlon_ip_brannoc_CCH_outputs outputs{(call.nulls & 2) != 0 ? nullptr : data.data(),
                                        (call.nulls & 4) != 0 ? nullptr : ack.data(),
                                        call.maxData,
                                        call.maxAck,
                                        0,
                                        0,
                                        0};
  const vexlon_ip_brannoc_CCH_inputs inputs{(call.nulls & 1) != 0 ? nullptr : llr.data(),
                                            call.llrSize, call.control};
  const std::int32_t status = vexlon_ip_brannoc_CCH_bitacc_simulate(
      (call.nulls & 16) != 0 ? nullptr : state, inputs, (call.nulls & 8) != 0 ? nullptr : &outputs);
  check(status == 0 || (status >= 500 && status <= 510) || status == 600 || status == 701 ||
        status == 702);
  check(outputs.CCH_data_out_size <= call.maxData && outputs.CCH_ACK_out_size <= call.maxAck);
  if (status == 0) {
    check(outputs.CCH_data_out_size == call.control.CCH_UCI_OP_SIZE &&
          outputs.CCH_ACK_out_size == call.control.CCH_ACK_OP_SIZE &&
          outputs.CCH_TAG_out == call.control.CCH_TAG);
  }
}

}  // namespace brannoc::fuzz
