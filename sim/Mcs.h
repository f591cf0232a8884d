// Uplink modulation and transport-block size from an MCS index and a PRB count: TS 36.213
// Table 8.6.1-1 (I_MCS -> Qm, I_TBS, redundancy version) and Table 7.1.7.2.1-1 (I_TBS and
// N_PRB -> TBS), read from tables/ul_mcs.csv and tables/tbs_table.csv.
#ifndef BRANNOC_SIM_MCS_H
#define BRANNOC_SIM_MCS_H

#include <cstdint>
#include <optional>

namespace brannoc::sim {

struct UplinkMcs {
  std::uint32_t Qm;    // 2, 4 or 6
  std::uint32_t iTbs;  // 0..26
};

// I_MCS 0..28; none for 29..31 (retransmission-only indices) and beyond.
std::optional<UplinkMcs> uplinkMcs(std::uint32_t iMcs);

// TBS for I_TBS 0..26 and N_PRB 1..110; none outside the table.
std::optional<std::uint32_t> transportBlockSize(std::uint32_t iTbs, std::uint32_t numPrb);

}  // namespace brannoc::sim

#endif
