// The two tables as constant arrays generated from tables/ at build time.
#include "sim/Mcs.h"

#include <algorithm>
#include <iterator>

namespace brannoc::sim {

namespace {

struct McsRow {
  int iMcs, Qm, iTbs, rv;
};
constexpr McsRow kUlMcs[] = {
#include "tables/ul_mcs.inc"
};

struct TbsRow {
  int iTbs, numPrb, tbs;
};
constexpr TbsRow kTbs[] = {
#include "tables/tbs_table.inc"
};

}  // namespace

std::optional<UplinkMcs> uplinkMcs(std::uint32_t iMcs) {
  const auto row = std::find_if(std::begin(kUlMcs), std::end(kUlMcs), [&](const McsRow& r) {
    return r.iMcs == static_cast<int>(iMcs) && r.Qm > 0;
  });
  if (row == std::end(kUlMcs)) return std::nullopt;
  return UplinkMcs{static_cast<std::uint32_t>(row->Qm), static_cast<std::uint32_t>(row->iTbs)};
}

std::optional<std::uint32_t> transportBlockSize(std::uint32_t iTbs, std::uint32_t numPrb) {
  const auto row = std::find_if(std::begin(kTbs), std::end(kTbs), [&](const TbsRow& r) {
    return r.iTbs == static_cast<int>(iTbs) && r.numPrb == static_cast<int>(numPrb);
  });
  if (row == std::end(kTbs)) return std::nullopt;
  return static_cast<std::uint32_t>(row->tbs);
}

}  // namespace brannoc::sim
