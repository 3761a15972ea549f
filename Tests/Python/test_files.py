"""Files: rendering, the README's example, the type checker's view, and a folder on a cluster."""

import os
import signal
import subprocess
import sys
import threading
import time
from pathlib import Path

import dspdll as dsp
import numpy as np
import pytest
from support import PACKAGES, RATE, noise, sine

soundfile = pytest.importorskip("soundfile")
ROOT = Path(__file__).parents[2]
sys.path.insert(0, str(ROOT / "examples"))


def test_render_is_the_whole_array_in_blocks(tmp_path):
    chain = dsp.Chain([dsp.Valvex(oversampling="16"), dsp.Echo("Single delay")])
    x = noise(150000, np.float64)
    soundfile.write(tmp_path / "in.wav", x, RATE, "DOUBLE")
    for tail in (0.0, 0.25, "auto"):
        target = dsp.render(tmp_path / "in.wav", tmp_path / "out.wav", chain, tail=tail)
        expected = chain(x, RATE, tail=tail)
        assert target == tmp_path / "out.wav" and soundfile.info(target).subtype == "DOUBLE"
        assert np.allclose(soundfile.read(target)[0], expected, rtol=0, atol=1e-12)
    short = dsp.render(tmp_path / "in.wav", tmp_path / "out.flac", [dsp.Gain(gain="-20 dB")], subtype="PCM_24")
    assert soundfile.info(short).frames == 150000 and soundfile.info(short).subtype == "PCM_24"


def test_what_fails_leaves_the_target_as_it_was(tmp_path):
    source, target = tmp_path / "in.wav", tmp_path / "out.wav"
    soundfile.write(source, noise(70000), 44099)
    target.write_bytes(b"before")

    class Breaks(dsp.Gain):
        def stream(self, rate, channels=2, *, axis=0):
            stream = super().stream(rate, channels)
            stream(np.zeros((1, channels), np.float32))  # so that doubles are refused later
            return stream

    three, empty = tmp_path / "three.wav", tmp_path / "empty.wav"
    soundfile.write(three, np.zeros((10, 3)), RATE)
    soundfile.write(empty, np.zeros((0, 1)), RATE)
    damaged = tmp_path / "damaged.flac"
    soundfile.write(damaged, noise(70000), RATE)
    damaged.write_bytes(damaged.read_bytes()[:50000])
    for wrong, fx, error in ((source, Breaks(), TypeError), (three, dsp.Gain(), ValueError),
                             (tmp_path / "no.wav", dsp.Gain(), FileNotFoundError),
                             (empty, dsp.Gain(), ValueError), (damaged, dsp.Gain(), OSError)):
        with pytest.raises(error):
            dsp.render(wrong, target, fx)
        assert target.read_bytes() == b"before"
    with pytest.raises(ValueError, match="ending"):
        dsp.render(source, tmp_path / "out.xyz", dsp.Gain())
    with pytest.raises(FileNotFoundError, match="no folder"):
        dsp.render(source, tmp_path / "no" / "out.wav", dsp.Gain())
    with pytest.raises(OSError, match="out.mp3: cannot be written: .*sample rates"):
        dsp.render(source, tmp_path / "out.mp3", dsp.Gain())
    with pytest.warns(UserWarning, match="samples were above full scale"):
        dsp.render(source, source, dsp.Gain(gain="20 dB"))  # onto itself
    assert sorted(path.name for path in tmp_path.iterdir()) == ["damaged.flac", "empty.wav", "in.wav", "out.wav", "three.wav"]
    assert len(soundfile.read(source)[0]) == 70000


def test_what_stands_around_the_samples(tmp_path):
    source, target = tmp_path / "in.wav", tmp_path / "link.wav"
    with soundfile.SoundFile(source, "w", RATE, 1) as file:
        file.title = "Theme"
        file.write(noise(9000)[:, 0])
    (tmp_path / "real.wav").touch(0o600)
    target.symlink_to("real.wav")
    dsp.render(source, target, dsp.Gain())
    assert target.is_symlink() and (tmp_path / "real.wav").stat().st_mode & 0o777 == 0o600
    assert soundfile.SoundFile(tmp_path / "real.wav").title == "Theme"
    source.write_bytes(source.read_bytes()[:10000])
    with pytest.warns(UserWarning, match="in.wav: was cut off, after 4"):
        dsp.render(source, target, dsp.Gain())


def test_the_readme_example_runs(tmp_path):
    text = (ROOT / "README.md").read_text(encoding="utf-8")
    blocks = [part.split("\n```\n")[0] for part in text.split("\n```python\n")[1:]]
    assert len(blocks) == 1
    soundfile.write(tmp_path / "in.flac", 0.3 * sine(220, 1.0)[:, None].repeat(2, 1), RATE)
    done = subprocess.run([sys.executable, "-c", blocks[0]], cwd=tmp_path, capture_output=True, text=True)
    assert done.returncode == 0, done.stderr
    assert {path.name for path in tmp_path.iterdir()} > {"in.flac", "out.wav"} and done.stdout


def test_stubs(tmp_path):
    pytest.importorskip("mypy")
    (tmp_path / "use.py").write_text(
        "import dspdll as dsp\nfx = dsp.Compressor(preset='Studio Vocal', threshold=-20)\n"
        "y = fx.stream(48000, 2)\ndsp.Compressor(treshold=1)\ndsp.Echo(preset='Studio Vocal')\n"
        "dsp.Chain([fx, 3])\ndsp.render('a', 'b', fx, tails=1)\n")
    command = [sys.executable, "-m", "mypy", "--strict", "--ignore-missing-imports", str(PACKAGES / "dspdll"), "use.py"]
    done = subprocess.run(command, cwd=tmp_path, env={**os.environ, "MYPYPATH": str(PACKAGES)},
                          capture_output=True, text=True)
    wrong = [line for line in done.stdout.splitlines() if ": error:" in line]
    assert [line.split(":")[:2] for line in wrong] == [["use.py", str(n)] for n in (4, 5, 6, 7)], done.stdout


def make_folder(folder, files, broken=()):
    folder.mkdir()
    for i in range(files):
        soundfile.write(folder / f"{i:02}.flac", noise(24000 + 100 * i), RATE)
    for name in broken:
        (folder / name).write_bytes(b"no audio")
    return folder


def test_a_folder_on_a_cluster_that_loses_a_worker(tmp_path):
    distributed = pytest.importorskip("distributed")
    import many_files

    folder, out = make_folder(tmp_path / "in", 64, ["bad.wav", "empty.flac"]), tmp_path / "out"
    chain = many_files.usual_chain()
    pairs, _ = many_files.to_do(folder, out, ".wav")
    with distributed.LocalCluster(n_workers=2, threads_per_worker=1, dashboard_address=None) as local:
        with distributed.Client(local) as client:
            victim = next(iter(client.run(os.getpid).values()))
            rows = []
            for row in many_files.run(client, many_files.rendering(chain), pairs):
                rows.append(row)
                if len(rows) == 33:
                    os.kill(victim, signal.SIGKILL)
    assert sorted(source.name for source, _, error in rows if error) == ["bad.wav", "empty.flac"]
    assert all("Error" in error for _, _, error in rows if error) and len(rows) == 66
    assert sorted(path.name for path in out.iterdir()) == [f"{i:02}.wav" for i in range(64)], "nothing half-written"
    for i in range(64):
        serial = dsp.render(folder / f"{i:02}.flac", tmp_path / "serial.wav", chain, tail="auto")
        assert serial.read_bytes() == (out / f"{i:02}.wav").read_bytes()


def test_many_files_as_a_program(tmp_path):
    pytest.importorskip("distributed")
    folder = make_folder(tmp_path / "in", 3, ["bad.wav"])
    (folder / "sub").mkdir()
    (folder / "00.flac").rename(folder / "sub" / "00.flac")
    command = [sys.executable, str(ROOT / "examples/many_files.py"), str(folder), str(tmp_path / "out"),
               "--measure", "peaks", "--per-task", "3"]
    first, second = (subprocess.run(command, capture_output=True, text=True) for _ in range(2))
    assert first.returncode == second.returncode == 1 and "1 files failed:\n  bad.wav  LibsndfileError" in first.stdout
    assert "4 files to do, 0 done before" in first.stdout and "1 files to do, 3 done before" in second.stdout
    assert '"mean_db": -2' in (tmp_path / "out" / "sub" / "00.json").read_text()
