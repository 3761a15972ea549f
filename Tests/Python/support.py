import functools
import os
from pathlib import Path

import dspdll
import numpy as np

RATE = 48000
PACKAGES = Path(dspdll.__file__).absolute().parents[1]
LIBRARY = next((PACKAGES / "bin").glob("libDSPDll.so.?"))
os.environ["PYTHONPATH"] = str(PACKAGES)  # for programs that run elsewhere


@functools.lru_cache
def _noise(frames):
    return np.random.default_rng(frames).standard_normal((frames, 2)) * 0.1


def noise(frames, dtype=np.float32):
    return _noise(frames).astype(dtype)


def sine(hz, seconds, rate=RATE, dtype=np.float64):
    return (0.5 * np.sin(2 * np.pi * hz * np.arange(round(seconds * rate)) / rate)).astype(dtype)
