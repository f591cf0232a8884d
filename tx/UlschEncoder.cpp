// UL-SCH data encoding chain, TS 36.212 5.2.2.1 to 5.2.2.5.
#include "tx/UlschEncoder.h"

#include <algorithm>

#include "tx/Crc.h"
#include "tx/TurboRateMatcher.h"

namespace brannoc::tx {

std::vector<std::uint32_t> rateMatchedLengths(std::uint32_t G, std::uint32_t Qm, std::uint32_t C,
                                              std::uint32_t NL) {
  const std::uint64_t symbolBits = static_cast<std::uint64_t>(NL) * Qm;
  if (C == 0 || symbolBits == 0 || G % symbolBits != 0) return {};
  const auto Gprime = static_cast<std::uint32_t>(G / symbolBits);
  const std::uint32_t gamma = Gprime % C;
  const auto small = static_cast<std::uint32_t>(symbolBits * (Gprime / C));
  const auto large = static_cast<std::uint32_t>(symbolBits * ((Gprime + C - 1) / C));
  std::vector<std::uint32_t> E(C);
  for (std::uint32_t r = 0; r < C; ++r) E[r] = r + gamma <= C - 1 ? small : large;
  return E;
}

bool encodeUlsch(std::span<const std::uint8_t> transportBlock, std::uint32_t G,
                 std::uint32_t Qm, std::uint32_t rv, UlschEncoding& out) {
  out = UlschEncoding{};
  if (transportBlock.size() >= (std::size_t{1} << 31) || rv > 3) return false;
  if (std::any_of(transportBlock.begin(), transportBlock.end(), [](auto bit) { return bit > 1; })) {
    return false;
  }
  const auto tbSize = static_cast<std::uint32_t>(transportBlock.size());
  out.segmentation = segmentTransportBlock(tbSize);
  out.E = rateMatchedLengths(G, Qm, out.segmentation.C);
  if (out.E.empty()) {
    out = UlschEncoding{};
    return false;
  }
  out.b = attachCrc(transportBlock, CrcType::Crc24A);
  bool ok = segmentCodeBlocks(out.b, out.segmentation, out.c);
  out.d.resize(out.segmentation.C);
  out.e.resize(out.segmentation.C);
  out.f.reserve(G);
  for (std::uint32_t r = 0; ok && r < out.segmentation.C; ++r) {
    ok = turboEncode(out.c[r], out.d[r]) && rateMatchTurbo(out.d[r], out.E[r], rv, out.e[r]);
    out.f.insert(out.f.end(), out.e[r].begin(), out.e[r].end());
  }
  if (!ok) out = UlschEncoding{};
  return ok;
}

}  // namespace brannoc::tx
