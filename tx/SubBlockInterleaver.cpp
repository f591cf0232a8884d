// Sub-block interleaving of TS 36.212 5.1.4.1.1 and 5.1.4.2.1.
#include "tx/SubBlockInterleaver.h"

namespace brannoc::tx {

namespace {

// Table 5.1.4-1 is the 5-bit bit reversal of the column number, and Table 5.1.4-2 is the
// same with the lowest bit inverted (it starts 1, 17, 9, 25 where the turbo table starts
// 0, 16, 8, 24), so both are generated rather than listed.
constexpr std::array<std::uint8_t, kSubBlockColumns> makePattern(std::uint8_t flip) {
  std::array<std::uint8_t, kSubBlockColumns> pattern{};
  for (std::uint32_t j = 0; j < kSubBlockColumns; ++j) {
    std::uint32_t reversed = 0;
    for (std::uint32_t b = 0; b < 5; ++b) reversed |= ((j >> b) & 1u) << (4 - b);
    pattern[j] = static_cast<std::uint8_t>(reversed ^ flip);
  }
  return pattern;
}

constexpr std::array<std::uint8_t, kSubBlockColumns> kTurboPattern = makePattern(0);
constexpr std::array<std::uint8_t, kSubBlockColumns> kConvolutionalPattern = makePattern(1);

}  // namespace

const std::array<std::uint8_t, kSubBlockColumns>& subBlockColumnPattern(SubBlockPattern pattern) {
  return pattern == SubBlockPattern::Turbo ? kTurboPattern : kConvolutionalPattern;
}

std::uint32_t subBlockReadIndex(std::uint32_t k, std::uint32_t R, SubBlockPattern pattern,
                                bool thirdTurboStream) {
  const std::uint32_t index =
      subBlockColumnPattern(pattern)[k / R] + kSubBlockColumns * (k % R);
  if (!thirdTurboStream) return index;
  return (index + 1) % (kSubBlockColumns * R);
}

Bits subBlockInterleave(std::span<const std::uint8_t> d, SubBlockPattern pattern,
                        bool thirdTurboStream) {
  const auto D = static_cast<std::uint32_t>(d.size());
  const std::uint32_t R = subBlockRows(D);
  const std::uint32_t Kpi = kSubBlockColumns * R;
  const std::uint32_t ND = Kpi - D;
  Bits v(Kpi);
  for (std::uint32_t k = 0; k < Kpi; ++k) {
    const std::uint32_t y = subBlockReadIndex(k, R, pattern, thirdTurboStream);
    v[k] = y < ND ? kNullBit : d[y - ND];
  }
  return v;
}

}  // namespace brannoc::tx
