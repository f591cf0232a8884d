// rateMatchParams: rate-matching parameters of TS 36.212 clause 5.1.4.1 for the uplink.
// The size setters report under "../s/rateMatchParams.cpp" with the line of the reporting
// statement.
#include "rateMatchParams.h"

#include <algorithm>

#include "errorLine.h"

namespace brannoc {

namespace {

constexpr std::string_view kSource = "../s/rateMatchParams.cpp";

struct CircularBuffer {
  std::uint32_t rows;  // R of the 32-column sub-block interleaver
  std::uint32_t Ncb;
  std::uint32_t k0;
};

// For a code block of K bits: D = K + 4 bits per stream, R = ceil(D / 32) rows,
// Kw = 3 * 32 * R, Ncb = Kw without a soft-buffer limit (always so on the uplink), else
// min(NIR / C, Kw), and k0 = R * (2 * ceil(Ncb / (8 * R)) * rv + 2).
CircularBuffer circularBuffer(std::uint32_t K, std::uint32_t NIR, std::uint32_t C,
                              std::uint32_t rvidx) {
  CircularBuffer buffer;
  buffer.rows = (K + 3) / 32 + 1;
  const std::uint32_t Kw = 96 * buffer.rows;
  buffer.Ncb = NIR == 0 ? Kw : std::min(NIR / C, Kw);
  buffer.k0 = 2 * buffer.rows * (((buffer.Ncb - 1) / (8 * buffer.rows) + 1) * rvidx + 1);
  return buffer;
}

}  // namespace

bool rateMatchParams::setTransmission(std::uint32_t totalBits_, std::uint32_t Qm_,
                                      std::uint32_t Nlayers_, std::uint32_t cpType_) {
  seg.compute();
  totalBits = totalBits_;
  Qm = Qm_;
  Nlayers = Nlayers_;
  cpType = cpType_;
  if (complete) {
    compute();
  }
  return true;
}

bool rateMatchParams::setDataParams(std::uint32_t tbSize, std::uint32_t G_, std::uint32_t NIR_,
                                    std::uint32_t Qm_, std::uint32_t rvidx_,
                                    std::uint32_t Nlayers_) {
  seg.compute();
  seg.setTBSize(tbSize);
  G = G_;
  NIR = NIR_;
  rvidx = rvidx_;
  Qm = Qm_;
  Nlayers = Nlayers_;
  return compute();
}

bool rateMatchParams::setCQISize(std::uint32_t n) {
  if (n >= 128) {
    brannoc::errorLineSource(kSource, __LINE__, "Error: CQI Size must be <128 :", n);
    return false;
  }
  cqiSize = n;
  return true;
}

bool rateMatchParams::setRISize(std::uint32_t n) {
  // Two RI bits are accepted, as the field allows; the message keeps the core's text.
  if (n >= 3) {
    brannoc::errorLineSource(kSource, __LINE__, "Error: RI Size must be <2 :", n);
    return false;
  }
  riSize = n;
  return true;
}

bool rateMatchParams::setACKSize(std::uint32_t n) {
  if (n >= 3) {
    brannoc::errorLineSource(kSource, __LINE__, "Error: ACK Size must be <2 : ", n);
    return false;
  }
  ackSize = n;
  return true;
}

bool rateMatchParams::setCQIQ(std::uint32_t n) {
  cqiQ = n;
  return compute();
}

bool rateMatchParams::setRIQ(std::uint32_t n) {
  riQ = n;
  return compute();
}

bool rateMatchParams::setACKQ(std::uint32_t n) {
  ackQ = n;
  return compute();
}

bool rateMatchParams::compute() {
  // G' = G / (NL * Qm) symbols per layer; gamma = G' mod C; the last gamma code blocks take
  // ceil(G' / C) symbols, the others floor(G' / C) (TS 36.212 5.1.4.1.2).
  const std::uint32_t bitsPerSymbol = Nlayers * Qm;
  const std::uint32_t C = seg.C;
  if (bitsPerSymbol == 0 || C == 0) {
    // Not configured yet: nothing can be derived.
    return true;
  }
  const std::uint32_t Gprime = G / bitsPerSymbol;
  const std::uint32_t gamma = Gprime % C;
  Eidx = C - gamma - 1;
  E0 = bitsPerSymbol * (Gprime / C);
  // For G' = 0 the ceiling is 0 as well (the unsigned form (G' - 1) / C + 1 would wrap).
  E1 = Gprime == 0 ? 0 : bitsPerSymbol * ((Gprime - 1) / C + 1);

  const CircularBuffer minus = circularBuffer(seg.Kminus, NIR, C, rvidx);
  rowMinus = minus.rows;
  NcbMinus = minus.Ncb;
  k0_0 = minus.k0;
  const CircularBuffer plus = circularBuffer(seg.Kplus, NIR, C, rvidx);
  rowPlus = plus.rows;
  NcbPlus = plus.Ncb;
  k0_1 = plus.k0;
  complete = true;
  return true;
}

}  // namespace brannoc
