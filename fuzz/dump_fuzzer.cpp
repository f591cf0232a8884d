// libFuzzer harness of IUO_set_debugfn_state: up to four switches (key, channel, name bytes
// with zero bytes included) on one instance, then a control-channel and a shared-channel
// decode that write the dumps, all in a scratch folder emptied after each input. Every name
// starts with the scratch folder's path and a '/' in the fuzzed part becomes '_', so that no
// input writes outside the folder. The harness never changes the working directory: libFuzzer
// reads and writes its corpus by the paths it was given.
//
// Input: switch count byte; per switch a key word, a channel byte, a name length byte and the
// name; then a control-channel call (layout in FuzzCalls.h).
#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <string>

#include "FuzzCalls.h"

namespace {

// The scratch folder's path, kept in a plain array so that the exit handler that removes the
// (by then empty) folder never outlives it.
char scratchName[4096];

void removeScratch() { rmdir(scratchName); }

const std::filesystem::path& scratch() {
  static const std::filesystem::path folder = [] {
    const std::string name =
        (std::filesystem::temp_directory_path() / "brannoc-dump-fuzz-XXXXXX").string();
    if (name.size() >= sizeof scratchName) {
      std::abort();
    }
    name.copy(scratchName, name.size());
    if (mkdtemp(scratchName) == nullptr) {
      std::abort();
    }
    std::atexit(removeScratch);
    return std::filesystem::path(scratchName);
  }();
  return folder;
}

// The data-only call of a 1000-bit transport block, QPSK, 50 rows: enough to reach every
// shared-channel dump point but CQI's.
void decodeSharedChannel(vexlon_ip_brannoc_state* state) {
  static std::int32_t llr[1200];
  static std::uint8_t data[1000], small[8];
  static std::int32_t harq[3][1028];
  vexlon_ip_brannoc_SCH_inputs in{};
  in.tb_llr = llr;
  in.llr_size = 1200;
  in.controlData.SCH_IP_DATA_TYPE = 1;
  in.controlData.SCH_CH_INT_ROWS = 50;
  in.controlData.SCH_RM_E_MINUS = in.controlData.SCH_RM_E_PLUS = 1200;
  in.controlData.SCH_TBSIZE = 1000;
  in.controlData.SCH_TD_ITER = 1;
  in.controlData.SCH_ND = 1;
  vexlon_ip_brannoc_SCH_outputs out{};
  out.SCH_data_out = data;
  out.SCH_ACK_out = out.SCH_RI_out = out.SCH_CQI_out = out.CW_CRC_out = small;
  out.sys_harq_buffer = harq[0];
  out.p0_harq_buffer = harq[1];
  out.p1_harq_buffer = harq[2];
  out.max_harq_buffer_size = 1028;
  out.max_SCH_data_out_size = 1000;
  out.max_CW_CRC_out_size = 8;
  if (vexlon_ip_brannoc_SCH_bitacc_simulate(state, in, &out) != 0) {
    __builtin_trap();
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  scratch();
  brannoc::fuzz::FuzzInput in(data, size);
  vexlon_ip_brannoc_state* state =
      vexlon_ip_brannoc_create_state(vexlon_ip_brannoc_get_default_generics());
  const int switches = 1 + in.byte() % 4;
  for (int n = 0; n < switches; ++n) {
    const std::uint32_t key = in.word();
    const std::uint32_t channel = in.byte();
    std::string name = scratch().string() + '/';
    for (std::uint8_t length = in.byte() % 48; length > 0; --length) {
      const char c = static_cast<char>(in.byte());
      name += c == '/' ? '_' : c;
    }
    const std::uint32_t result = IUO_set_debugfn_state(state, key, channel, name.data(),
                                                       static_cast<std::uint32_t>(name.size()));
    if (result != ((key <= 32 && channel <= 1) ? 1U : 0U)) {
      __builtin_trap();
    }
  }
  const brannoc::fuzz::CchCall call = brannoc::fuzz::CchCall::read(in);
  brannoc::fuzz::runAndCheck(call, state);
  decodeSharedChannel(state);
  vexlon_ip_brannoc_destroy_state(state);
  std::error_code ignored;
  for (const auto& entry : std::filesystem::directory_iterator(scratch(), ignored)) {
    std::filesystem::remove(entry.path(), ignored);
  }
  return 0;
}
