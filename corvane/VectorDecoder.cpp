// The vectorised turbo decoder (see VectorDecoder.h), written once over Highway and compiled
// for every target by foreach_target.h, which includes this file once per target.
#include "VectorDecoder.h"

#include <algorithm>

#if CORVANE_HAVE_HIGHWAY

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "VectorDecoder.cpp"
#include <hwy/foreach_target.h>  // IWYU pragma: keep
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace corvane {
namespace HWY_NAMESPACE {

namespace hn = hwy::HWY_NAMESPACE;

// max for max-log-MAP.
template <class D>
struct MaxCombine {
  using V = decltype(hn::Zero(D()));
  HWY_INLINE V operator()(V a, V b) const { return hn::Max(a, b); }
};

// max* for log-MAP: max(a, b) plus the correction of |a - b|, counted as the thresholds
// above the difference (the table falls monotonically, so this is the table's entry).
template <class D>
struct LogMapCombine {
  using V = decltype(hn::Zero(D()));
  const std::int16_t* threshold;
  int count;
  HWY_INLINE V operator()(V a, V b) const {
    const D d;
    const V larger = hn::Max(a, b);
    const V difference = hn::SaturatedSub(larger, hn::Min(a, b));
    V below = hn::Zero(d);
    for (int v = 0; v < count; ++v) {
      below = hn::Sub(below, hn::VecFromMask(d, hn::Lt(difference, hn::Set(d, threshold[v]))));
    }
    return hn::Add(larger, below);
  }
};

// One lane group of one half-iteration: the forward recursion from the alpha metrics in
// states[0..7] (one vector per state, lanes = segments) over `length` steps, storing every
// alpha, then the backward recursion from the beta metrics in states[8..15] with the raw
// extrinsic value of every step. Leaves the reached alpha and beta in states. State 0 is 0
// throughout (every metric is stored relative to it), so it takes no register.
template <class D, class Combine>
HWY_NOINLINE void decodeLaneGroup(D d, const Combine& combine, const std::int16_t* HWY_RESTRICT lu,
                                  const std::int16_t* HWY_RESTRICT lp, std::size_t length,
                                  std::int16_t* HWY_RESTRICT alphaStore,
                                  std::int16_t* HWY_RESTRICT states,
                                  std::int16_t* HWY_RESTRICT extrinsic) {
  using V = decltype(hn::Zero(d));
  const std::size_t N = hn::Lanes(d);
  const V zero = hn::Zero(d);
  V a1 = hn::Load(d, states + 1 * N), a2 = hn::Load(d, states + 2 * N);
  V a3 = hn::Load(d, states + 3 * N), a4 = hn::Load(d, states + 4 * N);
  V a5 = hn::Load(d, states + 5 * N), a6 = hn::Load(d, states + 6 * N);
  V a7 = hn::Load(d, states + 7 * N);
  for (std::size_t k = 0; k < length; ++k) {
    std::int16_t* store = alphaStore + k * 7 * N;
    hn::Store(a1, d, store + 0 * N);
    hn::Store(a2, d, store + 1 * N);
    hn::Store(a3, d, store + 2 * N);
    hn::Store(a4, d, store + 3 * N);
    hn::Store(a5, d, store + 4 * N);
    hn::Store(a6, d, store + 5 * N);
    hn::Store(a7, d, store + 6 * N);
    const V g = hn::Load(d, lu + k * N);
    const V p = hn::Load(d, lp + k * N);
    const V both = hn::Add(g, p);
    // The butterflies of forwardStep: 0 <- (0, 1), 1 <- (2, 3), 2 <- (4, 5), 3 <- (6, 7).
    const V n0 = combine(zero, hn::Add(a1, both));
    const V n4 = combine(both, a1);
    const V n1 = combine(hn::Add(a2, g), hn::Add(a3, p));
    const V n5 = combine(hn::Add(a2, p), hn::Add(a3, g));
    const V n2 = combine(hn::Add(a4, p), hn::Add(a5, g));
    const V n6 = combine(hn::Add(a4, g), hn::Add(a5, p));
    const V n3 = combine(hn::Add(a6, both), a7);
    const V n7 = combine(a6, hn::Add(a7, both));
    a1 = hn::Sub(n1, n0);
    a2 = hn::Sub(n2, n0);
    a3 = hn::Sub(n3, n0);
    a4 = hn::Sub(n4, n0);
    a5 = hn::Sub(n5, n0);
    a6 = hn::Sub(n6, n0);
    a7 = hn::Sub(n7, n0);
  }
  hn::Store(a1, d, states + 1 * N);
  hn::Store(a2, d, states + 2 * N);
  hn::Store(a3, d, states + 3 * N);
  hn::Store(a4, d, states + 4 * N);
  hn::Store(a5, d, states + 5 * N);
  hn::Store(a6, d, states + 6 * N);
  hn::Store(a7, d, states + 7 * N);

  std::int16_t* betaStates = states + 8 * N;
  V b1 = hn::Load(d, betaStates + 1 * N), b2 = hn::Load(d, betaStates + 2 * N);
  V b3 = hn::Load(d, betaStates + 3 * N), b4 = hn::Load(d, betaStates + 4 * N);
  V b5 = hn::Load(d, betaStates + 5 * N), b6 = hn::Load(d, betaStates + 6 * N);
  V b7 = hn::Load(d, betaStates + 7 * N);
  const V floor = hn::Set(d, -32767);
  for (std::size_t k = length; k-- > 0;) {
    const std::int16_t* store = alphaStore + k * 7 * N;
    const V al1 = hn::Load(d, store + 0 * N), al2 = hn::Load(d, store + 1 * N);
    const V al3 = hn::Load(d, store + 2 * N), al4 = hn::Load(d, store + 3 * N);
    const V al5 = hn::Load(d, store + 4 * N), al6 = hn::Load(d, store + 5 * N);
    const V al7 = hn::Load(d, store + 6 * N);
    const V g = hn::Load(d, lu + k * N);
    const V p = hn::Load(d, lp + k * N);
    // extrinsicStep, with alpha_0 = beta_0 = 0.
    const V oneParity0 = combine(combine(hn::Add(al2, b1), hn::Add(al3, b5)),
                                 combine(hn::Add(al4, b6), hn::Add(al5, b2)));
    const V oneParity1 = combine(combine(b4, al1), combine(hn::Add(al6, b3), hn::Add(al7, b7)));
    const V zeroParity0 =
        combine(combine(zero, hn::Add(al1, b4)), combine(hn::Add(al6, b7), hn::Add(al7, b3)));
    const V zeroParity1 = combine(combine(hn::Add(al2, b5), hn::Add(al3, b1)),
                                  combine(hn::Add(al4, b2), hn::Add(al5, b6)));
    const V e = hn::SaturatedSub(combine(oneParity0, hn::Add(oneParity1, p)),
                                 combine(zeroParity0, hn::Add(zeroParity1, p)));
    hn::Store(hn::Max(e, floor), d, extrinsic + k * N);
    // The butterflies of backwardStep: (0, 1) <- (0, 4), (2, 3) <- (1, 5), (4, 5) <- (2, 6),
    // (6, 7) <- (3, 7).
    const V both = hn::Add(g, p);
    const V p0 = combine(zero, hn::Add(b4, both));
    const V p1 = combine(both, b4);
    const V p2 = combine(hn::Add(b1, g), hn::Add(b5, p));
    const V p3 = combine(hn::Add(b1, p), hn::Add(b5, g));
    const V p4 = combine(hn::Add(b2, p), hn::Add(b6, g));
    const V p5 = combine(hn::Add(b2, g), hn::Add(b6, p));
    const V p6 = combine(hn::Add(b3, both), b7);
    const V p7 = combine(b3, hn::Add(b7, both));
    b1 = hn::Sub(p1, p0);
    b2 = hn::Sub(p2, p0);
    b3 = hn::Sub(p3, p0);
    b4 = hn::Sub(p4, p0);
    b5 = hn::Sub(p5, p0);
    b6 = hn::Sub(p6, p0);
    b7 = hn::Sub(p7, p0);
  }
  hn::Store(b1, d, betaStates + 1 * N);
  hn::Store(b2, d, betaStates + 2 * N);
  hn::Store(b3, d, betaStates + 3 * N);
  hn::Store(b4, d, betaStates + 4 * N);
  hn::Store(b5, d, betaStates + 5 * N);
  hn::Store(b6, d, betaStates + 6 * N);
  hn::Store(b7, d, betaStates + 7 * N);
}

// The a priori value of a raw extrinsic value: scaled by 0.75 for scaled max-log-MAP (the
// product rounded as ScaledMaxLogPolicy does), saturated to the extrinsic width. The raw
// value is first limited to +-2047, which changes no result (0.75 * 2047 exceeds every
// extrinsic limit) and keeps 3e within 16 bits.
template <class D>
struct APriori {
  using V = decltype(hn::Zero(D()));
  V limit, negativeLimit, bound, negativeBound, two;
  bool scaled;
  explicit APriori(const VectorWorkspace& work) {
    const D d;
    limit = hn::Set(d, static_cast<std::int16_t>(work.extrinsicLimit));
    negativeLimit = hn::Neg(limit);
    bound = hn::Set(d, 2047);
    negativeBound = hn::Neg(bound);
    two = hn::Set(d, 2);
    scaled = work.algorithm == Algorithm::ScaledMaxLog;
  }
  HWY_INLINE V operator()(V e) const {
    const D d;
    if (scaled) {
      e = hn::Min(hn::Max(e, negativeBound), bound);
      const V triple = hn::Add(hn::Add(e, e), e);
      // (3e + 2 - [3e < 0]) >> 2: the mask of 3e < 0 is -1.
      e = hn::ShiftRight<2>(
          hn::Add(hn::Add(triple, two), hn::VecFromMask(d, hn::Lt(triple, hn::Zero(d)))));
    }
    return hn::Min(hn::Max(e, negativeLimit), limit);
  }
};

// Carries values of one decoder's order into the other's: the value for step k of every
// window comes from step source[k] of the same lane group, its lanes rearranged within each
// block's windows by pattern[k] (16 byte indices, repeated in every 128-bit block: the P
// windows of a block share one 128-bit block, P dividing 8). out = add + transform(moved).
template <class D, class Transform>
HWY_NOINLINE void permuteSteps(D d, const Transform& transform, const VectorWorkspace& work,
                               int toDecoder, std::size_t laneGroups, std::size_t L,
                               const std::int16_t* HWY_RESTRICT from,
                               const std::int16_t* HWY_RESTRICT add,
                               std::int16_t* HWY_RESTRICT out) {
  const std::size_t N = hn::Lanes(d);
  const hn::Repartition<std::uint8_t, D> bytes;
  const std::uint16_t* source = work.sourceStep[toDecoder].get();
  const std::uint8_t* pattern = work.lanePattern[toDecoder].get();
  const bool permuted = work.processingUnits > 1;
  for (std::size_t group = 0; group < laneGroups; ++group) {
    const std::size_t first = group * L * N;
    for (std::size_t k = 0; k < L; ++k) {
      auto moved = hn::Load(d, from + first + source[k] * N);
      if (permuted) {
        moved = hn::TableLookupBytes(moved, hn::BitCast(d, hn::LoadDup128(bytes, pattern + 16 * k)));
      }
      const std::size_t at = first + k * N;
      hn::Store(hn::Add(hn::Load(d, add + at), transform(moved)), d, out + at);
    }
  }
}

// The tables of permuteSteps for the group's K, from the QPP permutation: Pi(w*L + k) is
// congruent to Pi(k) modulo L for every window w (Pi(x + L) - Pi(x) = L * (f1 + f2 * (2x + L))),
// so the interleaved step k of every window reads one natural step, and back.
void buildStepTables(VectorWorkspace& work, const QppRow& row) {
  const std::size_t K = row.K;
  const std::size_t P = work.processingUnits;
  const std::size_t L = K / P;
  std::uint16_t* pi = work.pi.get();
  std::uint16_t* inverse = work.piInverse.get();
  buildQppPermutation(row, pi);
  for (std::size_t i = 0; i < K; ++i) inverse[pi[i]] = static_cast<std::uint16_t>(i);
  const std::uint16_t* maps[2] = {inverse, pi};  // to decoder 0: natural <- interleaved
  for (int decoder = 0; decoder < 2; ++decoder) {
    const std::uint16_t* map = maps[decoder];
    for (std::size_t k = 0; k < L; ++k) {
      work.sourceStep[decoder].get()[k] = static_cast<std::uint16_t>(map[k] % L);
      std::uint8_t* pattern = work.lanePattern[decoder].get() + 16 * k;
      for (std::size_t lane = 0; lane < 8; ++lane) {
        const std::size_t w = lane % P;
        const std::size_t source = lane - w + map[w * L + k] / L;
        pattern[2 * lane] = static_cast<std::uint8_t>(2 * source);
        pattern[2 * lane + 1] = static_cast<std::uint8_t>(2 * source + 1);
      }
    }
  }
  work.tablesK = K;
}

template <class D>
void decodeGroupWith(D d, VectorWorkspace& work, const CodeBlock* const* blocks,
                     std::size_t count) {
  const std::size_t K = blocks[0]->row->K;
  const std::size_t P = work.processingUnits;
  const std::size_t N = hn::Lanes(d);
  const std::size_t S = count * P;
  const std::size_t laneGroups = (S + N - 1) / N;
  const std::size_t L = K / P;
  const std::size_t positions = laneGroups * L * N;
  const std::uint32_t iterations = blocks[0]->iterations;
  if (work.tablesK != K) buildStepTables(work, *blocks[0]->row);

  const std::uint16_t* pi = work.pi.get();
  std::int16_t* sys[2] = {work.systematic[0].get(), work.systematic[1].get()};
  std::int16_t* par[2] = {work.parity[0].get(), work.parity[1].get()};
  std::int16_t* lu = work.lu.get();
  std::int16_t* extrinsic = work.extrinsic.get();
  // Every value of the group in array order: block b's window w is segment s = b*P + w, in
  // lane s % N of lane group s / N; lanes without a segment hold zeros.
  const auto forEachValue = [&](const auto& visit) {
    for (std::size_t group = 0; group < laneGroups; ++group) {
      const std::size_t firstBlock = group * (N / P);
      const std::size_t groupBlocks = std::min(N / P, count - firstBlock);
      for (std::size_t k = 0; k < L; ++k) {
        const std::size_t first = (group * L + k) * N;
        for (std::size_t b = 0; b < groupBlocks; ++b) {
          const CodeBlock& block = *blocks[firstBlock + b];
          for (std::size_t w = 0; w < P; ++w) visit(first + b * P + w, block, w * L + k);
        }
      }
    }
  };
  if (S % N != 0) {
    std::fill_n(sys[0], positions, std::int16_t{0});
    std::fill_n(par[0], positions, std::int16_t{0});
    std::fill_n(par[1], positions, std::int16_t{0});
  }
  forEachValue([&](std::size_t j, const CodeBlock& block, std::size_t i) {
    sys[0][j] = softValue(block.d0[i]);
    par[0][j] = softValue(block.d1[i]);
    par[1][j] = softValue(block.d2[i]);
  });
  const auto unchanged = [](auto v) { return v; };
  std::fill_n(lu, positions, std::int16_t{0});
  permuteSteps(d, unchanged, work, 1, laneGroups, L, sys[0], lu, sys[1]);
  for (std::size_t b = 0; b < count; ++b) {
    StateMetrics betas[2];
    tailBetas(*blocks[b], betas);
    work.tails[2 * b] = betas[0];
    work.tails[2 * b + 1] = betas[1];
  }
  StateMetrics* boundaries = work.boundaries.get();
  const std::size_t stride = work.maxSegments;
  for (std::size_t i = 0; i < 8 * stride; ++i) boundaries[i] = StateMetrics{};
  const StateMetrics start = knownStateZero();

  const auto halfIteration = [&](const auto& combine, int decoder) {
    StateMetrics* alphaIn = boundaries + (4 * decoder + 0) * stride;
    StateMetrics* betaIn = boundaries + (4 * decoder + 1) * stride;
    StateMetrics* alphaOut = boundaries + (4 * decoder + 2) * stride;
    StateMetrics* betaOut = boundaries + (4 * decoder + 3) * stride;
    std::int16_t* states = work.laneStates.get();
    for (std::size_t group = 0; group < laneGroups; ++group) {
      for (std::size_t lane = 0; lane < N; ++lane) {
        const std::size_t s = group * N + lane;
        const std::size_t w = s % P;
        const bool used = s < S;
        const StateMetrics zero{};
        const StateMetrics& a = !used ? zero : (w == 0 ? start : alphaIn[s]);
        const StateMetrics& bt =
            !used ? zero : (w == P - 1 ? work.tails[2 * (s / P) + decoder] : betaIn[s + 1]);
        for (int m = 0; m < kStates; ++m) {
          states[m * N + lane] = a.m[m];
          states[(8 + m) * N + lane] = bt.m[m];
        }
      }
      const std::size_t first = group * L * N;
      decodeLaneGroup(d, combine, lu + first, par[decoder] + first, L, work.alpha.get(), states,
                      extrinsic + first);
      for (std::size_t lane = 0; lane < N && group * N + lane < S; ++lane) {
        const std::size_t s = group * N + lane;
        for (int m = 0; m < kStates; ++m) {
          alphaOut[s + 1].m[m] = states[m * N + lane];
          betaOut[s].m[m] = states[(8 + m) * N + lane];
        }
      }
    }
    for (std::size_t s = 0; s < S; ++s) {
      if (s % P != 0) {
        alphaIn[s] = alphaOut[s];
        betaIn[s] = betaOut[s];
      }
    }
  };
  const APriori<D> aPriori(work);
  const auto toDecoder = [&](int decoder) {
    permuteSteps(d, aPriori, work, decoder, laneGroups, L, extrinsic, sys[decoder], lu);
  };
  const auto iterate = [&](const auto& combine) {
    std::copy_n(sys[0], positions, lu);
    for (std::uint32_t iteration = 0; iteration < iterations; ++iteration) {
      halfIteration(combine, 0);
      toDecoder(1);
      halfIteration(combine, 1);
      if (iteration + 1 < iterations) toDecoder(0);
    }
  };
  if (work.algorithm == Algorithm::LogMap) {
    iterate(LogMapCombine<D>{work.threshold, work.thresholdCount});
  } else {
    iterate(MaxCombine<D>{});
  }
  // A posteriori value = systematic + a priori + unscaled extrinsic; 0 or more decides 1.
  forEachValue([&](std::size_t j, const CodeBlock& block, std::size_t i) {
    block.bits[pi[i]] = static_cast<std::uint8_t>(lu[j] + extrinsic[j] >= 0 ? 1 : 0);
  });
}

#if HWY_TARGET == HWY_SCALAR
// The one-lane fallback target (a processor without SSSE3) decodes with the scalar decoder.
void decodeGroup(VectorWorkspace& work, const CodeBlock* const* blocks, std::size_t count) {
  for (std::size_t b = 0; b < count; ++b) work.oneLane.decode(*blocks[b]);
}
#else
void decodeGroup(VectorWorkspace& work, const CodeBlock* const* blocks, std::size_t count) {
  const std::size_t maxLanes = hn::Lanes(hn::ScalableTag<std::int16_t>());
  const std::size_t lanes = laneGroupWidth(count * work.processingUnits, maxLanes);
  if (lanes <= 8) {
    decodeGroupWith(hn::CappedTag<std::int16_t, 8>(), work, blocks, count);
  } else if (lanes <= 16) {
    decodeGroupWith(hn::CappedTag<std::int16_t, 16>(), work, blocks, count);
  } else {
    decodeGroupWith(hn::CappedTag<std::int16_t, 32>(), work, blocks, count);
  }
}
#endif  // HWY_TARGET == HWY_SCALAR

}  // namespace HWY_NAMESPACE
}  // namespace corvane
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace corvane {

HWY_EXPORT(decodeGroup);

bool vectorDecoderAvailable() { return true; }

bool VectorDecoder::init(const DecoderConfig& config, const CorrectionTable& correction) {
  VectorWorkspace& work = itsWork;
  work.processingUnits = config.processingUnits;
  work.algorithm = config.algorithm;
  work.extrinsicLimit = (1 << (config.extrinsicBits - 1)) - 1;
  work.thresholdCount = correction[0];
  for (int v = 1; v <= work.thresholdCount; ++v) {
    int d = 0;
    while (correction[d] >= v) ++d;
    work.threshold[v - 1] = static_cast<std::int16_t>(d);
  }
  const std::size_t K = config.maxBlockSize;
  const std::size_t P = config.processingUnits;
  const std::size_t B = config.maxCodeBlocks;
  work.maxSegments = B * P + 1;
  // A group of S segments takes at most max(8, 2S) lanes of L = K / P steps (see
  // laneGroupWidth); one lane group at most 32 lanes.
  const std::size_t L = K / P;
  work.positions = (B * P * 2 > 8 ? B * P * 2 : 8) * L;
  const std::size_t groupLanes = B * P * 2 > 32 ? 32 : (B * P * 2 > 8 ? B * P * 2 : 8);
  const std::size_t n = work.positions;
  bool ok = work.lu.allocate(n) && work.extrinsic.allocate(n) &&
            work.alpha.allocate(7 * groupLanes * L) && work.laneStates.allocate(16 * 32) &&
            work.pi.allocate(K) && work.piInverse.allocate(K);
  for (int decoder = 0; decoder < 2; ++decoder) {
    ok = ok && work.systematic[decoder].allocate(n) && work.parity[decoder].allocate(n) &&
         work.sourceStep[decoder].allocate(L) && work.lanePattern[decoder].allocate(16 * L);
  }
  if (!ok || !work.oneLane.init(config)) return false;
  work.boundaries.reset(new (std::nothrow) StateMetrics[8 * work.maxSegments]);
  work.tails.reset(new (std::nothrow) StateMetrics[2 * B]);
  itsGroup.reset(new (std::nothrow) const CodeBlock*[B]);
  return work.boundaries != nullptr && work.tails != nullptr && itsGroup != nullptr;
}

void VectorDecoder::decode(const CodeBlock* blocks, std::uint32_t count) {
  // Groups of equal K and iteration count, each block in the first group that fits it.
  std::uint64_t done = 0;
  for (std::uint32_t first = 0; first < count; ++first) {
    if ((done >> first) & 1) continue;
    std::size_t size = 0;
    for (std::uint32_t b = first; b < count; ++b) {
      if (!((done >> b) & 1) && blocks[b].row == blocks[first].row &&
          blocks[b].iterations == blocks[first].iterations) {
        itsGroup[size++] = &blocks[b];
        done |= std::uint64_t{1} << b;
      }
    }
    HWY_DYNAMIC_DISPATCH(decodeGroup)(itsWork, itsGroup.get(), size);
  }
}

}  // namespace corvane
#endif  // HWY_ONCE

#else  // !CORVANE_HAVE_HIGHWAY

namespace corvane {

bool vectorDecoderAvailable() { return false; }

bool VectorDecoder::init(const DecoderConfig&, const CorrectionTable&) { return false; }

void VectorDecoder::decode(const CodeBlock*, std::uint32_t) {}

}  // namespace corvane

#endif  // CORVANE_HAVE_HIGHWAY
