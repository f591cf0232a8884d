// CSV by hand (fixed columns), JSON through nlohmann::json.
#include "sim/Report.h"

#include <algorithm>
#include <cstdio>
#include <nlohmann/json.hpp>

namespace brannoc::sim {

namespace {

std::string number(double value) {
  char text[32];
  std::snprintf(text, sizeof text, "%.6g", value);
  return text;
}

std::string csvText(const std::string& text) {
  if (text.find_first_of(",\"\n") == std::string::npos) return text;
  std::string quoted = "\"";
  for (char c : text) quoted += c == '"' ? std::string("\"\"") : std::string(1, c);
  return quoted + "\"";
}

std::uint32_t transmissionsOf(const LinkConfig& link) {
  return link.channel == Channel::Pusch ? link.maxTransmissions : 1;
}

}  // namespace

std::uint32_t maxTransmissionsOf(const SweepConfig& config) {
  std::uint32_t n = 1;
  for (const Curve& c : config.curves) n = std::max(n, transmissionsOf(c.link));
  return n;
}

double uciErrorRate(const PointResult& point, std::uint64_t errors, std::uint32_t bits) {
  if (bits == 0 || point.uciTransmissions == 0) return -1.0;
  return static_cast<double>(errors) / static_cast<double>(point.uciTransmissions);
}

std::string formatCsv(const SweepConfig& config, const SweepResult& result) {
  const std::uint32_t n = maxTransmissionsOf(config);
  std::string csv = "curve,snr_db,blocks,transmissions";
  for (std::uint32_t k = 1; k <= n; ++k) csv += ",bler_" + std::to_string(k);
  csv += ",throughput_mbps,cqi_error_rate,ack_error_rate,ri_error_rate\n";
  for (const PointResult& p : result.points) {
    const LinkConfig& link = config.curves[p.curve].link;
    csv += csvText(config.curves[p.curve].label) + "," + number(p.snrDb) + "," +
           std::to_string(p.blocks) + "," + std::to_string(p.transmissions);
    for (std::uint32_t k = 0; k < n; ++k) {
      csv += "," + (k < p.failedAfter.size() ? number(p.bler(k)) : std::string());
    }
    csv += "," + number(p.throughputMbps());
    const std::pair<std::uint64_t, std::uint32_t> uci[] = {
        {p.cqiErrors, link.cqiBits}, {p.ackErrors, link.ackBits}, {p.riErrors, link.riBits}};
    for (const auto& [errors, bits] : uci) {
      const double rate = uciErrorRate(p, errors, bits);
      csv += "," + (rate < 0 ? std::string() : number(rate));
    }
    csv += "\n";
  }
  return csv;
}

std::string formatJson(const SweepConfig& config, const SweepResult& result) {
  using nlohmann::json;
  json curves = json::array();
  for (const Curve& c : config.curves) {
    const LinkConfig& l = c.link;
    curves.push_back({{"label", c.label},
                      {"channel", l.channel == Channel::Pusch ? "pusch" : "pucch"},
                      {"prb", l.numPrb},
                      {"qm", l.Qm},
                      {"cp", l.cp == tx::CyclicPrefix::Normal ? "normal" : "extended"},
                      {"tbs", l.tbSize},
                      {"rv_sequence", l.rvSequence},
                      {"max_transmissions", transmissionsOf(l)},
                      {"iterations", l.iterations},
                      {"C_NUM_PU", l.generics.C_NUM_PU},
                      {"C_ALGORITHM_TYPE", l.generics.C_ALGORITHM_TYPE},
                      {"C_NUM_CQI_PU", l.generics.C_NUM_CQI_PU},
                      {"cqi_bits", l.cqiBits},
                      {"ack_bits", l.ackBits},
                      {"ri_bits", l.riBits},
                      {"llr_scale", l.llrScale},
                      {"points", json::array()}});
  }
  for (const PointResult& p : result.points) {
    const LinkConfig& l = config.curves[p.curve].link;
    json bler = json::array();
    for (std::size_t k = 0; k < p.failedAfter.size(); ++k) bler.push_back(p.bler(k));
    const auto rate = [&](std::uint64_t errors, std::uint32_t bits) -> json {
      const double r = uciErrorRate(p, errors, bits);
      return r < 0 ? json(nullptr) : json(r);
    };
    curves[p.curve]["points"].push_back({{"snr_db", p.snrDb},
                                         {"blocks", p.blocks},
                                         {"transmissions", p.transmissions},
                                         {"failed_after", p.failedAfter},
                                         {"bler", bler},
                                         {"throughput_mbps", p.throughputMbps()},
                                         {"cqi_error_rate", rate(p.cqiErrors, l.cqiBits)},
                                         {"ack_error_rate", rate(p.ackErrors, l.ackBits)},
                                         {"ri_error_rate", rate(p.riErrors, l.riBits)},
                                         {"decode_mbps_per_thread", p.decodeMbps()}});
  }
  const json document = {{"snr", "Es/N0 of the modulation symbols, dB"},
                         {"seed", config.seed},
                         {"max_blocks", config.maxBlocks},
                         {"target_errors", config.targetErrors},
                         {"batch_blocks", config.batchBlocks},
                         {"threads", config.threads},
                         {"wall_seconds", result.wallSeconds},
                         {"curves", curves}};
  return document.dump(2) + "\n";
}

}  // namespace brannoc::sim
