// Modulation mappers of TS 36.211 7.1 and Table 5.4.1-1 and the max-log soft demapper.
#include "tx/Modulation.h"

#include <cmath>
#include <cstddef>

namespace brannoc::tx {

namespace {

// 1 - 2b: the sign a Gray-mapped bit gives to its axis (0 -> +1, 1 -> -1).
double sign(std::uint32_t bit) { return bit != 0 ? -1.0 : 1.0; }

}  // namespace

std::uint32_t bitsPerSymbol(Constellation constellation) {
  switch (constellation) {
    case Constellation::PucchBpsk:
      return 1;
    case Constellation::PucchQpsk:
    case Constellation::Qpsk:
      return 2;
    case Constellation::Qam16:
      return 4;
    case Constellation::Qam64:
      return 6;
  }
  return 0;
}

bool constellationForQm(std::uint32_t Qm, Constellation& constellation) {
  switch (Qm) {
    case 2:
      constellation = Constellation::Qpsk;
      return true;
    case 4:
      constellation = Constellation::Qam16;
      return true;
    case 6:
      constellation = Constellation::Qam64;
      return true;
    default:
      return false;
  }
}

Symbol constellationPoint(Constellation constellation, std::uint32_t label) {
  const std::uint32_t Qm = bitsPerSymbol(constellation);
  // b[n] = b(i + n), the first bit being the most significant of the label.
  std::uint32_t b[6] = {};
  for (std::uint32_t n = 0; n < Qm; ++n) {
    b[n] = (label >> (Qm - 1 - n)) & 1u;
  }
  switch (constellation) {
    case Constellation::PucchBpsk:
      return {sign(b[0]), 0.0};
    case Constellation::PucchQpsk: {
      // 00 -> 1, 01 -> -j, 10 -> j, 11 -> -1
      constexpr Symbol points[4] = {{1.0, 0.0}, {0.0, -1.0}, {0.0, 1.0}, {-1.0, 0.0}};
      return points[(b[0] << 1) | b[1]];
    }
    case Constellation::Qpsk: {
      const double a = 1.0 / std::sqrt(2.0);
      return {sign(b[0]) * a, sign(b[1]) * a};
    }
    case Constellation::Qam16: {
      // b(i), b(i+1) choose the signs of I and Q, b(i+2), b(i+3) the amplitude 1 or 3.
      const double a = 1.0 / std::sqrt(10.0);
      return {sign(b[0]) * (2.0 - sign(b[2])) * a, sign(b[1]) * (2.0 - sign(b[3])) * a};
    }
    case Constellation::Qam64: {
      // Amplitudes 1, 3, 5, 7: 4 - (1 - 2b(i+2)) * (2 - (1 - 2b(i+4))) on I, likewise on Q.
      const double a = 1.0 / std::sqrt(42.0);
      return {sign(b[0]) * (4.0 - sign(b[2]) * (2.0 - sign(b[4]))) * a,
              sign(b[1]) * (4.0 - sign(b[3]) * (2.0 - sign(b[5]))) * a};
    }
  }
  return {};
}

std::vector<Symbol> modulate(std::span<const std::uint8_t> bits, Constellation constellation) {
  const std::size_t Qm = bitsPerSymbol(constellation);
  std::vector<Symbol> symbols;
  symbols.reserve((bits.size() + Qm - 1) / Qm);
  for (std::size_t first = 0; first < bits.size(); first += Qm) {
    std::uint32_t label = 0;
    for (std::size_t n = 0; n < Qm; ++n) {
      const std::size_t index = first + n;
      const std::uint32_t bit = index >= bits.size() || bits[index] != 0 ? 1u : 0u;
      label = (label << 1) | bit;
    }
    symbols.push_back(constellationPoint(constellation, label));
  }
  return symbols;
}

std::vector<double> demapMaxLog(std::span<const Symbol> received, Constellation constellation,
                                double N0) {
  const std::uint32_t Qm = bitsPerSymbol(constellation);
  const std::uint32_t numPoints = 1u << Qm;
  Symbol points[64];
  for (std::uint32_t label = 0; label < numPoints; ++label) {
    points[label] = constellationPoint(constellation, label);
  }
  std::vector<double> llrs;
  llrs.reserve(received.size() * Qm);
  for (const Symbol& r : received) {
    double best[6][2];
    for (std::uint32_t n = 0; n < Qm; ++n) {
      best[n][0] = best[n][1] = INFINITY;
    }
    for (std::uint32_t label = 0; label < numPoints; ++label) {
      const double dRe = r.re - points[label].re;
      const double dIm = r.im - points[label].im;
      const double distance = dRe * dRe + dIm * dIm;
      for (std::uint32_t n = 0; n < Qm; ++n) {
        double& slot = best[n][(label >> (Qm - 1 - n)) & 1u];
        if (distance < slot) {
          slot = distance;
        }
      }
    }
    for (std::uint32_t n = 0; n < Qm; ++n) {
      llrs.push_back((best[n][0] - best[n][1]) / N0);
    }
  }
  return llrs;
}

}  // namespace brannoc::tx
