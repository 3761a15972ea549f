#!/usr/bin/env python3
"""Processes or measures every audio file of a folder, on all cores of this machine or on a cluster.

    many_files.py IN OUT                                  through the chain below
    many_files.py IN OUT --chain FILE.py                  through the one that FILE.py calls `chain`
    many_files.py IN OUT --measure tuning|spectrum|peaks  into one .json or .csv per file
    many_files.py IN OUT --scheduler HOST:PORT            on the workers of a Dask cluster

Sub-folders are followed. A result is written beside its place and moved there when it is whole. A second run does
only what is missing or older than its source. A broken file is reported at the end and stops nothing; what a dead
worker was doing, another one does. On a cluster every worker sees the folders under the same paths, and has the
packages dspdll and soundfile.
"""

import argparse
import collections
import functools
import json
import runpy
import sys
import time
import warnings
from pathlib import Path

import numpy as np
import soundfile

import dspdll as dsp
from dspdll.files import remains_of, written_whole

ENDINGS = {".wav", ".flac", ".ogg", ".aiff", ".aif"}


def usual_chain():
    return dsp.Chain([dsp.Equalizer(["80 highpass"]), dsp.Compressor(preset="Studio Vocal"),
                      dsp.Reverb(wet_level="-20 dB")])


# A job gets a source and a target, which it writes whole or not at all; what it uses has to be on every worker. The
# measures return what is to be written.


def _render(source, target, chain):
    dsp.render(source, target, chain, tail="auto", progress=False)


def rendering(chain):
    """The job of rendering through a chain."""
    return functools.partial(_render, chain=chain)


def _measure(source, target, measure):
    text = measure(source)
    with written_whole(target) as beside:
        beside.write_text(text)


def measuring(measure):
    """The job of writing what measure(source) returns."""
    return functools.partial(_measure, measure=measure)


def tuning(source):
    heard = dsp.tune(*soundfile.read(source, dtype="float32"))
    numbers = {"frequency_hz": heard.frequency, "error_cents": heard.error}
    return json.dumps({"note": heard.note, **(numbers if heard.note else {})}) + "\n"


def spectrum(source):
    result = dsp.spectrum(*soundfile.read(source, dtype="float32"))
    rows = zip(result.frequencies, result.levels, result.peaks)
    return "frequency_hz,mean_db,highest_db\n" + "".join(f"{hz:.3f},{mean:.3f},{peak:.3f}\n" for hz, mean, peak in rows)


def peaks(source):
    """The highest sample, and the loudest and mean power of 0.4 s pieces, in dB below full scale."""
    highest, powers = 0.0, [0.0]
    with soundfile.SoundFile(source) as file:
        for block in file.blocks(max(1, int(0.4 * file.samplerate)), dtype="float64", always_2d=True):
            highest = max(highest, np.abs(block).max())
            powers.append(np.mean(block**2))
    found = {"peak_db": highest**2, "loudest_db": max(powers), "mean_db": np.sum(powers) / max(1, len(powers) - 1)}
    return json.dumps({name: round(10 * np.log10(max(power, 1e-30)), 2) for name, power in found.items()}) + "\n"


MEASURES = {"tuning": (tuning, ".json"), "spectrum": (spectrum, ".csv"), "peaks": (peaks, ".json")}


def told(error):
    return " ".join(f"{type(error).__name__}: {error}".split())


def do(job, pairs):
    """Runs on a worker. For each file the seconds of audio, and what went wrong or ""; the job's warnings stand there
    beside seconds above 0."""
    done = []
    for source, target in pairs:
        try:
            target.parent.mkdir(parents=True, exist_ok=True)
            with warnings.catch_warnings(record=True) as remarks:
                warnings.simplefilter("always", UserWarning)
                job(source, target)
            done.append((seconds_of(source), "; ".join(str(remark.message) for remark in remarks)))
        except Exception as error:  # whatever it is, it is this file's alone
            done.append((0.0, told(error)))
    return done


def seconds_of(source):
    with soundfile.SoundFile(source) as file:
        # Of some files that were cut off the number of frames is unknown, and the highest there is.
        return max(file.frames, 1) / file.samplerate if file.frames < 2**60 else 1.0


def to_do(folder, out, ending):
    """(source, target) of what is missing or outdated, the largest first so that none is left for the end, and how many
    are done already."""
    sources = [path for path in folder.rglob("*")
               if path.suffix.lower() in ENDINGS and path.is_file() and out not in path.parents]
    pairs = [(source, (out / source.relative_to(folder)).with_suffix(ending or source.suffix)) for source in sources]
    counts = collections.Counter(target for _, target in pairs)
    pairs = [(source, target.with_name(source.name + target.suffix) if counts[target] > 1 else target)
             for source, target in pairs]
    missing = [(source, target) for source, target in pairs
               if not target.exists() or target.stat().st_mtime < source.stat().st_mtime]
    return sorted(missing, key=lambda pair: -pair[0].stat().st_size), len(pairs) - len(missing)


def run(client, job, pairs, per_task=1):
    """Yields (source, seconds of audio, error) as the files are done."""
    from dask.distributed import as_completed

    pieces = [pairs[first:first + per_task] for first in range(0, len(pairs), per_task)]
    futures = {client.submit(do, job, piece, pure=False): piece for piece in pieces}
    for future in as_completed(futures):
        if future.status == "finished":
            results = future.result()
        else:  # not a file's own error, but for example that several workers died of it
            results = [(0.0, told(future.exception()))] * len(futures[future])
        for (source, _), result in zip(futures[future], results):
            yield (source, *result)
    for _, target in pairs:
        remains_of(target)


def cluster(scheduler, workers):
    from dask.distributed import Client, LocalCluster

    if scheduler:
        return Client(f"tcp://{scheduler}" if "://" not in scheduler else scheduler)
    # One process a core: then reading and writing keep nobody else waiting.
    return Client(LocalCluster(n_workers=workers, threads_per_worker=1, dashboard_address=None))


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("source", type=Path, metavar="IN")
    parser.add_argument("target", type=Path, metavar="OUT")
    parser.add_argument("--chain", type=Path, help="a Python file that sets `chain`")
    parser.add_argument("--ending", help="the outputs' format, for example .flac; the sources' when left out")
    parser.add_argument("--measure", choices=MEASURES)
    parser.add_argument("--scheduler", metavar="HOST:PORT")
    parser.add_argument("--per-task", type=int, default=1, metavar="N", help="files a worker gets at once")
    parser.add_argument("--workers", type=int, help="on this machine; as many as cores when left out")
    options = parser.parse_args()
    if not options.source.is_dir():
        parser.error(f"{options.source} is no folder")
    if options.target.resolve() in (options.source.resolve(), *options.source.resolve().parents):
        parser.error("OUT is IN or holds it; results need a folder of their own")
    if options.ending and not options.ending.startswith("."):
        options.ending = "." + options.ending
    if options.measure:
        measure, ending = MEASURES[options.measure]
        job = measuring(measure)
    else:
        chain = usual_chain()
        if options.chain:
            if not options.chain.is_file():
                parser.error(f"{options.chain} is no file")
            chain = runpy.run_path(str(options.chain)).get("chain")
            if not isinstance(chain, dsp.Processor):
                parser.error(f"{options.chain} sets no `chain`, as chain = dsp.Chain([...]) does")
        ending = options.ending
        job = rendering(chain)
    pairs, before = to_do(options.source.resolve(), options.target.resolve(), ending)
    print(f"{len(pairs)} files to do, {before} done before")
    if not pairs:
        return 0
    failures, remarks, audio = [], [], 0.0
    with cluster(options.scheduler, options.workers) as client:
        start = time.time()
        for count, (source, seconds, error) in enumerate(run(client, job, pairs, max(1, options.per_task)), 1):
            audio += seconds
            if error:
                (remarks if seconds else failures).append((source.relative_to(options.source.resolve()), error))
            if sys.stderr.isatty():
                print(f"\r{count} of {len(pairs)}", end="", file=sys.stderr)
        took = time.time() - start
    print(f"{len(pairs) - len(failures)} files, {audio / 3600:.2f} hours of audio in {took:.1f} s")
    for rows, heading in ((remarks, "files are done, but:"), (failures, "files failed:")):
        width = max((len(str(name)) for name, _ in rows), default=0)
        if rows:
            print(f"{len(rows)} {heading}")
        for name, error in sorted(rows):
            print(f"  {str(name):{width}}  {error}")
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main())
