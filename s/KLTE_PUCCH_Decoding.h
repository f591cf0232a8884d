// KLTE_PUCCH_Decoding: the control-channel (PUCCH) decoder of one library instance, TS 36.212
// clause 5.2.3. A CQI report of up to 13 bits arrives as the 20 soft values of a (20,A)
// codeword and is decoded by the owned CQI block decoder. The HARQ-ACK bits travel:
// - with normal cyclic prefix (formats 2a/2b), as one soft value each after the codeword,
//   decided by sign;
// - with extended cyclic prefix, inside the codeword: A = CQI bits + ACK bits (at most 13),
//   the ACK bits last;
// - without CQI (formats 1a/1b), as one soft value each, decided by sign.
// Each decode also builds the core's control and status register images (64-bit words, for
// the dumps only) and writes its dump records.
#ifndef BRANNOC_KLTE_PUCCH_DECODING_H
#define BRANNOC_KLTE_PUCCH_DECODING_H

#include <array>
#include <cstdint>
#include <fstream>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "KFileIO.h"
#include "KLTE_CQI_Decoding.h"
#include "KRateDeMatch.h"

namespace brannoc {

class KLTE_PUCCH_Decoding {
 public:
  using SoftValues = std::vector<std::int32_t>;
  using Bits = std::vector<std::uint8_t>;
  using RegisterImage = std::vector<std::uint64_t>;

  static constexpr std::uint32_t kChannel = 1;

  // Factory: only the empty properties text is accepted; the object is built for 8:5 LLRs.
  static std::unique_ptr<KLTE_PUCCH_Decoding> create(const std::string& properties);

  // Any width text other than "8:5" is warned about (the width is not used otherwise).
  explicit KLTE_PUCCH_Decoding(const std::string& llrWidth);

  KLTE_PUCCH_Decoding(const KLTE_PUCCH_Decoding&) = delete;
  KLTE_PUCCH_Decoding& operator=(const KLTE_PUCCH_Decoding&) = delete;

  // Sizes of the next decodes. Normal cyclic prefix: at most 13 CQI bits; extended: at most
  // 13 CQI + ACK bits; at most 2 ACK bits. A refusal in the size or unit checks keeps the
  // previous settings.
  bool setCCHParams(std::uint32_t cqiSize, std::uint32_t ackSize, std::uint32_t cyclicPrefix,
                    std::uint32_t numPU);

  // Decodes the soft values of one transmission into the ACK and CQI bits (both resized).
  // The soft values must number exactly 20 + ACK bits (normal cyclic prefix or no ACK), 20
  // (extended cyclic prefix with CQI and ACK), or at least the ACK bits (ACK only).
  bool decodeCCH(const SoftValues& llr, Bits& ackBits, Bits& cqiBits);

  // MEM_MAP_CTRL_UL_RX_DEC_CCH, one word: CQI size (bits 3..0), cyclic prefix (4), ACK size
  // (6..5), user (31..16), OR-ed into the word the image holds.
  void packControlRegister(RegisterImage& ctrl) const;
  // One word: user (15..0), CQI bit j at bit 16 + j, ACK bits at 29 and 30.
  void packStatusRegister(RegisterImage& status, const Bits& ackBits, const Bits& cqiBits) const;

  // Debug dumps of keys 1, 3, 27, 28 and 32 on channel 1. Opening any other key does nothing.
  bool openDumpFile(std::uint32_t key, std::uint32_t channel, std::string_view prefix);
  DumpDescriptor getDumpDescriptor(std::uint32_t key, std::uint32_t channel);
  bool setDumpDescriptor(std::uint32_t key, std::uint32_t channel,
                         const DumpDescriptor& descriptor);

  std::uint32_t getCQISize() const { return itsRateDematch.getRMParams().cqiSize; }
  std::uint32_t getACKSize() const { return itsRateDematch.getRMParams().ackSize; }
  std::uint32_t getCyclicPrefix() const { return itsCyclicPrefix; }

  // The user of the status words; the control-channel call keeps its low 16 bits.
  void setUserId(std::uint32_t userId) { itsUserId = userId & 0xFFFF; }
  std::uint32_t getUserId() const { return itsUserId; }

 private:
  void writeDumps(const SoftValues& llr, const Bits& ackBits, const Bits& cqiBits);

  std::array<std::ofstream, 5> itsDumpFiles;  // keys 1, 3, 27, 28, 32 in that order
  DumpTable itsDumpTable;
  KRateDeMatch itsRateDematch;  // only its parameter set: the CQI and ACK sizes
  KLTE_CQI_Decoding itsCQIDecoder;
  std::uint32_t itsUserId = 0;
  std::uint32_t itsCyclicPrefix = 0;  // 0 normal, 1 extended
  bool itsCCHEnabled = true;
};

}  // namespace brannoc

#endif  // BRANNOC_KLTE_PUCCH_DECODING_H
