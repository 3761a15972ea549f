#!/usr/bin/env bash
# Unpacks the libraries that the build needs from Debian's i386 packages into the cache, once, and links build/i386-root
# to them. Nothing is installed: the system's packages and lists stay as they are.
step=i386
source "$(dirname "$0")/roots-common.sh"

mkdir -p "$cache"
root=$(place_of root "$0" "$tree/Scripts/common.sh")
exec 8> "$cache/root.lock"
flock 8
if ! [ -d "$root" ]; then
    say "unpacking Debian's i386 libraries (kept in $cache)"
    work=$(mktemp -d "$cache/work.XXXXXX") part=$(mktemp -d "$cache/root.part.XXXXXX")
    trap 'rm -rf "$work" "$part"' EXIT
    cd "$work"
    mapfile -t packages < <(printf '%s\n' "libstdc++-$(g++ -dumpversion)-dev" "${BUILD_PACKAGES[@]}" | grep -- '-dev$')
    i386_apt() {
        own_apt "$@" -o APT::Architecture=i386 -o APT::Architectures=i386 -o Dir::State::status=/dev/null \
            -o Acquire::Languages=none -o Debug::NoLocking=1
    }
    own_lists deb
    i386_apt update
    i386_apt install --download-only -y --no-install-recommends "${packages[@]}"
    for package in cache/archives/*.deb; do dpkg-deb -x "$package" "$part"; done
    # Links to places in that system are not to lead into this one.
    find "$part" -type l -lname '/*' -exec bash -c 'ln -sfnr "$0$(readlink "$1")" "$1"' "$part" {} \;
    chmod 755 "$part"
    mv "$part" "$root"
    remove_older root "$root"
fi
touch "$root"
mkdir -p "$tree/build"
ln -sfn "$root" "$tree/build/i386-root"
