"""Sample-rate conversion and pitch shift of whole recordings."""

from __future__ import annotations

import operator

import numpy as np

from . import _native
from .processor import Audio, whole_rate


def convert(x: Audio, in_rate: float, out_rate: float, *, nearest: bool = False, axis: int = 0) -> Audio:
    """Converts from one sample rate to another, 1000 to 768000 Hz each, any ratio of whole numbers.

    x: (frames,) or (frames, channels) with up to 48 channels, float32 or float64; axis=1 for
        (channels, frames). The result has round(frames * out_rate / in_rate) frames and stands where x stood:
        the filter's delay is taken out.
    nearest: quicker where the exact ratio has large factors, but may miss the rate by some cents."""
    return _native.convert(np.asarray(x), whole_rate(in_rate), whole_rate(out_rate), bool(nearest),
                           operator.index(axis))


def pitch(x: Audio, rate: float, semitones: float, *, engine: str = "new", quality: int = 4, speed: float = 1.0,
          axis: int = 0) -> Audio:
    """Shifts the pitch, -36 to 36 semitones; what comes out stands where it stood.

    x: (frames,) or (frames, channels) with 1 or 2 channels, float32 or float64, processed as float32.
    engine: "new" or "classic". quality: from 0, the fastest, to 9, with "classic" to 13.
    speed: 0.1 to 10, with the engine "new" only: how fast it plays, pitch along with it; the result has
        frames / speed frames."""
    return _native.pitch(np.asarray(x), whole_rate(rate), float(semitones), str(engine), operator.index(quality),
                         float(speed), operator.index(axis))
