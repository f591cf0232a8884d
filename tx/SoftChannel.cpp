// Modulation, AWGN, max-log demapping and 8:5 quantisation of the soft values.
#include "tx/SoftChannel.h"

#include <cmath>
#include <cstddef>

#include "tx/UplinkTypes.h"

namespace brannoc::tx {

namespace {

constexpr double kLn10 = 2.302585092994045684017991;

bool usable(const ChannelSettings& settings) {
  if (settings.mode == ChannelMode::Ideal) {
    return settings.idealAmplitude >= 1 && settings.idealAmplitude <= kSoftMax;
  }
  return std::isfinite(settings.esN0Db) && std::fabs(settings.esN0Db) <= 300.0 &&
         std::isfinite(settings.llrScale) && settings.llrScale > 0.0;
}

}  // namespace

std::int32_t quantizeLlr(double llr, double scale) {
  const double value = llr * scale * kSoftOne;
  if (!(value < kSoftMax)) {  // also catches NaN, which cannot come from finite inputs
    return value != value ? 0 : kSoftMax;
  }
  if (value <= kSoftMin) {
    return kSoftMin;
  }
  return static_cast<std::int32_t>(value < 0.0 ? std::ceil(value - 0.5) : std::floor(value + 0.5));
}

double noiseVarianceFromEsN0Db(double esN0Db) {
  return deterministicExp(-esN0Db * kLn10 / 10.0);
}

bool makeSoftValues(std::span<const std::uint8_t> bits, Constellation constellation,
                    const ChannelSettings& settings, std::vector<std::int32_t>& soft) {
  soft.clear();
  GaussianSource noise(settings.seed);
  return appendSoftValues(bits, constellation, settings, noise, soft);
}

bool appendSoftValues(std::span<const std::uint8_t> bits, Constellation constellation,
                      const ChannelSettings& settings, GaussianSource& noise,
                      std::vector<std::int32_t>& soft) {
  if (!usable(settings)) {
    soft.clear();
    return false;
  }
  soft.reserve(soft.size() + bits.size());
  if (settings.mode == ChannelMode::Ideal) {
    for (std::uint8_t bit : bits) {
      soft.push_back(bit == kPlaceholderBit ? 0
                     : bit != 0             ? settings.idealAmplitude
                                            : -settings.idealAmplitude);
    }
    return true;
  }
  std::vector<Symbol> symbols = modulate(bits, constellation);
  const double N0 = noiseVarianceFromEsN0Db(settings.esN0Db);
  const double sigma = std::sqrt(N0 / 2.0);  // per real dimension
  for (Symbol& symbol : symbols) {
    const GaussianSource::Pair n = noise.nextPair();
    symbol.re += sigma * n.first;
    symbol.im += sigma * n.second;
  }
  const std::vector<double> llrs = demapMaxLog(symbols, constellation, N0);
  for (std::size_t i = 0; i < bits.size(); ++i) {
    soft.push_back(bits[i] == kPlaceholderBit ? 0 : quantizeLlr(llrs[i], settings.llrScale));
  }
  return true;
}

}  // namespace brannoc::tx
