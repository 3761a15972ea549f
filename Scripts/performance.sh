#!/usr/bin/env bash
# performance.sh [--write]: measures the library beside its packaged peers (Bench/rows.txt) and prints the tables of
# Docs/performance.md, or puts them there, and tells which rows miss their goals. About five minutes on a machine with
# nothing else to do, after the builds.
set -euo pipefail
cd "$(dirname "$0")/.."
source Scripts/common.sh

load=$(cut -d' ' -f1 /proc/loadavg)  # before this script adds to it

peers=(ffmpeg sox swh-plugins caps guitarix-ladspa libsoxr0 libfftw3-single3 libaubio5 libsoundtouch1 libcairo2
    swh-lv2 lsp-plugins-lv2 mda-lv2 calf-plugins)
need_packages "${BUILD_PACKAGES[@]}" libbenchmark-dev ladspa-sdk libavfilter-dev libswresample-dev libsoxr-dev \
    libfftw3-dev libaubio-dev liblilv-dev sonic-pi-samples libsox-fmt-base "${peers[@]}" >&2
{
    say "building (bench)"
    build_preset bench dsp_bench dsphost
    say "building (nothing but SSE2)"
    build_baseline dsp_bench
} >&2

recordings=$(mktemp -d)
trap 'rm -rf "$recordings"' EXIT
sample=$(dpkg -L sonic-pi-samples | grep -m1 '/loop_amen_full\.')
for rate in 44100 48000; do
    sox -R -V1 "$sample" -b 16 "$recordings/in${rate:0:2}.wav" repeat 99 vol 0.5 rate -v $rate trim 0 600
done

say "measuring" >&2
tables=$recordings/tables.md
{
    printf 'Measured on %s on one %s, with %s, by\n' \
        "$(date -u +%F)" "$(processor_and_load "$load")" "$(c++ --version | head -1)"
    printf '`Scripts/performance.sh`, beside these Debian packages:\n'
    dpkg-query -W -f='`${Package}` ${Version}\n' "${peers[@]}" | sort -u | paste -sd, | sed 's/,/, /g; s/$/./'
    printf '\nA ratio is our time to theirs, so that below 1 ours is the quicker one. Times are medians of rounds in turn.\n'
    Scripts/performance.py "$PWD/build/bench/bin" "$PWD/build/baseline/bin" "$recordings"
} >"$tables"

if [ "${1:-}" = --write ]; then
    sed -i '/^<!-- Measured/q' Docs/performance.md
    cat "$tables" >>Docs/performance.md
else
    cat "$tables"
fi
