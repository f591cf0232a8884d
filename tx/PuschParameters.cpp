// Control symbol counts (TS 36.212 5.2.2.6, TS 36.213 8.6.3), interleaver size (5.2.2.8)
// and rate-matched lengths (5.1.4.1.2) of one PUSCH subframe.
#include "tx/PuschParameters.h"

#include <algorithm>
#include <string>
#include <string_view>
#include <tuple>
#include <utility>
#include <vector>

#include "tx/Segmentation.h"
#include "tx/UciPuschEncoder.h"
#include "tx/UlschEncoder.h"

namespace brannoc::tx {

namespace {

struct BetaRow {
  const char* table;
  std::uint32_t index;
  std::uint32_t eighths;  // 8 * beta_offset, 0 for a reserved entry
};
constexpr BetaRow kBetaOffsets[] = {
#include "tables/beta_offsets.inc"
};

std::string_view tableName(BetaTable table) {
  switch (table) {
    case BetaTable::Ack:
      return "ACK";
    case BetaTable::Ri:
      return "RI";
    case BetaTable::Cqi:
      return "CQI";
  }
  return "";
}

std::uint64_t ceilDiv(std::uint64_t numerator, std::uint64_t denominator) {
  return (numerator + denominator - 1) / denominator;
}

// 8 * beta of the field, or a failure naming it.
TxOutcome lookUpBeta(BetaTable table, std::uint32_t index, std::uint64_t& eighths) {
  const std::string name(tableName(table));
  if (index > 15) {
    return txFailure(TxStatus::UnknownBetaIndex, name + " beta-offset index " +
                                                     std::to_string(index) + " is beyond 15");
  }
  eighths = betaOffsetEighths(table, index);
  if (eighths == 0) {
    return txFailure(TxStatus::ReservedBetaIndex,
                     name + " beta-offset index " + std::to_string(index) + " is reserved");
  }
  return {};
}

// Q' of a field that has a payload: given directly, or from the formula
// ceil(numerator * beta8 / denominator8), capped at `cap` (the cap applies to the formula;
// a directly given Q' above it is refused).
TxOutcome codedSymbols(const char* name, const UciResource& resource, std::uint64_t numerator,
                       std::uint64_t beta8, std::uint64_t denominator8, std::uint64_t cap,
                       std::uint32_t& Qprime) {
  if (resource.codedSymbols) {
    if (*resource.codedSymbols == 0) {
      return txFailure(TxStatus::InvalidParameter,
                       std::string(name) + " has payload bits but Q' = 0 coded symbols");
    }
    if (*resource.codedSymbols > cap) {
      return txFailure(TxStatus::ControlTooLarge,
                       std::string(name) + " Q' = " + std::to_string(*resource.codedSymbols) +
                           " exceeds its limit of " + std::to_string(cap) + " symbols");
    }
    Qprime = *resource.codedSymbols;
    return {};
  }
  Qprime = static_cast<std::uint32_t>(std::min(ceilDiv(numerator * beta8, denominator8), cap));
  return {};
}

TxOutcome checkRanges(const PuschParameters& p) {
  auto invalid = [](std::string text) { return txFailure(TxStatus::InvalidParameter, text); };
  if (p.numPrb == 0 || p.numPrb > kMaxUplinkPrb) {
    return invalid("number of PRBs " + std::to_string(p.numPrb) + " is outside 1..110");
  }
  if (p.initialNumPrb > kMaxUplinkPrb) {
    return invalid("initial number of PRBs " + std::to_string(p.initialNumPrb) +
                   " is outside 1..110");
  }
  if (p.Qm != 2 && p.Qm != 4 && p.Qm != 6) {
    return invalid("Qm " + std::to_string(p.Qm) + " is not 2, 4 or 6");
  }
  if (p.rv > 3) {
    return invalid("redundancy version " + std::to_string(p.rv) + " is outside 0..3");
  }
  if (p.ackBits > kMaxAckRiBits || p.riBits > kMaxAckRiBits) {
    return invalid("HARQ-ACK and RI fields must have 0, 1 or 2 bits (ACK " +
                   std::to_string(p.ackBits) + ", RI " + std::to_string(p.riBits) + ")");
  }
  if (p.tbSize >= (1u << 31)) {
    return invalid("transport block size " + std::to_string(p.tbSize) + " is too large");
  }
  if (p.tbSize == 0 && p.cqiBits == 0) {
    return invalid("a PUSCH without a transport block must carry a CQI report");
  }
  const std::pair<const char*, const UciResource*> absent[] = {
      {"CQI", p.cqiBits == 0 ? &p.cqi : nullptr},
      {"HARQ-ACK", p.ackBits == 0 ? &p.ack : nullptr},
      {"RI", p.riBits == 0 ? &p.ri : nullptr}};
  for (const auto& [name, resource] : absent) {
    if (resource != nullptr && resource->codedSymbols && *resource->codedSymbols != 0) {
      return invalid(std::string(name) + " has no payload bits but Q' = " +
                     std::to_string(*resource->codedSymbols) + " coded symbols");
    }
  }
  return {};
}

}  // namespace

std::uint32_t betaOffsetEighths(BetaTable table, std::uint32_t index) {
  const std::string_view name = tableName(table);
  for (const BetaRow& row : kBetaOffsets) {
    if (row.index == index && name == row.table) {
      return row.eighths;
    }
  }
  return 0;
}

TxOutcome derivePuschControlFields(const PuschParameters& p, PuschControlFields& fields) {
  fields = PuschControlFields{};
  PuschControlFields out;
  if (TxOutcome outcome = checkRanges(p); !outcome.ok()) {
    return outcome;
  }
  out.Qm = p.Qm;
  out.qamIndex = p.Qm / 2 - 1;
  out.cpIndex = p.cp == CyclicPrefix::Normal ? 0 : 1;
  out.Msc = kSubcarriersPerPrb * p.numPrb;
  out.Cmux = dataSymbolsPerSubframe(p.cp);
  out.Rmux = out.Msc;  // R'mux = H'' / Cmux = M_sc * N_symb / Cmux
  out.tbSize = p.tbSize;
  out.rv = p.rv;
  out.cqiBits = p.cqiBits;
  out.ackBits = p.ackBits;
  out.riBits = p.riBits;
  out.contentMask = (p.tbSize > 0 ? 1u : 0u) | (p.cqiBits > 0 ? 2u : 0u) |
                    (p.ackBits > 0 ? 4u : 0u) | (p.riBits > 0 ? 8u : 0u);
  const std::uint64_t symbols = static_cast<std::uint64_t>(out.Msc) * out.Cmux;  // M_sc N_symb
  if (p.cqiBits > symbols * p.Qm) {
    return txFailure(TxStatus::ControlTooLarge,
                     "a CQI report of " + std::to_string(p.cqiBits) + " bits exceeds the " +
                         std::to_string(symbols * p.Qm) + " coded bits of the allocation");
  }
  const std::uint64_t ackRiCap = 4ull * out.Msc;
  const std::uint32_t cqiCrcBits = p.cqiBits > kCqiBlockCodeMaxBits ? kCqiCrcBits : 0;

  // Beta offsets are looked up only where a formula needs them.
  std::uint64_t betaAck = 0;
  std::uint64_t betaRi = 0;
  std::uint64_t betaCqi = 0;
  const bool formulaAck = p.ackBits > 0 && !p.ack.codedSymbols;
  const bool formulaRi = p.riBits > 0 && !p.ri.codedSymbols;
  const bool dataPresent = p.tbSize > 0;
  const bool formulaCqi = p.cqiBits > 0 && (dataPresent ? !p.cqi.codedSymbols
                                                        : formulaAck || formulaRi);
  for (auto [needed, table, index, eighths] :
       {std::tuple{formulaAck, BetaTable::Ack, p.ack.betaIndex, &betaAck},
        std::tuple{formulaRi, BetaTable::Ri, p.ri.betaIndex, &betaRi},
        std::tuple{formulaCqi, BetaTable::Cqi, p.cqi.betaIndex, &betaCqi}}) {
    if (needed) {
      if (TxOutcome outcome = lookUpBeta(table, index, *eighths); !outcome.ok()) {
        return outcome;
      }
    }
  }

  TxOutcome outcome;
  if (dataPresent) {
    // With UL-SCH data: Q' = ceil(O * M_sc-initial * N_symb-initial * beta / sum K_r).
    const CodeBlockSegmentation seg = segmentTransportBlock(p.tbSize);
    const std::uint64_t sumK = static_cast<std::uint64_t>(seg.Cplus) * seg.Kplus +
                               static_cast<std::uint64_t>(seg.Cminus) * seg.Kminus;
    const std::uint32_t initialPrb = p.initialNumPrb != 0 ? p.initialNumPrb : p.numPrb;
    const std::uint64_t initialSymbols =
        static_cast<std::uint64_t>(kSubcarriersPerPrb) * initialPrb * out.Cmux;
    if (p.ackBits > 0) {
      outcome = codedSymbols("HARQ-ACK", p.ack, p.ackBits * initialSymbols, betaAck, 8 * sumK,
                             ackRiCap, out.QprimeAck);
    }
    if (outcome.ok() && p.riBits > 0) {
      outcome = codedSymbols("RI", p.ri, p.riBits * initialSymbols, betaRi, 8 * sumK, ackRiCap,
                             out.QprimeRi);
    }
    if (outcome.ok() && p.cqiBits > 0) {
      outcome = codedSymbols("CQI", p.cqi, (p.cqiBits + cqiCrcBits) * initialSymbols, betaCqi,
                             8 * sumK, symbols - out.QprimeRi, out.QprimeCqi);
    }
    if (!outcome.ok()) {
      return outcome;
    }
    const std::uint64_t dataSymbols = symbols - out.QprimeCqi - out.QprimeRi;
    if (dataSymbols < seg.C) {
      return txFailure(TxStatus::NoRoomForData,
                       "the control information leaves " + std::to_string(dataSymbols) +
                           " data symbols for " + std::to_string(seg.C) + " code blocks");
    }
    out.G = static_cast<std::uint32_t>(dataSymbols * p.Qm);
    const std::vector<std::uint32_t> E = rateMatchedLengths(out.G, p.Qm, seg.C);
    out.C = seg.C;
    out.Eminus = E.front();
    out.Eplus = E.back();
    while (out.Eidx + 1 < seg.C && E[out.Eidx + 1] == out.Eminus) {
      ++out.Eidx;  // ends at C - gamma - 1
    }
    out.harqBufferLength = (seg.Kplus + 4) * seg.Cplus + (seg.Kminus + 4) * seg.Cminus;
  } else {
    // Control only: ACK and RI scale with beta / beta_CQI over O_CQI-MIN, and the CQI takes
    // every symbol that RI leaves.
    const std::uint64_t cqiMin = p.cqiMinBits != 0 ? p.cqiMinBits : p.cqiBits + cqiCrcBits;
    if (p.ackBits > 0) {
      outcome = codedSymbols("HARQ-ACK", p.ack, p.ackBits * symbols, betaAck, cqiMin * betaCqi,
                             ackRiCap, out.QprimeAck);
    }
    if (outcome.ok() && p.riBits > 0) {
      outcome = codedSymbols("RI", p.ri, p.riBits * symbols, betaRi, cqiMin * betaCqi, ackRiCap,
                             out.QprimeRi);
    }
    if (!outcome.ok()) {
      return outcome;
    }
    out.QprimeCqi = static_cast<std::uint32_t>(symbols - out.QprimeRi);
    if (p.cqi.codedSymbols && *p.cqi.codedSymbols != out.QprimeCqi) {
      return txFailure(TxStatus::ControlTooLarge,
                       "without a transport block the CQI takes all " +
                           std::to_string(out.QprimeCqi) + " symbols left by RI, not Q' = " +
                           std::to_string(*p.cqi.codedSymbols));
    }
  }
  out.Qcqi = p.Qm * out.QprimeCqi;
  out.Qack = p.Qm * out.QprimeAck;
  out.Qri = p.Qm * out.QprimeRi;
  out.totalBits = static_cast<std::uint32_t>(symbols * p.Qm);
  fields = out;
  return {};
}

}  // namespace brannoc::tx
