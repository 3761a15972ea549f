"""Rendering files, block by block."""

from __future__ import annotations

import contextlib
import errno
import glob
import os
import re
import shutil
import uuid
import warnings
from pathlib import Path
from typing import Any, Iterator, Optional, Sequence, Union

import numpy as np

from .chain import Chain
from .processor import Audio, Processor, Tail, tail_seconds

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
    otherwise. Nobody else writes to it, be it another process or another machine. Where `path` is a link, what it
    points to is replaced; a file that is replaced leaves its mode to the new one."""
    path = path.resolve()
    beside = path.with_name(f".{path.stem}.{uuid.uuid4().hex[:12]}.part{path.suffix}")
    try:
        yield beside
        with contextlib.suppress(FileNotFoundError):
            shutil.copymode(path, beside)
        os.replace(beside, path)
    finally:
        with contextlib.suppress(FileNotFoundError):
            beside.unlink()


def remains_of(path: Path) -> None:
    """Removes what processes that were killed have left beside `path`; for when nobody is writing it any more."""
    path = path.resolve()
    for beside in path.parent.glob(f".{glob.escape(path.stem)}.????????????.part{path.suffix}"):
        beside.unlink(missing_ok=True)


def _cut_off(read: Any, frames: int) -> bool:
    """Whether less was read than the file promises. Recorders that never come back to the header leave some
    highest number there."""
    if read.frames != frames:
        return True
    promised = re.search(r"^data : (\d+) \(should be (\d+)\)", read.extra_info, re.M)  # of WAV files
    return promised is not None and int(promised[2]) < int(promised[1]) < 0x7FFFF000


@contextlib.contextmanager
def _failing(what: str) -> Iterator[None]:
    """Says which file fails, and how: soundfile knows of a name beside the target's at most."""
    import soundfile

    try:
        yield
    except soundfile.LibsndfileError as error:
        raise OSError(f"{what}: {error.error_string}") from error


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

    Titles and other tags are kept where both formats have them. Warns when samples were above full scale and had to
    be clipped, and when the source was cut off before its end."""
    try:
        import soundfile
    except ImportError as error:
        raise ImportError("dspdll.render needs soundfile (Debian: python3-soundfile)") from error
    processor = chain if isinstance(chain, Processor) else Chain(chain)
    target = Path(target)
    if dtype not in ("float32", "float64"):
        raise ValueError(f"dtype cannot be {dtype!r}; accepted: float32, float64")
    tail_seconds(tail)
    if isinstance(source, (str, os.PathLike)) and not os.path.exists(source):
        raise FileNotFoundError(errno.ENOENT, os.strerror(errno.ENOENT), os.fspath(source))
    if not target.parent.is_dir():
        raise FileNotFoundError(f"{target}: there is no folder {target.parent}")
    kind = target.suffix[1:].upper().replace("AIF", "AIFF").replace("AIFFF", "AIFF")
    if kind not in soundfile.available_formats():
        raise ValueError(f"{target}: there is no audio format for this ending; accepted: "
                         + ", ".join("." + known.lower() for known in soundfile.available_formats()))
    with soundfile.SoundFile(source) as read:
        if read.channels > 2:
            raise ValueError(f"{source}: has {read.channels} channels; 1 or 2 can be processed")
        if read.frames == 0:
            raise ValueError(f"{source}: is empty: it holds no samples")
        if subtype is None:
            subtype = read.subtype if soundfile.check_format(kind, read.subtype) else soundfile.default_subtype(kind)
        stream = processor.stream(read.samplerate, read.channels)
        clipped = frames = 0
        unwritable = f"{target}: cannot be written"
        with written_whole(target) as beside, _progress(progress, read.frames, read.samplerate, target.name) as done:

            def blocks() -> Iterator[Audio]:
                nonlocal frames
                while True:
                    with _failing(f"{source}: is damaged after {frames} frames"):
                        block = read.read(_BLOCK, dtype, always_2d=True)
                    if not len(block):
                        return
                    yield block
                    frames += len(block)
                    done(len(block))

            with _failing(unwritable):
                write = soundfile.SoundFile(beside, "w", read.samplerate, read.channels, subtype, format=kind)
            with write:
                for name, value in read.copy_metadata().items():
                    with contextlib.suppress(soundfile.LibsndfileError):
                        setattr(write, name, value)
                for block in stream._aligned(blocks(), tail, dtype):
                    if subtype not in ("FLOAT", "DOUBLE"):
                        clipped += int(np.count_nonzero(np.abs(block) > 1.0))
                    with _failing(unwritable):
                        write.write(block)
                with _failing(unwritable):
                    write.close()
        if _cut_off(read, frames):
            warnings.warn(f"{source}: was cut off, after {frames} frames", stacklevel=2)
    if clipped:
        warnings.warn(f"{target}: {clipped} samples were above full scale and are clipped; "
                      'a gain in front or subtype="FLOAT" avoids that', stacklevel=2)
    return target
