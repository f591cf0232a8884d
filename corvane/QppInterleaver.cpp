// The turbo code internal interleaver of TS 36.212 clause 5.1.3.2.3 and the block sizes of
// Table 5.1.3-3, taken from the project's copy of the table.
#include "QppInterleaver.h"

#include <algorithm>
#include <iterator>

namespace corvane {

namespace {

constexpr QppRow kQppTable[] = {
#include "tables/qpp_interleaver.inc"
};

static_assert(std::size(kQppTable) == 188, "TS 36.212 Table 5.1.3-3 has 188 block sizes");
static_assert(kQppTable[std::size(kQppTable) - 1].K == kMaxBlockSize);

}  // namespace

const QppRow* findQppRow(std::uint32_t K) {
  const QppRow* row = std::lower_bound(std::begin(kQppTable), std::end(kQppTable), K,
                                       [](const QppRow& r, std::uint32_t k) { return r.K < k; });
  return (row != std::end(kQppTable) && row->K == K) ? row : nullptr;
}

void buildQppPermutation(const QppRow& row, std::uint16_t* pi) {
  // Pi(i+1) = Pi(i) + f1 + f2*(2i + 1), kept modulo K by two running residues:
  // step(i) = (f1 + f2 + 2*f2*i) mod K grows by 2*f2 mod K each time.
  const std::uint32_t K = row.K;
  const std::uint32_t stepIncrement = (2 * row.f2) % K;
  std::uint32_t value = 0;
  std::uint32_t step = (row.f1 + row.f2) % K;
  for (std::uint32_t i = 0; i < K; ++i) {
    pi[i] = static_cast<std::uint16_t>(value);
    value += step;
    value -= (value >= K) ? K : 0;
    step += stepIncrement;
    step -= (step >= K) ? K : 0;
  }
}

}  // namespace corvane
