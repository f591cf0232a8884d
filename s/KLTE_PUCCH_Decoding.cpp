// KLTE_PUCCH_Decoding: PUCCH format 1a/1b/2/2a/2b decoding (TS 36.212 clause 5.2.3), register
// images and dumps.
#include "KLTE_PUCCH_Decoding.h"

#include "errorLine.h"

namespace brannoc {

namespace {

constexpr std::string_view kSource = "../s/KLTE_PUCCH_Decoding";

constexpr std::uint32_t kCodewordLength = 20;  // the (20,A) code
constexpr std::uint32_t kMaxCodedBits = 13;

// One control-channel dump key: its stream, file name piece, line format and register layout,
// and the line (with its fixed line number; 0 for none) printed when its file cannot be opened.
struct DumpKeyInfo {
  std::uint32_t key;
  std::string_view piece;
  std::uint32_t mode;
  std::uint32_t binWidth;  // 0: the descriptor's default
  std::uint32_t address;
  unsigned failureLine;
  std::string_view openFailure;
};

constexpr DumpKeyInfo kDumpKeys[] = {
    {1, "Output_TB", kDumpDecimal, 0, 0, 0, ""},
    {3, "Output_TB_ACK", kDumpDecimal, 0, 0, 333,
     "Error: UNABLE TO open Output CCH_rx_Output_TB_ACK."},
    {27, "llrInput_Out", kDumpBinary, 0, 0, 342,
     "Error: UNABLE TO open Output CCH_rx_llrInput_Out."},
    {28, "Ctrl_Out", kDumpAddressBinary, 32, 0x2234, 351,
     "Error: UNABLE TO open Output CCH_rx_Ctrl_Out."},
    {32, "Status_Out", kDumpBinary, 32, 0, 360, "Error: UNABLE TO open Output CCH_rx_Status_Out."},
};
constexpr std::uint32_t kCqiKey = 1;
constexpr std::uint32_t kAckKey = 3;
constexpr std::uint32_t kLlrKey = 27;
constexpr std::uint32_t kCtrlKey = 28;
constexpr std::uint32_t kStatusKey = 32;

}  // namespace

std::unique_ptr<KLTE_PUCCH_Decoding> KLTE_PUCCH_Decoding::create(const std::string& properties) {
  if (!properties.empty()) {
    errorLineFile(kSource, __LINE__,
                  "ERROR:KLTE_PUCCH_Decoding:Unexpected properties:", properties);
    return nullptr;
  }
  return std::make_unique<KLTE_PUCCH_Decoding>("8:5");
}

KLTE_PUCCH_Decoding::KLTE_PUCCH_Decoding(const std::string& llrWidth) {
  if (llrWidth != "8:5") {
    errorLineBare("WARNING llr bit width MUST be 8:5 or the code may have unexpected results.");
  }
  for (const DumpKeyInfo& info : kDumpKeys) {
    DumpDescriptor descriptor(nullptr, kDumpDecimal, 0, 4, 20, 16, 8);
    descriptor.setMode(info.mode);
    if (info.binWidth != 0) {
      descriptor.setBinWidth(info.binWidth);
    }
    descriptor.setAddress(info.address, 4);
    itsDumpTable[{info.key, kChannel}] = descriptor;
  }
}

bool KLTE_PUCCH_Decoding::setCCHParams(std::uint32_t cqiSize, std::uint32_t ackSize,
                                       std::uint32_t cyclicPrefix, std::uint32_t numPU) {
  if (!itsCCHEnabled) {
    errorLineSource(kSource, __LINE__, "Error: CCH channel is not enabled or wrong channel type. ");
    return false;
  }
  if (cyclicPrefix == 0 && cqiSize > kMaxCodedBits) {
    errorLineSource(kSource, __LINE__, "Error:CCH CQI max 13 bits. ");
    return false;
  }
  // Compared in 64 bits: two 32-bit sizes must not wrap past the limit.
  if (cyclicPrefix != 0 && std::uint64_t{cqiSize} + ackSize > kMaxCodedBits) {
    errorLineSource(kSource, __LINE__, "Error:CCH CQI+ACK max 13 bits. ");
    return false;
  }
  if (!itsCQIDecoder.setNumPU(numPU)) {
    errorLineSource(kSource, __LINE__, "UNABLE TO Set Number of PU");
    return false;
  }
  itsCyclicPrefix = cyclicPrefix;
  const bool cqiAccepted = itsRateDematch.rmParams().setCQISize(cqiSize);
  const bool ackAccepted = itsRateDematch.rmParams().setACKSize(ackSize);
  return cqiAccepted && ackAccepted;
}

bool KLTE_PUCCH_Decoding::decodeCCH(const SoftValues& llr, Bits& ackBits, Bits& cqiBits) {
  if (!itsCCHEnabled) {
    errorLineSource(kSource, __LINE__, "Error: CCH channel is not enabled. ");
    return false;
  }
  const std::uint32_t cqiSize = getCQISize();
  const std::uint32_t ackSize = getACKSize();
  if (cqiSize == 0 && ackSize == 0) {
    errorLineSource(kSource, __LINE__, "Error: No CCH data. ");
    return false;
  }
  if (cqiSize > 0 && (itsCyclicPrefix == 0 || ackSize == 0)) {
    // CQI codeword, then one soft value per ACK bit.
    if (!itsCQIDecoder.setNumBits(cqiSize)) {
      errorLineSource(kSource, __LINE__, "UNABLE TO Set Number of bits");
      return false;
    }
    if (!itsCQIDecoder.setCQIType(KLTE_CQI_Decoding::CQI_TYPE_PUCCH)) {
      errorLineSource(kSource, __LINE__, "UNABLE TO Set type");
      return false;
    }
    ackBits.assign(ackSize, 0);
    const std::uint32_t expected = itsCQIDecoder.getEncodedSize() + ackSize;
    if (llr.size() != expected) {
      errorLineSource(kSource, __LINE__, "INCORRECT TB SIZE. size=", llr.size(),
                      " tbCRC.size()+itsRateDematch.getACKsize()=", expected);
      return false;
    }
    const SoftValues codeword(llr.begin(), llr.begin() + kCodewordLength);
    for (std::uint32_t j = 0; j < ackSize; ++j) {
      ackBits[j] = llr[kCodewordLength + j] >= 0 ? 1 : 0;
    }
    cqiBits.assign(cqiSize, 0);
    if (!itsCQIDecoder.decode(codeword, cqiBits)) {
      errorLineSource(kSource, __LINE__, "UNABLE TO decode PUCCH");
      return false;
    }
  } else if (cqiSize > 0) {
    // Extended cyclic prefix: CQI and ACK coded together, the ACK bits last.
    if (!itsCQIDecoder.setNumBits(cqiSize + ackSize)) {
      errorLineSource(kSource, __LINE__, "UNABLE TO Set Number of bits");
      return false;
    }
    if (!itsCQIDecoder.setCQIType(KLTE_CQI_Decoding::CQI_TYPE_PUCCH)) {
      errorLineSource(kSource, __LINE__, "UNABLE TO Set type");
      return false;
    }
    if (llr.size() != kCodewordLength) {
      errorLineSource(kSource, __LINE__, "PUCCH DataIn wrong size");
      return false;
    }
    Bits message(cqiSize + ackSize, 0);
    if (!itsCQIDecoder.decode(llr, message)) {
      errorLineSource(kSource, __LINE__, "UNABLE TO encode PUCCH");
      return false;
    }
    cqiBits.assign(message.begin(), message.begin() + cqiSize);
    ackBits.resize(ackSize);
    for (std::uint32_t j = 0; j < ackSize; ++j) {
      ackBits[j] = message[cqiSize + j] != 0 ? 1 : 0;
    }
  } else {
    // ACK alone: one soft value per bit. A shorter input is refused rather than read past.
    cqiBits.clear();
    if (llr.size() < ackSize) {
      errorLineSource(kSource, __LINE__, "INCORRECT TB SIZE. size=", llr.size(),
                      " itsRateDematch.getACKsize()=", ackSize);
      return false;
    }
    ackBits.resize(ackSize);
    for (std::uint32_t j = 0; j < ackSize; ++j) {
      ackBits[j] = llr[j] >= 0 ? 1 : 0;
    }
  }
  writeDumps(llr, ackBits, cqiBits);
  return true;
}

void KLTE_PUCCH_Decoding::writeDumps(const SoftValues& llr, const Bits& ackBits,
                                     const Bits& cqiBits) {
  writeVector(getDumpDescriptor(kCqiKey, kChannel), cqiBits, "OUTPUT_UCI_CQI");
  writeVector(getDumpDescriptor(kAckKey, kChannel), ackBits, "OUTPUT_UCI_ACK");
  writeVector(getDumpDescriptor(kLlrKey, kChannel), llr, "LLR_INPUT_TB");
  const DumpDescriptor ctrlDump = getDumpDescriptor(kCtrlKey, kChannel);
  if (ctrlDump.isOpen()) {
    RegisterImage ctrl;
    packControlRegister(ctrl);
    writeVector(ctrlDump, ctrl, "CTRL");
  }
  const DumpDescriptor statusDump = getDumpDescriptor(kStatusKey, kChannel);
  if (statusDump.isOpen()) {
    RegisterImage status;
    packStatusRegister(status, ackBits, cqiBits);
    writeVector(statusDump, status, "STATUS");
  }
}

void KLTE_PUCCH_Decoding::packControlRegister(RegisterImage& ctrl) const {
  if (ctrl.empty()) {
    ctrl.assign(1, 0);
  }
  if (ctrl.size() != 1) {
    errorLineFileSpaced(kSource, __LINE__,
                        "Size of ctrl register is not consistent with "
                        "MEM_MAP_CTRL_UL_RX_DEC_CCH::memMapSize. Resizing.");
    ctrl.resize(1);
  }
  ctrl[0] |= (std::uint64_t{getCQISize()} & 0xF) | (std::uint64_t{itsCyclicPrefix} & 1) << 4 |
             (std::uint64_t{getACKSize()} & 3) << 5 | std::uint64_t{itsUserId & 0xFFFF} << 16;
}

void KLTE_PUCCH_Decoding::packStatusRegister(RegisterImage& status, const Bits& ackBits,
                                             const Bits& cqiBits) const {
  status.assign(1, 0);
  std::uint64_t word = itsUserId & 0xFFFF;
  for (std::size_t j = 0; j < cqiBits.size() && j < kMaxCodedBits; ++j) {
    word |= std::uint64_t{cqiBits[j] & 1U} << (16 + j);
  }
  for (std::size_t j = 0; j < ackBits.size() && j < 2; ++j) {
    word |= std::uint64_t{ackBits[j] & 1U} << (29 + j);
  }
  status[0] = word;
}

bool KLTE_PUCCH_Decoding::openDumpFile(std::uint32_t key, std::uint32_t channel,
                                       std::string_view prefix) {
  for (std::size_t k = 0; k < std::size(kDumpKeys); ++k) {
    const DumpKeyInfo& info = kDumpKeys[k];
    if (info.key != key) {
      continue;
    }
    if (!brannoc::openDumpFile(itsDumpTable, key, channel, itsDumpFiles[k], prefix, info.piece)) {
      if (info.failureLine != 0) {
        errorLineFile(kSource, info.failureLine, info.openFailure);
      }
      return false;
    }
    return true;
  }
  return false;
}

DumpDescriptor KLTE_PUCCH_Decoding::getDumpDescriptor(std::uint32_t key, std::uint32_t channel) {
  return lookupDumpDescriptor(itsDumpTable, key, channel);
}

bool KLTE_PUCCH_Decoding::setDumpDescriptor(std::uint32_t key, std::uint32_t channel,
                                            const DumpDescriptor& descriptor) {
  return storeDumpDescriptor(itsDumpTable, key, channel, kChannel, descriptor);
}

}  // namespace brannoc
