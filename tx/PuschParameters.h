// Transmission parameters of one PUSCH subframe (one layer, one transport block or control
// information only) and the quantities they imply: the numbers of coded control symbols of
// TS 36.212 5.2.2.6 with the beta offsets of TS 36.213 8.6.3 (Tables 8.6.3-1/-2/-3), the
// channel interleaver size of 5.2.2.8, the data bits G, and the rate-matched lengths E_r of
// the code blocks (5.1.4.1.2).
//
// The formulas ceil(O * M_sc * N_symb * beta / K) are evaluated exactly in integers: every
// beta offset is a multiple of 1/8 and is held as 8 * beta.
#ifndef BRANNOC_TX_PUSCHPARAMETERS_H
#define BRANNOC_TX_PUSCHPARAMETERS_H

#include <cstdint>
#include <optional>

#include "tx/TxStatus.h"
#include "tx/UplinkTypes.h"

namespace brannoc::tx {

constexpr std::uint32_t kSubcarriersPerPrb = 12;
constexpr std::uint32_t kMaxUplinkPrb = 110;
constexpr std::uint32_t kMaxAckRiBits = 2;  // the HARQ-ACK and RI codes of this transmitter

enum class BetaTable { Ack, Ri, Cqi };

// 8 * beta_offset for the signalled index (TS 36.213 Tables 8.6.3-1, -2, -3), or 0 when
// the index is reserved or beyond the table.
std::uint32_t betaOffsetEighths(BetaTable table, std::uint32_t index);

// The coded symbols of one control field: from its beta-offset index, or given directly.
struct UciResource {
  std::uint32_t betaIndex = 0;                 // I_offset of the field's table
  std::optional<std::uint32_t> codedSymbols;   // Q', used instead of the beta offset
};

struct PuschParameters {
  std::uint32_t numPrb = 1;          // M_sc^PUSCH = 12 * numPrb
  std::uint32_t Qm = 2;              // 2 QPSK, 4 16QAM, 6 64QAM
  CyclicPrefix cp = CyclicPrefix::Normal;
  std::uint32_t tbSize = 0;          // transport block bits without CRC; 0: control only
  std::uint32_t rv = 0;              // redundancy version, 0..3
  std::uint32_t cqiBits = 0;         // O_CQI (CQI/PMI report)
  std::uint32_t ackBits = 0;         // 0..2
  std::uint32_t riBits = 0;          // 0..2
  UciResource cqi;
  UciResource ack;
  UciResource ri;
  // M_sc^PUSCH-initial / 12 of the initial transmission of the transport block, for the
  // control symbol formulas; 0 means numPrb. N_symb^PUSCH-initial is taken as Cmux.
  std::uint32_t initialNumPrb = 0;
  // O_CQI-MIN of a control-only transmission (CQI bits with CRC for rank 1); 0 means the
  // CQI report of this transmission, with its 8 CRC bits when it has more than 11 bits.
  std::uint32_t cqiMinBits = 0;
};

// Everything the receiver needs to know about the layout of the transmission.
struct PuschControlFields {
  std::uint32_t Qm = 0;
  std::uint32_t qamIndex = 0;      // 0 QPSK, 1 16QAM, 2 64QAM
  std::uint32_t cpIndex = 0;       // 0 normal, 1 extended
  std::uint32_t Msc = 0;           // M_sc^PUSCH
  std::uint32_t Cmux = 0;          // interleaver columns, N_symb^PUSCH
  std::uint32_t Rmux = 0;          // interleaver rows R'mux (= M_sc^PUSCH)
  std::uint32_t QprimeCqi = 0;
  std::uint32_t QprimeAck = 0;
  std::uint32_t QprimeRi = 0;
  std::uint32_t Qcqi = 0;          // Qm * Q'_CQI
  std::uint32_t Qack = 0;
  std::uint32_t Qri = 0;
  std::uint32_t G = 0;             // UL-SCH data bits: Qm * R'mux * Cmux - Q_CQI - Q_RI
  std::uint32_t totalBits = 0;     // Qm * R'mux * Cmux = G + Q_CQI + Q_RI
  std::uint32_t tbSize = 0;
  std::uint32_t rv = 0;
  std::uint32_t C = 0;             // code blocks (0 without a transport block)
  std::uint32_t Eminus = 0;        // E_r of blocks 0..Eidx
  std::uint32_t Eplus = 0;         // E_r of blocks Eidx+1..C-1
  std::uint32_t Eidx = 0;          // C - gamma - 1: the last block of length Eminus
  std::uint32_t harqBufferLength = 0;  // sum over the code blocks of K_r + 4
  std::uint32_t cqiBits = 0;
  std::uint32_t ackBits = 0;
  std::uint32_t riBits = 0;
  std::uint32_t contentMask = 0;   // 1 data, 2 CQI, 4 HARQ-ACK, 8 RI, added together
};

// Derives the control fields. On failure `fields` is reset and the outcome says why.
TxOutcome derivePuschControlFields(const PuschParameters& params, PuschControlFields& fields);

}  // namespace brannoc::tx

#endif
