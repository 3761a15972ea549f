#!/usr/bin/env bash
# windows-root.sh win32|win64
# Makes what Wine runs in, once, and prints where it is: Windows' folders, and for the 32-bit Wine an i386 root
# around them. It cannot stand beside the packages of a 64-bit Debian whose i386 index is at another version; in
# a root of its own it can.
source "$(dirname "$0")/windows-common.sh"

root=$(place_of root "$0" "$tree/Scripts/windows-inside.sh")
exec 8> "$cache/root.lock"
flock 8
if [ -d "$root" ]; then
    touch "$root"
    echo "$root"
    exit
fi

need_windows_packages
finished=$root
root=$(mktemp -d "$cache/root.part.XXXXXX")
trap 'rm -rf --one-file-system "$root"' EXIT
chmod 755 "$root"

if [ "$target" = win32 ]; then
    read -r mirror release < <(debian_archive) || skip "no Debian mirror is configured"
    export mirror release
    export_apt_proxy
fi

make_i386_root() {
    debootstrap --variant=minbase --arch=i386 "$release" "$root" "$mirror"
    printf '%s\n' force-unsafe-io path-exclude=/usr/share/{doc,man,locale}/'*' > "$root/etc/dpkg/dpkg.cfg.d/lean"
    echo 'Acquire::Languages "none";' > "$root/etc/apt/apt.conf.d/90lean"
    mount -t proc proc "$root/proc"
    mount --bind /dev "$root/dev"
    export DEBIAN_FRONTEND=noninteractive LC_ALL=C
    chroot "$root" apt-get -qq update
    chroot "$root" apt-get -qq -y install --no-install-recommends \
        wine wine32 xvfb libgl1 libgl1-mesa-dri fontconfig
    chroot "$root" apt-get clean
    rm -rf "$root"/var/lib/apt/lists/*
    umount "$root/proc" "$root/dev"
}

make_root() {
    if [ "$target" = win32 ]; then
        make_i386_root
    else
        mkdir "$root/system"
    fi
    mkdir "$root/wine"
    install -m 755 "$tree/Scripts/windows-inside.sh" "$root/wine/inside"
    # Without it texts are drawn in another typeface.
    fetch_montserrat "$root/wine/.local/share/fonts" || echo "Montserrat could not be fetched"
    mount_system
    chroot "$system" "$HOME_OF_WINE/inside" make-prefix
}

# Mounts live in a name space of their own: whatever happens, they are gone when it ends.
export root tree
export -f make_root make_i386_root fetch_montserrat
unshare --mount --propagation private bash -euo pipefail -c make_root > "$cache/root.log" 2>&1 ||
    skip "Wine's root could not be made (no network, no mounts?): $(tail -n 1 "$cache/root.log")"
mv "$root" "$finished"
remove_older root "$finished"
echo "$finished"
