#!/usr/bin/env python3
"""compare.py EXPECTED FILE [LATENCY]: whether FILE is EXPECTED that many frames later.
compare.py --sounds FILE [NAME...]: whether every channel of FILE has sound, and only finite samples; their names."""
import sys

import numpy
import soundfile

TOLERANCE = 10 ** (-100 / 20)  # of full scale


def read(name):
    samples, rate = soundfile.read(name, always_2d=True)
    if not numpy.isfinite(samples).all():
        sys.exit(f"{name} has samples that are not finite")
    return samples, rate


if sys.argv[1] == "--sounds":
    samples, _ = read(sys.argv[2])
    silent = [name for name, peak in zip(sys.argv[3:], abs(samples).max(axis=0)) if peak < 1e-4]
    sys.exit(f"{sys.argv[2]} is silent: {', '.join(silent)}" if silent or not abs(samples).max() > 1e-4 else 0)

(expected, rate), (found, found_rate) = read(sys.argv[1]), read(sys.argv[2])
latency = int(sys.argv[3]) if len(sys.argv) > 3 else 0
found = found[latency:]
frames = min(len(expected), len(found))
if rate != found_rate or expected.shape[1] != found.shape[1] or frames < len(expected) - latency - 8192:
    sys.exit(f"{sys.argv[2]} has {len(found)} frames of {found.shape[1]} channels at {found_rate} Hz, not "
             f"{len(expected)} of {expected.shape[1]} at {rate} Hz")
difference = abs(expected[:frames] - found[:frames]).max()
if not abs(expected[:frames]).max() > 1e-4:
    sys.exit(f"{sys.argv[1]} is silent")
if not difference <= TOLERANCE:
    sys.exit(f"{sys.argv[2]} differs from {sys.argv[1]} by {20 * numpy.log10(difference):.1f} dBFS")
