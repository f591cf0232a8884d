// The link options shared by `brannoc sim` and `brannoc gen`: channel, PRBs, modulation,
// cyclic prefix, MCS or transport-block size, redundancy versions, transmissions, turbo
// iterations, the generics and the UCI sizes. Each takes a comma-separated list; sim runs
// one curve per combination of the listed values, gen takes exactly one.
#ifndef BRANNOC_TOOLS_LINKOPTIONS_H
#define BRANNOC_TOOLS_LINKOPTIONS_H

#include <CLI/CLI.hpp>
#include <functional>
#include <string>
#include <vector>

#include "sim/Sweep.h"

namespace brannoc::tool {

class LinkOptions {
 public:
  // Adds the options to command.
  void add(CLI::App& command);

  // One curve per combination of the values, labelled by the options given more than one
  // value; false with a message when a value is refused.
  bool curves(std::vector<sim::Curve>& curves, std::string& error) const;

 private:
  // The settings a link is made of, before the MCS is turned into Qm and TBS.
  struct Draft {
    sim::LinkConfig link;
    int mcs = -1;
  };
  // One option: its values, and how one value changes a draft.
  struct Dimension {
    std::string name;
    const std::vector<std::string>* values;
    std::function<bool(const std::string&, Draft&)> apply;
  };
  std::vector<Dimension> dimensions() const;

  std::string itsChannel = "pusch";
  std::vector<std::string> itsPrb{"6"}, itsModulation{"qpsk"}, itsCp{"normal"}, itsMcs{"10"},
      itsTbs, itsRv{"0231"}, itsMaxTx{"4"}, itsIterations{"6"}, itsPu{"2"}, itsAlgorithm{"1"},
      itsCqiPu{"1"}, itsCqi{"0"}, itsAck{"0"}, itsRi{"0"};
  double itsLlrScale = 1.0;
};

// Parses an unsigned number, entirely; false otherwise.
bool parseUnsigned(const std::string& text, std::uint32_t& value);

}  // namespace brannoc::tool

#endif
