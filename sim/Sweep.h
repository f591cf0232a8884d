// The simulation engine: BLER, throughput and UCI error rates of one or more curves (link
// configurations) over a sweep of SNR points.
//
// Work is cut into units (curve, point, block). Block b of point p is drawn from
// blockSeed(seed, p, b) alone: every curve sees the same payloads and noise at a point, so
// curves differ by their configuration and not by their draw, and a block's outcome does not
// depend on which thread (or process) decodes it. The HARQ retransmissions of a block belong
// to its unit.
//
// Stopping rule: the blocks of a point are taken in batches of batchBlocks consecutive block
// indices (the last one cut at maxBlocks). A point stops at the end of the first batch at
// which the blocks whose first transmission failed reach targetErrors (when it is not 0), or
// at maxBlocks. Counts are added in block order after each batch, so every thread count
// gives the same counts; a process-parallel run can split each batch the same way.
#ifndef BRANNOC_SIM_SWEEP_H
#define BRANNOC_SIM_SWEEP_H

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "sim/Link.h"

namespace brannoc::sim {

struct Curve {
  std::string label;  // names the curve in the table, the files and the plot
  LinkConfig link;
};

struct SweepConfig {
  std::vector<Curve> curves;
  std::vector<double> snrDb;         // Es/N0 of the modulation symbols, per point
  std::uint64_t maxBlocks = 2000;    // blocks per point at most
  std::uint64_t targetErrors = 100;  // first-transmission block errors that end a point; 0: none
  std::uint64_t batchBlocks = 100;   // blocks between two checks of the stopping rule
  std::uint64_t seed = 1;
  unsigned threads = 1;  // worker threads, each with its own decoder instances
};

// The counts of one (curve, point). All but the two timing fields are the same for every
// thread count.
struct PointResult {
  std::size_t curve = 0;
  std::size_t point = 0;
  double snrDb = 0;
  std::uint64_t blocks = 0;
  std::vector<std::uint64_t> failedAfter;  // [k]: blocks not decoded after transmission k + 1
  std::uint64_t transmissions = 0;         // sent in all
  std::uint64_t deliveredBits = 0;         // bits of the blocks decoded correctly
  std::uint64_t cqiErrors = 0, ackErrors = 0, riErrors = 0;  // per transmission carrying them
  std::uint64_t uciTransmissions = 0;  // transmissions (each carries the configured UCI)
  double decodeSeconds = 0;            // time in the decoder's calls (timing)
  std::uint64_t decodedBits = 0;       // bits through the decoder (timing)

  double bler(std::size_t k) const;  // failedAfter[k] / blocks
  // Delivered bits per transmission time interval of 1 ms, in Mbit/s.
  double throughputMbps() const;
  // Decoder speed per thread: decoded bits / decodeSeconds, in Mbit/s.
  double decodeMbps() const;
};

struct SweepResult {
  std::vector<PointResult> points;  // curve-major, then SNR order
  std::string error;                // empty on success
  double wallSeconds = 0;
};

// fraction done (0..1), called from one thread at a time after each batch.
using ProgressFn = std::function<void(double)>;

// A sweep split across processes (the MPI build of the tool). All points advance together in
// rounds of one batch each; within a round this process decodes the blocks whose index within
// their batch is rank modulo ranks, with its threads. At the end of a round the processes
// exchange the round's outcomes (those of the blocks a process did not decode are 0) and any
// error, so that every process adds the same outcomes in block order, applies the same
// stopping rule and stops at the same round: the counts are those of a one-process run.
struct Distribution {
  unsigned rank = 0;
  unsigned ranks = 1;
  // Sums the vectors element by element over all processes, on all of them (every process
  // calls it at the same points with vectors of the same lengths).
  std::function<void(std::vector<std::uint64_t>&, std::vector<double>&)> sum;
  // The error of the lowest-ranked process that has one, on all processes ("" when none).
  std::function<std::string(const std::string&)> firstError;
};

std::uint64_t blockSeed(std::uint64_t seed, std::uint64_t point, std::uint64_t block);

// Adds one block's outcome to a point's counts.
void accumulate(PointResult& point, const BlockOutcome& outcome, std::uint32_t maxTransmissions);

// True when the point's counts, taken at the end of a batch, end the point.
bool pointFinished(const SweepConfig& config, const PointResult& point);

// Runs the whole sweep on config.threads threads (at least 1), in this process or, given a
// distribution of more than one rank, shared with the other processes.
SweepResult runSweep(const SweepConfig& config, const ProgressFn& progress = {},
                     const Distribution* distribution = nullptr);

}  // namespace brannoc::sim

#endif
