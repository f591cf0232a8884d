// KRateDeMatch: rate dematching of turbo-coded code blocks (TS 36.212 clause 5.1.4.1), of
// the convolutionally coded CQI (clause 5.1.4.2) and soft combining of the HARQ-ACK, RI and
// short CQI repetitions (clause 5.2.2.6), with 8:5 saturation of every sum.
#include "KRateDeMatch.h"

#include <algorithm>
#include <array>
#include <string_view>

#include "errorLine.h"

namespace brannoc {

namespace {

constexpr std::string_view kSource = "../s/KRateDeMatch";

// Inter-column permutations of the sub-block interleaver: TS 36.212 Table 5.1.4-1 (turbo
// coded, mode 0) and Table 5.1.4-2 (convolutionally coded, mode 1).
// clang-format off
constexpr std::array<std::int32_t, 32> kTurboColumns = {
    0, 16, 8, 24, 4, 20, 12, 28, 2, 18, 10, 26, 6, 22, 14, 30,
    1, 17, 9, 25, 5, 21, 13, 29, 3, 19, 11, 27, 7, 23, 15, 31};
constexpr std::array<std::int32_t, 32> kConvColumns = {
    1, 17, 9, 25, 5, 21, 13, 29, 3, 19, 11, 27, 7, 23, 15, 31,
    0, 16, 8, 24, 4, 20, 12, 28, 2, 18, 10, 26, 6, 22, 14, 30};
// clang-format on

const std::array<std::int32_t, 32>* columnPattern(std::uint32_t mode) {
  if (mode == 0) {
    return &kTurboColumns;
  }
  if (mode == 1) {
    return &kConvColumns;
  }
  return nullptr;
}

// Null-map marks of the circular buffer.
constexpr std::int32_t kReal = 0;
constexpr std::int32_t kDummy = 1;
constexpr std::int32_t kFiller = 2;

// Geometry of the convolutionally coded CQI: D = O + 8 (the CRC8), 32-column interleaver.
struct ConvGeometry {
  std::uint32_t D;
  std::uint32_t Kpi;
  std::uint32_t ND;
};

ConvGeometry convGeometry(std::uint32_t cqiSize) {
  const std::uint32_t D = cqiSize + 8;
  const std::uint32_t R = (D - 1) / 32 + 1;
  return {D, 32 * R, 32 * R - D};
}

// Writes value at out[position - ND] when that lies inside the stream; false (after a line)
// when an inconsistent table points outside it.
bool placeSoftValue(std::vector<std::int32_t>& out, std::int32_t position, std::uint32_t ND,
                    std::int32_t value) {
  const std::int64_t index = std::int64_t{position} - ND;
  if (index < 0 || index >= static_cast<std::int64_t>(out.size())) {
    errorLineFile(kSource, __LINE__, " interleaver position ", position,
                  " lies outside the stream of ", out.size(), " soft values after ", ND,
                  " dummies");
    return false;
  }
  out[static_cast<std::size_t>(index)] = value;
  return true;
}

}  // namespace

std::unique_ptr<KRateDeMatch> KRateDeMatch::create(const std::string& properties) {
  if (!properties.empty()) {
    errorLineBare("ERROR:KRateDeMatch:Unexpected properties:", properties);
    return nullptr;
  }
  return std::make_unique<KRateDeMatch>();
}

KRateDeMatch::KRateDeMatch()
    : itsParamsSet(false),
      itsRMParams(),
      itsChaseFormat(0.0, 3, 5, false),
      itsHarqFormat(0.0, 3, 5, false) {}

KRateDeMatch::~KRateDeMatch() = default;

bool KRateDeMatch::setModulationParams(std::uint32_t totalBits, std::uint32_t Qm,
                                       std::uint32_t numLayers, std::uint32_t cpType) {
  itsParamsSet = true;
  return itsRMParams.setTransmission(totalBits, Qm, numLayers, cpType);
}

bool KRateDeMatch::setParams(std::uint32_t tbSize, std::uint32_t G, std::uint32_t Qm,
                             std::uint32_t rvIdx, std::uint32_t numLayers) {
  // The rate-matched length per code block is counted in modulation symbols per layer:
  // without bits per symbol or layers there is nothing to divide by.
  if (Qm == 0 || numLayers == 0 || !itsRMParams.setDataParams(tbSize, G, 0, Qm, rvIdx, numLayers)) {
    errorLineBare("Invalid combination of parameters: tbsize, g, qm, rvidx, nlayers");
    return false;
  }
  itsParamsSet = true;
  return true;
}

std::uint32_t KRateDeMatch::getCodeBlockBufferLength(std::uint32_t r) const {
  const segmentationParams& seg = itsRMParams.seg;
  const std::uint32_t K = r >= seg.Cminus ? seg.Kplus : seg.Kminus;
  return 3 * (K + 4);
}

std::uint32_t KRateDeMatch::getCodeBlockE(std::uint32_t r) const {
  return r <= itsRMParams.Eidx ? itsRMParams.E0 : itsRMParams.E1;
}

// The quantizer results are not needed: saturation is the intended behaviour, not a
// failure. Moving the sum back to the full format leaves its value as it is.
std::int32_t KRateDeMatch::saturatedSum(const KQuantized& format, std::int32_t a, std::int32_t b) {
  KQuantized x(format);
  x.setValueQ(a);
  KQuantized y(format);
  y.setValueQ(b);
  KQuantized sum = x + y;
  sum.setNINTBITS(format.getNINTBITS());
  sum.changeFormat(format.getNINTBITS(), format.getNFRACBITS());
  return static_cast<std::int32_t>(sum.getValueQ());
}

bool KRateDeMatch::blockGeometry(std::uint32_t r, BlockGeometry& g) const {
  if (computeBlockGeometry(r, g)) {
    return true;
  }
  const segmentationParams& seg = itsRMParams.seg;
  const bool minus = r < seg.Cminus;
  errorLineFile(kSource, __LINE__, " interleaver of ",
                32 * std::uint64_t{minus ? itsRMParams.rowMinus : itsRMParams.rowPlus},
                " positions cannot hold ", std::uint64_t{minus ? seg.Kminus : seg.Kplus} + 4,
                " soft values with ", r == 0 ? seg.F : 0, " fillers");
  return false;
}

bool KRateDeMatch::computeBlockGeometry(std::uint32_t r, BlockGeometry& g) const {
  const segmentationParams& seg = itsRMParams.seg;
  const bool minus = r < seg.Cminus;
  const std::uint64_t D = std::uint64_t{minus ? seg.Kminus : seg.Kplus} + 4;
  const std::uint64_t R = minus ? itsRMParams.rowMinus : itsRMParams.rowPlus;
  const std::uint64_t Kpi = 32 * R;
  const std::uint64_t F = r == 0 ? seg.F : 0;
  // The interleaver must hold the D_r soft values, and the fillers are part of them; the
  // buffer of three streams must stay addressable by signed 32-bit tables.
  if (Kpi < D || F > D || 3 * Kpi > INT32_MAX) {
    return false;
  }
  g.D = static_cast<std::uint32_t>(D);
  g.R = static_cast<std::uint32_t>(R);
  g.Kpi = static_cast<std::uint32_t>(Kpi);
  g.ND = static_cast<std::uint32_t>(Kpi - D);
  g.F = static_cast<std::uint32_t>(F);
  return true;
}

const KRateDeMatch::DematchMap* KRateDeMatch::dematchMap(std::uint32_t r) {
  BlockGeometry g;
  if (!computeBlockGeometry(r, g) || g.D > kIndexMask) {
    return nullptr;
  }
  const bool minus = r < itsRMParams.seg.Cminus;
  const std::uint32_t Ncb = minus ? itsRMParams.NcbMinus : itsRMParams.NcbPlus;
  for (const DematchMap& map : itsMaps) {
    if (map.D == g.D && map.R == g.R && map.F == g.F && map.Ncb == Ncb) {
      return &map;
    }
  }
  // Only the whole circular buffer (no soft-buffer limit) is handled here.
  if (Ncb != 3 * g.Kpi) {
    return nullptr;
  }
  SoftValues nullMap;
  SoftValues P;
  SoftValues pi;
  if (!createInterleavingTables(0, r, nullMap, P, pi)) {
    return nullptr;
  }
  DematchMap map;
  map.D = g.D;
  map.R = g.R;
  map.F = g.F;
  map.Ncb = Ncb;
  auto place = [&g](std::uint32_t stream, std::int32_t y) {
    return stream << kStreamShift | (static_cast<std::uint32_t>(y) - g.ND);
  };
  for (std::uint32_t p = 0; p < Ncb; ++p) {
    const std::uint32_t k = p < g.Kpi ? p : (p - g.Kpi) / 2;
    const std::uint32_t stream = p < g.Kpi ? 0 : 1 + (p - g.Kpi) % 2;
    const std::uint32_t target = place(stream, stream == 2 ? pi[k] : P[k]);
    if (nullMap[p] == kReal) {
      map.position.push_back(p);
      map.target.push_back(target);
    } else if (nullMap[p] == kFiller) {
      map.fillers.push_back(target);
    }
  }
  if (map.position.empty()) {
    return nullptr;
  }
  if (itsMaps.size() == 4) {
    itsMaps.erase(itsMaps.begin());
  }
  itsMaps.push_back(std::move(map));
  return &itsMaps.back();
}

bool KRateDeMatch::rateDematchData(std::span<const std::int32_t> in, Streams& out,
                                   std::uint32_t r) {
  const DematchMap* map = itsParamsSet && in.size() == getCodeBlockE(r) ? dematchMap(r) : nullptr;
  if (map == nullptr) {
    return rateDematchDataReference(in, out, r);
  }
  out.resize(3);
  for (SoftValues& stream : out) {
    stream.assign(map->D, 0);
  }
  std::int32_t* const streams[3] = {out[0].data(), out[1].data(), out[2].data()};
  const std::int64_t minQ = itsChaseFormat.getMinQ();
  const std::int64_t maxQ = itsChaseFormat.getMaxQ();
  for (const std::uint32_t target : map->fillers) {
    streams[target >> kStreamShift][target & kIndexMask] = static_cast<std::int32_t>(minQ);
  }
  // The walk starts at the first real position at or after k0 and wraps around the buffer.
  const bool minus = r < itsRMParams.seg.Cminus;
  const std::uint32_t k0 = (minus ? itsRMParams.k0_0 : itsRMParams.k0_1) % map->Ncb;
  const std::size_t count = map->position.size();
  std::size_t n = static_cast<std::size_t>(
      std::lower_bound(map->position.begin(), map->position.end(), k0) - map->position.begin());
  if (in.size() <= count) {
    // Each position is met once at most, onto its 0: the sum is the soft value saturated.
    for (const std::int32_t value : in) {
      if (n == count) {
        n = 0;
      }
      const std::uint32_t target = map->target[n++];
      streams[target >> kStreamShift][target & kIndexMask] =
          static_cast<std::int32_t>(std::clamp<std::int64_t>(value, minQ, maxQ));
    }
    return true;
  }
  for (const std::int32_t value : in) {
    if (n == count) {
      n = 0;
    }
    const std::uint32_t target = map->target[n++];
    std::int32_t& acc = streams[target >> kStreamShift][target & kIndexMask];
    acc = saturatingAdd(value, acc, minQ, maxQ);
  }
  return true;
}

bool KRateDeMatch::rateDematchDataReference(std::span<const std::int32_t> in, Streams& out,
                                            std::uint32_t r) {
  out.assign(3, SoftValues());
  if (!itsParamsSet) {
    errorLineBare("Need to set RM parameters before calling RM data");
    return false;
  }
  const std::uint32_t E = getCodeBlockE(r);
  if (in.size() != E) {
    errorLineBare("LLR Input Size must be: ", E);
    return false;
  }
  SoftValues nullMap;
  SoftValues P;
  SoftValues pi;
  if (!createInterleavingTables(0, r, nullMap, P, pi)) {
    errorLineBare("Unable to create Interleaving Tables");
    return false;
  }
  const bool minus = r < itsRMParams.seg.Cminus;
  const std::uint32_t k0 = minus ? itsRMParams.k0_0 : itsRMParams.k0_1;
  const std::uint32_t Ncb = minus ? itsRMParams.NcbMinus : itsRMParams.NcbPlus;
  SoftValues w;
  if (!llrCollect(in, nullMap, w, k0, Ncb, E)) {
    errorLineBare(" Error in llrCollect");
    return false;
  }
  if (!deinterleaveData(w, nullMap, P, pi, out[0], out[1], out[2], r)) {
    errorLineBare(" Error in deinterleaveData");
    return false;
  }
  return true;
}

bool KRateDeMatch::createInterleavingTables(std::uint32_t mode, std::uint32_t r,
                                            SoftValues& nullMap, SoftValues& P,
                                            SoftValues& pi) const {
  const std::array<std::int32_t, 32>* pattern = columnPattern(mode);
  if (pattern == nullptr) {
    errorLineFile(kSource, __LINE__, " no column permutation for mode ", mode);
    return false;
  }
  BlockGeometry g;
  if (!blockGeometry(r, g)) {
    return false;
  }
  // Interleaver input y: ND dummies, then (block 0 only) F fillers, then the stream. The
  // fillers occupy the systematic and first-parity streams; the second parity stream of the
  // turbo coder has none.
  const auto markSystematic = [&g](std::int32_t y) {
    const auto i = static_cast<std::uint32_t>(y);
    return i < g.ND ? kDummy : (i < g.ND + g.F ? kFiller : kReal);
  };
  const auto markParity2 = [&g](std::int32_t y) {
    return static_cast<std::uint32_t>(y) < g.ND ? kDummy : kReal;
  };

  const auto Kpi = static_cast<std::int32_t>(g.Kpi);
  const auto R = static_cast<std::int32_t>(g.R);
  P.assign(g.Kpi, 0);
  pi.assign(g.Kpi, 0);
  std::size_t k = 0;
  for (std::int32_t column : *pattern) {
    for (std::int32_t row = 0; row < R; ++row, ++k) {
      P[k] = column + 32 * row;
      pi[k] = (P[k] + 1) % Kpi;
    }
  }
  // Circular buffer w: the systematic stream v0 first, then v1 and v2 interlaced (v1 at the
  // even positions).
  nullMap.assign(3 * std::size_t{g.Kpi}, kReal);
  for (k = 0; k < g.Kpi; ++k) {
    nullMap[k] = markSystematic(P[k]);
    nullMap[g.Kpi + 2 * k] = markSystematic(P[k]);
    nullMap[g.Kpi + 2 * k + 1] = markParity2(pi[k]);
  }
  return true;
}

bool KRateDeMatch::createConvInterleavingTables(std::uint32_t mode, SoftValues& nullMap,
                                                SoftValues& P) const {
  const std::array<std::int32_t, 32>* pattern = columnPattern(mode);
  if (pattern == nullptr) {
    errorLineFile(kSource, __LINE__, " no column permutation for mode ", mode);
    return false;
  }
  const ConvGeometry g = convGeometry(itsRMParams.cqiSize);
  const auto R = static_cast<std::int32_t>(g.Kpi / 32);
  P.assign(g.Kpi, 0);
  std::size_t k = 0;
  for (std::int32_t column : *pattern) {
    for (std::int32_t row = 0; row < R; ++row, ++k) {
      P[k] = column + 32 * row;
    }
  }
  // The three coded streams follow one another in the buffer, each with the same dummies.
  nullMap.assign(3 * std::size_t{g.Kpi}, kReal);
  for (k = 0; k < g.Kpi; ++k) {
    const std::int32_t mark = static_cast<std::uint32_t>(P[k]) < g.ND ? kDummy : kReal;
    nullMap[k] = mark;
    nullMap[g.Kpi + k] = mark;
    nullMap[2 * g.Kpi + k] = mark;
  }
  return true;
}

bool KRateDeMatch::llrCollect(std::span<const std::int32_t> in, const SoftValues& nullMap,
                              SoftValues& w, std::uint32_t k0, std::uint32_t Ncb,
                              std::uint32_t E) const {
  w.assign(Ncb, 0);
  if (E == 0) {
    return true;
  }
  if (Ncb == 0 || nullMap.size() < Ncb || in.size() < E) {
    errorLineFile(kSource, __LINE__, " cannot collect ", E, " soft values from ", in.size(),
                  " into a buffer of ", Ncb, " with ", nullMap.size(), " marks");
    return false;
  }
  // Walk the circular buffer from k0, giving the next soft value to every real position and
  // skipping dummies and fillers. A position met again (E above the real positions) adds
  // the repetition; positions never met stay 0.
  std::uint32_t p = k0 % Ncb;
  std::uint32_t skippedInARow = 0;
  std::uint32_t m = 0;
  while (m < E) {
    if (nullMap[p] == kReal) {
      w[p] = saturatingAdd(in[m], w[p], itsChaseFormat.getMinQ(), itsChaseFormat.getMaxQ());
      ++m;
      skippedInARow = 0;
    } else if (++skippedInARow == Ncb) {
      errorLineFile(kSource, __LINE__, " buffer of ", Ncb, " positions holds no real bit");
      return false;
    }
    if (++p == Ncb) {
      p = 0;
    }
  }
  return true;
}

bool KRateDeMatch::deinterleaveData(const SoftValues& w, const SoftValues& nullMap,
                                    const SoftValues& P, const SoftValues& pi, SoftValues& d0,
                                    SoftValues& d1, SoftValues& d2, std::uint32_t r) const {
  const segmentationParams& seg = itsRMParams.seg;
  const bool minus = r < seg.Cminus;
  const std::uint32_t D = (minus ? seg.Kminus : seg.Kplus) + 4;
  const std::uint64_t Kpi = 32 * std::uint64_t{minus ? itsRMParams.rowMinus : itsRMParams.rowPlus};
  d0.assign(D, 0);
  d1.assign(D, 0);
  d2.assign(D, 0);
  if (w.size() != 3 * Kpi) {
    errorLineFile(kSource, 276, " llr's size should be:", 3 * Kpi, "  size is:", w.size());
    return false;
  }
  if (Kpi < D || nullMap.size() != 3 * Kpi || P.size() != Kpi || pi.size() != Kpi) {
    errorLineFile(kSource, __LINE__, " tables do not fit an interleaver of ", Kpi,
                  " positions for ", D, " soft values: null map ", nullMap.size(), ", P ", P.size(),
                  ", pi ", pi.size());
    return false;
  }
  const auto ND = static_cast<std::uint32_t>(Kpi - D);
  const auto filler = static_cast<std::int32_t>(itsChaseFormat.getMinQ());
  for (std::size_t k = 0; k < Kpi; ++k) {
    // A filler is a known 0 bit: the strongest "0" soft value.
    const std::int32_t mark0 = nullMap[k];
    if (mark0 != kDummy && !placeSoftValue(d0, P[k], ND, mark0 == kFiller ? filler : w[k])) {
      return false;
    }
    const std::size_t p1 = Kpi + 2 * k;
    const std::int32_t mark1 = nullMap[p1];
    if (mark1 != kDummy && !placeSoftValue(d1, P[k], ND, mark1 == kFiller ? filler : w[p1])) {
      return false;
    }
    const std::int32_t mark2 = nullMap[p1 + 1];
    if (mark2 == kFiller) {
      errorLineFile(kSource, 331, " No segmentation fillers for p1. ????");
      return false;
    }
    if (mark2 != kDummy && !placeSoftValue(d2, pi[k], ND, w[p1 + 1])) {
      return false;
    }
  }
  return true;
}

bool KRateDeMatch::applyHARQ(const Streams& harqIn, const Streams& dematched, Streams& out,
                             std::uint32_t r) {
  const std::uint32_t D = getCodeBlockBufferLength(r) / 3;
  out.resize(3);
  for (SoftValues& stream : out) {
    stream.assign(D, 0);
  }
  // Both inputs must hold D_r soft values in each of the three streams.
  for (std::size_t s = 0; s < 3; ++s) {
    const std::size_t harqSize = s < harqIn.size() ? harqIn[s].size() : 0;
    const std::size_t dematchedSize = s < dematched.size() ? dematched[s].size() : 0;
    if (harqSize < D || dematchedSize < D) {
      errorLineFile(kSource, __LINE__, " HARQ stream ", s, " size should be at least:", D,
                    "  harq size is:", harqSize, "  dematched size is:", dematchedSize);
      return false;
    }
  }
  const std::int64_t minQ = itsHarqFormat.getMinQ();
  const std::int64_t maxQ = itsHarqFormat.getMaxQ();
  for (std::size_t s = 0; s < 3; ++s) {
    for (std::size_t i = 0; i < D; ++i) {
      out[s][i] = saturatingAdd(dematched[s][i], harqIn[s][i], minQ, maxQ);
    }
  }
  return true;
}

bool KRateDeMatch::rateDematchAndHARQ(const SoftValues& in, const Streams& harqIn, Streams& out,
                                      std::uint32_t r) {
  out.assign(3, SoftValues());
  Streams dematched;
  if (!rateDematchData(in, dematched, r)) {
    errorLineBare("ERROR PERFORMING RATE DEMATCH");
    return false;
  }
  if (!applyHARQ(harqIn, dematched, out, r)) {
    errorLineBare("ERROR PERFORMING HARQ");
    return false;
  }
  return true;
}

bool KRateDeMatch::rateDematchConv(const SoftValues& in, SoftValues& w, SoftValues& d0,
                                   SoftValues& d1, SoftValues& d2) {
  d0.clear();
  d1.clear();
  d2.clear();
  if (!itsParamsSet) {
    errorLineBare("Need to set RM parameters before calling RM data");
    return false;
  }
  const std::uint32_t Q = itsRMParams.cqiQ;
  if (in.size() != Q) {
    errorLineBare("LLR Input Size must be: ", Q);
    return false;
  }
  SoftValues nullMap;
  SoftValues P;
  if (!createConvInterleavingTables(1, nullMap, P)) {
    errorLineBare("Unable to create Interleaving Tables");
    return false;
  }
  const auto Ncb = static_cast<std::uint32_t>(3 * P.size());
  if (!llrCollect(in, nullMap, w, 0, Ncb, Q)) {
    errorLineBare(" Error in llrCollect");
    return false;
  }
  if (!deinterleaveConvData(w, nullMap, P, d0, d1, d2)) {
    errorLineBare(" Error in deinterleaveData");
    return false;
  }
  return true;
}

bool KRateDeMatch::deinterleaveConvData(const SoftValues& w, const SoftValues& nullMap,
                                        const SoftValues& P, SoftValues& d0, SoftValues& d1,
                                        SoftValues& d2) const {
  const ConvGeometry g = convGeometry(itsRMParams.cqiSize);
  d0.assign(g.D, 0);
  d1.assign(g.D, 0);
  d2.assign(g.D, 0);
  const std::size_t Kpi = g.Kpi;
  if (w.size() != 3 * Kpi) {
    errorLineFile(kSource, 361, " llr's size should be:", 3 * Kpi, "  size is:", w.size());
    return false;
  }
  if (nullMap.size() != 3 * Kpi || P.size() != Kpi) {
    errorLineFile(kSource, __LINE__, " tables do not fit an interleaver of ", Kpi,
                  " positions: null map ", nullMap.size(), ", P ", P.size());
    return false;
  }
  SoftValues* const streams[3] = {&d0, &d1, &d2};
  for (std::size_t s = 0; s < 3; ++s) {
    for (std::size_t k = 0; k < Kpi; ++k) {
      const std::size_t p = s * Kpi + k;
      if (nullMap[p] == kReal && !placeSoftValue(*streams[s], P[k], g.ND, w[p])) {
        return false;
      }
    }
  }
  return true;
}

bool KRateDeMatch::combineAckRi(const SoftValues& softIn, SoftValues& combined, std::uint32_t Q,
                                std::uint32_t fieldSize, bool isRI) const {
  if (!itsParamsSet) {
    errorLineFile(kSource, __LINE__, "Need to set RM parameters before calling RM data");
    return false;
  }
  if (Q == 0) {
    errorLineFile(kSource, __LINE__,
                  isRI ? "Need to set RI_Q parameter before calling RM data"
                       : "Need to set ACK_Q parameter before calling RM data");
    return false;
  }
  if (softIn.size() != Q) {
    errorLineFile(kSource, __LINE__,
                  isRI ? "RI DataIn size must match RI_Q" : "ACK DataIn size must match ACK_Q");
    return false;
  }
  if (fieldSize != 1 && fieldSize != 2) {
    if (isRI) {
      errorLineFile(kSource, __LINE__, "RI size must be either 1 or 2 = ", fieldSize);
    } else {
      errorLineFile(kSource, __LINE__, "ACK size must be either 1 or 2");
    }
    return false;
  }
  // One coded block of the field: one modulation symbol for 1 bit, three for 2 bits.
  const std::uint32_t P = fieldSize == 1 ? itsRMParams.Qm : 3 * itsRMParams.Qm;
  if (P == 0) {
    errorLineFile(kSource, __LINE__, " modulation order is 0: no positions to combine on");
    return false;
  }
  combined.assign(P, 0);
  for (std::size_t i = 0; i < softIn.size(); ++i) {
    std::int32_t& acc = combined[i % P];
    acc = saturatingAdd(softIn[i], acc, itsChaseFormat.getMinQ(), itsChaseFormat.getMaxQ());
  }
  return true;
}

bool KRateDeMatch::rateDematchRI(const SoftValues& softIn, SoftValues& combined) const {
  return combineAckRi(softIn, combined, itsRMParams.riQ, itsRMParams.riSize, true);
}

bool KRateDeMatch::rateDematchACK(const SoftValues& softIn, SoftValues& combined) const {
  return combineAckRi(softIn, combined, itsRMParams.ackQ, itsRMParams.ackSize, false);
}

bool KRateDeMatch::rateDematchCQI(const SoftValues& softIn, SoftValues& combined) const {
  if (!itsParamsSet) {
    errorLineFile(kSource, __LINE__, "Need to set RM parameters before calling RM data");
    return false;
  }
  const std::uint32_t Q = itsRMParams.cqiQ;
  if (Q == 0) {
    errorLineFile(kSource, __LINE__, "Need to set CQI_Q parameter before calling RM data");
    return false;
  }
  if (softIn.size() != Q) {
    errorLineFile(kSource, __LINE__, "CQI DataIn size must match CQI_Q");
    return false;
  }
  // The (32, O) block code repeated: every soft value lands on its code position i mod 32.
  constexpr std::size_t kCodeLength = 32;
  combined.assign(kCodeLength, 0);
  for (std::size_t i = 0; i < softIn.size(); ++i) {
    std::int32_t& acc = combined[i % kCodeLength];
    acc = saturatingAdd(softIn[i], acc, itsChaseFormat.getMinQ(), itsChaseFormat.getMaxQ());
  }
  return true;
}

}  // namespace brannoc
