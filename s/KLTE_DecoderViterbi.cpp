// KLTE_DecoderViterbi: hardware model of the tail-biting Viterbi decoder for the rate 1/3,
// constraint length 7 convolutional code of TS 36.212 clause 5.1.3.1.
#include "KLTE_DecoderViterbi.h"

#include <algorithm>
#include <bit>
#include <cstdlib>
#include <fstream>
#include <string_view>

#include "errorLine.h"

namespace brannoc {

namespace {

constexpr std::string_view kSource = "../s/KLTE_DecoderViterbi";

constexpr std::uint32_t kNumStates = 64;
constexpr std::uint32_t kStateBits = 6;
constexpr std::uint32_t kMaxBlockLength = 256;
constexpr std::uint32_t kMaxTracebackLength = 128;
constexpr std::uint32_t kFallbackTracebackLength = 48;
constexpr std::uint32_t kFallbackNumSoftBits = 4;
// Start of the best-state search: above any path metric (they stay below 2^(s+4)).
constexpr std::uint32_t kBestStateStart = 1000000;
// The hardware's survivor memory; the extended block never exceeds N + 3T + 6 steps.
constexpr std::uint32_t kSurvivorMemorySteps = 2048;
static_assert(kMaxBlockLength + 3 * kMaxTracebackLength + 6 <= kSurvivorMemorySteps);

// Register taps of the three code bits, as masks of the state number (bit i = S_i, bit 5 the
// newest information bit): G0 = 133, G1 = 171, G2 = 165 octal without their input tap.
constexpr std::uint32_t kOutputTaps[3] = {0x1B, 0x39, 0x35};

// Code bit `selection` (0, 1 or 2) for state number S and input bit u.
std::uint32_t codeBit(std::uint32_t state, std::uint32_t inputBit, std::uint32_t selection) {
  return (inputBit ^ static_cast<std::uint32_t>(std::popcount(state & kOutputTaps[selection]))) &
         1U;
}

// The hardware visits states h = 0..63 as bitrev6(h).
std::uint32_t bitrev6(std::uint32_t h) {
  std::uint32_t r = 0;
  for (std::uint32_t i = 0; i < kStateBits; ++i) {
    r |= ((h >> i) & 1U) << (kStateBits - 1 - i);
  }
  return r;
}

// A trace stream is written only when it can take output: a file stream must be open, any
// stream must be in a good state.
bool traceOpen(std::ostream& stream) {
  if (!stream.good()) {
    return false;
  }
  if (const auto* file = dynamic_cast<const std::filebuf*>(stream.rdbuf())) {
    return file->is_open();
  }
  return stream.rdbuf() != nullptr;
}

void writeBinary(std::ostream& out, std::int32_t value, std::uint32_t digits) {
  for (std::uint32_t bit = digits; bit-- > 0;) {
    out << ((static_cast<std::uint32_t>(value) >> bit) & 1U);
  }
}

}  // namespace

KLTE_DecoderViterbi::KLTE_DecoderViterbi()
    : itsConstraintLength(7),
      itsNumOutputs(3),
      itsTracebackLength(96),
      itsUseBestState(true),
      itsNumSoftBits(4),
      itsRandomInputDelay(false) {}

bool KLTE_DecoderViterbi::setTracebackLength(std::int32_t length) {
  if (length < static_cast<std::int32_t>(itsConstraintLength - 1) ||
      length > static_cast<std::int32_t>(kMaxTracebackLength)) {
    errorLineFile(kSource, __LINE__, "Error: Invalid Traceback length = ", length);
    itsTracebackLength = kFallbackTracebackLength;
    return false;
  }
  itsTracebackLength = static_cast<std::uint32_t>(length);
  return true;
}

bool KLTE_DecoderViterbi::setNumSoftBits(std::uint32_t bits) {
  if (bits < 3 || bits > 8) {
    errorLineFile(kSource, __LINE__, "Error: Invalid Number of Soft bits =", bits);
    itsNumSoftBits = kFallbackNumSoftBits;
    return false;
  }
  itsNumSoftBits = bits;
  return true;
}

bool KLTE_DecoderViterbi::nextState(const std::vector<std::uint8_t>& currentState,
                                    std::vector<std::uint8_t>& nextStateVector,
                                    std::uint8_t inputBit) const {
  const std::size_t stateBits = itsConstraintLength - 1;
  if (currentState.size() != stateBits) {
    errorLineFile(kSource, __LINE__, "Error: current state length= ", itsConstraintLength);
    return false;
  }
  if (nextStateVector.size() != stateBits) {
    errorLineFile(kSource, __LINE__, "Error: next state length= ", itsConstraintLength);
    return false;
  }
  for (std::size_t i = 0; i + 1 < stateBits; ++i) {
    nextStateVector[i] = currentState[i + 1];
  }
  nextStateVector[stateBits - 1] = inputBit;
  return true;
}

// A state vector of the wrong length is reported and used as far as it goes: missing
// register bits count as 0, surplus elements are ignored.
std::uint8_t KLTE_DecoderViterbi::encoderOutput(const std::vector<std::uint8_t>& state,
                                                std::uint8_t inputBit,
                                                std::uint32_t selection) const {
  if (state.size() != itsConstraintLength - 1) {
    errorLineFile(kSource, __LINE__, "Error: constraint length= ", itsConstraintLength);
  }
  if (selection > 2) {
    errorLineFile(kSource, __LINE__, "Error: Invalid rate, bit selection = ", selection);
    return 0;
  }
  std::uint32_t number = 0;
  for (std::size_t i = 0; i < state.size() && i < kStateBits; ++i) {
    number |= static_cast<std::uint32_t>(state[i] != 0) << i;
  }
  return static_cast<std::uint8_t>(codeBit(number, inputBit != 0, selection));
}

std::vector<std::uint8_t> KLTE_DecoderViterbi::stateNumberToVector(std::uint32_t state) const {
  std::vector<std::uint8_t> bits(itsConstraintLength - 1);
  for (std::size_t i = 0; i < bits.size(); ++i) {
    bits[i] = static_cast<std::uint8_t>((state >> i) & 1U);
  }
  return bits;
}

std::uint32_t KLTE_DecoderViterbi::stateVectorToNumber(const std::vector<std::uint8_t>& state) {
  std::uint32_t number = 0;
  for (std::size_t i = 0; i < state.size() && i < 32; ++i) {
    number += static_cast<std::uint32_t>(state[i]) << i;
  }
  return number;
}

bool KLTE_DecoderViterbi::decode(
    const std::vector<std::int32_t>& q0, const std::vector<std::int32_t>& q1,
    const std::vector<std::int32_t>& q2, const std::vector<std::int32_t>& e0,
    const std::vector<std::int32_t>& e1, const std::vector<std::int32_t>& e2,
    std::vector<std::uint8_t>& decodedBits, std::ostream& rawInputTrace, std::ostream& acsTrace,
    std::ostream& bestStateTrace, std::ostream& tracebackTrace, bool traceEnable,
    ExtendedRxData& extendedRxData) {
  const std::uint32_t T = itsTracebackLength;
  if (T < itsConstraintLength - 1) {
    errorLineFile(kSource, __LINE__, "Error: Traceback size must >= ", itsConstraintLength - 1);
    return false;
  }
  if (T > kMaxTracebackLength) {
    errorLineFile(kSource, __LINE__, "Error: Traceback size must < 128 ");
    return false;
  }
  const std::size_t N = q0.size();
  if (N < 1 || N > kMaxBlockLength) {
    errorLineFile(kSource, __LINE__, "Error: All blocks must be >0 and <=256", N);
    return false;
  }
  if (q1.size() != N || q2.size() != N || decodedBits.size() != N || e0.size() != N ||
      e1.size() != N || e2.size() != N) {
    errorLineFile(kSource, __LINE__, "Error: All blocks must be the same size");
    return false;
  }

  // Extended length: at least T of history before the block, the block, and enough after it
  // for the traceback window, in whole chunks of T.
  std::uint32_t L = 3 * T;
  while (L < N + 2 * T + 7) {
    L += T;
  }
  const std::uint32_t numChunks = L / T;

  // Cyclic extension: element t is input[(t - T) mod N], so the block sits at T .. T+N-1.
  const std::vector<std::int32_t>* inputs[6] = {&q0, &q1, &q2, &e0, &e1, &e2};
  for (std::size_t k = 0; k < 6; ++k) {
    std::vector<std::int32_t>& extended = extendedRxData[k];
    extended.resize(L);
    const auto n = static_cast<std::int64_t>(N);
    for (std::uint32_t t = 0; t < L; ++t) {
      const std::int64_t position = ((static_cast<std::int64_t>(t) - T) % n + n) % n;
      extended[t] = (*inputs[k])[static_cast<std::size_t>(position)];
    }
  }
  const std::vector<std::int32_t>& xq0 = extendedRxData[0];
  const std::vector<std::int32_t>& xq1 = extendedRxData[1];
  const std::vector<std::int32_t>& xq2 = extendedRxData[2];
  const std::vector<std::int32_t>& xe0 = extendedRxData[3];
  const std::vector<std::int32_t>& xe1 = extendedRxData[4];
  const std::vector<std::int32_t>& xe2 = extendedRxData[5];

  const std::uint32_t s = itsNumSoftBits;

  // Raw input trace, with r idle lines when the random input delay is on.
  std::uint32_t r = 0;
  if (itsRandomInputDelay) {
    r = T * (1 + static_cast<std::uint32_t>(std::rand() % 9));
  }
  if (traceOpen(rawInputTrace)) {
    std::ostream& out = rawInputTrace;
    out << "[Channel Type : CQI TB raw viterbi input data: (Offset-Binary) Soft Bits " << s
        << " : Format d2,d1,d0,erase2,erase1,erase0,dv]\n";
    out << "[Size of Array 0 : " << L + r;
    for (int a = 1; a <= 5; ++a) {
      out << " Size of Array " << a << " : " << L + r;
    }
    out << " Size of Array 6 : " << L << "]\n";
    out << "[length: " << L + r << "]\n";
    for (std::uint32_t t = 0; t < L; ++t) {
      const int valid = (t >= T && t < T + N) ? 1 : 0;
      writeBinary(out, xq2[t], s);
      writeBinary(out, xq1[t], s);
      writeBinary(out, xq0[t], s);
      out << (xe2[t] & 1) << (xe1[t] & 1) << (xe0[t] & 1) << valid << " # " << xq2[t] << ' '
          << xq1[t] << ' ' << xq0[t] << ' ' << xe2[t] << ' ' << xe1[t] << ' ' << xe0[t] << ' '
          << valid << '\n';
    }
    for (std::uint32_t line = 0; line < r; ++line) {
      out << "0000000000001110 # 0 0 0 1 1 1 0\n";
    }
  }
  const bool acsOn = traceEnable && traceOpen(acsTrace);
  const bool bestOn = traceEnable && traceOpen(bestStateTrace);
  const bool tracebackOn = traceEnable && traceOpen(tracebackTrace);

  // Code bits (d0 in bit 0, d1 in bit 1, d2 in bit 2) of the two branches into every state:
  // from a = 2(e mod 32) and from a + 1, with input bit e / 32.
  std::uint8_t branchPattern[kNumStates][2];
  for (std::uint32_t e = 0; e < kNumStates; ++e) {
    for (std::uint32_t odd = 0; odd < 2; ++odd) {
      const std::uint32_t p = 2 * (e % 32) + odd;
      const std::uint32_t u = e / 32;
      branchPattern[e][odd] = static_cast<std::uint8_t>(codeBit(p, u, 0) | (codeBit(p, u, 1) << 1) |
                                                        (codeBit(p, u, 2) << 2));
    }
  }

  const std::uint32_t softMax = (1U << s) - 1;
  const std::uint32_t saturation = 1U << (s + 4);
  const std::uint32_t normalisation = 1U << (s + 3);
  // Block lengths up to T - 6 are fully decided at the end of chunk 2; longer blocks are
  // decided in two halves at the ends of chunks 2 and 3.
  const bool shortBlock = N + 6 <= T;
  const std::uint32_t decisionDepth = T + 6;

  std::vector<std::uint8_t> survivors(static_cast<std::size_t>(L) * kNumStates);
  std::uint32_t metric[kNumStates] = {};
  std::uint32_t candA[kNumStates];
  std::uint32_t candB[kNumStates];
  std::uint32_t normalisationCounter = 0;
  itsPathMetrics.assign(kNumStates, 0);

  for (std::uint32_t c = 0; c < numChunks; ++c) {
    for (std::uint32_t j = 0; j < T; ++j) {
      const std::uint32_t t = c * T + j;
      // An erased stream costs nothing for either hypothesis.
      const std::uint32_t mask[3] = {(xe0[t] & 1) ? 0U : softMax, (xe1[t] & 1) ? 0U : softMax,
                                     (xe2[t] & 1) ? 0U : softMax};
      const std::uint32_t q[3] = {static_cast<std::uint32_t>(xq0[t]),
                                  static_cast<std::uint32_t>(xq1[t]),
                                  static_cast<std::uint32_t>(xq2[t])};
      // Cost of each of the eight code-bit patterns: q where 0 is expected, NOT q where 1 is.
      std::uint32_t patternCost[8];
      for (std::uint32_t pattern = 0; pattern < 8; ++pattern) {
        std::uint32_t cost = 0;
        for (std::uint32_t k = 0; k < 3; ++k) {
          cost += (((pattern >> k) & 1U) ? ~q[k] : q[k]) & mask[k];
        }
        patternCost[pattern] = cost;
      }

      // Add-compare-select: target e has predecessors a = 2(e mod 32) and a + 1, both with
      // input bit e / 32; on equal costs the even predecessor survives. Then saturation.
      std::uint8_t* survivor = &survivors[static_cast<std::size_t>(t) * kNumStates];
      std::uint32_t minMetric = saturation;
      for (std::uint32_t e = 0; e < kNumStates; ++e) {
        const std::uint32_t a = 2 * (e % 32);
        candA[e] = metric[a] + patternCost[branchPattern[e][0]];
        candB[e] = metric[a + 1] + patternCost[branchPattern[e][1]];
      }
      for (std::uint32_t e = 0; e < kNumStates; ++e) {
        const bool takeB = candB[e] < candA[e];
        const std::uint32_t selected = std::min(takeB ? candB[e] : candA[e], saturation - 1);
        survivor[e] = static_cast<std::uint8_t>(2 * (e % 32) + (takeB ? 1 : 0));
        metric[e] = selected;
        minMetric = std::min(minMetric, selected);
      }
      if (bestOn) {
        for (std::uint32_t e = 0; e < kNumStates; ++e) {
          if (candA[e] == candB[e]) {
            bestStateTrace << (e < 32 ? "A: " : "B: ") << e << " : " << 2 * (e % 32) << " :: ";
          }
        }
      }

      // Normalisation two steps after all metrics reached the threshold.
      const bool allAbove = minMetric >= normalisation;
      if (allAbove || normalisationCounter > 0) {
        if (++normalisationCounter == 3) {
          for (std::uint32_t& value : metric) {
            value -= normalisation;
          }
          normalisationCounter = 0;
        }
      }

      if (acsOn) {
        acsTrace << "[Channel Type : CQI TB ACS output data: (Offset-Binary) Soft Bits " << s + 3
                 << " : Format acs]\n[Size of Array 0 : " << kNumStates
                 << "]\n[length: " << kNumStates << "]\n";
        for (std::uint32_t h = 0; h < kNumStates; ++h) {
          acsTrace << metric[bitrev6(h)] << '\n';
        }
      }
      if (bestOn) {
        bestStateTrace << "[Channel Type : CQI TB Best State output data: Format best state]\n"
                       << "[Size of Array 0 : " << kNumStates << "]\n[length: " << kNumStates
                       << "]\n";
        for (std::uint32_t h = 0; h < kNumStates; ++h) {
          const std::uint32_t state = bitrev6(h);
          bestStateTrace << h << " : " << (survivor[state] & 1U)
                         << (candA[state] == candB[state] ? " ****\n" : "\n");
        }
      }
    }

    // Start state of the traceback: the smallest metric, first found in hardware order.
    std::uint32_t tb = 0;
    if (itsUseBestState) {
      std::uint32_t best = kBestStateStart;
      for (std::uint32_t h = 0; h < kNumStates; ++h) {
        const std::uint32_t state = bitrev6(h);
        if (metric[state] < best) {
          best = metric[state];
          tb = state;
        }
      }
    }

    // The traceback window needs two chunks of history.
    if (c < 2) {
      continue;
    }
    const bool decides = shortBlock || c == 2 || c == 3;
    const std::uint32_t depth = (!shortBlock && c == 3) ? 2 * T + 5 : 2 * T - 1;
    if (tracebackOn) {
      tracebackTrace << "[Channel Type : CQI TB Trace Back State output data: Format best state]\n"
                     << "[Size of Array 0 : " << 2 * T << "]\n[length: " << 2 * T << "]\n"
                     << tb << '\n';
    }
    // tb(i) is the state at time (c+1)T - i; block position k = cT - i - 1 is decided by
    // the newest register bit of that state, once the depth reaches T + 6.
    for (std::uint32_t i = 1; i <= depth; ++i) {
      const std::uint32_t t = (c + 1) * T - i;
      tb = survivors[static_cast<std::size_t>(t) * kNumStates + tb];
      if (tracebackOn) {
        tracebackTrace << tb << '\n';
      }
      if (!decides || i < decisionDepth) {
        continue;
      }
      const std::int64_t k = static_cast<std::int64_t>(c) * T - i - 1;
      if (k >= 0 && k < static_cast<std::int64_t>(N)) {
        decodedBits[static_cast<std::size_t>(k)] = static_cast<std::uint8_t>((tb >> 5) & 1U);
      }
    }
  }

  for (std::uint32_t e = 0; e < kNumStates; ++e) {
    itsPathMetrics[e] = metric[e];
  }
  return true;
}

}  // namespace brannoc
