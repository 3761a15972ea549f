#!/usr/bin/env bash
# fuzz.sh [SECONDS]: builds as ./check asan does, with Clang, warnings as errors, and lets each fuzzer run its share of the time
# (60 s in all when nothing is said). ./check fuzz
# Sessions are long from the start: from short ones a minute never gets there. Corpora grow in build/fuzz. An input
# that fails is left in build/fuzz/failed/TARGET: mend the fault, and keep the input in Fuzz/Failed/TARGET under a
# name that says what it was.
set -euo pipefail
cd "$(dirname "$0")/.."
source Scripts/common.sh
seconds=${1:-60}

need_packages "${BUILD_PACKAGES[@]}" "${TEST_PACKAGES[@]}" "${CLANG_PACKAGES[@]}"
say "building (asan)"
build_preset asan

work=build/fuzz programs=build/asan/bin
Fuzz/seeds.sh $programs/dsphost $work/seeds
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
    local report=$work/$target.log
    mkdir -p "$work/corpus/$target" "$work/failed/$target" "$work/seeds/$target"
    local known=()  # what failed before
    [ ! -d "Fuzz/Failed/$target" ] || known=("Fuzz/Failed/$target")
    "$program" -max_total_time="$share" -timeout=20 -rss_limit_mb=3000 -max_len=8192 -len_control=0 -print_final_stats=1 \
        -artifact_prefix="$work/failed/$target/" "$work/corpus/$target" "$work/seeds/$target" "${known[@]}" 2>&1 |
        grep -v '^dsphost: warning' > "$report" || {
        tail -n 60 "$report"
        echo "$target: FAILED; the input is in $work/failed/$target"
        return 1
    }
    sed -n "s/^Done \([0-9]*\) runs.*/$target: \1 runs/p" "$report"
}
export -f fuzz
export SHELLOPTS  # failures inside pipes count there too
export work share

say "fuzzing, $share s for each of ${#fuzzers[@]} targets"
printf '%s\0' "${fuzzers[@]}" | xargs -0 -n 1 -P "$(nproc)" bash -c 'fuzz "$1"' fuzz
