// The link options and their expansion into curves.
#include "LinkOptions.h"

#include <charconv>

#include "sim/Mcs.h"

namespace brannoc::tool {

bool parseUnsigned(const std::string& text, std::uint32_t& value) {
  const char* end = text.data() + text.size();
  const auto [ptr, ec] = std::from_chars(text.data(), end, value);
  return !text.empty() && ec == std::errc() && ptr == end;
}

namespace {

// An apply function that reads an unsigned value and hands it to set.
template <typename Set>
auto number(Set set) {
  return [set](const std::string& text, auto& draft) {
    std::uint32_t value = 0;
    return parseUnsigned(text, value) && set(value, draft);
  };
}

}  // namespace

void LinkOptions::add(CLI::App& command) {
  const auto list = [&](const std::string& name, std::vector<std::string>& values,
                        const std::string& help) {
    command.add_option(name, values, help)
        ->delimiter(',')
        ->type_name("LIST")
        ->capture_default_str();
  };
  command.add_option("--channel", itsChannel, "pusch, or pucch (format 2 CQI with ACK)")
      ->check(CLI::IsMember({"pusch", "pucch"}))
      ->capture_default_str();
  list("--prb", itsPrb, "PRBs of the PUSCH allocation (1..110)");
  auto* mcs = command.add_option("--mcs", itsMcs,
                                 "MCS index 0..28: Qm and TBS from TS 36.213 Tables 8.6.1-1 "
                                 "and 7.1.7.2.1-1 with the PRB count");
  mcs->delimiter(',')->type_name("LIST")->capture_default_str();
  auto* tbs = command.add_option("--tbs", itsTbs,
                                 "transport-block size in bits, instead of --mcs (with "
                                 "--modulation)");
  tbs->delimiter(',')->type_name("LIST");
  tbs->excludes(mcs);
  list("--modulation", itsModulation, "qpsk, 16qam or 64qam, with --tbs");
  list("--cp", itsCp, "cyclic prefix: normal or extended");
  list("--rv", itsRv,
       "redundancy versions of the transmissions in turn, as digits (0231: rv 0, 2, 3, 1)");
  list("--max-tx", itsMaxTx, "transmissions of a transport block at most (HARQ), 1..16");
  list("--iterations", itsIterations, "turbo-decoder iterations (SCH_TD_ITER), 1..15");
  list("--pu", itsPu, "C_NUM_PU: turbo processing units, 1, 2, 4 or 8");
  list("--algorithm", itsAlgorithm,
       "C_ALGORITHM_TYPE: 0 max-log-MAP, 1 scaled max-log-MAP, 2 log-MAP");
  list("--cqi-pu", itsCqiPu, "C_NUM_CQI_PU: CQI processing units, 1..4");
  list("--cqi", itsCqi, "CQI bits per transmission (PUSCH 0..127, PUCCH 0..13)");
  list("--ack", itsAck, "HARQ-ACK bits per transmission, 0..2");
  list("--ri", itsRi, "RI bits per transmission, 0..2 (PUSCH)");
  command
      .add_option("--llr-scale", itsLlrScale,
                  "soft value = round(32 * scale * LLR), saturated to -128..127")
      ->check(CLI::PositiveNumber)
      ->capture_default_str();
}

std::vector<LinkOptions::Dimension> LinkOptions::dimensions() const {
  using D = Draft;
  const auto generic = [](std::uint32_t vexlon_ip_brannoc_generics::*field) {
    return number([field](std::uint32_t v, D& d) { return (d.link.generics.*field = v, true); });
  };
  const auto within = [](std::uint32_t sim::LinkConfig::*field, std::uint32_t least,
                         std::uint32_t most) {
    return number(
        [=](std::uint32_t v, D& d) { return (d.link.*field = v, v >= least && v <= most); });
  };
  return {
      {"prb", &itsPrb, within(&sim::LinkConfig::numPrb, 1, 110)},
      {"modulation", &itsModulation,
       [](const std::string& v, D& d) {
         d.link.Qm = v == "qpsk" ? 2 : v == "16qam" ? 4 : v == "64qam" ? 6 : 0;
         return d.link.Qm != 0;
       }},
      {"mcs", &itsMcs, number([](std::uint32_t v, D& d) { return (d.mcs = int(v), v <= 28); })},
      {"tbs", &itsTbs, within(&sim::LinkConfig::tbSize, 0, 262143)},
      {"cp", &itsCp,
       [](const std::string& v, D& d) {
         d.link.cp = v == "extended" ? tx::CyclicPrefix::Extended : tx::CyclicPrefix::Normal;
         return v == "normal" || v == "extended";
       }},
      {"rv", &itsRv,
       [](const std::string& v, D& d) {
         d.link.rvSequence.clear();
         for (char c : v) {
           if (c < '0' || c > '3') return false;
           d.link.rvSequence.push_back(static_cast<std::uint32_t>(c - '0'));
         }
         return !v.empty();
       }},
      {"max-tx", &itsMaxTx, number([](std::uint32_t v, D& d) {
         return (d.link.maxTransmissions = v, v >= 1 && v <= 16);
       })},
      {"iterations", &itsIterations, within(&sim::LinkConfig::iterations, 1, 15)},
      {"pu", &itsPu, generic(&vexlon_ip_brannoc_generics::C_NUM_PU)},
      {"algorithm", &itsAlgorithm, generic(&vexlon_ip_brannoc_generics::C_ALGORITHM_TYPE)},
      {"cqi-pu", &itsCqiPu, generic(&vexlon_ip_brannoc_generics::C_NUM_CQI_PU)},
      {"cqi", &itsCqi, within(&sim::LinkConfig::cqiBits, 0, 127)},
      {"ack", &itsAck, within(&sim::LinkConfig::ackBits, 0, 2)},
      {"ri", &itsRi, within(&sim::LinkConfig::riBits, 0, 2)},
  };
}

bool LinkOptions::curves(std::vector<sim::Curve>& curves, std::string& error) const {
  const bool pucch = itsChannel == "pucch";
  std::vector<Dimension> dims = dimensions();
  std::erase_if(dims, [&](const Dimension& d) {
    if (pucch)
      return d.name == "prb" || d.name == "modulation" || d.name == "mcs" || d.name == "tbs" ||
             d.name == "rv" || d.name == "max-tx" || d.name == "ri";
    return d.name == (itsTbs.empty() ? "modulation" : "mcs") || d.values->empty();
  });
  curves.clear();
  std::vector<std::size_t> index(dims.size(), 0);
  for (;;) {
    Draft draft;
    draft.link.channel = pucch ? sim::Channel::Pucch : sim::Channel::Pusch;
    draft.link.llrScale = itsLlrScale;
    std::string label;
    for (std::size_t i = 0; i < dims.size(); ++i) {
      const std::string& value = (*dims[i].values)[index[i]];
      if (!dims[i].apply(value, draft)) {
        error = "--" + dims[i].name + ": '" + value + "' is not a value it takes";
        return false;
      }
      if (dims[i].values->size() > 1)
        label += (label.empty() ? "" : " ") + dims[i].name + "=" + value;
    }
    if (draft.mcs >= 0) {
      const auto mcs = sim::uplinkMcs(static_cast<std::uint32_t>(draft.mcs));
      const auto tbs = mcs ? sim::transportBlockSize(mcs->iTbs, draft.link.numPrb) : std::nullopt;
      if (!tbs) {
        error = "--mcs " + std::to_string(draft.mcs) + " has no transport block for " +
                std::to_string(draft.link.numPrb) + " PRBs";
        return false;
      }
      draft.link.Qm = mcs->Qm;
      draft.link.tbSize = *tbs;
    }
    if (pucch) draft.link.maxTransmissions = 1;
    if (label.empty()) {
      label = pucch ? "pucch cqi=" + std::to_string(draft.link.cqiBits) +
                          " ack=" + std::to_string(draft.link.ackBits)
                    : "pusch prb=" + std::to_string(draft.link.numPrb) +
                          " qm=" + std::to_string(draft.link.Qm) +
                          " tbs=" + std::to_string(draft.link.tbSize);
    }
    curves.push_back({label, draft.link});
    // The next combination, the last option varying fastest.
    std::size_t i = dims.size();
    while (i > 0 && ++index[i - 1] == dims[i - 1].values->size()) index[--i] = 0;
    if (i == 0) return true;
  }
}

}  // namespace brannoc::tool
