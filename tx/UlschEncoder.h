// Channel coding of the uplink shared channel data, TS 36.212 5.2.2.1 to 5.2.2.5: transport
// block CRC24A (5.1.1), code block segmentation with CRC24B and filler bits (5.1.2), turbo
// encoding (5.1.3.2), rate matching of each block to its E_r bits (5.1.4.1) and code block
// concatenation (5.1.5) into the G bits f of the data. One layer (NL = 1) unless given.
#ifndef BRANNOC_TX_ULSCHENCODER_H
#define BRANNOC_TX_ULSCHENCODER_H

#include <cstdint>
#include <span>
#include <vector>

#include "tx/Bits.h"
#include "tx/Segmentation.h"
#include "tx/TurboEncoder.h"

namespace brannoc::tx {

// The result of encoding one transport block, with every intermediate stage.
struct UlschEncoding {
  CodeBlockSegmentation segmentation;
  Bits b;                          // transport block followed by its CRC24A (B bits)
  std::vector<Bits> c;             // code blocks c_r (K_r bits, fillers kNullBit, CRC24B)
  std::vector<TurboCodeword> d;    // turbo streams of each block
  std::vector<std::uint32_t> E;    // rate-matched length E_r of each block
  std::vector<Bits> e;             // rate-matched bits e_r
  Bits f;                          // concatenation of the e_r: G bits
};

// E_r of TS 36.212 5.1.4.1.2 for the C blocks sharing G bits: G' = G/(NL Qm),
// gamma = G' mod C, E_r = NL Qm floor(G'/C) for r <= C - gamma - 1, else NL Qm ceil(G'/C).
// Empty when C, Qm or NL is 0 or G is not a multiple of NL Qm (bits would be lost).
std::vector<std::uint32_t> rateMatchedLengths(std::uint32_t G, std::uint32_t Qm, std::uint32_t C,
                                              std::uint32_t NL = 1);

// Encodes the transport block (bits 0/1, fewer than 2^31) into G bits for modulation order Qm
// and redundancy version rv (0..3). False, with out reset, on an invalid argument.
bool encodeUlsch(std::span<const std::uint8_t> transportBlock, std::uint32_t G,
                 std::uint32_t Qm, std::uint32_t rv, UlschEncoding& out);

}  // namespace brannoc::tx

#endif
