# What the scripts of the Windows target share; sourced by each of them.
step=win32
source "$(dirname "${BASH_SOURCE[0]}")/roots-common.sh"

# The step cannot be done on this machine: one line, and the exit status that test drivers take for
# "skipped".
skip() {
    echo "win32: skipped: $*"
    exit 77
}

[ "$(id -u)" = 0 ] || skip "needs root (packages, and an i386 root for Wine)"
mkdir -p "$cache"

WIN32_PACKAGES=(g++-mingw-w64-i686-posix debootstrap dpkg-dev googletest sonic-pi-samples util-linux zip unzip
    "${BUILD_PACKAGES[@]}" "${TEST_PACKAGES[@]}")
need_win32_packages() {
    need_packages "${WIN32_PACKAGES[@]}" >&2 || skip "packages are missing and could not be installed (no network?)"
}
