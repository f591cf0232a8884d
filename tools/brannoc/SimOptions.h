// The options of a simulation (brannoc sim and the Python package's sweep): the link options
// of every curve, the SNR sweep, the stopping rule, threads, seed and output files, and the
// engine's configuration they describe.
#ifndef BRANNOC_TOOLS_SIMOPTIONS_H
#define BRANNOC_TOOLS_SIMOPTIONS_H

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cstdint>
#include <string>
#include <thread>
#include <vector>

#include "LinkOptions.h"
#include "sim/Sweep.h"

namespace brannoc::tool {

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

// Registers every option of a simulation on app.
void addSimOptions(CLI::App& app, SimOptions& o);

// The sweep the options describe; false, with the message, when they describe none.
bool sweepConfig(const SimOptions& o, sim::SweepConfig& config, std::string& error);

}  // namespace brannoc::tool

#endif
