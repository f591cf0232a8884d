#!/usr/bin/env python3
"""Draws the CSV of `brannoc sim` as a PNG: BLER after the first transmission (log scale) and
throughput against SNR, one line per curve.

usage: brannoc-plot RESULTS.csv PLOT.png
"""
import csv
import sys
from collections import OrderedDict

import matplotlib

matplotlib.use("Agg")
import matplotlib.pyplot as plt  # noqa: E402


def read_curves(path):
    curves = OrderedDict()
    with open(path, newline="") as f:
        for row in csv.DictReader(f):
            curve = curves.setdefault(row["curve"], {"snr": [], "bler": [], "tput": []})
            curve["snr"].append(float(row["snr_db"]))
            curve["bler"].append(float(row["bler_1"]))
            curve["tput"].append(float(row["throughput_mbps"]))
    return curves


def main(argv):
    if len(argv) != 3:
        sys.stderr.write(__doc__)
        return 2
    curves = read_curves(argv[1])
    fig, (top, bottom) = plt.subplots(2, 1, sharex=True, figsize=(7, 7))
    for label, c in curves.items():
        # A BLER of 0 has no place on a log scale: those points are left out.
        shown = [(s, b) for s, b in zip(c["snr"], c["bler"]) if b > 0]
        top.semilogy([s for s, _ in shown], [b for _, b in shown], "o-", label=label)
        bottom.plot(c["snr"], c["tput"], "o-", label=label)
    top.set_ylabel("BLER, first transmission")
    top.grid(True, which="both", alpha=0.4)
    top.legend(fontsize="small")
    bottom.set_ylabel("throughput, Mbit/s")
    bottom.set_xlabel("SNR (Es/N0), dB")
    bottom.grid(True, alpha=0.4)
    fig.tight_layout()
    fig.savefig(argv[2], dpi=80)
    return 0


if __name__ == "__main__":
    sys.exit(main(sys.argv))
