// The subcommands of brannoc. Each add function registers its subcommand, whose callback
// runs it and leaves the process's exit status in status.
#ifndef BRANNOC_TOOLS_COMMANDS_H
#define BRANNOC_TOOLS_COMMANDS_H

#include <CLI/CLI.hpp>

namespace brannoc::tool {

void addSimCommand(CLI::App& app, int& status);
void addGenCommand(CLI::App& app, int& status);
void addDecodeCommand(CLI::App& app, int& status);

}  // namespace brannoc::tool

#endif
