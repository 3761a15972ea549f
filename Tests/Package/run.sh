#!/usr/bin/env bash
# Installs the build into a folder, moves that folder, and builds and runs the README's example against it
# with find_package and with pkg-config, and the examples.
set -euo pipefail
source_dir=$1 build_dir=$2 compiler=$3
here=$(cd "$(dirname "$0")" && pwd)
work=$build_dir/package-test
rm -rf "$work"
mkdir -p "$work/example"

cmake --install "$build_dir" --prefix "$work/first" >/dev/null
mv "$work/first" "$work/installed"

if [ -x "$work/installed/bin/dsphost" ]; then "$work/installed/bin/dsphost" --version; fi
if [ -x "$work/installed/bin/dspdll-analyser" ]; then
    "$work/installed/bin/dspdll-analyser" --version
    for file in man/man1/dspdll-analyser.1 bash-completion/completions/dspdll-analyser \
        applications/dspdll-analyser.desktop icons/hicolor/scalable/apps/dspdll-analyser.svg; do
        [ -s "$work/installed/share/$file" ]
    done
fi

# The examples are the README's only blocks of C++ and of C.
for language in cpp c; do
    awk -v start="\`\`\`$language" '$0 == start {on = 1; next} /^```$/ {on = 0} on' "$source_dir/README.md" \
        > "$work/example/example.$language"
    [ -s "$work/example/example.$language" ]
done
cp "$here/CMakeLists.txt" "$here/drawing.cpp" "$source_dir/Tests/C/consumer.c" "$work/example/"

cmake -G Ninja -S "$work/example" -B "$work/by-cmake" -DCMAKE_PREFIX_PATH="$work/installed" \
    -DCMAKE_CXX_COMPILER="$compiler" >/dev/null
cmake --build "$work/by-cmake" >/dev/null
by_cmake=$("$work/by-cmake/example")
drawing=$(find "$work/installed" -name dspdrawing.pc)
if [ -n "$drawing" ]; then "$work/by-cmake/drawing"; fi

# The examples, as a user builds them.
cmake -G Ninja -S "$source_dir/examples" -B "$work/examples" -DCMAKE_PREFIX_PATH="$work/installed" \
    -DCMAKE_CXX_COMPILER="$compiler" >/dev/null
cmake --build "$work/examples" >/dev/null
ctest --test-dir "$work/examples" --no-tests=error --output-on-failure

pc=$(find "$work/installed" -name dspdll.pc)
export PKG_CONFIG_PATH=${pc%/*}
# shellcheck disable=SC2046
"$compiler" "$work/example/example.cpp" -o "$work/by-pkg-config" $(pkg-config --cflags --libs dspdll) \
    -Wl,-rpath,"$(pkg-config --variable=libdir dspdll)"
by_pkg_config=$("$work/by-pkg-config")
if [ -n "$drawing" ]; then
    # shellcheck disable=SC2046
    "$compiler" "$work/example/drawing.cpp" -o "$work/drawing" $(pkg-config --cflags --libs dspdrawing) \
        -Wl,-rpath,"$(pkg-config --variable=libdir dspdrawing)"
    "$work/drawing"
fi

"$work/by-cmake/consumer"
in_c=$("$work/by-cmake/c_example")
echo "the example in C says: $in_c"
[ "${in_c% *}" = "after 0.64 s:" ] && [ "${in_c##* }" != 0.0000 ]
echo "the example says: $by_cmake"
[ -n "$by_cmake" ] && [ "$by_cmake" = "$by_pkg_config" ]
