// The iterative decoder of the LTE turbo code (TS 36.212 clause 5.1.3.2): two constituent
// decoders exchanging extrinsic values through the QPP interleaver, each half-iteration's
// trellis cut into equal windows decoded as if by parallel processing units.
#ifndef CORVANE_TURBODECODER_H
#define CORVANE_TURBODECODER_H

#include <cstdint>
#include <vector>

#include "ConstituentDecoder.h"
#include "QppInterleaver.h"

namespace corvane {

enum class Algorithm : std::uint32_t { MaxLog = 0, ScaledMaxLog = 1, LogMap = 2 };

struct DecoderConfig {
  std::uint32_t maxBlockSize = kMaxBlockSize;  // a K of Table 5.1.3-3
  std::uint32_t processingUnits = 2;           // 1, 2, 4 or 8
  Algorithm algorithm = Algorithm::ScaledMaxLog;
  std::uint32_t extrinsicBits = 10;            // 8..11
};

constexpr std::uint32_t kMaxProcessingUnits = 8;
constexpr std::uint32_t kMaxIterations = 16;
constexpr std::uint32_t kMinExtrinsicBits = 8;
constexpr std::uint32_t kMaxExtrinsicBits = 11;

// True when the decoder can be built with config.
bool isValidConfig(const DecoderConfig& config);

class TurboDecoder {
 public:
  // Allocates every working buffer for blocks up to config.maxBlockSize; false when the
  // configuration is invalid or memory runs out.
  bool init(const DecoderConfig& config);

  std::uint32_t maxBlockSize() const { return itsConfig.maxBlockSize; }

  // Decodes one block of size row.K (at most maxBlockSize()) from its three streams d0, d1,
  // d2 (K + 4 raw 8:5 soft values each, the tail arranged as in clause 5.1.3.2.2) with the
  // given number of full iterations (1..kMaxIterations), writing K bits (0 or 1) to bits.
  void decode(const QppRow& row, const std::int32_t* d0, const std::int32_t* d1,
              const std::int32_t* d2, std::uint32_t iterations, std::uint8_t* bits);

 private:
  // Boundary state metrics of one constituent decoder: entry t holds the metric at the
  // start of window t (alpha) or the end of window t - 1 (beta), as reached in the last
  // iteration.
  struct Boundaries {
    StateMetrics alpha[kMaxProcessingUnits + 1];
    StateMetrics beta[kMaxProcessingUnits + 1];
  };

  template <class Policy>
  void iterate(std::uint32_t K, std::uint32_t iterations, std::uint8_t* bits);

  template <class Policy>
  void halfIteration(int K, const Metric* parity, const StateMetrics& tailBeta,
                     Boundaries& boundaries);

  // Scales the raw extrinsic values and saturates them to the extrinsic width.
  template <class Policy>
  int aPriori(int rawExtrinsic) const;

  DecoderConfig itsConfig;
  int itsExtrinsicLimit = 0;
  std::vector<std::uint16_t> itsPi;          // QPP permutation of the current block
  std::vector<Metric> itsSystematic;          // d0, natural order
  std::vector<Metric> itsSystematicInterleaved;
  std::vector<Metric> itsParity1;             // d1
  std::vector<Metric> itsParity2;             // d2
  std::vector<Metric> itsAPriori;             // input order of the next half-iteration
  std::vector<Metric> itsLu;                  // systematic + a priori per step
  std::vector<Metric> itsExtrinsic;           // raw extrinsic values per step
  std::vector<StateMetrics> itsAlpha;         // forward metrics of one window
  StateMetrics itsTailBeta[2];
  Boundaries itsBoundaries[2];
};

}  // namespace corvane

#endif  // CORVANE_TURBODECODER_H
