#!/usr/bin/env bash
# windows.sh win32|win64
# Builds a Windows DLL and everything around it, and runs the tests under Wine: ./check win32, ./check win64.
# What it needs is made on the first run and kept in the cache. Exits 77 where it cannot run at all: no root,
# or no network on the first run.
source "$(dirname "$0")/windows-common.sh"
cd "$tree"
build=build/$target

need_windows_packages
on_wine() { Scripts/windows-wine.sh "$target" "$@"; }

# The root for Wine takes the network's time more than this machine's: it is made beside everything up to the
# first program that runs.
answer=$(mktemp)
trap 'rm -f "$answer"' EXIT
Scripts/windows-root.sh "$target" > "$answer" &
root_job=$!
root_ready() {
    local status=0
    wait $root_job || status=$?
    [ $status = 0 ] || { cat "$answer"; exit $status; }
}

say "libraries for the target (kept in $cache)"
prefix=$(Scripts/windows-deps.sh "$target") || { status=$?; echo "$prefix"; root_ready; exit $status; }

say "building ($target)"
# Paths of an earlier prefix would stick in the cache of the build.
fresh=()
if [ -f $build/CMakeCache.txt ] && ! grep -qF "$prefix/" $build/CMakeCache.txt; then fresh=(--fresh); fi
cmake --preset "$target" "${fresh[@]}" > /dev/null
cmake --build --preset "$target" --target DSPDll dsp_tests c_interface_tests record_effects dsphost fuzz_replay
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
    local report=$build/$1.report
    on_wine "$build/bin/$1.exe" | tee "$report"
    grep -qE '^\[==========\] [1-9][0-9]* tests? from .* ran\.' "$report" || {
        echo "$1 ran no test"
        return 1
    }
}

compare_builds() {
    build_preset release record_effects
    on_wine $build/bin/record_effects.exe windows.takes
    build/release/bin/record_effects build/release/native.takes $build/bin/windows.takes
}

package=$build/package/DSPDll programs=$build/package/DSPDll/bin
unpack() {
    cpack --config $build/CPackConfig.cmake -B $build/package > /dev/null
    rm -rf $package
    unzip -q $build/package/DSPDll-*-$target.zip -d $package
    mv $package/*/* $package  # out of the folder that has the version in its name
}

# The fuzzers do not build for this target; what they found is replayed, and their sessions run on random input.
replay_failed() {
    cp -r Fuzz/Failed $build/bin/
    on_wine $build/bin/fuzz_replay.exe Failed
    on_wine $build/bin/fuzz_replay.exe --soak 15 "$RANDOM" soak
}

# From the unpacked zip alone the host renders a file to the same bytes as the native one.
try_package() {
    unpack
    ls $programs
    build_preset release dsphost
    local render=(render -q -y --fx "Gain: Gain=-3") host=build/release/bin/dsphost
    "$host" render -q -y --fx Gain --format f32 "$(dpkg -L sonic-pi-samples | grep -m1 '/loop_amen\.flac$')" \
        $programs/loop.wav
    "$host" "${render[@]}" $programs/loop.wav $package/here.wav
    on_wine $programs/dsphost.exe "${render[@]}" loop.wav there.wav
    cmp $package/here.wav $programs/there.wav
    echo "dsphost.exe rendered the same $(stat -c %s $package/here.wav) bytes as the native host"
    on_wine $programs/dsphost.exe sonogram -q -y loop.wav picture.png --spectrum
    cmp -n 8 $programs/picture.png <(printf '\x89PNG\r\n\x1a\n')
    echo "dsphost.exe drew a picture of $(stat -c %s $programs/picture.png) bytes"
}

# A host in C with nothing but the package, which needs none of the flags that hosts in C++ need.
try_c_interface() {
    "$processor-w64-mingw32-gcc-posix" -std=c11 -Wall -Wextra -Werror -DDSP_TEST_DRAWS -I $package/include/DSPDll \
        Tests/C/consumer.c $package/lib/DSPDll.lib -o $programs/consumer.exe
    on_wine $programs/consumer.exe
}

# The other compiler family: its compiler takes the package's headers, its linker the import library. It has no C
# library here.
try_other_compilers() {
    local own=$build/other-compilers
    rm -rf "$own"
    cmake -G Ninja -S Tests/C/OtherCompilers -B "$own" -DCMAKE_BUILD_TYPE=Release -DCMAKE_SYSTEM_NAME=Windows \
        -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++ -DCMAKE_TRY_COMPILE_TARGET_TYPE=STATIC_LIBRARY \
        -DCMAKE_{C,CXX}_COMPILER_TARGET=$processor-pc-windows-msvc -DCMAKE_MSVC_RUNTIME_LIBRARY= \
        -DCMAKE_{C,CXX}_STANDARD_LIBRARIES= -DCMAKE_{C,CXX}_FLAGS="-ffreestanding -Wall -Wextra -Wpedantic -Werror" \
        -DCMAKE_C_STANDARD=11 -DCMAKE_CXX_STANDARD=11 -DCMAKE_PREFIX_PATH="$PWD/$package" \
        -DFUNCTIONS="$PWD/$build/Tests/C" > /dev/null
    cmake --build "$own"
    cp "$own/freestanding.exe" $programs
    on_wine $programs/freestanding.exe || {
        echo "freestanding.exe says that step $? failed"
        return 1
    }
    echo "a program of the other compiler family found every function and used some"
}

# The example of a window with the analyser, built against the package as a host would; its picture is of the end
# of a recording.
try_window() {
    local flags="-std=c++20 -O2 -Wall -Wextra -Werror -msse2 -mfpmath=sse"
    [ "$target" != win32 ] || flags+=" -mstackrealign -faligned-new=8"
    "$processor-w64-mingw32-g++-posix" $flags -mwindows -I $package/include/DSPDll \
        examples/windows-analyser/windows-analyser.cpp $package/lib/libDSPDll.dll.a -ld2d1 -lole32 -lwindowscodecs -luuid \
        -o $programs/windows-analyser.exe
    sox "$(dpkg -L sonic-pi-samples | grep -m1 '/guit_em9\.flac$')" -b 16 $programs/guitar.wav
    on_wine $programs/windows-analyser.exe guitar.wav window.bmp
    python3 - $programs/window.bmp <<'END'
import sys
pixels = open(sys.argv[1], "rb").read()[54:]
colours = {pixels[i:i + 3] for i in range(0, len(pixels), 4)}
assert len(pixels) == 4 * 984 * 661 and len(colours) > 200, (len(pixels), len(colours))
print("the window's picture has", len(colours), "colours")
END
}

part "tests under Wine" test_program dsp_tests
part "tests of the C interface under Wine" test_program c_interface_tests
part "hardening" Tests/Package/hardening.sh $build/bin/{DSPDll.dll,dsphost.exe}
part "exported names" Tests/Exports/exports.sh check $build/bin/DSPDll.dll
part "the native build and this one" compare_builds
part "inputs that failed once" replay_failed
part "package" try_package
part "C interface" try_c_interface
part "window" try_window
part "other compilers" try_other_compilers

[ ${#failed[@]} = 0 ] || {
    printf '\n%s: FAILED:\n' "$target"
    printf '    %s\n' "${failed[@]}"
    exit 1
}
printf '\n%s: everything passed\n' "$target"
