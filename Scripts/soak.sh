#!/usr/bin/env bash
# soak.sh [SECONDS] [SEED]: random sessions with edits, formats, presets and pictures over all effects, the analyser
# and everything else that Fuzz has, under the address sanitizer; fails too when memory grows. 600 s, and
# another seed each time, when nothing is said. The last session of each kind is left in build/soak: after a fault
# `build/asan/bin/fuzz_replay build/soak` repeats it.
set -euo pipefail
cd "$(dirname "$0")/.."
source Scripts/common.sh
seconds=${1:-600} seed=${2:-$RANDOM}

need_packages "${BUILD_PACKAGES[@]}" "${TEST_PACKAGES[@]}" "${CLANG_PACKAGES[@]}"
say "building (asan)"
build_preset asan fuzz_replay

say "$seconds s"
# What was freed is kept for a while to be watched: little of it, so that growth is seen.
export ASAN_OPTIONS=allocator_may_return_null=1:quarantine_size_mb=16
export LSAN_OPTIONS=suppressions=$PWD/Tests/leaks.supp:print_suppressions=0
exec build/asan/bin/fuzz_replay --soak "$seconds" "$seed" build/soak
