// The iterative decoder of the LTE turbo code (TS 36.212 clause 5.1.3.2): two constituent
// decoders exchanging extrinsic values through the QPP interleaver, each half-iteration's
// trellis cut into equal windows decoded as if by parallel processing units.
#ifndef CORVANE_TURBODECODER_H
#define CORVANE_TURBODECODER_H

#include <cstdint>
#include <vector>

#include "ConstituentDecoder.h"
#include "MetricPolicies.h"
#include "QppInterleaver.h"

namespace corvane {

enum class Algorithm : std::uint32_t { MaxLog = 0, ScaledMaxLog = 1, LogMap = 2 };

struct DecoderConfig {
  std::uint32_t maxBlockSize = kMaxBlockSize;  // a K of Table 5.1.3-3
  std::uint32_t processingUnits = 2;           // 1, 2, 4 or 8
  Algorithm algorithm = Algorithm::ScaledMaxLog;
  std::uint32_t extrinsicBits = 10;  // 8..11
  std::uint32_t stepsPerUnit = 32;   // raw steps per natural-log unit, 1..64
  std::uint32_t maxCodeBlocks = 1;   // blocks per batch, 1..kMaxCodeBlocks
};

constexpr std::uint32_t kMaxProcessingUnits = 8;
constexpr std::uint32_t kMaxCodeBlocks = 32;
constexpr std::uint32_t kMaxIterations = 16;
constexpr std::uint32_t kMinExtrinsicBits = 8;
constexpr std::uint32_t kMaxExtrinsicBits = 11;

// True when the decoder can be built with config.
bool isValidConfig(const DecoderConfig& config);

// One code block to decode: its row of Table 5.1.3-3, the streams d0, d1, d2 (K + 4 raw soft
// values each, the tail arranged as in clause 5.1.3.2.2), the full iterations to run
// (1..kMaxIterations) and the array that takes the K decided bits (0 or 1).
struct CodeBlock {
  const QppRow* row;
  const std::int32_t* d0;
  const std::int32_t* d1;
  const std::int32_t* d2;
  std::uint32_t iterations;
  std::uint8_t* bits;
};

// A received soft value saturated to the 8-bit range -128..127.
inline Metric softValue(std::int32_t value) {
  return static_cast<Metric>(value < -128 ? -128 : (value > 127 ? 127 : value));
}

// beta_K of both constituent codes from the block's tail values (clause 5.1.3.2.2).
void tailBetas(const CodeBlock& block, StateMetrics (&betas)[2]);

class TurboDecoder {
 public:
  // Allocates every working buffer for blocks up to config.maxBlockSize; false when the
  // configuration is invalid or memory runs out.
  bool init(const DecoderConfig& config);

  std::uint32_t maxBlockSize() const { return itsConfig.maxBlockSize; }

  // Decodes one block of size K at most maxBlockSize().
  void decode(const CodeBlock& block);

 private:
  // Boundary state metrics of one constituent decoder: entry t holds the metric at the
  // start of window t (alpha) or the end of window t - 1 (beta), as reached in the last
  // iteration.
  struct Boundaries {
    StateMetrics alpha[kMaxProcessingUnits + 1];
    StateMetrics beta[kMaxProcessingUnits + 1];
  };

  template <class Policy>
  void iterate(const Policy& policy, std::uint32_t K, std::uint32_t iterations, std::uint8_t* bits);

  template <class Policy>
  void halfIteration(const Policy& policy, int K, const Metric* parity,
                     const StateMetrics& tailBeta, Boundaries& boundaries);

  // Scales the raw extrinsic values and saturates them to the extrinsic width.
  template <class Policy>
  int aPriori(int rawExtrinsic) const;

  DecoderConfig itsConfig;
  CorrectionTable itsCorrection;
  int itsExtrinsicLimit = 0;
  std::vector<std::uint16_t> itsPi;   // QPP permutation of the current block
  std::vector<Metric> itsSystematic;  // d0, natural order
  std::vector<Metric> itsSystematicInterleaved;
  std::vector<Metric> itsParity1;      // d1
  std::vector<Metric> itsParity2;      // d2
  std::vector<Metric> itsAPriori;      // input order of the next half-iteration
  std::vector<Metric> itsLu;           // systematic + a priori per step
  std::vector<Metric> itsExtrinsic;    // raw extrinsic values per step
  std::vector<StateMetrics> itsAlpha;  // forward metrics of one window
  StateMetrics itsTailBeta[2];
  Boundaries itsBoundaries[2];
};

}  // namespace corvane

#endif  // CORVANE_TURBODECODER_H
