#!/usr/bin/env bash
# Makes the i386 root that Wine lives in, once, and prints where it is. 32-bit Wine cannot stand beside the
# packages of a 64-bit Debian whose i386 index is at another version; in a root of its own it can.
source "$(dirname "$0")/win32-common.sh"

root=$(place_of root "$0" "$tree/Scripts/win32-inside.sh")
exec 8> "$cache/root.lock"
flock 8
if [ -d "$root" ]; then
    touch "$root"
    echo "$root"
    exit
fi

need_win32_packages
read -r mirror release < <(debian_archive) || skip "no Debian mirror is configured"
export_apt_proxy

part=$(mktemp -d "$cache/root.part.XXXXXX")
trap 'rm -rf --one-file-system "$part"' EXIT
chmod 755 "$part"

make_root() {
    debootstrap --variant=minbase --arch=i386 "$release" "$part" "$mirror"
    printf '%s\n' force-unsafe-io path-exclude=/usr/share/{doc,man,locale}/'*' > "$part/etc/dpkg/dpkg.cfg.d/lean"
    echo 'Acquire::Languages "none";' > "$part/etc/apt/apt.conf.d/90lean"
    mount -t proc proc "$part/proc"
    mount --bind /dev "$part/dev"
    export DEBIAN_FRONTEND=noninteractive LC_ALL=C
    chroot "$part" apt-get -qq update
    chroot "$part" apt-get -qq -y install --no-install-recommends \
        wine wine32 xvfb libgl1 libgl1-mesa-dri fontconfig
    chroot "$part" apt-get clean
    rm -rf "$part"/var/lib/apt/lists/*
    # Without it texts are drawn in another typeface.
    fetch_montserrat "$part/usr/share/fonts/truetype/montserrat" || echo "Montserrat could not be fetched"
    install -m 755 "$tree/Scripts/win32-inside.sh" "$part/usr/local/bin/inside"
    mkdir "$part/wine"
    # After a crash the debugger prints where, and does not wait for somebody to press a button.
    chroot "$part" env -i PATH="$PATH" HOME=/wine WINEPREFIX=/wine/prefix WINEARCH=win32 WINEDEBUG=-all \
        sh -c 'wineboot -i && wine reg add "HKCU\\Software\\Wine\\WineDbg" /v ShowCrashDialog /t REG_DWORD /d 0 &&
            wineserver -w'
}

# Mounts live in a name space of their own: whatever happens, they are gone when it ends.
export part mirror release tree
export -f make_root fetch_montserrat
unshare --mount --propagation private bash -euo pipefail -c make_root > "$cache/root.log" 2>&1 ||
    skip "the i386 root could not be made (no network, no mounts?): $(tail -n 1 "$cache/root.log")"
mv "$part" "$root"
remove_older root "$root"
echo "$root"
