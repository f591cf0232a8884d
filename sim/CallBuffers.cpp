#include "sim/CallBuffers.h"

#include <algorithm>

namespace brannoc::sim {

namespace {

template <typename T>
std::uint32_t sized(std::vector<T>& array, std::uint32_t size) {
  array.resize(std::clamp<std::uint32_t>(size, 1, SharedOutputs::kMaxCapacity));
  return static_cast<std::uint32_t>(array.size());
}

}  // namespace

vexlon_ip_brannoc_SCH_outputs& SharedOutputs::prepare(
    const vexlon_ip_brannoc_SCH_controlData& control, std::uint32_t harqLength) {
  record = {};
  record.max_SCH_data_out_size = sized(data, control.SCH_TBSIZE);
  record.max_SCH_CQI_out_size = sized(cqi, control.SCH_CQI_OP_SIZE);
  record.max_SCH_ACK_out_size = sized(ack, control.SCH_ACK_OP_SIZE);
  record.max_SCH_RI_out_size = sized(ri, control.SCH_RI_OP_SIZE);
  record.max_CW_CRC_out_size = sized(codeBlocks, kCodeBlockFlags);
  for (auto& h : harq) sized(h, harqLength);
  record.max_harq_buffer_size = std::min(harqLength, static_cast<std::uint32_t>(harq[0].size()));
  record.SCH_data_out = data.data();
  record.SCH_CQI_out = cqi.data();
  record.SCH_ACK_out = ack.data();
  record.SCH_RI_out = ri.data();
  record.CW_CRC_out = codeBlocks.data();
  record.sys_harq_buffer = harq[0].data();
  record.p0_harq_buffer = harq[1].data();
  record.p1_harq_buffer = harq[2].data();
  return record;
}

}  // namespace brannoc::sim
