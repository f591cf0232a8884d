// Code block segmentation and code block CRC attachment of TS 36.212 5.1.2 for a transport
// block of tbSize bits followed by its 24-bit CRC (B = tbSize + 24 bits b_0..b_(B-1)).
#ifndef BRANNOC_TX_SEGMENTATION_H
#define BRANNOC_TX_SEGMENTATION_H

#include <cstdint>
#include <span>
#include <vector>

#include "tx/Bits.h"

namespace brannoc::tx {

// Largest code block size Z of Table 5.1.3-3.
constexpr std::uint32_t kMaxCodeBlockSize = 6144;

struct CodeBlockSegmentation {
  std::uint32_t B;       // input bits, transport block CRC included
  std::uint32_t L;       // code block CRC length: 0 for one block, 24 otherwise
  std::uint32_t C;       // number of code blocks
  std::uint32_t Bprime;  // B + C·L
  std::uint32_t Kplus;   // smallest table size K with C·K >= B'
  std::uint32_t Kminus;  // largest table size below K+ (0 for one block)
  std::uint32_t Cplus;   // blocks of size K+
  std::uint32_t Cminus;  // blocks of size K- (the first Cminus blocks)
  std::uint32_t F;       // <NULL> filler bits at the start of block 0
};

// Segmentation figures of a transport block of tbSize bits (0 <= tbSize < 2^31).
CodeBlockSegmentation segmentTransportBlock(std::uint32_t tbSize);

// K_r: K- for r < C-, else K+.
std::uint32_t codeBlockSize(const CodeBlockSegmentation& seg, std::uint32_t r);

// The C code blocks c_r (K_r bits each) of the B bits b: F filler bits (kNullBit) at the
// start of block 0, the input bits in order, and a CRC24B on each block when C > 1 (the
// filler bits counted as 0). False, with no blocks, when b does not hold seg.B bits.
bool segmentCodeBlocks(std::span<const std::uint8_t> b, const CodeBlockSegmentation& seg,
                       std::vector<Bits>& blocks);

}  // namespace brannoc::tx

#endif
