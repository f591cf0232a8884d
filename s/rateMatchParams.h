// rateMatchParams: the rate-matching parameters of one PUSCH transmission (TS 36.212
// clause 5.1.4.1): the configured totals, modulation and UCI sizes, and what the rate
// dematcher derives from them per code-block size: sub-block interleaver rows, the
// circular-buffer length Ncb, the redundancy version's start k0 and the rate-matched
// lengths E with the index at which E changes. It embeds the transport block's
// segmentation, from which it takes C, K+ and K-.
#ifndef BRANNOC_RATEMATCHPARAMS_H
#define BRANNOC_RATEMATCHPARAMS_H

#include <cstdint>

#include "KDeSegment3GPPLTE.h"

namespace brannoc {

struct rateMatchParams {
  bool complete = false;   // the derived fields have been computed at least once
  std::uint32_t G = 0;     // rate-matched data bits (LLRs) of the transport block
  std::uint32_t k0_0 = 0;  // k0 of K- code blocks
  std::uint32_t k0_1 = 0;  // k0 of K+ code blocks
  std::uint32_t NcbMinus = 0;
  std::uint32_t NcbPlus = 0;
  std::uint32_t rowMinus = 0;   // sub-block interleaver rows of K- code blocks
  std::uint32_t rowPlus = 0;    // rows of K+ code blocks
  std::uint32_t E0 = 0;         // E of code blocks 0 .. Eidx
  std::uint32_t E1 = 0;         // E of the code blocks after Eidx
  std::uint32_t Eidx = 0;       // last code block of length E0
  std::uint32_t riSize = 0;     // RI bits, 0..2
  std::uint32_t ackSize = 0;    // ACK bits, 0..2
  std::uint32_t cqiSize = 0;    // CQI bits, 0..127
  std::uint32_t cqiQ = 0;       // coded CQI bits (LLRs)
  std::uint32_t riQ = 0;        // coded RI bits
  std::uint32_t ackQ = 0;       // coded ACK bits
  std::uint32_t Qm = 0;         // modulation order: 2, 4 or 6
  std::uint32_t Nlayers = 0;    // layers (1 on this core)
  std::uint32_t NIR = 0;        // soft-buffer limit, 0 for none (the uplink has none)
  std::uint32_t rvidx = 0;      // redundancy version, 0..3
  std::uint32_t totalBits = 0;  // coded bits (LLRs) of the whole transmission
  std::uint32_t cpType = 0;     // cyclic prefix: 0 normal, 1 extended
  segmentationParams seg;

  // Stores the transmission's totals (recomputing the segmentation from its current B);
  // recomputes the derived fields if they have been computed before. Always true.
  bool setTransmission(std::uint32_t totalBits, std::uint32_t Qm, std::uint32_t Nlayers,
                       std::uint32_t cpType);
  // Stores the data parameters, sets the segmentation's transport-block size and computes
  // the derived fields. Always true.
  bool setDataParams(std::uint32_t tbSize, std::uint32_t G, std::uint32_t NIR, std::uint32_t Qm,
                     std::uint32_t rvidx, std::uint32_t Nlayers);
  bool setCQISize(std::uint32_t n);  // n < 128
  bool setRISize(std::uint32_t n);   // n < 3
  bool setACKSize(std::uint32_t n);  // n < 3
  bool setCQIQ(std::uint32_t n);
  bool setRIQ(std::uint32_t n);
  bool setACKQ(std::uint32_t n);
  // Derives Eidx, E0, E1, the interleaver rows, Ncb and k0 for both code-block sizes.
  bool compute();
};

}  // namespace brannoc

#endif  // BRANNOC_RATEMATCHPARAMS_H
