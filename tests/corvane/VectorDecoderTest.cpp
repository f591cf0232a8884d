// The vectorised decoder against the scalar reference on every instruction set this
// processor runs (Highway runs one test binary's vector code once per target): noisy frames
// of every block size, every unit count and algorithm, random iteration counts and correction
// scales, decoded in batches of mixed sizes, must give the scalar decoder's bits.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <vector>

#include "CorvaneTestSupport.h"
#include "tx/QppInterleaver.h"

#if CORVANE_HAVE_HIGHWAY
#include <hwy/targets.h>
#endif

namespace corvane::test {
namespace {

#if CORVANE_HAVE_HIGHWAY
struct Frame {
  SoftStreams streams;
  std::uint32_t iterations;
  std::vector<std::uint8_t> expected;
};

// The frames of one configuration: two of each block size given (sharing 1..8 iterations,
// so that the vectorised decoder puts them side by side) and a run of 13 of one size with
// 1..16 iterations, the largest size given when longRun (windows long enough for the
// vectorised decoder to keep only every second forward metric).
std::vector<Frame> framesFor(SplitMix64& rng, const std::vector<std::uint32_t>& sizes,
                             bool longRun) {
  std::vector<Frame> frames;
  const auto add = [&](std::uint32_t K, std::uint32_t copies) {
    const std::uint32_t iterations =
        1 + static_cast<std::uint32_t>(rng.next() % (copies > 2 ? 16 : 8));
    for (std::uint32_t c = 0; c < copies; ++c) {
      const auto mean = static_cast<std::int32_t>(8 + rng.next() % 10);
      const auto spread = static_cast<std::int64_t>(16 + rng.next() % 16);
      frames.push_back(
          {noisyStreams(encode(randomBits(rng, K)), rng, mean, spread), iterations, {}});
    }
  };
  for (std::uint32_t K : sizes) add(K, 2);
  add(longRun ? *std::max_element(sizes.begin(), sizes.end()) : sizes[rng.next() % sizes.size()],
      13);
  return frames;
}

TEST(VectorDecoder, EveryTargetDecidesAsTheScalarDecoder) {
  SplitMix64 rng(0x5EC7);
  std::vector<std::uint32_t> sizes[12];  // every K, each with one of the 12 configurations
  std::size_t next = 0;
  for (const brannoc::tx::QppParameters& row : brannoc::tx::qppTable()) {
    sizes[(next++ + rng.next() % 2) % 12].push_back(row.K);
  }
  std::vector<std::uint8_t> bits;
  std::size_t targetsRun = 0;
  for (std::uint32_t config = 0; config < 12; ++config) {
    vexlon_ip_corvane_generics generics = Model::generics(1u << (config % 4), config / 4);
    generics.steps_per_unit = 4u << (rng.next() % 5);  // 4..64: byte tables and thresholds
    generics.max_code_blocks = 32;
    std::vector<Frame> frames = framesFor(rng, sizes[config], config % 4 < 2);  // P 1 or 2
    generics.decoder_path = 1;
    const Model scalar(generics);
    for (Frame& frame : frames) {
      ASSERT_EQ(decodeStreams(scalar, frame.streams, frame.iterations, frame.expected), 0);
    }
    generics.decoder_path = 2;
    for (std::int64_t target : hwy::SupportedAndGeneratedTargets()) {
      hwy::SetSupportedTargetsForTest(target);
      ++targetsRun;
      const Model vectorised(generics);
      ASSERT_NE(vectorised.get(), nullptr);
      for (std::size_t first = 0; first < frames.size();) {
        const std::size_t count = std::min<std::size_t>(1 + rng.next() % 32, frames.size() - first);
        std::vector<vexlon_ip_corvane_inputs> inputs;
        std::vector<vexlon_ip_corvane_outputs> outputs;
        std::vector<std::vector<std::uint8_t> > decided(count);
        for (std::size_t i = 0; i < count; ++i) {
          const Frame& frame = frames[first + i];
          inputs.push_back(inputsFor(frame.streams, frame.iterations));
          decided[i].assign(frame.expected.size(), 0xEE);
          outputs.push_back(
              {0, 0, decided[i].data(), static_cast<std::uint32_t>(decided[i].size())});
        }
        ASSERT_EQ(
            vexlon_ip_corvane_bitacc_simulate_batch(
                vectorised.get(), inputs.data(), static_cast<std::uint32_t>(count), outputs.data()),
            0);
        for (std::size_t i = 0; i < count; ++i) {
          ASSERT_EQ(decided[i], frames[first + i].expected)
              << hwy::TargetName(target) << ", P " << generics.processing_units << ", algorithm "
              << generics.algorithm << ", steps " << generics.steps_per_unit << ", K "
              << inputs[i].block_size << ", iterations " << inputs[i].iterations;
        }
        first += count;
      }
    }
    hwy::SetSupportedTargetsForTest(0);
  }
  EXPECT_GE(targetsRun, 12u * 2);  // at least a vector target and the portable baseline
}
#else
TEST(VectorDecoder, EveryTargetDecidesAsTheScalarDecoder) {
  GTEST_SKIP() << "this build has the scalar decoder only";
}
#endif

}  // namespace
}  // namespace corvane::test
