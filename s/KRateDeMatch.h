// KRateDeMatch: the receive side of the uplink rate matching of TS 36.212.
//
// Turbo-coded code blocks (clause 5.1.4.1): the E soft values of code block r are written
// back into the circular buffer from k0 on, soft values that the transmitter repeated being
// added, and the three sub-block interleavers are undone, giving the systematic, first-parity
// and second-parity streams d0, d1, d2 (D_r = K_r + 4 soft values each, tail included).
// Filler bits come out as the strongest "0" (-128); dummy positions are dropped; buffer
// positions the transmission never reached stay 0 (an erasure). The streams can then be
// chase-combined with the HARQ soft buffer kept from earlier transmissions.
//
// Convolutionally coded CQI (clause 5.1.4.2, with its 8-bit CRC, clause 5.2.2.6.4), and the
// short control fields (HARQ-ACK and RI, clause 5.2.2.6; CQI of up to 11 bits with the (32,O)
// code): every repetition of a coded bit is summed onto one accumulator.
//
// Soft values are signed 32-bit raw 8:5 values (-128..127, >= 0 favours bit 1). Every sum
// goes through a KQuantized in the core's 8:5 register format, so it saturates exactly where
// the hardware's buffers do.
#ifndef BRANNOC_KRATEDEMATCH_H
#define BRANNOC_KRATEDEMATCH_H

#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "KQuantized.h"
#include "rateMatchParams.h"

namespace brannoc {

class KRateDeMatch {
 public:
  using SoftValues = std::vector<std::int32_t>;
  // d0, d1, d2 of one code block (or of a HARQ buffer slice), in that order.
  using Streams = std::vector<SoftValues>;

  // Factory: only the empty properties text is accepted.
  static std::unique_ptr<KRateDeMatch> create(const std::string& properties);

  KRateDeMatch();
  virtual ~KRateDeMatch();

  // Transmission parameters (total coded bits, modulation order, layers, cyclic prefix).
  bool setModulationParams(std::uint32_t totalBits, std::uint32_t Qm, std::uint32_t numLayers,
                           std::uint32_t cpType);
  // Data parameters of the transport block; the soft-buffer limit is always none (Ncb = Kw).
  bool setParams(std::uint32_t tbSize, std::uint32_t G, std::uint32_t Qm, std::uint32_t rvIdx,
                 std::uint32_t numLayers);

  rateMatchParams getRMParams() const { return itsRMParams; }
  // The parameter set itself, for the owner's setters of the CQI, ACK and RI sizes and
  // coded lengths (rateMatchParams::setCQISize, setCQIQ, ...).
  rateMatchParams& rmParams() { return itsRMParams; }
  // 3 * (K_r + 4): the soft values of code block r in the HARQ buffer.
  std::uint32_t getCodeBlockBufferLength(std::uint32_t r) const;
  // E_r: the rate-matched soft values of code block r in this transmission.
  std::uint32_t getCodeBlockE(std::uint32_t r) const;

  // E_r soft values of code block r -> its three streams. The soft values are scattered
  // straight to their stream positions through a map of the block's circular buffer, kept
  // for the next blocks and calls of the same geometry; rateDematchDataReference is the
  // step-by-step form (tables, llrCollect, deinterleaveData) it must equal.
  bool rateDematchData(std::span<const std::int32_t> in, Streams& out, std::uint32_t r);
  bool rateDematchDataReference(std::span<const std::int32_t> in, Streams& out, std::uint32_t r);
  // Chase combining: out[s][i] = sat(dematched[s][i] + harqIn[s][i]) for the D_r values of
  // each stream.
  bool applyHARQ(const Streams& harqIn, const Streams& dematched, Streams& out, std::uint32_t r);
  bool rateDematchAndHARQ(const SoftValues& in, const Streams& harqIn, Streams& out,
                          std::uint32_t r);

  // CQI_Q soft values of the convolutionally coded CQI -> the collected circular buffer w
  // (3 * Kpi positions) and the streams d0, d1, d2 (CQI size + 8 values each).
  bool rateDematchConv(const SoftValues& in, SoftValues& w, SoftValues& d0, SoftValues& d1,
                       SoftValues& d2);

  // Steps of the turbo dematching of code block r. mode 0 uses the column permutation of
  // turbo-coded blocks, mode 1 that of convolutionally coded blocks. nullMap gets 3 * Kpi
  // marks (0 real bit, 1 dummy, 2 filler) in circular-buffer order; P and pi get the
  // interleaver input position read at each output position of sub-block interleavers 1/2
  // and of interleaver 3.
  bool createInterleavingTables(std::uint32_t mode, std::uint32_t r, SoftValues& nullMap,
                                SoftValues& P, SoftValues& pi) const;
  // The same for the convolutionally coded CQI block: the three streams follow one another
  // in the buffer and share P.
  bool createConvInterleavingTables(std::uint32_t mode, SoftValues& nullMap, SoftValues& P) const;
  // Inverse bit selection: w = Ncb positions, in[m] added (saturating) at the m-th real
  // position met from k0 on, wrapping around the buffer.
  bool llrCollect(std::span<const std::int32_t> in, const SoftValues& nullMap, SoftValues& w,
                  std::uint32_t k0, std::uint32_t Ncb, std::uint32_t E) const;
  bool deinterleaveData(const SoftValues& w, const SoftValues& nullMap, const SoftValues& P,
                        const SoftValues& pi, SoftValues& d0, SoftValues& d1, SoftValues& d2,
                        std::uint32_t r) const;
  bool deinterleaveConvData(const SoftValues& w, const SoftValues& nullMap, const SoftValues& P,
                            SoftValues& d0, SoftValues& d1, SoftValues& d2) const;

  // The core's adder of two soft values in a register format: each operand clamped into the
  // format, the exact sum narrowed back with saturation. saturatedSum forms it with KQuantized
  // as the hardware description does; saturatingAdd is its integer form, used everywhere.
  static std::int32_t saturatedSum(const KQuantized& format, std::int32_t a, std::int32_t b);
  static std::int32_t saturatingAdd(std::int32_t a, std::int32_t b, std::int64_t minQ,
                                    std::int64_t maxQ) {
    const std::int64_t x = a < minQ ? minQ : (a > maxQ ? maxQ : a);
    const std::int64_t y = b < minQ ? minQ : (b > maxQ ? maxQ : b);
    const std::int64_t sum = x + y;
    return static_cast<std::int32_t>(sum < minQ ? minQ : (sum > maxQ ? maxQ : sum));
  }

  // Repetitions of the RI, HARQ-ACK and short CQI fields summed onto Qm (1-bit field) or
  // 3 * Qm (2-bit field) accumulators, and 32 for the CQI.
  bool rateDematchRI(const SoftValues& softIn, SoftValues& combined) const;
  bool rateDematchACK(const SoftValues& softIn, SoftValues& combined) const;
  bool rateDematchCQI(const SoftValues& softIn, SoftValues& combined) const;

 private:
  // Per code block quantities of the sub-block interleaver.
  struct BlockGeometry {
    std::uint32_t D;    // K_r + 4 soft values per stream
    std::uint32_t R;    // interleaver rows
    std::uint32_t Kpi;  // 32 * R
    std::uint32_t ND;   // dummy positions at the head of each interleaver
    std::uint32_t F;    // filler bits at the head of the block (block 0 only)
  };
  // False (after a line) when the parameters give no room for D_r values and the fillers.
  bool blockGeometry(std::uint32_t r, BlockGeometry& g) const;
  // The same without the line.
  bool computeBlockGeometry(std::uint32_t r, BlockGeometry& g) const;

  // Where each real position of a code block's circular buffer lands: position[n] is the
  // n-th real buffer position, target[n] its stream (bits 31..30) and index; fillers lists
  // the stream positions of the filler bits.
  struct DematchMap {
    std::uint32_t D = 0, R = 0, F = 0, Ncb = 0;
    std::vector<std::uint32_t> position;
    std::vector<std::uint32_t> target;
    std::vector<std::uint32_t> fillers;
  };
  static constexpr std::uint32_t kStreamShift = 30;
  static constexpr std::uint32_t kIndexMask = (1U << kStreamShift) - 1;
  // The map of code block r, built on first use; null when the block's geometry is one the
  // reference path must report on.
  const DematchMap* dematchMap(std::uint32_t r);

  // Accumulation onto P = Qm or 3 * Qm positions, shared by the RI and ACK fields.
  bool combineAckRi(const SoftValues& softIn, SoftValues& combined, std::uint32_t Q,
                    std::uint32_t fieldSize, bool isRI) const;

  bool itsParamsSet;
  rateMatchParams itsRMParams;
  KQuantized itsChaseFormat;        // saturation of repeated soft values in one transmission
  KQuantized itsHarqFormat;         // saturation of the HARQ soft buffer
  std::vector<DematchMap> itsMaps;  // the maps of the geometries met lately
};

}  // namespace brannoc

#endif  // BRANNOC_KRATEDEMATCH_H
