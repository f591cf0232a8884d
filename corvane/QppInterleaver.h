// The turbo code internal interleaver of TS 36.212 clause 5.1.3.2.3: the quadratic
// permutation polynomial Pi(i) = (f1*i + f2*i^2) mod K, with f1 and f2 of Table 5.1.3-3.
#ifndef CORVANE_QPPINTERLEAVER_H
#define CORVANE_QPPINTERLEAVER_H

#include <cstdint>

namespace corvane {

// One row of TS 36.212 Table 5.1.3-3: table index i, block size K and the coefficients.
struct QppRow {
  std::uint32_t i, K, f1, f2;
};

// The largest block size of the table.
constexpr std::uint32_t kMaxBlockSize = 6144;

// The table row of block size K, or null when K is not a block size of the table.
const QppRow* findQppRow(std::uint32_t K);

// Writes Pi(0..K-1) of the row into pi (K entries), by running differences that stay
// below 2K, so no product of the polynomial is ever formed.
void buildQppPermutation(const QppRow& row, std::uint16_t* pi);

}  // namespace corvane

#endif  // CORVANE_QPPINTERLEAVER_H
