"""The uplink transmitter and channel model: PUSCH and PUCCH transmissions as the decoder
receives them.

Each function codes its payload as TS 36.212 does (clauses 5.2.2 and 5.2.3), maps it to
symbols, adds complex Gaussian noise at ``esn0_db`` (or none with ``esn0_db=None``: ideal
soft values of +-``ideal_amplitude``), demaps it and quantises the soft values to the 8:5
format (32 = 1.0, ``llr_scale`` times the natural-log likelihood ratio). The same seed gives
the same soft values on every build.
"""

from __future__ import annotations

from dataclasses import dataclass
from typing import Optional, Sequence, Union

import numpy as np

from . import CchControl, SchControl, _brannoc

__all__ = ["PucchTransmission", "PuschTransmission", "pucch", "pusch"]

Bits = Union[int, Sequence[int], np.ndarray]


@dataclass
class PuschTransmission:
    """One PUSCH transmission: the soft values, the control fields that decode them, and the
    payload that was sent."""

    llr: np.ndarray  #: int32 soft values in channel order
    control: SchControl  #: the decoder's control fields (SCH_ND 1; set 0 to retransmit)
    harq_length: int  #: soft values per stream of the HARQ buffers
    code_blocks: int  #: code blocks of the transport block (0 without data)
    transport_block: np.ndarray  #: the bits sent (uint8)
    cqi: np.ndarray
    ack: np.ndarray
    ri: np.ndarray


@dataclass
class PucchTransmission:
    """One PUCCH transmission."""

    llr: np.ndarray  #: int32 soft values: 20 coded bits, then separately sent ACK bits
    control: CchControl
    cqi: np.ndarray
    ack: np.ndarray


def _bits(bits: Bits, rng: np.random.Generator) -> np.ndarray:
    """An int n gives n random bits; a sequence gives those bits."""
    if isinstance(bits, (int, np.integer)):
        return rng.integers(0, 2, size=int(bits), dtype=np.uint8)
    return np.ascontiguousarray(bits, dtype=np.uint8)


def _channel(esn0_db: Optional[float], seed: int, llr_scale: float, ideal_amplitude: int):
    return (esn0_db is not None, 0.0 if esn0_db is None else float(esn0_db), seed, llr_scale,
            ideal_amplitude)


def pusch(
    num_prb: int,
    qm: int,
    transport_block: Bits = 0,
    *,
    extended_cp: bool = False,
    rv: int = 0,
    cqi: Bits = 0,
    ack: Bits = 0,
    ri: Bits = 0,
    beta_indices: Sequence[int] = (8, 6, 6),
    initial_num_prb: int = 0,
    esn0_db: Optional[float] = None,
    seed: int = 1,
    llr_scale: float = 1.0,
    ideal_amplitude: int = 64,
) -> PuschTransmission:
    """One PUSCH subframe of ``num_prb`` resource blocks with modulation order ``qm`` (2, 4,
    6) carrying a transport block and CQI, ACK and RI bits (each a bit array, or a count of
    random bits drawn from ``seed``). ``beta_indices`` are the CQI, ACK and RI offset indices
    of TS 36.213 8.6.3. Raises ValueError when the transmitter refuses the parameters."""
    rng = np.random.default_rng(seed)
    tb, cqi_bits, ack_bits, ri_bits = (_bits(b, rng) for b in (transport_block, cqi, ack, ri))
    llr, fields, harq_length, blocks = _brannoc.transmit_pusch(
        num_prb, qm, extended_cp, tb, rv, cqi_bits, ack_bits, ri_bits, tuple(beta_indices),
        initial_num_prb, *_channel(esn0_db, seed, llr_scale, ideal_amplitude))
    return PuschTransmission(llr, SchControl(*fields), harq_length, blocks, tb, cqi_bits,
                             ack_bits, ri_bits)


def pucch(
    cqi: Bits = 0,
    ack: Bits = 0,
    *,
    extended_cp: bool = False,
    esn0_db: Optional[float] = None,
    seed: int = 1,
    llr_scale: float = 1.0,
    ideal_amplitude: int = 64,
) -> PucchTransmission:
    """One PUCCH transmission: up to 13 CQI bits coded with the (20,A) code and up to two
    ACK bits (beside the codeword with normal cyclic prefix, inside it with extended), or ACK
    bits alone. Raises ValueError when the payload does not fit."""
    rng = np.random.default_rng(seed)
    cqi_bits, ack_bits = _bits(cqi, rng), _bits(ack, rng)
    llr, fields = _brannoc.transmit_pucch(cqi_bits, ack_bits, extended_cp,
                                          *_channel(esn0_db, seed, llr_scale, ideal_amplitude))
    return PucchTransmission(llr, CchControl(*fields), cqi_bits, ack_bits)
