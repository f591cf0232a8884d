// Reads a fuzzer's bytes as the fields of a call: little-endian words, bytes and soft values,
// with 0 once the bytes run out, so that every input, however short, describes one call.
#ifndef BRANNOC_FUZZ_FUZZINPUT_H
#define BRANNOC_FUZZ_FUZZINPUT_H

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

namespace brannoc::fuzz {

class FuzzInput {
 public:
  FuzzInput(const std::uint8_t* data, std::size_t size) : itsData(data), itsSize(size) {}

  std::uint8_t byte() { return itsPos < itsSize ? itsData[itsPos++] : 0; }
  std::uint32_t word() {
    std::uint32_t w = 0;
    for (int k = 0; k < 4; ++k) w |= std::uint32_t{byte()} << (8 * k);
    return w;
  }
  // n soft values: one byte each (sign-extended) in mode 0, four bytes each otherwise, so
  // that values anywhere in 32 bits occur; zeros past the end of the input.
  std::vector<std::int32_t> softValues(std::size_t n, bool wide) {
    std::vector<std::int32_t> v(n, 0);
    for (std::int32_t& x : v) {
      x = wide ? static_cast<std::int32_t>(word()) : static_cast<std::int8_t>(byte());
    }
    return v;
  }
  std::size_t remaining() const { return itsSize - itsPos; }

 private:
  const std::uint8_t* itsData;
  std::size_t itsSize;
  std::size_t itsPos = 0;
};

// Appends little-endian words and bytes: the seed-corpus writer's side of FuzzInput.
class FuzzOutput {
 public:
  void byte(std::uint8_t b) { itsBytes.push_back(b); }
  void word(std::uint32_t w) {
    for (int k = 0; k < 4; ++k) byte(static_cast<std::uint8_t>(w >> (8 * k)));
  }
  void softValues(const std::vector<std::int32_t>& v, bool wide) {
    for (const std::int32_t x : v) {
      if (wide) {
        word(static_cast<std::uint32_t>(x));
      } else {
        byte(static_cast<std::uint8_t>(static_cast<std::int8_t>(x)));
      }
    }
  }
  const std::vector<std::uint8_t>& bytes() const { return itsBytes; }

 private:
  std::vector<std::uint8_t> itsBytes;
};

}  // namespace brannoc::fuzz

#endif  // BRANNOC_FUZZ_FUZZINPUT_H
