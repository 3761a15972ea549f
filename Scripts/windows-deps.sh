#!/usr/bin/env bash
# windows-deps.sh win32|win64
# Builds the libraries the Windows target needs into a cached prefix, once, and prints where it is:
# GoogleTest, SoundTouch and libsndfile from Debian's sources, the header-only ones linked from the system.
# The prefix is named after the checksum of this script and the toolchain files, which find it by that.
source "$(dirname "$0")/windows-common.sh"

prefix=$(place_of prefix "$0" "$tree"/cmake/{windows,$target}-toolchain.cmake)
exec 8> "$cache/prefix.lock"
flock 8
if [ -d "$prefix" ]; then
    touch "$prefix"
    echo "$prefix"
    exit
fi

need_windows_packages
work=$(mktemp -d "$cache/deps.XXXXXX")
part=$(mktemp -d "$cache/prefix.part.XXXXXX")
trap 'rm -rf "$work" "$part"' EXIT
cd "$work"

fetch_sources() {
    own_lists deb-src
    own_apt update
    own_apt source "$@"
}

# build SOURCE [CMAKE OPTION...]
build() {
    local source=$1
    shift
    cmake -G Ninja -S "$source" -B "$source.build" -DCMAKE_BUILD_TYPE=Release \
        -DCMAKE_TOOLCHAIN_FILE="$tree/cmake/$target-toolchain.cmake" -DDSP_MAKING_PREFIX=ON \
        -DCMAKE_INSTALL_PREFIX="$part" "$@"
    cmake --build "$source.build" --target install
}

# header_only PACKAGE TARGET FOLDER: links the folder and describes it to find_package. The system's whole
# include folder must not come onto a cross compiler's path.
header_only() {
    local package=$1 target=$2 folder=$3
    mkdir -p "$part/include" "$part/lib/cmake/$package"
    ln -s "/usr/include/$folder" "$part/include/$folder"
    cat > "$part/lib/cmake/$package/${package}Config.cmake" <<END
if(NOT TARGET $target)
    add_library($target INTERFACE IMPORTED)
    set_target_properties($target PROPERTIES
        INTERFACE_INCLUDE_DIRECTORIES "\${CMAKE_CURRENT_LIST_DIR}/../../../include")
endif()
END
    # The native build asks for the version; the headers are the same.
    echo 'set(PACKAGE_VERSION_COMPATIBLE TRUE)' > "$part/lib/cmake/$package/${package}ConfigVersion.cmake"
}

build_all() {
    cp -r /usr/src/googletest .
    build googletest -DBUILD_GMOCK=OFF
    mv soundtouch-*/ soundtouch
    build soundtouch -DSOUNDSTRETCH=OFF -DBUILD_SHARED_LIBS=OFF
    # Its CMake package leaves out the folder that its headers are in.
    sed -i 's|{_IMPORT_PREFIX}/include;|{_IMPORT_PREFIX}/include/soundtouch;|' \
        "$part/lib/cmake/SoundTouch/SoundTouchTargets.cmake"
    mv libsndfile-*/ libsndfile
    build libsndfile -DBUILD_SHARED_LIBS=OFF -DBUILD_PROGRAMS=OFF -DBUILD_EXAMPLES=OFF -DBUILD_TESTING=OFF \
        -DENABLE_EXTERNAL_LIBS=OFF -DENABLE_MPEG=OFF
    header_only xsimd xsimd xsimd
    header_only nlohmann_json nlohmann_json::nlohmann_json nlohmann
    header_only CLI11 CLI11::CLI11 CLI
    # Made in one place and moved to another.
    sed -i 's|^prefix=.*|prefix=${pcfiledir}/../..|' "$part"/lib/pkgconfig/*.pc
}

# Runs a function with its output in the log and its status in $status. Called on a line of its own: inside a
# condition the shell would go on after errors.
log=$cache/deps.log
logged() {
    set +e
    (set -e; "$@") >> "$log" 2>&1
    status=$?
    set -e
}

: > "$log"
logged fetch_sources soundtouch libsndfile
[ $status = 0 ] || skip "Debian's source packages could not be fetched (no network?), see $log"
logged build_all
if [ $status != 0 ]; then
    grep -iE 'error|cannot' "$log" | tail -n 20 >&2
    echo "$target: a library for the target did not build; the whole log is $log" >&2
    exit 1
fi

chmod 755 "$part"
mv "$part" "$prefix"
remove_older prefix "$prefix"
echo "$prefix"
