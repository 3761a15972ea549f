#!/usr/bin/env bash
# compare-targets.sh win32|win64 [TURNS] [--write]
# How much longer the kernels take in a Windows DLL than in the native library, on this processor, and than in one
# with nothing but SSE2. All run in turn, 5 times when nothing is said, and the medians are divided. Wine adds
# nothing to arithmetic. Wanted of win32: 1.2 times the time with SSE2, at most 1.5. --write puts its table into
# Docs/performance.md.
source "$(dirname "$0")/windows-common.sh"
cd "$tree"
load=$(cut -d' ' -f1 /proc/loadavg)  # before this script adds to it
turns=5 write=
for argument in "${@:2}"; do
    case $argument in
        --write) [ "$target" = win32 ] && write=1 || { echo "--write is for win32" >&2; exit 2; } ;;
        *) turns=$argument ;;
    esac
done

need_windows_packages
need_packages libbenchmark-dev
prefix=$(Scripts/windows-deps.sh "$target") || skip "no libraries for the target"
say "building"
cmake --preset bench > /dev/null
cmake --build --preset bench --target kernel_times > /dev/null
build_baseline kernel_times > /dev/null
cmake --preset "$target" -DDSP_BUILD_BENCH=ON > /dev/null
cmake --build --preset "$target" --target kernel_times > /dev/null

times=$(mktemp -d)
trap 'rm -rf "$times"' EXIT
for turn in $(seq "$turns"); do
    build/bench/bin/kernel_times > "$times/native.$turn"
    build/baseline/bin/kernel_times > "$times/baseline.$turn"
    Scripts/windows-wine.sh "$target" "build/$target/bin/kernel_times.exe" > "$times/target.$turn"
done
{
    printf '\nMeasured on %s on one %s, by `Scripts/compare-targets.sh %s`.\n\n' \
        "$(date -u +%F)" "$(processor_and_load "$load")" "$target"
    python3 - "$times" "$target" <<'END'
import pathlib, statistics, sys

def medians(build):
    times = {}
    for turn in sorted(pathlib.Path(sys.argv[1]).glob(build + ".*")):
        for line in turn.read_text().splitlines():
            name, nanoseconds = line.split("\t")
            times.setdefault(name, []).append(float(nanoseconds))
    return {name: statistics.median(found) for name, found in times.items()}

native, baseline, target = medians("native"), medians("baseline"), medians("target")
assert native.keys() == baseline.keys() == target.keys(), "the builds measured different kernels"
print(f"| Kernel | native, ns | SSE2 only, ns | {sys.argv[2]}, ns | to native | to SSE2 |\n|---|---|---|---|---|---|")
for name, time in target.items():
    print(f"| {name} | {native[name]:.2f} | {baseline[name]:.2f} | {time:.2f} |"
          f" {time / native[name]:.2f} | {time / baseline[name]:.2f} |")
for plain in (name for name in target if name.startswith("plain ")):
    kernel = plain.removeprefix("plain ")
    print(f"\n\"{kernel}\" takes {target[kernel] / target[plain]:.2g} of the time of \"{plain}\" on {sys.argv[2]}, and"
          f" {native[kernel] / native[plain]:.2g} in the native library.")
END
    echo
} > "$times/table.md"
if [ "$write" ]; then
    # Between the two marks, which stay.
    sed -i -e "/^<!-- win32/r $times/table.md" -e '/^<!-- win32/,/^<!-- end of win32/{/^<!-- /!d}' Docs/performance.md
else
    cat "$times/table.md"
fi
