"""How often the tuner says the right note, a wrong one or none:

    python3 Bench/tuner_notes.py build/release/bin/dsphost

Of Debian's sonic-pi-samples the eight bass recordings with one note in their name (bass_drop_c falls by an
octave), in percent of the refreshes, 30 a second, at which the recording is within 40 dB of its loudest; its
level is the mean power of a refresh. An octave does not count as wrong. Below it what is said of drums, where
less is better. Needs sox.
"""

import array
import json
import math
import subprocess
import sys
import tempfile

RECORDINGS = "/usr/share/sonic-pi/samples/"
NOTES = "dnb_f hard_c hit_c thick_c trance_c voxy_c voxy_hit_c woodsy_c"
DRUMS = "loop_amen loop_amen_full loop_breakbeat loop_compus loop_industrial drum_roll drum_snare_hard sn_dub"
RATE, REFRESH = 44100, 1470
RANGE = 40.0


def heard(host, path):
    with tempfile.TemporaryDirectory() as folder:
        command = [host, "tuner", path, folder + "/panel.png", "--json", "-q"]
        return json.loads(subprocess.run(command, check=True, capture_output=True).stdout)


def levels(path, times):
    """The level in dB at each time."""
    command = ["sox", path, "-t", "f64", "-r", str(RATE), "-c", "1", "-"]
    samples = array.array("d", subprocess.run(command, check=True, capture_output=True).stdout)
    for time in times:
        first = max(int(time * RATE) - REFRESH // 2, 0)
        power = sum(x * x for x in samples[first : first + REFRESH]) / REFRESH
        yield 10.0 * math.log10(power + 1e-20)


def shares(host, name, note=""):
    """Of right, wrong and no notes; without `note` each is wrong."""
    path = RECORDINGS + name + ".flac"
    frames = heard(host, path)
    loudness = list(levels(path, [frame["time"] for frame in frames]))
    said = [
        frame["note"].rstrip("0123456789-") if frame["note"] else ""
        for frame, level in zip(frames, loudness)
        if level > max(loudness) - RANGE
    ]
    right, none = said.count(note or "-"), said.count("")
    return [100.0 * count / len(said) for count in (right, len(said) - right - none, none)]


def show(name, values):
    print(f"{name:18}" + "".join(f"{value:7.1f}" for value in values))


def main(host):
    print(f"{'':18}  right  wrong   none")
    rows = []
    for name in NOTES.split():
        rows.append(shares(host, "bass_" + name, name[-1].upper()))
        show("bass_" + name, rows[-1])
    show("mean", [sum(column) / len(rows) for column in zip(*rows)])
    for name in DRUMS.split():
        show(name, shares(host, name))


if __name__ == "__main__":
    main(sys.argv[1])
