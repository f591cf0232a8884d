// KLTE_PUSCH_Decoding: construction, configuration and debug dump files of the shared-channel
// decoder.
#include "KLTE_PUSCH_Decoding.h"

#include "errorLine.h"

namespace brannoc {

namespace {

constexpr std::string_view kSource = "../s/KLTE_PUSCH_Decoding";

// Line numbers of the decoder's messages, fixed because the hardware comparison's log
// screening matches whole lines.
constexpr unsigned kFactoryLine = 286;
constexpr unsigned kModulationLine = 306;
constexpr unsigned kTransportBlockLine = 316;
constexpr unsigned kCQILine = 336;
constexpr unsigned kCQINumPULine = 346;
constexpr unsigned kACKLine = 359;
constexpr unsigned kRILine = 376;

// One shared-channel dump key: its file name piece, line format and register layout, and the
// line printed when its file cannot be opened.
struct DumpKeyInfo {
  std::string_view piece;
  std::uint32_t mode;
  std::uint32_t binWidth;  // 0: the descriptor's default
  std::uint32_t address;
  std::string_view openFailure;
};

constexpr std::uint32_t kBits = kDumpDecimal;
constexpr std::uint32_t kSoft = kDumpBinary;

// Keys 0..32. Registers: the control words as bus writes from 0x2200, the status words in 32
// binary digits.
constexpr DumpKeyInfo kDumpKeys[KLTE_PUSCH_Decoding::kNumDumpKeys] = {
    {"Output_TB", kBits, 0, 0, "Error: UNABLE TO open Output SCH_rx_Output_TB                "},
    {"Output_TB_CQI", kBits, 0, 0, "Error: UNABLE TO open Output SCH_rx_Output_TB_CQI           "},
    {"Output_TB_RI", kBits, 0, 0, "Error: UNABLE TO open Output SCH_rx_Output_TB_RI           "},
    {"Output_TB_ACK", kBits, 0, 0, "Error: UNABLE TO open Output SCH_rx_Output_TB_ACK           "},
    {"tbWcrc_TB_Out", kBits, 0, 0, "Error: UNABLE TO open Output SCH_rx_tbWcrc_TB_Out"},
    {"cwsWcrc_CW_Out", kBits, 0, 0, "Error: UNABLE TO open Output SCH_rx_cwsWcrc_CW_Out      ."},
    {"cwsWcrc_TB_Out", kBits, 0, 0, "Error: UNABLE TO open Output SCH__rx_cwsWcrc_TB_Out"},
    {"afterDecode_CW_Out", kBits, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_afterDecode_CW_Out         "},
    {"afterDecode_TB_Out", kBits, 0, 0,
     "Error: UNABLE TO open  Output SCH_rx_afterDecode_TB_Out        "},
    {"afterDecode_TB_CQI_Out", kBits, 0, 0,
     "Error: UNABLE TO open  Output SCH_rx_afterDecode_TB_CQI_Out    "},
    {"afterHARQ_CW_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_afterHARQ_CW_Out         "},
    {"afterHARQ_TB_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_afterHARQ_TB_Out         "},
    {"harqInput_CW_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_harqInput_CW_Out         "},
    {"harqInput_TB_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_harqInput_TB_Out         "},
    {"afterChase_CW_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_afterChase_CW_Out        "},
    {"afterChase_TB_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_afterChase_TB_Out        "},
    {"afterChase_TB_CQI_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_afterChase_TB_CQI_Out    "},
    {"rawViterbi_TB_CQI_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_rawViterbi_CQI_Out      "},
    {"afterChase_TB_ACK_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_afterChase_TB_ACK_Out    "},
    {"afterChase_TB_RI_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_afterChase_TB_RI_Out    "},
    {"llrInput_TB_CQI_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_llrInput_TB_CQI_Out      "},
    {"afterDemux_TB_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_afterDemux_TB_Out        "},
    {"llrInput_TB_Data_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_llrInput_TB_Data_Out     "},
    {"afterDeInterleave_TB_CQI_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_afterDemux_TB_CQI_Out    "},
    {"llrInput_TB_RI_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_llrInput_TB_RI_Out       "},
    {"llrInput_TB_ACK_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_llrInput_TB_ACK_Out      "},
    {"llrInput_CW_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_llrInput_CW_Out          "},
    {"llrInput_TB_Out", kSoft, 0, 0,
     "Error: UNABLE TO open Output SCH_rx_llrInput_TB_Out          "},
    {"CTRL", kDumpAddressBinary, 32, 0x2200, "Error: UNABLE TO open Output SCH_rx_CTRL        ."},
    {"STATUS_CQI", kSoft, 32, 0, "Error: UNABLE TO open Output SCH_rx_Status_CQI    ."},
    {"STATUS_RI", kSoft, 32, 0, "Error: UNABLE TO open Output SCH_rx_Status_RI     ."},
    {"STATUS_ACK", kSoft, 32, 0, "Error: UNABLE TO open Output SCH_rx_Status_ACK    ."},
    {"STATUS", kSoft, 32, 0, "Error: UNABLE TO open Output SCH_rx_Status        ."},
};

}  // namespace

std::unique_ptr<KLTE_PUSCH_Decoding> KLTE_PUSCH_Decoding::create(const std::string& properties) {
  if (!properties.empty()) {
    errorLineFile(kSource, kFactoryLine,
                  "ERROR:KLTE_PUSCH_Decoding:Unexpected properties:", properties);
    return nullptr;
  }
  return std::make_unique<KLTE_PUSCH_Decoding>("8:5");
}

// The LLR format is built as 8:8 holding 0 and set to 8:5 once every member exists.
KLTE_PUSCH_Decoding::KLTE_PUSCH_Decoding(const std::string& llrWidth)
    : itsLLRFormat(0.0, 8, 8, false), itsTurboDecoder() {
  if (llrWidth != "8:5") {
    errorLineBare("WARNING llr bit width MUST be 8:5 or the code may have unexpected results.");
  }
  itsLLRFormat.setTypeFromString("8:5");
  fillDumpTable();
}

KLTE_PUSCH_Decoding::~KLTE_PUSCH_Decoding() { itsTurboDecoder.destroyModel(); }

void KLTE_PUSCH_Decoding::fillDumpTable() {
  itsDumpTable.clear();
  for (std::uint32_t key = 0; key < kNumDumpKeys; ++key) {
    DumpDescriptor descriptor(nullptr, kDumpDecimal, 0, 4, 20, 16, 8);
    descriptor.setMode(kDumpKeys[key].mode);
    if (kDumpKeys[key].binWidth != 0) {
      descriptor.setBinWidth(kDumpKeys[key].binWidth);
    }
    descriptor.setAddress(kDumpKeys[key].address, 4);
    itsDumpTable[{key, kChannel}] = descriptor;
  }
}

bool KLTE_PUSCH_Decoding::openDumpFile(std::uint32_t key, std::uint32_t channel,
                                       std::string_view prefix) {
  if (key >= kNumDumpKeys) {
    return false;
  }
  if (!brannoc::openDumpFile(itsDumpTable, key, channel, itsDumpFiles[key], prefix,
                             kDumpKeys[key].piece)) {
    errorLineBare(kDumpKeys[key].openFailure);
    return false;
  }
  return true;
}

DumpDescriptor KLTE_PUSCH_Decoding::getDumpDescriptor(std::uint32_t key, std::uint32_t channel) {
  return lookupDumpDescriptor(itsDumpTable, key, channel);
}

bool KLTE_PUSCH_Decoding::setDumpDescriptor(std::uint32_t key, std::uint32_t channel,
                                            const DumpDescriptor& descriptor) {
  return storeDumpDescriptor(itsDumpTable, key, channel, kChannel, descriptor);
}

bool KLTE_PUSCH_Decoding::channelEnabled(unsigned line) const {
  if (!itsSCHEnabled) {
    errorLineSource(kSource, line, "Error: SCH channel is not enabled. ");
  }
  return itsSCHEnabled;
}

bool KLTE_PUSCH_Decoding::setModulationParams(std::uint32_t totalBits, std::uint32_t Qm,
                                              std::uint32_t numLayers, std::uint32_t cpType) {
  if (!channelEnabled(kModulationLine)) {
    return false;
  }
  itsNumColumns = cpType != 0 ? 10 : 12;
  return itsRateDematch.setModulationParams(totalBits, Qm, numLayers, cpType);
}

bool KLTE_PUSCH_Decoding::setTransportBlockParams(std::uint32_t tbSize, std::uint32_t G,
                                                  std::uint32_t /*qm*/, std::uint32_t rvIdx,
                                                  std::uint32_t turboFlush) {
  if (!channelEnabled(kTransportBlockLine)) {
    return false;
  }
  const bool segmented = itsDeSegment.setTBSize(tbSize);
  const rateMatchParams& params = itsRateDematch.getRMParams();
  const bool matched = itsRateDematch.setParams(tbSize, G, params.Qm, rvIdx, params.Nlayers);
  itsTurboFlush = turboFlush;
  return segmented && matched;
}

bool KLTE_PUSCH_Decoding::setCQIParams(std::uint32_t cqiSize, std::uint32_t cqiQ,
                                       std::uint32_t numCQIPU) {
  if (!channelEnabled(kCQILine)) {
    return false;
  }
  const bool sized = itsRateDematch.rmParams().setCQISize(cqiSize);
  const bool coded = itsRateDematch.rmParams().setCQIQ(cqiQ);
  if (!itsCQIDecoder.setNumPU(numCQIPU)) {
    errorLineSource(kSource, kCQINumPULine, "UNABLE TO Set Number of PU");
    return false;
  }
  return sized && coded;
}

bool KLTE_PUSCH_Decoding::setACKParams(std::uint32_t ackSize, std::uint32_t ackQ) {
  if (!channelEnabled(kACKLine)) {
    return false;
  }
  const bool sized = itsRateDematch.rmParams().setACKSize(ackSize);
  const bool coded = itsRateDematch.rmParams().setACKQ(ackQ);
  return sized && coded;
}

bool KLTE_PUSCH_Decoding::setRIParams(std::uint32_t riSize, std::uint32_t riQ) {
  if (!channelEnabled(kRILine)) {
    return false;
  }
  const bool sized = itsRateDematch.rmParams().setRISize(riSize);
  const bool coded = itsRateDematch.rmParams().setRIQ(riQ);
  return sized && coded;
}

bool KLTE_PUSCH_Decoding::setTurboIterations(std::int32_t iterations) {
  if (iterations < 1 || iterations > 16) {
    return false;
  }
  itsTurboIterations = static_cast<std::uint32_t>(iterations);
  return true;
}

void KLTE_PUSCH_Decoding::setCallIdentifiers(std::uint32_t userId, bool hfc,
                                             std::uint32_t subframe) {
  itsUserId = userId & 0xFFFF;
  itsHFC = hfc;
  itsHarqSubframeId = itsSubframeId;
  itsSubframeId = subframe % 16;
}

std::uint32_t KLTE_PUSCH_Decoding::getDataLength() const {
  const rateMatchParams& params = itsRateDematch.getRMParams();
  std::uint64_t G = 0;
  for (std::uint32_t r = 0; r < params.seg.C; ++r) {
    G += r > params.Eidx ? params.E1 : params.E0;
  }
  return static_cast<std::uint32_t>(G);
}

std::uint32_t KLTE_PUSCH_Decoding::getHarqLength() const {
  const segmentationParams seg = itsDeSegment.getSegmentationParams();
  std::uint64_t length = 0;
  for (std::uint32_t r = 0; r < seg.C; ++r) {
    length += seg.blockSize(r) + 4;
  }
  return static_cast<std::uint32_t>(length);
}

}  // namespace brannoc
