// Frame error rate of the turbo-decoder model library over an AWGN channel: the
// transmitter's turbo codewords (TS 36.212 clause 5.1.3.2, rate 1/3 with the 12 tail bits)
// sent as BPSK, noise and 8:5 quantisation from the transmitter's channel model, decoded
// through the library's C interface. One table row per Eb/N0 point.
//
// Eb/N0 counts the information bits: Es/N0 = Eb/N0 + 10 log10(K / (3K + 12)), slightly
// harsher than the nominal rate 1/3. The soft values are raw = round(scale * LLR), halves
// away from zero, saturated to -128..127, LLR = ln(P(1)/P(0)) computed with the true noise
// variance; the default scale is 32 raw steps per natural-log unit (1.0 in 8:5 is one unit),
// the library's default. The library's log-MAP correction is built for --steps steps per
// unit (generics word 5), by default the input scale rounded.
//
// --path scalar or vector chooses the library's decoder (generics word 6; both give the same
// bits, so the same table); --batch n decodes n frames per call of the batch entry point,
// which fills the vector lanes (each frame's bits are those it gets alone).
//
// Each frame draws its bits and its noise from seeds derived from the frame number, so a
// frame is the same whichever thread decodes it. A point stops once it has the requested
// number of frame errors or the frame cap, and counts the frames in order up to that point, so
// that its row does not depend on the threads or the batch size.
#include <CLI/CLI.hpp>
#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <thread>
#include <vector>

#include "tx/SoftChannel.h"
#include "tx/TurboEncoder.h"
#include "vexlon_ip_corvane_bitacc_cmodel.h"

namespace {

struct Options {
  std::uint32_t K = 6144;
  std::uint32_t algorithm = 1;
  std::uint32_t units = 1;
  std::uint32_t iterations = 6;
  std::uint32_t extrinsicBits = 10;
  double from = 0.4;
  double to = 1.0;
  double step = 0.1;
  std::uint64_t minErrors = 50;
  std::uint64_t maxFrames = 20000;
  double scale = 32.0;
  std::uint32_t steps = 0;  // 0: the scale rounded
  std::uint32_t path = 0;   // generics word 6: 0 automatic, 1 scalar, 2 vector
  std::uint32_t batch = 1;
  unsigned threads = 2;
  std::uint64_t seed = 1;
};

// The command line on CLI11; false (after CLI11's message) when it is refused or asked for
// help, with the exit status in status.
bool parse(int argc, char** argv, Options& o, int& status) {
  CLI::App app{"turbo_fer: frame error rate of the turbo-decoder model over BPSK and AWGN"};
  app.add_option("--K", o.K, "code block size")->capture_default_str();
  app.add_option("--algorithm", o.algorithm, "0 max-log-MAP, 1 scaled, 2 log-MAP")
      ->check(CLI::Range(0, 2))
      ->capture_default_str();
  app.add_option("--units", o.units, "processing units 1, 2, 4, 8")
      ->check(CLI::IsMember({1, 2, 4, 8}))
      ->capture_default_str();
  app.add_option("--iterations", o.iterations)->check(CLI::Range(1, 16))->capture_default_str();
  app.add_option("--extrinsic-bits", o.extrinsicBits)->capture_default_str();
  app.add_option("--from", o.from, "first Eb/N0 in dB")->capture_default_str();
  app.add_option("--to", o.to, "last Eb/N0 in dB")->capture_default_str();
  app.add_option("--step", o.step, "Eb/N0 step in dB")
      ->check(CLI::PositiveNumber)
      ->capture_default_str();
  app.add_option("--errors", o.minErrors, "frame errors that end a point")->capture_default_str();
  app.add_option("--frames", o.maxFrames, "frames per point at most")
      ->check(CLI::Range(std::uint64_t{1}, std::uint64_t{100000000}))
      ->capture_default_str();
  app.add_option("--scale", o.scale, "raw soft-value steps per natural-log unit of the input")
      ->check(CLI::PositiveNumber)
      ->capture_default_str();
  app.add_option("--steps", o.steps, "steps per unit of the log-MAP correction (default: --scale)");
  std::string path = "automatic";
  app.add_option("--path", path, "decoder: scalar, vector or automatic")
      ->check(CLI::IsMember({"automatic", "scalar", "vector"}))
      ->capture_default_str();
  app.add_option("--batch", o.batch, "frames per call of the batch entry point")
      ->check(CLI::Range(1, 32))
      ->capture_default_str();
  app.add_option("--threads", o.threads)->check(CLI::PositiveNumber)->capture_default_str();
  app.add_option("--seed", o.seed)->capture_default_str();
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& e) {
    status = app.exit(e);
    return false;
  }
  o.path = path == "scalar" ? 1 : (path == "vector" ? 2 : 0);
  if (o.steps == 0) o.steps = static_cast<std::uint32_t>(std::lround(o.scale));
  return true;
}

std::uint64_t mix(std::uint64_t x) {
  x += 0x9E3779B97F4A7C15ull;
  x = (x ^ (x >> 30)) * 0xBF58476D1CE4E5B9ull;
  x = (x ^ (x >> 27)) * 0x94D049BB133111EBull;
  return x ^ (x >> 31);
}

// The frames of one point: the next frame number to draw, the frame errors so far (which
// stop the workers), and each frame's bit errors by frame number.
struct Counts {
  explicit Counts(std::uint64_t frames) : bitErrors(frames) {}
  std::atomic<std::uint64_t> nextFrame{0};
  std::atomic<std::uint64_t> frameErrors{0};
  std::vector<std::uint32_t> bitErrors;
};

// One frame: its information bits, its soft streams and its decisions.
struct Frame {
  std::vector<std::uint8_t> c, decided;
  std::vector<std::int32_t> soft[3];
};

// Draws frame number `frame` of the point: bits from the seed, the transmitter's codeword,
// BPSK soft values with the point's noise. False when the transmitter refuses.
bool makeFrame(const Options& o, const brannoc::tx::ChannelSettings& channel,
               std::uint64_t pointSeed, std::uint64_t frame, Frame& f) {
  f.c.resize(o.K);
  f.decided.resize(o.K);
  std::uint64_t bitSeed = mix(pointSeed ^ mix(frame));
  for (std::uint32_t k = 0; k < o.K; k += 64) {
    bitSeed = mix(bitSeed);
    for (std::uint32_t b = 0; b < 64 && k + b < o.K; ++b) f.c[k + b] = (bitSeed >> b) & 1;
  }
  brannoc::tx::TurboCodeword d;
  if (!brannoc::tx::turboEncode(f.c, d)) return false;
  brannoc::tx::GaussianSource noise(mix(bitSeed + 1));
  const brannoc::tx::Bits* streams[3] = {&d.d0, &d.d1, &d.d2};
  for (int s = 0; s < 3; ++s) {
    f.soft[s].clear();
    brannoc::tx::appendSoftValues(*streams[s], brannoc::tx::Constellation::PucchBpsk, channel,
                                  noise, f.soft[s]);
  }
  return true;
}

// Decodes frames of one Eb/N0 point, o.batch per call, until the point has enough errors or
// frames.
bool runWorker(const Options& o, double esN0Db, std::uint64_t pointSeed, Counts& counts) {
  vexlon_ip_corvane_generics generics = vexlon_ip_corvane_get_default_generics();
  generics.max_block_size = o.K;
  generics.processing_units = o.units;
  generics.algorithm = o.algorithm;
  generics.extrinsic_bits = o.extrinsicBits;
  generics.steps_per_unit = o.steps;
  generics.decoder_path = o.path;
  generics.max_code_blocks = o.batch;
  vexlon_ip_corvane_state* model = vexlon_ip_corvane_create_state(generics);
  if (model == nullptr) return false;
  brannoc::tx::ChannelSettings channel;
  channel.mode = brannoc::tx::ChannelMode::Awgn;
  channel.esN0Db = esN0Db;
  channel.llrScale = o.scale / brannoc::tx::kSoftOne;
  std::vector<Frame> frames(o.batch);
  std::vector<vexlon_ip_corvane_inputs> in(o.batch);
  std::vector<vexlon_ip_corvane_outputs> out(o.batch);
  std::vector<std::uint64_t> frameNumbers(o.batch);
  const std::uint32_t N = o.K + 4;
  bool ok = true;
  while (ok && counts.frameErrors.load() < o.minErrors) {
    std::uint32_t count = 0;
    for (; count < o.batch; ++count) {
      const std::uint64_t frame = counts.nextFrame.fetch_add(1);
      if (frame >= o.maxFrames) break;
      frameNumbers[count] = frame;
      Frame& f = frames[count];
      ok = ok && makeFrame(o, channel, pointSeed, frame, f);
      in[count] = {
          o.K, o.iterations, 1, 0, f.soft[0].data(), N, f.soft[1].data(), N, f.soft[2].data(), N, 0,
          0};
      out[count] = {0, 0, f.decided.data(), o.K};
    }
    if (count == 0) break;
    ok = ok && vexlon_ip_corvane_bitacc_simulate_batch(model, in.data(), count, out.data()) == 0;
    for (std::uint32_t i = 0; ok && i < count; ++i) {
      std::uint32_t errors = 0;
      for (std::uint32_t k = 0; k < o.K; ++k) errors += frames[i].decided[k] != frames[i].c[k];
      counts.bitErrors[frameNumbers[i]] = errors;
      if (errors != 0) counts.frameErrors.fetch_add(1);
    }
  }
  vexlon_ip_corvane_destroy_state(model);
  return ok;
}

}  // namespace

int main(int argc, char** argv) {
  Options o;
  int status = 0;
  if (!parse(argc, argv, o, status)) {
    return status;
  }
  const double rate = static_cast<double>(o.K) / (3.0 * o.K + 12.0);
  const char* paths[] = {"automatic", "scalar", "vector"};
  std::printf(
      "# K %u, algorithm %u, units %u, iterations %u, extrinsic bits %u,"
      " scale %.3g raw/LLR, correction for %u steps/unit, %s decoder, batch %u,"
      " BPSK over AWGN, rate %u/%u\n",
      o.K, o.algorithm, o.units, o.iterations, o.extrinsicBits, o.scale, o.steps, paths[o.path],
      o.batch, o.K, 3 * o.K + 12);
  std::printf("# stop at %llu frame errors or %llu frames\n",
              static_cast<unsigned long long>(o.minErrors),
              static_cast<unsigned long long>(o.maxFrames));
  std::printf("| Eb/N0 (dB) | frames | frame errors | FER | BER |\n|---|---|---|---|---|\n");
  std::fflush(stdout);
  for (int point = 0;; ++point) {
    const double ebN0Db = o.from + point * o.step;
    if (ebN0Db > o.to + 1e-9) break;
    const double esN0Db = ebN0Db + 10.0 * std::log10(rate);
    Counts counts(o.maxFrames);
    std::vector<std::thread> workers;
    std::atomic<bool> failed{false};
    const std::uint64_t pointSeed = mix(o.seed * 1000 + static_cast<std::uint64_t>(point));
    for (unsigned t = 0; t < o.threads; ++t) {
      workers.emplace_back([&] {
        if (!runWorker(o, esN0Db, pointSeed, counts)) failed = true;
      });
    }
    for (std::thread& worker : workers) worker.join();
    if (failed) {
      std::fprintf(stderr, "turbo_fer: the model refused the configuration or a frame\n");
      return 1;
    }
    // The point counts frames 0..F-1, F the first frame count with enough frame errors (or
    // every frame drawn): the same table for any number of threads and batch size.
    std::uint64_t frames = 0, frameErrors = 0, bitErrors = 0;
    const std::uint64_t drawn = std::min<std::uint64_t>(counts.nextFrame.load(), o.maxFrames);
    while (frames < drawn && frameErrors < o.minErrors) {
      bitErrors += counts.bitErrors[frames];
      frameErrors += counts.bitErrors[frames] != 0 ? 1 : 0;
      ++frames;
    }
    std::printf("| %.2f | %llu | %llu | %.3e | %.3e |\n", ebN0Db,
                static_cast<unsigned long long>(frames),
                static_cast<unsigned long long>(frameErrors),
                static_cast<double>(frameErrors) / static_cast<double>(frames),
                static_cast<double>(bitErrors) / (static_cast<double>(frames) * o.K));
    std::fflush(stdout);
  }
  return 0;
}
