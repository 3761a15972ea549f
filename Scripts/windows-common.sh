# What the scripts of the Windows targets share. Each of them sources this; its first argument is the target,
# win32 or win64.
target=${1:-}
case $target in
    win32) processor=i686 own_packages=(g++-mingw-w64-i686-posix debootstrap) ;;
    win64) processor=x86_64 own_packages=(g++-mingw-w64-x86-64-posix wine64 xvfb libgl1 libgl1-mesa-dri) ;;
    *)
        echo "usage: ${0##*/} win32|win64 ..." >&2
        exit 2
        ;;
esac
step=$target
source "$(dirname "${BASH_SOURCE[0]}")/roots-common.sh"

# The step cannot be done on this machine: one line, and the exit status that test drivers take for
# "skipped".
skip() {
    echo "$target: skipped: $*"
    exit 77
}

[ "$(id -u)" = 0 ] || skip "needs root (packages, and mounts for Wine)"
mkdir -p "$cache"

WINDOWS_PACKAGES=("${own_packages[@]}" clang lld llvm dpkg-dev googletest sonic-pi-samples sox util-linux zip unzip
    "${BUILD_PACKAGES[@]}" "${TEST_PACKAGES[@]}")
need_windows_packages() {
    need_packages "${WINDOWS_PACKAGES[@]}" >&2 || skip "packages are missing and could not be installed (no network?)"
}

# Wine's own folder is /tmp/wine, wherever it runs.
export HOME_OF_WINE=/tmp/wine
export WINEPREFIX=$HOME_OF_WINE/prefix WINEARCH=$target

# Mounts what Wine sees as the root: an i386 root of its own, or this system for the 64-bit Wine, which Debian
# has beside everything else; with temporary files of its own in either. Sets `system` to where that is. For a
# name space of mounts that ends with its caller.
mount_system() {
    system=$root
    if [ "$target" = win64 ]; then
        system=$root/system
        mount --rbind / "$system"
    else
        mount --bind /dev "$system/dev"
    fi
    mount -t proc proc "$system/proc"
    mount -t tmpfs tmpfs "$system/tmp"
    mkdir "$system$HOME_OF_WINE"
    mount --bind "$root/wine" "$system$HOME_OF_WINE"
}
export -f mount_system
export target
