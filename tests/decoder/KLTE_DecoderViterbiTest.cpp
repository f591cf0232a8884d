// Tests of the tail-biting Viterbi decoder model (TS 36.212 5.1.3.1 code): round trips from
// the transmitter's tail-biting encoder, the short and long block paths, positions left
// unwritten, erasures, validation messages, setters' fallbacks and the trace streams.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <fstream>
#include <random>
#include <regex>
#include <sstream>
#include <string>
#include <vector>

#include "KLTE_DecoderViterbi.h"
#include "tx/ConvolutionalCode.h"

namespace {

using brannoc::KLTE_DecoderViterbi;
using Bits = std::vector<std::uint8_t>;
using Soft = std::vector<std::int32_t>;
using Extended = KLTE_DecoderViterbi::ExtendedRxData;

// Soft streams q0..q2 and erasure streams e0..e2 of one block.
struct Received {
  std::array<Soft, 3> q;
  std::array<Soft, 3> e;
};

Bits randomBits(std::size_t n, std::mt19937& random) {
  Bits bits(n);
  for (std::uint8_t& bit : bits) {
    bit = static_cast<std::uint8_t>(random() & 1U);
  }
  return bits;
}

// The transmitter's tail-biting codeword as offset-binary soft values (one -> most
// confident 1), no erasures.
Received receive(const Bits& info, std::int32_t one = 15) {
  const brannoc::tx::ConvolutionalStreams d = brannoc::tx::encodeTailBiting(info);
  Received rx;
  for (std::size_t k = 0; k < 3; ++k) {
    for (std::uint8_t bit : d[k]) {
      rx.q[k].push_back(bit ? one : 0);
    }
    rx.e[k].assign(info.size(), 0);
  }
  return rx;
}

struct Traces {
  std::ostringstream raw, acs, best, traceback;
};

bool runDecode(KLTE_DecoderViterbi& decoder, const Received& rx, Bits& decoded,
               Extended& extended, Traces* traces = nullptr, bool traceEnable = false) {
  std::ofstream closed;  // a stream that is not open takes nothing
  if (traces == nullptr) {
    return decoder.decode(rx.q[0], rx.q[1], rx.q[2], rx.e[0], rx.e[1], rx.e[2], decoded, closed,
                          closed, closed, closed, traceEnable, extended);
  }
  return decoder.decode(rx.q[0], rx.q[1], rx.q[2], rx.e[0], rx.e[1], rx.e[2], decoded,
                        traces->raw, traces->acs, traces->best, traces->traceback, traceEnable,
                        extended);
}

bool runDecode(KLTE_DecoderViterbi& decoder, const Received& rx, Bits& decoded) {
  Extended extended;
  return runDecode(decoder, rx, decoded, extended);
}

std::vector<std::string> lines(const std::string& text) {
  std::vector<std::string> result;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);) {
    result.push_back(line);
  }
  return result;
}

void expectErrorLine(const std::string& captured, const std::string& text) {
  const std::string escaped = std::regex_replace(text, std::regex(R"([()\[\]+.=<>])"), R"(\$&)");
  EXPECT_TRUE(std::regex_match(
      captured, std::regex("File: \\.\\./s/KLTE_DecoderViterbi\\([0-9]+\\)" + escaped + "\n")))
      << captured;
}

TEST(KLTE_DecoderViterbi, DecodesTransmitterCodewordsOfEveryLengthAtDefaultTraceback) {
  std::mt19937 random(5131);
  KLTE_DecoderViterbi decoder;
  for (std::size_t n = 6; n <= 186; ++n) {
    const Bits info = randomBits(n, random);
    Bits decoded(n, 7);
    ASSERT_TRUE(runDecode(decoder, receive(info), decoded));
    EXPECT_EQ(decoded, info) << "N = " << n;
  }
}

TEST(KLTE_DecoderViterbi, DecodesWithOtherTracebackLengthsAndSoftWidths) {
  struct Case {
    std::int32_t traceback;
    std::uint32_t softBits;
    std::size_t n;
  };
  const Case cases[] = {{6, 4, 6},     {48, 3, 90},   {48, 8, 40},   {128, 4, 1 + 121},
                        {128, 4, 250}, {100, 5, 194}, {64, 6, 122}};
  std::mt19937 random(77);
  for (const Case& c : cases) {
    KLTE_DecoderViterbi decoder;
    ASSERT_TRUE(decoder.setTracebackLength(c.traceback));
    ASSERT_TRUE(decoder.setNumSoftBits(c.softBits));
    const Bits info = randomBits(c.n, random);
    Bits decoded(c.n, 7);
    ASSERT_TRUE(runDecode(decoder, receive(info, (1 << c.softBits) - 1), decoded));
    EXPECT_EQ(decoded, info) << "T = " << c.traceback << " s = " << c.softBits << " N = " << c.n;
  }
}

TEST(KLTE_DecoderViterbi, DecodesThroughErasuresAndWeakSoftValues) {
  std::mt19937 random(4242);
  KLTE_DecoderViterbi decoder;
  for (std::size_t n : {20U, 96U, 150U, 186U}) {
    const Bits info = randomBits(n, random);
    Received rx = receive(info);
    for (std::size_t k = 0; k < n; ++k) {
      // Every third d1 value erased (its soft value made misleading), the others weakened
      // to 10 (for 1) and 5 (for 0): still the right side of the middle.
      if (k % 3 == 0) {
        rx.e[1][k] = 1;
        rx.q[1][k] = 15 - rx.q[1][k];
      }
      for (std::size_t s = 0; s < 3; ++s) {
        if (!(s == 1 && k % 3 == 0)) {
          rx.q[s][k] = rx.q[s][k] ? 10 : 5;
        }
      }
    }
    Bits decoded(n, 7);
    ASSERT_TRUE(runDecode(decoder, rx, decoded));
    EXPECT_EQ(decoded, info) << "N = " << n;
    for (std::uint32_t metric : decoder.getPathMetrics()) {
      EXPECT_LT(metric, 256U);
    }
  }
}

// Metrics never decrease except when normalised; 2^(s+3) is subtracted two steps after the
// step at which all of them first reached it, also when those steps straddle a chunk end.
// Ambiguous soft values (7 of 15) make the metrics grow by about 21 every step.
TEST(KLTE_DecoderViterbi, NormalisationFollowsThresholdByTwoSteps) {
  struct Case {
    std::int32_t traceback;
    std::size_t n;
    std::uint32_t softBits;
  };
  const Case cases[] = {{6, 20, 4}, {96, 135, 4}, {16, 30, 3}};
  for (const Case& c : cases) {
    KLTE_DecoderViterbi decoder;
    ASSERT_TRUE(decoder.setTracebackLength(c.traceback));
    ASSERT_TRUE(decoder.setNumSoftBits(c.softBits));
    const std::int32_t middle = (1 << (c.softBits - 1)) - 1;
    Received rx;
    for (std::size_t k = 0; k < 3; ++k) {
      rx.q[k].assign(c.n, middle);
      rx.e[k].assign(c.n, 0);
    }
    Bits decoded(c.n);
    Extended extended;
    Traces traces;
    ASSERT_TRUE(runDecode(decoder, rx, decoded, extended, &traces, true));

    std::vector<std::vector<std::uint32_t>> steps;
    for (const std::string& line : lines(traces.acs.str())) {
      if (line.rfind("[Channel Type", 0) == 0) {
        steps.emplace_back();
      } else if (line.rfind("[", 0) != 0) {
        steps.back().push_back(static_cast<std::uint32_t>(std::stoul(line)));
      }
    }
    ASSERT_EQ(steps.size(), extended[0].size());
    const std::uint32_t threshold = 1U << (c.softBits + 3);
    std::uint32_t counter = 0;
    std::uint32_t normalisations = 0;
    std::uint32_t previousMin = 0;
    for (std::size_t x = 0; x < steps.size(); ++x) {
      ASSERT_EQ(steps[x].size(), 64U);
      const std::uint32_t min = *std::min_element(steps[x].begin(), steps[x].end());
      EXPECT_LT(*std::max_element(steps[x].begin(), steps[x].end()), 2 * threshold);
      if (counter > 0 || min >= threshold) {
        ++counter;
      }
      if (counter == 3) {
        counter = 0;
        ++normalisations;
        EXPECT_LT(min, previousMin) << "T " << c.traceback << " step " << x;
        EXPECT_GE(min + threshold, previousMin) << "T " << c.traceback << " step " << x;
      } else {
        EXPECT_GE(min, previousMin) << "T " << c.traceback << " step " << x;
      }
      previousMin = min;
    }
    EXPECT_GT(normalisations, 2U);
    // The trace lists state bitrev6(h) in line h.
    for (std::uint32_t h = 0; h < 64; ++h) {
      std::uint32_t state = 0;
      for (std::uint32_t i = 0; i < 6; ++i) {
        state |= ((h >> i) & 1U) << (5 - i);
      }
      EXPECT_EQ(decoder.getPathMetrics()[state], steps.back()[h]) << h;
    }
  }
}

TEST(KLTE_DecoderViterbi, AllErasedDecodesZeros) {
  KLTE_DecoderViterbi decoder;
  Received rx;
  for (std::size_t k = 0; k < 3; ++k) {
    rx.q[k].assign(40, 15);
    rx.e[k].assign(40, 1);
  }
  Bits decoded(40, 1);
  ASSERT_TRUE(runDecode(decoder, rx, decoded));
  EXPECT_EQ(decoded, Bits(40, 0));
  EXPECT_EQ(decoder.getPathMetrics(), std::vector<std::uint32_t>(64, 0));
}

// The block is preceded by its last T values and followed by its beginning, repeated
// cyclically when it is shorter than T.
TEST(KLTE_DecoderViterbi, ExtendedInputsAreCyclicCopies) {
  struct Case {
    std::int32_t traceback;
    std::size_t n;
    std::size_t length;
  };
  const Case cases[] = {{96, 10, 288}, {96, 90, 384}, {96, 91, 384}, {48, 200, 336}};
  for (const Case& c : cases) {
    KLTE_DecoderViterbi decoder;
    ASSERT_TRUE(decoder.setTracebackLength(c.traceback));
    Received rx;
    for (std::size_t k = 0; k < 3; ++k) {
      rx.q[k].resize(c.n);
      rx.e[k].resize(c.n);
      for (std::size_t i = 0; i < c.n; ++i) {
        rx.q[k][i] = static_cast<std::int32_t>((i * 7 + k) % 16);
        rx.e[k][i] = static_cast<std::int32_t>((i / 5 + k) % 2);
      }
    }
    Bits decoded(c.n);
    Extended extended;
    ASSERT_TRUE(runDecode(decoder, rx, decoded, extended));
    const std::size_t T = static_cast<std::size_t>(c.traceback);
    for (std::size_t k = 0; k < 6; ++k) {
      const Soft& source = k < 3 ? rx.q[k] : rx.e[k - 3];
      ASSERT_EQ(extended[k].size(), c.length) << "N = " << c.n;
      for (std::size_t t = 0; t < c.length; ++t) {
        ASSERT_EQ(extended[k][t], source[(t + c.n * T - T) % c.n]) << "stream " << k << " t " << t;
      }
    }
  }
}

// Blocks up to T - 6 are decided at the end of chunk 2 with a 2T - 1 deep traceback; longer
// ones also at the end of chunk 3, 2T + 5 deep. Both take four chunks at N = T - 6, T - 5.
TEST(KLTE_DecoderViterbi, ShortAndLongBlockPaths) {
  struct Case {
    std::size_t n;
    std::vector<std::size_t> tracebackBlockLines;
  };
  const Case cases[] = {{90, {192, 192}}, {91, {192, 198}}};
  std::mt19937 random(9);
  for (const Case& c : cases) {
    KLTE_DecoderViterbi decoder;
    const Bits info = randomBits(c.n, random);
    Bits decoded(c.n, 7);
    Extended extended;
    Traces traces;
    ASSERT_TRUE(runDecode(decoder, receive(info), decoded, extended, &traces, true));
    EXPECT_EQ(decoded, info);
    EXPECT_EQ(extended[0].size(), 4U * 96);
    // Each traceback block: three header lines, then the start state and every step.
    std::vector<std::size_t> blockLines;
    for (const std::string& line : lines(traces.traceback.str())) {
      if (line.rfind("[Channel Type : CQI TB Trace Back State output data", 0) == 0) {
        blockLines.push_back(0);
      } else if (line.rfind("[", 0) != 0) {
        ++blockLines.back();
      }
    }
    EXPECT_EQ(blockLines, c.tracebackBlockLines) << "N = " << c.n;
  }
}

// Positions from 2T - 6 onward are never decided: they keep the caller's values.
TEST(KLTE_DecoderViterbi, LongestBlockLeavesLastPositionsUnwritten) {
  std::mt19937 random(128);
  KLTE_DecoderViterbi decoder;
  ASSERT_TRUE(decoder.setTracebackLength(128));
  const Bits info = randomBits(256, random);
  Bits decoded(256, 7);
  ASSERT_TRUE(runDecode(decoder, receive(info), decoded));
  EXPECT_TRUE(std::equal(info.begin(), info.begin() + 250, decoded.begin()));
  EXPECT_EQ(Bits(decoded.begin() + 250, decoded.end()), Bits(6, 7));
}

TEST(KLTE_DecoderViterbi, InvalidBlockSizesAreRefused) {
  struct Case {
    const char* what;
    std::size_t n;
    std::size_t shortStream;  // index into q0..q2, e0..e2, decoded (6): one element fewer
    std::string message;
  };
  const Case cases[] = {
      {"empty", 0, 99, "Error: All blocks must be >0 and <=2560"},
      {"too long", 257, 99, "Error: All blocks must be >0 and <=256257"},
      {"short q1", 40, 1, "Error: All blocks must be the same size"},
      {"short q2", 40, 2, "Error: All blocks must be the same size"},
      {"short e0", 40, 3, "Error: All blocks must be the same size"},
      {"short e2", 40, 5, "Error: All blocks must be the same size"},
      {"short output", 40, 6, "Error: All blocks must be the same size"},
  };
  for (const Case& c : cases) {
    KLTE_DecoderViterbi decoder;
    Received rx;
    for (std::size_t k = 0; k < 3; ++k) {
      rx.q[k].assign(c.n - (c.shortStream == k ? 1 : 0), 3);
      rx.e[k].assign(c.n - (c.shortStream == k + 3 ? 1 : 0), 0);
    }
    Bits decoded(c.n - (c.shortStream == 6 ? 1 : 0), 7);
    const Bits before = decoded;
    Extended extended;
    testing::internal::CaptureStderr();
    EXPECT_FALSE(runDecode(decoder, rx, decoded, extended)) << c.what;
    expectErrorLine(testing::internal::GetCapturedStderr(), c.message);
    EXPECT_EQ(decoded, before) << c.what;
    EXPECT_TRUE(extended[0].empty()) << c.what;
  }
}

TEST(KLTE_DecoderViterbi, RefusedSettersInstallFallbacks) {
  KLTE_DecoderViterbi decoder;
  struct Case {
    std::int32_t length;
    bool accepted;
    std::uint32_t result;
  };
  const Case tracebacks[] = {{5, false, 48}, {129, false, 48}, {-1, false, 48},
                             {128, true, 128}, {6, true, 6}};
  for (const Case& c : tracebacks) {
    ASSERT_TRUE(decoder.setTracebackLength(100));
    testing::internal::CaptureStderr();
    EXPECT_EQ(decoder.setTracebackLength(c.length), c.accepted) << c.length;
    const std::string captured = testing::internal::GetCapturedStderr();
    EXPECT_EQ(decoder.getTracebackLength(), c.result);
    if (c.accepted) {
      EXPECT_EQ(captured, "");
    } else {
      expectErrorLine(captured, "Error: Invalid Traceback length = " + std::to_string(c.length));
    }
  }
  for (std::uint32_t bits : {2U, 9U}) {
    ASSERT_TRUE(decoder.setNumSoftBits(6));
    testing::internal::CaptureStderr();
    EXPECT_FALSE(decoder.setNumSoftBits(bits));
    expectErrorLine(testing::internal::GetCapturedStderr(),
                    "Error: Invalid Number of Soft bits =" + std::to_string(bits));
    EXPECT_EQ(decoder.getNumSoftBits(), 4U);
  }
  EXPECT_TRUE(decoder.setNumSoftBits(3));
  EXPECT_TRUE(decoder.setNumSoftBits(8));
}

// Walking the register with nextState and encoderOutput from the tail-biting start state
// reproduces the transmitter's three streams.
TEST(KLTE_DecoderViterbi, EncoderModelMatchesTransmitter) {
  std::mt19937 random(31);
  const KLTE_DecoderViterbi decoder;
  const Bits info = randomBits(60, random);
  const brannoc::tx::ConvolutionalStreams d = brannoc::tx::encodeTailBiting(info);
  std::uint32_t startNumber = 0;
  for (std::uint32_t i = 0; i < 6; ++i) {
    startNumber |= static_cast<std::uint32_t>(info[info.size() - 6 + i]) << i;
  }
  std::vector<std::uint8_t> state = decoder.stateNumberToVector(startNumber);
  ASSERT_EQ(KLTE_DecoderViterbi::stateVectorToNumber(state), startNumber);
  std::vector<std::uint8_t> next(6);
  for (std::size_t k = 0; k < info.size(); ++k) {
    for (std::uint32_t stream = 0; stream < 3; ++stream) {
      ASSERT_EQ(decoder.encoderOutput(state, info[k], stream), d[stream][k])
          << "stream " << stream << " k " << k;
    }
    ASSERT_TRUE(decoder.nextState(state, next, info[k]));
    state = next;
  }
  EXPECT_EQ(KLTE_DecoderViterbi::stateVectorToNumber(state), startNumber);
}

TEST(KLTE_DecoderViterbi, EncoderModelReportsBadArguments) {
  const KLTE_DecoderViterbi decoder;
  std::vector<std::uint8_t> state(6, 1);
  std::vector<std::uint8_t> next(5);
  testing::internal::CaptureStderr();
  EXPECT_FALSE(decoder.nextState(state, next, 1));
  expectErrorLine(testing::internal::GetCapturedStderr(), "Error: next state length= 7");
  testing::internal::CaptureStderr();
  EXPECT_FALSE(decoder.nextState(next, state, 1));
  expectErrorLine(testing::internal::GetCapturedStderr(), "Error: current state length= 7");

  testing::internal::CaptureStderr();
  EXPECT_EQ(decoder.encoderOutput(state, 1, 3), 0);
  expectErrorLine(testing::internal::GetCapturedStderr(),
                  "Error: Invalid rate, bit selection = 3");
  // A short state vector is reported and its missing register bits count as 0.
  testing::internal::CaptureStderr();
  EXPECT_EQ(decoder.encoderOutput({}, 1, 0), 1);
  expectErrorLine(testing::internal::GetCapturedStderr(), "Error: constraint length= 7");
}

TEST(KLTE_DecoderViterbi, TraceStreamsFollowHardwareFormats) {
  std::mt19937 random(1);
  KLTE_DecoderViterbi decoder;
  ASSERT_TRUE(decoder.setTracebackLength(16));
  const Bits info = randomBits(8, random);
  Received rx = receive(info);
  for (Soft& erasures : rx.e) {
    erasures[0] = 1;  // extended steps 0, 8, ... carry no information
  }
  Bits decoded(8);
  Extended extended;
  Traces traces;
  ASSERT_TRUE(runDecode(decoder, rx, decoded, extended, &traces, true));
  EXPECT_EQ(decoded, info);
  const std::size_t L = 48;

  const std::vector<std::string> raw = lines(traces.raw.str());
  ASSERT_EQ(raw.size(), 3 + L);
  EXPECT_EQ(raw[0],
            "[Channel Type : CQI TB raw viterbi input data: (Offset-Binary) Soft Bits 4 : Format "
            "d2,d1,d0,erase2,erase1,erase0,dv]");
  EXPECT_EQ(raw[1],
            "[Size of Array 0 : 48 Size of Array 1 : 48 Size of Array 2 : 48 Size of Array 3 : 48 "
            "Size of Array 4 : 48 Size of Array 5 : 48 Size of Array 6 : 48]");
  EXPECT_EQ(raw[2], "[length: 48]");
  // Line of t = T (block position 0, d2 erased) and of t = T - 1 (outside the block).
  auto rawLine = [&](std::size_t t) {
    std::string digits;
    for (std::size_t k = 3; k-- > 0;) {
      for (int bit = 3; bit >= 0; --bit) {
        digits += static_cast<char>('0' + ((extended[k][t] >> bit) & 1));
      }
    }
    const bool valid = t >= 16 && t < 24;
    digits += std::to_string(extended[5][t]) + std::to_string(extended[4][t]) +
              std::to_string(extended[3][t]) + (valid ? "1" : "0");
    return digits + " # " + std::to_string(extended[2][t]) + " " + std::to_string(extended[1][t]) +
           " " + std::to_string(extended[0][t]) + " " + std::to_string(extended[5][t]) + " " +
           std::to_string(extended[4][t]) + " " + std::to_string(extended[3][t]) +
           (valid ? " 1" : " 0");
  };
  EXPECT_EQ(raw[3 + 16], rawLine(16));
  EXPECT_EQ(raw[3 + 15], rawLine(15));
  EXPECT_EQ(extended[5][16], 1);

  const std::string acs = traces.acs.str();
  const std::vector<std::string> acsLines = lines(acs);
  ASSERT_EQ(acsLines.size(), L * 67);
  EXPECT_EQ(acsLines[0],
            "[Channel Type : CQI TB ACS output data: (Offset-Binary) Soft Bits 7 : Format acs]");
  EXPECT_EQ(acsLines[1], "[Size of Array 0 : 64]");
  EXPECT_EQ(acsLines[2], "[length: 64]");
  // The last block lists the final path metrics in bit-reversed state order.
  const std::vector<std::uint32_t>& metrics = decoder.getPathMetrics();
  EXPECT_EQ(acsLines[(L - 1) * 67 + 3 + 1], std::to_string(metrics[32]));
  EXPECT_EQ(acsLines[(L - 1) * 67 + 3 + 3], std::to_string(metrics[48]));

  const std::vector<std::string> best = lines(traces.best.str());
  EXPECT_EQ(std::count_if(best.begin(), best.end(),
                          [](const std::string& line) {
                            return line.find(
                                       "[Channel Type : CQI TB Best State output data: Format "
                                       "best state]") != std::string::npos;
                          }),
            static_cast<std::ptrdiff_t>(L));
  // The first step is erased and starts from equal metrics: every state ties, the ties are
  // noted during the selection and flagged in the list, and the even predecessor survives.
  EXPECT_EQ(best[0].rfind("A: 0 : 0 :: A: 1 : 2 :: ", 0), 0U) << best[0];
  EXPECT_NE(best[0].find("B: 63 : 62 :: [Channel Type"), std::string::npos) << best[0];
  EXPECT_EQ(best[3], "0 : 0 ****");

  const std::vector<std::string> traceback = lines(traces.traceback.str());
  ASSERT_EQ(traceback.size(), 1 * (3 + 32));  // chunk 2 only
  EXPECT_EQ(traceback[1], "[Size of Array 0 : 32]");
}

TEST(KLTE_DecoderViterbi, RandomInputDelayAddsIdleChunks) {
  KLTE_DecoderViterbi decoder;
  decoder.setRandomInputDelay(true);
  ASSERT_TRUE(decoder.setTracebackLength(16));
  std::mt19937 random(2);
  const Bits info = randomBits(8, random);
  Bits decoded(8);
  Extended extended;
  Traces traces;
  ASSERT_TRUE(runDecode(decoder, receive(info), decoded, extended, &traces, false));
  EXPECT_EQ(decoded, info);
  EXPECT_TRUE(traces.acs.str().empty());
  const std::vector<std::string> raw = lines(traces.raw.str());
  ASSERT_GT(raw.size(), 3U + 48);
  const std::size_t idle = raw.size() - 3 - 48;
  EXPECT_EQ(idle % 16, 0U);
  EXPECT_GE(idle / 16, 1U);
  EXPECT_LE(idle / 16, 9U);
  EXPECT_EQ(raw.back(), "0000000000001110 # 0 0 0 1 1 1 0");
  EXPECT_EQ(raw[2], "[length: " + std::to_string(48 + idle) + "]");
}

}  // namespace
