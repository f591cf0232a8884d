// The arrays a caller owns for one shared-channel call, and the outputs record pointing at
// them: every capacity at least 1 and at most kMaxCapacity, so that sizes read from a file
// never allocate beyond what a call can use.
#ifndef BRANNOC_SIM_CALLBUFFERS_H
#define BRANNOC_SIM_CALLBUFFERS_H

#include <array>
#include <cstdint>
#include <vector>

#include "vexlon_ip_brannoc_bitacc_cmodel.h"

namespace brannoc::sim {

class SharedOutputs {
 public:
  static constexpr std::uint32_t kMaxCapacity = 1u << 20;
  static constexpr std::uint32_t kCodeBlockFlags = 64;  // more than the largest block needs

  // Sizes the arrays for the control fields and the HARQ length, and returns the record
  // pointing at them (its results zeroed).
  vexlon_ip_brannoc_SCH_outputs& prepare(const vexlon_ip_brannoc_SCH_controlData& control,
                                         std::uint32_t harqLength);

  vexlon_ip_brannoc_SCH_outputs record{};
  std::vector<std::uint8_t> data, cqi, ack, ri, codeBlocks;
  std::array<std::vector<std::int32_t>, 3> harq;  // sys, p0, p1
};

}  // namespace brannoc::sim

#endif
