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

  // Each sets one generics word and creates the model again.
  bool setNumPU(std::uint32_t numPU);         // word 4
  bool setAlgorithmType(std::uint32_t type);  // word 7
  bool setExtrinsicBits(std::uint32_t bits);  // word 8

  vexlon_ip_corvane_generics getGenerics() const { return itsGenerics; }

  // Destroys the model; the library's result, or 0 when there was none.
  std::int32_t destroyModel();

  // Decodes one code block from its systematic, first-parity and second-parity streams
  // (K + 4 raw 8:5 soft values each) with the given number of iterations; on success out
  // holds the K decided bits. False, after one error line, with out untouched, on failure.
  bool decode(const std::vector<std::int32_t>& sys, const std::vector<std::int32_t>& p1,
              const std::vector<std::int32_t>& p2, std::vector<std::uint8_t>& out,
              std::uint32_t iterations);

 private:
  vexlon_ip_corvane_generics itsGenerics;
  vexlon_ip_corvane_state* itsModel = nullptr;
};

}  // namespace brannoc

#endif  // BRANNOC_KTURBODECODERCMODEL_H
