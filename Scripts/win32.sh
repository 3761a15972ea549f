#!/usr/bin/env bash
# Builds the Windows DLL and everything around it, and runs the tests under Wine: ./check win32.
# What it needs is made on the first run and kept in the cache. Exits 77 where it cannot run at all: no root,
# or no network on the first run.
source "$(dirname "$0")/win32-common.sh"
cd "$tree"

need_win32_packages

# The root for Wine takes the network's time more than this machine's: it is made beside everything up to the
# first program that runs.
answer=$(mktemp)
trap 'rm -f "$answer"' EXIT
Scripts/win32-root.sh > "$answer" &
root_job=$!
root_ready() {
    local status=0
    wait $root_job || status=$?
    [ $status = 0 ] || { cat "$answer"; exit $status; }
}

say "libraries for the target (kept in $cache)"
prefix=$(Scripts/win32-deps.sh) || { status=$?; echo "$prefix"; root_ready; exit $status; }

say "building (win32)"
# Paths of an earlier prefix would stick in the cache of the build.
fresh=()
if [ -f build/win32/CMakeCache.txt ] && ! grep -qF "$prefix/" build/win32/CMakeCache.txt; then fresh=(--fresh); fi
cmake --preset win32 "${fresh[@]}" > /dev/null
cmake --build --preset win32 --target DSPDll dsp_tests record_effects dsphost
root_ready

# Every part runs even when one before it failed, so that one run tells all.
failed=()
part() {
    say "$1"
    set +e
    (set -e; "${@:2}")
    local status=$?
    set -e
    [ $status = 0 ] || failed+=("$1")
}

# GoogleTest's own report and verdict; a program that ran nothing has not passed.
test_program() {
    local report=build/win32/$1.report
    Scripts/win32-wine.sh "build/win32/bin/$1.exe" | tee "$report"
    grep -qE '^\[==========\] [1-9][0-9]* tests? from .* ran\.' "$report" || {
        echo "$1 ran no test"
        return 1
    }
}

compare_builds() {
    build_preset release record_effects
    Scripts/win32-wine.sh build/win32/bin/record_effects.exe win32.takes
    build/release/bin/record_effects build/release/native.takes build/win32/bin/win32.takes
}

# From the unpacked zip alone the host renders a file to the same bytes as the native one.
try_package() {
    local unpacked=build/win32/package/unpacked programs
    cpack --config build/win32/CPackConfig.cmake -B build/win32/package > /dev/null
    rm -rf "$unpacked"
    unzip -q build/win32/package/DSPDll-*-win32.zip -d "$unpacked"
    programs=$(echo "$unpacked"/*/bin)
    ls "$programs"
    build_preset release dsphost
    local render=(render -q -y --fx "Gain: Gain=-3") host=build/release/bin/dsphost
    "$host" render -q -y --fx Gain --format f32 /usr/share/sonic-pi/samples/loop_amen.flac "$programs/loop.wav"
    "$host" "${render[@]}" "$programs/loop.wav" "$unpacked/here.wav"
    Scripts/win32-wine.sh "$programs/dsphost.exe" "${render[@]}" loop.wav there.wav
    cmp "$unpacked/here.wav" "$programs/there.wav"
    echo "dsphost.exe rendered the same $(stat -c %s "$unpacked/here.wav") bytes as the native host"
    Scripts/win32-wine.sh "$programs/dsphost.exe" sonogram -q -y loop.wav picture.png --spectrum
    cmp -n 8 "$programs/picture.png" <(printf '\x89PNG\r\n\x1a\n')
    echo "dsphost.exe drew a picture of $(stat -c %s "$programs/picture.png") bytes"
}

part "tests under Wine" test_program dsp_tests
part "hardening" Tests/Package/hardening.sh build/win32/bin/{DSPDll.dll,dsphost.exe}
part "exported names" Tests/Exports/exports.sh check build/win32/bin/DSPDll.dll
part "the native build and this one" compare_builds
part "package" try_package

[ ${#failed[@]} = 0 ] || {
    printf '\nwin32: FAILED: %s\n' "${failed[@]}"
    exit 1
}
printf '\nwin32: everything passed\n'
