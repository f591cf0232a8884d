// The vectorised turbo decoder (see VectorDecoder.h), written once over Highway and compiled
// for every target by foreach_target.h, which includes this file once per target.
#include "VectorDecoder.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <type_traits>

#if CORVANE_HAVE_HIGHWAY

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "VectorDecoder.cpp"
#include <hwy/cache_control.h>
#include <hwy/foreach_target.h>  // IWYU pragma: keep
#include <hwy/highway.h>

// Lambdas of the inner loops are inlined even where the compiler's size estimate would not.
#ifndef CORVANE_INLINE_LAMBDA
#if defined(__GNUC__)
#define CORVANE_INLINE_LAMBDA __attribute__((always_inline))
#else
#define CORVANE_INLINE_LAMBDA
#endif
#endif

HWY_BEFORE_NAMESPACE();
namespace corvane {
namespace HWY_NAMESPACE {

namespace hn = hwy::HWY_NAMESPACE;

#if HWY_TARGET == HWY_SCALAR
// The one-lane fallback target (a processor without SSSE3) decodes with the scalar decoder.
void decodeGroup(VectorWorkspace& work, const CodeBlock* const* blocks, std::size_t count) {
  for (std::size_t b = 0; b < count; ++b) work.oneLane.decode(*blocks[b]);
}
#else

// max for max-log-MAP; pair() combines two pairs of operands.
struct MaxCombine {
  template <class V>
  HWY_INLINE void pair(V a0, V b0, V a1, V b1, V& out0, V& out1) const {
    out0 = hn::Max(a0, b0);
    out1 = hn::Max(a1, b1);
  }
  template <class V>
  HWY_INLINE V one(V a, V b) const {
    return hn::Max(a, b);
  }
};

// max* for log-MAP: max(a, b) plus the correction of |a - b|. The differences of two
// combinations are saturated to bytes and looked up 15 entries at a time in 16-byte tables
// (byte shuffles): chunk c adds f(15c + min(x, 15)) - f(15c + 15), x = (d - 15c) floored at
// 0, and the chunks' sum telescopes to f(d) once the last chunk reaches the table's final 0.
// A table longer than 256 entries (more than 54 steps per unit) counts the thresholds above
// the difference instead (the table falls monotonically, so this is its entry).
struct LogMapCombine {
  const VectorWorkspace* work;
  template <class V>
  HWY_INLINE V thresholdsAbove(V difference) const {
    const hn::DFromV<V> d;
    V above = hn::Zero(d);  // each true mask is -1
    for (int v = 0; v < work->thresholdCount; ++v) {
      above =
          hn::Sub(above, hn::VecFromMask(d, hn::Lt(difference, hn::Set(d, work->threshold[v]))));
    }
    return above;
  }
  template <class V>
  HWY_INLINE void pair(V a0, V b0, V a1, V b1, V& out0, V& out1) const {
    const hn::DFromV<V> d;
    const V larger0 = hn::Max(a0, b0);
    const V larger1 = hn::Max(a1, b1);
    const V difference0 = hn::SaturatedSub(larger0, hn::Min(a0, b0));
    const V difference1 = hn::SaturatedSub(larger1, hn::Min(a1, b1));
    if (work->chunkCount == 0) {
      out0 = hn::Add(larger0, thresholdsAbove(difference0));
      out1 = hn::Add(larger1, thresholdsAbove(difference1));
      return;
    }
    const hn::Repartition<std::uint8_t, decltype(d)> bytes;
    const hn::Rebind<std::uint8_t, decltype(d)> halfBytes;
    const auto packed = hn::Combine(bytes, hn::DemoteTo(halfBytes, difference1),
                                    hn::DemoteTo(halfBytes, difference0));
    const auto fifteen = hn::Set(bytes, std::uint8_t{15});
    auto correction = hn::Zero(bytes);
    for (int c = 0; c < work->chunkCount; ++c) {
      const auto x = hn::SaturatedSub(packed, hn::Set(bytes, static_cast<std::uint8_t>(15 * c)));
      const auto table = hn::LoadDup128(bytes, work->chunkTable + 16 * c);
      correction = hn::Add(correction, hn::TableLookupBytes(table, hn::Min(x, fifteen)));
    }
    out0 = hn::Add(larger0, hn::BitCast(d, hn::PromoteTo(hn::Rebind<std::uint16_t, decltype(d)>(),
                                                         hn::LowerHalf(halfBytes, correction))));
    out1 = hn::Add(larger1, hn::BitCast(d, hn::PromoteTo(hn::Rebind<std::uint16_t, decltype(d)>(),
                                                         hn::UpperHalf(halfBytes, correction))));
  }
  template <class V>
  HWY_INLINE V one(V a, V b) const {
    V out, unused;
    pair(a, b, a, b, out, unused);
    return out;
  }
};

// The backward recursion runs in the forward recursion's form on relabelled states:
// register i holds beta of state sigma(i), sigma reversing the three state bits. Then
// beta_k's butterflies (0, 1) <- (0, 4), (2, 3) <- (1, 5), (4, 5) <- (2, 6), (6, 7) <- (3, 7)
// become the forward butterflies 0 <- (0, 1), 2 <- (4, 5), 1 <- (2, 3), 3 <- (6, 7) with the
// branch metrics Lu and Lp exchanged, and state 0 stays register 0.
constexpr int kSigma[kStates] = {0, 4, 2, 6, 1, 5, 3, 7};

// f(1), ..., f(7) written out, so that arrays of state registers indexed by the argument stay
// in registers (a loop over them would keep them in memory).
template <class F>
HWY_INLINE void forStates1To7(const F& f) {
  f(1);
  f(2);
  f(3);
  f(4);
  f(5);
  f(6);
  f(7);
}

// f(0), ..., f(7), the same way.
template <class F>
HWY_INLINE void forEight(const F& f) {
  f(0);
  forStates1To7(f);
}

// One step of the forward recursion (forwardStep) on the metrics of states 1..7 in m[1..7]
// (state 0's is 0 before and after: every metric is kept relative to it), with Lu = g and
// Lp = p; one step of the backward recursion on relabelled metrics with Lu = p and Lp = g.
template <class Combine, class V>
HWY_INLINE void trellisStep(const Combine& combine, V (&m)[kStates], V zero, V g, V p) {
  const V both = hn::Add(g, p);
  V n0, n1, n2, n3, n4, n5, n6, n7;
  combine.pair(zero, hn::Add(m[1], both), both, m[1], n0, n4);
  combine.pair(hn::Add(m[2], g), hn::Add(m[3], p), hn::Add(m[2], p), hn::Add(m[3], g), n1, n5);
  combine.pair(hn::Add(m[4], p), hn::Add(m[5], g), hn::Add(m[4], g), hn::Add(m[5], p), n2, n6);
  combine.pair(hn::Add(m[6], both), m[7], m[6], hn::Add(m[7], both), n3, n7);
  m[1] = hn::Sub(n1, n0);
  m[2] = hn::Sub(n2, n0);
  m[3] = hn::Sub(n3, n0);
  m[4] = hn::Sub(n4, n0);
  m[5] = hn::Sub(n5, n0);
  m[6] = hn::Sub(n6, n0);
  m[7] = hn::Sub(n7, n0);
}

// The same step from metrics not normalised (m[0] too), without normalising.
template <class Combine, class V>
HWY_INLINE void trellisStepFrom(const Combine& combine, V (&m)[kStates], V g, V p) {
  const V both = hn::Add(g, p);
  V n0, n1, n2, n3, n4, n5, n6, n7;
  combine.pair(m[0], hn::Add(m[1], both), hn::Add(m[0], both), m[1], n0, n4);
  combine.pair(hn::Add(m[2], g), hn::Add(m[3], p), hn::Add(m[2], p), hn::Add(m[3], g), n1, n5);
  combine.pair(hn::Add(m[4], p), hn::Add(m[5], g), hn::Add(m[4], g), hn::Add(m[5], p), n2, n6);
  combine.pair(hn::Add(m[6], both), m[7], m[6], hn::Add(m[7], both), n3, n7);
  m[0] = n0;
  m[1] = n1;
  m[2] = n2;
  m[3] = n3;
  m[4] = n4;
  m[5] = n5;
  m[6] = n6;
  m[7] = n7;
}

// Subtracts the metric of state 0 from all eight.
template <class V>
HWY_INLINE void normalise(V (&m)[kStates], V zero) {
  forStates1To7([&](int i) { m[i] = hn::Sub(m[i], m[0]); });
  m[0] = zero;
}

// extrinsicStep from alpha_k (alpha(i) for i = 1..7, alpha_0 = 0) and relabelled beta_k+1
// (r[0..7]), one group of equal u after the other (combine4 within each group of
// equal (u, p), then the two parity groups), so that few values are live at once.
template <class Combine, class Alpha, class V>
HWY_INLINE V extrinsicOf(const Combine& combine, const Alpha& alpha, const V (&r)[kStates], V p) {
  const V b0 = r[0], b1 = r[4], b2 = r[2], b3 = r[6], b4 = r[1], b5 = r[5], b6 = r[3], b7 = r[7];
  if constexpr (std::is_same_v<Combine, MaxCombine>) {
    // Max-log-MAP: the maxima may be taken in any order, so each alpha goes into the
    // maxima of both its branches while it is loaded (u = 1 groups one0/one1 by parity).
    V one0 = hn::Max(hn::Add(alpha(2), b1), hn::Add(alpha(3), b5));
    V zero1 = hn::Max(hn::Add(alpha(2), b5), hn::Add(alpha(3), b1));
    one0 = hn::Max(one0, hn::Add(alpha(4), b6));
    zero1 = hn::Max(zero1, hn::Add(alpha(4), b2));
    one0 = hn::Max(one0, hn::Add(alpha(5), b2));
    zero1 = hn::Max(zero1, hn::Add(alpha(5), b6));
    V zero0 = hn::Max(b0, hn::Add(alpha(1), b4));
    V one1 = hn::Max(b4, hn::Add(alpha(1), b0));
    zero0 = hn::Max(zero0, hn::Add(alpha(6), b7));
    one1 = hn::Max(one1, hn::Add(alpha(6), b3));
    zero0 = hn::Max(zero0, hn::Add(alpha(7), b3));
    one1 = hn::Max(one1, hn::Add(alpha(7), b7));
    return hn::Sub(hn::Max(one0, hn::Add(one1, p)), hn::Max(zero0, hn::Add(zero1, p)));
  }
  V x, y, z, w, one0, one1, zero0, zero1, one, none;
  combine.pair(hn::Add(alpha(2), b1), hn::Add(alpha(3), b5), hn::Add(alpha(4), b6),
               hn::Add(alpha(5), b2), x, y);
  combine.pair(b4, hn::Add(alpha(1), b0), hn::Add(alpha(6), b3), hn::Add(alpha(7), b7), z, w);
  combine.pair(x, y, z, w, one0, one1);
  combine.pair(b0, hn::Add(alpha(1), b4), hn::Add(alpha(6), b7), hn::Add(alpha(7), b3), x, y);
  combine.pair(hn::Add(alpha(2), b5), hn::Add(alpha(3), b1), hn::Add(alpha(4), b2),
               hn::Add(alpha(5), b6), z, w);
  combine.pair(x, y, z, w, zero0, zero1);
  combine.pair(one0, hn::Add(one1, p), zero0, hn::Add(zero1, p), one, none);
  return hn::Sub(one, none);  // |e| < 7000 (see VectorDecoder.h)
}

// The a priori value of a raw extrinsic value e: scaled by 0.75 for scaled max-log-MAP,
// rounded half away from zero as ScaledMaxLogPolicy does, (3|e| + 2) >> 2 = (|e| * 24576 +
// 16384) >> 15 with e's sign, then saturated to the extrinsic width.
struct APriori {
  std::int16_t limit;
  bool scaled;
  explicit APriori(const VectorWorkspace& work)
      : limit(static_cast<std::int16_t>(work.extrinsicLimit)),
        scaled(work.algorithm == Algorithm::ScaledMaxLog) {}
  template <class V>
  HWY_INLINE V operator()(V e) const {
    const hn::DFromV<V> d;
    if (scaled) {
      const V magnitude = hn::MulFixedPoint15(hn::Abs(e), hn::Set(d, 24576));
      e = hn::IfNegativeThenElse(e, hn::Neg(magnitude), magnitude);
    }
    return hn::Min(hn::Max(e, hn::Set(d, static_cast<std::int16_t>(-limit))), hn::Set(d, limit));
  }
};

// What the exchange between the half-iterations makes of the values it moves (see
// permuteSteps), at position `at`: a step's Lu, systematic + the a priori value of the other
// decoder's raw extrinsic value; a decision from an a posteriori sum, 1 + (sum >> 15), so 1
// for a sum of 0 or more; the values unchanged.
struct LuOf {
  APriori aPriori;
  const std::int16_t* systematic;
  template <class V>
  HWY_INLINE V operator()(V moved, std::size_t at) const {
    return hn::Add(hn::Load(hn::DFromV<V>(), systematic + at), aPriori(moved));
  }
};
struct Decision {
  template <class V>
  HWY_INLINE V operator()(V sum, std::size_t) const {
    return hn::Add(hn::ShiftRight<15>(sum), hn::Set(hn::DFromV<V>(), 1));
  }
};
struct Unchanged {
  template <class V>
  HWY_INLINE V operator()(V moved, std::size_t) const {
    return moved;
  }
};

// Where the values of a decoder's step come from in the other decoder's order: step
// source[k] of the same lane group (from), its lanes rearranged within each block's windows
// by pattern[k] (16 byte indices, repeated in every 128-bit block: the P windows of a block
// share one 128-bit block, P dividing 8; none for P = 1).
struct StepSource {
  const std::int16_t* from;
  const std::uint16_t* source;
  const std::uint8_t* pattern;
  bool permuted;
};

constexpr std::size_t kPrefetchDistance = 16;  // steps

// The values of step k, in a vector of d (one row of the lane group).
template <class D>
HWY_INLINE auto movedStep(D d, const StepSource& step, std::size_t k) {
  const std::size_t N = hn::Lanes(d);
  auto moved = hn::Load(d, step.from + step.source[k] * N);
  if (step.permuted) {
    const hn::Repartition<std::uint8_t, D> bytes;
    const auto indices = N == 8 ? hn::LoadU(bytes, step.pattern + 16 * k)
                                : hn::LoadDup128(bytes, step.pattern + 16 * k);
    moved = hn::TableLookupBytes(moved, hn::BitCast(d, indices));
  }
  return moved;
}

// Starts loading the values of step k (when there is one).
template <class D>
HWY_INLINE void prefetchStep(D d, const StepSource& step, std::size_t k, std::size_t length) {
  if (k < length) hwy::Prefetch(step.from + step.source[k] * hn::Lanes(d));
}

// One lane group of one half-iteration, lanes = segments: the forward recursion from the
// alpha metrics in states[0..7] (one row of lanes per state) over `length` steps, storing
// the alpha of every (2^strideShift)-th step, then the backward recursion from the
// relabelled beta metrics in states[8..15] with the raw extrinsic value of every step (an
// alpha not stored is made again from the last stored one). Leaves the reached alpha and
// (relabelled) beta in states. A stride of 2 halves the store for long windows, which then
// stays in the cache. The forward recursion also makes each step's Lu, systematic + the a
// priori value of the other decoder's raw extrinsic value (the exchange of permuteSteps),
// and stores it in lu; the backward recursion then overwrites those extrinsic values with
// its own.
template <class D, class Combine>
HWY_NOINLINE void decodeLaneGroup(D d, const Combine& combine, const StepSource exchange,
                                  const APriori aPriori,
                                  const std::int16_t* HWY_RESTRICT systematic,
                                  std::int16_t* HWY_RESTRICT lu,
                                  const std::int16_t* HWY_RESTRICT lp, std::size_t length,
                                  int strideShift, std::int16_t* HWY_RESTRICT alphaStore,
                                  std::int16_t* HWY_RESTRICT states,
                                  std::int16_t* HWY_RESTRICT extrinsic) {
  using V = decltype(hn::Zero(d));
  const std::size_t N = hn::Lanes(d);
  const std::size_t strideMask = (std::size_t{1} << strideShift) - 1;
  const V zero = hn::Zero(d);
  V a[kStates], r[kStates];
  forStates1To7([&](int m) { a[m] = hn::Load(d, states + m * N); });
  // Each step's Lu is made one step ahead, so that the recursion does not wait for it.
  const LuOf luFrom{aPriori, systematic};
  const auto luOf = [&](std::size_t k) {
    const V g = luFrom(movedStep(d, exchange, k), k * N);
    hn::Store(g, d, lu + k * N);
    return g;
  };
  V g = luOf(0);
  for (std::size_t k = 0; k < length; ++k) {
    prefetchStep(d, exchange, k + kPrefetchDistance, length);
    if ((k & strideMask) == 0) {
      std::int16_t* store = alphaStore + (k >> strideShift) * 7 * N;
      forStates1To7([&](int m) { hn::Store(a[m], d, store + (m - 1) * N); });
    }
    const V next = k + 1 < length ? luOf(k + 1) : g;
    trellisStep(combine, a, zero, g, hn::Load(d, lp + k * N));
    g = next;
  }
  forStates1To7([&](int m) { hn::Store(a[m], d, states + m * N); });
  forStates1To7([&](int m) { r[m] = hn::Load(d, states + (8 + m) * N); });
  r[0] = zero;
  HWY_ALIGN std::int16_t made[7 * 32];  // an alpha not stored, made again
  for (std::size_t k = length; k-- > 0;) {
    const std::size_t stored = k & ~strideMask;
    const std::int16_t* alpha = alphaStore + (stored >> strideShift) * 7 * N;
    if (stored != k) {
      forStates1To7([&](int m) { a[m] = hn::Load(d, alpha + (m - 1) * N); });
      for (std::size_t t = stored; t < k; ++t) {
        trellisStep(combine, a, zero, hn::Load(d, lu + t * N), hn::Load(d, lp + t * N));
      }
      forStates1To7([&](int m) { hn::Store(a[m], d, made + (m - 1) * N); });
      alpha = made;
    }
    const V g = hn::Load(d, lu + k * N);
    const V p = hn::Load(d, lp + k * N);
    const auto alphaOf = [&](int m) { return hn::Load(d, alpha + (m - 1) * N); };
    hn::Store(extrinsicOf(combine, alphaOf, r, p), d, extrinsic + k * N);
    trellisStepFrom(combine, r, p, g);
    if (k % kNormalisationPeriod == 0) normalise(r, zero);
  }
  normalise(r, zero);
  forStates1To7([&](int m) { hn::Store(r[m], d, states + (8 + m) * N); });
}

// The same for a lane group of at most half a vector: the forward recursion in the lower
// half and the backward recursion in the upper half of every register advance together
// (step t takes alpha_t to alpha_t+1 and beta_L-t to beta_L-t-1, storing both), then every
// step's extrinsic value is formed from the stored metrics, steps k and L-1-k side by side.
template <class D, class Combine>
HWY_NOINLINE void decodeLaneGroupPaired(D d, const Combine& combine,
                                        const std::int16_t* HWY_RESTRICT lu,
                                        const std::int16_t* HWY_RESTRICT lp, std::size_t length,
                                        std::int16_t* HWY_RESTRICT store,
                                        std::int16_t* HWY_RESTRICT states,
                                        std::int16_t* HWY_RESTRICT extrinsic) {
  using V = decltype(hn::Zero(d));
  const hn::Half<D> dh;
  const std::size_t N = hn::Lanes(dh);
  const std::size_t last = length - 1;
  const V zero = hn::Zero(d);
  V m[kStates];
  forStates1To7([&](int i) {
    m[i] = hn::Combine(d, hn::Load(dh, states + (8 + i) * N), hn::Load(dh, states + i * N));
  });
  for (std::size_t t = 0; t < length; ++t) {
    std::int16_t* row = store + t * 7 * 2 * N;
    forStates1To7([&](int i) { hn::Store(m[i], d, row + (i - 1) * 2 * N); });
    const V g = hn::Combine(d, hn::Load(dh, lp + (last - t) * N), hn::Load(dh, lu + t * N));
    const V p = hn::Combine(d, hn::Load(dh, lu + (last - t) * N), hn::Load(dh, lp + t * N));
    trellisStep(combine, m, zero, g, p);
  }
  forStates1To7([&](int i) {
    hn::Store(hn::LowerHalf(dh, m[i]), dh, states + i * N);
    hn::Store(hn::UpperHalf(dh, m[i]), dh, states + (8 + i) * N);
  });
  // Row t holds alpha_t below and beta_L-t above: steps k and k2 = L-1-k read alpha from
  // rows k and k2, and beta_k+1 and beta_k2+1 from rows k2 and k.
  for (std::size_t k = 0; k <= last - k; ++k) {
    const std::size_t k2 = last - k;
    const std::int16_t* rowK = store + k * 7 * 2 * N;
    const std::int16_t* rowK2 = store + k2 * 7 * 2 * N;
    V a[kStates], r[kStates];
    forStates1To7([&](int i) {
      const V fromK = hn::Load(d, rowK + (i - 1) * 2 * N);
      const V fromK2 = hn::Load(d, rowK2 + (i - 1) * 2 * N);
      a[i] = hn::ConcatLowerLower(d, fromK2, fromK);
      r[i] = hn::ConcatUpperUpper(d, fromK, fromK2);
    });
    const V p = hn::Combine(d, hn::Load(dh, lp + k2 * N), hn::Load(dh, lp + k * N));
    r[0] = zero;
    const V e = extrinsicOf(
        combine, [&](int i) { return a[i]; }, r, p);
    hn::Store(hn::UpperHalf(dh, e), dh, extrinsic + k2 * N);
    hn::Store(hn::LowerHalf(dh, e), dh, extrinsic + k * N);
  }
}

// Carries values of one decoder's order into the other's (see StepSource): the vector
// stored at position j of step k is output(moved, j). Rows of eight lanes go several to a
// vector.
template <class D, class Output>
HWY_NOINLINE void permuteSteps(D d, Output output, const VectorWorkspace& work, int toDecoder,
                               std::size_t laneGroups, std::size_t L,
                               const std::int16_t* HWY_RESTRICT from,
                               std::int16_t* HWY_RESTRICT out) {
  const std::size_t N = hn::Lanes(d);
  for (std::size_t group = 0; group < laneGroups; ++group) {
    const std::size_t first = group * L * N;
    const StepSource step{from + first, work.sourceStep[toDecoder].get(),
                          work.lanePattern[toDecoder].get(), work.processingUnits > 1};
    std::size_t k = 0;
#if HWY_TARGET <= HWY_AVX2
    if constexpr (hn::MaxLanes(D()) == 8) {  // rows k..k+rows-1 in one vector
      const hn::CappedTag<std::int16_t, 32> wide;
      const hn::Repartition<std::uint8_t, decltype(wide)> bytes;
      const std::size_t rows = hn::Lanes(wide) / 8;
      for (; k + rows <= L; k += rows) {
        const auto row = [&](std::size_t r) {
          return hn::Load(d, step.from + step.source[k + r] * 8);
        };
        decltype(hn::Zero(wide)) moved;
        if constexpr (hn::MaxLanes(decltype(wide)()) == 32) {
          const hn::Half<decltype(wide)> dh;
          moved =
              hn::Combine(wide, hn::Combine(dh, row(3), row(2)), hn::Combine(dh, row(1), row(0)));
        } else {
          moved = hn::Combine(wide, row(1), row(0));
        }
        if (step.permuted) {
          moved = hn::TableLookupBytes(moved,
                                       hn::BitCast(wide, hn::LoadU(bytes, step.pattern + 16 * k)));
        }
        hn::Store(output(moved, first + k * 8), wide, out + first + k * 8);
      }
    }
#endif
    for (; k < L; ++k) {
      prefetchStep(d, step, k + kPrefetchDistance, L);
      hn::Store(output(movedStep(d, step, k), first + k * N), d, out + first + k * N);
    }
  }
}

// Eight vectors of eight 16-bit lanes transposed in place: vector t becomes lane t of every
// input (16-bit, 32-bit and 64-bit interleaves).
template <class D8, class V>
HWY_INLINE void transpose8(D8 d8, V (&r)[8]) {
  const hn::Repartition<std::int32_t, D8> d32;
  const hn::Repartition<std::int64_t, D8> d64;
  const auto t0 = hn::BitCast(d32, hn::InterleaveLower(d8, r[0], r[1]));
  const auto t1 = hn::BitCast(d32, hn::InterleaveUpper(d8, r[0], r[1]));
  const auto t2 = hn::BitCast(d32, hn::InterleaveLower(d8, r[2], r[3]));
  const auto t3 = hn::BitCast(d32, hn::InterleaveUpper(d8, r[2], r[3]));
  const auto t4 = hn::BitCast(d32, hn::InterleaveLower(d8, r[4], r[5]));
  const auto t5 = hn::BitCast(d32, hn::InterleaveUpper(d8, r[4], r[5]));
  const auto t6 = hn::BitCast(d32, hn::InterleaveLower(d8, r[6], r[7]));
  const auto t7 = hn::BitCast(d32, hn::InterleaveUpper(d8, r[6], r[7]));
  const auto u0 = hn::BitCast(d64, hn::InterleaveLower(d32, t0, t2));
  const auto u1 = hn::BitCast(d64, hn::InterleaveUpper(d32, t0, t2));
  const auto u2 = hn::BitCast(d64, hn::InterleaveLower(d32, t1, t3));
  const auto u3 = hn::BitCast(d64, hn::InterleaveUpper(d32, t1, t3));
  const auto u4 = hn::BitCast(d64, hn::InterleaveLower(d32, t4, t6));
  const auto u5 = hn::BitCast(d64, hn::InterleaveUpper(d32, t4, t6));
  const auto u6 = hn::BitCast(d64, hn::InterleaveLower(d32, t5, t7));
  const auto u7 = hn::BitCast(d64, hn::InterleaveUpper(d32, t5, t7));
  r[0] = hn::BitCast(d8, hn::InterleaveLower(d64, u0, u4));
  r[1] = hn::BitCast(d8, hn::InterleaveUpper(d64, u0, u4));
  r[2] = hn::BitCast(d8, hn::InterleaveLower(d64, u1, u5));
  r[3] = hn::BitCast(d8, hn::InterleaveUpper(d64, u1, u5));
  r[4] = hn::BitCast(d8, hn::InterleaveLower(d64, u2, u6));
  r[5] = hn::BitCast(d8, hn::InterleaveUpper(d64, u2, u6));
  r[6] = hn::BitCast(d8, hn::InterleaveLower(d64, u3, u7));
  r[7] = hn::BitCast(d8, hn::InterleaveUpper(d64, u3, u7));
}

// Eight received soft values from in, saturated to -128..127.
template <class D8>
HWY_INLINE auto loadSoftValues(D8 d8, const std::int32_t* in) {
  const hn::Repartition<std::int32_t, D8> d32;
  const auto wide = hn::ReorderDemote2To(d8, hn::LoadU(d32, in), hn::LoadU(d32, in + 4));
  return hn::Min(hn::Max(wide, hn::Set(d8, -128)), hn::Set(d8, 127));
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
      // Rows of two lanes (two windows): rotated by 16 bits when lane 0 reads lane 1.
      work.laneSwap[decoder].get()[k] = static_cast<std::uint8_t>(P == 2 ? 8 * pattern[0] : 0);
    }
  }
  work.tablesK = K;
}

// The boundary metrics of a group's segments: [decoder][alpha, beta, new alpha, new beta]
// [segment], entry s of alpha holding segment s's alpha_0 and of beta segment s-1's beta_L,
// as the previous iteration reached them.
struct GroupBoundaries {
  StateMetrics* all;
  std::size_t segments;  // entries per array
  std::size_t S, P;
  const StateMetrics* tails;  // [block][decoder]
  StateMetrics start = knownStateZero();
  StateMetrics* array(int decoder, int which) const {
    return all + (4 * decoder + which) * segments;
  }
  const StateMetrics& alphaStart(int decoder, std::size_t s) const {
    return s % P == 0 ? start : array(decoder, 0)[s];
  }
  const StateMetrics& betaEnd(int decoder, std::size_t s) const {
    return s % P == P - 1 ? tails[2 * (s / P) + decoder] : array(decoder, 1)[s + 1];
  }
  void reached(int decoder, std::size_t s, const StateMetrics& alphaEnd,
               const StateMetrics& betaStart) const {
    array(decoder, 2)[s + 1] = alphaEnd;
    array(decoder, 3)[s] = betaStart;
  }
  // After a half-iteration: the reached metrics become those the next one starts from.
  void keep(int decoder) const {
    for (std::size_t s = 0; s < S; ++s) {
      if (s % P != 0) {
        array(decoder, 0)[s] = array(decoder, 2)[s];
        array(decoder, 1)[s] = array(decoder, 3)[s];
      }
    }
  }
};

// The tail metrics of every block of a group and boundaries that start equiprobable.
inline GroupBoundaries startBoundaries(VectorWorkspace& work, const CodeBlock* const* blocks,
                                       std::size_t count) {
  for (std::size_t b = 0; b < count; ++b) {
    StateMetrics betas[2];
    tailBetas(*blocks[b], betas);
    work.tails[2 * b] = betas[0];
    work.tails[2 * b + 1] = betas[1];
  }
  const GroupBoundaries ends{work.boundaries.get(), work.maxSegments, count * work.processingUnits,
                             work.processingUnits, work.tails.get()};
  std::fill_n(ends.all, 8 * ends.segments, StateMetrics{});
  return ends;
}

#if HWY_TARGET <= HWY_AVX2
// A group of one or two windows (S segments) fills few lanes of the layout above, so its
// recursions run with the states across the lanes instead: the eight state metrics of one
// recursion in the eight lanes of a 128-bit block. A register of B blocks (B = 2 or 4)
// holds the forward recursions of B/2 windows in its lower half and their backward
// recursions in its upper half, G = 2S/B registers for S windows. Time t takes every
// forward recursion from alpha_t to alpha_t+1 and every backward one from beta_L-t to
// beta_L-1-t, each block through a radix-2 step done by byte shuffles within the block:
// forward, X[j] = alpha[2(j%4)] and Y[j] = alpha[2(j%4)+1] are the two states that lead to
// j; backward, X[s] = beta[s>>1] and Y[s] = beta[4+(s>>1)] are the states s leads to with
// register input 0 and 1. The branch metrics GX and GY come by shuffles from the step's
// quad [0, Lu, Lp, Lu+Lp] (the metric of (u, p) at index u + 2p), and every block steps to
// combine(X + GX, Y + GY). Every kNormalisationPeriod times the metric of state 0 is
// subtracted, through the branch metrics so that the recursion does not wait for it.
//
// The first L/2 times store the metrics before their step, forward and backward halves
// exchanged. From time L/2 on, time t reads back those of time L-1-t: beta_t+1 beside each
// forward recursion and alpha_L-1-t beside each backward one, the metrics at the other end
// of the branches of step t (forward half) and step L-1-t (backward half). Added to this
// time's sums X + GX and Y + GY they make all 16 branch sums alpha + gamma + beta, which
// three levels of shuffle and combine reduce pairwise in the order of extrinsicStep
// (combine4 within each group of equal (u, p), then the two parity groups), leaving the
// u = 1 combination in lane 6 and the u = 0 one in lane 7. Their difference is the
// extrinsic value plus Lu (the branch metrics count u * Lu); the differences of eight times
// are shifted into an accumulator and written out less Lu.
//
// Such a group keeps its values in rows of S lanes (step k of segment s at k*S + s), the
// quads in rows of 4*S lanes.
struct StateLaneTable {
  // Lanes read: the butterfly operands, the branch metrics (quad entry), the partners of
  // the three combine levels and of the difference, and state 0.
  std::uint8_t x[8], y[8], gx[8], gy[8], level1[8], level2[8], level3[8], partner[8], first[8];
};
constexpr StateLaneTable kForwardLanes = {
    {0, 2, 4, 6, 0, 2, 4, 6}, {1, 3, 5, 7, 1, 3, 5, 7}, {0, 1, 2, 3, 3, 2, 1, 0},
    {3, 2, 1, 0, 0, 1, 2, 3}, {4, 5, 6, 7, 0, 1, 2, 3}, {7, 6, 5, 4, 3, 2, 1, 0},
    {2, 3, 0, 1, 6, 7, 4, 5}, {1, 0, 3, 2, 5, 4, 7, 6}, {0, 0, 0, 0, 0, 0, 0, 0}};
constexpr StateLaneTable kBackwardLanes = {
    {0, 0, 1, 1, 2, 2, 3, 3}, {4, 4, 5, 5, 6, 6, 7, 7}, {0, 3, 1, 2, 2, 1, 3, 0},
    {3, 0, 2, 1, 1, 2, 0, 3}, {1, 0, 3, 2, 5, 4, 7, 6}, {7, 6, 5, 4, 3, 2, 1, 0},
    {3, 2, 1, 0, 7, 6, 5, 4}, {1, 0, 3, 2, 5, 4, 7, 6}, {0, 0, 0, 0, 0, 0, 0, 0}};

// The byte indices of one table field for every block of d, forward in the lower half and
// backward in the upper; the quad entries of the window of block b, for a register whose
// first window is `window`, are 4 * (window + b % (B/2)) lanes on.
template <class D>
HWY_INLINE auto stateLaneIndices(D d, const std::uint8_t (StateLaneTable::*field)[8],
                                 std::size_t window = 0, bool quad = false) {
  const hn::Repartition<std::uint8_t, D> bytes;
  const std::size_t blocks = hn::Lanes(d) / 8;
  HWY_ALIGN std::uint8_t index[64];
  for (std::size_t b = 0; b < blocks; ++b) {
    const StateLaneTable& table = 2 * b < blocks ? kForwardLanes : kBackwardLanes;
    const std::size_t offset = quad ? 4 * (window + b % (blocks / 2)) : 0;
    for (std::size_t lane = 0; lane < 8; ++lane) {
      const std::size_t source = offset + (table.*field)[lane];
      index[16 * b + 2 * lane] = static_cast<std::uint8_t>(2 * source);
      index[16 * b + 2 * lane + 1] = static_cast<std::uint8_t>(2 * source + 1);
    }
  }
  return hn::BitCast(d, hn::Load(bytes, index));
}

// f(0), ..., f(G - 1) written out, so that arrays of registers stay in registers.
template <std::size_t G, class F>
HWY_INLINE void forRegisters(const F& f) {
  f(0);
  if constexpr (G > 1) f(1);
}

// 16 bytes at p in every block of a vector of d's half.
template <class DH>
HWY_INLINE auto loadBlockDup(DH dh, const std::int16_t* p) {
  if constexpr (hn::MaxLanes(DH()) == 8) {
    return hn::LoadU(dh, p);
  } else {
    return hn::LoadDup128(dh, p);
  }
}

// The recursions of S windows of length L (a multiple of 4: K is a multiple of 8 and P at
// most 2) in G registers of d, from the quads of every step; rows takes the metrics stored
// over the first L/2 times; metrics holds the G registers' starting metrics and takes the
// reached ones (not normalised). Writes the raw extrinsic values, less the Lu of lu.
template <std::size_t G, class D, class Combine>
HWY_NOINLINE void decodeStateLanes(D d, const Combine& combine,
                                   const std::int16_t* HWY_RESTRICT quads,
                                   const std::int16_t* HWY_RESTRICT lu, std::size_t L,
                                   std::size_t S, std::int16_t* HWY_RESTRICT rows,
                                   std::int16_t* HWY_RESTRICT metrics,
                                   std::int16_t* HWY_RESTRICT extrinsic) {
  using V = decltype(hn::Zero(d));
  const hn::Half<D> dh;
  const hn::CappedTag<std::int16_t, 8> d8;
  constexpr std::size_t kLanes = hn::MaxLanes(D());
  constexpr std::size_t kWindows = kLanes / 16;  // per register
  const V x = stateLaneIndices(d, &StateLaneTable::x);
  const V y = stateLaneIndices(d, &StateLaneTable::y);
  const V level1 = stateLaneIndices(d, &StateLaneTable::level1);
  const V level2 = stateLaneIndices(d, &StateLaneTable::level2);
  const V level3 = stateLaneIndices(d, &StateLaneTable::level3);
  const V partner = stateLaneIndices(d, &StateLaneTable::partner);
  const V first = stateLaneIndices(d, &StateLaneTable::first);
  V gx[G], gy[G], m[G], accumulated[G];
  for (std::size_t g = 0; g < G; ++g) {
    gx[g] = stateLaneIndices(d, &StateLaneTable::gx, g * kWindows, true);
    gy[g] = stateLaneIndices(d, &StateLaneTable::gy, g * kWindows, true);
    m[g] = hn::Load(d, metrics + g * kLanes);
    accumulated[g] = hn::Zero(d);
  }
  const auto time = [&](std::size_t t, auto store, auto extrinsicToo) CORVANE_INLINE_LAMBDA {
    // The quads of step t in every forward block, of step L-1-t in every backward one.
    const V q = hn::Combine(d, loadBlockDup(dh, quads + (L - 1 - t) * 4 * S),
                            loadBlockDup(dh, quads + t * 4 * S));
    const bool normalise = t % kNormalisationPeriod == 0;
    forRegisters<G>([&](std::size_t g) {
      V branchX = hn::TableLookupBytes(q, gx[g]);
      V branchY = hn::TableLookupBytes(q, gy[g]);
      if (normalise) {
        const V state0 = hn::TableLookupBytes(m[g], first);
        branchX = hn::Sub(branchX, state0);
        branchY = hn::Sub(branchY, state0);
      }
      if (store) hn::Store(hn::ConcatLowerUpper(d, m[g], m[g]), d, rows + (t * G + g) * kLanes);
      const V sx = hn::Add(hn::TableLookupBytes(m[g], x), branchX);
      const V sy = hn::Add(hn::TableLookupBytes(m[g], y), branchY);
      if (extrinsicToo) {
        const V other = hn::Load(d, rows + ((L - 1 - t) * G + g) * kLanes);
        V r = combine.one(hn::Add(sx, other), hn::TableLookupBytes(hn::Add(sy, other), level1));
        r = combine.one(r, hn::TableLookupBytes(r, level2));
        r = combine.one(r, hn::TableLookupBytes(r, level3));
        const V difference = hn::Sub(hn::TableLookupBytes(r, partner), r);
        accumulated[g] = hn::CombineShiftRightBytes<14>(d, accumulated[g], difference);
      }
      m[g] = combine.one(sx, sy);
    });
  };
  // The values of the last `count` times (time `last` in lane 0 of each block): the
  // forward blocks hold steps last, last-1, ..., the backward blocks L-1-last, L-last, ....
  HWY_ALIGN std::int16_t values[G * kLanes];
  const auto blockOf = [&](bool forward, std::size_t s) {
    return values + s / kWindows * kLanes + ((forward ? 0 : kWindows) + s % kWindows) * 8;
  };
  const auto flush = [&](std::size_t last) CORVANE_INLINE_LAMBDA {
    for (std::size_t g = 0; g < G; ++g) hn::Store(accumulated[g], d, values + g * kLanes);
    for (int side = 0; side < 2; ++side) {
      const bool forward = side == 0;
      // Steps firstStep..firstStep+7, in order.
      const std::size_t firstStep = forward ? last - 7 : L - 1 - last;
      auto v0 = hn::Load(d8, blockOf(forward, 0));
      auto v1 = hn::Load(d8, blockOf(forward, S - 1));
      if (forward) {
        v0 = hn::Reverse(d8, v0);
        v1 = hn::Reverse(d8, v1);
      }
      std::int16_t* out = extrinsic + firstStep * S;
      const std::int16_t* lus = lu + firstStep * S;
      if (S == 1) {
        hn::StoreU(hn::Sub(v0, hn::LoadU(d8, lus)), d8, out);
      } else {
        hn::StoreU(hn::Sub(hn::InterleaveLower(d8, v0, v1), hn::LoadU(d8, lus)), d8, out);
        hn::StoreU(hn::Sub(hn::InterleaveUpper(d8, v0, v1), hn::LoadU(d8, lus + 8)), d8, out + 8);
      }
    }
  };
  const auto flushPartly = [&](std::size_t last, std::size_t count) {
    for (std::size_t g = 0; g < G; ++g) hn::Store(accumulated[g], d, values + g * kLanes);
    for (std::size_t s = 0; s < S; ++s) {
      for (std::size_t i = 0; i < count; ++i) {
        const std::size_t forward = (last - i) * S + s;
        const std::size_t backward = (L - 1 - (last - i)) * S + s;
        extrinsic[forward] = static_cast<std::int16_t>(blockOf(true, s)[i] - lu[forward]);
        extrinsic[backward] = static_cast<std::int16_t>(blockOf(false, s)[i] - lu[backward]);
      }
    }
  };
  const std::true_type yes;
  const std::false_type no;
  std::size_t t = 0;
  for (; t < L / 2; ++t) time(t, yes, no);
  std::size_t count = 0;
  for (; t < L; ++t) {
    time(t, no, yes);
    if (++count == 8) {
      flush(t);
      count = 0;
    }
  }
  if (count != 0) flushPartly(L - 1, count);
  for (std::size_t g = 0; g < G; ++g) hn::Store(m[g], d, metrics + g * kLanes);
}

// quads + 4*S*k = the quads [0, Lu, Lp, Lu+Lp] of step k of each segment, from rows of S
// lanes.
HWY_NOINLINE void buildQuads(const std::int16_t* HWY_RESTRICT lu,
                             const std::int16_t* HWY_RESTRICT lp, std::size_t L, std::size_t S,
                             std::int16_t* HWY_RESTRICT quads) {
  const hn::CappedTag<std::int16_t, 8> d8;
  const hn::Repartition<std::int32_t, decltype(d8)> d32;
  const std::size_t steps = 8 / S;  // per vector
  std::size_t k = 0;
  for (; k + steps <= L; k += steps) {
    const auto u = hn::Load(d8, lu + S * k);
    const auto p = hn::Load(d8, lp + S * k);
    const auto both = hn::Add(u, p);
    std::int16_t* out = quads + 4 * S * k;
    for (int half = 0; half < 2; ++half) {
      const auto zeroLu = hn::BitCast(d32, half == 0 ? hn::InterleaveLower(d8, hn::Zero(d8), u)
                                                     : hn::InterleaveUpper(d8, hn::Zero(d8), u));
      const auto lpBoth = hn::BitCast(
          d32, half == 0 ? hn::InterleaveLower(d8, p, both) : hn::InterleaveUpper(d8, p, both));
      hn::Store(hn::BitCast(d8, hn::InterleaveLower(d32, zeroLu, lpBoth)), d8, out + 16 * half);
      hn::Store(hn::BitCast(d8, hn::InterleaveUpper(d32, zeroLu, lpBoth)), d8, out + 16 * half + 8);
    }
  }
  for (; k < L; ++k) {
    for (std::size_t s = 0; s < S; ++s) {
      std::int16_t* q = quads + 4 * (S * k + s);
      q[0] = 0;
      q[1] = lu[S * k + s];
      q[2] = lp[S * k + s];
      q[3] = static_cast<std::int16_t>(q[1] + q[2]);
    }
  }
}

// Carries values of one decoder's order into the other's in rows of S = 1 or 2 lanes: row k
// is row source[k] of the other order, its two lanes swapped where the windows' QPP
// interleaving swaps them (P = 2); then out[j] = output(value, j), vector by vector.
template <class Output>
HWY_NOINLINE void permuteRows(Output output, const VectorWorkspace& work, int toDecoder,
                              std::size_t L, std::size_t S, const std::int16_t* HWY_RESTRICT from,
                              std::int16_t* HWY_RESTRICT out) {
  const std::uint16_t* source = work.sourceStep[toDecoder].get();
  if (S == 1) {
    for (std::size_t k = 0; k < L; ++k) out[k] = from[source[k]];
  } else {
    const std::uint8_t* rotation = work.laneSwap[toDecoder].get();
    for (std::size_t k = 0; k < L; ++k) {
      std::uint32_t row;
      std::memcpy(&row, from + 2 * source[k], sizeof(row));
      row = std::rotr(row, rotation[k]);
      std::memcpy(out + 2 * k, &row, sizeof(row));
    }
  }
  const hn::CappedTag<std::int16_t, 32> d;
  for (std::size_t j = 0; j < L * S; j += hn::Lanes(d)) {
    hn::Store(output(hn::Load(d, out + j), j), d, out + j);
  }
}

// Decodes a group of S = 1 or 2 segments with the states across the lanes, in the widest
// registers their 2S recursions fill.
template <class Combine>
void decodeStateLaneGroup(const Combine& combine, VectorWorkspace& work,
                          const CodeBlock* const* blocks, std::size_t count) {
  const std::size_t K = blocks[0]->row->K;
  const std::size_t P = work.processingUnits;
  const std::size_t S = count * P;
  const std::size_t L = K / P;
  const std::size_t positions = L * S;
  if (work.tablesK != K) buildStepTables(work, *blocks[0]->row);
  std::int16_t* sys[2] = {work.systematic[0].get(), work.systematic[1].get()};
  std::int16_t* par[2] = {work.parity[0].get(), work.parity[1].get()};
  std::int16_t* lu = work.lu.get();
  std::int16_t* extrinsic = work.extrinsic.get();
  // Into rows of S lanes: d0, d1, d2 of every segment, saturated to -128..127.
  const hn::CappedTag<std::int16_t, 8> d8;
  std::int16_t* arrays[3] = {sys[0], par[0], par[1]};
  for (int stream = 0; stream < 3; ++stream) {
    const std::int32_t* in[2];
    for (std::size_t s = 0; s < S; ++s) {
      const CodeBlock& block = *blocks[s / P];
      const std::int32_t* streams[3] = {block.d0, block.d1, block.d2};
      in[s] = streams[stream] + s % P * L;
    }
    std::int16_t* out = arrays[stream];
    std::size_t k = 0;
    for (; k + 8 <= L; k += 8) {
      const auto a = loadSoftValues(d8, in[0] + k);
      if (S == 1) {
        hn::StoreU(a, d8, out + k);
      } else {
        const auto b = loadSoftValues(d8, in[1] + k);
        hn::StoreU(hn::InterleaveLower(d8, a, b), d8, out + 2 * k);
        hn::StoreU(hn::InterleaveUpper(d8, a, b), d8, out + 2 * k + 8);
      }
    }
    for (; k < L; ++k) {
      for (std::size_t s = 0; s < S; ++s) out[k * S + s] = softValue(in[s][k]);
    }
  }
  permuteRows(Unchanged(), work, 1, L, S, sys[0], sys[1]);
  const GroupBoundaries ends = startBoundaries(work, blocks, count);

  const hn::CappedTag<std::int16_t, 32> wide;
  const hn::CappedTag<std::int16_t, 16> narrow;
  const std::size_t lanes = S == 2 && hn::Lanes(wide) == 32 ? 32 : 16;
  const std::size_t windows = lanes / 16;  // per register
  HWY_ALIGN std::int16_t metrics[2 * 32];
  const auto metricsOf = [&](std::size_t s) {
    return metrics + s / windows * lanes + s % windows * 8;
  };
  const auto halfIteration = [&](int decoder) {
    buildQuads(lu, par[decoder], L, S, work.quads.get());
    for (std::size_t s = 0; s < S; ++s) {
      for (int i = 0; i < kStates; ++i) {
        metricsOf(s)[i] = ends.alphaStart(decoder, s).m[i];
        metricsOf(s)[lanes / 2 + i] = ends.betaEnd(decoder, s).m[i];
      }
    }
    const std::int16_t* quads = work.quads.get();
    std::int16_t* rows = work.alpha.get();
    if (lanes == 32) {
      decodeStateLanes<1>(wide, combine, quads, lu, L, S, rows, metrics, extrinsic);
    } else if (S == 2) {
      decodeStateLanes<2>(narrow, combine, quads, lu, L, S, rows, metrics, extrinsic);
    } else {
      decodeStateLanes<1>(narrow, combine, quads, lu, L, S, rows, metrics, extrinsic);
    }
    for (std::size_t s = 0; s < S; ++s) {
      const std::int16_t* alpha = metricsOf(s);
      const std::int16_t* beta = metricsOf(s) + lanes / 2;
      StateMetrics alphaEnd, betaStart;
      for (int i = 0; i < kStates; ++i) {
        alphaEnd.m[i] = static_cast<Metric>(alpha[i] - alpha[0]);
        betaStart.m[i] = static_cast<Metric>(beta[i] - beta[0]);
      }
      ends.reached(decoder, s, alphaEnd, betaStart);
    }
    ends.keep(decoder);
  };
  const APriori aPriori(work);
  const auto toDecoder = [&](int decoder) {
    permuteRows(LuOf{aPriori, sys[decoder]}, work, decoder, L, S, extrinsic, lu);
  };
  std::copy_n(sys[0], positions, lu);
  const std::uint32_t iterations = blocks[0]->iterations;
  for (std::uint32_t iteration = 0; iteration < iterations; ++iteration) {
    halfIteration(0);
    toDecoder(1);
    halfIteration(1);
    if (iteration + 1 < iterations) toDecoder(0);
  }
  // A posteriori value = systematic + a priori + unscaled extrinsic; the decisions go into
  // natural order in lu, then out of the rows.
  for (std::size_t j = 0; j < positions; j += hn::Lanes(wide)) {
    hn::Store(hn::Add(hn::Load(wide, lu + j), hn::Load(wide, extrinsic + j)), wide, extrinsic + j);
  }
  permuteRows(Decision(), work, 0, L, S, extrinsic, lu);
  std::uint8_t* target[2];
  for (std::size_t s = 0; s < S; ++s) target[s] = blocks[s / P]->bits + s % P * L;
  const hn::Rebind<std::uint8_t, decltype(narrow)> bytes16;
  const hn::Repartition<std::uint8_t, decltype(d8)> bytes8;
  HWY_ALIGN static constexpr std::uint8_t kEvenOdd[16] = {0, 2, 4, 6, 8, 10, 12, 14,
                                                          1, 3, 5, 7, 9, 11, 13, 15};
  std::size_t k = 0;
  for (; k + 8 <= L; k += 8) {
    const auto bits = hn::DemoteTo(bytes16, hn::LoadU(narrow, lu + S * k));  // 8 * S
    if (S == 1) {
      hn::StoreU(hn::LowerHalf(bits), hn::Rebind<std::uint8_t, decltype(d8)>(), target[0] + k);
    } else {
      const auto split = hn::TableLookupBytes(bits, hn::Load(bytes8, kEvenOdd));
      hn::StoreU(hn::LowerHalf(split), hn::Rebind<std::uint8_t, decltype(d8)>(), target[0] + k);
      hn::StoreU(hn::UpperHalf(hn::Rebind<std::uint8_t, decltype(d8)>(), split),
                 hn::Rebind<std::uint8_t, decltype(d8)>(), target[1] + k);
    }
  }
  for (; k < L; ++k) {
    for (std::size_t s = 0; s < S; ++s) target[s][k] = static_cast<std::uint8_t>(lu[S * k + s]);
  }
}
#endif  // HWY_TARGET <= HWY_AVX2

// Decodes a group in lane groups of d's width; a group that fills at most half of dPaired's
// lanes runs the paired recursions in dPaired's registers.
template <class D, class DPaired>
void decodeGroupWith(D d, DPaired dPaired, VectorWorkspace& work, const CodeBlock* const* blocks,
                     std::size_t count) {
  const std::size_t K = blocks[0]->row->K;
  const std::size_t P = work.processingUnits;
  const std::size_t N = hn::Lanes(d);
  const std::size_t S = count * P;
  const std::size_t laneGroups = (S + N - 1) / N;
  const std::size_t L = K / P;
  const std::size_t positions = laneGroups * L * N;
  const std::uint32_t iterations = blocks[0]->iterations;
  // The paired recursions store both metrics of every step: only while that fits 1 MiB.
  const bool paired = laneGroups == 1 && hn::Lanes(dPaired) == 2 * N &&
                      7 * 2 * N * L * sizeof(std::int16_t) <= (std::size_t{1} << 20);
  // Every second alpha stored when all would take more than 1 MiB, or 512 KiB in a
  // 32-lane group, whose steps cost less against their memory traffic (as measured).
  const std::size_t storeLimit = std::size_t{1} << (N >= 32 ? 19 : 20);
  const int strideShift = 7 * N * L * sizeof(std::int16_t) > storeLimit ? 1 : 0;
  if (work.tablesK != K) buildStepTables(work, *blocks[0]->row);

  std::int16_t* sys[2] = {work.systematic[0].get(), work.systematic[1].get()};
  std::int16_t* par[2] = {work.parity[0].get(), work.parity[1].get()};
  std::int16_t* lu = work.lu.get();
  std::int16_t* extrinsic = work.extrinsic.get();
  // Block b's window w is segment s = b*P + w, in lane s % N of lane group s / N (a lane
  // group holds N / P whole blocks); lanes without a segment hold zeros. Values move between
  // the blocks' arrays and the lanes eight segments by eight steps at a time, transposed in
  // registers (missing segments read zeros and write to a sink), and the last steps one by
  // one.
  // The lane-per-window recursions make each step's Lu in the forward recursion (see
  // decodeLaneGroup), the paired ones in a pass of their own (permuteSteps). The first a
  // priori values come from zero extrinsic values.
  if (!paired) std::fill_n(extrinsic, positions, std::int16_t{0});
  if (S % N != 0) {
    std::fill_n(sys[0], positions, std::int16_t{0});
    std::fill_n(par[0], positions, std::int16_t{0});
    std::fill_n(par[1], positions, std::int16_t{0});
  }
  const hn::CappedTag<std::int16_t, 8> d8;
  using V8 = decltype(hn::Zero(d8));
  const std::size_t fullRows = L - L % 8;
  // Into the lanes: d0, d1, d2 of every block, saturated to -128..127.
  std::int16_t* arrays[3] = {sys[0], par[0], par[1]};
  for (std::size_t first = 0; first < S; first += 8) {
    const std::size_t lanes = std::min<std::size_t>(8, S - first);
    for (int stream = 0; stream < 3; ++stream) {
      const std::int32_t* source[8];
      for (std::size_t s = 0; s < 8; ++s) {
        const CodeBlock& block = *blocks[std::min(first + s, S - 1) / P];
        const std::int32_t* streams[3] = {block.d0, block.d1, block.d2};
        source[s] = s < lanes ? streams[stream] + (first + s) % P * L : work.zeros.get();
      }
      std::int16_t* out = arrays[stream] + first / N * L * N + first % N;
      for (std::size_t k = 0; k < fullRows; k += 8) {
        V8 r[8];
        forEight([&](int s) { r[s] = loadSoftValues(d8, source[s] + k); });
        transpose8(d8, r);
        forEight([&](int t) { hn::StoreU(r[t], d8, out + (k + t) * N); });
      }
      for (std::size_t k = fullRows; k < L; ++k) {
        for (std::size_t s = 0; s < lanes; ++s) out[k * N + s] = softValue(source[s][k]);
      }
    }
  }
  permuteSteps(d, Unchanged(), work, 1, laneGroups, L, sys[0], sys[1]);
  const GroupBoundaries ends = startBoundaries(work, blocks, count);

  const APriori aPriori(work);
  const auto halfIteration = [&](const auto& combine, int decoder) {
    std::int16_t* states = work.laneStates.get();
    for (std::size_t group = 0; group < laneGroups; ++group) {
      for (std::size_t lane = 0; lane < N; ++lane) {
        const std::size_t s = group * N + lane;
        const StateMetrics zero{};
        const StateMetrics& a = s < S ? ends.alphaStart(decoder, s) : zero;
        const StateMetrics& bt = s < S ? ends.betaEnd(decoder, s) : zero;
        for (int m = 0; m < kStates; ++m) {
          states[m * N + lane] = a.m[m];
          states[(8 + m) * N + lane] = bt.m[kSigma[m]];
        }
      }
      const std::size_t first = group * L * N;
      if (paired) {
        decodeLaneGroupPaired(dPaired, combine, lu, par[decoder], L, work.alpha.get(), states,
                              extrinsic);
      } else {
        const StepSource exchange{extrinsic + first, work.sourceStep[decoder].get(),
                                  work.lanePattern[decoder].get(), P > 1};
        decodeLaneGroup(d, combine, exchange, aPriori, sys[decoder] + first, lu + first,
                        par[decoder] + first, L, strideShift, work.alpha.get(), states,
                        extrinsic + first);
      }
      for (std::size_t lane = 0; lane < N && group * N + lane < S; ++lane) {
        StateMetrics alphaEnd, betaStart;
        for (int m = 0; m < kStates; ++m) {
          alphaEnd.m[m] = states[m * N + lane];
          betaStart.m[kSigma[m]] = states[(8 + m) * N + lane];
        }
        ends.reached(decoder, group * N + lane, alphaEnd, betaStart);
      }
    }
    ends.keep(decoder);
  };
  const auto toDecoder = [&](int decoder) {
    if (paired)
      permuteSteps(d, LuOf{aPriori, sys[decoder]}, work, decoder, laneGroups, L, extrinsic, lu);
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
    iterate(LogMapCombine{&work});
  } else {
    iterate(MaxCombine{});
  }
  // A posteriori value = systematic + a priori + unscaled extrinsic; the decisions go into
  // natural order in lu, then out of the lanes.
  for (std::size_t j = 0; j < positions; j += N) {
    hn::Store(hn::Add(hn::Load(d, lu + j), hn::Load(d, extrinsic + j)), d, extrinsic + j);
  }
  permuteSteps(d, Decision(), work, 0, laneGroups, L, extrinsic, lu);
  const hn::Rebind<std::uint8_t, decltype(d8)> bytes8;
  for (std::size_t first = 0; first < S; first += 8) {
    const std::size_t lanes = std::min<std::size_t>(8, S - first);
    std::uint8_t* target[8];
    for (std::size_t s = 0; s < 8; ++s) {
      target[s] = s < lanes ? blocks[(first + s) / P]->bits + (first + s) % P * L : work.sink.get();
    }
    const std::int16_t* in = lu + first / N * L * N + first % N;
    for (std::size_t k = 0; k < fullRows; k += 8) {
      V8 r[8];
      forEight([&](int t) { r[t] = hn::LoadU(d8, in + (k + t) * N); });
      transpose8(d8, r);
      forEight([&](int s) { hn::StoreU(hn::DemoteTo(bytes8, r[s]), bytes8, target[s] + k); });
    }
    for (std::size_t k = fullRows; k < L; ++k) {
      for (std::size_t s = 0; s < lanes; ++s) {
        target[s][k] = static_cast<std::uint8_t>(in[k * N + s]);
      }
    }
  }
}

void decodeGroup(VectorWorkspace& work, const CodeBlock* const* blocks, std::size_t count) {
  if (work.algorithm == Algorithm::LogMap && count * work.processingUnits == 1) {
    // One log-MAP window fills too few lanes to pay for the vector table look-ups.
    work.oneLane.decode(*blocks[0]);
    return;
  }
  const std::size_t maxLanes = hn::Lanes(hn::ScalableTag<std::int16_t>());
  const std::size_t segments = count * work.processingUnits;
  // Blocks beyond the last full lane group that fill at most half of one are a group of
  // their own (the blocks are independent), which the paired recursions decode for less.
  const std::size_t perGroup = std::max<std::size_t>(1, maxLanes / work.processingUnits);
  const std::size_t rest = count % perGroup;
  if (count > perGroup && rest != 0 && 2 * rest * work.processingUnits <= maxLanes) {
    decodeGroup(work, blocks, count - rest);
    decodeGroup(work, blocks + count - rest, rest);
    return;
  }
#if HWY_TARGET <= HWY_AVX2
  if (segments <= 2) {  // the states across the lanes
    if (work.algorithm == Algorithm::LogMap) {
      decodeStateLaneGroup(LogMapCombine{&work}, work, blocks, count);
    } else {
      decodeStateLaneGroup(MaxCombine{}, work, blocks, count);
    }
    return;
  }
#endif
  const std::size_t lanes = laneGroupWidth(segments, maxLanes);
  if (lanes <= 8) {
    decodeGroupWith(hn::CappedTag<std::int16_t, 8>(), hn::CappedTag<std::int16_t, 16>(), work,
                    blocks, count);
  } else if (lanes <= 16) {
    decodeGroupWith(hn::CappedTag<std::int16_t, 16>(), hn::CappedTag<std::int16_t, 32>(), work,
                    blocks, count);
  } else {
    const hn::CappedTag<std::int16_t, 32> d;
    decodeGroupWith(d, d, work, blocks, count);
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
  const int size = correction.size();
  work.chunkCount = size <= 256 ? (size - 1 + 14) / 15 : 0;
  const auto f = [&](int d) { return correction[d < size ? d : size - 1]; };
  for (int c = 0; c < work.chunkCount; ++c) {
    for (int x = 0; x < 16; ++x) {
      work.chunkTable[16 * c + x] =
          static_cast<std::uint8_t>(f(15 * c + std::min(x, 15)) - f(15 * c + 15));
    }
  }
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
  // One lane group (alpha, or alpha and beta in the paired recursions) at most 32 lanes.
  const std::size_t groupLanes = std::min<std::size_t>(32, std::max<std::size_t>(16, 4 * B * P));
  const std::size_t n = work.positions;
  bool ok = work.lu.allocate(n) && work.extrinsic.allocate(n) &&
            work.alpha.allocate(7 * groupLanes * L) && work.laneStates.allocate(16 * 32) &&
            work.pi.allocate(K) && work.piInverse.allocate(K) && work.quads.allocate(16 * K) &&
            work.zeros.allocate(K + 8) && work.sink.allocate(K);
  for (int decoder = 0; decoder < 2; ++decoder) {
    ok = ok && work.systematic[decoder].allocate(n) && work.parity[decoder].allocate(n) &&
         work.sourceStep[decoder].allocate(L) && work.lanePattern[decoder].allocate(16 * L) &&
         work.laneSwap[decoder].allocate(L);
  }
  if (!ok || !work.oneLane.init(config)) return false;
  std::fill_n(work.zeros.get(), K + 8, 0);
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
