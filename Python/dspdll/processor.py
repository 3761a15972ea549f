"""What effects, equalisers and chains have in common: they process arrays and streams."""

from __future__ import annotations

import itertools
import operator
from typing import TYPE_CHECKING, Any, Dict, Iterable, Iterator, List, Optional, Tuple, Union

import numpy as np

from . import _native

if TYPE_CHECKING:
    import numpy.typing as npt

    Audio = npt.NDArray[Any]
else:
    Audio = np.ndarray

Tail = Union[float, str]

# An automatic tail has died away when it stayed below -120 dB for this long and for the longest gap between
# two echoes. Its quiet end is left out.
QUIET_SECONDS = 0.5
QUIET_LEVEL = 1e-6
LONGEST_SECONDS = 60.0
_BLOCK = 8192

_HIGHEST_RATE = 2**31 - 1
_MOST_SECONDS = 1e6

_revisions = itertools.count()


def is_number(value: Any) -> bool:
    return isinstance(value, (int, float, np.integer, np.floating))


def whole_rate(rate: float) -> int:
    """A sample rate as an integer; ValueError where it is none."""
    if not (is_number(rate) and 0 < rate <= _HIGHEST_RATE and rate == int(rate)):
        raise ValueError(f"the sample rate is a whole number of Hz above 0, not {rate!r}")
    return int(rate)


def tail_seconds(tail: Tail) -> Optional[float]:
    """None for an automatic tail."""
    if tail == "auto":
        return None
    if is_number(tail) and 0.0 <= float(tail) <= _MOST_SECONDS:
        return float(tail)
    raise ValueError(f'tail is "auto" or seconds from 0 to {_MOST_SECONDS:.0f}, not {tail!r}')


def whole_axis(axis: int, dimensions: int) -> int:
    """An axis from 0 on; ValueError where the array has none such."""
    if not -dimensions <= axis < dimensions:
        raise ValueError(f"axis {axis} is none of an array of {dimensions} dimensions")
    return operator.index(axis) % dimensions


class Stream(_native.Line):
    """Processes block after block and keeps its state in between; made by stream().

    stream(block) takes a block of any length, (frames,) or (frames, channels), and returns one of the same
    shape and type, later by `latency` frames. All blocks have the type of the first one, float32 or float64.
    Later changes to the effects it was made of do not reach it.
    """

    def __repr__(self) -> str:
        return f"<Stream of {self.channels} channels at {self.rate} Hz, {self.position} frames processed>"

    def flush(self, tail: Tail = 0.0) -> Audio:
        """What is still inside when the signal has ended: `latency` frames, and the tail; always of two
        dimensions.

        tail: seconds, or "auto": until it has died away."""
        dtype = np.float64 if self.is_double else np.float32
        pieces = list(self._ends(self.rate, tail, dtype, 0))
        return np.concatenate([self._silence(0, dtype), *pieces], axis=self.axis)

    def _silence(self, frames: int, dtype: Any) -> Audio:
        shape = (frames, self.channels) if self.axis == 0 else (self.channels, frames)
        return np.zeros(shape, dtype)

    def _ends(self, rate: int, tail: Tail, dtype: Any, skip: int) -> Iterator[Audio]:
        """What comes behind the input in blocks, without its first `skip` frames."""
        seconds = tail_seconds(tail)
        left = self.latency + (round(rate * seconds) if seconds else 0)
        while left > 0:
            block = self(self._silence(min(left, _BLOCK), dtype))
            left -= _frames(block, self.axis)
            skipped = min(skip, _frames(block, self.axis))
            skip -= skipped
            if skipped < _frames(block, self.axis):
                yield _cut(block, self.axis, skipped)
        if seconds is None:
            yield from self._dies_away(rate, dtype)

    def _dies_away(self, rate: int, dtype: Any) -> Iterator[Audio]:
        quiet = round(rate * (QUIET_SECONDS + self.longest_gap))
        left = round(rate * LONGEST_SECONDS)
        held: List[Audio] = []
        held_frames = 0
        while left > 0 and held_frames < quiet:
            block = self(self._silence(min(left, _BLOCK), dtype))
            frames = _frames(block, self.axis)
            left -= frames
            loud = np.flatnonzero((np.abs(block) >= QUIET_LEVEL).any(axis=1 - self.axis))
            last = loud[-1] + 1 if loud.size else 0
            if last:
                yield from held
                yield _cut(block, self.axis, 0, last)
                held, held_frames = [], 0
            if last < frames:
                held.append(_cut(block, self.axis, last))
                held_frames += frames - last

    def _aligned(self, blocks: Iterable[Audio], tail: Tail, dtype: Any) -> Iterator[Audio]:
        """The blocks processed, without the latency; then what comes behind them."""
        skip = self.latency
        for block in blocks:
            processed = self(block)
            skipped = min(skip, _frames(processed, self.axis))
            skip -= skipped
            yield _cut(processed, self.axis, skipped)
        yield from self._ends(self.rate, tail, dtype, skip)


def _frames(x: Audio, axis: int) -> int:
    return int(x.shape[axis])


def _cut(x: Audio, axis: int, start: int, end: Optional[int] = None) -> Audio:
    cut: Audio = x[start:end] if axis == 0 else x[:, start:end]
    return cut


class Processor:
    """An effect, an equaliser or a chain of them."""

    _revision = -1

    def _changed(self) -> None:
        object.__setattr__(self, "_revision", next(_revisions))

    def __getstate__(self) -> Dict[str, Any]:
        kept = dict(self.__dict__)  # at once: another thread may be processing
        kept.pop("_spare", None)
        return kept

    def __setstate__(self, kept: Dict[str, Any]) -> None:
        self.__dict__.update(kept)
        self._changed()

    def _stations(self) -> List["Processor"]:
        """What it consists of, in order."""
        return [self]

    def _add_to(self, line: Stream, key_channels: int) -> None:
        raise NotImplementedError

    def _key_channels(self, sidechain: Audio, axis: int) -> int:
        raise TypeError(f"{type(self).__name__} has no side-chain")

    def _line(self, rate: int, channels: int, axis: int, key_channels: int = 0) -> Stream:
        line = Stream(rate, channels, axis)
        for station in self._stations():
            station._add_to(line, key_channels)
        return line

    def stream(self, rate: float, channels: int = 2, *, axis: int = 0) -> Stream:
        """A stream with this processor's settings, for blocks that follow each other.

        rate in Hz, channels 1 or 2, axis that of the frames in two-dimensional blocks."""
        return self._line(whole_rate(rate), operator.index(channels), whole_axis(axis, 2))

    def __call__(self, x: Audio, rate: float, *, tail: Tail = 0.0, axis: int = 0,
                 sidechain: Optional[Audio] = None) -> Audio:
        """Processes a whole recording and returns the result, aligned with x: latency is taken out.

        x: (frames,) or (frames, channels) with 1 or 2 channels, float32 or float64; axis=1 for
            (channels, frames).
        rate: in Hz.
        tail: how much longer than x the result is, in seconds, or "auto": until what rings on has died away
            (60 seconds at most).
        sidechain: for effects that listen to another signal, an array with as many frames as x.

        Every call begins afresh; several threads may call the same object. Raises TypeError for samples of
        another type and ValueError for shapes and numbers that cannot be."""
        x = np.asarray(x)
        rate = whole_rate(rate)
        axis = whole_axis(axis, max(x.ndim, 1))
        channels = x.shape[1 - axis] if x.ndim == 2 else 1
        if x.ndim not in (1, 2) or not 1 <= channels <= 2:
            hint = "; for (channels, frames) say axis=1" if x.ndim == 2 and x.shape[0] <= 2 and axis == 0 else ""
            raise ValueError(f"an array of the shape {x.shape} cannot be processed; expected are (frames,) or "
                             f"(frames, channels) with 1 or 2 channels{hint}")
        seconds = tail_seconds(tail)
        key_channels = 0
        if sidechain is not None:
            sidechain = np.asarray(sidechain)
            key_channels = self._key_channels(sidechain, axis)
        settings = (rate, channels, axis, key_channels, tuple(s._revision for s in self._stations()))
        # A line in use is nobody else's: a second thread makes one of its own.
        spare = self.__dict__.pop("_spare", None)
        if spare is not None and spare[0] == settings and spare[2] == x.dtype:
            line = spare[1]
            line.reset()
        else:
            line = self._line(rate, channels, axis, key_channels)
        latency = line.latency
        if seconds is None:
            # With the latency behind it; what follows then is the tail alone.
            body = line._process(x, latency, latency, sidechain)
            flat = x.ndim == 1
            pieces = [p.reshape(-1) if flat else p for p in line._dies_away(rate, x.dtype)]
            result: Audio = np.concatenate([body, *pieces], axis=axis) if pieces else body
        else:
            result = line._process(x, latency + round(rate * seconds), latency, sidechain)
        self.__dict__["_spare"] = (settings, line, x.dtype)
        return result
