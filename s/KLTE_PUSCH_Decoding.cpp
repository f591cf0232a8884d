// KLTE_PUSCH_Decoding: construction, configuration and debug dump files of the shared-channel
// decoder.
#include "KLTE_PUSCH_Decoding.h"

#include <algorithm>
#include <atomic>
#include <string>

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

// ---------------------------------------------------------------------------------------------
// Channel deinterleaver and demultiplexer (TS 36.212 5.2.2.7, 5.2.2.8 undone)
// ---------------------------------------------------------------------------------------------

namespace {

// Column sets of TS 36.212 Tables 5.2.2.8-1 (RI) and 5.2.2.8-2 (HARQ-ACK), by cyclic prefix,
// used in the order j = 0, 3, 2, 1.
constexpr std::uint32_t kRIColumns[2][4] = {{1, 4, 7, 10}, {0, 3, 5, 8}};
constexpr std::uint32_t kACKColumns[2][4] = {{2, 3, 8, 9}, {1, 2, 6, 7}};

enum CellMark : std::uint8_t { kDataCell = 0, kAckCell = 1, kRiCell = 2 };

// The cell of symbol i of an ACK or RI field: from the last row upwards, four columns a row.
struct ControlCell {
  std::uint32_t row;
  std::uint32_t column;
};

ControlCell controlCell(const std::uint32_t (&columns)[4], std::uint32_t rows, std::uint32_t i) {
  return {rows - 1 - i / 4, columns[(3 * i) % 4]};
}

}  // namespace

bool KLTE_PUSCH_Decoding::channelDeinterleave(const SoftValues& input, SoftValues& cqiData,
                                              SoftValues& ri, SoftValues& ack) {
  const rateMatchParams params = itsRateDematch.getRMParams();
  const std::uint32_t H = params.totalBits;
  const std::uint32_t Qm = params.Qm;
  const std::uint32_t Cmux = itsNumColumns;
  const std::uint32_t cp = params.cpType != 0 ? 1 : 0;
  if (Qm == 0 || H % Qm != 0) {
    errorLineSource(kSource, 948, "H must be a multiple of Qm");
    return false;
  }
  const std::uint32_t symbols = H / Qm;
  if (Cmux == 0 || symbols % Cmux != 0) {
    errorLineSource(kSource, 963, "H''*Qm must be a multiple of Cmux");
    return false;
  }
  const std::uint32_t R = symbols / Cmux;
  itsNumRows = R;
  if (input.size() != H) {
    errorLineSource(kSource, 977, "Input Data size must equal R*C");
    return false;
  }
  // The transmitter read the matrix out column by column, each cell's Qm bits in order: the
  // cell in row r, column c starts at input index (c * R + r) * Qm.
  const auto cellStart = [R, Qm](std::uint32_t r, std::uint32_t c) {
    return (std::size_t{c} * R + r) * Qm;
  };
  // Which cells the ACK and RI symbols took. Kept apart from the soft values, so that any
  // 32-bit input value is a soft value and nothing else.
  std::vector<std::uint8_t>& marks = itsWork.cellMarks;
  marks.assign(symbols, kDataCell);
  const auto takeSymbols = [&](const std::uint32_t(&columns)[4], std::uint32_t count, CellMark mark,
                               SoftValues& out) {
    for (std::uint32_t i = 0; i < count; ++i) {
      const ControlCell cell = controlCell(columns, R, i);
      const std::size_t start = cellStart(cell.row, cell.column);
      std::copy(input.begin() + start, input.begin() + start + Qm, out.begin() + i * Qm);
      marks[std::size_t{cell.row} * Cmux + cell.column] = mark;
    }
  };
  if (itsACKEnabled) {
    if (params.ackQ % Qm != 0) {
      errorLineSource(kSource, 998, "ACK Q must be a multiple of Qm");
      return false;
    }
    if (params.ackQ > std::uint64_t{4} * R * Qm) {
      errorLineSource(kSource, 999, "ACK Q must less than 4 columns worth");
      return false;
    }
    ack.assign(params.ackQ, 0);
    takeSymbols(kACKColumns[cp], params.ackQ / Qm, kAckCell, ack);
  }
  if (itsRIEnabled) {
    if (params.riQ % Qm != 0) {
      errorLineSource(kSource, 1025, "RI Q must be a multiple of Qm");
      return false;
    }
    if (params.riQ / Qm > std::uint64_t{4} * R) {
      errorLineSource(kSource, 1027, "RI Q must less than 4 columns worth");
      return false;
    }
    ri.assign(params.riQ, 0);
    takeSymbols(kRIColumns[cp], params.riQ / Qm, kRiCell, ri);
  }
  if (itsDataEnabled) {
    // Row by row: RI cells are left out (data and CQI were placed around them), ACK cells
    // stay as zeros (the ACK symbols punctured data or CQI there).
    const std::size_t size = H - (itsRIEnabled ? params.riQ : 0);
    cqiData.assign(size, 0);
    std::size_t j = 0;
    for (std::uint32_t r = 0; r < R; ++r) {
      for (std::uint32_t c = 0; c < Cmux; ++c) {
        const std::uint8_t mark = marks[std::size_t{r} * Cmux + c];
        if (mark == kRiCell) {
          continue;
        }
        if (j + Qm > size) {
          errorLineSource(kSource, 1071, "Tried to read outside of CQI-Data array");
          return false;
        }
        if (mark == kDataCell) {
          const std::size_t start = cellStart(r, c);
          std::copy(input.begin() + start, input.begin() + start + Qm, cqiData.begin() + j);
        }
        j += Qm;
      }
    }
    if (j != size) {
      errorLineSource(kSource, 1077, "CQI-Data array must fill spare bits exactly, j=", j,
                      " size=", size);
      return false;
    }
  }
  return true;
}

// ---------------------------------------------------------------------------------------------
// Transport-block decode flow
// ---------------------------------------------------------------------------------------------

namespace {

// Set by the first saturation warning of any decoder object in the process; later
// saturations are silent.
std::atomic<bool> gSaturationWarned{false};

// v clamped into [minQ, maxQ]; the first clamp of the process prints the warning.
std::int32_t saturateInput(std::int32_t v, std::int64_t minQ, std::int64_t maxQ,
                           std::string_view warning) {
  if (v >= minQ && v <= maxQ) {
    return v;
  }
  if (!gSaturationWarned.exchange(true)) {
    errorLineBare(warning);
  }
  return static_cast<std::int32_t>(v < minQ ? minQ : maxQ);
}

// Reports the first out-of-range value of the process among values.
void warnIfSaturating(std::span<const std::int32_t> values, std::int64_t minQ, std::int64_t maxQ,
                      std::string_view warning) {
  if (gSaturationWarned.load(std::memory_order_relaxed)) {
    return;
  }
  std::int64_t low = minQ;
  std::int64_t high = maxQ;
  for (const std::int32_t v : values) {
    low = std::min<std::int64_t>(low, v);
    high = std::max<std::int64_t>(high, v);
  }
  if ((low < minQ || high > maxQ) && !gSaturationWarned.exchange(true)) {
    errorLineBare(warning);
  }
}

constexpr std::string_view kLLRSaturated =
    "LLR Input to Decoder was saturated to Format 8:5. Additional saturating warnings are "
    "suppressed. ";
constexpr std::string_view kHARQSaturated =
    "HARQ Input to Decoder was saturated to Format 8:5. Additional saturating warnings are "
    "suppressed. ";

template <typename T>
std::vector<T> joined(const std::vector<std::vector<T>>& parts) {
  std::vector<T> all;
  for (const std::vector<T>& part : parts) {
    all.insert(all.end(), part.begin(), part.end());
  }
  return all;
}

// The streams of every block joined stream by stream into all (its memory reused).
void joinStreams(const std::vector<KLTE_PUSCH_Decoding::Streams>& blocks,
                 KLTE_PUSCH_Decoding::Streams& all) {
  all.resize(3);
  for (std::size_t s = 0; s < 3; ++s) {
    all[s].clear();
    for (const KLTE_PUSCH_Decoding::Streams& block : blocks) {
      if (s < block.size()) {
        all[s].insert(all[s].end(), block[s].begin(), block[s].end());
      }
    }
  }
}

std::string blockComment(std::string_view title, std::uint32_t r) {
  std::string comment(title);
  comment.append(" : ").append(std::to_string(r)).append(". Quantized 8:5");
  return comment;
}

}  // namespace

bool KLTE_PUSCH_Decoding::decodeSCH(bool retransmission, const SoftValues& llrInput,
                                    const Streams& harqIn, SCHResults& results) {
  if (!itsSCHEnabled) {
    errorLineSource(kSource, 826, "Error: SCH channel is not enabled. ");
    return false;
  }
  if (!itsDataEnabled && !itsCQIEnabled && !itsACKEnabled && !itsRIEnabled) {
    errorLineSource(kSource, 827, "Error: SCH channel - no elements enabled. ");
    return false;
  }
  SoftValues& cqiData = itsWork.cqiData;
  SoftValues& ri = itsWork.ri;
  SoftValues& ack = itsWork.ack;
  if (!channelDeinterleave(llrInput, cqiData, ri, ack)) {
    return false;
  }
  // The CQI soft values come first in the multiplexed stream, the data after them.
  const std::size_t cqiQ =
      !itsDataEnabled  ? cqiData.size()
      : !itsCQIEnabled ? 0
                       : std::min<std::size_t>(itsRateDematch.getRMParams().cqiQ, cqiData.size());
  SoftValues& cqi = itsWork.cqi;
  cqi.assign(cqiData.begin(), cqiData.begin() + static_cast<std::ptrdiff_t>(cqiQ));
  const std::span<const std::int32_t> data = std::span<const std::int32_t>(cqiData).subspan(cqiQ);
  std::vector<Streams>& combined = itsWork.combined;
  if (retransmission) {
    if (!decodeRetransmission(data, harqIn, results.harqOut, combined, results.tbOut,
                              results.tbCrcPass, results.crc_CWs)) {
      errorLineSource(kSource, 874, "Error: SCH Decode Data Fail ");
      return false;
    }
  } else if (!decodeNewData(data, results.harqOut, combined, results.tbOut, results.tbCrcPass,
                            results.crc_CWs)) {
    errorLineSource(kSource, 877, "Error: SCH Decode Data Fail ");
    return false;
  }
  if (!decodeCQI(cqi, results.cqiOut, results.cqiCrcPass)) {
    errorLineSource(kSource, 879, "Error: SCH Decode CQI Fail ");
    return false;
  }
  if (!decodeACK(ack, results.ackOut, results.ackFlag)) {
    errorLineSource(kSource, 881, "Error: SCH Decode ACK Fail ");
    return false;
  }
  if (!decodeRI(ri, results.riOut, results.riFlag)) {
    errorLineSource(kSource, 883, "Error: SCH Decode RI Fail ");
    return false;
  }
  dump(27, llrInput, "LLR_INPUT_TB. Quantized 8:5");
  dump(25, ack, "DEINTERLEAVE_ACK_TB");
  dump(24, ri, "DEINTERLEAVE_RI_TB");
  dump(21, data, "DEMUX_TB");
  dump(20, cqi, "DEMUX_CQI_TB");
  RegisterImage words;
  if (dumpOpen(28) && packControlRegister(words)) {
    dump(28, words, "CTRL");
  }
  if (dumpOpen(32) && packDataStatus(results.crc_CWs, results.tbCrcPass, words)) {
    dump(32, words, "STATUS REGISTERS");
  }
  if (dumpOpen(29) && packCQIStatus(results.cqiCrcPass, results.cqiOut, words)) {
    dump(29, words, "CQI STATUS REGISTERS");
  }
  if (dumpOpen(30) && packRIStatus(results.riFlag, results.riOut, words)) {
    dump(30, words, "RI STATUS REGISTERS");
  }
  if (dumpOpen(31) && packACKStatus(results.ackFlag, results.ackOut, words)) {
    dump(31, words, "ACK STATUS REGISTERS");
  }
  return true;
}

bool KLTE_PUSCH_Decoding::decodeNewData(std::span<const std::int32_t> data, Streams& harqOut,
                                        std::vector<Streams>& combined, Bits& tbOut,
                                        std::uint8_t& tbCrcPass, Bits& crc_CWs) {
  itsCombineHARQ = false;
  return decodeData(data, Streams(3), harqOut, combined, tbOut, tbCrcPass, crc_CWs);
}

bool KLTE_PUSCH_Decoding::decodeRetransmission(std::span<const std::int32_t> data,
                                               const Streams& harqIn, Streams& harqOut,
                                               std::vector<Streams>& combined, Bits& tbOut,
                                               std::uint8_t& tbCrcPass, Bits& crc_CWs) {
  itsCombineHARQ = true;
  return decodeData(data, harqIn, harqOut, combined, tbOut, tbCrcPass, crc_CWs);
}

bool KLTE_PUSCH_Decoding::decodeDataCWs(std::span<const std::int32_t> data,
                                        const std::vector<Streams>& harqIn_CWs, Streams& harqOut,
                                        std::vector<Streams>& combined, Bits& tbOut,
                                        std::uint8_t& tbCrcPass, Bits& crc_CWs) {
  for (const Streams& block : harqIn_CWs) {
    if (block.size() != 3) {
      errorLineFileSpaced(kSource, 563, "harqIn_CWs Vector needs to be C x 3 x cwLength");
      return false;
    }
  }
  Streams harqIn;
  joinStreams(harqIn_CWs, harqIn);
  return decodeData(data, harqIn, harqOut, combined, tbOut, tbCrcPass, crc_CWs);
}

bool KLTE_PUSCH_Decoding::decodeData(std::span<const std::int32_t> data, const Streams& harqIn,
                                     Streams& harqOut, std::vector<Streams>& combined, Bits& tbOut,
                                     std::uint8_t& tbCrcPass, Bits& crc_CWs) {
  const std::uint32_t G = getDataLength();
  // With no room for a single modulation symbol per code block, data soft values that were
  // sent cannot be decoded: that is a length mismatch, not an empty transport block.
  if (G == 0 && data.empty()) {
    tbOut.clear();
    crc_CWs.clear();
    return true;
  }
  if (data.size() != G) {
    errorLineFile(kSource, 603,
                  "Error: INCORRECT LLR Input SIZE. Properly use setParams. LLR input size: ",
                  data.size(), "   Expected size: ", G);
    return false;
  }
  const std::uint32_t L = getHarqLength();
  if (itsCombineHARQ) {
    if (harqIn.size() != 3) {
      errorLineFile(kSource, 613, "Error: INCORRECT HARQ Input SIZE. It should be a 3x", L,
                    " vector. Not a ", harqIn.size(), " dimensional vector");
      return false;
    }
    if (harqIn[0].size() != L || harqIn[1].size() != L || harqIn[2].size() != L) {
      errorLineFile(kSource, 619, "Error: INCORRECT HARQ Input SIZE. It should be a 3x", L,
                    " vector ", harqIn[0].size(), " ", harqIn[1].size(), " ", harqIn[2].size());
      return false;
    }
  }
  const segmentationParams seg = itsDeSegment.getSegmentationParams();
  const rateMatchParams& params = itsRateDematch.getRMParams();
  const std::uint32_t C = seg.C;
  const std::int64_t minQ = itsLLRFormat.getMinQ();
  const std::int64_t maxQ = itsLLRFormat.getMaxQ();
  // The HARQ input per block is needed to combine, and otherwise only for its dump.
  const bool harqBlocksNeeded = itsCombineHARQ || dumpOpen(12);
  std::vector<std::span<const std::int32_t>>& blocks = itsWork.blocks;
  std::vector<Streams>& harqBlocks = itsWork.harqBlocks;
  blocks.resize(C);
  harqBlocks.resize(harqBlocksNeeded ? C : 0);
  std::size_t p = 0;
  std::size_t q = 0;
  for (std::uint32_t r = 0; r < C; ++r) {
    // The rate dematcher saturates every soft value it adds; here the first out-of-range
    // value of the process is reported.
    const std::uint32_t E = r > params.Eidx ? params.E1 : params.E0;
    blocks[r] = data.subspan(p, E);
    p += E;
    warnIfSaturating(blocks[r], minQ, maxQ, kLLRSaturated);
    const std::uint32_t D = seg.blockSize(r) + 4;
    if (!harqBlocksNeeded) {
      continue;
    }
    harqBlocks[r].resize(3);
    for (SoftValues& stream : harqBlocks[r]) {
      stream.assign(D, 0);
    }
    if (itsCombineHARQ) {
      for (std::uint32_t s = 0; s < 3; ++s) {
        for (std::uint32_t i = 0; i < D; ++i) {
          harqBlocks[r][s][i] = saturateInput(harqIn[s][q + i], minQ, maxQ, kHARQSaturated);
        }
      }
      q += D;
    }
  }
  std::vector<Streams>& dematched = itsWork.dematched;
  dematched.resize(C);
  if (!rateDematchCodeBlocks(blocks, dematched)) {
    errorLineFileSpaced(kSource, 700, "ERROR WHILE RATE DEMATCH");
    return false;
  }
  combined.resize(C);
  if (!applyHARQCodeBlocks(harqBlocks, dematched, combined)) {
    errorLineFileSpaced(kSource, 702, "ERROR in applyHARQ");
    return false;
  }
  std::vector<Bits>& decoded = itsWork.decoded;
  decoded.resize(C);
  if (!turboDecodeCodeBlocks(combined, decoded)) {
    errorLineFileSpaced(kSource, 705, "ERROR UNABLE TO TURBO DECODE ");
    return false;
  }
  std::vector<Bits>& stripped = itsWork.stripped;
  stripped.resize(C);
  if (C > 1) {
    itsCRCGenerator.setCRC24B();
    if (!removeCodeBlockCRCs(decoded, stripped, crc_CWs)) {
      errorLineFileSpaced(kSource, 714, "ERROR UNABLE TO REMOVE CRC");
      return false;
    }
  } else {
    // A lone block has no code-block CRC: its outcome is the transport block's.
    stripped = decoded;
    crc_CWs.assign(1, 0);
  }
  Bits& tbWithCrc = itsWork.tbWithCrc;
  if (!itsDeSegment.desegment(decoded, tbWithCrc)) {
    errorLineFileSpaced(kSource, 723, "UNABLE TO AGGREGATE TB");
    return false;
  }
  itsCRCGenerator.setCRC24A();
  if (!itsCRCGenerator.check(tbWithCrc, tbOut, tbCrcPass, 0)) {
    errorLineFileSpaced(kSource, 727, "UNABLE TO REMOVE TB CRC");
    return false;
  }
  joinStreams(combined, harqOut);

  for (std::uint32_t r = 0; r < C; ++r) {
    dump(5, stripped[r], "SEGMENT_CW");
    dump(7, decoded[r], "DECODED_CW CW");
    dump(10, combined[r], blockComment("AFTER_HARQ_CW CW", r));
    if (harqBlocksNeeded) {
      dump(12, harqBlocks[r], blockComment("HARQ_INPUT_CW CW", r));
    }
    // Without combining, the combined streams are the dematched ones (moved, not copied).
    dump(14, itsCombineHARQ ? dematched[r] : combined[r], blockComment("AFTER_CHASE_CW CW", r));
    if (dumpOpen(26)) {
      SoftValues saturated(blocks[r].begin(), blocks[r].end());
      for (std::int32_t& v : saturated) {
        v = static_cast<std::int32_t>(std::clamp<std::int64_t>(v, minQ, maxQ));
      }
      dump(26, saturated, blockComment("LLR_INPUT_CW CW", r));
    }
  }
  dump(0, tbOut, "OUTPUT");
  dump(4, tbWithCrc, "TB_CRC");
  if (dumpOpen(6)) {
    dump(6, joined(stripped), "SEGMENT_TB");
  }
  if (dumpOpen(8)) {
    dump(8, joined(decoded), "DECODED_TB");
  }
  dump(11, harqOut, "AFTER_HARQ_TB. Quantized 8:5");
  if (dumpOpen(15)) {
    Streams afterChase;
    joinStreams(itsCombineHARQ ? dematched : combined, afterChase);
    dump(15, afterChase, "AFTER_CHASE_TB. Quantized 8:5");
  }
  dump(13, harqIn, "HARQ_INPUT_TB. Quantized 8:5");
  dump(22, data, "LLR_INPUT_Data_TB. Quantized 8:5");
  return true;
}

bool KLTE_PUSCH_Decoding::rateDematchCodeBlocks(
    const std::vector<std::span<const std::int32_t>>& blocks, std::vector<Streams>& dematched) {
  bool ok = true;
  for (std::uint32_t r = 0; r < blocks.size(); ++r) {
    ok = itsRateDematch.rateDematchData(blocks[r], dematched[r], r) && ok;
  }
  return ok;
}

bool KLTE_PUSCH_Decoding::applyHARQCodeBlocks(const std::vector<Streams>& harqBlocks,
                                              std::vector<Streams>& dematched,
                                              std::vector<Streams>& combined) {
  bool ok = true;
  for (std::uint32_t r = 0; r < dematched.size(); ++r) {
    if (itsCombineHARQ) {
      ok = itsRateDematch.applyHARQ(harqBlocks[r], dematched[r], combined[r], r) && ok;
    } else {
      std::swap(combined[r], dematched[r]);
    }
  }
  return ok;
}

bool KLTE_PUSCH_Decoding::turboDecodeCodeBlocks(const std::vector<Streams>& combined,
                                                std::vector<Bits>& decoded) {
  // The blocks go to the model in batches; turboDecodeCodeBlock, one block at a time, is the
  // path for blocks whose streams differ in length (never so for dematched blocks).
  const bool sameLengths = std::all_of(combined.begin(), combined.end(), [](const Streams& s) {
    return s.size() == 3 && s[1].size() == s[0].size() && s[2].size() == s[0].size();
  });
  if (sameLengths) {
    return itsTurboDecoder.decodeBlocks(combined, decoded, itsTurboIterations);
  }
  bool ok = true;
  for (std::size_t r = 0; r < combined.size(); ++r) {
    ok = turboDecodeCodeBlock(combined[r], decoded[r], itsTurboIterations) && ok;
  }
  return ok;
}

bool KLTE_PUSCH_Decoding::turboDecodeCodeBlock(const Streams& streams, Bits& bits,
                                               std::uint32_t iterations) {
  if (streams.size() != 3) {
    return false;
  }
  const std::size_t N = streams[0].size();
  if (streams[1].size() == N && streams[2].size() == N) {
    return itsTurboDecoder.decode(streams[0], streams[1], streams[2], bits, iterations);
  }
  SoftValues p1 = streams[1];
  SoftValues p2 = streams[2];
  p1.resize(N, 0);
  p2.resize(N, 0);
  return itsTurboDecoder.decode(streams[0], p1, p2, bits, iterations);
}

bool KLTE_PUSCH_Decoding::removeCodeBlockCRCs(const std::vector<Bits>& decoded,
                                              std::vector<Bits>& stripped, Bits& crc_CWs) {
  crc_CWs.assign(decoded.size(), 0);
  bool ok = true;
  for (std::size_t r = 0; r < decoded.size(); ++r) {
    std::uint8_t pass = 0;
    ok = itsCRCGenerator.check(decoded[r], stripped[r], pass, 0) && ok;
    crc_CWs[r] = pass;
  }
  return ok;
}

// ---------------------------------------------------------------------------------------------
// CQI, HARQ-ACK and RI on PUSCH (TS 36.212 5.2.2.6)
// ---------------------------------------------------------------------------------------------

namespace {

constexpr std::uint32_t kMaxBlockCodedCQI = 11;  // larger reports: CRC8 + convolutional code
constexpr std::uint32_t kCQICrcBits = 8;

}  // namespace

bool KLTE_PUSCH_Decoding::decodeCQI(const SoftValues& softIn, Bits& cqiBits,
                                    std::uint8_t& cqiStatus) {
  if (!itsSCHEnabled) {
    errorLineSource(kSource, __LINE__, "Error: SCH channel is not enabled. ");
    return false;
  }
  const rateMatchParams& params = itsRateDematch.getRMParams();
  const std::uint32_t O = params.cqiSize;
  if (O == 0) {
    cqiBits.clear();
    cqiStatus = 0;
    return true;
  }
  if (softIn.size() != params.cqiQ) {
    errorLineSource(kSource, __LINE__, "INCORRECT TB SIZE. size=", softIn.size(),
                    " itsCQISize=", O);
    return false;
  }
  if (O <= kMaxBlockCodedCQI) {
    SoftValues combined;
    if (!itsRateDematch.rateDematchCQI(softIn, combined)) {
      errorLineSource(kSource, __LINE__, "UNABLE TO RATE MATCH CONTROL CODEWORD 0");
      return false;
    }
    if (!itsCQIDecoder.setNumBits(O)) {
      errorLineSource(kSource, __LINE__, "UNABLE TO Set Number of bits");
      return false;
    }
    if (!itsCQIDecoder.setCQIType(KLTE_CQI_Decoding::CQI_TYPE_PUSCH)) {
      errorLineSource(kSource, __LINE__, "UNABLE TO Set type");
      return false;
    }
    cqiBits.assign(O, 0);
    if (combined.size() != itsCQIDecoder.getEncodedSize()) {
      errorLineSource(kSource, __LINE__, "D0 is wrong size");
      return false;
    }
    if (!itsCQIDecoder.decode(combined, cqiBits)) {
      errorLineSource(kSource, __LINE__, "UNABLE TO decode CQI");
      return false;
    }
    cqiStatus = 1;
    dump(1, cqiBits, "OUTPUT_UCI_CQI");
    dump(16, combined, "d0");
    return true;
  }
  itsCRCGenerator.setCRC8();
  SoftValues w;
  SoftValues d0;
  SoftValues d1;
  SoftValues d2;
  if (!itsRateDematch.rateDematchConv(softIn, w, d0, d1, d2)) {
    errorLineSource(kSource, __LINE__, "UNABLE TO RATE DEMATCH CONTROL CODEWORD 0");
    return false;
  }
  Bits decoded(O + kCQICrcBits, 0);
  KLTE_DecoderViterbi::ExtendedRxData extended;
  if (!viterbiDecodeCQI(d0, d1, d2, decoded, extended)) {
    errorLineSource(kSource, __LINE__, "UNABLE TO VITERBI DECODE CONTROL CODEWORD 0");
    return false;
  }
  if (!itsCRCGenerator.check(decoded, cqiBits, cqiStatus, 0)) {
    errorLineSource(kSource, __LINE__, "UNABLE TO CHECK CRC FOR CONTROL CODEWORD 0");
    return false;
  }
  dump(1, cqiBits, "OUTPUT_UCI_CQI");
  dump(23, Streams{d0, d1, d2}, "d0 d1 d2");
  dump(9, decoded, "TB_CRC_UCI_CQI");
  const DumpDescriptor rawDump = getDumpDescriptor(17, kChannel);
  if (rawDump.isOpen()) {
    // Each element twice in a row, as the core's two-sample input bus carries it.
    std::array<std::vector<std::uint32_t>, 6> doubled;
    for (std::size_t v = 0; v < extended.size(); ++v) {
      for (const std::int32_t x : extended[v]) {
        doubled[v].insert(doubled[v].end(), 2, static_cast<std::uint32_t>(x));
      }
    }
    writeArrays(rawDump, doubled[0], doubled[1], doubled[2], doubled[3], doubled[4], doubled[5],
                "TB_RAW_VITERBI_INPUT_CQI");
  }
  dump(16, w, "AFTER_CHASE_TB_CQI");
  return true;
}

bool KLTE_PUSCH_Decoding::viterbiDecodeCQI(const SoftValues& d0, const SoftValues& d1,
                                           const SoftValues& d2, Bits& decodedBits,
                                           KLTE_DecoderViterbi::ExtendedRxData& extendedRxData) {
  const std::size_t N = d0.size();
  // The decoder decides positions 0 .. 2T - 7 only: a longer block would come back partly
  // undecided.
  const std::size_t decidable = 2 * std::size_t{itsViterbi.getTracebackLength()} - 6;
  if (N > decidable) {
    errorLineSource(kSource, __LINE__, "Error: CQI block of ", N,
                    " bits is longer than the Viterbi decoder decides: ", decidable);
    return false;
  }
  decodedBits.assign(N, 0);
  const SoftValues* const streams[3] = {&d0, &d1, &d2};
  std::array<SoftValues, 3> q;
  std::array<SoftValues, 3> e;
  for (std::size_t s = 0; s < 3; ++s) {
    q[s].assign(streams[s]->size(), 0);
    e[s].assign(streams[s]->size(), 0);
  }
  constexpr std::string_view kRangeMessages[3] = {
      "Error: d0 should be in range -128 to 127. = ", "Error: d1 should be in range -128 to 127 = ",
      "Error: d2 should be in range -128 to 127 = "};
  const std::size_t longest = std::max({d0.size(), d1.size(), d2.size()});
  for (std::size_t k = 0; k < longest; ++k) {
    for (std::size_t s = 0; s < 3; ++s) {
      if (k >= streams[s]->size()) {
        continue;
      }
      const std::int32_t d = (*streams[s])[k];
      if (d < -128 || d > 127) {
        errorLineSource(kSource, __LINE__, kRangeMessages[s], d);
        return false;
      }
      // 4-bit offset binary: floor(d / 16) + 8; a zero soft value carries no information.
      e[s][k] = d == 0 ? 1 : 0;
      q[s][k] = (d >> 4) + 8;
    }
  }
  std::ofstream noTrace[4];
  return itsViterbi.decode(q[0], q[1], q[2], e[0], e[1], e[2], decodedBits, noTrace[0], noTrace[1],
                           noTrace[2], noTrace[3], false, extendedRxData);
}

bool KLTE_PUSCH_Decoding::decodeACK(const SoftValues& softIn, Bits& ackBits,
                                    std::uint8_t& parityError) {
  return decodeACKorRI(false, softIn, ackBits, parityError);
}

bool KLTE_PUSCH_Decoding::decodeRI(const SoftValues& softIn, Bits& riBits,
                                   std::uint8_t& parityError) {
  return decodeACKorRI(true, softIn, riBits, parityError);
}

bool KLTE_PUSCH_Decoding::decodeACKorRI(bool isRI, const SoftValues& softIn, Bits& bits,
                                        std::uint8_t& parityError) {
  if (!itsSCHEnabled) {
    errorLineSource(kSource, __LINE__, "Error: SCH channel is not enabled. ");
    return false;
  }
  const rateMatchParams& params = itsRateDematch.getRMParams();
  const std::uint32_t size = isRI ? params.riSize : params.ackSize;
  if (size == 0) {
    bits.clear();
    parityError = 0;
    return true;
  }
  SoftValues combined;
  if (!(isRI ? itsRateDematch.rateDematchRI(softIn, combined)
             : itsRateDematch.rateDematchACK(softIn, combined))) {
    errorLineSource(kSource, __LINE__,
                    isRI ? "UNABLE TO RATE MATCH RI" : "UNABLE TO RATE MATCH ACK");
    return false;
  }
  bits.assign(size, 0);
  if (!decodeACKRIBits(combined, bits, parityError)) {
    errorLineSource(kSource, __LINE__, isRI ? "UNABLE TO ENCODE RI" : "UNABLE TO ENCODE ACK");
    return false;
  }
  dump(isRI ? 19 : 18, combined, isRI ? "AFTER_CHASE_TB_RI" : "AFTER_CHASE_TB_ACK");
  dump(isRI ? 2 : 3, bits, isRI ? "OUTPUT_UCI_RI" : "OUTPUT_UCI_ACK");
  return true;
}

bool KLTE_PUSCH_Decoding::decodeACKRIBits(const SoftValues& combined, Bits& bits,
                                          std::uint8_t& parityError) const {
  if (!itsSCHEnabled) {
    errorLineSource(kSource, 1086, "Error: SCH channel is not enabled. ");
    return false;
  }
  const std::uint32_t Qm = itsRateDematch.getRMParams().Qm;
  const auto decide = [&combined](std::size_t a, std::size_t b) -> std::uint8_t {
    return std::int64_t{combined[a]} + combined[b] >= 0 ? 1 : 0;
  };
  if (bits.size() == 1 && combined.size() >= 2) {
    bits[0] = decide(0, 1);
    parityError = 0;
  } else if (bits.size() == 2 && Qm >= 2 && combined.size() >= 3 * std::size_t{Qm}) {
    // The pattern (o0, o1), (o2, o0), (o1, o2), each pair followed by Qm - 2 placeholders.
    bits[0] = decide(0, Qm + 1);
    bits[1] = decide(1, 2 * Qm);
    const std::uint8_t parity = decide(Qm, 2 * Qm + 1);
    parityError = (bits[0] ^ bits[1]) != parity ? 1 : 0;
  } else if (bits.size() == 1 || bits.size() == 2) {
    errorLineSource(kSource, __LINE__, "Error: ", combined.size(),
                    " combined values cannot carry the field for Qm ", Qm);
    return false;
  }
  return true;
}

// ---------------------------------------------------------------------------------------------
// Control and status registers of the core
// ---------------------------------------------------------------------------------------------

bool KLTE_PUSCH_Decoding::packControlRegister(RegisterImage& image) const {
  constexpr std::size_t kMemMapSize = 9;
  if (image.empty()) {
    image.assign(kMemMapSize, 0);
  }
  if (image.size() != kMemMapSize) {
    errorLineFileSpaced(kSource, 1833,
                        "Size of ctrl register is not consistent with "
                        "MEM_MAP_CTRL_UL_RX_DEC_SCH::memMapSize. Resizing.");
    return false;
  }
  const rateMatchParams params = itsRateDematch.getRMParams();
  const std::uint64_t tbSize = itsDeSegment.getSegmentationParams().TBsize;
  const auto flag = [](bool b) { return std::uint64_t{b ? 1U : 0U}; };
  image[0] |= (params.cqiQ & 0x1FFFU) | std::uint64_t{params.cqiSize & 0xFFU} << 16 |
              flag(tbSize != 0) << 24 | flag(params.cqiSize != 0) << 25 |
              flag(params.ackSize != 0) << 26 | flag(params.riSize != 0) << 27;
  image[1] |= (params.ackQ & 0xFFU) | std::uint64_t{params.ackSize & 3U} << 8 |
              std::uint64_t{params.riQ & 0xFFU} << 16 | std::uint64_t{params.riSize & 3U} << 24;
  image[2] |= std::uint64_t{params.Eidx & 0x7FU} << 8;
  image[3] |= (itsNumRows & 0x7FFU) | flag(params.cpType != 0) << 16;
  image[5] |= (params.E0 & 0xFFFFU) | std::uint64_t{params.E1 & 0xFFFFU} << 16;
  image[6] |= flag(itsIdOption == "USERID") | flag(itsIdOption == "SFRMID") << 1 |
              flag(itsIdOption == "CBID") << 2 |
              flag(itsLengthOption == "LONG" || itsLengthOption == "SHORT") << 3;
  const std::uint64_t modulation = params.Qm == 4 ? 1 : (params.Qm == 6 ? 2 : 0);
  image[7] |=
      (tbSize & 0x3FFFFU) | std::uint64_t{itsTurboIterations & 0xFU} << 24 | modulation << 28;
  image[8] |= (itsUserId & 0xFFFFU) | std::uint64_t{itsSubframeId & 0xFU} << 16 |
              std::uint64_t{itsHarqSubframeId & 0xFU} << 20 |
              std::uint64_t{params.rvidx & 3U} << 24 | flag(!itsCombineHARQ) << 26 |
              flag(itsHFC) << 27 | std::uint64_t{itsTurboFlush & 1U} << 28;
  return true;
}

bool KLTE_PUSCH_Decoding::packDataStatus(const Bits& crc_CWs, std::uint8_t tbCrcPass,
                                         RegisterImage& words) const {
  words.assign(crc_CWs.size(), 0);
  const std::size_t last = crc_CWs.size() - 1;
  for (std::size_t i = 0; i < crc_CWs.size(); ++i) {
    const bool blockFailed = crc_CWs.size() > 1 && crc_CWs[i] == 0;
    const bool tbFailed = i == last && tbCrcPass == 0;
    words[i] = (itsUserId & 0xFFFFU) | std::uint64_t{itsSubframeId & 0xFU} << 16 |
               std::uint64_t{i & 0xFU} << 20 | std::uint64_t{blockFailed ? 1U : 0U} << 24 |
               std::uint64_t{tbFailed ? 1U : 0U} << 25;
  }
  return true;
}

bool KLTE_PUSCH_Decoding::packCQIStatus(std::uint8_t cqiCrcPass, const Bits& data_CQI,
                                        RegisterImage& words) const {
  words.clear();
  const std::uint32_t cqiSize = itsRateDematch.getRMParams().cqiSize;
  if (cqiSize == 0) {
    return true;
  }
  words.assign(data_CQI.size() / 32 + 2, 0);
  words[0] = (itsUserId & 0xFFFFU) | std::uint64_t{cqiSize & 0x7FU} << 16 |
             std::uint64_t{cqiCrcPass == 0 ? 1U : 0U} << 23 | 0xA0000000U;
  for (std::size_t j = 0; j < data_CQI.size(); ++j) {
    words[1 + j / 32] |= std::uint64_t{data_CQI[j] & 1U} << (j % 32);
  }
  return true;
}

bool KLTE_PUSCH_Decoding::packRIStatus(std::uint8_t riFlag, const Bits& riBits,
                                       RegisterImage& words) const {
  packUciStatus(itsRateDematch.getRMParams().riSize, riFlag, riBits, words);
  return true;
}

bool KLTE_PUSCH_Decoding::packACKStatus(std::uint8_t ackFlag, const Bits& ackBits,
                                        RegisterImage& words) const {
  packUciStatus(itsRateDematch.getRMParams().ackSize, ackFlag, ackBits, words);
  return true;
}

void KLTE_PUSCH_Decoding::packUciStatus(std::uint32_t size, std::uint8_t flag, const Bits& bits,
                                        RegisterImage& words) const {
  words.clear();
  if (size == 0) {
    return;
  }
  const std::uint32_t b0 = bits.size() > 0 ? bits[0] & 1U : 0;
  const std::uint32_t b1 = bits.size() > 1 ? bits[1] & 1U : 0;
  const std::uint32_t value = size == 1 ? b0 : (size == 2 ? 2 * b1 + b0 : 0);
  words.assign(1, (itsUserId & 0xFFFFU) | std::uint64_t{size & 3U} << 16 |
                      std::uint64_t{value & 3U} << 18 | std::uint64_t{flag & 1U} << 20);
}

// ---------------------------------------------------------------------------------------------
// Dump points
// ---------------------------------------------------------------------------------------------

bool KLTE_PUSCH_Decoding::dumpOpen(std::uint32_t key) {
  return getDumpDescriptor(key, kChannel).isOpen();
}

void KLTE_PUSCH_Decoding::dump(std::uint32_t key, const Bits& bits, std::string_view comment) {
  writeVector(getDumpDescriptor(key, kChannel), bits, comment);
}

void KLTE_PUSCH_Decoding::dump(std::uint32_t key, const SoftValues& values,
                               std::string_view comment) {
  writeVector(getDumpDescriptor(key, kChannel), values, comment);
}

void KLTE_PUSCH_Decoding::dump(std::uint32_t key, std::span<const std::int32_t> values,
                               std::string_view comment) {
  if (dumpOpen(key)) {
    dump(key, SoftValues(values.begin(), values.end()), comment);
  }
}

void KLTE_PUSCH_Decoding::dump(std::uint32_t key, const RegisterImage& words,
                               std::string_view comment) {
  writeVector(getDumpDescriptor(key, kChannel), words, comment);
}

void KLTE_PUSCH_Decoding::dump(std::uint32_t key, const Streams& streams,
                               std::string_view comment) {
  const DumpDescriptor descriptor = getDumpDescriptor(key, kChannel);
  if (!descriptor.isOpen()) {
    return;
  }
  const SoftValues none;
  const auto stream = [&](std::size_t s) -> const SoftValues& {
    return s < streams.size() ? streams[s] : none;
  };
  writeArrays(descriptor, stream(0), stream(1), stream(2), comment);
}

}  // namespace brannoc
