"""brannoc: the bit-accurate LTE uplink channel decoder model from Python.

``Decoder`` wraps one instance of the decoder library (libIp_brannoc_bitacc_cmodel) and decodes
PUSCH (``decode_sch``) and PUCCH (``decode_cch``) transmissions from numpy int32 arrays of raw
8:5 soft values (32 = 1.0, 0 or more favours bit 1). ``brannoc.tx`` makes such transmissions
with the project's transmitter and channel model. Every failure of the library raises
``BrannocError`` with the library's status code and the lines it printed.

Example::

    import brannoc
    from brannoc import tx
    sent = tx.pusch(num_prb=6, qm=2, transport_block=1000, esn0_db=4.0, seed=1)
    result = brannoc.Decoder().decode_sch(sent.llr, sent.control)
    assert result.tb_crc_error == 0 and (result.transport_block == sent.transport_block).all()
"""

from __future__ import annotations

import io
import threading
from dataclasses import astuple, dataclass
from typing import Optional, Tuple

import numpy as np

from . import _brannoc

__all__ = [
    "BrannocError",
    "sweep",
    "CchControl",
    "CchResult",
    "Decoder",
    "SchControl",
    "SchResult",
    "soft_view",
]


class BrannocError(RuntimeError):
    """A call of the decoder library failed.

    Attributes:
        code: the library's status code (for example 158 for a shared-channel call whose
            llr_size is not G + CQI + RI soft values, 600 for a control-channel decode that
            failed); 0 for an instance that could not be made.
        lines: the error lines the library printed for this call, one per line.
    """

    def __init__(self, code: int, lines: str) -> None:
        self.code = code
        self.lines = lines
        super().__init__(f"status {code}: {lines.strip()}")


@dataclass
class SchControl:
    """Control fields of a shared-channel call, named and ordered as the C record
    ``vexlon_ip_brannoc_SCH_controlData`` (see the C header for the ranges)."""

    SCH_CQI_IP_SIZE: int = 0  #: soft values carrying coded CQI
    SCH_CQI_OP_SIZE: int = 0  #: CQI bits to decode
    SCH_IP_DATA_TYPE: int = 0  #: 1 data, 2 CQI, 4 ACK, 8 RI, added together
    SCH_ACK_IP_SIZE: int = 0  #: soft values carrying coded ACK
    SCH_ACK_OP_SIZE: int = 0  #: ACK bits (0..2)
    SCH_RI_IP_SIZE: int = 0  #: soft values carrying coded RI
    SCH_RI_OP_SIZE: int = 0  #: RI bits (0..2)
    SCH_RM_E_IDX: int = 0  #: last code block of length SCH_RM_E_MINUS
    SCH_CH_INT_ROWS: int = 0  #: channel-interleaver rows
    SCH_CP: int = 0  #: 0 normal, 1 extended cyclic prefix
    SCH_RM_E_MINUS: int = 0  #: rate-matched soft values of blocks 0..SCH_RM_E_IDX
    SCH_RM_E_PLUS: int = 0  #: rate-matched soft values of the later blocks
    SCH_TBSIZE: int = 0  #: transport-block bits without CRC
    SCH_TD_ITER: int = 8  #: turbo iterations (1..15)
    SCH_QAM: int = 0  #: 0 QPSK, 1 16QAM, 2 64QAM
    SCH_USER_ID: int = 0  #: user identifier (0..65535)
    SCH_SFRM: int = 0  #: subframe (0..15)
    SCH_HARQ_SFRM: int = 0  #: subframe of the HARQ process (0..15)
    SCH_RV: int = 0  #: redundancy version (0..3)
    SCH_ND: int = 1  #: 1 new data, 0 retransmission combined with the HARQ input
    SCH_HFC: int = 0  #: one-bit flag of the control register
    SCH_TD_FLUSH: int = 0  #: turbo-decoder flush flag
    SCH_TAG: int = 0  #: copied into the result's tag


@dataclass
class CchControl:
    """Control fields of a control-channel call, as the C record
    ``vexlon_ip_brannoc_CCH_controlData``."""

    CCH_UCI_OP_SIZE: int = 0  #: CQI bits (0..13)
    CCH_CP: int = 0  #: 0 normal, 1 extended cyclic prefix
    CCH_ACK_OP_SIZE: int = 0  #: ACK bits (0..2)
    CCH_USER_ID: int = 0  #: user identifier (0..65535)
    CCH_TAG: int = 0  #: copied into the result's tag


@dataclass
class SchResult:
    """What a shared-channel call returns. Bit arrays hold one bit (0 or 1) per uint8."""

    transport_block: np.ndarray  #: decoded transport-block bits (empty without data)
    cqi: np.ndarray  #: decoded CQI bits
    ack: np.ndarray  #: decoded ACK bits
    ri: np.ndarray  #: decoded RI bits
    cw_crc_error: np.ndarray  #: per code block 1 when its CRC failed (a lone block: always 1)
    harq: Optional[np.ndarray]  #: (3, n) int32 soft values to pass back with a retransmission
    tb_crc_error: int  #: 1 when the transport-block CRC failed (0 without data)
    cqi_crc_error: int  #: 1 when the CQI CRC failed or no CQI was decoded
    ack_parity_error: int  #: 1 when a two-bit ACK failed its parity check
    ri_parity_error: int  #: 1 when a two-bit RI failed its parity check
    tag: int  #: the call's SCH_TAG


@dataclass
class CchResult:
    """What a control-channel call returns."""

    cqi: np.ndarray  #: decoded CQI bits
    ack: np.ndarray  #: decoded ACK bits
    tag: int  #: the call's CCH_TAG


def soft_view(values: np.ndarray) -> np.ndarray:
    """The soft values as the library reads them: the array itself when it already is a
    C-contiguous int32 array (no copy), else a converted copy."""
    return np.ascontiguousarray(values, dtype=np.int32)


class Decoder:
    """One instance of the decoder library.

    Args:
        num_pu: turbo-decoder processing units (1, 2, 4, 8).
        algorithm: 0 max-log-MAP, 1 max-log-MAP with extrinsic scaling, 2 log-MAP.
        interleaver_buffer_size: channel-interleaver buffer in symbols (18432 or 36864).
        num_cqi_pu: CQI decoder processing units (1..4).

    Raises:
        BrannocError: code 0 and the library's line when the generics are refused.

    One Decoder decodes on one thread at a time (calls on one Decoder from several threads
    are serialised); different Decoders decode in parallel, the GIL released meanwhile.
    """

    def __init__(
        self,
        num_pu: int = 2,
        algorithm: int = 1,
        interleaver_buffer_size: int = 36864,
        num_cqi_pu: int = 1,
    ) -> None:
        self._core = _brannoc.Decoder(num_pu, algorithm, interleaver_buffer_size, num_cqi_pu)
        if not self._core.valid:
            raise BrannocError(0, self._core.failure)
        self._lock = threading.Lock()

    def decode_sch(
        self,
        llr: np.ndarray,
        control: SchControl,
        harq: Optional[np.ndarray] = None,
    ) -> SchResult:
        """Decodes one PUSCH transmission.

        Args:
            llr: the transmission's soft values in channel order (int32; other arrays are
                converted, an int32 C-contiguous array is read in place).
            control: the control fields; with ``SCH_ND`` 0 the call combines with ``harq``.
            harq: the (3, n) soft values a previous call returned (``SchResult.harq``), for a
                retransmission; ignored for new data.

        Raises:
            BrannocError: the library's status code and lines when the call fails.
        """
        soft = soft_view(llr)
        streams: Tuple[Optional[np.ndarray], ...] = (None, None, None)
        harq_size = 0
        if harq is not None and control.SCH_ND == 0:
            harq_values = soft_view(harq)
            if harq_values.ndim != 2 or harq_values.shape[0] != 3:
                raise ValueError("harq must be a (3, n) array")
            streams = tuple(harq_values[s] for s in range(3))
            harq_size = harq_values.shape[1]
        with self._lock:
            out = self._core.decode_sch(soft, astuple(control), *streams, harq_size)
        status, lines = out[0], out[1]
        if status != 0:
            raise BrannocError(status, lines)
        data, cqi, ack, ri, cw, harq_out, tb, cqi_err, ack_err, ri_err, tag = out[2:]
        return SchResult(
            transport_block=data,
            cqi=cqi,
            ack=ack,
            ri=ri,
            cw_crc_error=cw,
            harq=harq_out if data.size > 0 else None,
            tb_crc_error=tb,
            cqi_crc_error=cqi_err,
            ack_parity_error=ack_err,
            ri_parity_error=ri_err,
            tag=tag,
        )

    def decode_cch(self, llr: np.ndarray, control: CchControl) -> CchResult:
        """Decodes one PUCCH transmission (format 2/2a/2b, or ACK alone).

        Raises:
            BrannocError: the library's status code and lines when the call fails.
        """
        with self._lock:
            status, lines, cqi, ack, tag = self._core.decode_cch(soft_view(llr), astuple(control))
        if status != 0:
            raise BrannocError(status, lines)
        return CchResult(cqi=cqi, ack=ack, tag=tag)

    def set_dump(self, key: int, channel: int, prefix: str | bytes) -> None:
        """Switches the debug dump of ``key`` (0..32) of ``channel`` (0 shared, 1 control)
        into the file ``prefix + piece + ".log"``.

        Raises:
            BrannocError: code 0 when key or channel is out of range (a file that cannot be
                opened is only reported by the library's lines, as in C).
        """
        name = prefix.encode() if isinstance(prefix, str) else bytes(prefix)
        with self._lock:
            result, lines = self._core.set_dump(key, channel, name)
        if result == 0:
            raise BrannocError(0, lines or f"no dump key {key} on channel {channel}")

def sweep(*args: str, **options: object) -> np.ndarray:
    """Runs the link-level simulation of ``brannoc sim`` and returns its table.

    Options are those of ``brannoc sim`` (``brannoc sim --help``), given as command-line
    words (``sweep("--prb", "6", "--snr", "1:3:0.5")``) or as keywords, underscores for
    dashes, lists for the comma lists that make several curves, True for a flag
    (``sweep(prb=6, snr="1:3:0.5", algorithm=[0, 1], blocks=500, seed=3)``). With ``csv``
    the same CSV file as the tool's is written. Only the counts' options and ``--csv`` take
    effect (no table is printed, no plot drawn).

    Returns:
        A numpy structured array, one row per (curve, SNR point), with the CSV's columns:
        curve, snr_db, blocks, transmissions, bler_1 .. bler_N (BLER after transmission n),
        throughput_mbps, cqi_error_rate, ack_error_rate, ri_error_rate.

    Raises:
        ValueError: options the tool refuses. RuntimeError: a run that failed.
    """
    words = list(args)
    for name, value in options.items():
        flag = "--" + name.replace("_", "-")
        if value is True:
            words.append(flag)
        elif value is not False and value is not None:
            values = value if isinstance(value, (list, tuple)) else [value]
            words += [flag, ",".join(str(v) for v in values)]
    csv = _brannoc.sweep(words)
    names = csv.split("\n", 1)[0].split(",")
    counts = ("blocks", "transmissions")
    dtype = [(n, "U128" if n == "curve" else "i8" if n in counts else "f8") for n in names]
    return np.genfromtxt(io.StringIO(csv), delimiter=",", skip_header=1, dtype=dtype,
                         encoding=None, ndmin=1)


from . import tx  # noqa: E402  (the transmitter, which uses the records above)
