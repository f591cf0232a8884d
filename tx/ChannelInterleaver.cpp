// Data and control multiplexing and channel interleaving on PUSCH (TS 36.212 5.2.2.7, 5.2.2.8).
#include "tx/ChannelInterleaver.h"

#include <cstddef>
#include <vector>

namespace brannoc::tx {

std::array<std::uint32_t, 4> riColumnSet(CyclicPrefix cp) {
  if (cp == CyclicPrefix::Normal) {
    return {1, 4, 7, 10};
  }
  return {0, 3, 5, 8};
}

std::array<std::uint32_t, 4> ackColumnSet(CyclicPrefix cp) {
  if (cp == CyclicPrefix::Normal) {
    return {2, 3, 8, 9};
  }
  return {1, 2, 6, 7};
}

MatrixCell controlSymbolCell(std::uint32_t i, std::uint32_t Rmux,
                             const std::array<std::uint32_t, 4>& columnSet) {
  return {Rmux - 1 - i / 4, columnSet[(3 * i) % 4]};
}

Bits multiplexAndInterleave(std::span<const std::uint8_t> f, std::span<const std::uint8_t> qCqi,
                            std::span<const std::uint8_t> qAck,
                            std::span<const std::uint8_t> qRi, std::uint32_t Qm,
                            CyclicPrefix cp) {
  if (Qm != 2 && Qm != 4 && Qm != 6) {
    return {};
  }
  if (f.size() % Qm != 0 || qCqi.size() % Qm != 0 || qAck.size() % Qm != 0 ||
      qRi.size() % Qm != 0) {
    return {};
  }
  const std::size_t Cmux = dataSymbolsPerSubframe(cp);
  const std::size_t Hprime = (f.size() + qCqi.size()) / Qm;  // H' = (G + Q_CQI) / Qm
  const std::size_t QprimeRi = qRi.size() / Qm;
  const std::size_t QprimeAck = qAck.size() / Qm;
  const std::size_t Hsecond = Hprime + QprimeRi;  // H'' = H' + Q'_RI
  if (Hsecond == 0 || Hsecond % Cmux != 0) {
    return {};
  }
  const std::size_t Rmux = Hsecond / Cmux;
  if (QprimeRi > 4 * Rmux || QprimeAck > 4 * Rmux) {
    return {};
  }

  // Matrix entries, row-major: the index of the entry's first bit in a source, per source.
  enum class Source : std::uint8_t { None, Multiplexed, Ri, Ack };
  struct Entry {
    Source source = Source::None;
    std::size_t first = 0;
  };
  std::vector<Entry> y(Hsecond);

  const auto riSet = riColumnSet(cp);
  for (std::size_t i = 0; i < QprimeRi; ++i) {
    const MatrixCell cell = controlSymbolCell(static_cast<std::uint32_t>(i),
                                              static_cast<std::uint32_t>(Rmux), riSet);
    y[cell.row * Cmux + cell.column] = {Source::Ri, i * Qm};
  }
  // g_k: the Q'_CQI CQI vectors, then the data vectors, into the entries RI left free.
  std::size_t k = 0;
  for (Entry& entry : y) {
    if (entry.source == Source::None) {
      entry = {Source::Multiplexed, k * Qm};
      ++k;
    }
  }
  const auto ackSet = ackColumnSet(cp);
  for (std::size_t i = 0; i < QprimeAck; ++i) {
    const MatrixCell cell = controlSymbolCell(static_cast<std::uint32_t>(i),
                                              static_cast<std::uint32_t>(Rmux), ackSet);
    y[cell.row * Cmux + cell.column] = {Source::Ack, i * Qm};
  }

  Bits h;
  h.reserve(Hsecond * Qm);
  for (std::size_t column = 0; column < Cmux; ++column) {
    for (std::size_t row = 0; row < Rmux; ++row) {
      const Entry& entry = y[row * Cmux + column];
      for (std::size_t bit = 0; bit < Qm; ++bit) {
        const std::size_t n = entry.first + bit;
        switch (entry.source) {
          case Source::Ri:
            h.push_back(qRi[n]);
            break;
          case Source::Ack:
            h.push_back(qAck[n]);
            break;
          default:
            h.push_back(n < qCqi.size() ? qCqi[n] : f[n - qCqi.size()]);
            break;
        }
      }
    }
  }
  return h;
}

}  // namespace brannoc::tx
