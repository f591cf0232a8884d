// Turbo code internal interleaver of TS 36.212 5.1.3.2.3: the code block sizes K and QPP
// coefficients f1, f2 of Table 5.1.3-3 (from the project's table data), and the quadratic
// permutation Pi(i) = (f1·i + f2·i²) mod K.
#ifndef BRANNOC_TX_QPPINTERLEAVER_H
#define BRANNOC_TX_QPPINTERLEAVER_H

#include <cstdint>
#include <span>
#include <vector>

namespace brannoc::tx {

struct QppParameters {
  std::uint32_t i, K, f1, f2;  // table index (1..188), block size, coefficients
};

// The 188 rows of Table 5.1.3-3, in increasing K.
std::span<const QppParameters> qppTable();

// The row of block size K, or nullptr when K is not a turbo code block size.
const QppParameters* findQpp(std::uint32_t K);

// Pi(i) for the row's coefficients, 0 <= i < K (computed so that it fits in 32 bits).
std::uint32_t qppIndex(const QppParameters& row, std::uint32_t i);

// The whole permutation Pi(0..K-1); false (and pi empty) when K is not a table size.
bool qppPermutation(std::uint32_t K, std::vector<std::uint32_t>& pi);

}  // namespace brannoc::tx

#endif
