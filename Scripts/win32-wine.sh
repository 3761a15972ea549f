#!/usr/bin/env bash
# win32-wine.sh PROGRAM.exe [ARGUMENT...]
# Runs a Windows program under Wine inside the i386 root. The program's folder is its current folder and all
# it sees of this tree; its exit status is passed on. One program runs at a time: they share the Windows
# environment.
source "$(dirname "$0")/win32-common.sh"

root=$("$tree/Scripts/win32-root.sh") || { status=$?; echo "$root"; exit $status; }
program=$(realpath "$1")
shift
export root folder=${program%/*}
export HOME=/wine WINEPREFIX=/wine/prefix WINEARCH=win32 WINEDEBUG=-all,err+module LC_ALL=C

exec 8> "$cache/wine.lock"
flock 8
# In name spaces of its own nothing outlives the program, neither mounts nor servers, and its display cannot
# collide with another one.
exec unshare --mount --propagation private --net --pid --fork --kill-child bash -euc '
    mount -t proc proc "$root/proc"
    mount --bind /dev "$root/dev"
    mount -t tmpfs tmpfs "$root/tmp"
    mount --bind "$folder" "$root/mnt"
    exec chroot "$root" /usr/local/bin/inside "$@"' bash "./${program##*/}" "$@"
