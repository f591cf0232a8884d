// The vectorised turbo decoder: the same decoding as TurboDecoder, bit for bit, with the
// windows of a half-iteration, of one block and of every block of a batch, decoded side by
// side, one window (trellis segment) per 16-bit vector lane and each of the eight state
// metrics in a register of its own. The windows of a half-iteration are independent by
// construction (each starts from the boundary metrics of the previous iteration), so the
// lanes never exchange data within one.
//
// Blocks of equal K and iteration count form a group decoded together. In a group of B
// blocks with P windows of length L = K / P each, segment s = b*P + w (window w of block b)
// sits in lane s % N of lane group s / N, N lanes wide (8, 16 or 32, the narrowest that
// holds every segment, at most the processor's vector width); the values of step k of a
// lane group lie at (group * L + k) * N + lane, so every step loads one vector. Between the
// half-iterations the QPP interleaver moves whole steps: interleaved step k of every window
// reads one natural step, its lanes shuffled within each block (see buildStepTables).
//
// A group that fills at most half of the widest vector (one block with 8 windows on AVX2,
// up to 16 windows on AVX-512) runs the forward recursion in the lower half and the
// backward recursion in the upper half of the same registers, then forms the extrinsic
// values of two steps per vector, so the lanes are used twice as well, as long as the
// store of both metrics of every step fits 1 MiB; the blocks beyond a group's last full
// lane group form a group of their own when they fill at most half of one. The other
// groups make the a priori values of a half-iteration in its forward recursion.
//
// One or two windows (a single block with P = 1 or 2, or two blocks with P = 1) fill still
// fewer lanes, so on AVX2 and AVX-512 they run with the states across the lanes instead:
// the eight metrics of one recursion in one 128-bit block, the forward and backward
// recursions of the windows in the lower and upper halves of one or two registers, the
// extrinsic values formed during the second half of the steps (see decodeStateLanes). Their
// values lie in rows of one or two lanes, which the exchange moves one by one.
//
// Widths. ConstituentDecoder.h argues the widths of the reference's metrics, normalised
// every step. The vectorised decoder normalises its backward recursions, and the state-lane
// recursions both ways, only every kNormalisationPeriod = 4 steps (the extrinsic values and
// the next metrics depend only on differences within a step; the boundary metrics handed to
// the next iteration are normalised), and the state-lane branch sums count u * Lu.
// Per step the largest metric rises by at most 1279 + 44 and falls by at most 640 (of the
// two branches leaving a state, with (u, p) and (1-u, 1-p), one has at least (Lu + Lp) / 2);
// the metrics of reachable states span at most 3 * 1279 + 3 * 44 from the third step of a
// window on and 6615 (that plus two steps' ranges) in its first and last two steps, and in
// window 0, whose states 1..7 start at -8192, no metric is more than 14000 below the
// largest. Normalised (state 0 at 0), alpha lies within -14000..6615 and beta within
// -6615..6615; four steps later alpha lies within -16560..11907 and beta within
// -9175..11907, a metric plus a branch metric within -17839..13186, and a branch sum
// alpha + gamma + beta within -27014..25093, a combination of such sums at most 3 * 44
// above: every sum fits 16 bits. The u = 0 and u = 1 branches leaving one state differ only
// in beta and Lp, so a raw extrinsic value e has |e| < 6615 + 128 + 132 < 7000; e + Lu
// (what the state-lane recursions form), 3e (the scaling) and the a posteriori sum
// systematic + a priori + e (below 8200) fit 16 bits as well.
//
// The vector code is compiled for every x86 instruction set Highway knows (SSSE3, SSE4, AVX2,
// AVX-512) and the best the processor runs is chosen at the first call; on a processor
// without SSSE3, Highway's one-lane fallback decodes with the scalar decoder, which also
// takes a log-MAP block of one window (too few lanes to pay for the vector table look-ups). A build
// without Highway (CORVANE_SIMD off, Highway missing, or the 32-bit build) has no vectorised
// decoder: vectorDecoderAvailable() is false and init() refuses.
#ifndef CORVANE_VECTORDECODER_H
#define CORVANE_VECTORDECODER_H

#include <cstddef>
#include <cstdint>
#include <memory>
#include <new>

#include "TurboDecoder.h"

namespace corvane {

// True when this build has the vectorised decoder.
bool vectorDecoderAvailable();

// The lanes a group of `segments` windows uses on a processor whose vectors hold
// maxLanes 16-bit lanes: the narrowest of 8, 16, 32 that holds them all, at most maxLanes.
inline std::size_t laneGroupWidth(std::size_t segments, std::size_t maxLanes) {
  std::size_t lanes = 8;
  while (lanes < segments && lanes < 32 && lanes < maxLanes) lanes *= 2;
  return lanes;
}

// Steps between the normalisations of the backward and the state-lane recursions (see the
// widths above).
constexpr std::size_t kNormalisationPeriod = 4;

// An array of T aligned for the widest vectors, freed with the aligned delete.
template <class T>
class AlignedArray {
 public:
  static constexpr std::align_val_t kAlignment{64};
  bool allocate(std::size_t count) {
    itsData.reset(static_cast<T*>(::operator new(count * sizeof(T), kAlignment, std::nothrow)));
    return itsData != nullptr || count == 0;
  }
  T* get() const { return itsData.get(); }

 private:
  struct Free {
    void operator()(T* p) const { ::operator delete(p, kAlignment); }
  };
  std::unique_ptr<T, Free> itsData;
};

// Everything a group decode needs: the configuration, the correction thresholds and the
// working arrays, sized at init for the largest group (maxCodeBlocks blocks of
// maxBlockSize).
struct VectorWorkspace {
  std::uint32_t processingUnits = 2;
  Algorithm algorithm = Algorithm::ScaledMaxLog;
  int extrinsicLimit = 0;
  // threshold[v - 1] = the smallest difference whose log-MAP correction is below v, for
  // v = 1..thresholdCount: the correction of d is the number of thresholds above d.
  std::int16_t threshold[64] = {};
  int thresholdCount = 0;
  // The same correction as 16-byte tables of 15 entries each (see LogMapCombine), for
  // tables of at most 256 entries; chunkCount 0 otherwise.
  std::uint8_t chunkTable[17 * 16] = {};
  int chunkCount = 0;
  std::size_t positions = 0;                 // capacity of the per-position arrays
  AlignedArray<std::int16_t> systematic[2];  // per decoder: natural, interleaved order
  AlignedArray<std::int16_t> parity[2];
  AlignedArray<std::int16_t> lu;         // systematic + a priori
  AlignedArray<std::int16_t> extrinsic;  // raw extrinsic values
  // Per decoder d and step k: the step of the other decoder's order its values come from,
  // and the 16 byte indices that move them between the lanes (see permuteSteps).
  AlignedArray<std::uint16_t> sourceStep[2];
  AlignedArray<std::uint8_t> lanePattern[2];
  AlignedArray<std::uint8_t> laneSwap[2];  // the same for rows of two windows: 0 or 16 bits
  AlignedArray<std::int16_t> alpha;        // forward (or state-lane) metrics of one group
  AlignedArray<std::int16_t> quads;        // branch metric quads of the state-lane recursions
  AlignedArray<std::int16_t> laneStates;   // 2 x 8 x 32 boundary metrics of a lane group
  AlignedArray<std::int32_t> zeros;        // soft values of missing segments
  AlignedArray<std::uint8_t> sink;         // decisions of missing segments
  AlignedArray<std::uint16_t> pi;          // QPP permutation of the group's K
  AlignedArray<std::uint16_t> piInverse;
  std::size_t tablesK = 0;  // the K of pi, sourceStep and lanePattern
  // [decoder][alpha, beta, new alpha, new beta][segment]
  std::unique_ptr<StateMetrics[]> boundaries;
  std::unique_ptr<StateMetrics[]> tails;  // [block][decoder]
  std::size_t maxSegments = 0;
  TurboDecoder oneLane;  // scalar decoder: one-lane fallback target, one log-MAP window
};

class VectorDecoder {
 public:
  // Sizes the buffers for config.maxCodeBlocks blocks of config.maxBlockSize; false when
  // the build has no vectorised decoder or memory runs out.
  bool init(const DecoderConfig& config, const CorrectionTable& correction);

  // Decodes count blocks (K at most the configured maximum, count at most maxCodeBlocks).
  void decode(const CodeBlock* blocks, std::uint32_t count);

 private:
  VectorWorkspace itsWork;
  std::unique_ptr<const CodeBlock*[]> itsGroup;
};

}  // namespace corvane

#endif  // CORVANE_VECTORDECODER_H
