#!/usr/bin/python3
"""Measures the rows of Bench/rows.txt and prints them as tables in Markdown: performance.py PROGRAMS FOLDER
PROGRAMS holds dsp_bench and dsphost; FOLDER holds the recordings of the commands, and gets what they write."""

import json
import math
import os
import pathlib
import re
import shlex
import statistics
import subprocess
import sys
import time

ROUNDS, SECONDS, SHELL_ROUNDS = 9, 0.02, 5
SHELL = "From a shell"
EXPLAINED = {
    "Effects": "Stereo floats at 48 kHz, interleaved, blocks of 512; a frame each.",
    "Session": "Tracks of gain, equaliser (4 bands), compressor, echo and reverb, each with settings of its own, on one "
    "thread; a frame of a track each. Opening: making an effect, restoring its settings and preparing it.",
    SHELL: "Ten minutes of stereo, 16 bits, from file to file; whole processes in turn, wall time.",
}


def read_rows(path):
    """(section, [what, ours, theirs, peer, goal, limit]) in the file's order."""
    section, rows = "", []
    for line in path.read_text().splitlines():
        if line.startswith("## "):
            section = line[3:]
        elif line and not line.startswith("#"):
            rows.append((section, [field.strip() for field in line.split("|")]))
    return rows


def names_in(expression):
    return [name.partition("@")[0] for name in expression.split(" - ") if name and name != "REAL_TIME"]


def pattern(name):
    return re.escape(name).replace(r"\*", "(.*)").replace(r"\{\}", "(.*)")


def run_benchmarks(program, rows):
    """The medians of all benchmarks that the rows name, by their names."""
    names = {name for section, row in rows if section != SHELL for name in names_in(row[1]) + names_in(row[2])}
    # The program knows other escapes than Python.
    wanted = "|".join(re.sub(r"\\.", ".", pattern(name)) for name in sorted(names))
    result = subprocess.run(
        [program, f"--benchmark_filter=^({wanted})$",
         "--benchmark_enable_random_interleaving", f"--benchmark_repetitions={ROUNDS}",
         f"--benchmark_min_time={SECONDS}", "--benchmark_report_aggregates_only", "--benchmark_format=json"],
        check=True, stdout=subprocess.PIPE)
    found = json.loads(result.stdout)["benchmarks"]
    return {each["run_name"]: each for each in found if each.get("aggregate_name") == "median"}


def nanoseconds(expression, medians, each_item):
    units = {"ns": 1, "us": 1e3, "ms": 1e6, "s": 1e9}
    times = []
    for name in expression.split(" - "):
        if name == "REAL_TIME":
            times.append(1e9 / 48000)
        elif each_item:
            times.append(1e9 / medians[name]["items_per_second"])
        else:
            clock = "real_time" if name.endswith("/manual_time") else "cpu_time"
            times.append(medians[name][clock] * units[medians[name]["time_unit"]])
    return times[0] - sum(times[1:])


def compare(ours, theirs, medians):
    """Our time and theirs; None where a benchmark is missing. A counter is a share of a core."""
    if "@" in ours:
        name, counter = ours.split("@")
        return (medians[name][counter] / 100, 1.0) if name in medians else None
    names = names_in(ours) + names_in(theirs)
    if any(name not in medians for name in names):
        return None
    each_item = all("items_per_second" in medians[name] for name in names)
    return nanoseconds(ours, medians, each_item), nanoseconds(theirs, medians, each_item) if theirs else None


def ends(name, sign, medians):
    found = [re.fullmatch(pattern(name), each) for each in medians]
    return [match.group(1) for match in found if match]


def measured(row, medians):
    """(what, our time, their time, ratio) for each row of the table that this row stands for."""
    what, ours, theirs = row[:3]
    first = names_in(ours)[0]
    if "{}" in ours:
        for end in ends(first, "{}", medians):
            times = compare(ours.replace("{}", end), theirs.replace("{}", end), medians)
            yield what.replace("{}", end), *(times or (None, None))
    elif "*" in ours:
        pairs = [compare(ours.replace("*", end), theirs.replace("*", end), medians) for end in ends(first, "*", medians)]
        pairs = [pair for pair in pairs if pair]
        mean = [math.exp(statistics.mean(math.log(time) for time in side)) for side in zip(*pairs)]
        yield what, *(mean or (None, None))
    else:
        yield what, *(compare(ours, theirs, medians) or (None, None))


def run_commands(rows, programs, folder):
    """The median wall time of each command, all of them in turn."""
    commands = {command: [] for row in rows for command in row[1:3]}
    environment = {**os.environ, "PATH": f"{programs}:{os.environ['PATH']}"}
    for _ in range(SHELL_ROUNDS):
        for command, times in commands.items():
            start = time.perf_counter()
            subprocess.run(shlex.split(command), check=True, cwd=folder, env=environment, stderr=subprocess.DEVNULL)
            times.append(time.perf_counter() - start)
    return {command: 1e9 * statistics.median(times) for command, times in commands.items()}


def duration(nanos):
    for unit, size in (("s", 1e9), ("ms", 1e6), ("µs", 1e3)):
        if nanos >= size:
            return f"{nanos / size:.3g} {unit}"
    return f"{nanos:.3g} ns"


def table_row(what, ours, theirs, row):
    peer, goal, limit = row[3:6]
    if ours is None:
        return f"| {what} | – | – | not measured | {goal} | {peer} | {limit} |"
    share = "@" in row[1]  # no times
    ratio = f"{ours / theirs:.3g}" if theirs else ""
    missed = goal and (ours / theirs > float(goal) if theirs else ours > 1e3 * float(goal.split()[0]))
    shown = ratio or duration(ours)
    shown = f"**{shown}**" if missed else shown
    mine, other = ("", "") if share or not theirs else (duration(ours), duration(theirs))
    return f"| {what} | {mine} | {other} | {shown} | {goal} | {peer} | {limit if missed else ''} |"


def main(programs, folder):
    rows = read_rows(pathlib.Path(__file__).parent.parent / "Bench/rows.txt")
    shell_rows = [row for section, row in rows if section == SHELL]
    commands = run_commands(shell_rows, programs, folder)
    medians = run_benchmarks(f"{programs}/dsp_bench", rows)
    for section in dict.fromkeys(section for section, _ in rows):
        print(f"\n## {section}\n")
        if section in EXPLAINED:
            print(EXPLAINED[section] + "\n")
        print("| | Ours | Theirs | Ratio | Goal | Beside | Limit |\n|---|---|---|---|---|---|---|")
        for row in (row for each, row in rows if each == section):
            if section == SHELL:
                print(table_row(row[0], commands[row[1]], commands[row[2]], row))
                continue
            for what, ours, theirs in measured(row, medians):
                print(table_row(what, ours, theirs, row))


if __name__ == "__main__":
    main(*sys.argv[1:3])
