// The (32, O) and (20, A) block codes of TS 36.212 5.2.2.6.4 and 5.2.3.3.
#include "tx/ReedMullerCode.h"

#include <array>
#include <cstddef>

namespace brannoc::tx {

namespace {

struct Rm32Row {
  std::uint8_t i;
  std::array<std::uint8_t, kRm32MaxBits> M;
};
constexpr Rm32Row kRm32Basis[] = {
#include "tables/rm_32_o_basis.inc"
};
static_assert(std::size(kRm32Basis) == kRm32Length);

struct Rm20Row {
  std::uint8_t i;
  std::array<std::uint8_t, kRm20MaxBits> M;
};
constexpr Rm20Row kRm20Basis[] = {
#include "tables/rm_20_a_basis.inc"
};
static_assert(std::size(kRm20Basis) == kRm20Length);

template <typename Row, std::size_t N>
Bits encodeWithBasis(const Row (&basis)[N], std::span<const std::uint8_t> message) {
  if (message.size() > std::size(basis[0].M)) {
    return {};
  }
  Bits b(N, 0);
  for (std::size_t i = 0; i < N; ++i) {
    unsigned sum = 0;
    for (std::size_t n = 0; n < message.size(); ++n) {
      sum += (message[n] != 0 ? 1u : 0u) * basis[i].M[n];
    }
    b[i] = static_cast<std::uint8_t>(sum & 1u);
  }
  return b;
}

}  // namespace

Bits encodeRm32(std::span<const std::uint8_t> o) { return encodeWithBasis(kRm32Basis, o); }

Bits encodeRm20(std::span<const std::uint8_t> a) { return encodeWithBasis(kRm20Basis, a); }

}  // namespace brannoc::tx
