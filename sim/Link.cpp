// The link: transmitter, channel and one decoder instance, with HARQ combining.
#include "sim/Link.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <utility>

#include "tx/NoiseSource.h"
#include "tx/PucchTransmitter.h"

namespace brannoc::sim {

namespace {

tx::PuschParameters puschParameters(const LinkConfig& c, std::uint32_t rv) {
  tx::PuschParameters p;
  p.numPrb = c.numPrb;
  p.Qm = c.Qm;
  p.cp = c.cp;
  p.tbSize = c.tbSize;
  p.rv = rv;
  p.cqiBits = c.cqiBits;
  p.ackBits = c.ackBits;
  p.riBits = c.riBits;
  p.cqi.betaIndex = c.betaCqi;
  p.ack.betaIndex = c.betaAck;
  p.ri.betaIndex = c.betaRi;
  return p;
}

tx::Bits randomBits(tx::Xoshiro256& random, std::uint32_t n) {
  tx::Bits bits(n);
  std::uint64_t word = 0;
  for (std::uint32_t i = 0; i < n; ++i) {
    if (i % 64 == 0) word = random.next();
    bits[i] = static_cast<std::uint8_t>((word >> (i % 64)) & 1U);
  }
  return bits;
}

bool sameBits(const std::uint8_t* decoded, std::uint32_t size, const tx::Bits& sent) {
  return size == sent.size() && std::equal(sent.begin(), sent.end(), decoded);
}

tx::ChannelSettings awgn(const LinkConfig& c, double snrDb, std::uint64_t seed) {
  tx::ChannelSettings channel;
  channel.mode = std::isfinite(snrDb) ? tx::ChannelMode::Awgn : tx::ChannelMode::Ideal;
  channel.esN0Db = snrDb;
  channel.seed = seed;
  channel.llrScale = c.llrScale;
  return channel;
}

// Times one call of the decoder.
template <typename CallFn>
std::int32_t timed(BlockOutcome& outcome, CallFn&& call) {
  const auto start = std::chrono::steady_clock::now();
  const std::int32_t status = call();
  outcome.decodeSeconds +=
      std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
  return status;
}

}  // namespace

std::uint64_t mixSeed(std::uint64_t a, std::uint64_t b) {
  std::uint64_t x = a ^ (b * 0x9E3779B97F4A7C15ull + 0x632BE59BD9B4E019ull);
  x = (x ^ (x >> 30)) * 0xBF58476D1CE4E5B9ull;
  x = (x ^ (x >> 27)) * 0x94D049BB133111EBull;
  return x ^ (x >> 31);
}

Link::Link(LinkConfig config) : itsConfig(std::move(config)) {}

Link::~Link() { vexlon_ip_brannoc_destroy_state(itsState); }

bool Link::open(std::string& error) {
  const LinkConfig& c = itsConfig;
  if (c.maxTransmissions == 0 || c.rvSequence.empty() ||
      std::any_of(c.rvSequence.begin(), c.rvSequence.end(),
                  [](std::uint32_t rv) { return rv > 3; })) {
    error = "the redundancy versions must be 0..3 and at least one transmission is sent";
    return false;
  }
  if (c.channel == Channel::Pusch) {
    tx::PuschControlFields fields;
    if (const tx::TxOutcome outcome = derivePuschControlFields(puschParameters(c, 0), fields);
        !outcome.ok()) {
      error = "the transmitter refused the PUSCH parameters: " + outcome.text;
      return false;
    }
  } else {
    tx::PucchTransmission probe;
    const tx::Bits cqi(c.cqiBits), ack(c.ackBits);
    if (const tx::TxOutcome outcome = tx::transmitPucch(cqi, ack, c.cp, {}, probe); !outcome.ok()) {
      error = "the transmitter refused the PUCCH payload: " + outcome.text;
      return false;
    }
  }
  vexlon_ip_brannoc_destroy_state(itsState);
  itsState = vexlon_ip_brannoc_create_state(c.generics);
  if (itsState == nullptr) {
    error = "the decoder library refused the generics (its line above says why)";
    return false;
  }
  return true;
}

bool Link::runBlock(double snrDb, std::uint64_t seed, BlockOutcome& outcome, std::string& error,
                    const CallHook& hook) {
  outcome = BlockOutcome{};
  if (itsState == nullptr) {
    error = "the link was not opened";
    return false;
  }
  return itsConfig.channel == Channel::Pusch ? runPusch(snrDb, seed, outcome, error, hook)
                                             : runPucch(snrDb, seed, outcome, error, hook);
}

bool Link::runPusch(double snrDb, std::uint64_t seed, BlockOutcome& outcome, std::string& error,
                    const CallHook& hook) {
  const LinkConfig& c = itsConfig;
  tx::Xoshiro256 random(seed);
  tx::PuschPayload payload;
  payload.transportBlock = randomBits(random, c.tbSize);
  payload.cqi = randomBits(random, c.cqiBits);
  payload.ack = randomBits(random, c.ackBits);
  payload.ri = randomBits(random, c.riBits);
  std::uint32_t harqSize = 0;
  for (std::uint32_t t = 0; t < c.maxTransmissions; ++t) {
    const std::uint32_t rv = c.rvSequence[t % c.rvSequence.size()];
    const tx::TxOutcome sent = tx::transmitPusch(puschParameters(c, rv), payload,
                                                 awgn(c, snrDb, mixSeed(seed, t + 1)), itsSent);
    if (!sent.ok()) {
      error = "the transmitter refused a PUSCH transmission: " + sent.text;
      return false;
    }
    const tx::PuschControlFields& f = itsSent.fields;
    const std::array<std::vector<std::int32_t>, 3>& harqIn = itsHarqIn;
    const vexlon_ip_brannoc_SCH_inputs in{itsSent.softValues.data(),
                                          t == 0 ? nullptr : harqIn[0].data(),
                                          t == 0 ? nullptr : harqIn[1].data(),
                                          t == 0 ? nullptr : harqIn[2].data(),
                                          static_cast<std::uint32_t>(itsSent.softValues.size()),
                                          harqSize,
                                          {f.Qcqi,
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
                                           c.iterations,
                                           f.qamIndex,
                                           0,
                                           (8 * t) % 10,
                                           0,
                                           f.rv,
                                           t == 0 ? 1u : 0u,
                                           0,
                                           0,
                                           t}};
    vexlon_ip_brannoc_SCH_outputs& out = itsOut.prepare(in.controlData, f.harqBufferLength);
    if (hook) {
      hook({&in, f.harqBufferLength, nullptr, &payload.transportBlock, &payload.cqi, &payload.ack,
            &payload.ri});
    }
    const std::int32_t status =
        timed(outcome, [&] { return vexlon_ip_brannoc_SCH_bitacc_simulate(itsState, in, &out); });
    if (status != 0) {
      error = "the shared-channel call returned status " + std::to_string(status);
      return false;
    }
    outcome.transmissions = t + 1;
    outcome.decodedBits += c.tbSize;
    const bool cqiWrong =
        c.cqiBits > 0 && (out.SCH_CQI_crc_error != 0 ||
                          !sameBits(itsOut.cqi.data(), out.SCH_CQI_out_size, payload.cqi));
    const bool ackWrong =
        c.ackBits > 0 && !sameBits(itsOut.ack.data(), out.SCH_ACK_out_size, payload.ack);
    const bool riWrong =
        c.riBits > 0 && !sameBits(itsOut.ri.data(), out.SCH_RI_out_size, payload.ri);
    outcome.cqiErrors += cqiWrong;
    outcome.ackErrors += ackWrong;
    outcome.riErrors += riWrong;
    if (out.SCH_TB_crc_error == 0 && !outcome.correct) {
      // The receiver takes the block: right unless the CRC missed an error. Without a
      // transport block (control only), the control fields are the block.
      outcome.correct =
          c.tbSize > 0 ? sameBits(itsOut.data.data(), out.SCH_data_out_size, payload.transportBlock)
                       : !(cqiWrong || ackWrong || riWrong);
      outcome.deliveredBits = outcome.correct ? c.tbSize : 0;
      if (!c.retransmitDecoded) break;
    }
    std::swap(itsHarqIn, itsOut.harq);
    harqSize = out.harq_buffer_out_size;
  }
  return true;
}

bool Link::runPucch(double snrDb, std::uint64_t seed, BlockOutcome& outcome, std::string& error,
                    const CallHook& hook) {
  const LinkConfig& c = itsConfig;
  tx::Xoshiro256 random(seed);
  const tx::Bits cqi = randomBits(random, c.cqiBits);
  const tx::Bits ack = randomBits(random, c.ackBits);
  tx::PucchTransmission sent;
  if (const tx::TxOutcome outcome =
          tx::transmitPucch(cqi, ack, c.cp, awgn(c, snrDb, mixSeed(seed, 1)), sent);
      !outcome.ok()) {
    error = "the transmitter refused a PUCCH transmission: " + outcome.text;
    return false;
  }
  std::vector<std::uint8_t>& decodedCqi = itsOut.cqi;
  std::vector<std::uint8_t>& decodedAck = itsOut.ack;
  decodedCqi.resize(std::max<std::uint32_t>(c.cqiBits, 1));
  decodedAck.resize(2);
  const vexlon_ip_brannoc_CCH_inputs in{
      sent.softValues.data(),
      static_cast<std::uint32_t>(sent.softValues.size()),
      {c.cqiBits, c.cp == tx::CyclicPrefix::Normal ? 0u : 1u, c.ackBits, 0, 0}};
  vexlon_ip_brannoc_CCH_outputs out{decodedCqi.data(),
                                    decodedAck.data(),
                                    static_cast<std::uint32_t>(decodedCqi.size()),
                                    2,
                                    0,
                                    0,
                                    0};
  if (hook) hook({nullptr, 0, &in, nullptr, &cqi, &ack, nullptr});
  const std::int32_t status =
      timed(outcome, [&] { return vexlon_ip_brannoc_CCH_bitacc_simulate(itsState, in, &out); });
  if (status != 0) {
    error = "the control-channel call returned status " + std::to_string(status);
    return false;
  }
  const bool cqiRight = sameBits(decodedCqi.data(), out.CCH_data_out_size, cqi);
  const bool ackRight = sameBits(decodedAck.data(), out.CCH_ACK_out_size, ack);
  outcome.transmissions = 1;
  outcome.decodedBits = c.cqiBits + c.ackBits;
  outcome.cqiErrors = c.cqiBits > 0 && !cqiRight;
  outcome.ackErrors = c.ackBits > 0 && !ackRight;
  outcome.correct = c.cqiBits > 0 ? cqiRight : ackRight;
  outcome.deliveredBits = outcome.correct ? outcome.decodedBits : 0;
  return true;
}

}  // namespace brannoc::sim
