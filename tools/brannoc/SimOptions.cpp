// The options of a simulation and the sweep they describe.
#include "SimOptions.h"

#include <cmath>
#include <cstdio>

namespace brannoc::tool {

namespace {

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

}  // namespace

void addSimOptions(CLI::App& app, SimOptions& o) {
  o.link.add(app);
  app.add_option("--snr", o.snr, "SNR points in dB: values and FROM:TO:STEP ranges")
      ->delimiter(',')
      ->capture_default_str();
  app.add_option("--blocks", o.blocks, "transport blocks per point at most")->capture_default_str();
  app.add_option("--errors", o.errors,
                 "first-transmission block errors that end a point (checked after each batch; "
                 "0: always --blocks)")
      ->capture_default_str();
  app.add_option("--batch", o.batch, "blocks between two checks of --errors")
      ->check(CLI::PositiveNumber)
      ->capture_default_str();
  app.add_option("--threads", o.threads, "worker threads")
      ->check(CLI::Range(1u, 256u))
      ->capture_default_str();
  app.add_option("--seed", o.seed, "seed of every payload and noise draw")->capture_default_str();
  app.add_option("-o,--out", o.out,
                 "folder for bler.csv, bler.json and bler.png (unless given one by one)");
  app.add_option("--csv", o.csv, "write the counts as CSV to this file");
  app.add_option("--json", o.json, "write configuration, counts and speed as JSON");
  app.add_option("--plot", o.plot, "draw BLER and throughput against SNR into this PNG");
  app.add_flag("-q,--quiet", o.quiet, "no progress bar");
}

bool sweepConfig(const SimOptions& o, sim::SweepConfig& config, std::string& error) {
  if (!o.link.curves(config.curves, error)) {
    return false;
  }
  if (!snrPoints(o.snr, config.snrDb)) {
    error = "--snr takes values and ranges FROM:TO:STEP (STEP > 0)";
    return false;
  }
  config.maxBlocks = o.blocks;
  config.targetErrors = o.errors;
  config.batchBlocks = o.batch;
  config.seed = o.seed;
  config.threads = o.threads;
  return true;
}

}  // namespace brannoc::tool
