// KLTE_PUSCH_Decoding: the shared-channel (PUSCH) decoder of one library instance. It owns
// every component that decoding a PUSCH transmission needs (CRC generator, tail-biting Viterbi
// decoder, desegmenter, rate dematcher with its parameter set, CQI block decoder, LLR format,
// turbo-decoder adapter) and its debug dump files, holds the configuration that the library
// interface writes before each call, and keeps the few values that live from one call to the
// next (the parameter sets, the interleaver rows, the subframe of the previous call).
//
// The interface configures it for every call in this order: the turbo adapter's processing
// units and algorithm, setTurboIterations, setCallIdentifiers, setModulationParams,
// setTransportBlockParams, setCQIParams, setACKParams, setRIParams; setTransportBlockParams reads
// Qm and the number of layers that setModulationParams stored.
#ifndef BRANNOC_KLTE_PUSCH_DECODING_H
#define BRANNOC_KLTE_PUSCH_DECODING_H

#include <array>
#include <cstdint>
#include <fstream>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "KCRCGenerator.h"
#include "KDeSegment3GPPLTE.h"
#include "KFileIO.h"
#include "KLTE_CQI_Decoding.h"
#include "KLTE_DecoderViterbi.h"
#include "KQuantized.h"
#include "KRateDeMatch.h"
#include "KTurboDecoderCModel.h"

namespace brannoc {

class KLTE_PUSCH_Decoding {
 public:
  using SoftValues = std::vector<std::int32_t>;
  using Bits = std::vector<std::uint8_t>;
  using Streams = KRateDeMatch::Streams;  // d0, d1, d2
  using RegisterImage = std::vector<std::uint64_t>;

  // Everything one shared-channel decode produces.
  struct SCHResults {
    Streams harqOut;  // the combined soft values of all blocks, stream by stream
    Bits tbOut;       // the transport block without its CRC
    Bits cqiOut;      // the CQI report
    Bits riOut;       // the RI bits
    Bits ackOut;      // the HARQ-ACK bits
    std::uint8_t tbCrcPass = 0;
    Bits crc_CWs;                 // per code block: 1 when its CRC matched (0 for a lone block)
    std::uint8_t ackFlag = 0;     // 2-bit ACK parity failed
    std::uint8_t riFlag = 0;      // 2-bit RI parity failed
    std::uint8_t cqiCrcPass = 0;  // 0 no CQI, 1 block code, else the CRC8 outcome
  };

  // Dump keys of the shared channel (channel 0), 0..32; the stream of key k is itsDumpFiles[k].
  static constexpr std::uint32_t kNumDumpKeys = 33;
  static constexpr std::uint32_t kChannel = 0;

  // Factory: only the empty properties text is accepted; the object is built for 8:5 LLRs.
  static std::unique_ptr<KLTE_PUSCH_Decoding> create(const std::string& properties);

  // Any width text other than "8:5" is warned about; the LLR format is 8:5 whatever it says.
  explicit KLTE_PUSCH_Decoding(const std::string& llrWidth);
  ~KLTE_PUSCH_Decoding();

  KLTE_PUSCH_Decoding(const KLTE_PUSCH_Decoding&) = delete;
  KLTE_PUSCH_Decoding& operator=(const KLTE_PUSCH_Decoding&) = delete;

  // Setters: each refuses (one line, false, nothing changed) while the shared channel is not
  // enabled. See the class comment for the order the interface calls them in.
  bool setModulationParams(std::uint32_t totalBits, std::uint32_t Qm, std::uint32_t numLayers,
                           std::uint32_t cpType);
  // The third argument is ignored: Qm and the layers come from setModulationParams.
  bool setTransportBlockParams(std::uint32_t tbSize, std::uint32_t G, std::uint32_t qm,
                               std::uint32_t rvIdx, std::uint32_t turboFlush);
  bool setCQIParams(std::uint32_t cqiSize, std::uint32_t cqiQ, std::uint32_t numCQIPU);
  bool setACKParams(std::uint32_t ackSize, std::uint32_t ackQ);
  bool setRIParams(std::uint32_t riSize, std::uint32_t riQ);
  // 1..16; anything else is refused without a line (the interface prints its own).
  bool setTurboIterations(std::int32_t iterations);

  // G: the rate-matched data soft values of all code blocks (E0 up to Eidx, E1 after).
  std::uint32_t getDataLength() const;
  // The HARQ buffer length of one stream: the sum of K_r + 4 over the code blocks.
  std::uint32_t getHarqLength() const;

  // The buffers of one shared-channel call: the interface caches the caller's soft values in
  // them and the decode leaves its results there. They live with the object so that each
  // call reuses the memory of the previous one.
  struct CallBuffers {
    SoftValues llr;
    Streams harqIn = Streams(3);
    SCHResults results;
  };
  CallBuffers& callBuffers() { return itsCallBuffers; }

  // The whole decode of one transmission: deinterleaving and demultiplexing, the data chain
  // (with HARQ combining when retransmission is set; harqIn is then three streams of
  // getHarqLength() values), CQI, ACK and RI, dumps and register images.
  bool decodeSCH(bool retransmission, const SoftValues& llrInput, const Streams& harqIn,
                 SCHResults& results);

  // TS 36.212 5.2.2.8 undone: the H soft values of the transmission back into the matrix of
  // R'mux rows and Cmux columns, the ACK and RI symbols taken out of their columns, and the
  // rest read row by row into the CQI-and-data stream (ACK positions as 0, RI left out).
  bool channelDeinterleave(const SoftValues& input, SoftValues& cqiData, SoftValues& ri,
                           SoftValues& ack);

  // The data chain of TS 36.212 5.1 undone: slicing and saturation per code block,
  // rate dematching, HARQ combining (itsCombineHARQ), turbo decoding, code-block and
  // transport-block CRCs. combined receives the combined streams of every block.
  bool decodeData(std::span<const std::int32_t> data, const Streams& harqIn, Streams& harqOut,
                  std::vector<Streams>& combined, Bits& tbOut, std::uint8_t& tbCrcPass,
                  Bits& crc_CWs);
  bool decodeNewData(std::span<const std::int32_t> data, Streams& harqOut,
                     std::vector<Streams>& combined, Bits& tbOut, std::uint8_t& tbCrcPass,
                     Bits& crc_CWs);
  bool decodeRetransmission(std::span<const std::int32_t> data, const Streams& harqIn,
                            Streams& harqOut, std::vector<Streams>& combined, Bits& tbOut,
                            std::uint8_t& tbCrcPass, Bits& crc_CWs);
  // The HARQ input given per code block (C entries of three streams), joined and decoded.
  bool decodeDataCWs(std::span<const std::int32_t> data, const std::vector<Streams>& harqIn_CWs,
                     Streams& harqOut, std::vector<Streams>& combined, Bits& tbOut,
                     std::uint8_t& tbCrcPass, Bits& crc_CWs);
  // One code block's three streams through the turbo-decoder adapter.
  bool turboDecodeCodeBlock(const Streams& streams, Bits& bits, std::uint32_t iterations);

  // CQI on PUSCH (TS 36.212 5.2.2.6.4): the (32,O) block code for O up to 11 bits, else the
  // CRC8 and tail-biting convolutional code through the Viterbi decoder.
  bool decodeCQI(const SoftValues& softIn, Bits& cqiBits, std::uint8_t& cqiStatus);
  // d0, d1, d2 quantised to 4-bit offset binary with a zero soft value as an erasure, then
  // decoded; extendedRxData receives the decoder's six extended inputs for the dumps.
  bool viterbiDecodeCQI(const SoftValues& d0, const SoftValues& d1, const SoftValues& d2,
                        Bits& decodedBits, KLTE_DecoderViterbi::ExtendedRxData& extendedRxData);
  // HARQ-ACK and RI on PUSCH (TS 36.212 5.2.2.6): repetitions combined, bits decided by sign,
  // the parity of a 2-bit field checked into the flag.
  bool decodeACK(const SoftValues& softIn, Bits& ackBits, std::uint8_t& parityError);
  bool decodeRI(const SoftValues& softIn, Bits& riBits, std::uint8_t& parityError);
  bool decodeACKRIBits(const SoftValues& combined, Bits& bits, std::uint8_t& parityError) const;

  // Register images of the core (dumps only): MEM_MAP_CTRL_UL_RX_DEC_SCH (9 words), one data
  // status word per code block, the CQI, RI and ACK status words.
  bool packControlRegister(RegisterImage& image) const;
  bool packDataStatus(const Bits& crc_CWs, std::uint8_t tbCrcPass, RegisterImage& words) const;
  bool packCQIStatus(std::uint8_t cqiCrcPass, const Bits& data_CQI, RegisterImage& words) const;
  bool packRIStatus(std::uint8_t riFlag, const Bits& riBits, RegisterImage& words) const;
  bool packACKStatus(std::uint8_t ackFlag, const Bits& ackBits, RegisterImage& words) const;

  // Debug dumps: switches the file of (key, channel 0) on under prefix; the descriptor of a
  // (key, channel) pair (a pair not in the map gets a default one); storing a descriptor is
  // accepted for channel 0 only.
  bool openDumpFile(std::uint32_t key, std::uint32_t channel, std::string_view prefix);
  DumpDescriptor getDumpDescriptor(std::uint32_t key, std::uint32_t channel);
  bool setDumpDescriptor(std::uint32_t key, std::uint32_t channel,
                         const DumpDescriptor& descriptor);

  KTurboDecoderCModel& turboDecoder() { return itsTurboDecoder; }
  const KRateDeMatch& rateDematcher() const { return itsRateDematch; }
  const KDeSegment3GPPLTE& deSegmenter() const { return itsDeSegment; }
  const KLTE_CQI_Decoding& cqiDecoder() const { return itsCQIDecoder; }
  const KQuantized& llrFormat() const { return itsLLRFormat; }
  std::uint32_t getNumColumns() const { return itsNumColumns; }
  std::uint32_t getNumRows() const { return itsNumRows; }
  std::uint32_t getTurboFlush() const { return itsTurboFlush; }
  std::uint32_t getTurboIterations() const { return itsTurboIterations; }

  // The per-call identifiers of the status words: the user (low 16 bits kept), the SCH_HFC
  // flag and the subframe (4 bits); the subframe held so far becomes the HARQ subframe.
  void setCallIdentifiers(std::uint32_t userId, bool hfc, std::uint32_t subframe);
  std::uint32_t getUserId() const { return itsUserId; }
  std::uint32_t getSubframeId() const { return itsSubframeId; }
  std::uint32_t getHarqSubframeId() const { return itsHarqSubframeId; }
  bool getHFC() const { return itsHFC; }

 private:
  // Prints "../s/KLTE_PUSCH_Decoding(line)Error: SCH channel is not enabled. " and returns
  // false when the shared channel is off.
  bool channelEnabled(unsigned line) const;
  void fillDumpTable();
  // Writes a record when the key's file is open (the record is built only then).
  void dump(std::uint32_t key, const Bits& bits, std::string_view comment);
  void dump(std::uint32_t key, const SoftValues& values, std::string_view comment);
  void dump(std::uint32_t key, std::span<const std::int32_t> values, std::string_view comment);
  void dump(std::uint32_t key, const RegisterImage& words, std::string_view comment);
  void dump(std::uint32_t key, const Streams& streams, std::string_view comment);
  bool dumpOpen(std::uint32_t key);
  // The per-block loops of decodeData: each runs over every block and ANDs the results.
  // Without HARQ combining the dematched streams are moved into combined.
  bool rateDematchCodeBlocks(const std::vector<std::span<const std::int32_t>>& blocks,
                             std::vector<Streams>& dematched);
  bool applyHARQCodeBlocks(const std::vector<Streams>& harqBlocks, std::vector<Streams>& dematched,
                           std::vector<Streams>& combined);
  bool turboDecodeCodeBlocks(const std::vector<Streams>& combined, std::vector<Bits>& decoded);
  bool removeCodeBlockCRCs(const std::vector<Bits>& decoded, std::vector<Bits>& stripped,
                           Bits& crc_CWs);
  bool decodeACKorRI(bool isRI, const SoftValues& softIn, Bits& bits, std::uint8_t& parityError);
  void packUciStatus(std::uint32_t size, std::uint8_t flag, const Bits& bits,
                     RegisterImage& words) const;

  std::array<std::ofstream, 37> itsDumpFiles;  // keys 0..32; the last four have no key
  DumpTable itsDumpTable;
  KCRCGenerator itsCRCGenerator;
  KLTE_DecoderViterbi itsViterbi;
  KDeSegment3GPPLTE itsDeSegment;
  KRateDeMatch itsRateDematch;
  KLTE_CQI_Decoding itsCQIDecoder;
  KQuantized itsLLRFormat;
  std::uint32_t itsNumColumns = 14;  // Cmux: 12 normal, 10 extended cyclic prefix
  std::uint32_t itsNumRows = 0;      // R'mux, written by each deinterleave
  std::uint32_t itsTurboFlush = 0;
  // No operation changes these: data, CQI, ACK and RI are always enabled, and what is really
  // present follows from the sizes.
  bool itsSCHEnabled = true;
  bool itsDataEnabled = true;
  bool itsCQIEnabled = true;
  bool itsRIEnabled = true;
  bool itsACKEnabled = true;
  bool itsHFC = false;
  std::string itsLengthOption;           // register options: "LONG" / "SHORT"
  std::string itsIdOption;               // "USERID" / "SFRMID" / "CBID"
  std::uint32_t itsTurboIterations = 7;  // 1..16
  std::uint32_t itsUserId = 0;           // 16 bits used
  std::uint32_t itsSubframeId = 0;       // 4 bits
  std::uint32_t itsHarqSubframeId = 0;   // the subframe of the previous call
  bool itsCombineHARQ = false;           // the current call is a retransmission
  KTurboDecoderCModel itsTurboDecoder;
  // Intermediate results of a decode, kept so that the next call reuses their memory.
  struct Workspace {
    SoftValues cqiData, cqi, ri, ack;
    std::vector<std::span<const std::int32_t>> blocks;
    std::vector<Streams> harqBlocks, dematched, combined;
    std::vector<Bits> decoded, stripped;
    Bits tbWithCrc;
    std::vector<std::uint8_t> cellMarks;
  };
  Workspace itsWork;
  CallBuffers itsCallBuffers;
};

}  // namespace brannoc

#endif  // BRANNOC_KLTE_PUSCH_DECODING_H
