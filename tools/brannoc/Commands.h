// The subcommands of brannoc. Each add function registers its subcommand, whose callback
// runs it and leaves the process's exit status in status. Under mpirun a simulation is shared
// by the processes; the other subcommands run on rank 0 only.
#ifndef BRANNOC_TOOLS_COMMANDS_H
#define BRANNOC_TOOLS_COMMANDS_H

#include <CLI/CLI.hpp>

#include "Processes.h"

namespace brannoc::tool {

void addSimCommand(CLI::App& app, int& status, const Processes& processes);
void addGenCommand(CLI::App& app, int& status, const Processes& processes);
void addDecodeCommand(CLI::App& app, int& status, const Processes& processes);

}  // namespace brannoc::tool

#endif
