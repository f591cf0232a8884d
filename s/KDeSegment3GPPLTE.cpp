// Code-block segmentation (TS 36.212 clause 5.1.2) and desegmentation.
#include "KDeSegment3GPPLTE.h"

#include "errorLine.h"

namespace brannoc {

namespace {

constexpr std::uint32_t kMaxCodeBlock = 6144;  // Z of TS 36.212 5.1.2
constexpr std::uint32_t kCodeBlockCrc = 24;

// Smallest interleaver size of Table 5.1.3-3 not below kPrime: the table steps by 8 up to
// 512, by 16 up to 1024, by 32 up to 2048 and by 64 up to 6144.
std::uint32_t roundUpToInterleaverSize(std::uint32_t kPrime) {
  auto roundUp = [](std::uint32_t value, std::uint32_t step) {
    return (value + step - 1) / step * step;
  };
  if (kPrime < 40) return 40;
  if (kPrime < 512) return roundUp(kPrime, 8);
  if (kPrime < 1024) return roundUp(kPrime, 16);
  if (kPrime < 2048) return roundUp(kPrime, 32);
  return roundUp(kPrime, 64);
}

// The interleaver size just below kPlus (0 below the smallest size).
std::uint32_t nextSmallerInterleaverSize(std::uint32_t kPlus) {
  if (kPlus <= 40) return 0;
  if (kPlus <= 512) return kPlus - 8;
  if (kPlus <= 1024) return kPlus - 16;
  if (kPlus <= 2048) return kPlus - 32;
  return kPlus - 64;
}

}  // namespace

bool segmentationParams::compute() {
  // Unsigned arithmetic throughout: on a new record B is 0 and TBsize wraps to 2^32 - 24,
  // which lets a following setTBSize(0) compute the record of an empty transport block.
  TBsize = B - 24;
  L = B > kMaxCodeBlock ? kCodeBlockCrc : 0;
  C = (B - L + kMaxCodeBlock - 1) / (kMaxCodeBlock - L);
  if (C == 0) {
    C = 1;
  }
  Bprime = B + C * L;
  const std::uint32_t kPrime = (Bprime + C - 1) / C;
  Kplus = roundUpToInterleaverSize(kPrime);
  Kminus = nextSmallerInterleaverSize(Kplus);
  Cminus = (C * Kplus - Bprime) / (Kplus - Kminus);
  Cplus = C - Cminus;
  F = Cminus * Kminus + Cplus * Kplus - Bprime;
  return true;
}

bool segmentationParams::setTBSize(std::uint32_t tbSize) {
  if (tbSize == TBsize) {
    return true;
  }
  B = tbSize + 24;
  return compute();
}

std::unique_ptr<KDeSegment3GPPLTE> KDeSegment3GPPLTE::create(const std::string& properties) {
  if (!properties.empty()) {
    brannoc::errorLineBare("ERROR:KDeSegment3GPPLTE:Unexpected properties:", properties);
    return nullptr;
  }
  return std::make_unique<KDeSegment3GPPLTE>();
}

bool KDeSegment3GPPLTE::setTBSize(std::uint32_t tbSize) {
  itsParams.compute();
  return itsParams.setTBSize(tbSize);
}

bool KDeSegment3GPPLTE::desegment(const std::vector<std::vector<std::uint8_t>>& codeBlocks,
                                  std::vector<std::uint8_t>& out) const {
  const segmentationParams& p = itsParams;
  if (codeBlocks.size() != p.C) {
    return false;
  }
  for (std::uint32_t r = 0; r < p.C; ++r) {
    const std::uint32_t first = r == 0 ? p.F : 0;
    if (codeBlocks[r].size() != p.blockSize(r) || p.blockSize(r) < first + p.L) {
      return false;
    }
  }
  out.clear();
  out.reserve(static_cast<std::size_t>(p.TBsize) + 24);
  for (std::uint32_t r = 0; r < p.C; ++r) {
    const std::vector<std::uint8_t>& block = codeBlocks[r];
    const std::uint32_t first = r == 0 ? p.F : 0;
    out.insert(out.end(), block.begin() + first, block.end() - p.L);
  }
  return true;
}

}  // namespace brannoc
