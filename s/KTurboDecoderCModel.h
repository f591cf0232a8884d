// KTurboDecoderCModel: the adapter to the turbo-decoder model library
// libIp_corvane_bitacc_cmodel (TS 36.212 clause 5.1.3.2 turbo code). It owns one model
// state, creates it again whenever one of its generics changes, and turns the three
// soft-value streams of one code block into one call of the library's simulate function.
#ifndef BRANNOC_KTURBODECODERCMODEL_H
#define BRANNOC_KTURBODECODERCMODEL_H

#include <cstdint>
#include <memory>
#include <vector>

#include "vexlon_ip_corvane_bitacc_cmodel.h"

namespace brannoc {

class KTurboDecoderCModel {
 public:
  // Takes the library's default generics and creates a model (one error line on failure).
  KTurboDecoderCModel();
  // Creates a model from the given generics (one error line on failure).
  explicit KTurboDecoderCModel(const vexlon_ip_corvane_generics& generics);
  ~KTurboDecoderCModel();

  KTurboDecoderCModel(const KTurboDecoderCModel&) = delete;
  KTurboDecoderCModel& operator=(const KTurboDecoderCModel&) = delete;
  KTurboDecoderCModel(KTurboDecoderCModel&& other) noexcept;
  KTurboDecoderCModel& operator=(KTurboDecoderCModel&& other) noexcept;

  static std::unique_ptr<KTurboDecoderCModel> create();
  static std::unique_ptr<KTurboDecoderCModel> create(const vexlon_ip_corvane_generics& generics);

  // Destroys the model (if any) and creates one from generics, which become the adapter's.
  bool createModel(const vexlon_ip_corvane_generics& generics);

  // Each sets one generics word and creates the model again; a word that already holds the
  // value, with a model made from it, leaves the model as it is (a model keeps nothing from
  // one decode to the next, so making it again would change nothing but the time taken).
  bool setNumPU(std::uint32_t numPU);         // word 4
  bool setAlgorithmType(std::uint32_t type);  // word 7
  bool setExtrinsicBits(std::uint32_t bits);  // word 8

  vexlon_ip_corvane_generics getGenerics() const { return itsGenerics; }

  // The code blocks one call of the model's batch entry point takes: the default
  // constructor's model takes up to this many.
  static constexpr std::uint32_t kBatchBlocks = 16;

  // Destroys the model; the library's result, or 0 when there was none.
  std::int32_t destroyModel();

  // Decodes one code block from its systematic, first-parity and second-parity streams
  // (K + 4 raw 8:5 soft values each) with the given number of iterations; on success out
  // holds the K decided bits. False, after one error line, with out untouched, on failure.
  bool decode(const std::vector<std::int32_t>& sys, const std::vector<std::int32_t>& p1,
              const std::vector<std::int32_t>& p2, std::vector<std::uint8_t>& out,
              std::uint32_t iterations);

  // Several code blocks of one transport block, given as their three streams (d0, d1, d2
  // each), decoded in batches of up to max_code_blocks by the model's batch entry point;
  // out[i] receives block i's bits. Every block's bits, lines and result are those decode
  // gives it alone (a batch the model refuses is decoded block by block to say so); true
  // when every block decoded.
  bool decodeBlocks(const std::vector<std::vector<std::vector<std::int32_t>>>& blocks,
                    std::vector<std::vector<std::uint8_t>>& out, std::uint32_t iterations);

 private:
  // Makes the model again from itsGenerics with word set to value, unless it already holds
  // that value and a model exists.
  bool setWord(std::uint32_t vexlon_ip_corvane_generics::*word, std::uint32_t value);

  vexlon_ip_corvane_generics itsGenerics;
  vexlon_ip_corvane_state* itsModel = nullptr;
  std::vector<std::uint8_t> itsBits;  // the batch's decisions before they are handed out
};

}  // namespace brannoc

#endif  // BRANNOC_KTURBODECODERCMODEL_H
