#!/usr/bin/env python3
"""compare.py EXPECTED FILE LATENCY [LEAD]: whether FILE is EXPECTED, without its first LEAD frames, that many frames
later; more channels of it than EXPECTED has are left out.
compare.py --sounds FILE...: whether every file has sound, and only finite samples."""
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
    silent = [name for name in sys.argv[2:] if not (abs(read(name)[0]).max(axis=0, initial=0) > 1e-4).any()]
    sys.exit(f"silent: {', '.join(silent)}" if silent or not sys.argv[2:] else 0)

(expected, rate), (found, found_rate) = read(sys.argv[1]), read(sys.argv[2])
latency, lead = (int(number) for number in (sys.argv[3:] + ["0"])[:2])
found = found[latency:, :expected.shape[1]]
expected = expected[lead:]
frames = min(len(expected), len(found))
if rate != found_rate or expected.shape[1] != found.shape[1] or frames < len(expected) - latency - 8192:
    sys.exit(f"{sys.argv[2]} has {len(found)} frames of {found.shape[1]} channels at {found_rate} Hz, not "
             f"{len(expected)} of {expected.shape[1]} at {rate} Hz")
difference = abs(expected[:frames] - found[:frames]).max()
if not abs(expected[:frames]).max() > 1e-4:
    sys.exit(f"{sys.argv[1]} is silent")
if not difference <= TOLERANCE:
    sys.exit(f"{sys.argv[2]} differs from {sys.argv[1]} by {20 * numpy.log10(difference):.1f} dBFS")
