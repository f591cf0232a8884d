// The decoder's error lines on the standard error stream, in the four shapes every
// component uses:
//   errorLineFile         "File: " source "(" line ")" message
//   errorLineFileSpaced   "File: " source " (" line ") " message
//   errorLineSource       source "(" line ")" message
//   errorLineBare         message
// The message is the concatenation of the parts, each written as a stream would write it
// (numbers in decimal; byte-sized integers as numbers, not characters). The whole line is
// built first and written with one call, then the end of line flushes the stream, so that
// lines from different instances never mix inside a line.
#ifndef BRANNOC_ERRORLINE_H
#define BRANNOC_ERRORLINE_H

#include <cstdint>
#include <sstream>
#include <string>
#include <string_view>
#include <type_traits>

namespace brannoc {

namespace detail {

template <typename T>
void appendPart(std::ostringstream& out, const T& part) {
  if constexpr (std::is_same_v<T, std::int8_t> || std::is_same_v<T, std::uint8_t> ||
                std::is_same_v<T, signed char> || std::is_same_v<T, unsigned char>) {
    out << static_cast<int>(part);
  } else {
    out << part;
  }
}

template <typename... Parts>
std::string joinParts(const Parts&... parts) {
  std::ostringstream out;
  (appendPart(out, parts), ...);
  return out.str();
}

// Writes text and an end of line (flushing) to the standard error stream.
void writeErrorLine(std::string_view text);

}  // namespace detail

template <typename... Parts>
void errorLineFile(std::string_view source, unsigned line, const Parts&... parts) {
  detail::writeErrorLine(detail::joinParts("File: ", source, "(", line, ")", parts...));
}

template <typename... Parts>
void errorLineFileSpaced(std::string_view source, unsigned line, const Parts&... parts) {
  detail::writeErrorLine(detail::joinParts("File: ", source, " (", line, ") ", parts...));
}

template <typename... Parts>
void errorLineSource(std::string_view source, unsigned line, const Parts&... parts) {
  detail::writeErrorLine(detail::joinParts(source, "(", line, ")", parts...));
}

template <typename... Parts>
void errorLineBare(const Parts&... parts) {
  detail::writeErrorLine(detail::joinParts(parts...));
}

}  // namespace brannoc

#endif  // BRANNOC_ERRORLINE_H
