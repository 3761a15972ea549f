"""What a recording is made of: its spectrum, its sonogram, its notes.

How the library analyses is set for a whole process, so one analysis runs at a time in each; several processes
run side by side."""

from __future__ import annotations

from dataclasses import dataclass, field
from typing import Any, List, Optional, Tuple

import numpy as np

from . import _native
from .picture import Drawn
from .processor import Audio, is_number, whole_axis, whole_rate

WINDOWS = ("rectangular", "triangular", "hann", "hamming", "blackman")
_FLOOR = 1e-30


def decibels(shares: Audio) -> Audio:
    """Powers relative to a full-scale sine's, in dB; -300 for nothing."""
    levels: Audio = np.maximum(shares, _FLOOR, out=shares)  # in place: sonograms are large
    np.log10(levels, out=levels)
    levels *= 10.0
    return levels


def as_array(values: Audio, dtype: Any, copy: Optional[bool]) -> Audio:
    """What NumPy asks __array__ for; `copy` is new in its version 2."""
    return np.array(values, dtype) if copy else np.asarray(values, dtype)


def axes(ax: Any) -> Any:
    if ax is not None:
        return ax
    import matplotlib.pyplot

    return matplotlib.pyplot.subplots(layout="constrained")[1]


@dataclass(repr=False, eq=False)
class Spectrum(Drawn):
    """frequencies: (bins,), Hz from 0 up. levels: (bins,), the mean of all windows, dB below a full-scale sine.
    peaks: (bins,), the highest level that each frequency reached. numpy.asarray gives the levels."""

    frequencies: Audio
    levels: Audio
    peaks: Audio
    rate: int
    window: str
    length: int

    def __array__(self, dtype: Any = None, copy: Optional[bool] = None) -> Audio:
        return as_array(self.levels, dtype, copy)

    @property
    def peak(self) -> Tuple[float, float]:
        """Frequency (Hz) and level (dB) of the strongest bin but 0 Hz."""
        k = int(np.argmax(self.levels[1:])) + 1
        return float(self.frequencies[k]), float(self.levels[k])

    def __repr__(self) -> str:
        hz, level = self.peak
        return (f"<Spectrum of {len(self.levels)} bins up to {self.rate / 2:g} Hz, "
                f"strongest at {hz:.1f} Hz: {level:.1f} dB>")

    def plot(self, ax: Any = None) -> Any:
        """Draws levels and peaks into Matplotlib axes, new ones if None, and returns them."""
        ax = axes(ax)
        ax.semilogx(self.frequencies[1:], self.peaks[1:], linewidth=0.7, label="highest")
        ax.semilogx(self.frequencies[1:], self.levels[1:], label="mean")
        ax.set_xlim(20, self.rate / 2)
        ax.set_ylim(-120, 0)
        ax.set_xlabel("Frequency (Hz)")
        ax.set_ylabel("Level (dB)")
        ax.legend()
        return ax

    def _pixels(self, width: int, height: int, dpi: float) -> Audio:
        powers = [10.0 ** (np.asarray(levels, np.float64) / 10.0) for levels in (self.levels, self.peaks)]
        return _native.draw_spectrum(powers[0].tolist(), powers[1].tolist(), self.rate, WINDOWS.index(self.window),
                                     self.length, width, height, dpi)


@dataclass(repr=False, eq=False)
class Sonogram(Drawn):
    """frequencies: (bins,), Hz. times: (windows,), seconds, the middle of each window. levels: (bins, windows),
    dB below a full-scale sine. numpy.asarray gives the levels. It keeps the recording's mean of channels for
    the picture."""

    frequencies: Audio
    times: Audio
    levels: Audio
    rate: int
    window: str
    length: int
    pitch: bool
    _samples: Audio = field(repr=False)

    def __array__(self, dtype: Any = None, copy: Optional[bool] = None) -> Audio:
        return as_array(self.levels, dtype, copy)

    def __repr__(self) -> str:
        return (f"<Sonogram of {self.levels.shape[1]} windows, {self.levels.shape[0]} bins up to {self.rate / 2:g} Hz, "
                f"{len(self._samples) / self.rate:.2f} s>")

    def plot(self, ax: Any = None) -> Any:
        """Draws the levels into Matplotlib axes, new ones if None, and returns them."""
        ax = axes(ax)
        image = ax.pcolormesh(self.times, self.frequencies[1:], self.levels[1:], vmin=-100, vmax=0, shading="nearest",
                              rasterized=True)
        ax.figure.colorbar(image, ax=ax, label="Level (dB)")
        ax.set_yscale("log")
        ax.set_ylim(20, self.rate / 2)
        ax.set_xlabel("Time (s)")
        ax.set_ylabel("Frequency (Hz)")
        return ax

    def _pixels(self, width: int, height: int, dpi: float) -> Audio:
        return _native.draw_sonogram(self._samples, self.rate, WINDOWS.index(self.window), self.length, self.pitch,
                                     width, height, dpi, 0)


@dataclass(repr=False, eq=False)
class Tuning(Drawn):
    """What the tuner heard, 30 times a second. times: (readings,), seconds. frequencies: Hz, and cents: how far
    that is from the note, both NaN where nothing was heard. notes: names with octaves, "" for none.
    numpy.asarray gives the frequencies."""

    times: Audio
    frequencies: Audio
    cents: Audio
    notes: List[str]
    rate: int
    _samples: Audio = field(repr=False)

    def __array__(self, dtype: Any = None, copy: Optional[bool] = None) -> Audio:
        return as_array(self.frequencies, dtype, copy)

    def _longest(self) -> Tuple[int, int]:
        """First reading and number of them, of the note that was heard longest in one piece."""
        best = (0, 0)
        start = 0
        for i in range(len(self.notes) + 1):
            if i == len(self.notes) or self.notes[i] != self.notes[start]:
                if self.notes[start:start + 1] != [""] and i - start > best[1]:
                    best = (start, i - start)
                start = i
        return best

    @property
    def note(self) -> str:
        """The note that was heard longest in one piece; "" for none."""
        start, count = self._longest()
        return self.notes[start] if count else ""

    @property
    def frequency(self) -> float:
        """The median frequency of that note, Hz; NaN for none."""
        start, count = self._longest()
        return float(np.median(self.frequencies[start:start + count])) if count else float("nan")

    @property
    def error(self) -> float:
        """The median error of that note, cents, positive when sharp; NaN for none."""
        start, count = self._longest()
        return float(np.median(self.cents[start:start + count])) if count else float("nan")

    def __repr__(self) -> str:
        if not self.note:
            return "<Tuning: no note was heard>"
        return f"<Tuning: {self.note}, {self.frequency:.2f} Hz, {self.error:+.1f} cents>"

    def plot(self, ax: Any = None) -> Any:
        """Draws frequency over time into Matplotlib axes, new ones if None, and returns them."""
        ax = axes(ax)
        ax.plot(self.times, self.frequencies)
        ax.set_xlabel("Time (s)")
        ax.set_ylabel("Frequency (Hz)")
        return ax

    def _pixels(self, width: int, height: int, dpi: float) -> Audio:
        return _native.draw_tuner(self._samples, self.rate, width, height, dpi)


def _mono(x: Audio, axis: int) -> Audio:
    return np.asarray(x if x.ndim == 1 else x.mean(axis=1 - whole_axis(axis, 2)), np.float32)


def _spectra(x: Audio, rate: int, window: str, length: int, overlap: float, everything: bool, axis: int) -> Any:
    if window not in WINDOWS:
        raise ValueError(f"window cannot be {window!r}; accepted: {', '.join(WINDOWS)}")
    if length not in [2**n for n in range(7, 20)]:
        raise ValueError(f"length cannot be {length!r}; accepted: powers of two from 128 to 524288")
    if not is_number(overlap) or not 0.0 <= overlap <= 0.99:
        raise ValueError(f"overlap cannot be {overlap!r}; accepted: 0 to 0.99 of a window")
    return _native.spectra(x, rate, WINDOWS.index(window), int(length), overlap, everything, axis)


def _frequencies(rate: int, length: int) -> Audio:
    return np.arange(length // 2) * (rate / length)


def spectrum(x: Audio, rate: float, *, length: int = 4096, window: str = "blackman", overlap: float = 0.5,
             axis: int = 0) -> Spectrum:
    """The mean spectrum of a recording, and the highest level that each frequency reached.

    x: (frames,) or (frames, channels), up to 64 channels, of which the mean is analysed; axis=1 for
        (channels, frames). What is shorter than a window is followed by silence.
    length: of a window, a power of two from 128 to 524288. window: one of analysis.WINDOWS.
    overlap: of successive windows, 0 to 0.99."""
    x, rate = np.asarray(x), whole_rate(rate)
    mean, peaks, _ = _spectra(x, rate, window, length, overlap, False, axis)
    return Spectrum(_frequencies(rate, length), decibels(mean), decibels(peaks), rate, window, length)


def sonogram(x: Audio, rate: float, *, length: int = 4096, window: str = "blackman", overlap: float = 0.75,
             pitch: bool = False, axis: int = 0) -> Sonogram:
    """Levels over time and frequency; parameters as for spectrum. `pitch` draws what the tuner hears into the
    picture, which is as wide as asked for or, for a short recording, narrower."""
    x, rate = np.asarray(x), whole_rate(rate)
    _, _, every = _spectra(x, rate, window, length, overlap, True, axis)
    hop = max(1, int(length * (1.0 - overlap)))
    times = (np.arange(len(every)) * hop + length / 2) / rate
    return Sonogram(_frequencies(rate, length), times, decibels(every).T, rate, window, length, bool(pitch),
                    _mono(x, axis))


def tune(x: Audio, rate: float, *, axis: int = 0) -> Tuning:
    """What a chromatic tuner hears, 30 times a second: x as for spectrum."""
    x, rate = np.asarray(x), whole_rate(rate)
    rows = _native.notes(x, rate, axis)
    times = np.array([row[0] for row in rows])
    heard = np.array([row[3] >= 0 for row in rows], bool)
    frequencies = np.where(heard, [row[1] for row in rows], np.nan)
    cents = np.where(heard, [row[2] for row in rows], np.nan)
    notes = [_native.note_name(row[3]) + str(row[4]) if row[3] >= 0 else "" for row in rows]
    result = Tuning(times, frequencies, cents, notes, rate, np.zeros(0, np.float32))
    # The picture shows the end of the longest note: a second before it is what the tuner needs to hear.
    start, count = result._longest()
    end = int(times[start + count - 1] * rate) + 1 if count else len(_mono(x, axis))
    result._samples = _mono(x, axis)[max(0, end - rate):end].copy()
    return result
