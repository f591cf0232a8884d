// Writes the decoder's error lines; see errorLine.h for their shapes.
#include "errorLine.h"

#include <iostream>
#include <string>

namespace brannoc::detail {

void writeErrorLine(std::string_view text) {
  std::string line;
  line.reserve(text.size() + 1);
  line.append(text).push_back('\n');
  std::cerr.write(line.data(), static_cast<std::streamsize>(line.size()));
  std::cerr.flush();
}

}  // namespace brannoc::detail
