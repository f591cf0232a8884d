// Vector files: a schema per channel (the records' fields by name), one reader that checks
// every line against it, and the writers.
#include "vectors/VectorFile.h"

#include <algorithm>
#include <charconv>
#include <exception>
#include <fstream>
#include <map>
#include <span>
#include <sstream>

namespace brannoc::vectors {

namespace {

constexpr std::string_view kVectorHeader = "brannoc-vector 1";
constexpr std::string_view kOutputHeader = "brannoc-output 1";
constexpr std::size_t kValuesPerLine = 16;
constexpr std::size_t kBitsPerLine = 64;

template <typename Record>
struct Field {
  std::string_view name;
  std::uint32_t Record::*member;
};

#define BRANNOC_FIELD(Record, name) \
  Field<Record> { #name, &Record::name }

using Generics = vexlon_ip_brannoc_generics;
using SchControl = vexlon_ip_brannoc_SCH_controlData;
using CchControl = vexlon_ip_brannoc_CCH_controlData;

constexpr Field<Generics> kGenerics[] = {
    BRANNOC_FIELD(Generics, C_NUM_PU), BRANNOC_FIELD(Generics, C_ALGORITHM_TYPE),
    BRANNOC_FIELD(Generics, C_INTERLEAVER_BUFFER_SIZE), BRANNOC_FIELD(Generics, C_NUM_CQI_PU)};

constexpr Field<SchControl> kSchControl[] = {
    BRANNOC_FIELD(SchControl, SCH_CQI_IP_SIZE),  BRANNOC_FIELD(SchControl, SCH_CQI_OP_SIZE),
    BRANNOC_FIELD(SchControl, SCH_IP_DATA_TYPE), BRANNOC_FIELD(SchControl, SCH_ACK_IP_SIZE),
    BRANNOC_FIELD(SchControl, SCH_ACK_OP_SIZE),  BRANNOC_FIELD(SchControl, SCH_RI_IP_SIZE),
    BRANNOC_FIELD(SchControl, SCH_RI_OP_SIZE),   BRANNOC_FIELD(SchControl, SCH_RM_E_IDX),
    BRANNOC_FIELD(SchControl, SCH_CH_INT_ROWS),  BRANNOC_FIELD(SchControl, SCH_CP),
    BRANNOC_FIELD(SchControl, SCH_RM_E_MINUS),   BRANNOC_FIELD(SchControl, SCH_RM_E_PLUS),
    BRANNOC_FIELD(SchControl, SCH_TBSIZE),       BRANNOC_FIELD(SchControl, SCH_TD_ITER),
    BRANNOC_FIELD(SchControl, SCH_QAM),          BRANNOC_FIELD(SchControl, SCH_USER_ID),
    BRANNOC_FIELD(SchControl, SCH_SFRM),         BRANNOC_FIELD(SchControl, SCH_HARQ_SFRM),
    BRANNOC_FIELD(SchControl, SCH_RV),           BRANNOC_FIELD(SchControl, SCH_ND),
    BRANNOC_FIELD(SchControl, SCH_HFC),          BRANNOC_FIELD(SchControl, SCH_TD_FLUSH),
    BRANNOC_FIELD(SchControl, SCH_TAG)};

constexpr Field<CchControl> kCchControl[] = {
    BRANNOC_FIELD(CchControl, CCH_UCI_OP_SIZE), BRANNOC_FIELD(CchControl, CCH_CP),
    BRANNOC_FIELD(CchControl, CCH_ACK_OP_SIZE), BRANNOC_FIELD(CchControl, CCH_USER_ID),
    BRANNOC_FIELD(CchControl, CCH_TAG)};

#undef BRANNOC_FIELD

// The arrays of each channel and their names in the file.
constexpr std::string_view kHarqNames[] = {"sys_harq_buffer", "p0_harq_buffer", "p1_harq_buffer"};
constexpr std::string_view kSchExpected[] = {"expect.SCH_data_out", "expect.SCH_CQI_out",
                                             "expect.SCH_ACK_out", "expect.SCH_RI_out"};
constexpr std::string_view kCchExpected[] = {"expect.CCH_data_out", "expect.CCH_ACK_out"};

enum class Kind { Scalar, Values, Bits };

struct Entry {
  std::string_view name;
  Kind kind;
  bool required;
};

std::vector<Entry> schemaOf(Channel channel) {
  std::vector<Entry> schema;
  for (const auto& f : kGenerics) schema.push_back({f.name, Kind::Scalar, true});
  if (channel == Channel::Shared) {
    for (const auto& f : kSchControl) schema.push_back({f.name, Kind::Scalar, true});
    schema.push_back({"max_harq_buffer_size", Kind::Scalar, true});
    schema.push_back({"tb_llr", Kind::Values, true});
    for (auto name : kHarqNames) schema.push_back({name, Kind::Values, false});
    for (auto name : kSchExpected) schema.push_back({name, Kind::Bits, false});
  } else {
    for (const auto& f : kCchControl) schema.push_back({f.name, Kind::Scalar, true});
    schema.push_back({"llr", Kind::Values, true});
    for (auto name : kCchExpected) schema.push_back({name, Kind::Bits, false});
  }
  return schema;
}

// What the file gave for one name.
struct Item {
  std::size_t line = 0;
  std::uint32_t scalar = 0;
  std::vector<std::int32_t> values;
};

template <typename Number>
bool parseNumber(std::string_view token, Number& value) {
  const char* end = token.data() + token.size();
  const auto [ptr, ec] = std::from_chars(token.data(), end, value);
  return ec == std::errc() && ptr == end;
}

std::string quoted(std::string_view text) {
  constexpr std::size_t kShown = 40;
  std::string shown(text.substr(0, kShown));
  if (text.size() > kShown) shown += "...";
  return "'" + shown + "'";
}

// The reader: lines in, items out, the first problem kept as the message.
class Reader {
 public:
  Reader(std::string_view text, std::string_view name) : itsText(text), itsName(name) {}

  std::string run(Vector& vector) {
    if (!header() || !channel(vector.channel)) return itsError;
    const std::vector<Entry> schema = schemaOf(vector.channel);
    std::map<std::string_view, Item> items;
    const Entry* open = nullptr;  // the array being read, and its values so far
    std::vector<std::int32_t>* values = nullptr;
    std::uint32_t wanted = 0;
    std::vector<std::string_view> tokens;
    while (nextLine(tokens)) {
      std::size_t t = 0;
      if (open == nullptr) {
        const auto entry = std::find_if(schema.begin(), schema.end(),
                                        [&](const Entry& e) { return e.name == tokens[0]; });
        if (entry == schema.end()) {
          return fail("expected a field name of a " + channelName(vector.channel) +
                      " vector, found " + quoted(tokens[0]));
        }
        if (const auto seen = items.find(entry->name); seen != items.end()) {
          return fail("'" + std::string(entry->name) + "' given a second time (first on line " +
                      std::to_string(seen->second.line) + ")");
        }
        std::uint32_t number = 0;
        const std::string what =
            entry->kind == Kind::Scalar ? "an unsigned 32-bit value" : "the number of values";
        if (tokens.size() < 2 || !parseNumber(tokens[1], number)) {
          return fail("expected " + what + " after '" + std::string(entry->name) + "'" +
                      (tokens.size() < 2 ? std::string() : ", found " + quoted(tokens[1])));
        }
        if (tokens.size() > 2) {
          return fail("expected the end of the line after '" + std::string(entry->name) + " " +
                      std::string(tokens[1]) + "', found " + quoted(tokens[2]));
        }
        Item& item = items[entry->name];
        item.line = itsLine;
        if (entry->kind == Kind::Scalar) {
          item.scalar = number;
          continue;
        }
        if (number > kMaxArrayValues) {
          return fail("expected at most " + std::to_string(kMaxArrayValues) + " values of '" +
                      std::string(entry->name) + "', found a count of " + std::to_string(number));
        }
        item.values.reserve(std::min<std::uint32_t>(number, 4096));
        open = &*entry;
        values = &item.values;
        wanted = number;
        t = tokens.size();
      }
      for (; t < tokens.size(); ++t) {
        if (!take(*open, tokens[t], wanted, *values)) return itsError;
      }
      if (values->size() == wanted) open = nullptr;
    }
    if (open != nullptr) {
      return fail("expected " + std::to_string(wanted - values->size()) + " more values of '" +
                  std::string(open->name) + "' before the end of the file");
    }
    for (const Entry& entry : schema) {
      if (entry.required && items.count(entry.name) == 0) {
        return fail("expected '" + std::string(entry.name) + "' before the end of the file (a " +
                    channelName(vector.channel) + " vector gives every field)");
      }
    }
    fill(items, vector);
    return {};
  }

 private:
  static std::string channelName(Channel channel) {
    return channel == Channel::Shared ? "pusch" : "pucch";
  }

  std::string fail(const std::string& what) {
    itsError = std::string(itsName) + ":" + std::to_string(std::max<std::size_t>(itsLine, 1)) +
               ": " + what;
    return itsError;
  }

  // The tokens of the next line that holds any, comments removed; false at the end.
  bool nextLine(std::vector<std::string_view>& tokens) {
    tokens.clear();
    while (tokens.empty() && itsPos < itsText.size()) {
      std::size_t end = itsText.find('\n', itsPos);
      if (end == std::string_view::npos) end = itsText.size();
      std::string_view line = itsText.substr(itsPos, end - itsPos);
      itsPos = end + 1;
      ++itsLine;
      line = line.substr(0, line.find('#'));
      std::size_t i = 0;
      while (i < line.size()) {
        const auto blank = [](char c) { return c == ' ' || c == '\t' || c == '\r'; };
        while (i < line.size() && blank(line[i])) ++i;
        std::size_t j = i;
        while (j < line.size() && !blank(line[j])) ++j;
        if (j > i) tokens.push_back(line.substr(i, j - i));
        i = j;
      }
    }
    return !tokens.empty();
  }

  bool header() {
    std::vector<std::string_view> tokens;
    if (!nextLine(tokens) || tokens.size() != 2 || tokens[0] != "brannoc-vector" ||
        tokens[1] != "1") {
      fail("expected the first line '" + std::string(kVectorHeader) + "'");
      return false;
    }
    return true;
  }

  bool channel(Channel& channel) {
    std::vector<std::string_view> tokens;
    const bool found = nextLine(tokens);
    if (found && tokens.size() == 2 && tokens[0] == "channel" &&
        (tokens[1] == "pusch" || tokens[1] == "pucch")) {
      channel = tokens[1] == "pusch" ? Channel::Shared : Channel::Control;
      return true;
    }
    fail("expected 'channel pusch' or 'channel pucch'");
    return false;
  }

  // Adds the values of one token to an array: one integer, or a run of bit characters.
  bool take(const Entry& entry, std::string_view token, std::uint32_t wanted,
            std::vector<std::int32_t>& values) {
    const bool bits = entry.kind == Kind::Bits;
    const auto expected = [&](const std::string& what) {
      fail("expected " + what + (bits ? " bits" : " soft values") + " of '" +
           std::string(entry.name) + "' (" + std::to_string(wanted) + " in all), found " +
           quoted(token));
      return false;
    };
    const auto left = [&] { return std::to_string(wanted - values.size()) + " more"; };
    if (bits) {
      for (char c : token) {
        if (values.size() == wanted) return expected("no more");
        if (c != '0' && c != '1') return expected(left());
        values.push_back(c - '0');
      }
      return true;
    }
    std::int32_t value = 0;
    if (values.size() == wanted) return expected("no more");
    if (!parseNumber(token, value)) return expected(left() + " signed 32-bit");
    values.push_back(value);
    return true;
  }

  static Bits toBits(const std::vector<std::int32_t>& values) {
    return Bits(values.begin(), values.end());
  }

  static void fill(std::map<std::string_view, Item>& items, Vector& vector) {
    for (const auto& f : kGenerics) vector.generics.*f.member = items[f.name].scalar;
    const auto expected = [&](std::string_view name) -> std::optional<Bits> {
      const auto it = items.find(name);
      if (it == items.end()) return std::nullopt;
      return toBits(it->second.values);
    };
    if (vector.channel == Channel::Shared) {
      SharedCall& call = vector.shared;
      for (const auto& f : kSchControl) call.control.*f.member = items[f.name].scalar;
      call.maxHarqBufferSize = items["max_harq_buffer_size"].scalar;
      call.llr = std::move(items["tb_llr"].values);
      for (std::size_t s = 0; s < 3; ++s) {
        if (const auto it = items.find(kHarqNames[s]); it != items.end()) {
          call.harq[s] = std::move(it->second.values);
        }
      }
      call.data = expected(kSchExpected[0]);
      call.cqi = expected(kSchExpected[1]);
      call.ack = expected(kSchExpected[2]);
      call.ri = expected(kSchExpected[3]);
    } else {
      ControlCall& call = vector.control;
      for (const auto& f : kCchControl) call.control.*f.member = items[f.name].scalar;
      call.llr = std::move(items["llr"].values);
      call.cqi = expected(kCchExpected[0]);
      call.ack = expected(kCchExpected[1]);
    }
  }

  std::string_view itsText;
  std::string_view itsName;
  std::size_t itsPos = 0;
  std::size_t itsLine = 0;
  std::string itsError;
};

// Text in the files' grammar: "name value" lines and arrays of values or bits.
class Writer {
 public:
  explicit Writer(std::string_view header) { (itsText += header) += '\n'; }

  void line(std::string_view text) { (itsText += text) += '\n'; }

  void scalar(std::string_view name, std::int64_t value) {
    ((itsText += name) += ' ') += std::to_string(value) + '\n';
  }

  template <typename Record, std::size_t N>
  void fields(const Field<Record> (&table)[N], const Record& record) {
    for (const auto& f : table) scalar(f.name, record.*f.member);
  }

  void values(std::string_view name, std::span<const std::int32_t> values) {
    scalar(name, static_cast<std::int64_t>(values.size()));
    for (std::size_t i = 0; i < values.size(); ++i) {
      itsText += std::to_string(values[i]);
      itsText += (i + 1) % kValuesPerLine == 0 || i + 1 == values.size() ? '\n' : ' ';
    }
  }

  void bits(std::string_view name, std::span<const std::uint8_t> bits) {
    scalar(name, static_cast<std::int64_t>(bits.size()));
    for (std::size_t i = 0; i < bits.size(); ++i) {
      itsText += bits[i] != 0 ? '1' : '0';
      if ((i + 1) % kBitsPerLine == 0 || i + 1 == bits.size()) itsText += '\n';
    }
  }

  std::string take() { return std::move(itsText); }

 private:
  std::string itsText;
};

template <typename T>
std::span<const T> written(const T* data, std::uint32_t size) {
  return data == nullptr ? std::span<const T>() : std::span<const T>(data, size);
}

}  // namespace

std::string parseVector(std::string_view text, std::string_view name, Vector& vector) {
  try {
    vector = Vector{};
    return Reader(text, name).run(vector);
  } catch (const std::exception& e) {  // allocation only: every size is checked first
    return std::string(name) + ": " + e.what();
  }
}

std::string readVectorFile(const std::filesystem::path& path, Vector& vector) {
  try {
    std::error_code ec;
    const std::uintmax_t size = std::filesystem::file_size(path, ec);
    if (ec) return path.string() + ": cannot be read: " + ec.message();
    if (size > kMaxFileBytes) {
      return path.string() + ": expected a vector file of at most " +
             std::to_string(kMaxFileBytes) + " bytes, found " + std::to_string(size);
    }
    std::ifstream in(path, std::ios::binary);
    std::ostringstream text;
    text << in.rdbuf();
    if (!in) return path.string() + ": cannot be read";
    return parseVector(text.str(), path.string(), vector);
  } catch (const std::exception& e) {
    return path.string() + ": " + e.what();
  }
}

std::string formatVector(const Vector& vector) {
  const bool shared = vector.channel == Channel::Shared;
  Writer w(kVectorHeader);
  w.line(shared ? "channel pusch" : "channel pucch");
  w.line("# generics");
  w.fields(kGenerics, vector.generics);
  w.line("# control fields");
  if (shared) {
    const SharedCall& call = vector.shared;
    w.fields(kSchControl, call.control);
    w.scalar("max_harq_buffer_size", call.maxHarqBufferSize);
    w.values("tb_llr", call.llr);
    if (call.control.SCH_ND == 0) {
      for (std::size_t s = 0; s < 3; ++s) w.values(kHarqNames[s], call.harq[s]);
    }
    const std::optional<Bits>* expected[] = {&call.data, &call.cqi, &call.ack, &call.ri};
    for (std::size_t i = 0; i < 4; ++i) {
      if (expected[i]->has_value()) w.bits(kSchExpected[i], **expected[i]);
    }
  } else {
    const ControlCall& call = vector.control;
    w.fields(kCchControl, call.control);
    w.values("llr", call.llr);
    if (call.cqi) w.bits(kCchExpected[0], *call.cqi);
    if (call.ack) w.bits(kCchExpected[1], *call.ack);
  }
  return w.take();
}

std::string formatSharedOutput(std::int32_t status, const vexlon_ip_brannoc_SCH_outputs& out) {
  Writer w(kOutputHeader);
  w.scalar("status", status);
  if (status != 0) return w.take();
  w.scalar("SCH_TB_crc_error", out.SCH_TB_crc_error);
  w.scalar("SCH_CQI_crc_error", out.SCH_CQI_crc_error);
  w.scalar("SCH_ACK_parity_error", out.SCH_ACK_parity_error);
  w.scalar("SCH_RI_parity_error", out.SCH_RI_parity_error);
  w.scalar("SCH_TAG_out", out.SCH_TAG_out);
  w.bits("SCH_data_out", written(out.SCH_data_out, out.SCH_data_out_size));
  w.bits("SCH_CQI_out", written(out.SCH_CQI_out, out.SCH_CQI_out_size));
  w.bits("SCH_ACK_out", written(out.SCH_ACK_out, out.SCH_ACK_out_size));
  w.bits("SCH_RI_out", written(out.SCH_RI_out, out.SCH_RI_out_size));
  w.bits("CW_CRC_out", written(out.CW_CRC_out, out.CW_CRC_out_size));
  w.values("sys_harq_buffer", written(out.sys_harq_buffer, out.harq_buffer_out_size));
  w.values("p0_harq_buffer", written(out.p0_harq_buffer, out.harq_buffer_out_size));
  w.values("p1_harq_buffer", written(out.p1_harq_buffer, out.harq_buffer_out_size));
  return w.take();
}

std::string formatControlOutput(std::int32_t status, const vexlon_ip_brannoc_CCH_outputs& out) {
  Writer w(kOutputHeader);
  w.scalar("status", status);
  if (status != 0) return w.take();
  w.scalar("CCH_TAG_out", out.CCH_TAG_out);
  w.bits("CCH_data_out", written(out.CCH_data_out, out.CCH_data_out_size));
  w.bits("CCH_ACK_out", written(out.CCH_ACK_out, out.CCH_ACK_out_size));
  return w.take();
}

std::string writeTextFile(const std::filesystem::path& path, std::string_view text) {
  std::ofstream out(path, std::ios::binary | std::ios::trunc);
  out.write(text.data(), static_cast<std::streamsize>(text.size()));
  out.close();
  return out ? std::string() : path.string() + ": cannot be written";
}

}  // namespace brannoc::vectors
