// The engine: a queue of block units shared by the worker threads. Every point of every
// curve runs at once, one batch at a time; the batch's outcomes are kept by block index and
// added in that order when its last block is done, then the stopping rule decides whether
// the point's next batch is queued.
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
  return transmissions == 0 ? 0.0
                            : static_cast<double>(deliveredBits) /
                                  static_cast<double>(transmissions) / 1000.0;
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
  Scheduler(const SweepConfig& config, const ProgressFn& progress)
      : itsConfig(config), itsProgress(progress) {
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
      } else {
        queueBatch(i);
      }
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

  void fail(const std::string& error) {
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
    const std::uint64_t end =
        std::min(state.batchStart + std::max<std::uint64_t>(itsConfig.batchBlocks, 1),
                 itsConfig.maxBlocks);
    state.pending = end - state.batchStart;
    state.outcomes.assign(state.pending, BlockOutcome{});
    for (std::uint64_t b = state.batchStart; b < end; ++b) itsQueue.push_back({i, b});
  }

  void finish(std::size_t i) {
    itsPoints[i].done = true;
    --itsOpen;
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
        scheduler.fail(config.curves[curve].label + ": " + error);
        return;
      }
    }
    if (!links[curve]->runBlock(config.snrDb[point], blockSeed(config.seed, point, unit.block),
                                outcome, error)) {
      scheduler.fail(config.curves[curve].label + ": " + error);
      return;
    }
    scheduler.complete(unit, outcome);
  }
}

}  // namespace

SweepResult runSweep(const SweepConfig& config, const ProgressFn& progress) {
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
  Scheduler scheduler(config, progress);
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
