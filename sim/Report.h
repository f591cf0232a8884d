// The results of a sweep as CSV (the counts only, identical for every thread count) and as
// JSON (the configuration, the counts and the decoder's speed).
#ifndef BRANNOC_SIM_REPORT_H
#define BRANNOC_SIM_REPORT_H

#include <string>

#include "sim/Sweep.h"

namespace brannoc::sim {

// One row per (curve, SNR point): curve, snr_db, blocks, transmissions, bler_1..bler_N (BLER
// after each transmission; N the largest maximum of the curves, empty beyond a curve's own),
// throughput_mbps, cqi_error_rate, ack_error_rate, ri_error_rate (empty without that UCI).
std::string formatCsv(const SweepConfig& config, const SweepResult& result);

std::string formatJson(const SweepConfig& config, const SweepResult& result);

// The largest number of transmissions of the curves (1 for PUCCH).
std::uint32_t maxTransmissionsOf(const SweepConfig& config);

// The error rate of a UCI field over the point's transmissions, or a negative value when
// the curve sends no such field.
double uciErrorRate(const PointResult& point, std::uint64_t errors, std::uint32_t bits);

}  // namespace brannoc::sim

#endif
