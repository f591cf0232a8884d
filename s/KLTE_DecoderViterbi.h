// KLTE_DecoderViterbi: bit-accurate model of the hardware Viterbi decoder for the tail-biting
// convolutional code of TS 36.212 clause 5.1.3.1 (constraint length 7, rate 1/3, generators
// 133, 171, 165 octal) that carries long CQI reports on PUSCH. Offset-binary soft inputs with
// erasure flags, 64 unsigned path metrics with saturation and delayed normalisation, a fixed
// traceback window, and the hardware's bit-reversed order of scanning states. Tail-biting is
// handled by decoding a cyclically extended copy of the block from all-zero path metrics.
#ifndef BRANNOC_KLTE_DECODERVITERBI_H
#define BRANNOC_KLTE_DECODERVITERBI_H

#include <array>
#include <cstdint>
#include <ostream>
#include <vector>

namespace brannoc {

class KLTE_DecoderViterbi {
 public:
  // The six cyclically extended decoder inputs q0, q1, q2, e0, e1, e2, handed back for dumps.
  using ExtendedRxData = std::array<std::vector<std::int32_t>, 6>;

  KLTE_DecoderViterbi();

  // Accepts 6 to 128; otherwise prints a line, installs T = 48 and returns false.
  bool setTracebackLength(std::int32_t length);
  // Accepts 3 to 8; otherwise prints a line, installs 4 and returns false.
  bool setNumSoftBits(std::uint32_t bits);
  void setUseBestState(bool useBestState) { itsUseBestState = useBestState; }
  void setRandomInputDelay(bool randomInputDelay) { itsRandomInputDelay = randomInputDelay; }

  std::uint32_t getConstraintLength() const { return itsConstraintLength; }
  std::uint32_t getNumOutputs() const { return itsNumOutputs; }
  std::uint32_t getTracebackLength() const { return itsTracebackLength; }
  bool getUseBestState() const { return itsUseBestState; }
  std::uint32_t getNumSoftBits() const { return itsNumSoftBits; }
  bool getRandomInputDelay() const { return itsRandomInputDelay; }
  const std::vector<std::uint32_t>& getPathMetrics() const { return itsPathMetrics; }

  // State vectors hold K-1 register bits, element 5 the newest. The next state shifts the
  // register towards element 0 and puts the input bit in the last element.
  bool nextState(const std::vector<std::uint8_t>& currentState,
                 std::vector<std::uint8_t>& nextStateVector, std::uint8_t inputBit) const;
  // Code bit 0, 1 or 2 (streams d0, d1, d2) leaving the state with the given input bit.
  std::uint8_t encoderOutput(const std::vector<std::uint8_t>& state, std::uint8_t inputBit,
                             std::uint32_t selection) const;
  // State number S = sum of element i * 2^i.
  std::vector<std::uint8_t> stateNumberToVector(std::uint32_t state) const;
  static std::uint32_t stateVectorToNumber(const std::vector<std::uint8_t>& state);

  // Decodes the N-bit block whose offset-binary soft streams are q0, q1, q2 (0 most
  // confident 0, 2^s - 1 most confident 1) and whose erasure flags are e0, e1, e2 (odd:
  // erased). decodedBits must already hold N elements; positions from 2T - 6 onward are not
  // written. Trace streams are written only while they are good (open).
  bool decode(const std::vector<std::int32_t>& q0, const std::vector<std::int32_t>& q1,
              const std::vector<std::int32_t>& q2, const std::vector<std::int32_t>& e0,
              const std::vector<std::int32_t>& e1, const std::vector<std::int32_t>& e2,
              std::vector<std::uint8_t>& decodedBits, std::ostream& rawInputTrace,
              std::ostream& acsTrace, std::ostream& bestStateTrace, std::ostream& tracebackTrace,
              bool traceEnable, ExtendedRxData& extendedRxData);

 private:
  std::uint32_t itsConstraintLength;
  std::uint32_t itsNumOutputs;
  std::uint32_t itsTracebackLength;
  bool itsUseBestState;
  std::uint32_t itsNumSoftBits;
  bool itsRandomInputDelay;
  std::vector<std::uint32_t> itsPathMetrics;
};

}  // namespace brannoc

#endif  // BRANNOC_KLTE_DECODERVITERBI_H
