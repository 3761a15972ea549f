"""Rendering files, block by block."""

from __future__ import annotations

import contextlib
import glob
import os
import uuid
import warnings
from pathlib import Path
from typing import Any, Iterator, Optional, Sequence, Union

import numpy as np

from .chain import Chain
from .processor import Audio, Processor, Tail

_BLOCK = 65536


@contextlib.contextmanager
def _progress(wanted: bool, frames: int, rate: int, name: str) -> Iterator[Any]:
    """Yields a function that takes the frames done."""
    bar = None
    if wanted:
        with contextlib.suppress(ImportError):
            from tqdm import tqdm

            # disable=None: not where standard error is no terminal.
            bar = tqdm(total=round(frames / rate, 1), unit="s", desc=name, disable=None)
    try:
        yield (lambda done: bar.update(done / rate)) if bar is not None else (lambda done: None)
    finally:
        if bar is not None:
            bar.close()


@contextlib.contextmanager
def written_whole(path: Path) -> Iterator[Path]:
    """A path beside `path`, of the same ending, to write to; it becomes `path` when all went well, and is removed
    otherwise. Nobody else writes to it, be it another process or another machine."""
    beside = path.with_name(f".{path.stem}.{uuid.uuid4().hex[:12]}.part{path.suffix}")
    try:
        yield beside
        os.replace(beside, path)
    finally:
        with contextlib.suppress(FileNotFoundError):
            beside.unlink()


def remains_of(path: Path) -> None:
    """Removes what processes that were killed have left beside `path`; for when nobody is writing it any more."""
    for beside in path.parent.glob(f".{glob.escape(path.stem)}.????????????.part{path.suffix}"):
        beside.unlink(missing_ok=True)


def render(source: Union[str, "os.PathLike[str]"], target: Union[str, "os.PathLike[str]"],
           chain: Union[Processor, Sequence[Processor]], *, tail: Tail = 0.0, subtype: Optional[str] = None,
           dtype: str = "float64", progress: bool = True) -> Path:
    """Renders an audio file of 1 or 2 channels through a chain (or one effect) into another, without holding
    it in memory, and returns the target's path. Needs soundfile.

    target: its ending says the format: .wav, .flac, .ogg ...; it is replaced when everything is written, and
        left as it was when anything fails.
    tail: how much longer than the source it becomes, in seconds, or "auto" until what rings on has died away.
    subtype: soundfile's, for example "PCM_24"; the source's where the format has it.
    dtype: "float64" or "float32", what is computed with.
    progress: shows a bar where tqdm is installed and standard error is a terminal.

    Warns when samples were above full scale and had to be clipped."""
    try:
        import soundfile
    except ImportError as error:
        raise ImportError("dspdll.render needs soundfile (Debian: python3-soundfile)") from error
    processor = chain if isinstance(chain, Processor) else Chain(chain)
    target = Path(target)
    kind = target.suffix[1:].upper().replace("AIF", "AIFF").replace("AIFFF", "AIFF")
    if kind not in soundfile.available_formats():
        raise ValueError(f"{target}: there is no audio format for this ending; accepted: "
                         + ", ".join("." + known.lower() for known in soundfile.available_formats()))
    with soundfile.SoundFile(source) as read:
        if read.channels > 2:
            raise ValueError(f"{source}: has {read.channels} channels; 1 or 2 can be processed")
        if subtype is None:
            subtype = read.subtype if soundfile.check_format(kind, read.subtype) else soundfile.default_subtype(kind)
        stream = processor.stream(read.samplerate, read.channels)
        clipped = 0
        with written_whole(target) as beside, _progress(progress, read.frames, read.samplerate, target.name) as done:
            with soundfile.SoundFile(beside, "w", read.samplerate, read.channels, subtype, format=kind) as write:

                def blocks() -> Iterator[Audio]:
                    while len(block := read.read(_BLOCK, dtype, always_2d=True)):
                        yield block
                        done(len(block))

                for block in stream._aligned(blocks(), tail, dtype):
                    if subtype not in ("FLOAT", "DOUBLE"):
                        clipped += int(np.count_nonzero(np.abs(block) > 1.0))
                    write.write(block)
    if clipped:
        warnings.warn(f"{target}: {clipped} samples were above full scale and are clipped; "
                      'a gain in front or subtype="FLOAT" avoids that', stacklevel=2)
    return target
