// _brannoc: the compiled part of the Python package brannoc. It wraps the exported C
// functions of the decoder library (one instance per Decoder object) and the transmitter
// library, moving soft values between numpy arrays and the C records without copying where a
// view serves. The Python layer (brannoc/__init__.py) gives the public names, dataclasses and
// documentation.
//
// Error lines: the library writes each failure as one line on std::cerr. The module puts a
// stream buffer in front of std::cerr that passes every write on and, on a thread that is
// inside a decode call, also keeps a copy, so that a failed call's exception carries the
// lines it printed while other threads' lines stay apart.
#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>
#include <pybind11/stl.h>

#include <array>
#include <cstdint>
#include <iostream>
#include <optional>
#include <streambuf>
#include <string>
#include <tuple>
#include <vector>

#ifdef BRANNOC_PYTHON_SWEEP
#include "SimOptions.h"
#include "sim/Report.h"
#include "vectors/VectorFile.h"
#endif
#include "tx/PucchTransmitter.h"
#include "tx/PuschTransmitter.h"
#include "tx/Segmentation.h"
#include "vexlon_ip_brannoc_bitacc_cmodel.h"

namespace py = pybind11;

namespace {

using Int32Array = py::array_t<std::int32_t, py::array::c_style>;
using ByteArray = py::array_t<std::uint8_t, py::array::c_style>;

// Tees std::cerr into the calling thread's capture string while one is set.
class CaptureBuffer : public std::streambuf {
 public:
  explicit CaptureBuffer(std::streambuf* through) : itsThrough(through) {}
  static thread_local std::string* capture;

 protected:
  int_type overflow(int_type c) override {
    if (traits_type::eq_int_type(c, traits_type::eof())) {
      return traits_type::not_eof(c);
    }
    const char ch = traits_type::to_char_type(c);
    return xsputn(&ch, 1) == 1 ? c : traits_type::eof();
  }
  std::streamsize xsputn(const char* s, std::streamsize n) override {
    if (capture != nullptr) {
      capture->append(s, static_cast<std::size_t>(n));
    }
    return itsThrough->sputn(s, n);
  }
  int sync() override { return itsThrough->pubsync(); }

 private:
  std::streambuf* itsThrough;
};

thread_local std::string* CaptureBuffer::capture = nullptr;

// While alive, the lines this thread writes to std::cerr are also kept in lines.
class CaptureLines {
 public:
  explicit CaptureLines(std::string& lines) { CaptureBuffer::capture = &lines; }
  ~CaptureLines() { CaptureBuffer::capture = nullptr; }
  CaptureLines(const CaptureLines&) = delete;
  CaptureLines& operator=(const CaptureLines&) = delete;
};

std::array<std::uint32_t, 23> schFields(const vexlon_ip_brannoc_SCH_controlData& c) {
  std::array<std::uint32_t, 23> fields{};
  const std::uint32_t* first = &c.SCH_CQI_IP_SIZE;
  std::copy(first, first + 23, fields.begin());
  return fields;
}

vexlon_ip_brannoc_SCH_controlData schControl(const std::array<std::uint32_t, 23>& fields) {
  vexlon_ip_brannoc_SCH_controlData c{};
  std::copy(fields.begin(), fields.end(), &c.SCH_CQI_IP_SIZE);
  return c;
}

// The HARQ length of a transport block: K_r + 4 summed over its code blocks (0 without
// one), so that the output arrays are exactly as long as the call fills them.
std::uint32_t harqCapacity(std::uint32_t tbSize) {
  if (tbSize == 0 || tbSize > 262143) {
    return 0;
  }
  const brannoc::tx::CodeBlockSegmentation seg = brannoc::tx::segmentTransportBlock(tbSize);
  return (seg.Kplus + 4) * seg.Cplus + (seg.Kminus + 4) * seg.Cminus;
}

const std::int32_t* softPointer(const std::optional<Int32Array>& array) {
  return array ? array->data() : nullptr;
}

class Decoder {
 public:
  Decoder(std::uint32_t numPU, std::uint32_t algorithm, std::uint32_t interleaverBufferSize,
          std::uint32_t numCqiPU) {
    const vexlon_ip_brannoc_generics generics{numPU, algorithm, interleaverBufferSize, numCqiPU};
    std::string lines;
    {
      CaptureLines capture(lines);
      itsState = vexlon_ip_brannoc_create_state(generics);
    }
    if (itsState == nullptr) {
      itsFailure = lines;
    }
  }
  ~Decoder() { vexlon_ip_brannoc_destroy_state(itsState); }
  Decoder(const Decoder&) = delete;
  Decoder& operator=(const Decoder&) = delete;

  bool valid() const { return itsState != nullptr; }
  const std::string& failure() const { return itsFailure; }

  // (status, lines, outputs...) of one shared-channel call. The soft-value arrays are the
  // caller's int32 C-contiguous arrays themselves (the Python layer converts others).
  py::tuple decodeSch(const Int32Array& llr, const std::array<std::uint32_t, 23>& fields,
                      const std::optional<Int32Array>& sys, const std::optional<Int32Array>& p0,
                      const std::optional<Int32Array>& p1, std::uint32_t harqSize) {
    const vexlon_ip_brannoc_SCH_controlData control = schControl(fields);
    const vexlon_ip_brannoc_SCH_inputs inputs{
        llr.size() == 0 ? nullptr : llr.data(), softPointer(sys), softPointer(p0), softPointer(p1),
        static_cast<std::uint32_t>(llr.size()), harqSize,         control};
    const std::uint32_t harq = std::max<std::uint32_t>(harqCapacity(control.SCH_TBSIZE), 1);
    ByteArray data(std::max<std::uint32_t>(control.SCH_TBSIZE, 1));
    ByteArray ack(std::max<std::uint32_t>(control.SCH_ACK_OP_SIZE, 1));
    ByteArray ri(std::max<std::uint32_t>(control.SCH_RI_OP_SIZE, 1));
    ByteArray cqi(std::max<std::uint32_t>(control.SCH_CQI_OP_SIZE, 1));
    ByteArray cw(64);
    Int32Array harqOut(std::vector<py::ssize_t>{3, static_cast<py::ssize_t>(harq)});
    vexlon_ip_brannoc_SCH_outputs outputs{};
    outputs.SCH_data_out = data.mutable_data();
    outputs.SCH_ACK_out = ack.mutable_data();
    outputs.SCH_RI_out = ri.mutable_data();
    outputs.SCH_CQI_out = cqi.mutable_data();
    outputs.CW_CRC_out = cw.mutable_data();
    outputs.sys_harq_buffer = harqOut.mutable_data(0, 0);
    outputs.p0_harq_buffer = harqOut.mutable_data(1, 0);
    outputs.p1_harq_buffer = harqOut.mutable_data(2, 0);
    outputs.max_harq_buffer_size = harq;
    outputs.max_SCH_data_out_size = static_cast<std::uint32_t>(data.size());
    outputs.max_SCH_ACK_out_size = static_cast<std::uint32_t>(ack.size());
    outputs.max_SCH_RI_out_size = static_cast<std::uint32_t>(ri.size());
    outputs.max_SCH_CQI_out_size = static_cast<std::uint32_t>(cqi.size());
    outputs.max_CW_CRC_out_size = static_cast<std::uint32_t>(cw.size());
    std::string lines;
    std::int32_t status = 0;
    {
      py::gil_scoped_release release;
      CaptureLines capture(lines);
      status = vexlon_ip_brannoc_SCH_bitacc_simulate(itsState, inputs, &outputs);
    }
    const py::slice harqUsed(0, outputs.harq_buffer_out_size, 1);
    return py::make_tuple(
        status, lines, data[py::slice(0, outputs.SCH_data_out_size, 1)],
        cqi[py::slice(0, outputs.SCH_CQI_out_size, 1)],
        ack[py::slice(0, outputs.SCH_ACK_out_size, 1)],
        ri[py::slice(0, outputs.SCH_RI_out_size, 1)], cw[py::slice(0, outputs.CW_CRC_out_size, 1)],
        harqOut[py::make_tuple(py::slice(0, 3, 1), harqUsed)], outputs.SCH_TB_crc_error,
        outputs.SCH_CQI_crc_error, outputs.SCH_ACK_parity_error, outputs.SCH_RI_parity_error,
        outputs.SCH_TAG_out);
  }

  // (status, lines, cqi, ack, tag) of one control-channel call.
  py::tuple decodeCch(const Int32Array& llr, const std::array<std::uint32_t, 5>& fields) {
    vexlon_ip_brannoc_CCH_controlData control{};
    std::copy(fields.begin(), fields.end(), &control.CCH_UCI_OP_SIZE);
    const vexlon_ip_brannoc_CCH_inputs inputs{llr.size() == 0 ? nullptr : llr.data(),
                                              static_cast<std::uint32_t>(llr.size()), control};
    ByteArray cqi(16);
    ByteArray ack(4);
    vexlon_ip_brannoc_CCH_outputs outputs{cqi.mutable_data(), ack.mutable_data(), 16, 4, 0, 0, 0};
    std::string lines;
    std::int32_t status = 0;
    {
      py::gil_scoped_release release;
      CaptureLines capture(lines);
      status = vexlon_ip_brannoc_CCH_bitacc_simulate(itsState, inputs, &outputs);
    }
    return py::make_tuple(status, lines, cqi[py::slice(0, outputs.CCH_data_out_size, 1)],
                          ack[py::slice(0, outputs.CCH_ACK_out_size, 1)], outputs.CCH_TAG_out);
  }

  // (result, lines) of the dump switch.
  py::tuple setDump(std::uint32_t key, std::uint32_t channel, const py::bytes& prefix) {
    const std::string name = prefix;
    std::string lines;
    std::uint32_t result = 0;
    {
      CaptureLines capture(lines);
      result = IUO_set_debugfn_state(itsState, key, channel, name.data(),
                                     static_cast<std::uint32_t>(name.size()));
    }
    return py::make_tuple(result, lines);
  }

 private:
  vexlon_ip_brannoc_state* itsState = nullptr;
  std::string itsFailure;
};

namespace tx = brannoc::tx;

tx::ChannelSettings channelSettings(bool awgn, double esN0Db, std::uint64_t seed, double llrScale,
                                    std::int32_t idealAmplitude) {
  tx::ChannelSettings channel;
  channel.mode = awgn ? tx::ChannelMode::Awgn : tx::ChannelMode::Ideal;
  channel.esN0Db = esN0Db;
  channel.seed = seed;
  channel.llrScale = llrScale;
  channel.idealAmplitude = idealAmplitude;
  return channel;
}

tx::Bits toBits(const ByteArray& bits) { return tx::Bits(bits.data(), bits.data() + bits.size()); }

// (soft values, the 23 control fields, HARQ length, code blocks) of one PUSCH transmission;
// raises ValueError with the transmitter's reason when it refuses.
py::tuple transmitPusch(std::uint32_t numPrb, std::uint32_t Qm, bool extended,
                        const ByteArray& transportBlock, std::uint32_t rv, const ByteArray& cqi,
                        const ByteArray& ack, const ByteArray& ri,
                        const std::array<std::uint32_t, 3>& betaIndices,
                        std::uint32_t initialNumPrb, bool awgn, double esN0Db, std::uint64_t seed,
                        double llrScale, std::int32_t idealAmplitude) {
  tx::PuschParameters p;
  p.numPrb = numPrb;
  p.Qm = Qm;
  p.cp = extended ? tx::CyclicPrefix::Extended : tx::CyclicPrefix::Normal;
  p.tbSize = static_cast<std::uint32_t>(transportBlock.size());
  p.rv = rv;
  p.cqiBits = static_cast<std::uint32_t>(cqi.size());
  p.ackBits = static_cast<std::uint32_t>(ack.size());
  p.riBits = static_cast<std::uint32_t>(ri.size());
  p.cqi.betaIndex = betaIndices[0];
  p.ack.betaIndex = betaIndices[1];
  p.ri.betaIndex = betaIndices[2];
  p.initialNumPrb = initialNumPrb;
  const tx::PuschPayload payload{toBits(transportBlock), toBits(cqi), toBits(ack), toBits(ri)};
  tx::PuschTransmission sent;
  tx::TxOutcome outcome;
  {
    py::gil_scoped_release release;
    outcome = tx::transmitPusch(
        p, payload, channelSettings(awgn, esN0Db, seed, llrScale, idealAmplitude), sent);
  }
  if (!outcome.ok()) {
    throw py::value_error(outcome.text);
  }
  const tx::PuschControlFields& f = sent.fields;
  vexlon_ip_brannoc_SCH_controlData c{};
  c.SCH_CQI_IP_SIZE = f.Qcqi;
  c.SCH_CQI_OP_SIZE = f.cqiBits;
  c.SCH_IP_DATA_TYPE = f.contentMask;
  c.SCH_ACK_IP_SIZE = f.Qack;
  c.SCH_ACK_OP_SIZE = f.ackBits;
  c.SCH_RI_IP_SIZE = f.Qri;
  c.SCH_RI_OP_SIZE = f.riBits;
  c.SCH_RM_E_IDX = f.Eidx;
  c.SCH_CH_INT_ROWS = f.Rmux;
  c.SCH_CP = f.cpIndex;
  c.SCH_RM_E_MINUS = f.Eminus;
  c.SCH_RM_E_PLUS = f.Eplus;
  c.SCH_TBSIZE = f.tbSize;
  c.SCH_TD_ITER = 8;
  c.SCH_QAM = f.qamIndex;
  c.SCH_RV = f.rv;
  c.SCH_ND = 1;
  Int32Array soft(static_cast<py::ssize_t>(sent.softValues.size()));
  std::copy(sent.softValues.begin(), sent.softValues.end(), soft.mutable_data());
  return py::make_tuple(soft, schFields(c), f.harqBufferLength, f.C);
}

// (soft values, the 5 control fields) of one PUCCH transmission.
py::tuple transmitPucch(const ByteArray& cqi, const ByteArray& ack, bool extended, bool awgn,
                        double esN0Db, std::uint64_t seed, double llrScale,
                        std::int32_t idealAmplitude) {
  tx::PucchTransmission sent;
  const tx::TxOutcome outcome = tx::transmitPucch(
      toBits(cqi), toBits(ack), extended ? tx::CyclicPrefix::Extended : tx::CyclicPrefix::Normal,
      channelSettings(awgn, esN0Db, seed, llrScale, idealAmplitude), sent);
  if (!outcome.ok()) {
    throw py::value_error(outcome.text);
  }
  Int32Array soft(static_cast<py::ssize_t>(sent.softValues.size()));
  std::copy(sent.softValues.begin(), sent.softValues.end(), soft.mutable_data());
  const std::array<std::uint32_t, 5> fields{static_cast<std::uint32_t>(cqi.size()),
                                            extended ? 1U : 0U,
                                            static_cast<std::uint32_t>(ack.size()), 0, 0};
  return py::make_tuple(soft, fields);
}

#ifdef BRANNOC_PYTHON_SWEEP
// The simulation of `brannoc sim` with these command-line options (sweep, links, seed,
// threads; the output options as the tool takes them): the CSV text of its counts, written to
// the --csv file when one is given. Raises ValueError for options the tool refuses and
// RuntimeError for a failed run.
std::string sweep(const std::vector<std::string>& args) {
  brannoc::tool::SimOptions options;
  CLI::App app{"sweep"};
  brannoc::tool::addSimOptions(app, options);
  std::vector<std::string> reversed(args.rbegin(), args.rend());
  try {
    app.parse(reversed);
  } catch (const CLI::ParseError& e) {
    throw py::value_error(e.what());
  }
  brannoc::sim::SweepConfig config;
  std::string error;
  if (!brannoc::tool::sweepConfig(options, config, error)) {
    throw py::value_error(error);
  }
  brannoc::sim::SweepResult result;
  {
    py::gil_scoped_release release;
    result = brannoc::sim::runSweep(config);
  }
  if (!result.error.empty()) {
    throw std::runtime_error(result.error);
  }
  const std::string csv = brannoc::sim::formatCsv(config, result);
  if (!options.csv.empty()) {
    if (const std::string problem = brannoc::vectors::writeTextFile(options.csv, csv);
        !problem.empty()) {
      throw std::runtime_error(problem);
    }
  }
  return csv;
}
#endif

}  // namespace

PYBIND11_MODULE(_brannoc, m) {
  m.doc() = "Compiled core of the brannoc package; use the names of brannoc instead.";
  static CaptureBuffer buffer(std::cerr.rdbuf());
  std::cerr.rdbuf(&buffer);

  py::class_<Decoder>(m, "Decoder")
      .def(py::init<std::uint32_t, std::uint32_t, std::uint32_t, std::uint32_t>())
      .def_property_readonly("valid", &Decoder::valid)
      .def_property_readonly("failure", &Decoder::failure)
      .def("decode_sch", &Decoder::decodeSch, py::arg("llr").noconvert(), py::arg("fields"),
           py::arg("sys"), py::arg("p0"), py::arg("p1"), py::arg("harq_size"))
      .def("decode_cch", &Decoder::decodeCch, py::arg("llr").noconvert(), py::arg("fields"))
      .def("set_dump", &Decoder::setDump);
  m.def("transmit_pusch", &transmitPusch);
  m.def("transmit_pucch", &transmitPucch);
#ifdef BRANNOC_PYTHON_SWEEP
  m.def("sweep", &sweep);
#endif
}
