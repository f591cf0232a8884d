// QPP interleaver parameters and permutation of TS 36.212 5.1.3.2.3 (Table 5.1.3-3).
#include "tx/QppInterleaver.h"

#include <algorithm>
#include <iterator>

namespace brannoc::tx {

namespace {

constexpr QppParameters kQppTable[] = {
#include "tables/qpp_interleaver.inc"
};

}  // namespace

std::span<const QppParameters> qppTable() { return kQppTable; }

const QppParameters* findQpp(std::uint32_t K) {
  const auto* end = std::end(kQppTable);
  const auto* row = std::lower_bound(
      std::begin(kQppTable), end, K,
      [](const QppParameters& r, std::uint32_t k) { return r.K < k; });
  return (row != end && row->K == K) ? row : nullptr;
}

std::uint32_t qppIndex(const QppParameters& row, std::uint32_t i) {
  // (f1 + f2·i) mod K, then times i mod K: each product stays below 2^32 for K <= 6144.
  const std::uint32_t slope = (row.f1 + (row.f2 * i) % row.K) % row.K;
  return static_cast<std::uint32_t>((static_cast<std::uint64_t>(slope) * i) % row.K);
}

bool qppPermutation(std::uint32_t K, std::vector<std::uint32_t>& pi) {
  pi.clear();
  const QppParameters* row = findQpp(K);
  if (row == nullptr) return false;
  pi.resize(K);
  for (std::uint32_t i = 0; i < K; ++i) pi[i] = qppIndex(*row, i);
  return true;
}

}  // namespace brannoc::tx
