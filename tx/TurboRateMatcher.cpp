// Turbo rate matching, TS 36.212 5.1.4.1.
#include "tx/TurboRateMatcher.h"

#include "tx/SubBlockInterleaver.h"

namespace brannoc::tx {

TurboBufferLayout turboBufferLayout(std::uint32_t D) {
  TurboBufferLayout layout{};
  layout.D = D;
  layout.R = subBlockRows(D);
  layout.Kpi = kSubBlockColumns * layout.R;
  layout.ND = layout.Kpi - D;
  layout.Kw = 3 * layout.Kpi;
  layout.Ncb = layout.Kw;
  return layout;
}

std::uint32_t turboK0(std::uint32_t R, std::uint32_t Ncb, std::uint32_t rv) {
  const std::uint32_t columnsPerRv = (Ncb + 8 * R - 1) / (8 * R);
  return R * (2 * columnsPerRv * rv + 2);
}

Bits turboCircularBuffer(const TurboCodeword& d) {
  if (d.d1.size() != d.d0.size() || d.d2.size() != d.d0.size()) return {};
  const Bits v0 = subBlockInterleave(d.d0, SubBlockPattern::Turbo);
  const Bits v1 = subBlockInterleave(d.d1, SubBlockPattern::Turbo);
  const Bits v2 = subBlockInterleave(d.d2, SubBlockPattern::Turbo, true);
  const auto Kpi = static_cast<std::uint32_t>(v0.size());
  Bits w(3 * Kpi);
  for (std::uint32_t k = 0; k < Kpi; ++k) {
    w[k] = v0[k];
    w[Kpi + 2 * k] = v1[k];
    w[Kpi + 2 * k + 1] = v2[k];
  }
  return w;
}

bool rateMatchTurbo(const TurboCodeword& d, std::uint32_t E, std::uint32_t rv, Bits& e) {
  e.clear();
  if (rv > 3) return false;
  const Bits w = turboCircularBuffer(d);
  const TurboBufferLayout layout = turboBufferLayout(static_cast<std::uint32_t>(d.d0.size()));
  if (w.size() != layout.Kw || layout.Ncb == 0) return false;
  bool anyReal = false;
  for (std::uint8_t bit : w) anyReal = anyReal || bit != kNullBit;
  if (!anyReal) return false;

  e.reserve(E);
  std::uint32_t position = turboK0(layout.R, layout.Ncb, rv) % layout.Ncb;
  while (e.size() < E) {
    if (w[position] != kNullBit) e.push_back(w[position]);
    if (++position == layout.Ncb) position = 0;
  }
  return true;
}

}  // namespace brannoc::tx
