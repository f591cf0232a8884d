// brannoc gen: vector files from the transmitter, one per transmission. Each block is sent
// --max-tx times; the HARQ inputs of a retransmission are what the decoder library returned
// for the transmission before it.
#include <fmt/format.h>

#include <cmath>
#include <filesystem>
#include <limits>
#include <memory>

#include "Commands.h"
#include "LinkOptions.h"
#include "vectors/VectorFile.h"

namespace brannoc::tool {

namespace {

namespace fs = std::filesystem;

struct GenOptions {
  LinkOptions link;
  double snr = std::numeric_limits<double>::infinity();
  std::uint64_t blocks = 1;
  std::uint64_t seed = 1;
  std::string out;
};

vectors::Vector vectorOf(const sim::Call& call, const vexlon_ip_brannoc_generics& generics) {
  vectors::Vector v;
  v.generics = generics;
  if (call.shared != nullptr) {
    const vexlon_ip_brannoc_SCH_inputs& in = *call.shared;
    vectors::SharedCall& s = v.shared;
    v.channel = vectors::Channel::Shared;
    s.control = in.controlData;
    s.maxHarqBufferSize = call.maxHarqBufferSize;
    s.llr.assign(in.tb_llr, in.tb_llr + in.llr_size);
    const std::int32_t* harq[] = {in.sys_harq_buffer, in.p0_harq_buffer, in.p1_harq_buffer};
    for (std::size_t i = 0; i < 3; ++i) {
      if (harq[i] != nullptr) s.harq[i].assign(harq[i], harq[i] + in.harq_buffer_size);
    }
    s.data = *call.data;
    s.cqi = *call.cqi;
    s.ack = *call.ack;
    s.ri = *call.ri;
  } else {
    const vexlon_ip_brannoc_CCH_inputs& in = *call.control;
    v.channel = vectors::Channel::Control;
    v.control.control = in.controlData;
    v.control.llr.assign(in.llr, in.llr + in.llr_size);
    v.control.cqi = *call.cqi;
    v.control.ack = *call.ack;
  }
  return v;
}

int runGen(const GenOptions& o) {
  std::vector<sim::Curve> curves;
  std::string error;
  if (!o.link.curves(curves, error) || curves.size() != 1) {
    fmt::print(stderr, "brannoc gen: {}\n",
               error.empty() ? "every link option takes one value here" : error);
    return 2;
  }
  sim::LinkConfig config = curves[0].link;
  config.retransmitDecoded = true;
  const bool oneFile = fs::path(o.out).extension() == ".vec";
  if (oneFile && (o.blocks != 1 || config.maxTransmissions != 1)) {
    fmt::print(stderr,
               "brannoc gen: a single .vec file holds one transmission: give a folder, "
               "or --blocks 1 --max-tx 1\n");
    return 2;
  }
  sim::Link link(config);
  if (!link.open(error)) {
    fmt::print(stderr, "brannoc gen: {}\n", error);
    return 2;
  }
  std::error_code ec;
  if (!oneFile) fs::create_directories(o.out, ec);
  std::uint64_t written = 0;
  for (std::uint64_t b = 0; b < o.blocks && error.empty(); ++b) {
    std::uint32_t t = 0;
    const auto write = [&](const sim::Call& call) {
      const fs::path path = oneFile ? fs::path(o.out)
                            : config.channel == sim::Channel::Pusch
                                ? fs::path(o.out) / fmt::format("b{:04}-t{}.vec", b, ++t)
                                : fs::path(o.out) / fmt::format("b{:04}.vec", b);
      if (error.empty())
        error =
            vectors::writeTextFile(path, vectors::formatVector(vectorOf(call, config.generics)));
      written += error.empty();
    };
    sim::BlockOutcome outcome;
    std::string failure;
    if (!link.runBlock(o.snr, sim::blockSeed(o.seed, 0, b), outcome, failure, write) &&
        error.empty()) {
      error = failure;
    }
  }
  if (!error.empty()) {
    fmt::print(stderr, "brannoc gen: {}\n", error);
    return 1;
  }
  fmt::print("wrote {} vector file{} to {}\n", written, written == 1 ? "" : "s", o.out);
  return 0;
}

}  // namespace

void addGenCommand(CLI::App& app, int& status, const Processes& processes) {
  auto options = std::make_shared<GenOptions>();
  CLI::App* gen = app.add_subcommand(
      "gen",
      "Write vector files (docs/vector-files.md): the inputs of each PUSCH or PUCCH call "
      "from the transmitter, with the payload sent as the expected results. Each block is "
      "sent --max-tx times (rv from --rv), the HARQ inputs of a retransmission being what "
      "the model returned for the transmission before it.");
  options->link.add(*gen);
  gen->get_option("--max-tx")->default_val("1");
  gen->add_option("--snr", options->snr, "Es/N0 in dB (default: noise-free, soft values +-64)");
  gen->add_option("--blocks", options->blocks, "transport blocks (or PUCCH reports)")
      ->capture_default_str();
  gen->add_option("--seed", options->seed, "seed of payloads and noise")->capture_default_str();
  gen->add_option("-o,--out", options->out,
                  "folder for the files (b0000-t1.vec ...), or one .vec file for one call")
      ->required();
  gen->callback(
      [options, &status, &processes] { status = processes.rank() == 0 ? runGen(*options) : 0; });
}

}  // namespace brannoc::tool
