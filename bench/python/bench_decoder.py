"""Cost of the Python package against the C interface, and two Python threads against one.

Decodes the benchmark transmission of the shared-channel call (64QAM, 100 PRBs, normal
cyclic prefix, the 75376-bit transport block, 8 iterations) through brannoc.Decoder and
through the C interface called with ctypes, alternately, and prints the time per call of
each and their ratio; then runs 2 N calls in one thread and N calls in each of two threads
with their own decoders and prints the speed-up.

Usage (from a build): PYTHONPATH=build/release/python \
    BRANNOC_C_LIBRARY=build/release/s/libIp_brannoc_bitacc_cmodel.so \
    python3 bench/python/bench_decoder.py [calls]
"""

import os
import sys
import threading
import time
from pathlib import Path

sys.path.insert(0, str(Path(__file__).resolve().parents[2] / "python" / "tests"))

import brannoc  # noqa: E402
from brannoc import tx  # noqa: E402
from test_decoder import CInterface  # noqa: E402  (the ctypes calls of the tests)


def main() -> None:
    calls = int(sys.argv[1]) if len(sys.argv) > 1 else 200
    sent = tx.pusch(num_prb=100, qm=6, transport_block=75376, esn0_db=20.0, seed=1)
    decoder = brannoc.Decoder()
    c_interface = CInterface()
    decoder.decode_sch(sent.llr, sent.control)
    c_interface.decode(sent)
    python_time = c_time = 0.0
    for _ in range(calls):
        start = time.perf_counter()
        decoder.decode_sch(sent.llr, sent.control)
        python_time += time.perf_counter() - start
        start = time.perf_counter()
        c_interface.decode(sent)
        c_time += time.perf_counter() - start
    print(f"per call: Python {1e3 * python_time / calls:.3f} ms, C interface "
          f"{1e3 * c_time / calls:.3f} ms, Python / C = {python_time / c_time:.3f}")

    def work(n: int) -> None:
        own = brannoc.Decoder()
        for _ in range(n):
            own.decode_sch(sent.llr, sent.control)

    start = time.perf_counter()
    work(2 * calls)
    one = time.perf_counter() - start
    threads = [threading.Thread(target=work, args=(calls,)) for _ in range(2)]
    start = time.perf_counter()
    for t in threads:
        t.start()
    for t in threads:
        t.join()
    two = time.perf_counter() - start
    print(f"{2 * calls} calls: one thread {one:.2f} s, two threads {two:.2f} s, "
          f"speed-up {one / two:.2f} (load {os.getloadavg()[0]:.2f})")


if __name__ == "__main__":
    main()
