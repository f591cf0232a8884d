// The control-channel call, instances and dump switches, through the exported C functions
// only: PUCCH transmissions from the transmitter decoded back, every status code with its
// line, dump files to the character, independent instances in parallel threads.
#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <filesystem>
#include <random>
#include <regex>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "DecoderTestSupport.h"
#include "tx/PucchTransmitter.h"

#if defined(__linux__)
#include <sys/resource.h>
#endif

namespace brannoc::test {
namespace {

using tx::CyclicPrefix;

struct CchCall {
  std::vector<std::int32_t> llr;
  vexlon_ip_brannoc_CCH_controlData control{};
  std::array<std::uint8_t, 16> cqi{};
  std::array<std::uint8_t, 4> ack{};
  vexlon_ip_brannoc_CCH_outputs outputs{cqi.data(), ack.data(), 16, 4, 0, 0, 0};

  CchCall() = default;
  // A copy writes into its own arrays.
  CchCall(const CchCall& other) { *this = other; }
  CchCall& operator=(const CchCall& other) {
    llr = other.llr;
    control = other.control;
    cqi = other.cqi;
    ack = other.ack;
    outputs = other.outputs;
    outputs.CCH_data_out = cqi.data();
    outputs.CCH_ACK_out = ack.data();
    return *this;
  }

  std::int32_t run(vexlon_ip_brannoc_state* state) {
    const vexlon_ip_brannoc_CCH_inputs inputs{llr.data(), static_cast<std::uint32_t>(llr.size()),
                                              control};
    return vexlon_ip_brannoc_CCH_bitacc_simulate(state, inputs, &outputs);
  }
  std::vector<std::uint8_t> cqiOut() const {
    return {cqi.begin(), cqi.begin() + outputs.CCH_data_out_size};
  }
  std::vector<std::uint8_t> ackOut() const {
    return {ack.begin(), ack.begin() + outputs.CCH_ACK_out_size};
  }
};

struct Payload {
  tx::Bits cqi, ack;
};

Payload randomPayload(std::uint32_t cqiBits, std::uint32_t ackBits, std::mt19937& rng) {
  Payload p;
  for (std::uint32_t i = 0; i < cqiBits; ++i) p.cqi.push_back(rng() & 1);
  for (std::uint32_t i = 0; i < ackBits; ++i) p.ack.push_back(rng() & 1);
  return p;
}

// A transmission of the payload through the transmitter's channel, ready to decode.
CchCall transmission(const Payload& p, CyclicPrefix cp, const tx::ChannelSettings& channel,
                     std::uint32_t userId = 7) {
  tx::PucchTransmission sent;
  EXPECT_TRUE(tx::transmitPucch(p.cqi, p.ack, cp, channel, sent).ok());
  CchCall call;
  call.llr = sent.softValues;
  call.control = {static_cast<std::uint32_t>(p.cqi.size()), cp == CyclicPrefix::Extended ? 1u : 0u,
                  static_cast<std::uint32_t>(p.ack.size()), userId, 0xC0FFEE};
  return call;
}

// Every CQI size with every ACK size and both cyclic prefixes, ACK alone included.
TEST(ControlChannel, NoiseFreeTransmissionsDecodeToTheSentBits) {
  Instance instance;
  std::mt19937 rng(5);
  for (const CyclicPrefix cp : {CyclicPrefix::Normal, CyclicPrefix::Extended}) {
    for (std::uint32_t cqiBits = 0; cqiBits <= 13; ++cqiBits) {
      for (std::uint32_t ackBits = 0; ackBits <= 2; ++ackBits) {
        if ((cqiBits == 0 && ackBits == 0) ||
            (cp == CyclicPrefix::Extended && cqiBits > 0 && cqiBits + ackBits > 13)) {
          continue;
        }
        const Payload p = randomPayload(cqiBits, ackBits, rng);
        CchCall call = transmission(p, cp, {}, 65535);
        ASSERT_EQ(call.run(instance.get()), 0) << cqiBits << " " << ackBits;
        EXPECT_EQ(call.cqiOut(), p.cqi) << cqiBits << " CQI bits, " << ackBits << " ACK bits";
        EXPECT_EQ(call.ackOut(), p.ack) << cqiBits << " CQI bits, " << ackBits << " ACK bits";
        EXPECT_EQ(call.outputs.CCH_TAG_out, 0xC0FFEEu);
      }
    }
  }
}

TEST(ControlChannel, NoisyCqiIsDecodedInNearlyEveryCall) {
  Instance instance;
  std::mt19937 rng(11);
  int right = 0;
  constexpr int kCalls = 300;
  for (int n = 0; n < kCalls; ++n) {
    const bool extended = n % 2 == 1;
    const Payload p = randomPayload(extended ? 11 : 13, 2, rng);
    tx::ChannelSettings channel;
    channel.mode = tx::ChannelMode::Awgn;
    channel.esN0Db = 5.0;
    channel.seed = 1000 + n;
    CchCall call =
        transmission(p, extended ? CyclicPrefix::Extended : CyclicPrefix::Normal, channel);
    ASSERT_EQ(call.run(instance.get()), 0);
    right += call.cqiOut() == p.cqi ? 1 : 0;
  }
  EXPECT_GE(right, kCalls * 97 / 100);
}

constexpr const char* kIf = "File: ../s/brannoc_bitacc_cmodel.cpp(#)";

// A valid call (4 CQI bits, 1 ACK bit, normal cyclic prefix) broken in one way each: its
// status and lines (a line without "../s/" is the interface's; "@" stands for the argument
// checks' "ERROR:PUCCH decoder:Simulate called with "); nothing is written.
TEST(ControlChannel, EveryStatusCodeWithItsLines) {
  using C = CchCall;
  using S = vexlon_ip_brannoc_state*;
  using O = vexlon_ip_brannoc_CCH_outputs*;
  using U = std::uint32_t;
  const struct {
    void (*change)(C&, S&, O&, U&);
    std::int32_t status;
    const char* lines;
  } cases[] = {
      {[](C&, S& s, O&, U&) { s = nullptr; }, 500, "@null state structure"},
      {[](C&, S&, O& o, U&) { o = nullptr; }, 501, "@null output structure"},
      {[](C& c, S&, O&, U&) { c.control.CCH_UCI_OP_SIZE = 14; }, 502,
       "@inputs.controlData.CCH_UCI_OP_SIZE>13"},
      {[](C& c, S&, O&, U&) { c.control.CCH_CP = 2; }, 503, "@inputs.controlData.CCH_CP>1"},
      {[](C& c, S&, O&, U&) { c.control.CCH_ACK_OP_SIZE = 3; }, 504,
       "@inputs.controlData.CCH_ACK_OP_SIZE>2"},
      {[](C& c, S&, O&, U&) { c.control.CCH_USER_ID = 65536; }, 505,
       "@inputs.controlData.CCH_USER_ID>65535"},
      {[](C& c, S&, O&, U&) {
         c.control = {12, 1, 2, 0, 0};
       },
       506,
       "../s/KLTE_PUCCH_Decoding(#)Error:CCH CQI+ACK max 13 bits. \n"
       "Error: UNABLE TO SET CCH PARAMETERS"},
      {[](C& c, S&, O&, U& size) { c.llr.clear(), size = 1; }, 508, "@null pointer for inputs.llr"},
      {[](C&, S&, O& o, U&) { o->CCH_data_out = nullptr; }, 509,
       "@null pointer for outputs->CCH_data_out"},
      {[](C&, S&, O& o, U&) { o->CCH_ACK_out = nullptr; }, 510,
       "@null pointer for outputs->CCH_ACK_out"},
      {[](C& c, S&, O&, U&) { c.llr.clear(); }, 600,
       "../s/KLTE_PUCCH_Decoding(#)INCORRECT TB SIZE. size=0 "
       "tbCRC.size()+itsRateDematch.getACKsize()=21\nError: Could not decode CCH"},
      {[](C& c, S&, O&, U&) { c.llr.push_back(1); }, 600,
       "../s/KLTE_PUCCH_Decoding(#)INCORRECT TB SIZE. size=22 "
       "tbCRC.size()+itsRateDematch.getACKsize()=21\nError: Could not decode CCH"},
      // ACK alone reads one soft value per bit and no further.
      {[](C& c, S&, O&, U&) {
         c.control = {0, 0, 2, 0, 0}, c.llr.resize(1);
       },
       600,
       "../s/KLTE_PUCCH_Decoding(#)INCORRECT TB SIZE. size=1 itsRateDematch.getACKsize()=2\n"
       "Error: Could not decode CCH"},
      {[](C& c, S&, O&, U&) {
         c.control = {0, 1, 0, 0, 0};
       },
       600, "../s/KLTE_PUCCH_Decoding(#)Error: No CCH data. \nError: Could not decode CCH"},
      {[](C&, S&, O& o, U&) { o->max_CCH_data_out_size = 3; }, 701,
       "ERROR:decoder:Insufficient allocated space for CCH Data output array"},
      {[](C&, S&, O& o, U&) { o->max_CCH_ACK_out_size = 0; }, 702,
       "ERROR:decoder:Insufficient allocated space for CCH ACK Data output array"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.status);
    Instance instance;
    std::mt19937 rng(1);
    CchCall call = transmission(randomPayload(4, 1, rng), CyclicPrefix::Normal, {});
    vexlon_ip_brannoc_state* state = instance.get();
    vexlon_ip_brannoc_CCH_outputs* outputs = &call.outputs;
    std::uint32_t size = 0;
    c.change(call, state, outputs, size);
    const vexlon_ip_brannoc_CCH_inputs inputs{
        call.llr.empty() ? nullptr : call.llr.data(),
        size != 0 ? size : static_cast<std::uint32_t>(call.llr.size()), call.control};
    std::int32_t status = -1;
    const std::string err =
        stderrOf([&] { status = vexlon_ip_brannoc_CCH_bitacc_simulate(state, inputs, outputs); });
    EXPECT_EQ(status, c.status);
    std::string lines;
    std::stringstream text(std::regex_replace(std::string(c.lines), std::regex("@"),
                                              "ERROR:PUCCH decoder:Simulate called with "));
    for (std::string line; std::getline(text, line);) {
      lines += (line.rfind("../s/", 0) == 0 ? "" : kIf) + line + "\n";
    }
    expectLines(err, lines);
    EXPECT_EQ(call.outputs.CCH_TAG_out, 0u);  // written on success only
  }
}

// A failure at the ACK copy leaves the CQI bits written.
TEST(ControlChannel, AckCapacityFailureKeepsTheCqiOutput) {
  Instance instance;
  std::mt19937 rng(3);
  const Payload p = randomPayload(6, 2, rng);
  CchCall call = transmission(p, CyclicPrefix::Normal, {});
  call.outputs.max_CCH_ACK_out_size = 1;
  stderrOf([&] { EXPECT_EQ(call.run(instance.get()), 702); });
  EXPECT_EQ(call.cqiOut(), p.cqi);
  EXPECT_EQ(call.outputs.CCH_ACK_out_size, 0u);
}

// More soft values than this build can hold, or than memory gives (the address space is
// limited for the call), is an allocation failure: status 507, never an exception.
TEST(ControlChannel, UncacheableInputIsOutOfMemory) {
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
  GTEST_SKIP() << "the sanitizers reserve more address space than the limit allows";
#else
  Instance instance;
  CchCall call;
  call.llr.assign(22, 0);
  call.control = {13, 0, 2, 0, 0};
  const vexlon_ip_brannoc_CCH_inputs inputs{call.llr.data(), 0xFFFFFFFFu, call.control};
  rlimit saved{};
  const bool limited = sizeof(void*) == 8 && getrlimit(RLIMIT_AS, &saved) == 0;
  if (limited) {
    // Below the 16 GiB asked for (only the 64-bit build gets here).
    const rlimit tight{static_cast<rlim_t>(std::uint64_t{8} << 30), saved.rlim_max};
    ASSERT_EQ(setrlimit(RLIMIT_AS, &tight), 0);
  }
  std::int32_t status = -1;
  const std::string err = stderrOf([&] {
    status = vexlon_ip_brannoc_CCH_bitacc_simulate(instance.get(), inputs, &call.outputs);
  });
  if (limited) {
    setrlimit(RLIMIT_AS, &saved);
  }
  EXPECT_EQ(status, 507);
  expectLines(err,
              std::string(kIf) +
                  "ERROR:decoder:Out of memory caching input vector. Size expected:4294967295\n");
#endif
}

// The records of every control-channel key for one decode: user 0x1234, CQI 1011, ACK 1,
// extended cyclic prefix.
TEST(DumpFiles, ControlChannelRecordsAreWrittenInTheirFormats) {
  ScratchDir dir;
  const std::string prefix = dir.prefix() + "CCH_rx_";
  Instance instance;
  for (std::uint32_t key : {1u, 3u, 27u, 28u, 32u}) {
    EXPECT_EQ(instance.dump(key, 1, prefix), 1u);
  }
  CchCall call = transmission({{1, 0, 1, 1}, {1}}, CyclicPrefix::Extended, {}, 0x1234);
  ASSERT_EQ(call.run(instance.get()), 0);
  instance.dump(28, 1, prefix + "again_");  // closes and flushes the first control file
  EXPECT_EQ(fileText(prefix + "Ctrl_Out.log"),
            "[CTRL]\n[ length: 1]\nW 0x00002234  00010010001101000000000000110100  #  305397812\n");
  EXPECT_EQ(fileText(prefix + "again_Ctrl_Out.log"), "");
  instance.dump(32, 1, prefix + "again_");
  EXPECT_EQ(fileText(prefix + "Status_Out.log"),
            "[STATUS]\n[ length: 1]\n00100000000011010001001000110100  #  537727540\n");
  instance.dump(1, 1, prefix + "again_");
  EXPECT_EQ(fileText(prefix + "Output_TB.log"),
            "[OUTPUT_UCI_CQI]\n[ length: 4]\n" + std::string(19, ' ') + "1\n" +
                std::string(19, ' ') + "0\n" + std::string(19, ' ') + "1\n" + std::string(19, ' ') +
                "1\n");
  instance.dump(3, 1, prefix + "again_");
  EXPECT_EQ(fileText(prefix + "Output_TB_ACK.log"),
            "[OUTPUT_UCI_ACK]\n[ length: 1]\n" + std::string(19, ' ') + "1\n");
  instance.dump(27, 1, prefix + "again_");
  // One line per soft value (+-64 noise free): 16 binary digits and the decimal value.
  const std::string llr = fileText(prefix + "llrInput_Out.log");
  EXPECT_TRUE(std::regex_match(
      llr, std::regex(R"(\[LLR_INPUT_TB\]\n\[ length: 20\]\n((0000000001000000  #  64|)"
                      R"(1111111111000000  #  -64)\n){20})")))
      << llr;
}

TEST(DumpFiles, SwitchRefusalsAndFailedOpens) {
  ScratchDir dir;
  Instance instance;
  const std::string missing = dir.prefix() + "missing/x_";
  std::uint32_t result = 0;
  expectLines(
      stderrOf([&] { result = instance.dump(28, 1, missing); }),
      "ERROR:Could not open output file '" + missing +
          "Ctrl_Out.log'\n"
          "File: ../s/KLTE_PUCCH_Decoding(351)Error: UNABLE TO open Output CCH_rx_Ctrl_Out.\n");
  EXPECT_EQ(result, 1u);
  expectLines(stderrOf([&] { instance.dump(1, 1, missing); }),
              "ERROR:Could not open output file '" + missing + "Output_TB.log'\n");
  expectLines(stderrOf([&] { instance.dump(6, 0, missing); }),
              "ERROR:Could not open output file '" + missing +
                  "cwsWcrc_TB_Out.log'\n"
                  "Error: UNABLE TO open Output SCH__rx_cwsWcrc_TB_Out\n");
  // A zero byte in the name would cut it short: no file is touched.
  const std::string withZero = dir.prefix() + std::string("a\0b", 3);
  expectLines(stderrOf([&] { instance.dump(29, 0, withZero); }),
              "ERROR:Could not open output file '" + dir.prefix() +
                  "a\\0bSTATUS_CQI.log'\n"
                  "Error: UNABLE TO open Output SCH_rx_Status_CQI    .\n");
  EXPECT_EQ(instance.dump(5, 1, dir.prefix()), 1u);  // no such control-channel dump
  EXPECT_EQ(instance.dump(33, 0, dir.prefix()), 0u);
  EXPECT_EQ(instance.dump(0, 2, dir.prefix()), 0u);
  EXPECT_EQ(IUO_set_debugfn_state(nullptr, 0, 0, "x", 1), 0u);
  EXPECT_EQ(IUO_set_debugfn_state(instance.get(), 0, 0, nullptr, 1), 0u);
  CchCall call = transmission({{1, 1}, {}}, CyclicPrefix::Normal, {});
  EXPECT_EQ(call.run(instance.get()), 0);  // decoding goes on without the failed files
  EXPECT_TRUE(std::filesystem::is_empty(dir.path()));

  // No prefix: the key's file name piece alone, in the current folder.
  const std::filesystem::path here = std::filesystem::current_path();
  std::filesystem::current_path(dir.path());
  EXPECT_EQ(IUO_set_debugfn_state(instance.get(), 0, 0, nullptr, 0), 1u);
  std::filesystem::current_path(here);
  EXPECT_TRUE(std::filesystem::exists(dir.path() / "Output_TB.log"));
}

// Two instances decoding at once in two threads give what one thread gives.
TEST(Instances, ParallelDecodesEqualSerialOnes) {
  std::vector<CchCall> calls;
  std::mt19937 rng(9);
  for (int n = 0; n < 40; ++n) {
    tx::ChannelSettings channel;
    channel.mode = tx::ChannelMode::Awgn;
    channel.esN0Db = 0.0;
    channel.seed = n;
    calls.push_back(
        transmission(randomPayload(1 + n % 13, n % 3, rng), CyclicPrefix::Normal, channel, n));
  }
  auto decodeAll = [](std::vector<CchCall>& set, std::size_t first) {
    vexlon_ip_brannoc_generics generics = vexlon_ip_brannoc_get_default_generics();
    generics.C_NUM_CQI_PU = 1 + first;
    Instance instance(generics);
    for (std::size_t n = first; n < set.size(); n += 2) {
      EXPECT_EQ(set[n].run(instance.get()), 0);
    }
  };
  std::vector<CchCall> parallel = calls;
  std::thread even(decodeAll, std::ref(parallel), 0);
  std::thread odd(decodeAll, std::ref(parallel), 1);
  even.join();
  odd.join();
  decodeAll(calls, 0);
  decodeAll(calls, 1);
  for (std::size_t n = 0; n < calls.size(); ++n) {
    EXPECT_EQ(parallel[n].cqiOut(), calls[n].cqiOut()) << n;
    EXPECT_EQ(parallel[n].ackOut(), calls[n].ackOut()) << n;
  }
}

}  // namespace
}  // namespace brannoc::test
