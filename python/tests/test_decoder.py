"""The Python package: round trips of every kind of transmission, HARQ combining, the
error paths, soft values read in place, equality with the C interface called directly, and
decoders in parallel threads."""

import ctypes
import os
import re
import subprocess
import threading
import tracemalloc
from pathlib import Path

import numpy as np
import pytest

import brannoc
from brannoc import tx


def same(a, b):
    return np.array_equal(np.asarray(a, dtype=np.uint8), np.asarray(b, dtype=np.uint8))


@pytest.mark.parametrize(
    "kwargs",
    [
        dict(num_prb=6, qm=2, transport_block=1000),
        dict(num_prb=25, qm=4, transport_block=4000, extended_cp=True, rv=2, cqi=11, ack=2, ri=1),
        dict(num_prb=25, qm=6, transport_block=9000, cqi=40, ack=1, ri=2),
        dict(num_prb=2, qm=2, cqi=30, ack=2),
    ],
)
def test_pusch_round_trip(kwargs):
    sent = tx.pusch(**kwargs, seed=3)
    result = brannoc.Decoder().decode_sch(sent.llr, sent.control)
    for name in ("transport_block", "cqi", "ack", "ri"):
        assert same(getattr(result, name), getattr(sent, name)), name
    assert result.tb_crc_error == 0 and result.ack_parity_error == 0
    assert result.ri_parity_error == 0
    assert (result.harq is None) == (sent.transport_block.size == 0)


@pytest.mark.parametrize(
    "cqi, ack, extended", [(13, 2, False), (11, 2, True), (4, 0, True), (0, 2, False)]
)
def test_pucch_round_trip(cqi, ack, extended):
    sent = tx.pucch(cqi=cqi, ack=ack, extended_cp=extended, seed=5)
    result = brannoc.Decoder().decode_cch(sent.llr, sent.control)
    assert same(result.cqi, sent.cqi) and same(result.ack, sent.ack)


def test_retransmission_combines_with_the_harq_buffers():
    decoder = brannoc.Decoder()
    bits = np.random.default_rng(7).integers(0, 2, 2000, dtype=np.uint8)
    first = tx.pusch(num_prb=12, qm=2, transport_block=bits, esn0_db=-1.0, seed=77)
    result = decoder.decode_sch(first.llr, first.control)
    assert result.tb_crc_error == 1
    second = tx.pusch(num_prb=12, qm=2, transport_block=bits, rv=2, esn0_db=-1.0, seed=78)
    second.control.SCH_ND = 0
    combined = decoder.decode_sch(second.llr, second.control, harq=result.harq)
    assert combined.tb_crc_error == 0 and same(combined.transport_block, bits)


def test_every_error_path_raises_with_its_code_and_line():
    with pytest.raises(brannoc.BrannocError) as refused:
        brannoc.Decoder(num_pu=3)
    assert refused.value.code == 0 and "C_NUM_PU must be 1, 2, 4 or 8." in refused.value.lines
    decoder = brannoc.Decoder()
    sent = tx.pusch(num_prb=6, qm=2, transport_block=1000)
    sent.control.SCH_TD_ITER = 16
    with pytest.raises(brannoc.BrannocError) as sch:
        decoder.decode_sch(sent.llr, sent.control)
    assert sch.value.code == 127
    assert re.fullmatch(r"File: \.\./s/brannoc_bitacc_cmodel\.cpp\(\d+\)ERROR:decoder:Simulate "
                        r"called with inputs\.controlData\.SCH_TD_ITER>15\n", sch.value.lines)
    pucch = tx.pucch(cqi=4, ack=1)
    with pytest.raises(brannoc.BrannocError) as cch:
        decoder.decode_cch(pucch.llr[:-1], pucch.control)
    assert cch.value.code == 600 and "INCORRECT TB SIZE. size=20" in cch.value.lines
    with pytest.raises(brannoc.BrannocError) as dump:
        decoder.set_dump(33, 0, "x_")
    assert dump.value.code == 0
    sent.control.SCH_ND = 0
    with pytest.raises(ValueError):
        decoder.decode_sch(sent.llr, sent.control, harq=np.zeros((2, 5), dtype=np.int32))
    with pytest.raises(ValueError):
        tx.pucch(cqi=14)


def test_dump_files_are_written(tmp_path):
    decoder = brannoc.Decoder()
    decoder.set_dump(28, 1, str(tmp_path / "CCH_"))
    sent = tx.pucch(cqi=4, ack=1)
    decoder.decode_cch(sent.llr, sent.control)
    del decoder
    assert (tmp_path / "CCH_Ctrl_Out.log").read_text().startswith("[CTRL]\n[ length: 1]\nW 0x00002234")


def test_soft_values_are_read_in_place():
    sent = tx.pusch(num_prb=100, qm=6, transport_block=40000)
    assert brannoc.soft_view(sent.llr) is sent.llr
    decoder = brannoc.Decoder()
    decoder.decode_sch(sent.llr, sent.control)  # the instance's own buffers exist from now on
    tracemalloc.start()
    result = decoder.decode_sch(sent.llr, sent.control)
    peak = tracemalloc.get_traced_memory()[1]
    tracemalloc.stop()
    # The result arrays are allocated; a copy of the 86400 soft values would add 345 KB.
    outputs = 3 * (40000 + 24 + 44 * 28 + 64) * 4 + 40000 + 1024
    assert result.tb_crc_error == 0
    assert peak < outputs + sent.llr.nbytes // 4, peak


class CInterface:
    """The decoder library called through its C interface with ctypes: one instance."""

    def __init__(self):
        self.lib = lib = ctypes.CDLL(os.environ["BRANNOC_C_LIBRARY"])
        u32 = ctypes.c_uint32
        self.i32p, self.u8p = ctypes.POINTER(ctypes.c_int32), ctypes.POINTER(ctypes.c_uint8)
        i32p, u8p = self.i32p, self.u8p

        class Generics(ctypes.Structure):
            _fields_ = [(n, u32) for n in ("pu", "alg", "buffer", "cqi_pu")]

        class Control(ctypes.Structure):
            _fields_ = [(name, u32) for name in brannoc.SchControl.__dataclass_fields__]

        class Inputs(ctypes.Structure):
            _fields_ = [("llr", i32p), ("sys", i32p), ("p0", i32p), ("p1", i32p),
                        ("llr_size", u32), ("harq_size", u32), ("control", Control)]

        class Outputs(ctypes.Structure):
            _fields_ = [("data", u8p), ("ack", u8p), ("ri", u8p), ("cqi", u8p), ("sys", i32p),
                        ("p0", i32p), ("p1", i32p), ("tb_err", ctypes.c_uint8), ("cw", u8p),
                        ("cqi_err", ctypes.c_uint8), ("ack_err", ctypes.c_uint8),
                        ("ri_err", ctypes.c_uint8)] + [(n, u32) for n in (
                            "max_harq", "max_data", "max_ack", "max_ri", "max_cqi", "max_cw",
                            "harq_size", "data_size", "ack_size", "ri_size", "cqi_size",
                            "cw_size", "tag")]

        self.Control, self.Inputs, self.Outputs = Control, Inputs, Outputs
        lib.vexlon_ip_brannoc_get_default_generics.restype = Generics
        lib.vexlon_ip_brannoc_create_state.restype = ctypes.c_void_p
        lib.vexlon_ip_brannoc_create_state.argtypes = [Generics]
        lib.vexlon_ip_brannoc_SCH_bitacc_simulate.argtypes = [ctypes.c_void_p, Inputs,
                                                               ctypes.POINTER(Outputs)]
        lib.vexlon_ip_brannoc_destroy_state.argtypes = [ctypes.c_void_p]
        self.state = lib.vexlon_ip_brannoc_create_state(lib.vexlon_ip_brannoc_get_default_generics())

    def __del__(self):
        self.lib.vexlon_ip_brannoc_destroy_state(self.state)

    def decode(self, sent):
        """Data bits, HARQ buffers and transport-block flag of one new transmission."""
        c = sent.control
        data = np.zeros(c.SCH_TBSIZE, np.uint8)
        small = [np.zeros(64, np.uint8) for _ in range(4)]
        harq = np.zeros((3, sent.harq_length), np.int32)

        def ptr(a, t):
            return a.ctypes.data_as(t)

        i32p, u8p = self.i32p, self.u8p
        inputs = self.Inputs(ptr(sent.llr, i32p), None, None, None, sent.llr.size, 0,
                             self.Control(*[getattr(c, name) for name, _ in self.Control._fields_]))
        outputs = self.Outputs(ptr(data, u8p), ptr(small[0], u8p), ptr(small[1], u8p),
                               ptr(small[2], u8p), ptr(harq[0], i32p), ptr(harq[1], i32p),
                               ptr(harq[2], i32p), 0, ptr(small[3], u8p), 0, 0, 0,
                               sent.harq_length, c.SCH_TBSIZE, 64, 64, 64, 64)
        status = self.lib.vexlon_ip_brannoc_SCH_bitacc_simulate(self.state, inputs,
                                                                ctypes.byref(outputs))
        assert status == 0
        return data, harq, outputs.tb_err


def test_results_equal_the_c_interface_bit_for_bit():
    sent = tx.pusch(num_prb=20, qm=4, transport_block=8000, esn0_db=5.5, seed=9)
    data, harq, tb_err = CInterface().decode(sent)
    result = brannoc.Decoder().decode_sch(sent.llr, sent.control)
    assert same(result.transport_block, data) and np.array_equal(result.harq, harq)
    assert result.tb_crc_error == tb_err


def test_decoders_in_two_threads_give_the_serial_results():
    sends = [tx.pusch(num_prb=10, qm=4, transport_block=3000, esn0_db=3.5, seed=s) for s in range(6)]
    serial = [brannoc.Decoder().decode_sch(s.llr, s.control) for s in sends]
    parallel = [None] * len(sends)

    def work(first):
        decoder = brannoc.Decoder()
        for n in range(first, len(sends), 2):
            parallel[n] = decoder.decode_sch(sends[n].llr, sends[n].control)

    threads = [threading.Thread(target=work, args=(k,)) for k in (0, 1)]
    for t in threads:
        t.start()
    for t in threads:
        t.join()
    for a, b in zip(serial, parallel):
        assert same(a.transport_block, b.transport_block) and np.array_equal(a.harq, b.harq)


def test_readme_example_runs_as_written():
    readme = Path(os.environ.get("BRANNOC_README", Path(__file__).parents[2] / "README.md"))
    blocks = re.findall(r"```python\n(.*?)```", readme.read_text(), re.S)
    assert blocks, "the README has no Python example"
    exec(compile(blocks[0], "README.md", "exec"), {})


def test_sweep_gives_the_tools_table_and_csv(tmp_path):
    csv = tmp_path / "py.csv"
    table = brannoc.sweep(prb=6, snr="1:3:1", blocks=120, errors=0, seed=3, csv=str(csv))
    assert table["blocks"].tolist() == [120, 120, 120]
    assert table["bler_1"][0] > 0.5 > table["bler_1"][-1]
    tool = Path(os.environ["BRANNOC_TOOL"])
    subprocess.run([str(tool), "sim", "--prb", "6", "--snr", "1:3:1", "--blocks", "120",
                    "--errors", "0", "--seed", "3", "--quiet", "--csv", str(tmp_path / "tool.csv")],
                   check=True, stdout=subprocess.DEVNULL)
    assert csv.read_text() == (tmp_path / "tool.csv").read_text()
    with pytest.raises(ValueError):
        brannoc.sweep(prb=0)
