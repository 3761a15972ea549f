# Shared by the scripts of this project; sourced with the project's root as working directory.

say() { printf '\n== %s\n' "$*"; }

# Installs the Debian packages that are missing; needs root or sudo only then.
need_packages() {
    local missing=()
    for package in "$@"; do
        dpkg-query -W -f='${Status}' "$package" 2>/dev/null | grep -q 'ok installed' || missing+=("$package")
    done
    [ ${#missing[@]} -gt 0 ] || return 0
    local as_root=()
    if [ "$(id -u)" -ne 0 ]; then
        command -v sudo >/dev/null || {
            echo "missing packages, and neither root nor sudo to install them: ${missing[*]}" >&2
            return 1
        }
        as_root=(sudo)
    fi
    say "installing ${missing[*]}"
    "${as_root[@]}" apt-get update -q >/dev/null
    "${as_root[@]}" env DEBIAN_FRONTEND=noninteractive \
        apt-get install -q -y --no-install-recommends "${missing[@]}" >/dev/null
}

BUILD_PACKAGES=(g++ cmake ninja-build ccache pkg-config libxsimd-dev libsndfile1-dev libcli11-dev
    nlohmann-json3-dev libsoundtouch-dev libcairo2-dev libpango1.0-dev libsdl2-dev fonts-dejavu-core)
TEST_PACKAGES=(libgtest-dev binutils abigail-tools)
CLANG_PACKAGES=(clang libclang-rt-dev libbenchmark-dev)  # the preset asan builds the benchmarks, too
PLUGIN_PACKAGES=(dpf-source libxcb1-dev)

# What installs them by hand.
install_command() { echo "apt-get install --no-install-recommends ${BUILD_PACKAGES[*]} ${TEST_PACKAGES[*]}"; }

# Configures and builds one preset, or the named targets of it.
build_preset() {
    local preset=$1
    shift
    cmake --preset "$preset" >/dev/null
    cmake --build --preset "$preset" ${1:+--target "$@"}
}

# The benchmarks of a library that keeps to SSE2, in build/baseline.
build_baseline() {
    cmake --preset bench -B build/baseline -DDSP_BUILD_APPS=OFF "-DCMAKE_CXX_FLAGS=${CXXFLAGS:-} -DDSP_BASELINE_ONLY" >/dev/null
    cmake --build build/baseline --target "$@"
}

# What a measurement says of the machine: the processor, and the load average of the minute before it began.
processor_and_load() {
    printf '%s (%s processors, a load average of %s in the minute before)' \
        "$(sed -n 's/^model name[^:]*: //p' /proc/cpuinfo | head -1)" "$(nproc)" "$1"
}

# Puts the typeface of the drawings into a folder; Debian has no package of it.
fetch_montserrat() {
    command -v npm >/dev/null || return 1
    local download
    download=$(mktemp -d)
    mkdir -p "$1"
    (cd "$download" && timeout 60 npm pack --silent @expo-google-fonts/montserrat >/dev/null && tar xzf ./*.tgz) &&
        cp "$download/package/400Regular/Montserrat_400Regular.ttf" "$1"
    local status=$?
    rm -rf "$download"
    return $status
}
