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
#include "SimOptions.h"
#include "sim/Report.h"
#include "vectors/VectorFile.h"

namespace brannoc::tool {

namespace {

namespace fs = std::filesystem;

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
        row += k < p.failedAfter.size() ? fmt::format(" {:>8.4f}", p.bler(k))
                                        : fmt::format(" {:>8}", "");
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
  const std::string workers = ranks > 1
                                  ? fmt::format("{} processes of {} threads", ranks, config.threads)
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
  std::string python = chosen != nullptr                ? chosen
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
  if (std::string error; !sweepConfig(o, config, error)) {
    fmt::print(stderr, "brannoc sim: {}\n", error);
    return 2;
  }
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
    result = sim::runSweep(
        config, [&](double fraction) { bar.update(fraction); }, processes.distribution());
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
  addSimOptions(*sim, *options);
  sim->callback([options, &status, &processes] { status = runSim(*options, processes); });
}

}  // namespace brannoc::tool
