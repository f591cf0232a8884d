// Outcome of a transmitter operation that checks its parameters: a status code and one line
// of text saying what was wrong. Nothing in the transmitter throws.
#ifndef BRANNOC_TX_TXSTATUS_H
#define BRANNOC_TX_TXSTATUS_H

#include <string>
#include <utility>

namespace brannoc::tx {

enum class TxStatus {
  Ok,
  InvalidParameter,     // a value outside its range (PRBs, Qm, rv, payload sizes, settings)
  UnknownBetaIndex,     // a beta-offset index beyond its table
  ReservedBetaIndex,    // a beta-offset index the table marks reserved
  ControlTooLarge,      // coded control symbols beyond their limit or beyond the resource
  NoRoomForData,        // the control leaves fewer data symbols than code blocks
  PayloadMismatch,      // a payload whose size differs from the parameters
};

struct TxOutcome {
  TxStatus status = TxStatus::Ok;
  std::string text;  // one line, empty on success

  bool ok() const { return status == TxStatus::Ok; }
};

inline TxOutcome txFailure(TxStatus status, std::string text) {
  return {status, std::move(text)};
}

}  // namespace brannoc::tx

#endif
