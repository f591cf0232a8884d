// The engine's tables and its stopping rule.
#include <gtest/gtest.h>

#include <optional>

#include "sim/Mcs.h"
#include "sim/Sweep.h"

namespace brannoc::sim {
namespace {

TEST(Mcs, TablesGiveModulationAndTransportBlockSize) {
  const struct {
    std::uint32_t iMcs, numPrb;
    std::optional<std::uint32_t> Qm, tbs;
  } cases[] = {
      {0, 1, 2, 16},      {10, 6, 2, 1032},    {11, 6, 4, 1032}, {20, 50, 4, 21384},
      {21, 50, 6, 21384}, {28, 110, 6, 75376}, {29, 6, {}, {}},  {10, 111, 2, {}},
  };
  for (const auto& c : cases) {
    const auto mcs = uplinkMcs(c.iMcs);
    EXPECT_EQ(mcs ? std::optional(mcs->Qm) : std::nullopt, c.Qm) << c.iMcs;
    EXPECT_EQ(mcs ? transportBlockSize(mcs->iTbs, c.numPrb) : std::nullopt, c.tbs) << c.iMcs;
  }
}

// A point stops at the end of the first batch that reaches the error target, or at the block
// cap (the last batch cut there); a failed block counts after every transmission.
TEST(Sweep, PointsStopAtBatchEnds) {
  SweepConfig config;
  LinkConfig link;
  link.numPrb = 1;
  link.tbSize = 40;
  link.maxTransmissions = 2;
  config.curves = {{"small", link}};
  config.snrDb = {-15.0, 30.0};
  config.maxBlocks = 20;
  config.targetErrors = 10;
  config.batchBlocks = 7;
  config.threads = 2;
  const SweepResult result = runSweep(config);
  ASSERT_EQ(result.error, "");
  ASSERT_EQ(result.points.size(), 2u);
  EXPECT_EQ(result.points[0].blocks, 14u);
  EXPECT_EQ(result.points[0].failedAfter, (std::vector<std::uint64_t>{14, 14}));
  EXPECT_EQ(result.points[0].transmissions, 28u);
  EXPECT_EQ(result.points[1].blocks, 20u);
  EXPECT_EQ(result.points[1].failedAfter, (std::vector<std::uint64_t>{0, 0}));
  EXPECT_DOUBLE_EQ(result.points[1].throughputMbps(), 0.04);
}

}  // namespace
}  // namespace brannoc::sim
