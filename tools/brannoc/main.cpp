// brannoc: link-level simulation through the decoder library, and vector files for test
// benches (generate them from the transmitter, decode them through the C interface).
#include <cstdio>
#include <exception>

#include "Commands.h"

#ifndef BRANNOC_VERSION
#define BRANNOC_VERSION "unknown"
#endif

int main(int argc, char** argv) {
  const brannoc::tool::Processes processes(argc, argv);
  if (!processes.differingCommand().empty()) {
    std::fprintf(stderr, "brannoc: %s\n", processes.differingCommand().c_str());
    return 2;
  }
  try {
    CLI::App app{
        "brannoc: link-level simulation and test vectors for the LTE uplink channel "
        "decoder model"};
    app.set_version_flag("--version", "brannoc " BRANNOC_VERSION);
    app.require_subcommand(1);
    int status = 0;
    brannoc::tool::addSimCommand(app, status, processes);
    brannoc::tool::addGenCommand(app, status, processes);
    brannoc::tool::addDecodeCommand(app, status, processes);
    CLI11_PARSE(app, argc, argv);
    return status;
  } catch (const std::exception& e) {
    std::fprintf(stderr, "brannoc: %s\n", e.what());
    return 2;
  }
}
