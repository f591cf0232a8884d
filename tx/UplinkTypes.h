// Small shared vocabulary of the uplink transmitter: the cyclic prefix, the number of
// SC-FDMA data symbols it leaves in a subframe (N_symb^PUSCH = 2 * (N_symb^UL - 1) with no
// sounding reference symbol, TS 36.211 5.5.2 and TS 36.212 5.2.2.6), and the marker of an
// "x" placeholder of TS 36.212 5.2.2.6.
#ifndef BRANNOC_TX_UPLINKTYPES_H
#define BRANNOC_TX_UPLINKTYPES_H

#include <cstdint>

namespace brannoc::tx {

enum class CyclicPrefix { Normal, Extended };

// Columns of the channel interleaver, Cmux = N_symb^PUSCH: 12 normal, 10 extended.
constexpr std::uint32_t dataSymbolsPerSubframe(CyclicPrefix cp) {
  return cp == CyclicPrefix::Normal ? 12u : 10u;
}

// An "x" placeholder of the ACK and RI encodings. 36.211 5.3.1 sets its scrambled value to
// 1, which puts the modulation symbol on the outermost constellation points; to a receiver
// that descrambles it carries no information. The modulator maps it as a 1 and the soft
// demapper gives it a zero LLR. (A "y" placeholder, which repeats the scrambled bit before
// it, is written as that bit: a descrambling receiver sees the bit it repeats.)
constexpr std::uint8_t kPlaceholderBit = 3;

}  // namespace brannoc::tx

#endif
