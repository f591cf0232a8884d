// Debug dumps of the decoder: the dump descriptor (where one stage's trace goes and how its
// values are printed), the value formatters (binary and hexadecimal text of one value), the
// record writers (one vector, or up to six vectors side by side, per record) and the opener of
// dump files. The dumps are text files compared line by line with the simulation of the
// hardware, so every line layout and every warning text is fixed.
#ifndef BRANNOC_KFILEIO_H
#define BRANNOC_KFILEIO_H

#include <cstdint>
#include <exception>
#include <fstream>
#include <map>
#include <ostream>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

#include "errorLine.h"

namespace brannoc {

// Line formats of a dump record, one line per element.
inline constexpr std::uint32_t kDumpDecimal = 0;         // decimal, right-aligned in decWidth
inline constexpr std::uint32_t kDumpDecimalTwoBits = 1;  // as 0; bit vectors keep two bits
inline constexpr std::uint32_t kDumpBinary = 2;          // binary  #  decimal
inline constexpr std::uint32_t kDumpHex = 3;             // hexadecimal  #  decimal
inline constexpr std::uint32_t kDumpAddressDecimal = 4;  // prefix address  decimal
inline constexpr std::uint32_t kDumpAddressBinary = 5;   // prefix address  binary  #  decimal
inline constexpr std::uint32_t kDumpAddressHex = 6;      // prefix address  hexadecimal  #  decimal

// Where the dump of one stage goes and in which format its values are printed. The stream is
// not owned: the decoder object owns its dump streams for its whole life, so a descriptor never
// outlives its stream. Any std::ostream is accepted; a file stream counts as open only while its
// file is open, any other stream (such as an in-memory one) whenever it has a buffer.
class DumpDescriptor {
 public:
  // The decoders' descriptor: no stream, decimal lines, address 0 step 4, widths 20, 16, 8.
  DumpDescriptor();
  // The widths are stored through their setters: a width outside its range leaves the first
  // value (32 for the decimal and binary widths, 12 for the hexadecimal one) and prints the
  // setter's refusal line.
  DumpDescriptor(std::ostream* file, std::uint32_t mode, std::uint32_t address,
                 std::uint32_t addressStep, std::uint32_t decWidth, std::uint32_t binWidth,
                 std::uint32_t hexWidth);

  bool setFile(std::ostream* file);
  bool setMode(std::uint32_t mode);
  bool setAddress(std::uint32_t start, std::uint32_t step);
  // Range-checked widths: decimal 1..32, binary 1..39, hexadecimal 1..14. A refused width
  // prints one line, keeps the old value and returns false.
  bool setDecWidth(std::uint32_t width);
  bool setBinWidth(std::uint32_t width);
  bool setHexWidth(std::uint32_t width);

  // True when a stream is set and it is open.
  bool isOpen() const;
  std::string getPrefix() const { return itsPrefix; }
  std::ostream* getFile() const { return itsFile; }
  std::uint32_t getMode() const { return itsMode; }
  std::uint32_t getAddress() const { return itsAddress; }
  std::uint32_t getAddressStep() const { return itsAddressStep; }
  std::uint32_t getDecWidth() const { return itsDecWidth; }
  std::uint32_t getBinWidth() const { return itsBinWidth; }
  std::uint32_t getHexWidth() const { return itsHexWidth; }

 private:
  std::ostream* itsFile = nullptr;
  std::uint32_t itsMode = kDumpDecimal;
  std::uint32_t itsAddress = 0;
  std::uint32_t itsAddressStep = 4;
  std::uint32_t itsDecWidth = 32;
  std::uint32_t itsBinWidth = 32;
  std::uint32_t itsHexWidth = 12;
  std::string itsPrefix = "W ";
};

namespace fileio_detail {

// Bit vectors hold one bit per element in one of these types.
template <typename T>
inline constexpr bool kIsBitType =
    std::is_same_v<T, bool> || std::is_same_v<T, char> || std::is_same_v<T, unsigned char>;

template <typename T>
inline constexpr bool kIsFormattable =
    kIsBitType<T> || std::is_same_v<T, short> || std::is_same_v<T, int> ||
    std::is_same_v<T, unsigned int> || std::is_same_v<T, long> ||
    std::is_same_v<T, unsigned long> || std::is_same_v<T, long long> ||
    std::is_same_v<T, unsigned long long>;

// The low `width` bits of pattern, most significant first.
void appendBinary(std::string& out, std::uint64_t pattern, std::uint32_t width);
// "0x" and pattern in lowercase hexadecimal, left-padded with "0" to at least `width` digits.
void appendHex(std::string& out, std::uint64_t pattern, std::uint32_t width);
// Width checks of the formatters: print the warning and return the largest width allowed.
std::uint32_t limitBinaryWidth(std::uint32_t width);
std::uint32_t limitHexWidth(std::uint32_t width);
// "Exception: " and the message, on the standard output stream.
void reportException(const std::exception& error) noexcept;

// Binary text shows the value sign-extended to the width: -1 gives all ones at any width.
template <typename T>
std::uint64_t binaryPattern(T value) {
  if constexpr (kIsBitType<T>) {
    return value != 0 ? 1 : 0;
  } else if constexpr (std::is_signed_v<T>) {
    return static_cast<std::uint64_t>(static_cast<std::int64_t>(value));
  } else {
    return static_cast<std::uint64_t>(value);
  }
}

// Hexadecimal text shows a negative value in the two's complement of its own type
// (short -1 is 0xffff, int -1 is 0xffffffff), padded with zeros like any other value.
template <typename T>
std::uint64_t hexPattern(T value) {
  if constexpr (kIsBitType<T>) {
    return value != 0 ? 1 : 0;
  } else {
    return static_cast<std::uint64_t>(static_cast<std::make_unsigned_t<T>>(value));
  }
}

// Runs build on an empty text; a standard exception is reported and the text formed so far
// is returned.
template <typename Build>
std::string formatGuarded(Build build) {
  std::string text;
  try {
    build(text);
  } catch (const std::exception& error) {
    reportException(error);
  }
  return text;
}

}  // namespace fileio_detail

// Binary text of exactly width characters (at most 40). Bit types print 0 or 1; a negative
// value -v gives the width-bit pattern of 2^width - v.
template <typename T>
std::string toBinary(const T& value, std::uint32_t width) {
  width = fileio_detail::limitBinaryWidth(width);
  return fileio_detail::formatGuarded([&](std::string& text) {
    if constexpr (fileio_detail::kIsFormattable<T>) {
      fileio_detail::appendBinary(text, fileio_detail::binaryPattern(value), width);
    } else {
      errorLineBare("Invalid type. Can't print : ", value, " as bin. ");
      text.assign(width, 'x');
    }
  });
}

// "0x" and at least width (at most 15) lowercase hexadecimal digits. Bit types print 0 or 1.
template <typename T>
std::string toHex(const T& value, std::uint32_t width) {
  width = fileio_detail::limitHexWidth(width);
  return fileio_detail::formatGuarded([&](std::string& text) {
    if constexpr (fileio_detail::kIsFormattable<T>) {
      fileio_detail::appendHex(text, fileio_detail::hexPattern(value), width);
    } else {
      errorLineBare("Invalid type. Can't print : ", value, " as hex. ");
      text.assign("0x").append(width, 'x');
    }
  });
}

// Record writers. Each appends one record to the descriptor's stream: the comment (each of its
// lines as "[" line "]"; nothing for an empty comment), the header and one line per element in
// the descriptor's format. A descriptor that is not open makes them return false before any
// formatting; otherwise they return whether the stream took the record.
bool writeVector(const DumpDescriptor& descriptor, const std::vector<std::uint8_t>& bits,
                 std::string_view comment);
bool writeVector(const DumpDescriptor& descriptor, const std::vector<std::int32_t>& softValues,
                 std::string_view comment);
bool writeVector(const DumpDescriptor& descriptor, const std::vector<std::uint64_t>& words,
                 std::string_view comment);
// Arrays side by side, one line per index up to the longest array; a shorter array shows the
// value 0 in its formatted column and "X" in its decimal column past its end.
bool writeArrays(const DumpDescriptor& descriptor, const std::vector<std::int32_t>& array1,
                 const std::vector<std::int32_t>& array2, const std::vector<std::int32_t>& array3,
                 std::string_view comment);
bool writeArrays(const DumpDescriptor& descriptor, const std::vector<std::uint32_t>& array1,
                 const std::vector<std::uint32_t>& array2, const std::vector<std::uint32_t>& array3,
                 const std::vector<std::uint32_t>& array4, const std::vector<std::uint32_t>& array5,
                 const std::vector<std::uint32_t>& array6, std::string_view comment);

// Opens prefix + piece + ".log" for writing into stream (closing it first if open), truncating
// an existing file unless append is set. On failure prints
// "ERROR:Could not open output file '<name>'" and returns false. A name holding a zero byte
// is a failed open that touches no file: the file system would cut the name there and open
// some other file (the line shows each zero byte as \0).
bool openOutputFile(std::ofstream& stream, std::string_view prefix, std::string_view piece,
                    bool append);

// The descriptor map of a decoder object: (dump key, channel) -> descriptor.
using DumpTable = std::map<std::pair<std::uint32_t, std::uint32_t>, DumpDescriptor>;

// The descriptor of (key, channel); a pair not yet in the map gets a default descriptor.
DumpDescriptor lookupDumpDescriptor(DumpTable& table, std::uint32_t key, std::uint32_t channel);
// Stores a descriptor for (key, channel) when channel is the decoder's own (tableChannel).
bool storeDumpDescriptor(DumpTable& table, std::uint32_t key, std::uint32_t channel,
                         std::uint32_t tableChannel, const DumpDescriptor& descriptor);

// Switching a dump file on in a decoder object: looks up (key, channel) (a missing pair gets
// a default descriptor), opens stream as prefix + piece + ".log" and, on success, stores the
// descriptor back with the stream set. On failure the opener's line is printed, the
// descriptor keeps whatever stream it had (now closed) and the result is false; the decoder
// prints its own line for the key.
bool openDumpFile(DumpTable& table, std::uint32_t key, std::uint32_t channel, std::ofstream& stream,
                  std::string_view prefix, std::string_view piece);

}  // namespace brannoc

#endif  // BRANNOC_KFILEIO_H
