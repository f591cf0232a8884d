// The iterative decoder of the LTE turbo code (TS 36.212 clause 5.1.3.2): exactly the
// requested number of iterations of two half-iterations, the first constituent decoder on
// the natural order, the second on the QPP-interleaved order (clause 5.1.3.2.3), with the
// hard decisions taken from the second decoder's a posteriori values after the last one.
#include "TurboDecoder.h"

#include <algorithm>
#include <new>

namespace corvane {

void tailBetas(const CodeBlock& block, StateMetrics (&betas)[2]) {
  // The tail of clause 5.1.3.2.2: x_K, z_K, x_K+1, z_K+1, x_K+2, z_K+2 of the first encoder
  // and the primed values of the second spread over d0, d1, d2 at K..K+3.
  const std::uint32_t K = block.row->K;
  const std::int32_t* d0 = block.d0;
  const std::int32_t* d1 = block.d1;
  const std::int32_t* d2 = block.d2;
  const int tailX1[3] = {softValue(d0[K]), softValue(d2[K]), softValue(d1[K + 1])};
  const int tailZ1[3] = {softValue(d1[K]), softValue(d0[K + 1]), softValue(d2[K + 1])};
  const int tailX2[3] = {softValue(d0[K + 2]), softValue(d2[K + 2]), softValue(d1[K + 3])};
  const int tailZ2[3] = {softValue(d1[K + 2]), softValue(d0[K + 3]), softValue(d2[K + 3])};
  betas[0] = terminatedBeta(tailX1, tailZ1);
  betas[1] = terminatedBeta(tailX2, tailZ2);
}

bool isValidConfig(const DecoderConfig& config) {
  const std::uint32_t P = config.processingUnits;
  return findQppRow(config.maxBlockSize) != nullptr && (P == 1 || P == 2 || P == 4 || P == 8) &&
         static_cast<std::uint32_t>(config.algorithm) <= 2 &&
         config.extrinsicBits >= kMinExtrinsicBits && config.extrinsicBits <= kMaxExtrinsicBits &&
         config.stepsPerUnit >= CorrectionTable::kMinStepsPerUnit &&
         config.stepsPerUnit <= CorrectionTable::kMaxStepsPerUnit && config.maxCodeBlocks >= 1 &&
         config.maxCodeBlocks <= kMaxCodeBlocks;
}

bool TurboDecoder::init(const DecoderConfig& config) {
  if (!isValidConfig(config)) {
    return false;
  }
  itsConfig = config;
  itsCorrection = CorrectionTable(config.stepsPerUnit);
  itsExtrinsicLimit = (1 << (config.extrinsicBits - 1)) - 1;
  const std::size_t K = config.maxBlockSize;
  try {
    itsPi.assign(K, 0);
    itsSystematic.assign(K, 0);
    itsSystematicInterleaved.assign(K, 0);
    itsParity1.assign(K, 0);
    itsParity2.assign(K, 0);
    itsAPriori.assign(K, 0);
    itsLu.assign(K, 0);
    itsExtrinsic.assign(K, 0);
    itsAlpha.assign(K + 1, StateMetrics{});
  } catch (const std::bad_alloc&) {
    return false;
  }
  return true;
}

void TurboDecoder::decode(const CodeBlock& block) {
  const std::uint32_t K = block.row->K;
  const std::int32_t* d0 = block.d0;
  const std::int32_t* d1 = block.d1;
  const std::int32_t* d2 = block.d2;
  buildQppPermutation(*block.row, itsPi.data());
  for (std::uint32_t k = 0; k < K; ++k) {
    itsSystematic[k] = softValue(d0[k]);
    itsParity1[k] = softValue(d1[k]);
    itsParity2[k] = softValue(d2[k]);
  }
  for (std::uint32_t i = 0; i < K; ++i) {
    itsSystematicInterleaved[i] = itsSystematic[itsPi[i]];
  }
  tailBetas(block, itsTailBeta);
  // Window boundaries start equiprobable in the first iteration.
  for (Boundaries& boundaries : itsBoundaries) {
    boundaries = Boundaries{};
  }
  switch (itsConfig.algorithm) {
    case Algorithm::MaxLog:
      iterate(MaxLogPolicy{}, K, block.iterations, block.bits);
      break;
    case Algorithm::ScaledMaxLog:
      iterate(ScaledMaxLogPolicy{}, K, block.iterations, block.bits);
      break;
    case Algorithm::LogMap:
      iterate(LogMapPolicy{&itsCorrection}, K, block.iterations, block.bits);
      break;
  }
}

template <class Policy>
int TurboDecoder::aPriori(int rawExtrinsic) const {
  return std::clamp(Policy::scaleExtrinsic(rawExtrinsic), -itsExtrinsicLimit, itsExtrinsicLimit);
}

template <class Policy>
void TurboDecoder::iterate(const Policy& policy, std::uint32_t K, std::uint32_t iterations,
                           std::uint8_t* bits) {
  const std::uint16_t* pi = itsPi.data();
  Metric* aPrioriValues = itsAPriori.data();
  Metric* lu = itsLu.data();
  const Metric* extrinsic = itsExtrinsic.data();
  std::fill_n(aPrioriValues, K, Metric{0});
  for (std::uint32_t iteration = 0; iteration < iterations; ++iteration) {
    // First decoder, natural order; its extrinsic values are read in interleaved order.
    for (std::uint32_t k = 0; k < K; ++k) {
      lu[k] = static_cast<Metric>(itsSystematic[k] + aPrioriValues[k]);
    }
    halfIteration(policy, static_cast<int>(K), itsParity1.data(), itsTailBeta[0], itsBoundaries[0]);
    for (std::uint32_t i = 0; i < K; ++i) {
      aPrioriValues[i] = static_cast<Metric>(aPriori<Policy>(extrinsic[pi[i]]));
    }
    // Second decoder, interleaved order; its values go back to position Pi(i).
    for (std::uint32_t i = 0; i < K; ++i) {
      lu[i] = static_cast<Metric>(itsSystematicInterleaved[i] + aPrioriValues[i]);
    }
    halfIteration(policy, static_cast<int>(K), itsParity2.data(), itsTailBeta[1], itsBoundaries[1]);
    if (iteration + 1 < iterations) {
      for (std::uint32_t i = 0; i < K; ++i) {
        aPrioriValues[pi[i]] = static_cast<Metric>(aPriori<Policy>(extrinsic[i]));
      }
    }
  }
  // A posteriori value = systematic + a priori + unscaled extrinsic; 0 or more decides 1.
  for (std::uint32_t i = 0; i < K; ++i) {
    bits[pi[i]] = static_cast<std::uint8_t>(lu[i] + extrinsic[i] >= 0 ? 1 : 0);
  }
}

template <class Policy>
void TurboDecoder::halfIteration(const Policy& policy, int K, const Metric* parity,
                                 const StateMetrics& tailBeta, Boundaries& boundaries) {
  const int P = static_cast<int>(itsConfig.processingUnits);
  const int length = K / P;  // every K of the table is a multiple of 8
  // The windows are independent within a half-iteration: each starts from the boundary
  // metrics of the previous iteration, so the new ones are collected apart.
  Boundaries reached;
  for (int w = 0; w < P; ++w) {
    const StateMetrics& alphaStart = w == 0 ? knownStateZero() : boundaries.alpha[w];
    const StateMetrics& betaEnd = w == P - 1 ? tailBeta : boundaries.beta[w + 1];
    const int first = w * length;
    decodeWindow(policy, itsLu.data() + first, parity + first, length, alphaStart, betaEnd,
                 itsAlpha.data(), reached.beta[w], itsExtrinsic.data() + first);
    reached.alpha[w + 1] = itsAlpha[length];
  }
  for (int t = 1; t < P; ++t) {
    boundaries.alpha[t] = reached.alpha[t];
    boundaries.beta[t] = reached.beta[t];
  }
}

}  // namespace corvane
