// The shared-channel call through the exported C functions only: PUSCH transmissions from the
// transmitter decoded back (every modulation, cyclic prefix, redundancy version, code-block
// layout and UCI combination), HARQ combining across retransmissions, every status code with
// its line, dump records, and parallel instances.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <bitset>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <random>
#include <regex>
#include <string>
#include <thread>
#include <vector>

#include "DecoderTestSupport.h"
#include "tx/PuschTransmitter.h"

namespace brannoc::test {
namespace {

using tx::CyclicPrefix;

// One call's records and the arrays behind them, sized to what the control fields need.
struct SchCall {
  std::vector<std::int32_t> llr;
  std::array<std::vector<std::int32_t>, 3> harqIn;
  vexlon_ip_brannoc_SCH_controlData control{};
  std::uint32_t harqSize = 0;

  std::vector<std::uint8_t> data, ack, ri, cqi, cw;
  std::array<std::vector<std::int32_t>, 3> harqOut;
  vexlon_ip_brannoc_SCH_outputs outputs{};

  SchCall() = default;
  // A copy writes into its own arrays.
  SchCall(const SchCall& other) { *this = other; }
  SchCall& operator=(const SchCall& other) {
    llr = other.llr;
    harqIn = other.harqIn;
    control = other.control;
    harqSize = other.harqSize;
    data = other.data;
    ack = other.ack;
    ri = other.ri;
    cqi = other.cqi;
    cw = other.cw;
    harqOut = other.harqOut;
    outputs = other.outputs;
    bindArrays();
    return *this;
  }

  // Arrays with the capacities the fields ask for (at least one element each).
  void prepareOutputs(std::uint32_t harqCapacity) {
    const auto cap = [](std::uint32_t n) { return std::max<std::uint32_t>(n, 1); };
    data.assign(cap(control.SCH_TBSIZE), 9);
    ack.assign(cap(control.SCH_ACK_OP_SIZE), 9);
    ri.assign(cap(control.SCH_RI_OP_SIZE), 9);
    cqi.assign(cap(control.SCH_CQI_OP_SIZE), 9);
    cw.assign(64, 9);
    for (auto& h : harqOut) h.assign(cap(harqCapacity), 0);
    outputs = {};
    bindArrays();
    outputs.max_harq_buffer_size = harqCapacity;
    outputs.max_SCH_data_out_size = static_cast<std::uint32_t>(data.size());
    outputs.max_SCH_ACK_out_size = static_cast<std::uint32_t>(ack.size());
    outputs.max_SCH_RI_out_size = static_cast<std::uint32_t>(ri.size());
    outputs.max_SCH_CQI_out_size = static_cast<std::uint32_t>(cqi.size());
    outputs.max_CW_CRC_out_size = static_cast<std::uint32_t>(cw.size());
  }

  void bindArrays() {
    outputs.SCH_data_out = data.data();
    outputs.SCH_ACK_out = ack.data();
    outputs.SCH_RI_out = ri.data();
    outputs.SCH_CQI_out = cqi.data();
    outputs.sys_harq_buffer = harqOut[0].data();
    outputs.p0_harq_buffer = harqOut[1].data();
    outputs.p1_harq_buffer = harqOut[2].data();
    outputs.CW_CRC_out = cw.data();
  }

  // An empty array is passed as a null pointer.
  vexlon_ip_brannoc_SCH_inputs inputs() const {
    const auto ptr = [](const std::vector<std::int32_t>& v) {
      return v.empty() ? nullptr : v.data();
    };
    return {ptr(llr),
            ptr(harqIn[0]),
            ptr(harqIn[1]),
            ptr(harqIn[2]),
            static_cast<std::uint32_t>(llr.size()),
            harqSize,
            control};
  }

  std::int32_t run(vexlon_ip_brannoc_state* state) {
    return vexlon_ip_brannoc_SCH_bitacc_simulate(state, inputs(), &outputs);
  }

  // The next transmission of the same transport block, combined with this call's output.
  void keepHarqFor(SchCall& next) const {
    for (std::size_t s = 0; s < 3; ++s) {
      next.harqIn[s].assign(harqOut[s].begin(), harqOut[s].begin() + outputs.harq_buffer_out_size);
    }
    next.harqSize = outputs.harq_buffer_out_size;
    next.control.SCH_ND = 0;
  }

  std::vector<std::uint8_t> out(const std::vector<std::uint8_t>& a, std::uint32_t n) const {
    return {a.begin(), a.begin() + n};
  }
};

struct Scenario {
  std::uint32_t numPrb, Qm;
  CyclicPrefix cp;
  std::uint32_t tbSize, rv, cqiBits, ackBits, riBits;
};

tx::Bits randomBits(std::size_t n, std::mt19937& rng) {
  tx::Bits bits(n);
  for (auto& b : bits) b = rng() & 1;
  return bits;
}

struct Sent {
  tx::PuschPayload payload;
  SchCall call;
};

Sent transmit(const Scenario& s, const tx::ChannelSettings& channel, std::uint32_t seed) {
  std::mt19937 rng(seed);
  tx::PuschParameters p;
  p.numPrb = s.numPrb;
  p.Qm = s.Qm;
  p.cp = s.cp;
  p.tbSize = s.tbSize;
  p.rv = s.rv;
  p.cqiBits = s.cqiBits;
  p.ackBits = s.ackBits;
  p.riBits = s.riBits;
  p.cqi.betaIndex = 8;
  p.ack.betaIndex = 6;
  p.ri.betaIndex = 6;
  Sent sent;
  sent.payload = {randomBits(s.tbSize, rng), randomBits(s.cqiBits, rng), randomBits(s.ackBits, rng),
                  randomBits(s.riBits, rng)};
  tx::PuschTransmission t;
  const tx::TxOutcome outcome = tx::transmitPusch(p, sent.payload, channel, t);
  EXPECT_TRUE(outcome.ok()) << outcome.text;
  const tx::PuschControlFields& f = t.fields;
  SchCall& call = sent.call;
  call.llr = t.softValues;
  call.control = {f.Qcqi, f.cqiBits, f.contentMask, f.Qack,  f.ackBits, f.Qri, f.riBits,   f.Eidx,
                  f.Rmux, f.cpIndex, f.Eminus,      f.Eplus, f.tbSize,  8,     f.qamIndex, 0x1234,
                  5,      4,         f.rv,          1,       0,         0,     0xBEEF};
  call.prepareOutputs(f.harqBufferLength);
  return sent;
}

// The decoded results equal what was sent, with every check flag reporting success.
void expectDecodedAsSent(const Sent& sent, const SchCall& c, const std::string& what) {
  const vexlon_ip_brannoc_SCH_outputs& o = c.outputs;
  EXPECT_EQ(c.out(c.data, o.SCH_data_out_size), sent.payload.transportBlock) << what;
  EXPECT_EQ(c.out(c.cqi, o.SCH_CQI_out_size), sent.payload.cqi) << what;
  EXPECT_EQ(c.out(c.ack, o.SCH_ACK_out_size), sent.payload.ack) << what;
  EXPECT_EQ(c.out(c.ri, o.SCH_RI_out_size), sent.payload.ri) << what;
  EXPECT_EQ(o.SCH_TB_crc_error, 0) << what;
  EXPECT_EQ(o.SCH_CQI_crc_error, sent.payload.cqi.empty() ? 1 : 0) << what;
  EXPECT_EQ(o.SCH_ACK_parity_error, 0) << what;
  EXPECT_EQ(o.SCH_RI_parity_error, 0) << what;
  EXPECT_EQ(o.SCH_TAG_out, 0xBEEFu) << what;
  // A lone code block has no CRC of its own and reports 1; segmented blocks report 0.
  const std::uint32_t C = o.CW_CRC_out_size;
  for (std::uint32_t i = 0; i < C; ++i) {
    EXPECT_EQ(c.cw[i], C == 1 ? 1 : 0) << what << " block " << i;
  }
}

class SharedChannelRoundTrip : public testing::TestWithParam<Scenario> {};

TEST_P(SharedChannelRoundTrip, NoiseFreeTransmissionDecodesToTheSentBits) {
  const Scenario& s = GetParam();
  Instance instance;
  Sent sent = transmit(s, {}, s.tbSize + s.cqiBits);
  ASSERT_EQ(sent.call.run(instance.get()), 0);
  expectDecodedAsSent(sent, sent.call, "first transmission");
}

INSTANTIATE_TEST_SUITE_P(
    Layouts, SharedChannelRoundTrip,
    testing::Values(
        // One code block with fillers, every redundancy version, both cyclic prefixes.
        Scenario{6, 2, CyclicPrefix::Normal, 1000, 0, 0, 0, 0},
        Scenario{12, 2, CyclicPrefix::Extended, 1000, 1, 0, 0, 0},
        Scenario{6, 4, CyclicPrefix::Normal, 1000, 2, 0, 0, 0},
        Scenario{6, 6, CyclicPrefix::Extended, 1000, 3, 0, 0, 0},
        // Two blocks, then many of two sizes, with every kind of UCI.
        Scenario{25, 4, CyclicPrefix::Normal, 6200, 0, 4, 1, 1},
        Scenario{100, 6, CyclicPrefix::Extended, 30000, 2, 11, 2, 2},
        Scenario{40, 4, CyclicPrefix::Normal, 15000, 0, 12, 2, 1},
        Scenario{30, 2, CyclicPrefix::Normal, 4000, 1, 127, 1, 2},
        // The largest one-layer transport block at 110 PRBs, 64QAM.
        Scenario{110, 6, CyclicPrefix::Normal, 75376, 0, 40, 2, 2},
        // Control information only.
        Scenario{4, 2, CyclicPrefix::Normal, 0, 0, 9, 0, 0},
        Scenario{2, 4, CyclicPrefix::Extended, 0, 0, 64, 2, 1}));

// A block sent where one transmission fails its CRC decodes after chase combining; the
// buffers the caller keeps pass through unchanged between calls.
TEST(SharedChannelHarq, RetransmissionsCombineUntilTheBlockDecodes) {
  Instance instance;
  tx::ChannelSettings channel;
  channel.mode = tx::ChannelMode::Awgn;
  channel.esN0Db = -1.0;
  const std::uint32_t rvs[] = {0, 2, 3, 1};
  Sent first = transmit({12, 2, CyclicPrefix::Normal, 2000, 0, 0, 0, 0}, channel, 77);
  ASSERT_EQ(first.call.run(instance.get()), 0);
  EXPECT_EQ(first.call.outputs.SCH_TB_crc_error, 1) << "the first transmission alone decodes";
  SchCall* previous = &first.call;
  std::vector<Sent> retransmissions;
  retransmissions.reserve(3);
  for (std::uint32_t n = 1; n < 4; ++n) {
    channel.seed = 100 + n;
    retransmissions.push_back(
        transmit({12, 2, CyclicPrefix::Normal, 2000, rvs[n], 0, 0, 0}, channel, 77));
    SchCall& call = retransmissions.back().call;
    previous->keepHarqFor(call);
    ASSERT_EQ(call.run(instance.get()), 0) << "rv " << rvs[n];
    previous = &call;
  }
  EXPECT_EQ(retransmissions[0].call.outputs.SCH_TB_crc_error, 0) << "rv 0 + rv 2";
  EXPECT_EQ(previous->out(previous->data, previous->outputs.SCH_data_out_size),
            first.payload.transportBlock);
}

// Feeding a new transmission's HARQ output back with the same soft values doubles every
// soft value, saturating at -128 and 127.
TEST(SharedChannelHarq, CombiningTheSameValuesDoublesThem) {
  Instance instance;
  tx::ChannelSettings channel;
  channel.idealAmplitude = 40;
  Sent sent = transmit({6, 2, CyclicPrefix::Normal, 500, 0, 0, 0, 0}, channel, 3);
  ASSERT_EQ(sent.call.run(instance.get()), 0);
  SchCall again = sent.call;
  sent.call.keepHarqFor(again);
  again.prepareOutputs(sent.call.outputs.max_harq_buffer_size);
  ASSERT_EQ(again.run(instance.get()), 0);
  for (std::size_t s = 0; s < 3; ++s) {
    for (std::uint32_t i = 0; i < again.outputs.harq_buffer_out_size; ++i) {
      const std::int32_t once = sent.call.harqOut[s][i];
      ASSERT_EQ(again.harqOut[s][i], std::clamp(2 * once, -128, 127)) << s << " " << i;
    }
  }
}

// --- Status codes -------------------------------------------------------------------------

// The data-only call that passes every check: TB 1000 (one block of 1024, HARQ length 1028),
// QPSK, 50 rows, 1200 soft values.
SchCall validCall() {
  SchCall call;
  call.llr.assign(1200, 20);
  call.control = {0, 0, 1, 0, 0, 0, 0, 0, 50, 0, 1200, 1200, 1000, 8, 0, 0, 0, 0, 0, 1, 0, 0, 7};
  call.prepareOutputs(1028);
  return call;
}

// Runs the valid call changed by change on an instance with the given interleaver buffer and
// checks the status and the lines (those of the interface: "File:
// ../s/brannoc_bitacc_cmodel.cpp(#)" and the text; a pattern starting with "*" is matched as it
// is); no output is written.
void expectStatus(const std::function<void(SchCall&, vexlon_ip_brannoc_state*&)>& change,
                  std::int32_t status, const std::string& lines, std::uint32_t buffer = 36864) {
  vexlon_ip_brannoc_generics generics = vexlon_ip_brannoc_get_default_generics();
  generics.C_INTERLEAVER_BUFFER_SIZE = buffer;
  Instance instance(generics);
  SchCall call = validCall();
  vexlon_ip_brannoc_state* state = instance.get();
  change(call, state);
  const vexlon_ip_brannoc_SCH_inputs inputs = call.inputs();
  std::int32_t result = -1;
  const std::string err = stderrOf(
      [&] { result = vexlon_ip_brannoc_SCH_bitacc_simulate(state, inputs, &call.outputs); });
  EXPECT_EQ(result, status);
  expectLines(err, lines.front() == '*' ? lines + "\n"
                                        : "File: ../s/brannoc_bitacc_cmodel.cpp(#)" + lines + "\n");
  EXPECT_EQ(call.outputs.SCH_TAG_out, 0u);
  if (status < 300) {
    EXPECT_EQ(call.data[0], 9) << "an output was written";
  }
}

const std::string kCalled = "ERROR:decoder:Simulate called with ";

// One control field out of range or inconsistent, in the order of the checks.
TEST(SharedChannelStatus, FieldChecks) {
  using D = vexlon_ip_brannoc_SCH_controlData;
  const struct {
    std::uint32_t D::*field;
    std::uint32_t value;
    std::int32_t status;
    const char* message;  // after "Simulate called with "; "@" stands for "inputs.controlData."
  } cases[] = {
      {&D::SCH_CQI_IP_SIZE, 4096, 103, "@SCH_CQI_IP_SIZE>4095"},
      {&D::SCH_CQI_OP_SIZE, 128, 104, "@SCH_CQI_OP_SIZE>127"},
      {&D::SCH_CQI_OP_SIZE, 1, 105, "@SCH_CQI_IP_SIZE<SCH_CQI_OP_SIZE"},
      {&D::SCH_IP_DATA_TYPE, 3, 106, "SCH_IP_DATA_TYPE=CQI and @SCH_CQI_OP_SIZE=0"},
      {&D::SCH_IP_DATA_TYPE, 16, 107, "@SCH_IP_DATA_TYPE>15"},
      {&D::SCH_ACK_IP_SIZE, 256, 108, "@SCH_ACK_IP_SIZE>255"},
      {&D::SCH_ACK_OP_SIZE, 3, 109, "@SCH_ACK_OP_SIZE>2"},
      {&D::SCH_ACK_OP_SIZE, 1, 110, "@SCH_ACK_IP_SIZE<SCH_ACK_OP_SIZE"},
      {&D::SCH_IP_DATA_TYPE, 5, 111, "SCH_IP_DATA_TYPE=ACK and @SCH_ACK_OP_SIZE=0"},
      {&D::SCH_RI_IP_SIZE, 256, 112, "@SCH_RI_IP_SIZE>255"},
      {&D::SCH_RI_OP_SIZE, 3, 113, "@SCH_RI_OP_SIZE>2"},
      {&D::SCH_RI_OP_SIZE, 2, 114, "@SCH_RI_IP_SIZE<SCH_RI_OP_SIZE"},
      {&D::SCH_IP_DATA_TYPE, 9, 115, "SCH_IP_DATA_TYPE=RI and @SCH_RI_OP_SIZE=0"},
      {&D::SCH_RM_E_IDX, 128, 116, "@SCH_RM_E_IDX>127"},
      {&D::SCH_CH_INT_ROWS, 2048, 117, "@SCH_CH_INT_ROWS>2047"},
      {&D::SCH_CH_INT_ROWS, 0, 118, "@SCH_CH_INT_ROWS=0"},
      {&D::SCH_CP, 2, 120, "@SCH_CP>1"},
      {&D::SCH_RM_E_MINUS, 65536, 121, "@SCH_RM_E_MINUS>65535"},
      {&D::SCH_RM_E_PLUS, 0xFFFFFFFF, 122, "@SCH_RM_E_PLUS>65535"},
      {&D::SCH_RM_E_MINUS, 0, 123, "SCH_IP_DATA_TYPE=DATA and @SCH_RM_E_MINUS=0"},
      {&D::SCH_TBSIZE, 262144, 124, "@SCH_TBSIZE>262143"},
      {&D::SCH_TBSIZE, 0, 125, "SCH_IP_DATA_TYPE=DATA and @SCH_TBSIZE=0"},
      {&D::SCH_TD_ITER, 16, 127, "@SCH_TD_ITER>15"},
      {&D::SCH_TD_ITER, 0, 128, "SCH_IP_DATA_TYPE=DATA and @SCH_TD_ITER=0"},
      {&D::SCH_QAM, 7, 129, "@SCH_QAM>2 = 7"},
      {&D::SCH_USER_ID, 65536, 130, "@SCH_USER_ID>65535"},
      {&D::SCH_SFRM, 16, 131, "@SCH_SFRM>15"},
      {&D::SCH_HARQ_SFRM, 16, 132, "@SCH_HARQ_SFRM>15"},
      {&D::SCH_RV, 4, 133, "@SCH_RV>3"},
      {&D::SCH_ND, 2, 134, "@SCH_ND>1"},
      {&D::SCH_HFC, 2, 135, "@SCH_HFC>1"},
      {&D::SCH_TD_FLUSH, 2, 167, "@SCH_TD_FLUSH>1"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.status);
    const std::string message =
        std::regex_replace(std::string(c.message), std::regex("@"), "inputs.controlData.");
    expectStatus([&c](SchCall& call, auto&) { call.control.*c.field = c.value; }, c.status,
                 kCalled + message);
  }
}

// Arrays, capacities, sizes and the decode itself.
TEST(SharedChannelStatus, ArrayAndSizeChecks) {
  using C = SchCall;
  using S = vexlon_ip_brannoc_state*;
  const auto retransmit = [](C& c, std::uint32_t size) {
    c.control.SCH_ND = 0;
    c.harqSize = size;
    for (auto& h : c.harqIn) h.assign(size, 0);
  };
  const struct {
    std::function<void(C&, S&)> change;
    std::int32_t status;
    std::string lines;
    std::uint32_t buffer = 36864;
  } cases[] = {
      {[](C&, S& s) { s = nullptr; }, 101, kCalled + "null state structure"},
      {[](C& c, S&) { c.outputs.SCH_data_out = nullptr; }, 136,
       kCalled + "null pointer for outputs->SCH_data_out"},
      {[](C& c, S&) { c.outputs.SCH_ACK_out = nullptr; }, 137,
       kCalled + "null pointer for outputs->SCH_ACK_out"},
      {[](C& c, S&) { c.outputs.SCH_RI_out = nullptr; }, 138,
       kCalled + "null pointer for outputs->SCH_RI_out"},
      {[](C& c, S&) { c.outputs.sys_harq_buffer = nullptr; }, 139,
       kCalled + "null pointer for outputs->sys_harq_buffer"},
      {[](C& c, S&) { c.outputs.p0_harq_buffer = nullptr; }, 140,
       kCalled + "null pointer for outputs->p0_harq_buffer"},
      {[](C& c, S&) { c.outputs.p1_harq_buffer = nullptr; }, 141,
       kCalled + "null pointer for outputs->p1_harq_buffer"},
      {[](C& c, S&) {
         c.control.SCH_CQI_OP_SIZE = 1;
         c.control.SCH_CQI_IP_SIZE = 2;
         c.outputs.SCH_CQI_out = nullptr;
       },
       168, kCalled + "null pointer for outputs->SCH_CQI_out"},
      {[](C& c, S&) { c.outputs.CW_CRC_out = nullptr; }, 169,
       kCalled + "null pointer for outputs->CW_CRC_out"},
      {[](C& c, S&) { c.outputs.max_SCH_data_out_size = 999; }, 142,
       kCalled + "outputs->max_SCH_data_out_size < inputs.controlData.SCH_TBSIZE"},
      {[](C& c, S&) { c.control.SCH_ACK_OP_SIZE = 2, c.control.SCH_ACK_IP_SIZE = 12; }, 143,
       kCalled + "outputs->max_SCH_ACK_out_size < inputs.controlData.SCH_ACK_OP_SIZE"},
      {[](C& c, S&) { c.control.SCH_RI_OP_SIZE = 2, c.control.SCH_RI_IP_SIZE = 12; }, 144,
       kCalled + "outputs->max_SCH_RI_out_size < inputs.controlData.SCH_RI_OP_SIZE"},
      {[](C& c, S&) { c.control.SCH_CQI_OP_SIZE = 2, c.control.SCH_CQI_IP_SIZE = 32; }, 145,
       kCalled + "outputs->max_SCH_CQI_out_size < inputs.controlData.SCH_CQI_OP_SIZE"},
      {[](C& c, S&) { c.harqSize = 1029; }, 146,
       kCalled + "outputs->max_harq_buffer_size < inputs.harq_buffer_size 1028 < 1029"},
      {[](C& c, S&) { c.llr.clear(); }, 147, kCalled + "null pointer for inputs.tb_llr"},
      {[&](C& c, S&) { retransmit(c, 1028), c.harqIn[0].clear(); }, 148,
       kCalled + "null pointer for inputs.sys_harq_buffer and not new data"},
      {[&](C& c, S&) { retransmit(c, 1028), c.harqIn[1].clear(); }, 149,
       kCalled + "null pointer for inputs.p0_harq_buffer and not new data"},
      {[&](C& c, S&) { retransmit(c, 1028), c.harqIn[2].clear(); }, 150,
       kCalled + "null pointer for inputs.p1_harq_buffer and not new data"},
      {[](C& c, S&) { c.control.SCH_CH_INT_ROWS = 49; }, 151,
       "ERROR:decoder:llr_size (1200) must be same size as "
       "inputs.controlData.SCH_CH_INT_ROWS*Columns*Qm (49 * 12)"},
      {[](C& c, S&) { c.control.SCH_CP = 1; }, 152,
       "ERROR:decoder:llr_size (1200) must be same size as "
       "inputs.controlData.SCH_CH_INT_ROWS*Columns*Qm (50 * 10 * 2)"},
      {[](C& c, S&) { c.control.SCH_CH_INT_ROWS = 1537, c.llr.assign(2 * 1537 * 12, 0); }, 166,
       kCalled + "Input SCH block larger than input buffer size", 18432},
      {[](C& c, S&) { c.outputs.max_harq_buffer_size = 1027; }, 153,
       "ERROR:decoder:outputs.max_harq_out_size is not correct based on ControlData fields "
       "1027 /= 1028"},
      {[&](C& c, S&) { retransmit(c, 1000); }, 154,
       "ERROR:decoder:harq_buffer_size is not correct based on ControlData fields 1000 /= 1028"},
      {[](C& c, S&) { c.control.SCH_IP_DATA_TYPE = 0, c.control.SCH_TD_ITER = 0; }, 157,
       "ERROR:decoder:Failed to setup Turbo Decoder Iterations "},
      {[](C& c, S&) { c.control.SCH_RM_E_MINUS = 1100; }, 158,
       "ERROR:decoder:llr_size must be same size as g+CQI_Q+RI_Q : 1100 + 0 + 0 != 1200"},
      // Three ACK soft values are not a whole number of QPSK symbols.
      {[](C& c, S&) { c.control.SCH_ACK_IP_SIZE = 3, c.control.SCH_ACK_OP_SIZE = 1; }, 200,
       "*../s/KLTE_PUSCH_Decoding(998)ACK Q must be a multiple of Qm\n"
       "File: ../s/brannoc_bitacc_cmodel.cpp(#)Error: Could not decode SCH"},
      {[&](C& c, S&) {
         retransmit(c, 1028);
         c.control.SCH_RI_IP_SIZE = c.control.SCH_RI_OP_SIZE = 1;
         c.control.SCH_RM_E_MINUS = c.control.SCH_RM_E_PLUS = 1199;
       },
       201,
       "*../s/KLTE_PUSCH_Decoding(1025)RI Q must be a multiple of Qm\n"
       "File: ../s/brannoc_bitacc_cmodel.cpp(#)Error: Could not decode SCH with HARQ"},
      {[](C& c, S&) { c.outputs.max_CW_CRC_out_size = 0; }, 305,
       "ERROR:decoder:Insufficient allocated space for CW CRC output array"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.status);
    expectStatus(c.change, c.status, c.lines, c.buffer);
  }
}

// Results written before a capacity failure stay written.
TEST(SharedChannelOutputs, CodeBlockFlagCapacityFailureKeepsEarlierOutputs) {
  Instance instance;
  Sent sent = transmit({6, 2, CyclicPrefix::Normal, 600, 0, 5, 1, 1}, {}, 4);
  sent.call.outputs.max_CW_CRC_out_size = 0;
  stderrOf([&] { EXPECT_EQ(sent.call.run(instance.get()), 305); });
  const SchCall& c = sent.call;
  EXPECT_EQ(c.out(c.data, c.outputs.SCH_data_out_size), sent.payload.transportBlock);
  EXPECT_EQ(c.out(c.ri, c.outputs.SCH_RI_out_size), sent.payload.ri);
  EXPECT_EQ(c.outputs.harq_buffer_out_size, 628u);  // K = 624
  EXPECT_EQ(c.outputs.SCH_TAG_out, 0u);
}

// Inputs the checks let through but the decode cannot honour, or must not touch.
TEST(SharedChannelOutputs, UnsafeInputsAreReportedOrLeftUnread) {
  Instance instance;
  // Data soft values that no whole QPSK symbol per code block can carry: G = 1 < Qm.
  SchCall tiny;
  tiny.llr.assign(24, 10);
  tiny.control = {23, 1, 3, 0, 0, 0, 0, 0, 1, 0, 1, 1, 16, 8, 0, 0, 0, 0, 0, 1, 0, 0, 0};
  tiny.prepareOutputs(44);
  expectLines(stderrOf([&] { EXPECT_EQ(tiny.run(instance.get()), 200); }),
              "File: ../s/KLTE_PUSCH_Decoding(603)Error: INCORRECT LLR Input SIZE. Properly use "
              "setParams. LLR input size: 1   Expected size: 0\n"
              "../s/KLTE_PUSCH_Decoding(877)Error: SCH Decode Data Fail \n"
              "File: ../s/brannoc_bitacc_cmodel.cpp(#)Error: Could not decode SCH\n");
  EXPECT_EQ(tiny.data[0], 9);

  // New data never reads the HARQ input, whatever size it claims, and capacities far beyond
  // the arrays are only capacities: nothing is written past what the call produces.
  Sent sent = transmit({6, 2, CyclicPrefix::Normal, 600, 0, 0, 0, 0}, {}, 5);
  sent.call.harqSize = 0xFFFFFFFF;
  vexlon_ip_brannoc_SCH_outputs& o = sent.call.outputs;
  o.max_harq_buffer_size = o.max_SCH_data_out_size = o.max_SCH_ACK_out_size =
      o.max_SCH_RI_out_size = o.max_SCH_CQI_out_size = o.max_CW_CRC_out_size = 0xFFFFFFFF;
  EXPECT_EQ(sent.call.run(instance.get()), 0);
  EXPECT_EQ(sent.call.outputs.SCH_TB_crc_error, 0);

  // A soft value of any 32-bit size is a soft value: 65535 saturates to 127.
  Sent big = transmit({6, 2, CyclicPrefix::Normal, 600, 0, 0, 0, 2}, {}, 6);
  for (std::int32_t& v : big.call.llr) {
    if (v > 0) v = 65535;
  }
  std::string err = stderrOf([&] { EXPECT_EQ(big.call.run(instance.get()), 0); });
  expectDecodedAsSent(big, big.call, "soft values of 65535");
}

// The saturation warning is printed once per process, for LLR and HARQ input alike. The check
// runs in a fresh process, where no earlier saturation has set the flag.
TEST(SharedChannelOutputs, SaturationIsWarnedAboutOnce) {
  if (sizeof(void*) == 4) {
    GTEST_SKIP() << "a fresh process of the 32-bit build may need an emulator to start";
  }
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  const auto twoSaturatingCalls = [] {
    Instance instance;
    Sent sent = transmit({6, 2, CyclicPrefix::Normal, 600, 0, 0, 0, 0}, {}, 7);
    sent.call.llr[5] = 200;
    SchCall again = sent.call;
    const bool first = sent.call.run(instance.get()) == 0;
    sent.call.keepHarqFor(again);
    again.harqIn[1][3] = -300;
    const bool second = again.run(instance.get()) == 0;
    std::exit(first && second ? 0 : 1);
  };
  EXPECT_EXIT(twoSaturatingCalls(), testing::ExitedWithCode(0),
              "^LLR Input to Decoder was saturated to Format 8:5\\. Additional saturating "
              "warnings are suppressed\\. \n$");
}

// Every shared-channel key writes its records; the nine control words of a data-only call
// (16QAM, 12 rows, transport block 1000, 8 iterations, user 0x1234, subframe 5) to the
// character.
TEST(SharedChannelDumps, EveryKeyWritesAndTheControlWordsAreExact) {
  ScratchDir dir;
  const std::string prefix = dir.prefix() + "SCH_rx_";
  Sent full = transmit({20, 4, CyclicPrefix::Normal, 8000, 0, 30, 2, 1}, {}, 9);
  {
    Instance instance;  // its destruction closes the files
    for (std::uint32_t key = 0; key <= 32; ++key) {
      ASSERT_EQ(instance.dump(key, 0, prefix), 1u);
    }
    SchCall call;
    call.llr.assign(576, 16);
    call.control = {0,    0, 1, 0,      0, 0, 0, 0, 12, 0, 576, 576,
                    1000, 8, 1, 0x1234, 5, 0, 0, 1, 0,  0, 0};
    call.prepareOutputs(1028);
    ASSERT_EQ(call.run(instance.get()), 0);
    ASSERT_EQ(full.call.run(instance.get()), 0);
  }
  const auto line = [](const char* address, std::uint64_t word) {
    return std::string("W ") + address + "  " + std::bitset<32>(word).to_string() + "  #  " +
           std::to_string(word) + "\n";
  };
  const std::uint64_t words[9] = {1u << 24,
                                  0,
                                  0,
                                  12,
                                  0,
                                  576 | 576u << 16,
                                  0,
                                  1000 | 8u << 24 | 1u << 28,
                                  0x1234 | 5u << 16 | 1u << 26};
  std::string expected = "[CTRL]\n[ length: 9]\n";
  for (std::uint32_t i = 0; i < 9; ++i) {
    char address[16];
    std::snprintf(address, sizeof address, "0x%08x", 0x2200 + 4 * i);
    expected += line(address, words[i]);
  }
  const std::string ctrl = fileText(prefix + "CTRL.log");
  EXPECT_EQ(ctrl.substr(0, expected.size()), expected);
  EXPECT_EQ(ctrl.rfind("[CTRL]"), expected.size()) << "one record per call";
  const std::uint32_t ackWord =
      0x1234 | 2u << 16 | (2u * full.payload.ack[1] + full.payload.ack[0]) << 18;
  EXPECT_EQ(fileText(prefix + "STATUS_ACK.log"),
            "[ACK STATUS REGISTERS]\n[ length: 0]\n"  // the first call carries no ACK
            "[ACK STATUS REGISTERS]\n[ length: 1]\n" +
                std::bitset<32>(ackWord).to_string() + "  #  " + std::to_string(ackWord) + "\n");
  // clang-format off
  static constexpr const char* kPieces[] = {
      "Output_TB", "Output_TB_CQI", "Output_TB_RI", "Output_TB_ACK", "tbWcrc_TB_Out",
      "cwsWcrc_CW_Out", "cwsWcrc_TB_Out", "afterDecode_CW_Out", "afterDecode_TB_Out",
      "afterDecode_TB_CQI_Out", "afterHARQ_CW_Out", "afterHARQ_TB_Out", "harqInput_CW_Out",
      "harqInput_TB_Out", "afterChase_CW_Out", "afterChase_TB_Out", "afterChase_TB_CQI_Out",
      "rawViterbi_TB_CQI_Out", "afterChase_TB_ACK_Out", "afterChase_TB_RI_Out",
      "llrInput_TB_CQI_Out", "afterDemux_TB_Out", "llrInput_TB_Data_Out",
      "afterDeInterleave_TB_CQI_Out", "llrInput_TB_RI_Out", "llrInput_TB_ACK_Out",
      "llrInput_CW_Out", "llrInput_TB_Out", "STATUS_CQI", "STATUS_RI", "STATUS"};
  // clang-format on
  for (const char* piece : kPieces) {
    EXPECT_EQ(fileText(prefix + piece + ".log").substr(0, 1), "[") << piece;
  }
}

// Two instances decoding different transmissions at once give the serial results.
TEST(SharedChannelInstances, ParallelDecodesEqualSerialOnes) {
  tx::ChannelSettings channel;
  channel.mode = tx::ChannelMode::Awgn;
  channel.esN0Db = 1.0;
  std::vector<Sent> sets[2];
  for (std::uint32_t n = 0; n < 6; ++n) {
    channel.seed = n;
    sets[n % 2].push_back(transmit({10, 2 + 2 * (n % 3), CyclicPrefix::Normal, 1500 + 300 * n,
                                    n % 4 == 3 ? 0 : n % 4, n, n % 3, 1},
                                   channel, n));
  }
  auto decodeAll = [](std::vector<Sent>& set) {
    Instance instance;
    for (Sent& s : set) {
      EXPECT_EQ(s.call.run(instance.get()), 0);
    }
  };
  std::vector<Sent> serial[2] = {sets[0], sets[1]};
  std::thread first(decodeAll, std::ref(sets[0]));
  std::thread second(decodeAll, std::ref(sets[1]));
  first.join();
  second.join();
  decodeAll(serial[0]);
  decodeAll(serial[1]);
  for (std::size_t k = 0; k < 2; ++k) {
    for (std::size_t n = 0; n < sets[k].size(); ++n) {
      EXPECT_EQ(sets[k][n].call.data, serial[k][n].call.data);
      EXPECT_EQ(sets[k][n].call.harqOut, serial[k][n].call.harqOut);
      EXPECT_EQ(sets[k][n].call.cqi, serial[k][n].call.cqi);
    }
  }
}

// One instance, call A, then other calls (other sizes, modulation and UCI, calls that fail in
// the checks and in the decode, a control-channel call), then A again: A's outputs are the
// same bit for bit.
TEST(SharedChannelInstances, CallsDoNotChangeEachOthersResults) {
  Instance instance;
  tx::ChannelSettings channel;
  channel.mode = tx::ChannelMode::Awgn;
  channel.esN0Db = 2.0;
  Sent a = transmit({10, 4, CyclicPrefix::Normal, 3000, 0, 20, 2, 1}, channel, 21);
  SchCall first = a.call;
  ASSERT_EQ(first.run(instance.get()), 0);
  Sent b = transmit({20, 6, CyclicPrefix::Extended, 9000, 2, 5, 1, 2}, channel, 22);
  SchCall failsInChecks = b.call;
  failsInChecks.control.SCH_RM_E_MINUS += 1;
  SchCall failsInDecode = validCall();
  failsInDecode.control.SCH_ACK_IP_SIZE = 3;
  failsInDecode.control.SCH_ACK_OP_SIZE = 1;
  stderrOf([&] {
    EXPECT_EQ(b.call.run(instance.get()), 0);
    EXPECT_EQ(failsInChecks.run(instance.get()), 158);
    EXPECT_EQ(failsInDecode.run(instance.get()), 200);
  });
  std::array<std::uint8_t, 13> cqi{};
  std::array<std::uint8_t, 2> ack{};
  std::vector<std::int32_t> pucch(22, -40);
  vexlon_ip_brannoc_CCH_outputs cchOut{cqi.data(), ack.data(), 13, 2, 0, 0, 0};
  EXPECT_EQ(vexlon_ip_brannoc_CCH_bitacc_simulate(instance.get(),
                                                  {pucch.data(), 22, {13, 0, 2, 0, 0}}, &cchOut),
            0);
  SchCall again = a.call;
  ASSERT_EQ(again.run(instance.get()), 0);
  EXPECT_EQ(again.data, first.data);
  EXPECT_EQ(again.cqi, first.cqi);
  EXPECT_EQ(again.ack, first.ack);
  EXPECT_EQ(again.ri, first.ri);
  EXPECT_EQ(again.cw, first.cw);
  EXPECT_EQ(again.harqOut, first.harqOut);
  EXPECT_EQ(again.outputs.SCH_TB_crc_error, first.outputs.SCH_TB_crc_error);
  EXPECT_EQ(again.outputs.SCH_CQI_crc_error, first.outputs.SCH_CQI_crc_error);
  EXPECT_EQ(again.outputs.SCH_ACK_parity_error, first.outputs.SCH_ACK_parity_error);
  EXPECT_EQ(again.outputs.SCH_RI_parity_error, first.outputs.SCH_RI_parity_error);
}

}  // namespace
}  // namespace brannoc::test
