// The processes of a run: one for a plain run, several under mpirun when the tool is built
// with MPI (Open MPI). Rank 0 prints and writes; the other ranks work silently, and every
// rank takes its share of a simulation through the engine's Distribution.
#ifndef BRANNOC_TOOLS_PROCESSES_H
#define BRANNOC_TOOLS_PROCESSES_H

#include <string>

#include "sim/Sweep.h"

namespace brannoc::tool {

class Processes {
 public:
  // Starts MPI when the tool has it (a plain start gives one rank); ranks other than 0 lose
  // their standard output and error streams.
  Processes(int& argc, char**& argv);
  ~Processes();
  Processes(const Processes&) = delete;
  Processes& operator=(const Processes&) = delete;

  unsigned rank() const { return itsRank; }
  unsigned ranks() const { return itsRanks; }
  // The exchange of a simulation shared by the ranks; null for a run of one process.
  const sim::Distribution* distribution() const {
    return itsRanks > 1 ? &itsDistribution : nullptr;
  }
  // "" when every rank was started with rank 0's command line, else the message to print
  // (on rank 0) before every rank leaves: ranks of other commands would not add up to one
  // run, and one that failed to parse its options alone would leave the others waiting.
  const std::string& differingCommand() const { return itsDiffering; }

 private:
  unsigned itsRank = 0;
  unsigned itsRanks = 1;
  bool itsStarted = false;
  std::string itsDiffering;
  sim::Distribution itsDistribution;
};

}  // namespace brannoc::tool

#endif
