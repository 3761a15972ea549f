"""The parametric equaliser."""

from __future__ import annotations

import re
from dataclasses import dataclass
from typing import Any, Iterable, List, Mapping, Optional, Tuple, Union

import numpy as np

from . import _native
from .processor import Audio, Processor, Stream, is_number, whole_rate

# By the numbers that the library has for them.
TYPES = ("highpass", "highshelf-butterworth", "peak", "lowshelf-butterworth", "lowpass", "highshelf", "lowshelf")


@dataclass(frozen=True)
class Band:
    """One band of an equaliser.

    frequency: Hz, whole, 1 to 1000000. type: one of equalizer.TYPES. gain: dB in tenths, -100 to 100; passes
    have none. q: 1 to 100000; a peak is q/133 octaves wide, shelves slope and passes resonate with q/50; None
    for what suits the type: 200 for a peak, 50 for all others."""

    frequency: int
    type: str = "peak"
    gain: float = 0.0
    q: Optional[int] = None

    def __post_init__(self) -> None:
        if self.type not in TYPES:
            raise ValueError(f"a band cannot be of the type {self.type!r}; accepted: {', '.join(TYPES)}")
        for name, number, step, lowest, highest in (("frequency", self.frequency, 1, 1, 10**6),
                                                    ("gain", self.gain, 0.1, -100, 100),
                                                    ("q", self.q if self.q is not None else 1, 1, 1, 10**5)):
            if not is_number(number):
                raise TypeError(f"a band's {name} is a number, not {number!r}")
            steps = number / step
            if not lowest <= number <= highest or abs(steps - round(steps)) > 1e-6:
                raise ValueError(f"{name} cannot be {number}; accepted: {lowest} to {highest} in steps of {step}")

    @classmethod
    def parse(cls, text: str) -> "Band":
        """From "FREQUENCY TYPE [GAIN] [q=Q]": "2500 peak -3 q=200"."""
        match = re.fullmatch(r"\s*(\d+)(?:\s*Hz)?\s+([a-z-]+)(?:\s+([+-]?[\d.]+)(?:\s*dB)?)?(?:\s+q=(\d+))?\s*",
                             text, re.I)
        if not match:
            raise ValueError(f'{text!r} is no band; write "FREQUENCY TYPE [GAIN] [q=Q]", for example '
                             '"2500 peak -3 q=200"')
        frequency, kind, gain, q = match.groups()
        return cls(int(frequency), kind.lower(), float(gain or 0), int(q) if q else None)

    def __str__(self) -> str:
        """As parse takes it."""
        gain = f" {self.gain:g}" if self.gain else ""
        return f"{self.frequency} {self.type}{gain}" + (f" q={self.q}" if self.q is not None else "")

    def _record(self) -> Tuple[int, int, float, int]:
        kind = TYPES.index(self.type)
        q = self.q if self.q is not None else _native.default_q(kind)
        return kind, round(self.frequency), float(self.gain), round(q)


class Equalizer(Processor):
    """Up to 20 bands: Equalizer(["80 highpass", "2500 peak -3 q=200", Band(8000, "highshelf", gain=2)]).

    A band is a Band, a text that Band.parse takes, or a mapping of Band's fields. `invert` turns the polarity
    around. It has no latency."""

    def __init__(self, bands: Iterable[Union[Band, str, Mapping[str, Any]]], *, invert: bool = False) -> None:
        if isinstance(bands, (str, Band, Mapping)):
            raise TypeError(f"an equaliser takes a list of bands: [{bands!r}]")
        self._bands: Tuple[Band, ...] = tuple(_band(band) for band in bands)
        self._invert = bool(invert)
        if len(self._bands) > 20:
            raise ValueError(f"an equaliser has up to 20 bands, not {len(self._bands)}")
        self._changed()

    @property
    def bands(self) -> Tuple[Band, ...]:
        return self._bands

    @property
    def invert(self) -> bool:
        return self._invert

    def _records(self) -> List[Tuple[int, int, float, int]]:
        return [band._record() for band in self._bands]

    def _add_to(self, line: Stream, key_channels: int) -> None:
        line._add_equalizer(self._records(), self._invert)

    def response(self, frequencies: Any, rate: float = 48000) -> Audio:
        """The complex response at frequencies in Hz: an array of their shape. Its level in dB is
        20 * numpy.log10(abs(response)), its phase numpy.angle(response)."""
        f = np.asarray(frequencies, np.float64)
        values = _native.equalizer_response(self._records(), self._invert, whole_rate(rate), f.ravel().tolist())
        return np.array(values, np.complex128).reshape(f.shape)

    def plot(self, ax: Any = None, rate: float = 48000) -> Any:
        """Draws the curve into Matplotlib axes, new ones if None, and returns them."""
        from .analysis import axes

        ax = axes(ax)
        f = np.geomspace(20, rate / 2 * 0.999, 1000)
        ax.semilogx(f, 20 * np.log10(np.maximum(np.abs(self.response(f, rate)), 1e-15)))
        ax.set_xlabel("Frequency (Hz)")
        ax.set_ylabel("Gain (dB)")
        ax.grid(True, alpha=0.3)
        return ax

    def __repr__(self) -> str:
        return f"Equalizer({[str(band) for band in self._bands]}{', invert=True' if self._invert else ''})"


def _band(band: Union[Band, str, Mapping[str, Any]]) -> Band:
    if isinstance(band, str):
        return Band.parse(band)
    if isinstance(band, Mapping):
        return Band(**band)
    if not isinstance(band, Band):
        raise TypeError(f"a band is a text, a Band or a mapping, not {band!r}")
    return band
