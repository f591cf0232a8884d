// Code block segmentation of TS 36.212 5.1.2, with the block sizes of Table 5.1.3-3.
#include "tx/Segmentation.h"

#include "tx/Crc.h"
#include "tx/QppInterleaver.h"

#include <utility>

namespace brannoc::tx {

namespace {

constexpr std::uint32_t kCodeBlockCrcLength = 24;

}  // namespace

CodeBlockSegmentation segmentTransportBlock(std::uint32_t tbSize) {
  CodeBlockSegmentation seg{};
  seg.B = tbSize + 24;
  if (seg.B <= kMaxCodeBlockSize) {
    seg.L = 0;
    seg.C = 1;
    seg.Bprime = seg.B;
  } else {
    seg.L = kCodeBlockCrcLength;
    seg.C = (seg.B + (kMaxCodeBlockSize - seg.L) - 1) / (kMaxCodeBlockSize - seg.L);
    seg.Bprime = seg.B + seg.C * seg.L;
  }
  // K+: the smallest table size with C·K >= B'; K-: the table size just below it.
  const auto table = qppTable();
  std::size_t plus = 0;
  while (plus + 1 < table.size() &&
         static_cast<std::uint64_t>(seg.C) * table[plus].K < seg.Bprime) {
    ++plus;
  }
  seg.Kplus = table[plus].K;
  if (seg.C == 1) {
    seg.Cplus = 1;
    seg.Kminus = 0;
    seg.Cminus = 0;
  } else {
    seg.Kminus = plus > 0 ? table[plus - 1].K : 0;
    const std::uint32_t deltaK = seg.Kplus - seg.Kminus;
    seg.Cminus = (seg.C * seg.Kplus - seg.Bprime) / deltaK;
    seg.Cplus = seg.C - seg.Cminus;
  }
  seg.F = seg.Cplus * seg.Kplus + seg.Cminus * seg.Kminus - seg.Bprime;
  return seg;
}

std::uint32_t codeBlockSize(const CodeBlockSegmentation& seg, std::uint32_t r) {
  return r < seg.Cminus ? seg.Kminus : seg.Kplus;
}

bool segmentCodeBlocks(std::span<const std::uint8_t> b, const CodeBlockSegmentation& seg,
                       std::vector<Bits>& blocks) {
  blocks.clear();
  if (b.size() != seg.B) return false;
  blocks.reserve(seg.C);
  std::size_t s = 0;
  for (std::uint32_t r = 0; r < seg.C; ++r) {
    const std::uint32_t Kr = codeBlockSize(seg, r);
    Bits block;
    block.reserve(Kr);
    if (r == 0) block.assign(seg.F, kNullBit);
    while (block.size() < Kr - seg.L) block.push_back(b[s++]);
    if (seg.C > 1) {
      const Bits parity = crcParity(block, CrcType::Crc24B);
      block.insert(block.end(), parity.begin(), parity.end());
    }
    blocks.push_back(std::move(block));
  }
  return true;
}

}  // namespace brannoc::tx
