// One shared-channel or control-channel call described by fuzzer bytes, with every array
// allocated at exactly the size the call declares, so that the sanitizers catch any read or
// write past a caller's array. The byte layout (all words little-endian) is what the seed
// corpus writer produces from transmitter stimulus:
//
// shared channel:  generics byte, flags byte, two null-pointer bytes, the 23 control words,
//                  llr_size, harq_buffer_size, then the capacities max_harq_buffer_size,
//                  max_SCH_data_out_size, max_SCH_ACK_out_size, max_SCH_RI_out_size,
//                  max_SCH_CQI_out_size, max_CW_CRC_out_size; then the soft values of tb_llr
//                  and of the three input HARQ buffers.
// control channel: generics byte, flags byte, null-pointer byte, the 5 control words,
//                  llr_size, max_CCH_data_out_size, max_CCH_ACK_out_size, the soft values.
//
// generics byte: bits 0-1 C_NUM_PU (1, 2, 4, 8), bits 2-3 C_ALGORITHM_TYPE (0..2, 3 means 1),
// bit 4 C_INTERLEAVER_BUFFER_SIZE 18432 (else 36864), bits 5-6 C_NUM_CQI_PU - 1.
// flags byte: bit 0 soft values of four bytes (else one), bit 1 make the sizes consistent
// with the modulation, rows and segmentation (reaches the decode more often).
#ifndef BRANNOC_FUZZ_FUZZCALLS_H
#define BRANNOC_FUZZ_FUZZCALLS_H

#include <array>
#include <cstdint>
#include <vector>

#include "FuzzInput.h"
#include "vexlon_ip_brannoc_bitacc_cmodel.h"

namespace brannoc::fuzz {

// Declared sizes are capped (a capped size is what the call then declares), so that one
// input allocates little: 65536 soft values hold QPSK with 2047 rows of 12 columns and any
// transport block the harness lets through (at most 12288 bits, see keepShort); larger
// declarations only reach the size checks.
constexpr std::uint32_t kMaxSoftValues = 1U << 16;
constexpr std::uint32_t kMaxCapacity = 1U << 14;

vexlon_ip_brannoc_generics genericsFromByte(std::uint8_t g);
std::uint8_t byteFromGenerics(const vexlon_ip_brannoc_generics& g);

struct SchCall {
  vexlon_ip_brannoc_generics generics{};
  std::uint8_t flags = 0;
  std::uint16_t nulls = 0;  // bit per pointer, in the order of nullBits below
  vexlon_ip_brannoc_SCH_controlData control{};
  std::uint32_t llrSize = 0, harqSize = 0;
  std::array<std::uint32_t, 6> capacities{};  // harq, data, ACK, RI, CQI, CW
  std::vector<std::int32_t> llr;
  std::array<std::vector<std::int32_t>, 3> harqIn;

  static SchCall read(FuzzInput& in);
  void write(FuzzOutput& out) const;
  // Fields put into the ranges that keep one decode short (few iterations, a few code
  // blocks), limits and values beyond them left as they are.
  void keepShort();
  // llr_size, the data lengths, the HARQ length and the capacities made consistent.
  void makeConsistent();
};

// The instance of a generics record, made on first use and kept for the process: later
// inputs decode on an instance earlier ones have used, as a test bench's calls do.
vexlon_ip_brannoc_state* instanceFor(const vexlon_ip_brannoc_generics& generics);

// Runs the call and checks what any call must satisfy: a known status, nothing written
// beyond a capacity, the sizes of a successful call. Traps on a violation.
void runAndCheck(const SchCall& call, vexlon_ip_brannoc_state* state);

struct CchCall {
  vexlon_ip_brannoc_generics generics{};
  std::uint8_t flags = 0;
  std::uint8_t nulls = 0;  // bit 0 llr, 1 CCH_data_out, 2 CCH_ACK_out, 3 outputs, 4 state
  vexlon_ip_brannoc_CCH_controlData control{};
  std::uint32_t llrSize = 0, maxData = 0, maxAck = 0;
  std::vector<std::int32_t> llr;

  static CchCall read(FuzzInput& in);
  void write(FuzzOutput& out) const;
};

void runAndCheck(const CchCall& call, vexlon_ip_brannoc_state* state);

}  // namespace brannoc::fuzz

#endif  // BRANNOC_FUZZ_FUZZCALLS_H
