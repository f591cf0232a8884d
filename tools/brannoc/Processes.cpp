// Processes of a run, with MPI when the tool is built with it (BRANNOC_WITH_MPI).
#include "Processes.h"

#include <cstdio>
#include <cstdlib>
#include <vector>

#ifdef BRANNOC_WITH_MPI
#include <mpi.h>
#endif

namespace brannoc::tool {

namespace {

#ifdef BRANNOC_WITH_MPI
// The longest error text exchanged between ranks.
constexpr int kMessageBytes = 1024;

void sumAcross(std::vector<std::uint64_t>& counts, std::vector<double>& seconds) {
  MPI_Allreduce(MPI_IN_PLACE, counts.data(), static_cast<int>(counts.size()), MPI_UINT64_T, MPI_SUM,
                MPI_COMM_WORLD);
  MPI_Allreduce(MPI_IN_PLACE, seconds.data(), static_cast<int>(seconds.size()), MPI_DOUBLE, MPI_SUM,
                MPI_COMM_WORLD);
}

// The error text of the lowest rank that has one, broadcast from it.
std::string firstAcross(const std::string& error, int rank, int ranks) {
  int mine = error.empty() ? ranks : rank;
  int first = ranks;
  MPI_Allreduce(&mine, &first, 1, MPI_INT, MPI_MIN, MPI_COMM_WORLD);
  if (first == ranks) return {};
  std::vector<char> text(kMessageBytes, '\0');
  if (rank == first) {
    error.copy(text.data(), kMessageBytes - 1);
  }
  MPI_Bcast(text.data(), kMessageBytes, MPI_CHAR, first, MPI_COMM_WORLD);
  return "rank " + std::to_string(first) + ": " + std::string(text.data());
}
#endif

}  // namespace

Processes::Processes(int& argc, char**& argv) {
#ifdef BRANNOC_WITH_MPI
  int provided = 0;
  // MPI only under a launcher (mpirun sets OMPI_COMM_WORLD_SIZE, PMIx launchers PMIX_RANK):
  // a plain start would make Open MPI start its daemon, half a second for every command.
  // Worker threads make the exchange one at a time, from whichever finishes a round.
  const bool launched = std::getenv("OMPI_COMM_WORLD_SIZE") != nullptr ||
                        std::getenv("PMIX_RANK") != nullptr || std::getenv("PMI_RANK") != nullptr;
  if (launched && MPI_Init_thread(&argc, &argv, MPI_THREAD_SERIALIZED, &provided) == MPI_SUCCESS) {
    itsStarted = true;
    int rank = 0, ranks = 1;
    MPI_Comm_rank(MPI_COMM_WORLD, &rank);
    MPI_Comm_size(MPI_COMM_WORLD, &ranks);
    itsRank = static_cast<unsigned>(rank);
    itsRanks = static_cast<unsigned>(ranks);
    itsDistribution.rank = itsRank;
    itsDistribution.ranks = itsRanks;
    itsDistribution.sum = sumAcross;
    itsDistribution.firstError = [rank, ranks](const std::string& error) {
      return firstAcross(error, rank, ranks);
    };
    // The command line (its length and a hash) against rank 0's.
    std::string command;
    for (int a = 1; a < argc; ++a) command.append(argv[a]).push_back('\0');
    std::uint64_t hash = 1469598103934665603ULL;
    for (const char c : command) hash = (hash ^ static_cast<unsigned char>(c)) * 1099511628211ULL;
    const std::uint64_t mine[2] = {hash, command.size()};
    std::uint64_t first[2] = {mine[0], mine[1]};
    MPI_Bcast(first, 2, MPI_UINT64_T, 0, MPI_COMM_WORLD);
    const bool same = mine[0] == first[0] && mine[1] == first[1];
    itsDiffering = firstAcross(same ? "" : "started with other options than rank 0", rank, ranks);
  }
#else
  (void)argc;
  (void)argv;
#endif
  if (itsRank != 0) {
    std::freopen("/dev/null", "w", stdout);
    std::freopen("/dev/null", "w", stderr);
  }
}

Processes::~Processes() {
#ifdef BRANNOC_WITH_MPI
  if (itsStarted) MPI_Finalize();
#endif
}

}  // namespace brannoc::tool
