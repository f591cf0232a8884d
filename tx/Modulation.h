// Modulation mappers of TS 36.211 7.1 (QPSK 7.1.2, 16QAM 7.1.3, 64QAM 7.1.4, Gray-mapped,
// normalised to unit average energy) and the PUCCH format 1a/1b, 2a/2b mapping of the
// HARQ-ACK bits of TS 36.211 Table 5.4.1-1 (BPSK 0 -> 1, 1 -> -1; QPSK 00 -> 1, 01 -> -j,
// 10 -> j, 11 -> -1), with a max-log soft demapper for each.
#ifndef BRANNOC_TX_MODULATION_H
#define BRANNOC_TX_MODULATION_H

#include <cstdint>
#include <span>
#include <vector>

namespace brannoc::tx {

enum class Constellation { PucchBpsk, PucchQpsk, Qpsk, Qam16, Qam64 };

struct Symbol {
  double re = 0.0;
  double im = 0.0;
};

std::uint32_t bitsPerSymbol(Constellation constellation);

// Qm 2, 4, 6 -> QPSK, 16QAM, 64QAM; false for any other Qm.
bool constellationForQm(std::uint32_t Qm, Constellation& constellation);

// The point for the bits b(i)..b(i+Qm-1) given as an integer, b(i) the most significant bit.
Symbol constellationPoint(Constellation constellation, std::uint32_t label);

// Maps the bits, Qm per symbol; a trailing partial symbol is padded with 1 bits. Any value
// other than 0 (an "x" placeholder included) is mapped as 1, the value a scrambled "x"
// takes (TS 36.211 5.3.1).
std::vector<Symbol> modulate(std::span<const std::uint8_t> bits, Constellation constellation);

// Max-log LLRs of the Qm bits of each received symbol, for complex noise of variance N0:
// (min over points with bit 0 of |r - s|^2 - min over points with bit 1 of |r - s|^2) / N0.
// POSITIVE FAVOURS BIT 1, as the decoder reads them.
std::vector<double> demapMaxLog(std::span<const Symbol> received, Constellation constellation,
                                double N0);

}  // namespace brannoc::tx

#endif
