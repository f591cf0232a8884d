// libFuzzer harness of the vector-file reader: any text is read or refused with a message
// naming the file and a line; what it reads is written again and reads back the same.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

#include "vectors/VectorFile.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace brannoc::vectors;
  const std::string_view text(reinterpret_cast<const char*>(data), size);
  Vector vector;
  const std::string error = parseVector(text, "in.vec", vector);
  if (!error.empty()) {
    if (error.rfind("in.vec:", 0) != 0) std::abort();
    return 0;
  }
  const std::string written = formatVector(vector);
  Vector again;
  if (!parseVector(written, "again.vec", again).empty() || formatVector(again) != written) {
    std::abort();
  }
  return 0;
}
