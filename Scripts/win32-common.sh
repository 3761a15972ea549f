# What the scripts of the Windows target share; sourced by each of them.
set -euo pipefail

tree=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
source "$tree/Scripts/common.sh"
cache=${XDG_CACHE_HOME:-${HOME:=/root}/.cache}/dspdll/win32
export HOME

# The step cannot be done on this machine: one line, and the exit status that test drivers take for
# "skipped".
skip() {
    echo "win32: skipped: $*"
    exit 77
}

[ "$(id -u)" = 0 ] || skip "needs root (packages, and an i386 root for Wine)"
mkdir -p "$cache"

WIN32_PACKAGES=(g++-mingw-w64-i686-posix debootstrap dpkg-dev googletest util-linux zip unzip
    "${BUILD_PACKAGES[@]}" "${TEST_PACKAGES[@]}")
need_win32_packages() {
    need_packages "${WIN32_PACKAGES[@]}" >&2 || skip "packages are missing and could not be installed (no network?)"
}

# The Debian mirror and release this machine is set up for, so that no host is named here.
debian_archive() {
    apt-get indextargets --format '$(ORIGIN) $(COMPONENT) $(CODENAME) $(REPO_URI)' 'Created-By: Packages' |
        awk '$1 == "Debian" && $2 == "main" && $3 !~ /-/ && !seen++ { print $4, $3 }'
}

# place_of KIND RECIPE...: the folder is named after the scripts that make it, so that it is made anew when
# they change and trees at different states do not disturb each other.
place_of() {
    local kind=$1
    shift
    echo "$cache/$kind-$(cat "$@" | sha256sum | cut -c1-12)"
}

# Removes what earlier recipes made, unless it was used lately by another tree.
remove_older() {
    find "$cache" -maxdepth 1 -name "$1-*" ! -path "$2" -mtime +14 -exec rm -rf --one-file-system {} +
}
