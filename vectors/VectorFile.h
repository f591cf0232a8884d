// Vector files: one shared-channel (PUSCH) or control-channel (PUCCH) call of the decoder
// library as plain text, with the results a test bench expects, and the output files that
// hold what a call returned. The format is described in docs/vector-files.md.
//
// The reader never throws and never trusts a size it reads: a count is checked against
// kMaxArrayValues before anything is kept, and the values are stored as they are read. A file
// it cannot take gives one message, "FILE:LINE: what was expected there".
//
// This library depends on the standard library and the public header's records only (it
// does not link the decoder), so that fuzz harnesses and test benches can read the files.
#ifndef BRANNOC_VECTORS_VECTORFILE_H
#define BRANNOC_VECTORS_VECTORFILE_H

#include <array>
#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "vexlon_ip_brannoc_bitacc_cmodel.h"

namespace brannoc::vectors {

// The most values one array of a file may hold (the largest shared-channel call needs about
// 150,000 soft values and three HARQ buffers of about 270,000).
constexpr std::uint32_t kMaxArrayValues = 1u << 20;

// The largest file readVectorFile accepts, in bytes.
constexpr std::uintmax_t kMaxFileBytes = 64u << 20;

enum class Channel { Shared, Control };

using Bits = std::vector<std::uint8_t>;
using SoftValues = std::vector<std::int32_t>;

// The inputs of one shared-channel call and the results expected from it. The output
// capacities of the call are the control fields' sizes, except max_harq_buffer_size.
struct SharedCall {
  vexlon_ip_brannoc_SCH_controlData control{};
  std::uint32_t maxHarqBufferSize = 0;     // sum over the code blocks of K + 4
  SoftValues llr;                          // tb_llr
  std::array<SoftValues, 3> harq;          // sys, p0, p1 input HARQ buffers; empty for new data
  std::optional<Bits> data, cqi, ack, ri;  // expected SCH_data_out, SCH_CQI_out, ...
};

struct ControlCall {
  vexlon_ip_brannoc_CCH_controlData control{};
  SoftValues llr;
  std::optional<Bits> cqi, ack;  // expected CCH_data_out, CCH_ACK_out
};

struct Vector {
  Channel channel = Channel::Shared;
  vexlon_ip_brannoc_generics generics{};
  SharedCall shared;    // when channel is Shared
  ControlCall control;  // when channel is Control
};

// Parses the text of a vector file; name is the file name used in the message. Empty on
// success, else "name:line: ..." (vector is then unspecified).
std::string parseVector(std::string_view text, std::string_view name, Vector& vector);

// Reads and parses a file; the same messages, and one for a file that cannot be read.
std::string readVectorFile(const std::filesystem::path& path, Vector& vector);

// The text of a vector file for vector, which parseVector reads back as it is.
std::string formatVector(const Vector& vector);

// The text of an output file: the status of the call and, when it is 0, every result the
// record points to (sizes as the call wrote them).
std::string formatSharedOutput(std::int32_t status, const vexlon_ip_brannoc_SCH_outputs& out);
std::string formatControlOutput(std::int32_t status, const vexlon_ip_brannoc_CCH_outputs& out);

// Writes text to path; empty on success, else a message naming the file.
std::string writeTextFile(const std::filesystem::path& path, std::string_view text);

}  // namespace brannoc::vectors

#endif
