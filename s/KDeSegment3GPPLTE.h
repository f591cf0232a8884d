// Code-block segmentation of a transport block (TS 36.212 clause 5.1.2) and the joining
// of decoded code blocks back into the transport block with its CRC.
//
// segmentationParams derives C, K+, K-, C+, C- and F from B = TBsize + 24 by rounding to
// the turbo interleaver sizes of TS 36.212 Table 5.1.3-3. With a single code block K- is
// the next smaller interleaver size (C- = 0), not 0: the rate-matching parameters derive
// their K- quantities from it.
#ifndef BRANNOC_KDESEGMENT3GPPLTE_H
#define BRANNOC_KDESEGMENT3GPPLTE_H

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace brannoc {

struct segmentationParams {
  std::uint32_t TBsize = 0;  // transport-block size in bits, without CRC
  std::uint32_t B = 0;       // TBsize + 24
  std::uint32_t L = 0;       // code-block CRC length: 24 when C > 1, else 0
  std::uint32_t C = 0;       // number of code blocks
  std::uint32_t Bprime = 0;  // B + C * L
  std::uint32_t Kminus = 0;  // K-, the smaller code-block size
  std::uint32_t Cminus = 0;  // C-, code blocks of size K- (blocks 0 .. C- - 1)
  std::uint32_t Kplus = 0;   // K+, the larger code-block size
  std::uint32_t Cplus = 0;   // C+, code blocks of size K+
  std::uint32_t F = 0;       // filler bits at the start of code block 0

  // Derives every field but B from B. Always true.
  bool compute();
  // Recomputes for a transport block of tbSize bits unless that size is already held.
  bool setTBSize(std::uint32_t tbSize);

  // K_r of code block r: K- for r < C-, else K+.
  std::uint32_t blockSize(std::uint32_t r) const { return r < Cminus ? Kminus : Kplus; }
};

class KDeSegment3GPPLTE {
 public:
  // Factory: only the empty properties text is accepted.
  static std::unique_ptr<KDeSegment3GPPLTE> create(const std::string& properties);

  KDeSegment3GPPLTE() = default;

  // Segmentation of a transport block of tbSize bits (computed afresh, then set).
  bool setTBSize(std::uint32_t tbSize);
  segmentationParams getSegmentationParams() const { return itsParams; }

  // Joins the C decoded code blocks (K_r bits each, code-block CRC included) into the
  // transport block with its CRC (TBsize + 24 bits): drops the F filler bits of block 0 and
  // the L CRC bits at the end of every block. False when the blocks do not have the sizes
  // of the segmentation.
  bool desegment(const std::vector<std::vector<std::uint8_t>>& codeBlocks,
                 std::vector<std::uint8_t>& out) const;

 private:
  segmentationParams itsParams;
};

}  // namespace brannoc

#endif  // BRANNOC_KDESEGMENT3GPPLTE_H
