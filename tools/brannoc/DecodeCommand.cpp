// brannoc decode: vector files through the C interface, compared with their expected results.
#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <filesystem>
#include <map>
#include <memory>

#include "Commands.h"
#include "LinkOptions.h"
#include "sim/CallBuffers.h"
#include "vectors/VectorFile.h"

namespace brannoc::tool {

namespace {

namespace fs = std::filesystem;

struct DecodeOptions {
  std::vector<std::string> paths;
  std::string out;
  std::string dump;
  std::vector<std::string> keys{"all"};
};

// The decoder instance, made again when a vector asks for other generics.
class Decoder {
 public:
  ~Decoder() { vexlon_ip_brannoc_destroy_state(itsState); }

  vexlon_ip_brannoc_state* get(const vexlon_ip_brannoc_generics& g) {
    const auto same = [&] {
      return g.C_NUM_PU == itsGenerics.C_NUM_PU &&
             g.C_ALGORITHM_TYPE == itsGenerics.C_ALGORITHM_TYPE &&
             g.C_INTERLEAVER_BUFFER_SIZE == itsGenerics.C_INTERLEAVER_BUFFER_SIZE &&
             g.C_NUM_CQI_PU == itsGenerics.C_NUM_CQI_PU;
    };
    if (itsState == nullptr || !same()) {
      vexlon_ip_brannoc_destroy_state(itsState);
      itsState = vexlon_ip_brannoc_create_state(g);
      itsGenerics = g;
    }
    return itsState;
  }

 private:
  vexlon_ip_brannoc_state* itsState = nullptr;
  vexlon_ip_brannoc_generics itsGenerics{};
};

template <typename T>
std::uint32_t capacity(const std::vector<T>& v) {
  return static_cast<std::uint32_t>(v.size());
}

// Compares one result with its expectation; adds its name to wrong when they differ.
void check(const char* name, const std::optional<vectors::Bits>& expected, const std::uint8_t* got,
           std::uint32_t size, std::vector<std::string>& wrong) {
  if (expected &&
      !(expected->size() == size && std::equal(expected->begin(), expected->end(), got))) {
    wrong.push_back(name);
  }
}

struct Verdict {
  std::int32_t status = 0;
  std::vector<std::string> wrong;  // results that differ from the expected ones
  std::string summary;             // what was decoded
  std::string output;              // the output file's text
};

Verdict decodeShared(vexlon_ip_brannoc_state* state, const vectors::SharedCall& call) {
  const vexlon_ip_brannoc_SCH_controlData& c = call.control;
  const auto in = [](const vectors::SoftValues& v) { return v.empty() ? nullptr : v.data(); };
  const vexlon_ip_brannoc_SCH_inputs inputs{in(call.llr),
                                            in(call.harq[0]),
                                            in(call.harq[1]),
                                            in(call.harq[2]),
                                            capacity(call.llr),
                                            capacity(call.harq[0]),
                                            c};
  sim::SharedOutputs buffers;
  vexlon_ip_brannoc_SCH_outputs& out = buffers.prepare(c, call.maxHarqBufferSize);
  Verdict v;
  v.status = vexlon_ip_brannoc_SCH_bitacc_simulate(state, inputs, &out);
  v.output = vectors::formatSharedOutput(v.status, out);
  v.summary =
      fmt::format("pusch tbs {} rv {}{}", c.SCH_TBSIZE, c.SCH_RV, c.SCH_ND ? "" : " (combined)");
  if (v.status != 0) return v;
  if (call.data && !call.data->empty() && out.SCH_TB_crc_error != 0)
    v.wrong.push_back("transport-block CRC");
  check("data", call.data, buffers.data.data(), out.SCH_data_out_size, v.wrong);
  check("CQI", call.cqi, buffers.cqi.data(), out.SCH_CQI_out_size, v.wrong);
  check("ACK", call.ack, buffers.ack.data(), out.SCH_ACK_out_size, v.wrong);
  check("RI", call.ri, buffers.ri.data(), out.SCH_RI_out_size, v.wrong);
  return v;
}

Verdict decodeControl(vexlon_ip_brannoc_state* state, const vectors::ControlCall& call) {
  std::vector<std::uint8_t> cqi(std::clamp<std::uint32_t>(call.control.CCH_UCI_OP_SIZE, 1, 64)),
      ack(std::clamp<std::uint32_t>(call.control.CCH_ACK_OP_SIZE, 1, 64));
  const vexlon_ip_brannoc_CCH_inputs inputs{call.llr.empty() ? nullptr : call.llr.data(),
                                            capacity(call.llr), call.control};
  vexlon_ip_brannoc_CCH_outputs out{cqi.data(), ack.data(), capacity(cqi), capacity(ack), 0, 0, 0};
  Verdict v;
  v.status = vexlon_ip_brannoc_CCH_bitacc_simulate(state, inputs, &out);
  v.output = vectors::formatControlOutput(v.status, out);
  v.summary = fmt::format("pucch cqi {} ack {}", call.control.CCH_UCI_OP_SIZE,
                          call.control.CCH_ACK_OP_SIZE);
  if (v.status != 0) return v;
  check("CQI", call.cqi, cqi.data(), out.CCH_data_out_size, v.wrong);
  check("ACK", call.ack, ack.data(), out.CCH_ACK_out_size, v.wrong);
  return v;
}

// The files named: a folder stands for its .vec files in name order.
std::vector<fs::path> vectorFiles(const std::vector<std::string>& paths) {
  std::vector<fs::path> files;
  for (const std::string& p : paths) {
    std::error_code ec;
    if (!fs::is_directory(p, ec)) {
      files.emplace_back(p);
      continue;
    }
    std::vector<fs::path> inFolder;
    for (const auto& entry : fs::directory_iterator(p, ec)) {
      if (entry.path().extension() == ".vec") inFolder.push_back(entry.path());
    }
    std::sort(inFolder.begin(), inFolder.end());
    files.insert(files.end(), inFolder.begin(), inFolder.end());
  }
  return files;
}

// The name of a file's outputs (output file, dump prefix): its stem, or, when another file
// of the run has the same stem, its path as given with the folder separators as '_', so
// that files of different folders never write over each other's outputs.
std::vector<std::string> outputNames(const std::vector<fs::path>& files) {
  std::map<std::string, int> stems;
  for (const fs::path& file : files) ++stems[file.stem().string()];
  std::vector<std::string> names;
  for (const fs::path& file : files) {
    std::string name = file.stem().string();
    if (stems[name] > 1) {
      name = fs::path(file).replace_extension().relative_path().string();
      std::replace(name.begin(), name.end(), '/', '_');
    }
    names.push_back(name);
  }
  return names;
}

bool dumpKeys(const std::vector<std::string>& items, std::vector<std::uint32_t>& keys) {
  for (const std::string& item : items) {
    std::uint32_t key = 0;
    if (item == "all") {
      for (std::uint32_t k = 0; k <= 32; ++k) keys.push_back(k);
    } else if (parseUnsigned(item, key) && key <= 32) {
      keys.push_back(key);
    } else {
      return false;
    }
  }
  return true;
}

int runDecode(const DecodeOptions& o) {
  std::vector<std::uint32_t> keys;
  if (!o.dump.empty() && !dumpKeys(o.keys, keys)) {
    fmt::print(stderr, "brannoc decode: --keys takes 0..32 or all\n");
    return 2;
  }
  const std::vector<fs::path> files = vectorFiles(o.paths);
  if (files.empty()) {
    fmt::print(stderr, "brannoc decode: no .vec files in {}\n", fmt::join(o.paths, ", "));
    return 2;
  }
  std::error_code ec;
  if (!o.out.empty()) fs::create_directories(o.out, ec);
  if (const fs::path folder = fs::path(o.dump).parent_path(); !folder.empty()) {
    fs::create_directories(folder, ec);
  }
  Decoder decoder;
  std::size_t passed = 0, mismatched = 0, failed = 0, unreadable = 0;
  const std::vector<std::string> names = outputNames(files);
  for (std::size_t n = 0; n < files.size(); ++n) {
    const fs::path& file = files[n];
    vectors::Vector vector;
    if (const std::string error = vectors::readVectorFile(file, vector); !error.empty()) {
      fmt::print("UNREADABLE {}\n", error);
      ++unreadable;
      continue;
    }
    const bool shared = vector.channel == vectors::Channel::Shared;
    const auto& harq = vector.shared.harq;
    if (shared && (harq[1].size() != harq[0].size() || harq[2].size() != harq[0].size())) {
      fmt::print("UNREADABLE {}: expected three HARQ buffers of one length, found {}, {} and {}\n",
                 file.string(), harq[0].size(), harq[1].size(), harq[2].size());
      ++unreadable;
      continue;
    }
    vexlon_ip_brannoc_state* state = decoder.get(vector.generics);
    if (state == nullptr) {
      fmt::print("FAILED {}: the library refused the generics\n", file.string());
      ++failed;
      continue;
    }
    const std::string dumpName = o.dump + names[n] + "-";
    for (std::uint32_t key : keys) {
      IUO_set_debugfn_state(state, key, shared ? 0 : 1, dumpName.data(),
                            static_cast<std::uint32_t>(dumpName.size()));
    }
    const Verdict v =
        shared ? decodeShared(state, vector.shared) : decodeControl(state, vector.control);
    if (!o.out.empty()) {
      const fs::path out = fs::path(o.out) / (names[n] + ".out");
      if (const std::string error = vectors::writeTextFile(out, v.output); !error.empty()) {
        fmt::print(stderr, "brannoc decode: {}\n", error);
      }
    }
    if (v.status != 0) {
      fmt::print("FAILED {}: {}, status {}\n", file.string(), v.summary, v.status);
      ++failed;
    } else if (!v.wrong.empty()) {
      fmt::print("MISMATCH {}: {}, differs: {}\n", file.string(), v.summary,
                 fmt::join(v.wrong, ", "));
      ++mismatched;
    } else {
      fmt::print("PASS {}: {}\n", file.string(), v.summary);
      ++passed;
    }
  }
  fmt::print("{} vectors: {} passed, {} mismatched, {} failed, {} unreadable\n", files.size(),
             passed, mismatched, failed, unreadable);
  return passed == files.size() ? 0 : 1;
}

}  // namespace

void addDecodeCommand(CLI::App& app, int& status, const Processes& processes) {
  auto options = std::make_shared<DecodeOptions>();
  CLI::App* decode = app.add_subcommand(
      "decode",
      "Decode vector files through the C interface and compare the results with the expected "
      "ones: one line per file and a summary; the exit status is 0 only when every file "
      "passed.");
  decode->add_option("paths", options->paths, "vector files, or folders of .vec files")->required();
  decode->add_option(
      "-o,--out", options->out,
      "folder for the output files (<name>.out; files of one name in different folders: "
      "<folder>_<name>.out)");
  auto* dump = decode->add_option("--dump", options->dump,
                                  "switch debug dumps on, into files <PREFIX><name>-<piece>.log");
  decode->add_option("--keys", options->keys, "dump keys 0..32, or all")
      ->delimiter(',')
      ->needs(dump)
      ->capture_default_str();
  decode->callback(
      [options, &status, &processes] { status = processes.rank() == 0 ? runDecode(*options) : 0; });
}

}  // namespace brannoc::tool
