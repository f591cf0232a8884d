// One link of a simulation: transport blocks (or PUCCH reports) from the transmitter library
// over AWGN, decoded by one instance of the decoder library through its C interface, with
// HARQ retransmissions of a block until its CRC passes or the maximum is reached.
//
// Everything random about a block comes from its seed: the payload from the seed itself, the
// noise of transmission t from mixSeed(seed, t + 1). A link is used by one thread at a time;
// several links decode in parallel.
#ifndef BRANNOC_SIM_LINK_H
#define BRANNOC_SIM_LINK_H

#include <array>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "sim/CallBuffers.h"
#include "tx/Bits.h"
#include "tx/PuschTransmitter.h"
#include "tx/UplinkTypes.h"
#include "vexlon_ip_brannoc_bitacc_cmodel.h"

namespace brannoc::sim {

enum class Channel { Pusch, Pucch };

struct LinkConfig {
  Channel channel = Channel::Pusch;
  std::uint32_t numPrb = 6;
  std::uint32_t Qm = 2;  // 2 QPSK, 4 16QAM, 6 64QAM
  tx::CyclicPrefix cp = tx::CyclicPrefix::Normal;
  std::uint32_t tbSize = 1032;  // PUSCH transport block bits; 0: control information only
  std::vector<std::uint32_t> rvSequence{0, 2, 3, 1};    // rv of transmission t: [t % size]
  std::uint32_t maxTransmissions = 4;                   // first transmission included
  std::uint32_t iterations = 6;                         // SCH_TD_ITER
  vexlon_ip_brannoc_generics generics{2, 1, 36864, 1};  // C_NUM_PU, C_ALGORITHM_TYPE, ...
  std::uint32_t cqiBits = 0;  // CQI report bits (PUSCH 0..127, PUCCH 0..13)
  std::uint32_t ackBits = 0;  // 0..2
  std::uint32_t riBits = 0;   // 0..2, PUSCH only
  std::uint32_t betaCqi = 8, betaAck = 6, betaRi = 6;  // beta-offset indices (TS 36.213 8.6.3)
  double llrScale = 1.0;  // soft value = round(32 * llrScale * LLR), saturated
  // Send every block maxTransmissions times, also after its CRC passed (vector files).
  bool retransmitDecoded = false;
};

// What happened to one block.
struct BlockOutcome {
  std::uint32_t transmissions = 0;  // sent, up to the one whose CRC passed
  bool correct = false;             // the block decoded to the bits sent
  std::uint32_t cqiErrors = 0;      // transmissions whose CQI / ACK / RI decoded wrongly
  std::uint32_t ackErrors = 0;
  std::uint32_t riErrors = 0;
  std::uint64_t deliveredBits = 0;  // bits of the block when it decoded correctly
  std::uint64_t decodedBits = 0;    // transport-block (PUCCH: report) bits of every call
  double decodeSeconds = 0;         // time spent in the decoder's calls
};

// One call of the C interface as the link makes it, with the payload that was sent (the
// results a test bench expects). Exactly one of shared and control is set.
struct Call {
  const vexlon_ip_brannoc_SCH_inputs* shared = nullptr;
  std::uint32_t maxHarqBufferSize = 0;
  const vexlon_ip_brannoc_CCH_inputs* control = nullptr;
  const tx::Bits* data = nullptr;  // PUSCH only
  const tx::Bits* cqi = nullptr;
  const tx::Bits* ack = nullptr;
  const tx::Bits* ri = nullptr;  // PUSCH only
};
using CallHook = std::function<void(const Call&)>;

// A well-mixed 64-bit value of two (splitmix64 finalizer steps).
std::uint64_t mixSeed(std::uint64_t a, std::uint64_t b);

class Link {
 public:
  explicit Link(LinkConfig config);
  ~Link();
  Link(const Link&) = delete;
  Link& operator=(const Link&) = delete;

  // Checks the configuration with the transmitter and creates the decoder instance; false
  // with a one-line message when either refuses.
  bool open(std::string& error);

  // Sends and decodes one block at Es/N0 snrDb (an infinite snrDb: noise-free, every soft
  // value +-64); hook (if any) sees each call before it is
  // made. False with a message when a call returns a non-zero status.
  bool runBlock(double snrDb, std::uint64_t seed, BlockOutcome& outcome, std::string& error,
                const CallHook& hook = {});

  const LinkConfig& config() const { return itsConfig; }

 private:
  bool runPusch(double snrDb, std::uint64_t seed, BlockOutcome& outcome, std::string& error,
                const CallHook& hook);
  bool runPucch(double snrDb, std::uint64_t seed, BlockOutcome& outcome, std::string& error,
                const CallHook& hook);

  LinkConfig itsConfig;
  vexlon_ip_brannoc_state* itsState = nullptr;
  tx::PuschTransmission itsSent;
  std::array<std::vector<std::int32_t>, 3> itsHarqIn;
  SharedOutputs itsOut;
};

}  // namespace brannoc::sim

#endif
