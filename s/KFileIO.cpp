// Dump descriptors, value formatters, record writers and the dump-file opener of the decoder's
// debug traces. A record is built in memory and appended to its stream with one write, and
// nothing is formatted at all while the descriptor's stream is not open.
#include "KFileIO.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cstddef>
#include <iostream>

namespace brannoc {

namespace {

constexpr std::uint32_t kMaxDecWidth = 32;
constexpr std::uint32_t kMaxBinWidth = 39;
constexpr std::uint32_t kMaxHexWidth = 14;
// Limits of the free formatters, wider than the descriptor's so that any descriptor width fits.
constexpr std::uint32_t kBinaryTextLimit = 40;
constexpr std::uint32_t kHexTextLimit = 15;
// Addresses of the register formats always print as 8 hexadecimal digits (32-bit bus).
constexpr std::uint32_t kAddressDigits = 8;
constexpr std::string_view kSeparator = "  #  ";
constexpr std::string_view kColumnGap = "  ";

// The formatters' two warnings carry fixed source tags rather than this file's line numbers:
// scripts that screen the logs of the hardware comparison match the whole text.
constexpr std::string_view kFormatterTag = "KFileIO";
constexpr unsigned kBinaryWidthTagLine = 177;
constexpr unsigned kHexWidthTagLine = 121;

bool refuseWidth(std::uint32_t width, std::uint32_t old, std::string_view range) {
  errorLineBare("Invalid Witdh: ", width, ". Value ", old, " is unchanged. Width must be in ",
                range);
  return false;
}

// Decimal text of value in the caller's buffer (large enough for any 64-bit value).
std::string_view decimalText(std::array<char, 24>& buffer, std::int64_t value) {
  const auto result = std::to_chars(buffer.data(), buffer.data() + buffer.size(), value);
  return std::string_view(buffer.data(), static_cast<std::size_t>(result.ptr - buffer.data()));
}

void appendDecimal(std::string& out, std::int64_t value) {
  std::array<char, 24> buffer{};
  out.append(decimalText(buffer, value));
}

void appendRightAligned(std::string& out, std::string_view text, std::uint32_t width) {
  if (text.size() < width) {
    out.append(width - text.size(), ' ');
  }
  out.append(text);
}

void appendDecimalRightAligned(std::string& out, std::int64_t value, std::uint32_t width) {
  std::array<char, 24> buffer{};
  appendRightAligned(out, decimalText(buffer, value), width);
}

// The decimal column: bit vectors keep their lowest bit (two bits in format 1), every other
// element type is written as a signed 64-bit number.
template <typename T>
std::int64_t decimalValue(T value, std::uint32_t mode) {
  if constexpr (fileio_detail::kIsBitType<T>) {
    return static_cast<std::int64_t>(value) & (mode == kDumpDecimalTwoBits ? 3 : 1);
  } else {
    return static_cast<std::int64_t>(value);
  }
}

bool isAddressMode(std::uint32_t mode) {
  return mode == kDumpAddressDecimal || mode == kDumpAddressBinary || mode == kDumpAddressHex;
}

// The formatted column of formats 2, 3, 5 and 6 (formats 0, 1 and 4 have none).
template <typename T>
void appendFormatted(std::string& out, const DumpDescriptor& descriptor, T value) {
  const std::uint32_t mode = descriptor.getMode();
  if (mode == kDumpBinary || mode == kDumpAddressBinary) {
    fileio_detail::appendBinary(out, fileio_detail::binaryPattern(value), descriptor.getBinWidth());
  } else if (mode == kDumpHex || mode == kDumpAddressHex) {
    fileio_detail::appendHex(out, fileio_detail::hexPattern(value), descriptor.getHexWidth());
  }
}

bool hasFormattedColumn(std::uint32_t mode) {
  return mode == kDumpBinary || mode == kDumpHex || mode == kDumpAddressBinary ||
         mode == kDumpAddressHex;
}

void appendAddress(std::string& out, const DumpDescriptor& descriptor, std::uint32_t address) {
  out.append(descriptor.getPrefix());
  fileio_detail::appendHex(out, address, kAddressDigits);
  out.append(kColumnGap);
}

void appendComment(std::string& out, std::string_view comment) {
  while (!comment.empty()) {
    const std::size_t end = comment.find('\n');
    out.push_back('[');
    out.append(comment.substr(0, end));
    out.append("]\n");
    if (end == std::string_view::npos) {
      break;
    }
    comment.remove_prefix(end + 1);
  }
}

void appendLengthLine(std::string& out, std::size_t length) {
  out.append("[ length: ");
  appendDecimal(out, static_cast<std::int64_t>(length));
  out.append("]\n");
}

// A generous guess of one element line, so that a record is built without regrowing.
std::size_t lineEstimate(const DumpDescriptor& descriptor, std::size_t columns) {
  return descriptor.getPrefix().size() + 2 * kAddressDigits +
         columns *
             (descriptor.getDecWidth() + descriptor.getBinWidth() + descriptor.getHexWidth() + 8) +
         kSeparator.size() + 1;
}

bool appendToStream(const DumpDescriptor& descriptor, const std::string& record) {
  std::ostream& stream = *descriptor.getFile();
  stream.write(record.data(), static_cast<std::streamsize>(record.size()));
  return !stream.fail();
}

template <typename T>
void appendElementLine(std::string& out, const DumpDescriptor& descriptor, T value,
                       std::uint32_t address) {
  const std::uint32_t mode = descriptor.getMode();
  if (mode > kDumpAddressHex) {
    return;
  }
  if (mode == kDumpDecimal || mode == kDumpDecimalTwoBits) {
    appendDecimalRightAligned(out, decimalValue(value, mode), descriptor.getDecWidth());
  } else {
    if (isAddressMode(mode)) {
      appendAddress(out, descriptor, address);
    }
    if (hasFormattedColumn(mode)) {
      appendFormatted(out, descriptor, value);
      out.append(kSeparator);
    }
    appendDecimal(out, decimalValue(value, mode));
  }
  out.push_back('\n');
}

template <typename T>
bool writeVectorOf(const DumpDescriptor& descriptor, const std::vector<T>& data,
                   std::string_view comment) {
  if (!descriptor.isOpen()) {
    return false;
  }
  try {
    std::string record;
    record.reserve(comment.size() + 32 + data.size() * lineEstimate(descriptor, 1));
    appendComment(record, comment);
    appendLengthLine(record, data.size());
    std::uint32_t address = descriptor.getAddress();
    for (const T value : data) {
      appendElementLine(record, descriptor, value, address);
      address += descriptor.getAddressStep();
    }
    return appendToStream(descriptor, record);
  } catch (const std::exception& error) {
    fileio_detail::reportException(error);
    return false;
  }
}

// One line of arrays side by side: address (formats 4..6), the formatted columns of all arrays
// with no separator between them, then the decimal column of each array followed by two blanks.
template <typename T, std::size_t N>
void appendArraysLine(std::string& out, const DumpDescriptor& descriptor,
                      const std::array<const std::vector<T>*, N>& arrays, std::size_t index,
                      std::uint32_t address) {
  const std::uint32_t mode = descriptor.getMode();
  if (mode == kDumpDecimalTwoBits || mode > kDumpAddressHex) {
    return;
  }
  if (mode == kDumpDecimal) {
    for (const std::vector<T>* array : arrays) {
      if (index < array->size()) {
        appendDecimalRightAligned(out, decimalValue((*array)[index], mode),
                                  descriptor.getDecWidth());
      } else {
        appendRightAligned(out, "X", descriptor.getDecWidth());
      }
      out.append(kColumnGap);
    }
    out.push_back('\n');
    return;
  }
  if (isAddressMode(mode)) {
    appendAddress(out, descriptor, address);
  }
  if (hasFormattedColumn(mode)) {
    for (const std::vector<T>* array : arrays) {
      appendFormatted(out, descriptor, index < array->size() ? (*array)[index] : T{0});
    }
    out.append(kSeparator);
  }
  for (const std::vector<T>* array : arrays) {
    if (index < array->size()) {
      appendDecimal(out, decimalValue((*array)[index], mode));
    } else {
      out.push_back('X');
    }
    out.append(kColumnGap);
  }
  out.push_back('\n');
}

template <typename T, std::size_t N>
bool writeArraysOf(const DumpDescriptor& descriptor,
                   const std::array<const std::vector<T>*, N>& arrays, std::string_view comment) {
  if (!descriptor.isOpen()) {
    return false;
  }
  try {
    std::size_t length = 0;
    for (const std::vector<T>* array : arrays) {
      length = std::max(length, array->size());
    }
    std::string record;
    record.reserve(comment.size() + 32 * (N + 1) + length * lineEstimate(descriptor, N));
    appendComment(record, comment);
    // The first gap is one blank shorter than the others; readers of the dumps expect it so.
    record.append("[  Size of Array 1: ");
    for (std::size_t k = 0; k < N; ++k) {
      if (k == 1) {
        record.append(" Size of Array 2: ");
      } else if (k > 1) {
        record.append("  Size of Array ");
        appendDecimal(record, static_cast<std::int64_t>(k + 1));
        record.append(": ");
      }
      appendDecimal(record, static_cast<std::int64_t>(arrays[k]->size()));
    }
    record.append("]\n");
    appendLengthLine(record, length);
    std::uint32_t address = descriptor.getAddress();
    for (std::size_t index = 0; index < length; ++index) {
      appendArraysLine(record, descriptor, arrays, index, address);
      address += descriptor.getAddressStep();
    }
    return appendToStream(descriptor, record);
  } catch (const std::exception& error) {
    fileio_detail::reportException(error);
    return false;
  }
}

}  // namespace

DumpDescriptor::DumpDescriptor() : DumpDescriptor(nullptr, kDumpDecimal, 0, 4, 20, 16, 8) {}

DumpDescriptor::DumpDescriptor(std::ostream* file, std::uint32_t mode, std::uint32_t address,
                               std::uint32_t addressStep, std::uint32_t decWidth,
                               std::uint32_t binWidth, std::uint32_t hexWidth)
    : itsFile(file), itsMode(mode), itsAddress(address), itsAddressStep(addressStep) {
  setDecWidth(decWidth);
  setBinWidth(binWidth);
  setHexWidth(hexWidth);
}

bool DumpDescriptor::setFile(std::ostream* file) {
  itsFile = file;
  return true;
}

bool DumpDescriptor::setMode(std::uint32_t mode) {
  itsMode = mode;
  return true;
}

bool DumpDescriptor::setAddress(std::uint32_t start, std::uint32_t step) {
  itsAddress = start;
  itsAddressStep = step;
  return true;
}

bool DumpDescriptor::setDecWidth(std::uint32_t width) {
  if (width < 1 || width > kMaxDecWidth) {
    return refuseWidth(width, itsDecWidth, "[1,32]");
  }
  itsDecWidth = width;
  return true;
}

bool DumpDescriptor::setBinWidth(std::uint32_t width) {
  if (width < 1 || width > kMaxBinWidth) {
    return refuseWidth(width, itsBinWidth, "[1,39]");
  }
  itsBinWidth = width;
  return true;
}

bool DumpDescriptor::setHexWidth(std::uint32_t width) {
  if (width < 1 || width > kMaxHexWidth) {
    return refuseWidth(width, itsHexWidth, "[1,15)");
  }
  itsHexWidth = width;
  return true;
}

bool DumpDescriptor::isOpen() const {
  if (itsFile == nullptr || itsFile->rdbuf() == nullptr) {
    return false;
  }
  // File streams (std::ofstream, std::fstream) share std::filebuf, which knows whether its file
  // is open; any other buffer is open while it exists.
  if (const auto* file = dynamic_cast<const std::filebuf*>(itsFile->rdbuf())) {
    return file->is_open();
  }
  return true;
}

namespace fileio_detail {

void appendBinary(std::string& out, std::uint64_t pattern, std::uint32_t width) {
  for (std::uint32_t bit = width; bit-- > 0;) {
    out.push_back(bit < 64 && ((pattern >> bit) & 1) != 0 ? '1' : '0');
  }
}

void appendHex(std::string& out, std::uint64_t pattern, std::uint32_t width) {
  std::array<char, 16> digits{};
  const auto result = std::to_chars(digits.data(), digits.data() + digits.size(), pattern, 16);
  const auto count = static_cast<std::uint32_t>(result.ptr - digits.data());
  out.append("0x");
  if (count < width) {
    out.append(width - count, '0');
  }
  out.append(digits.data(), count);
}

std::uint32_t limitBinaryWidth(std::uint32_t width) {
  if (width > kBinaryTextLimit) {
    errorLineFile(kFormatterTag, kBinaryWidthTagLine,
                  "  Passing width larger than 40. Setting to 40");
    return kBinaryTextLimit;
  }
  return width;
}

std::uint32_t limitHexWidth(std::uint32_t width) {
  if (width > kHexTextLimit) {
    errorLineFile(kFormatterTag, kHexWidthTagLine, "  Passing width larger than 15. Setting to 15");
    return kHexTextLimit;
  }
  return width;
}

void reportException(const std::exception& error) noexcept {
  try {
    std::cout << "Exception: " << error.what() << std::endl;
  } catch (...) {
    // Nothing more can be reported when the standard output stream itself fails.
  }
}

}  // namespace fileio_detail

bool writeVector(const DumpDescriptor& descriptor, const std::vector<std::uint8_t>& bits,
                 std::string_view comment) {
  return writeVectorOf(descriptor, bits, comment);
}

bool writeVector(const DumpDescriptor& descriptor, const std::vector<std::int32_t>& softValues,
                 std::string_view comment) {
  return writeVectorOf(descriptor, softValues, comment);
}

bool writeVector(const DumpDescriptor& descriptor, const std::vector<std::uint64_t>& words,
                 std::string_view comment) {
  return writeVectorOf(descriptor, words, comment);
}

bool writeArrays(const DumpDescriptor& descriptor, const std::vector<std::int32_t>& array1,
                 const std::vector<std::int32_t>& array2, const std::vector<std::int32_t>& array3,
                 std::string_view comment) {
  return writeArraysOf(descriptor, std::array{&array1, &array2, &array3}, comment);
}

bool writeArrays(const DumpDescriptor& descriptor, const std::vector<std::uint32_t>& array1,
                 const std::vector<std::uint32_t>& array2, const std::vector<std::uint32_t>& array3,
                 const std::vector<std::uint32_t>& array4, const std::vector<std::uint32_t>& array5,
                 const std::vector<std::uint32_t>& array6, std::string_view comment) {
  return writeArraysOf(descriptor, std::array{&array1, &array2, &array3, &array4, &array5, &array6},
                       comment);
}

bool openOutputFile(std::ofstream& stream, std::string_view prefix, std::string_view piece,
                    bool append) {
  if (stream.is_open()) {
    stream.close();
  }
  std::string name;
  name.reserve(prefix.size() + piece.size() + 4);
  name.append(prefix).append(piece).append(".log");
  const bool usable = name.find('\0') == std::string::npos;
  if (usable) {
    stream.open(name, std::ios::out | (append ? std::ios::app : std::ios::trunc));
    if (stream.is_open()) {
      return true;
    }
  }
  std::string shown;
  for (const char c : name) {
    shown.append(c == '\0' ? std::string_view("\\0") : std::string_view(&c, 1));
  }
  errorLineBare("ERROR:Could not open output file '", shown, "'");
  return false;
}

DumpDescriptor lookupDumpDescriptor(DumpTable& table, std::uint32_t key, std::uint32_t channel) {
  return table[{key, channel}];
}

bool storeDumpDescriptor(DumpTable& table, std::uint32_t key, std::uint32_t channel,
                         std::uint32_t tableChannel, const DumpDescriptor& descriptor) {
  if (channel != tableChannel) {
    return false;
  }
  table[{key, channel}] = descriptor;
  return true;
}

bool openDumpFile(DumpTable& table, std::uint32_t key, std::uint32_t channel, std::ofstream& stream,
                  std::string_view prefix, std::string_view piece) {
  DumpDescriptor descriptor = table[{key, channel}];
  if (!openOutputFile(stream, prefix, piece, false)) {
    return false;
  }
  descriptor.setFile(&stream);
  table[{key, channel}] = descriptor;
  return true;
}

}  // namespace brannoc
