// Tests of the tail-biting Viterbi decoder model (TS 36.212 5.1.3.1 code): round trips from
// the transmitter's tail-biting encoder, the short and long block paths, positions left
// unwritten, erasures, validation messages, setters' fallbacks and the trace streams.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <fstream>
#include <random>
#include <sstream>
#include <string>
#include <vector>

#include "DecoderTestSupport.h"
#include "KLTE_DecoderViterbi.h"
#include "tx/ConvolutionalCode.h"

namespace brannoc::test {
namespace {
using Bits = std::vector<std::uint8_t>;
using Soft = std::vector<std::int32_t>;
using Extended = KLTE_DecoderViterbi::ExtendedRxData;

// Soft streams q0..q2 and erasure streams e0..e2 of one block.
struct Received {
  std::array<Soft, 3> q;
  std::array<Soft, 3> e;
};

// The transmitter's tail-biting codeword as offset-binary soft values (one -> most
// confident 1), no erasures.
Received receive(const Bits& info, std::int32_t one = 15) {
  const tx::ConvolutionalStreams d = tx::encodeTailBiting(info);
  Received rx;
  for (std::size_t k = 0; k < 3; ++k) {
    for (std::uint8_t bit : d[k]) {
      rx.q[k].push_back(bit ? one : 0);
    }
    rx.e[k].assign(info.size(), 0);
  }
  return rx;
}

// Every stream of n values v, not erased.
Received constant(std::size_t n, std::int32_t v) {
  Received rx;
  for (std::size_t k = 0; k < 3; ++k) {
    rx.q[k].assign(n, v);
    rx.e[k].assign(n, 0);
  }
  return rx;
}

struct Traces {
  std::ostringstream raw, acs, best, traceback;
};

// Decodes with the traces written (when given) or into a stream that is not open.
bool run(KLTE_DecoderViterbi& decoder, const Received& rx, Bits& decoded,
         Extended* extended = nullptr, Traces* traces = nullptr, bool traceEnable = true) {
  std::ofstream closed;
  Extended unused;
  Extended& ext = extended ? *extended : unused;
  if (traces == nullptr) {
    return decoder.decode(rx.q[0], rx.q[1], rx.q[2], rx.e[0], rx.e[1], rx.e[2], decoded, closed,
                          closed, closed, closed, false, ext);
  }
  return decoder.decode(rx.q[0], rx.q[1], rx.q[2], rx.e[0], rx.e[1], rx.e[2], decoded, traces->raw,
                        traces->acs, traces->best, traces->traceback, traceEnable, ext);
}

std::vector<std::string> lines(const std::string& text) {
  std::vector<std::string> result;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);) {
    result.push_back(line);
  }
  return result;
}

// The decoder's error line around text.
std::string errorLine(const std::string& text) {
  return "File: ../s/KLTE_DecoderViterbi(#)" + text + "\n";
}

// Round trips from the transmitter's encoder: every length at the default traceback 96, other
// tracebacks and soft widths, and erasures. In the erasure rows, at position k stream k mod 3
// is erased and its soft value turned round; the others are weakened to 10 (for 1) and 5 (for
// 0): still the right side of the middle. Erasures on the wrong stream would leave a confident
// wrong value at every position. All erased decodes zeros.
TEST(KLTE_DecoderViterbi, DecodesTransmitterCodewordsThroughErasures) {
  struct Case {
    std::int32_t traceback;
    std::uint32_t softBits;
    std::size_t shortest, longest;
    bool erasures;
  };
  const Case cases[] = {{96, 4, 6, 186, false},    {6, 4, 6, 6, false},
                        {48, 3, 90, 90, false},    {128, 8, 250, 250, false},
                        {100, 5, 194, 194, false}, {96, 4, 20, 20, true},
                        {96, 4, 150, 150, true}};
  std::mt19937 random(5131);
  for (const Case& c : cases) {
    KLTE_DecoderViterbi decoder;
    ASSERT_TRUE(decoder.setTracebackLength(c.traceback));
    ASSERT_TRUE(decoder.setNumSoftBits(c.softBits));
    for (std::size_t n = c.shortest; n <= c.longest; ++n) {
      const Bits info = randomBits(n, random);
      Received rx = receive(info, (1 << c.softBits) - 1);
      for (std::size_t k = 0; c.erasures && k < n; ++k) {
        for (std::size_t s = 0; s < 3; ++s) {
          rx.q[s][k] = s == k % 3 ? 15 - rx.q[s][k] : (rx.q[s][k] ? 10 : 5);
        }
        rx.e[k % 3][k] = 1;
      }
      Bits decoded(n, 7);
      ASSERT_TRUE(run(decoder, rx, decoded));
      EXPECT_EQ(decoded, info) << "T " << c.traceback << " s " << c.softBits << " N " << n;
    }
  }
  KLTE_DecoderViterbi decoder;
  Received erased = constant(40, 15);
  for (Soft& e : erased.e) {
    e.assign(40, 1);
  }
  Bits decoded(40, 1);
  ASSERT_TRUE(run(decoder, erased, decoded));
  EXPECT_EQ(decoded, Bits(40, 0));
  EXPECT_EQ(decoder.getPathMetrics(), std::vector<std::uint32_t>(64, 0));
}

// Metrics never decrease except when normalised; 2^(s+3) is subtracted two steps after the
// step at which all of them first reached it, also when those steps straddle a chunk end.
// Ambiguous soft values (the middle) make the metrics grow by about 21 every step.
TEST(KLTE_DecoderViterbi, NormalisationFollowsThresholdByTwoSteps) {
  struct Case {
    std::int32_t traceback;
    std::size_t n;
    std::uint32_t softBits;
  };
  for (const Case& c : {Case{6, 20, 4}, Case{96, 135, 4}, Case{16, 30, 3}}) {
    KLTE_DecoderViterbi decoder;
    ASSERT_TRUE(decoder.setTracebackLength(c.traceback));
    ASSERT_TRUE(decoder.setNumSoftBits(c.softBits));
    Bits decoded(c.n);
    Extended extended;
    Traces traces;
    ASSERT_TRUE(
        run(decoder, constant(c.n, (1 << (c.softBits - 1)) - 1), decoded, &extended, &traces));
    std::vector<std::vector<std::uint32_t>> steps;  // the 64 metrics after each step
    for (const std::string& line : lines(traces.acs.str())) {
      if (line.rfind("[Channel Type", 0) == 0) {
        steps.emplace_back();
      } else if (line.rfind("[", 0) != 0) {
        steps.back().push_back(static_cast<std::uint32_t>(std::stoul(line)));
      }
    }
    ASSERT_EQ(steps.size(), extended[0].size());
    const std::uint32_t threshold = 1U << (c.softBits + 3);
    std::uint32_t counter = 0, normalisations = 0, previousMin = 0;
    for (std::size_t x = 0; x < steps.size(); ++x) {
      ASSERT_EQ(steps[x].size(), 64U);
      const std::uint32_t min = *std::min_element(steps[x].begin(), steps[x].end());
      EXPECT_LT(*std::max_element(steps[x].begin(), steps[x].end()), 2 * threshold);
      counter = (counter > 0 || min >= threshold) ? counter + 1 : 0;
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

// Blocks up to T - 6 are decided at the end of chunk 2 with a 2T - 1 deep traceback; longer
// ones also at the end of chunk 3, 2T + 5 deep. Both take four chunks at N = T - 6, T - 5.
// Positions from 2T - 6 onward are never decided: they keep the caller's values.
TEST(KLTE_DecoderViterbi, ShortAndLongBlockPathsAndUnwrittenPositions) {
  struct Case {
    std::size_t n;
    std::vector<std::size_t> tracebackBlockLines;
  };
  std::mt19937 random(9);
  for (const Case& c : {Case{90, {192, 192}}, Case{91, {192, 198}}}) {
    KLTE_DecoderViterbi decoder;
    const Bits info = randomBits(c.n, random);
    Bits decoded(c.n, 7);
    Extended extended;
    Traces traces;
    ASSERT_TRUE(run(decoder, receive(info), decoded, &extended, &traces));
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
  KLTE_DecoderViterbi decoder;
  ASSERT_TRUE(decoder.setTracebackLength(128));
  const Bits info = randomBits(256, random);
  Bits decoded(256, 7);
  ASSERT_TRUE(run(decoder, receive(info), decoded));
  EXPECT_TRUE(std::equal(info.begin(), info.begin() + 250, decoded.begin()));
  EXPECT_EQ(Bits(decoded.begin() + 250, decoded.end()), Bits(6, 7));
}

TEST(KLTE_DecoderViterbi, InvalidBlockSizesAreRefused) {
  struct Case {
    std::size_t n;
    std::size_t shortStream;  // index into q0..q2, e0..e2, decoded (6): one element fewer
    std::string message;
  };
  const Case cases[] = {
      {0, 99, "Error: All blocks must be >0 and <=2560"},
      {257, 99, "Error: All blocks must be >0 and <=256257"},
      {40, 1, "Error: All blocks must be the same size"},
      {40, 5, "Error: All blocks must be the same size"},
      {40, 6, "Error: All blocks must be the same size"},
  };
  for (const Case& c : cases) {
    KLTE_DecoderViterbi decoder;
    Received rx = constant(c.n, 3);
    if (c.shortStream < 6) {
      (c.shortStream < 3 ? rx.q[c.shortStream] : rx.e[c.shortStream - 3]).pop_back();
    }
    Bits decoded(c.n - (c.shortStream == 6 ? 1 : 0), 7);
    const Bits before = decoded;
    Extended extended;
    expectRefusals({{[&] { return run(decoder, rx, decoded, &extended); }, errorLine(c.message)}});
    EXPECT_EQ(decoded, before);
    EXPECT_TRUE(extended[0].empty());
  }
}

// A refused setting prints its line and installs the fallback T = 48 or 4 soft bits.
TEST(KLTE_DecoderViterbi, RefusedSettersInstallFallbacks) {
  KLTE_DecoderViterbi decoder;
  for (std::int32_t length : {5, 129, -1}) {
    ASSERT_TRUE(decoder.setTracebackLength(100));
    expectRefusals({{[&] { return decoder.setTracebackLength(length); },
                     errorLine("Error: Invalid Traceback length = " + std::to_string(length))}});
    EXPECT_EQ(decoder.getTracebackLength(), 48U);
  }
  for (std::uint32_t bits : {2U, 9U}) {
    ASSERT_TRUE(decoder.setNumSoftBits(6));
    expectRefusals({{[&] { return decoder.setNumSoftBits(bits); },
                     errorLine("Error: Invalid Number of Soft bits =" + std::to_string(bits))}});
    EXPECT_EQ(decoder.getNumSoftBits(), 4U);
  }
}

// Walking the register with nextState and encoderOutput from the tail-biting start state
// reproduces the transmitter's three streams; bad arguments are reported.
TEST(KLTE_DecoderViterbi, EncoderModelMatchesTransmitterAndReportsBadArguments) {
  std::mt19937 random(31);
  const KLTE_DecoderViterbi decoder;
  const Bits info = randomBits(60, random);
  const tx::ConvolutionalStreams d = tx::encodeTailBiting(info);
  std::uint32_t startNumber = 0;
  for (std::uint32_t i = 0; i < 6; ++i) {
    startNumber |= static_cast<std::uint32_t>(info[info.size() - 6 + i]) << i;
  }
  std::vector<std::uint8_t> state = decoder.stateNumberToVector(startNumber);
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

  // A short state vector is reported and its missing register bits count as 0.
  std::vector<std::uint8_t> seven(6, 1), five(5);
  expectRefusals({
      {[&] { return decoder.nextState(seven, five, 1); }, errorLine("Error: next state length= 7")},
      {[&] { return decoder.nextState(five, seven, 1); },
       errorLine("Error: current state length= 7")},
      {[&] { return decoder.encoderOutput(seven, 1, 3) != 0; },  // gives 0
       errorLine("Error: Invalid rate, bit selection = 3")},
      {[&] { return decoder.encoderOutput({}, 1, 0) == 0; },  // gives 1
       errorLine("Error: constraint length= 7")},
  });
}

// An all-zero block of 8 at T = 16 with block position 0 erased in every stream.
TEST(KLTE_DecoderViterbi, TraceStreamsFollowHardwareFormats) {
  KLTE_DecoderViterbi decoder;
  ASSERT_TRUE(decoder.setTracebackLength(16));
  Received rx = constant(8, 0);
  for (Soft& erasures : rx.e) {
    erasures[0] = 1;
  }
  Bits decoded(8, 1);
  Traces traces;
  ASSERT_TRUE(run(decoder, rx, decoded, nullptr, &traces));
  EXPECT_EQ(decoded, Bits(8, 0));
  const std::size_t L = 48;

  const std::vector<std::string> raw = lines(traces.raw.str());
  ASSERT_EQ(raw.size(), 3 + L);
  EXPECT_EQ(raw[0],
            "[Channel Type : CQI TB raw viterbi input data: (Offset-Binary) Soft Bits 4 : Format "
            "d2,d1,d0,erase2,erase1,erase0,dv]");
  EXPECT_EQ(raw[2], "[length: 48]");
  EXPECT_EQ(raw[3 + 16], "0000000000001111 # 0 0 0 1 1 1 1");  // t = T: block position 0
  EXPECT_EQ(raw[3 + 15], "0000000000000000 # 0 0 0 0 0 0 0");  // outside the block

  const std::vector<std::string> acs = lines(traces.acs.str());
  ASSERT_EQ(acs.size(), L * 67);
  EXPECT_EQ(acs[0],
            "[Channel Type : CQI TB ACS output data: (Offset-Binary) Soft Bits 7 : Format acs]");

  // The first step is erased and starts from equal metrics: every state ties, the ties are
  // noted during the selection and flagged in the list, and the even predecessor survives.
  const std::vector<std::string> best = lines(traces.best.str());
  EXPECT_EQ(best[0].rfind("A: 0 : 0 :: A: 1 : 2 :: ", 0), 0U) << best[0];
  EXPECT_NE(best[0].find("B: 63 : 62 :: [Channel Type : CQI TB Best State output data: Format "
                         "best state]"),
            std::string::npos)
      << best[0];
  EXPECT_EQ(best[3], "0 : 0 ****");

  const std::vector<std::string> traceback = lines(traces.traceback.str());
  ASSERT_EQ(traceback.size(), 1 * (3 + 32));  // chunk 2 only
  EXPECT_EQ(traceback[1], "[Size of Array 0 : 32]");

  // A random input delay adds idle chunks of T lines, and without traceEnable no ACS trace.
  decoder.setRandomInputDelay(true);
  Traces delayed;
  ASSERT_TRUE(run(decoder, rx, decoded, nullptr, &delayed, false));
  EXPECT_EQ(decoded, Bits(8, 0));
  EXPECT_TRUE(delayed.acs.str().empty());
  const std::vector<std::string> delayedRaw = lines(delayed.raw.str());
  const std::size_t idle = delayedRaw.size() - 3 - L;
  EXPECT_EQ(idle % 16, 0U);
  EXPECT_GE(idle / 16, 1U);
  EXPECT_LE(idle / 16, 9U);
  EXPECT_EQ(delayedRaw.back(), "0000000000001110 # 0 0 0 1 1 1 0");
  EXPECT_EQ(delayedRaw[2], "[length: " + std::to_string(L + idle) + "]");
}

}  // namespace
}  // namespace brannoc::test
