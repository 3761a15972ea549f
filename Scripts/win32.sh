#!/usr/bin/env bash
# Builds the Windows DLL and everything around it, and runs the tests under Wine: ./check win32.
# What it needs is made on the first run and kept in the cache. Exits 77 where it cannot run at all: no root,
# or no network on the first run.
source "$(dirname "$0")/win32-common.sh"
cd "$tree"

need_win32_packages

# The root for Wine takes the network and one core for a minute; the libraries are built beside it.
say "libraries for the target and the i386 root (kept in $cache)"
Scripts/win32-root.sh > "$cache/root.answer.$$" &
root_job=$!
prefix_status=0
prefix=$(Scripts/win32-deps.sh) || prefix_status=$?
root_status=0
wait $root_job || root_status=$?
root=$(tail -n 1 "$cache/root.answer.$$")
rm -f "$cache/root.answer.$$"
[ $prefix_status = 0 ] || { echo "$prefix"; exit $prefix_status; }
[ $root_status = 0 ] || { echo "$root"; exit $root_status; }

say "building (win32)"
# Paths of an earlier prefix would stick in the cache of the build.
fresh=()
if [ -f build/win32/CMakeCache.txt ] && ! grep -qF "$prefix/" build/win32/CMakeCache.txt; then fresh=(--fresh); fi
cmake --preset win32 "${fresh[@]}" > /dev/null
cmake --build --preset win32

say "exported names"
Tests/Exports/exports.sh check build/win32/bin/DSPDll.dll Tests/Exports/win32.txt

say "testing under Wine"
report=build/win32/dsp_tests.report
Scripts/win32-wine.sh build/win32/bin/dsp_tests.exe | tee "$report"
grep -qE '^\[==========\] [1-9][0-9]* tests? from .* ran\.' "$report" || {
    echo "win32: the test program ran no test"
    exit 1
}
