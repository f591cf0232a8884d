// The channel model between the transmitter's coded bits and the decoder's soft values:
// modulation (TS 36.211 7.1 or Table 5.4.1-1), complex AWGN from a seeded reproducible
// source, max-log soft demapping, and quantisation to the decoder's 8:5 soft-value format.
//
// Soft-value format: raw signed integers -128..127 with 5 fraction bits (32 = 1.0), and
// POSITIVE FAVOURS BIT 1 (the LLR is ln(P1/P0), the opposite of the usual ln(P0/P1)).
// Scale: raw = round(32 * llrScale * LLR) saturated to -128..127, LLR being the max-log
// value of demapMaxLog with the true noise variance; llrScale 1.0 makes raw/32 the LLR itself.
// An "x" placeholder bit (kPlaceholderBit) always gets the soft value 0: it carries no
// information to a descrambling receiver.
#ifndef BRANNOC_TX_SOFTCHANNEL_H
#define BRANNOC_TX_SOFTCHANNEL_H

#include <cstdint>
#include <span>
#include <vector>

#include "tx/Modulation.h"
#include "tx/NoiseSource.h"

namespace brannoc::tx {

constexpr std::int32_t kSoftOne = 32;
constexpr std::int32_t kSoftMax = 127;
constexpr std::int32_t kSoftMin = -128;

enum class ChannelMode {
  Ideal,  // every bit a fixed +amplitude (bit 1) or -amplitude (bit 0), no noise
  Awgn,   // modulation, complex Gaussian noise at the given Es/N0, max-log demapping
};

struct ChannelSettings {
  ChannelMode mode = ChannelMode::Ideal;
  std::int32_t idealAmplitude = 64;  // raw 8:5 magnitude of an ideal soft value, 1..127
  double esN0Db = 10.0;              // symbol energy (1 for every constellation) over N0
  std::uint64_t seed = 1;
  double llrScale = 1.0;
};

// round(32 * scale * llr), halves away from zero, saturated to -128..127.
std::int32_t quantizeLlr(double llr, double scale);

// N0 = 10^(-esN0Db / 10), computed without the C library's exp/pow.
double noiseVarianceFromEsN0Db(double esN0Db);

// One soft value per bit of `bits`, which are mapped onto `constellation` (the last symbol
// padded with 1 bits when the length is not a multiple of its bits per symbol). A seed
// gives the same values on every build. False, with `soft` emptied, when the settings are
// unusable (amplitude outside 1..127, Es/N0 not finite or beyond +-300 dB, scale not a
// positive finite number).
bool makeSoftValues(std::span<const std::uint8_t> bits, Constellation constellation,
                    const ChannelSettings& settings, std::vector<std::int32_t>& soft);

// The same, drawing the noise from `noise` (settings.seed unused), so that several parts of
// one transmission can share a noise sequence. The soft values are appended to `soft`,
// which is emptied when the settings are unusable.
bool appendSoftValues(std::span<const std::uint8_t> bits, Constellation constellation,
                      const ChannelSettings& settings, GaussianSource& noise,
                      std::vector<std::int32_t>& soft);

}  // namespace brannoc::tx

#endif
