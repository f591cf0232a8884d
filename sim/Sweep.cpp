// The engine: a queue of block units shared by the worker threads. Every point of every
// curve runs at once, one batch at a time; the batch's outcomes are kept by block index and
// added in that order when its last block is done, then the stopping rule decides whether
// the point's next batch is queued. A run shared by several processes advances all points
// in rounds instead, exchanging each round's outcomes (see Distribution).
#include "sim/Sweep.h"

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <deque>
#include <memory>
#include <mutex>
#include <thread>

namespace brannoc::sim {

double PointResult::bler(std::size_t k) const {
  return blocks == 0 || k >= failedAfter.size()
             ? 0.0
             : static_cast<double>(failedAfter[k]) / static_cast<double>(blocks);
}

double PointResult::throughputMbps() const {
  // One transmission per 1 ms subframe: bits per ms / 1000 = Mbit/s.
  return transmissions == 0
             ? 0.0
             : static_cast<double>(deliveredBits) / static_cast<double>(transmissions) / 1000.0;
}

double PointResult::decodeMbps() const {
  return decodeSeconds <= 0 ? 0.0 : static_cast<double>(decodedBits) / decodeSeconds / 1e6;
}

std::uint64_t blockSeed(std::uint64_t seed, std::uint64_t point, std::uint64_t block) {
  return mixSeed(mixSeed(seed, point), block);
}

void accumulate(PointResult& point, const BlockOutcome& outcome, std::uint32_t maxTransmissions) {
  point.failedAfter.resize(maxTransmissions, 0);
  ++point.blocks;
  for (std::uint32_t k = 0; k < maxTransmissions; ++k) {
    point.failedAfter[k] += !(outcome.correct && outcome.transmissions <= k + 1);
  }
  point.transmissions += outcome.transmissions;
  point.deliveredBits += outcome.deliveredBits;
  point.uciTransmissions += outcome.transmissions;
  point.cqiErrors += outcome.cqiErrors;
  point.ackErrors += outcome.ackErrors;
  point.riErrors += outcome.riErrors;
  point.decodedBits += outcome.decodedBits;
  point.decodeSeconds += outcome.decodeSeconds;
}

bool pointFinished(const SweepConfig& config, const PointResult& point) {
  const bool enoughErrors = config.targetErrors > 0 && !point.failedAfter.empty() &&
                            point.failedAfter[0] >= config.targetErrors;
  return enoughErrors || point.blocks >= config.maxBlocks;
}

namespace {

struct PointState {
  PointResult result;
  std::uint32_t maxTransmissions = 1;
  std::uint64_t batchStart = 0;
  std::vector<BlockOutcome> outcomes;  // of the batch in flight, by block - batchStart
  std::uint64_t pending = 0;
  bool done = false;
};

struct Unit {
  std::size_t point;  // index into the point states
  std::uint64_t block;
};

class Scheduler {
 public:
  Scheduler(const SweepConfig& config, const ProgressFn& progress, const Distribution* distribution)
      : itsConfig(config), itsProgress(progress), itsDistribution(distribution) {
    for (std::size_t c = 0; c < config.curves.size(); ++c) {
      for (std::size_t p = 0; p < config.snrDb.size(); ++p) {
        PointState state;
        state.result.curve = c;
        state.result.point = p;
        state.result.snrDb = config.snrDb[p];
        state.maxTransmissions = config.curves[c].link.channel == Channel::Pusch
                                     ? config.curves[c].link.maxTransmissions
                                     : 1;
        state.result.failedAfter.assign(state.maxTransmissions, 0);
        itsPoints.push_back(std::move(state));
      }
    }
    itsOpen = itsPoints.size();
    for (std::size_t i = 0; i < itsPoints.size(); ++i) {
      if (config.maxBlocks == 0) {
        finish(i);
      } else if (!distributed()) {
        queueBatch(i);
      }
    }
    if (distributed()) {
      queueRound();
    }
  }

  // The next unit; false when the sweep is over (or failed).
  bool next(Unit& unit) {
    std::unique_lock lock(itsMutex);
    itsReady.wait(lock, [&] { return !itsQueue.empty() || itsOpen == 0 || !itsError.empty(); });
    if (itsQueue.empty() || !itsError.empty()) return false;
    unit = itsQueue.front();
    itsQueue.pop_front();
    return true;
  }

  void complete(const Unit& unit, const BlockOutcome& outcome) {
    std::lock_guard lock(itsMutex);
    PointState& state = itsPoints[unit.point];
    state.outcomes[unit.block - state.batchStart] = outcome;
    if (distributed()) {
      if (--itsRoundPending == 0) {
        endRound();
        queueRound();
        itsReady.notify_all();
      }
      return;
    }
    if (--state.pending > 0) return;
    for (const BlockOutcome& o : state.outcomes) {
      accumulate(state.result, o, state.maxTransmissions);
    }
    if (pointFinished(itsConfig, state.result)) {
      finish(unit.point);
    } else {
      queueBatch(unit.point);
    }
    if (itsProgress) itsProgress(fractionDone());
    itsReady.notify_all();
  }

  // A unit that could not be decoded. A distributed run completes the round (the other
  // processes wait for its exchange) and then stops everywhere with the error.
  void fail(const Unit& unit, const std::string& error) {
    if (distributed()) {
      {
        std::lock_guard lock(itsMutex);
        if (itsLocalError.empty()) itsLocalError = error;
      }
      complete(unit, BlockOutcome{});
      return;
    }
    std::lock_guard lock(itsMutex);
    if (itsError.empty()) itsError = error;
    itsReady.notify_all();
  }

  SweepResult result() {
    SweepResult r;
    r.error = itsError;
    for (PointState& state : itsPoints) r.points.push_back(std::move(state.result));
    return r;
  }

 private:
  void queueBatch(std::size_t i) {
    PointState& state = itsPoints[i];
    state.batchStart = state.result.blocks;
    const std::uint64_t end = std::min(
        state.batchStart + std::max<std::uint64_t>(itsConfig.batchBlocks, 1), itsConfig.maxBlocks);
    state.pending = end - state.batchStart;
    state.outcomes.assign(state.pending, BlockOutcome{});
    for (std::uint64_t b = state.batchStart; b < end; ++b) itsQueue.push_back({i, b});
  }

  void finish(std::size_t i) {
    itsPoints[i].done = true;
    --itsOpen;
  }

  bool distributed() const { return itsDistribution != nullptr && itsDistribution->ranks > 1; }

  // The next batch of every open point, with this process's share of its blocks queued; a
  // round in which this process has no block is exchanged at once.
  void queueRound() {
    const Distribution& d = *itsDistribution;
    while (itsOpen > 0 && itsError.empty()) {
      itsRoundPending = 0;
      for (std::size_t i = 0; i < itsPoints.size(); ++i) {
        PointState& state = itsPoints[i];
        if (state.done) continue;
        state.batchStart = state.result.blocks;
        const std::uint64_t end =
            std::min(state.batchStart + std::max<std::uint64_t>(itsConfig.batchBlocks, 1),
                     itsConfig.maxBlocks);
        state.outcomes.assign(end - state.batchStart, BlockOutcome{});
        for (std::uint64_t b = state.batchStart; b < end; ++b) {
          if ((b - state.batchStart) % d.ranks == d.rank) {
            itsQueue.push_back({i, b});
            ++itsRoundPending;
          }
        }
      }
      if (itsRoundPending > 0) return;
      endRound();
    }
  }

  // Every process's outcomes of the round added in block order, the stopping rule applied.
  void endRound() {
    constexpr std::size_t kCounts = 7;
    std::vector<std::uint64_t> counts;
    std::vector<double> seconds;
    for (const PointState& state : itsPoints) {
      if (state.done) continue;
      for (const BlockOutcome& o : state.outcomes) {
        counts.insert(counts.end(), {o.transmissions, o.correct ? 1U : 0U, o.cqiErrors, o.ackErrors,
                                     o.riErrors, o.deliveredBits, o.decodedBits});
        seconds.push_back(o.decodeSeconds);
      }
    }
    itsDistribution->sum(counts, seconds);
    itsError = itsDistribution->firstError(itsLocalError);
    if (!itsError.empty()) return;
    std::size_t n = 0;
    for (std::size_t i = 0; i < itsPoints.size(); ++i) {
      PointState& state = itsPoints[i];
      if (state.done) continue;
      for (BlockOutcome& o : state.outcomes) {
        const std::uint64_t* c = &counts[kCounts * n];
        o.transmissions = static_cast<std::uint32_t>(c[0]);
        o.correct = c[1] != 0;
        o.cqiErrors = static_cast<std::uint32_t>(c[2]);
        o.ackErrors = static_cast<std::uint32_t>(c[3]);
        o.riErrors = static_cast<std::uint32_t>(c[4]);
        o.deliveredBits = c[5];
        o.decodedBits = c[6];
        o.decodeSeconds = seconds[n++];
        accumulate(state.result, o, state.maxTransmissions);
      }
      if (pointFinished(itsConfig, state.result)) finish(i);
    }
    if (itsProgress) itsProgress(fractionDone());
  }

  // Each point counts as the larger of its shares of the block cap and of the error target.
  double fractionDone() const {
    double sum = 0;
    for (const PointState& state : itsPoints) {
      double share = static_cast<double>(state.result.blocks) /
                     static_cast<double>(std::max<std::uint64_t>(itsConfig.maxBlocks, 1));
      if (itsConfig.targetErrors > 0) {
        share = std::max(share, static_cast<double>(state.result.failedAfter[0]) /
                                    static_cast<double>(itsConfig.targetErrors));
      }
      sum += state.done ? 1.0 : std::min(share, 1.0);
    }
    return itsPoints.empty() ? 1.0 : sum / static_cast<double>(itsPoints.size());
  }

  const SweepConfig& itsConfig;
  const ProgressFn& itsProgress;
  const Distribution* itsDistribution;
  std::uint64_t itsRoundPending = 0;  // this process's units of the round still running
  std::string itsLocalError;          // this process's first failure, for the exchange
  std::mutex itsMutex;
  std::condition_variable itsReady;
  std::vector<PointState> itsPoints;
  std::deque<Unit> itsQueue;
  std::size_t itsOpen = 0;
  std::string itsError;
};

// One worker: a link per curve, opened on first use, and units until the queue is done.
void work(const SweepConfig& config, Scheduler& scheduler) {
  std::vector<std::unique_ptr<Link>> links(config.curves.size());
  Unit unit{};
  BlockOutcome outcome;
  std::string error;
  while (scheduler.next(unit)) {
    const std::size_t curve = unit.point / config.snrDb.size();
    const std::size_t point = unit.point % config.snrDb.size();
    if (!links[curve]) {
      links[curve] = std::make_unique<Link>(config.curves[curve].link);
      if (!links[curve]->open(error)) {
        scheduler.fail(unit, config.curves[curve].label + ": " + error);
        links[curve].reset();
        continue;
      }
    }
    if (!links[curve]->runBlock(config.snrDb[point], blockSeed(config.seed, point, unit.block),
                                outcome, error)) {
      scheduler.fail(unit, config.curves[curve].label + ": " + error);
      continue;
    }
    scheduler.complete(unit, outcome);
  }
}

}  // namespace

SweepResult runSweep(const SweepConfig& config, const ProgressFn& progress,
                     const Distribution* distribution) {
  const auto start = std::chrono::steady_clock::now();
  // Refuse a configuration before any thread starts.
  for (const Curve& curve : config.curves) {
    Link probe(curve.link);
    std::string error;
    if (!probe.open(error)) {
      SweepResult failed;
      failed.error = curve.label + ": " + error;
      return failed;
    }
  }
  Scheduler scheduler(config, progress, distribution);
  {
    std::vector<std::jthread> workers;
    for (unsigned t = 1; t < std::max(config.threads, 1u); ++t) {
      workers.emplace_back([&] { work(config, scheduler); });
    }
    work(config, scheduler);
  }
  SweepResult result = scheduler.result();
  result.wallSeconds =
      std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
  return result;
}

}  // namespace brannoc::sim
