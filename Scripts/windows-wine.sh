#!/usr/bin/env bash
# windows-wine.sh win32|win64 PROGRAM.exe [ARGUMENT...]
# Runs a Windows program under Wine. The program's folder is its current folder; its exit status is passed on.
# One program runs at a time: they share the Windows environment.
source "$(dirname "$0")/windows-common.sh"

root=$("$tree/Scripts/windows-root.sh" "$target") || { status=$?; echo "$root"; exit $status; }
program=$(realpath "$2")
shift 2
export root folder=${program%/*} WINEDEBUG=-all,err+module

exec 8> "$cache/wine.lock"
flock 8
# In name spaces of its own nothing outlives the program, neither mounts nor servers, and its display cannot
# collide with another one.
exec unshare --mount --propagation private --net --pid --fork --kill-child bash -euc '
    mount_system
    mount --bind "$folder" "$system/mnt"
    exec chroot "$system" "$HOME_OF_WINE/inside" "$@"' bash "./${program##*/}" "$@"
