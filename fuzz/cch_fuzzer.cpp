// libFuzzer harness of vexlon_ip_brannoc_CCH_bitacc_simulate: one call per input (layout in
// FuzzCalls.h), on the instance of its generics (kept across inputs), every array at exactly its declared size.
#include <cstddef>
#include <cstdint>

#include "FuzzCalls.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  brannoc::fuzz::FuzzInput in(data, size);
  const brannoc::fuzz::CchCall call = brannoc::fuzz::CchCall::read(in);
  brannoc::fuzz::runAndCheck(call, brannoc::fuzz::instanceFor(call.generics));
  return 0;
}
