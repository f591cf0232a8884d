// The recursions of one constituent decoder of the turbo code of TS 36.212 clause 5.1.3.2:
// the 8-state recursive systematic encoder with transfer function [1, g1(D)/g0(D)],
// g0 = 1 + D^2 + D^3 and g1 = 1 + D + D^3, decoded over one window of the trellis by a
// forward (alpha) and a backward (beta) recursion that yields an extrinsic value per step.
// The combining operator (max or max*) comes from a policy (MetricPolicies.h), so the three
// algorithms share this body.
//
// Trellis: state s = 4*r1 + 2*r2 + r3, r1 the newest register bit. With input bit u the
// register input is a = u ^ r2 ^ r3, the parity p = a ^ r1 ^ r3 and the next state
// 4*a + (s >> 1). States 2j and 2j+1 both lead to states j (a = 0) and j + 4 (a = 1), a
// radix-2 butterfly: the branches 2j -> j and 2j+1 -> j+4 carry u = j & 1, p = j >> 1
// ("type A"), the other two the complements ("type B").
//
// Widths (16-bit lanes, as the vectorised decoder uses them): a step's branch metric is
// u*Lu + p*Lp with Lu = systematic + a priori (|Lu| <= 128 + 1023) and Lp = parity
// (|Lp| <= 128), so the branch metrics of one step lie within a range |Lu| + |Lp| <= 1279
// wide. Every state reaches every other in three steps, so within one step the metrics of
// reachable states differ by at most three such ranges plus three log-MAP corrections:
// 3 * 1279 + 3 * 44 < 4000 (the correction is at most round(s * ln 2), 44 at the largest
// scale s = 64; 0 for max-log-MAP). Each step subtracts the metric of state 0 from all
// eight (normalisation), so alpha stays within -(kUnreachable + 4000) .. 4000 and beta, whose
// terminated end already reaches every state, within -4000 .. 4000; a state metric plus a
// branch metric stays within -13500..5300, and alpha + parity + beta within -16400..8200, a
// combination of two of them at most 44 above: every sum fits a 16-bit lane. The raw
// extrinsic value, a difference of two combinations, is formed in 32 bits (saturating 16-bit
// subtraction in the vectorised decoder) and saturated to 16.
#ifndef CORVANE_CONSTITUENTDECODER_H
#define CORVANE_CONSTITUENTDECODER_H

#include <cstdint>

namespace corvane {

using Metric = std::int16_t;

constexpr int kStates = 8;

// The metric given to states known not to be occupied (the trellis start and end). It is
// far below any reachable metric yet leaves room for the additions of a step.
constexpr int kUnreachable = 8192;

// The eight state metrics of one trellis step, one 128-bit vector.
struct alignas(16) StateMetrics {
  Metric m[kStates];
};

namespace detail {

inline Metric toMetric(int value) { return static_cast<Metric>(value); }

}  // namespace detail

// The radix-2 butterfly shared by both recursions: two metrics x0, x1 extended over the
// type A and type B branch metrics into the two metrics they reach.
template <class Policy>
inline void butterfly(const Policy& policy, int x0, int x1, int typeA, int typeB, int& out0,
                      int& out1) {
  out0 = policy.combine(x0 + typeA, x1 + typeB);
  out1 = policy.combine(x0 + typeB, x1 + typeA);
}

// Stores the eight metrics of a step relative to that of state 0.
inline void storeNormalised(int n0, int n1, int n2, int n3, int n4, int n5, int n6, int n7,
                            StateMetrics& out) {
  out.m[0] = 0;
  out.m[1] = detail::toMetric(n1 - n0);
  out.m[2] = detail::toMetric(n2 - n0);
  out.m[3] = detail::toMetric(n3 - n0);
  out.m[4] = detail::toMetric(n4 - n0);
  out.m[5] = detail::toMetric(n5 - n0);
  out.m[6] = detail::toMetric(n6 - n0);
  out.m[7] = detail::toMetric(n7 - n0);
}

// alpha_{k+1} from alpha_k and the step's Lu, Lp. Butterfly j reads states 2j, 2j+1 and
// writes j (type A from 2j) and j+4 (type A from 2j+1); the type A branch metric of
// butterfly 0..3 is 0, Lu, Lp, Lu+Lp and type B the complement.
template <class Policy>
inline void forwardStep(const Policy& policy, const StateMetrics& alpha, StateMetrics& next, int lu,
                        int lp) {
  const int both = lu + lp;
  const Metric* a = alpha.m;
  int n0, n1, n2, n3, n4, n5, n6, n7;
  butterfly(policy, a[0], a[1], 0, both, n0, n4);
  butterfly(policy, a[2], a[3], lu, lp, n1, n5);
  butterfly(policy, a[4], a[5], lp, lu, n2, n6);
  butterfly(policy, a[6], a[7], both, 0, n3, n7);
  storeNormalised(n0, n1, n2, n3, n4, n5, n6, n7, next);
}

// beta_k from beta_{k+1} and the step's Lu, Lp: state 2j leaves on type A to j and type B
// to j+4, state 2j+1 the other way round.
template <class Policy>
inline void backwardStep(const Policy& policy, const StateMetrics& beta, StateMetrics& previous,
                         int lu, int lp) {
  const int both = lu + lp;
  const Metric* b = beta.m;
  int p0, p1, p2, p3, p4, p5, p6, p7;
  butterfly(policy, b[0], b[4], 0, both, p0, p1);
  butterfly(policy, b[1], b[5], lu, lp, p2, p3);
  butterfly(policy, b[2], b[6], lp, lu, p4, p5);
  butterfly(policy, b[3], b[7], both, 0, p6, p7);
  storeNormalised(p0, p1, p2, p3, p4, p5, p6, p7, previous);
}

// Combines four values pairwise in a fixed order, so that max* rounds the same way in every
// build (and as a vector reduction would).
template <class Policy>
inline int combine4(const Policy& policy, int v0, int v1, int v2, int v3) {
  return policy.combine(policy.combine(v0, v1), policy.combine(v2, v3));
}

// The raw extrinsic value of step k: the combined metric of the branches with u = 1 less
// that of the branches with u = 0, each branch counting alpha_k + p*Lp + beta_{k+1} (Lu is
// common to all branches of one u and cancels). The 16 branches fall into four groups of
// equal (u, p); Lp is added once per group with p = 1 (max*(x+c, y+c) = max*(x, y) + c).
// Saturated to 16 bits.
template <class Policy>
inline Metric extrinsicStep(const Policy& policy, const StateMetrics& alpha,
                            const StateMetrics& beta, int lp) {
  const int a0 = alpha.m[0], a1 = alpha.m[1], a2 = alpha.m[2], a3 = alpha.m[3];
  const int a4 = alpha.m[4], a5 = alpha.m[5], a6 = alpha.m[6], a7 = alpha.m[7];
  const int b0 = beta.m[0], b1 = beta.m[1], b2 = beta.m[2], b3 = beta.m[3];
  const int b4 = beta.m[4], b5 = beta.m[5], b6 = beta.m[6], b7 = beta.m[7];
  const int oneParity0 = combine4(policy, a2 + b1, a3 + b5, a4 + b6, a5 + b2);
  const int oneParity1 = combine4(policy, a0 + b4, a1 + b0, a6 + b3, a7 + b7);
  const int zeroParity0 = combine4(policy, a0 + b0, a1 + b4, a6 + b7, a7 + b3);
  const int zeroParity1 = combine4(policy, a2 + b5, a3 + b1, a4 + b2, a5 + b6);
  int e =
      policy.combine(oneParity0, oneParity1 + lp) - policy.combine(zeroParity0, zeroParity1 + lp);
  e = e > 32767 ? 32767 : e;
  e = e < -32767 ? -32767 : e;
  return detail::toMetric(e);
}

// One window of steps [0, length): the forward recursion from alphaStart stores alpha_k in
// alphaStore[0..length] (alphaStore[length] is the metric the window reaches at its end);
// the backward recursion from betaEnd writes the raw extrinsic value of every step and
// leaves beta_0 in betaStart. lu and lp hold the window's Lu and Lp per step.
template <class Policy>
void decodeWindow(const Policy& policy, const Metric* lu, const Metric* lp, int length,
                  const StateMetrics& alphaStart, const StateMetrics& betaEnd,
                  StateMetrics* alphaStore, StateMetrics& betaStart, Metric* extrinsic) {
  alphaStore[0] = alphaStart;
  for (int k = 0; k < length; ++k) {
    forwardStep(policy, alphaStore[k], alphaStore[k + 1], lu[k], lp[k]);
  }
  // Two beta registers in turn, two steps per pass, so no metrics are copied.
  StateMetrics beta = betaEnd;
  StateMetrics previous;
  int k = length - 1;
  for (; k >= 1; k -= 2) {
    extrinsic[k] = extrinsicStep(policy, alphaStore[k], beta, lp[k]);
    backwardStep(policy, beta, previous, lu[k], lp[k]);
    extrinsic[k - 1] = extrinsicStep(policy, alphaStore[k - 1], previous, lp[k - 1]);
    backwardStep(policy, previous, beta, lu[k - 1], lp[k - 1]);
  }
  if (k == 0) {
    extrinsic[0] = extrinsicStep(policy, alphaStore[0], beta, lp[0]);
    backwardStep(policy, beta, previous, lu[0], lp[0]);
    beta = previous;
  }
  betaStart = beta;
}

// The state metrics a trellis start in state 0 implies.
inline StateMetrics knownStateZero() {
  StateMetrics metrics;
  for (int s = 0; s < kStates; ++s) {
    metrics.m[s] = detail::toMetric(s == 0 ? 0 : -kUnreachable);
  }
  return metrics;
}

// beta_K of a terminated constituent code (TS 36.212 clause 5.1.3.2.2): three tail steps
// whose register input a is 0, so u = r2 ^ r3 and p = r1 ^ r3, ending in state 0.
// tailSystematic and tailParity are the soft values x_K..x_K+2 and z_K..z_K+2.
inline StateMetrics terminatedBeta(const int (&tailSystematic)[3], const int (&tailParity)[3]) {
  StateMetrics beta = knownStateZero();
  for (int k = 2; k >= 0; --k) {
    StateMetrics previous;
    int out[kStates];
    for (int s = 0; s < kStates; ++s) {
      const int r1 = (s >> 2) & 1;
      const int r2 = (s >> 1) & 1;
      const int r3 = s & 1;
      out[s] =
          beta.m[s >> 1] + ((r2 ^ r3) ? tailSystematic[k] : 0) + ((r1 ^ r3) ? tailParity[k] : 0);
    }
    for (int s = 0; s < kStates; ++s) {
      previous.m[s] = detail::toMetric(out[s] - out[0]);
    }
    beta = previous;
  }
  return beta;
}

}  // namespace corvane

#endif  // CORVANE_CONSTITUENTDECODER_H
