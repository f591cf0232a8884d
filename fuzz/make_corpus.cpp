// Writes the seed corpora of the fuzz harnesses into a folder: valid transmissions of every
// kind from the transmitter (PUSCH with and without UCI, retransmissions, CQI only, PUCCH
// with and without ACK, both cyclic prefixes), and from each of them the calls of the
// status-code tests (each control field one step past its limit, null and short arrays).
// Usage: make_corpus FOLDER (creates FOLDER/sch, FOLDER/cch, FOLDER/dump, FOLDER/corvane,
// FOLDER/vector).
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <string>
#include <utility>
#include <vector>

#include "FuzzCalls.h"
#include "tx/PucchTransmitter.h"
#include "tx/PuschTransmitter.h"
#include "tx/TurboEncoder.h"
#include "vectors/VectorFile.h"

namespace {

namespace fz = brannoc::fuzz;
namespace tx = brannoc::tx;

void writeFile(const std::filesystem::path& folder, const std::string& name,
               const fz::FuzzOutput& out) {
  std::filesystem::create_directories(folder);
  std::ofstream file(folder / name, std::ios::binary);
  file.write(reinterpret_cast<const char*>(out.bytes().data()),
             static_cast<std::streamsize>(out.bytes().size()));
}

void writeText(const std::filesystem::path& folder, const std::string& name,
               const std::string& text) {
  std::filesystem::create_directories(folder);
  std::ofstream(folder / name, std::ios::binary) << text;
}

tx::Bits pattern(std::size_t n, unsigned salt) {
  tx::Bits bits(n);
  for (std::size_t i = 0; i < n; ++i) bits[i] = ((i * 7 + salt + i / 3) % 5) < 2 ? 1 : 0;
  return bits;
}

struct Scenario {
  std::uint32_t prb, Qm;
  tx::CyclicPrefix cp;
  std::uint32_t tb, rv, cqi, ack, ri;
  bool retransmission;
};

fz::SchCall schCall(const Scenario& s) {
  tx::PuschParameters p;
  p.numPrb = s.prb;
  p.Qm = s.Qm;
  p.cp = s.cp;
  p.tbSize = s.tb;
  p.rv = s.rv;
  p.cqiBits = s.cqi;
  p.ackBits = s.ack;
  p.riBits = s.ri;
  p.cqi.betaIndex = 8;
  p.ack.betaIndex = p.ri.betaIndex = 6;
  tx::ChannelSettings channel;
  channel.mode = tx::ChannelMode::Awgn;
  channel.esN0Db = 6.0;
  tx::PuschTransmission t;
  tx::transmitPusch(p, {pattern(s.tb, 1), pattern(s.cqi, 2), pattern(s.ack, 3), pattern(s.ri, 4)},
                    channel, t);
  const tx::PuschControlFields& f = t.fields;
  fz::SchCall call;
  call.generics = vexlon_ip_brannoc_get_default_generics();
  call.control = {f.Qcqi,
                  f.cqiBits,
                  f.contentMask,
                  f.Qack,
                  f.ackBits,
                  f.Qri,
                  f.riBits,
                  f.Eidx,
                  f.Rmux,
                  f.cpIndex,
                  f.Eminus,
                  f.Eplus,
                  f.tbSize,
                  2,
                  f.qamIndex,
                  7,
                  3,
                  2,
                  f.rv,
                  s.retransmission ? 0U : 1U,
                  0,
                  0,
                  11};
  call.llrSize = f.totalBits;
  call.llr = t.softValues;
  if (s.retransmission) {
    call.harqSize = f.harqBufferLength;
    for (std::size_t k = 0; k < 3; ++k) {
      call.harqIn[k].assign(call.harqSize, static_cast<std::int32_t>(k * 17) - 20);
    }
  }
  call.capacities = {f.harqBufferLength, f.tbSize, f.ackBits, f.riBits, f.cqiBits, 8};
  return call;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) {
    std::fprintf(stderr, "usage: make_corpus FOLDER\n");
    return 2;
  }
  const std::filesystem::path root = argv[1];
  using tx::CyclicPrefix;
  const Scenario scenarios[] = {
      {6, 2, CyclicPrefix::Normal, 1000, 0, 0, 0, 0, false},
      {4, 4, CyclicPrefix::Extended, 600, 2, 5, 1, 1, false},
      {8, 6, CyclicPrefix::Normal, 3000, 0, 20, 2, 2, false},
      {6, 2, CyclicPrefix::Normal, 1000, 2, 0, 2, 0, true},
      {2, 2, CyclicPrefix::Normal, 0, 0, 30, 1, 1, false},
      {2, 4, CyclicPrefix::Extended, 0, 0, 9, 0, 2, false},
  };
  int n = 0;
  for (const Scenario& s : scenarios) {
    fz::SchCall call = schCall(s);
    const std::string base = "sch-" + std::to_string(n++);
    fz::FuzzOutput valid;
    call.write(valid);
    writeFile(root / "sch", base, valid);
    // The same call as a vector file, for the reader's harness.
    brannoc::vectors::Vector vector;
    vector.generics = call.generics;
    vector.shared.control = call.control;
    vector.shared.maxHarqBufferSize = call.capacities[0];
    vector.shared.llr = call.llr;
    vector.shared.harq = call.harqIn;
    vector.shared.data = pattern(s.tb, 1);
    writeText(root / "vector", base + ".vec", brannoc::vectors::formatVector(vector));
    // The same call past each control field's limit (SCH_TAG has none), and with each
    // pointer null.
    const std::uint32_t pastLimit[23] = {4096, 128, 16,    256,   3,      256, 3, 128,
                                         2048, 2,   65536, 65536, 262144, 16,  3, 65536,
                                         16,   16,  4,     2,     2,      2,   0};
    for (int k = 0; k < 22; ++k) {
      fz::SchCall broken = call;
      std::uint32_t* brokenFields = &broken.control.SCH_CQI_IP_SIZE;
      brokenFields[k] = pastLimit[k];
      fz::FuzzOutput out;
      broken.write(out);
      writeFile(root / "sch", base + "-field" + std::to_string(k), out);
    }
    for (int bit = 0; bit < 14; ++bit) {
      fz::SchCall broken = call;
      broken.nulls = static_cast<std::uint16_t>(1U << bit);
      fz::FuzzOutput out;
      broken.write(out);
      writeFile(root / "sch", base + "-null" + std::to_string(bit), out);
    }
  }
  n = 0;
  for (const CyclicPrefix cp : {CyclicPrefix::Normal, CyclicPrefix::Extended}) {
    for (const auto& [cqi, ack] : {std::pair{13u, 0u}, {11u, 2u}, {4u, 1u}, {0u, 2u}, {0u, 1u}}) {
      tx::PucchTransmission t;
      tx::ChannelSettings channel;
      channel.mode = tx::ChannelMode::Awgn;
      channel.esN0Db = 4.0;
      if (!tx::transmitPucch(pattern(cqi, 5), pattern(ack, 6), cp, channel, t).ok()) {
        continue;
      }
      fz::CchCall call;
      call.generics = vexlon_ip_brannoc_get_default_generics();
      call.control = {cqi, cp == CyclicPrefix::Extended ? 1U : 0U, ack, 0x1234, 5};
      call.llrSize = static_cast<std::uint32_t>(t.softValues.size());
      call.llr = t.softValues;
      call.maxData = 13;
      call.maxAck = 2;
      fz::FuzzOutput out;
      call.write(out);
      writeFile(root / "cch", "cch-" + std::to_string(n), out);
      brannoc::vectors::Vector vector;
      vector.channel = brannoc::vectors::Channel::Control;
      vector.generics = call.generics;
      vector.control.control = call.control;
      vector.control.llr = call.llr;
      vector.control.cqi = pattern(cqi, 5);
      vector.control.ack = pattern(ack, 6);
      writeText(root / "vector", "cch-" + std::to_string(n) + ".vec",
                brannoc::vectors::formatVector(vector));
      // The dump harness: two switches (a control-channel and a shared-channel key), then
      // the same call.
      fz::FuzzOutput dump;
      dump.byte(1);
      dump.word(28);
      dump.byte(1);
      dump.byte(4);
      for (const char c : std::string("CCH_")) dump.byte(static_cast<std::uint8_t>(c));
      dump.word(static_cast<std::uint32_t>(n));
      dump.byte(0);
      dump.byte(3);
      for (const char c : std::string("S\0_", 3)) dump.byte(static_cast<std::uint8_t>(c));
      call.write(dump);
      writeFile(root / "dump", "dump-" + std::to_string(n), dump);
      ++n;
    }
  }
  // The turbo model: noisy code blocks of a few sizes, alone and in a batch of three.
  for (const bool batch : {false, true}) {
    fz::FuzzOutput out;
    out.byte(batch ? 2 : 0);
    out.byte(0x01 | 0x04);  // 2 units, algorithm 1
    out.byte(32);
    if (batch) out.byte(3);
    for (const std::uint32_t K : {std::uint32_t{batch ? 40u : 1024u}, 48u, 56u}) {
      tx::TurboCodeword d;
      tx::turboEncode(pattern(K, K), d);
      const std::uint32_t index = K <= 512 ? (K - 40) / 8 : 60 + (K - 528) / 16;
      out.byte(static_cast<std::uint8_t>(index));
      out.byte(2);  // 3 iterations
      out.byte(0);  // no null pointer
      out.word(K);
      for (const tx::Bits* stream : {&d.d0, &d.d1, &d.d2}) {
        for (std::size_t i = 0; i < stream->size(); ++i) {
          out.byte(static_cast<std::uint8_t>(((*stream)[i] != 0 ? 40 : -40) + int(i % 7) - 3));
        }
      }
      if (!batch) break;
    }
    writeFile(root / "corvane", batch ? "batch" : "single", out);
  }
  return 0;
}
