#!/usr/bin/env bash
# fuzz.sh asan|asan32 [SECONDS]: builds as ./check asan does, with Clang, warnings as errors, or the same in 32 bits;
# replays what failed once, and lets each fuzzer run its share of the time (60 s in all when nothing is said).
# ./check fuzz, ./check fuzz32
# Sessions are long from the start: from short ones a minute never gets there. Corpora grow in build/fuzz. An input
# that fails is left in build/fuzz/failed/TARGET: mend the fault, and keep the input in Fuzz/Failed/TARGET under a
# name that says what it was.
set -euo pipefail
cd "$(dirname "$0")/.."
source Scripts/common.sh
preset=$1 seconds=${2:-60} memory=3000 longest=20

need_packages "${BUILD_PACKAGES[@]}" "${TEST_PACKAGES[@]}" "${CLANG_PACKAGES[@]}"
if [ "$preset" = asan32 ]; then
    memory=1500  # a process has 4 GiB, with what the address sanitizer keeps for itself
    longest=40  # sessions take up to twice as long
    Scripts/i386-root.sh
fi
say "building ($preset)"
build_preset "$preset"
build_preset release dsphost

work=build/fuzz programs=build/$preset/bin
Fuzz/seeds.sh build/release/bin/dsphost $work/seeds
fuzzers=($programs/fuzz_[A-Z]*)
share=$(((seconds + ${#fuzzers[@]} - 1) / ${#fuzzers[@]}))
export ASAN_OPTIONS=allocator_may_return_null=1 UBSAN_OPTIONS=print_stacktrace=1
# Pango has a thread of its own, and what that holds of GLib's memory looks lost in the middle of a run. At their end
# the tests of ./check asan look for it all the same.
{ cat Tests/leaks.supp; echo leak:libglib; } > $work/leaks.supp
export LSAN_OPTIONS=suppressions=$PWD/$work/leaks.supp:print_suppressions=0

# One fuzzer over its corpus; its report is shown when it finds something.
fuzz() {
    local program=$1 target=${1##*fuzz_}
    local report=$work/$preset-$target.log
    mkdir -p "$work/corpus/$target" "$work/failed/$target" "$work/seeds/$target"
    local known=()  # what failed before
    [ ! -d "Fuzz/Failed/$target" ] || known=("Fuzz/Failed/$target")
    "$program" -max_total_time="$share" -timeout="$longest" -rss_limit_mb="$memory" -max_len=8192 \
        -len_control=0 -print_final_stats=1 -artifact_prefix="$work/failed/$target/" \
        "$work/corpus/$target" "$work/seeds/$target" "${known[@]}" 2>&1 |
        grep -v '^dsphost: warning' > "$report" || {
        tail -n 60 "$report"
        echo "$target: FAILED; the input is in $work/failed/$target"
        return 1
    }
    sed -n "s/^Done \([0-9]*\) runs.*/$target: \1 runs/p" "$report"
}
export -f fuzz
export SHELLOPTS  # failures inside pipes count there too
export work preset memory longest share

"$programs/fuzz_replay" Fuzz/Failed

say "fuzzing, $share s for each of ${#fuzzers[@]} targets"
printf '%s\0' "${fuzzers[@]}" | xargs -0 -n 1 -P "$(nproc)" bash -c 'fuzz "$1"' fuzz
