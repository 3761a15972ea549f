#!/usr/bin/python3
"""Measures the rows of Bench/rows.txt and prints them as tables in Markdown: performance.py PROGRAMS BASELINE FOLDER
PROGRAMS holds dsp_bench and dsphost, BASELINE a dsp_bench of a library with nothing but SSE2; FOLDER holds the recordings
of the commands, and gets what they write. Which rows miss their goals stands on standard error."""

import json
import os
import pathlib
import re
import shlex
import statistics
import subprocess
import sys
import time

ROUNDS, SECONDS, SHELL_ROUNDS = 9, 0.02, 5
SHELL, BASELINE = "From a shell", "With SSE2 alone"
BENCH = pathlib.Path(__file__).parent.parent / "Bench"
EXPLAINED = {
    "Effects": "Stereo floats at 48 kHz, interleaved, blocks of 512; times are those of a frame. A percentage is the "
    "share of one core that real time takes.",
    BASELINE: "As above, with a library that keeps to SSE2, as on a processor without AVX2.",
    "Converter": "Stereo floats, times are those of an input frame. soxr's filter is far steeper than ours: "
    "[what ours does to sound](converter.md#what-it-does-to-sound).",
    "Analyser": "Times of transforms and of the spectrum are those of a sample. A frame is analysed and drawn; Cairo "
    "replays each fill, stroke and picture of it in the plainest way, without texts and without analysing anything. Times "
    "are means of 16 frames, one after the other.",
    "Session": "Tracks of gain, equaliser (4 bands), compressor, echo and reverb, each with settings of its own, on one "
    "thread; times are those of a frame of one track. Two threads take half of the tracks each, side by side; their time "
    "is the slower one's, on the processor, which says nothing of waiting, and on the clock, which other programs make "
    "longer. Opening: making an effect, restoring its settings and preparing it, while others of its kind are open; the "
    "memory is that of the pages that this touches.",
    SHELL: "Ten minutes of stereo, 16 bits, from file to file: whole processes in turn, and the time on the clock. "
    "soxr and sox filter far more steeply than our converter. ffmpeg's equaliser runs as it comes and, in a second row, "
    "with floats on one thread: with more it spends its time on waking them for each short block. Our files are on the disk "
    "when a command ends, theirs in the system's memory.",
}


def read_rows(path):
    """(section, [what, ours, theirs, peer, goal, remark]) in the file's order."""
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


def look_for_missing(program, rows):
    """Ends the program where a row names a benchmark that there is not. A peer that the sources have and the program
    has not is none of those: its library was not installed."""
    listed = subprocess.run([program, "--benchmark_list_tests"], check=True, stdout=subprocess.PIPE, text=True)
    listed = listed.stdout.splitlines()
    sources = "".join(source.read_text() for source in BENCH.glob("*.cpp"))
    missing = []
    for what, ours, theirs in (row[:3] for row in rows):
        for name in names_in(ours) + names_in(theirs):
            if any(re.fullmatch(pattern(name), each) for each in listed):
                continue
            function = re.compile(re.match(r"\w+", name).group() + r"\b")
            left_out = function.search(sources) and not any(function.match(each) for each in listed)
            if not (name in names_in(theirs) and left_out):
                missing.append(f"Bench/rows.txt: {what}: there is no benchmark {name}")
    if missing:
        sys.exit("\n".join(missing))


def run_benchmarks(program, rows):
    """The medians of all benchmarks that the rows name, by their names; a peer that is not installed has none."""
    names = {name for row in rows for name in names_in(row[1]) + names_in(row[2])}
    # The program knows other escapes than Python.
    wanted = "|".join(re.sub(r"\\.", ".", pattern(name)) for name in sorted(names))
    result = subprocess.run(
        [program, f"--benchmark_filter=^({wanted})$",
         "--benchmark_enable_random_interleaving", f"--benchmark_repetitions={ROUNDS}",
         f"--benchmark_min_time={SECONDS}", "--benchmark_report_aggregates_only", "--benchmark_format=json"],
        check=True, stdout=subprocess.PIPE)
    found = json.loads(result.stdout)["benchmarks"]
    medians = {each["run_name"]: each for each in found if each.get("aggregate_name") == "median"}
    failed = {each["run_name"]: each["error_message"] for each in found if each.get("error_occurred")}
    ours = "|".join(pattern(name) for row in rows for name in names_in(row[1]))
    for name, message in failed.items():
        if re.fullmatch(ours, name) or not message.endswith("not installed"):
            sys.exit(f"{name}: {message}")
    return medians


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
    """Our time and theirs; None for a peer that is not there. A counter is a share of a core."""
    if "@" in ours:
        name, counter = ours.split("@")
        return medians[name][counter] / 100, 1.0
    if any(name not in medians for name in names_in(theirs)):
        theirs = ""
    each_item = all("items_per_second" in medians[name] for name in names_in(ours) + names_in(theirs))
    return nanoseconds(ours, medians, each_item), nanoseconds(theirs, medians, each_item) if theirs else None


def ends(name, medians):
    """What stands for the sign in the names that were measured, by the numbers in it."""
    matches = [re.fullmatch(pattern(name), each) for each in medians]
    found = [match.group(1) for match in matches if match]
    return sorted(found, key=lambda end: [int(number) for number in re.findall(r"\d+", end)])


def measured(row, medians):
    """(what, our time, their time, ratio) for each row of the table that this row stands for."""
    what, ours, theirs = row[:3]
    first = names_in(ours)[0]
    if "{}" in ours:
        for end in ends(first, medians):
            yield what.format(*end.split("/")), *compare(ours.replace("{}", end), theirs.replace("{}", end), medians)
    elif "*" in ours:
        pairs = [compare(ours.replace("*", end), theirs.replace("*", end), medians) for end in ends(first, medians)]
        yield what, *(None if None in side else statistics.geometric_mean(side) for side in zip(*pairs))
    else:
        yield what, *compare(ours, theirs, medians)


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


def memory(row, medians):
    """What a benchmark counted beside the time."""
    counted = medians.get(row[1], {}).get("KB")
    return f", {counted:.0f} KB" if counted else ""


def table_row(what, ours, theirs, row, beside=""):
    peer, goal, remark = row[3:6]
    if row[2] and theirs is None:
        return f"| {what} | {duration(ours)} | | | {peer}, not installed | |"
    missed = goal and (ours / theirs > float(goal) if theirs else ours > 1e3 * float(goal.split()[0]))
    if missed:
        print(f"{what}, beside {peer}: above {goal}" if theirs else f"{what}: above {goal}", file=sys.stderr)
    remark = remark if missed else ""
    if "@" in row[1] or row[2] == "REAL_TIME":  # no times
        return f"| {what} | {100 * ours / theirs:.2g} % | | | {peer} | {remark} |"
    if not theirs:
        return f"| {what} | {duration(ours)}{beside} | | | | {remark} |"
    return f"| {what} | {duration(ours)} | {duration(theirs)} | {ours / theirs:.2g} | {peer} | {remark} |"


def main(programs, baseline, folder):
    rows = read_rows(BENCH / "rows.txt")
    sections = {section: [row for each, row in rows if each == section] for section, _ in rows}
    usual = [row for section, row in rows if section not in (SHELL, BASELINE)]
    look_for_missing(f"{programs}/dsp_bench", usual + sections[BASELINE])
    commands = run_commands(sections[SHELL], programs, folder)
    medians = run_benchmarks(f"{programs}/dsp_bench", usual)
    medians_of_baseline = run_benchmarks(f"{baseline}/dsp_bench", sections[BASELINE])
    for section, rows in sections.items():
        print(f"\n### {section}\n")
        if section in EXPLAINED:
            print(EXPLAINED[section] + "\n")
        print("| | Ours | Theirs | Ratio | Beside | Remark |\n|---|---|---|---|---|---|")
        found = medians_of_baseline if section == BASELINE else medians
        for row in rows:
            if section == SHELL:
                print(table_row(row[0], commands[row[1]], commands[row[2]], row))
                continue
            for what, ours, theirs in measured(row, found):
                print(table_row(what, ours, theirs, row, memory(row, found)))


if __name__ == "__main__":
    main(*sys.argv[1:4])
