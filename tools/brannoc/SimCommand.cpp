// brannoc sim: the sweep, its table on the terminal, CSV, JSON and the plot.
#include <fmt/format.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <thread>

#include "Commands.h"
#include "LinkOptions.h"
#include "Progress.h"
#include "sim/Report.h"
#include "vectors/VectorFile.h"

namespace brannoc::tool {

namespace {

namespace fs = std::filesystem;

struct SimOptions {
  LinkOptions link;
  std::vector<std::string> snr{"1:3.75:0.25"};
  std::uint64_t blocks = 10000;
  std::uint64_t errors = 100;
  std::uint64_t batch = 100;
  std::uint64_t seed = 1;
  unsigned threads = std::max(1u, std::thread::hardware_concurrency());
  std::string out, csv, json, plot;
  bool quiet = false;
};

// "a:b:step" from a to b, or a single value; false when unreadable.
bool snrPoints(const std::vector<std::string>& items, std::vector<double>& points) {
  for (const std::string& item : items) {
    double from = 0, to = 0, step = 1;
    char tail = 0;
    if (std::sscanf(item.c_str(), "%lf:%lf:%lf%c", &from, &to, &step, &tail) == 3) {
      if (!(step > 0) || !(to >= from) || (to - from) / step > 1000) return false;
      for (int i = 0; from + i * step <= to + step * 1e-6; ++i) {
        points.push_back(std::round((from + i * step) * 1e6) / 1e6);
      }
    } else if (std::sscanf(item.c_str(), "%lf%c", &from, &tail) == 1 && std::isfinite(from)) {
      points.push_back(from);
    } else {
      return false;
    }
  }
  return !points.empty();
}

std::string rate(double r) { return r < 0 ? "-" : fmt::format("{:.4f}", r); }

void printTable(const sim::SweepConfig& config, const sim::SweepResult& result, unsigned ranks) {
  const std::uint32_t n = sim::maxTransmissionsOf(config);
  for (std::size_t c = 0; c < config.curves.size(); ++c) {
    const sim::LinkConfig& l = config.curves[c].link;
    const bool uci = l.cqiBits + l.ackBits + l.riBits > 0;
    fmt::print("\n{}: {} iterations, C_NUM_PU {}, C_ALGORITHM_TYPE {}\n", config.curves[c].label,
               l.iterations, l.generics.C_NUM_PU, l.generics.C_ALGORITHM_TYPE);
    std::string head = fmt::format("{:>7} {:>7}", "SNR dB", "blocks");
    for (std::uint32_t k = 1; k <= n; ++k) head += fmt::format(" {:>8}", fmt::format("BLER{}", k));
    head += fmt::format(" {:>8}", "Mbit/s");
    if (uci) head += fmt::format(" {:>7} {:>7} {:>7}", "CQI err", "ACK err", "RI err");
    fmt::print("{} {:>10}\n", head, "dec Mbit/s");
    for (const sim::PointResult& p : result.points) {
      if (p.curve != c) continue;
      std::string row = fmt::format("{:>7.2f} {:>7}", p.snrDb, p.blocks);
      for (std::uint32_t k = 0; k < n; ++k) {
        row += k < p.failedAfter.size() ? fmt::format(" {:>8.4f}", p.bler(k)) : fmt::format(" {:>8}", "");
      }
      row += fmt::format(" {:>8.3f}", p.throughputMbps());
      if (uci) {
        row += fmt::format(" {:>7} {:>7} {:>7}", rate(sim::uciErrorRate(p, p.cqiErrors, l.cqiBits)),
                           rate(sim::uciErrorRate(p, p.ackErrors, l.ackBits)),
                           rate(sim::uciErrorRate(p, p.riErrors, l.riBits)));
      }
      fmt::print("{} {:>10.2f}\n", row, p.decodeMbps());
    }
  }
  std::uint64_t blocks = 0, bits = 0;
  for (const sim::PointResult& p : result.points) {
    blocks += p.blocks;
    bits += p.decodedBits;
  }
  const std::string workers = ranks > 1 ? fmt::format("{} processes of {} threads", ranks,
                                                      config.threads)
                                        : fmt::format("{} threads", config.threads);
  fmt::print("\n{} blocks in {:.1f} s on {} ({:.2f} Mbit/s decoded in all)\n", blocks,
             result.wallSeconds, workers,
             result.wallSeconds > 0 ? static_cast<double>(bits) / result.wallSeconds / 1e6 : 0.0);
}

// Runs the plot script that sits beside this program on a CSV file, with $BRANNOC_PYTHON, else
// the system's python3 (the one Debian's python3-matplotlib is for), else python3 from PATH;
// false with a message.
bool plot(const std::string& csv, const std::string& png) {
  std::error_code ec;
  const fs::path script = fs::read_symlink("/proc/self/exe", ec).parent_path() / "brannoc-plot";
  if (ec || !fs::exists(script)) {
    fmt::print(stderr, "brannoc: the plot script {} is missing\n", script.string());
    return false;
  }
  const char* chosen = std::getenv("BRANNOC_PYTHON");
  std::string python = chosen != nullptr ? chosen
                       : fs::exists("/usr/bin/python3") ? "/usr/bin/python3"
                                                        : "python3";
  std::string path = script.string(), in = csv, out = png;
  char* argv[] = {python.data(), path.data(), in.data(), out.data(), nullptr};
  pid_t pid = 0;
  int status = 0;
  std::fflush(stdout);
  if (posix_spawnp(&pid, python.c_str(), nullptr, nullptr, argv, environ) != 0 ||
      waitpid(pid, &status, 0) != pid || !WIFEXITED(status) || WEXITSTATUS(status) != 0) {
    fmt::print(stderr, "brannoc: the plot of {} could not be drawn ({} {})\n", csv, python, path);
    return false;
  }
  return true;
}

void makeParent(const std::string& path) {
  const fs::path parent = fs::path(path).parent_path();
  std::error_code ec;
  if (!parent.empty()) fs::create_directories(parent, ec);
}

bool writeResult(const std::string& path, const std::string& text) {
  if (path.empty()) return true;
  makeParent(path);
  const std::string error = vectors::writeTextFile(path, text);
  if (!error.empty()) fmt::print(stderr, "brannoc: {}\n", error);
  return error.empty();
}

int runSim(SimOptions& o, const Processes& processes) {
  sim::SweepConfig config;
  std::string error;
  if (!o.link.curves(config.curves, error)) {
    fmt::print(stderr, "brannoc sim: {}\n", error);
    return 2;
  }
  if (!snrPoints(o.snr, config.snrDb)) {
    fmt::print(stderr, "brannoc sim: --snr takes values and ranges FROM:TO:STEP (STEP > 0)\n");
    return 2;
  }
  config.maxBlocks = o.blocks;
  config.targetErrors = o.errors;
  config.batchBlocks = o.batch;
  config.seed = o.seed;
  config.threads = o.threads;
  if (!o.out.empty()) {
    const auto inOut = [&](std::string& path, const char* name) {
      if (path.empty()) path = (fs::path(o.out) / name).string();
    };
    inOut(o.csv, "bler.csv");
    inOut(o.json, "bler.json");
    inOut(o.plot, "bler.png");
  }
  sim::SweepResult result;
  {
    ProgressBar bar(!o.quiet && processes.rank() == 0);
    result = sim::runSweep(config, [&](double fraction) { bar.update(fraction); },
                           processes.distribution());
  }
  if (!result.error.empty()) {
    fmt::print(stderr, "brannoc sim: {}\n", result.error);
    return 1;
  }
  if (processes.rank() != 0) {
    return 0;  // rank 0 prints and writes the results of all
  }
  printTable(config, result, processes.ranks());
  const std::string csv = sim::formatCsv(config, result);
  bool ok = writeResult(o.csv, csv) && writeResult(o.json, sim::formatJson(config, result));
  if (ok && !o.plot.empty()) {
    std::string csvPath = o.csv;
    if (csvPath.empty()) {
      csvPath = (fs::temp_directory_path() / fmt::format("brannoc-{}.csv", getpid())).string();
      ok = writeResult(csvPath, csv);
    }
    makeParent(o.plot);
    ok = ok && plot(csvPath, o.plot);
    if (o.csv.empty()) fs::remove(csvPath);
  }
  for (const std::string& path : {o.csv, o.json, o.plot}) {
    if (ok && !path.empty()) fmt::print("wrote {}\n", path);
  }
  return ok ? 0 : 1;
}

}  // namespace

void addSimCommand(CLI::App& app, int& status, const Processes& processes) {
  auto options = std::make_shared<SimOptions>();
  CLI::App* sim = app.add_subcommand(
      "sim",
      "Link-level simulation over AWGN: BLER after each transmission, throughput and UCI "
      "error rates against SNR (Es/N0 of the modulation symbols). Every option that takes "
      "a list runs one curve per combination of its values.");
  options->link.add(*sim);
  sim->add_option("--snr", options->snr, "SNR points in dB: values and FROM:TO:STEP ranges")
      ->delimiter(',')
      ->capture_default_str();
  sim->add_option("--blocks", options->blocks, "transport blocks per point at most")
      ->capture_default_str();
  sim->add_option("--errors", options->errors,
                  "first-transmission block errors that end a point (checked after each batch; "
                  "0: always --blocks)")
      ->capture_default_str();
  sim->add_option("--batch", options->batch, "blocks between two checks of --errors")
      ->check(CLI::PositiveNumber)
      ->capture_default_str();
  sim->add_option("--threads", options->threads, "worker threads")
      ->check(CLI::Range(1u, 256u))
      ->capture_default_str();
  sim->add_option("--seed", options->seed, "seed of every payload and noise draw")
      ->capture_default_str();
  sim->add_option("-o,--out", options->out,
                  "folder for bler.csv, bler.json and bler.png (unless given one by one)");
  sim->add_option("--csv", options->csv, "write the counts as CSV to this file");
  sim->add_option("--json", options->json, "write configuration, counts and speed as JSON");
  sim->add_option("--plot", options->plot, "draw BLER and throughput against SNR into this PNG");
  sim->add_flag("-q,--quiet", options->quiet, "no progress bar");
  sim->callback([options, &status, &processes] {
    status = runSim(*options, processes);
  });
}

}  // namespace brannoc::tool
