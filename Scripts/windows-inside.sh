#!/bin/bash
# inside PROGRAM.exe [ARGUMENT...]   runs a Windows program from /mnt with a display to draw on
# inside make-prefix                 makes Windows' folders
# Installed in Wine's folder and run in its root, with WINEPREFIX and WINEARCH set.
export HOME=${0%/*} LC_ALL=C
wine=wine
if [ "$WINEARCH" = win64 ]; then
    # Without the package that chooses between the two.
    wine=/usr/lib/wine/wine64
    export WINESERVER=/usr/lib/wine/wineserver64
fi

if [ "$1" = make-prefix ]; then
    export WINEDEBUG=-all
    # After a crash the debugger prints where, and does not wait for somebody to press a button.
    "$wine" wineboot -i &&
        "$wine" reg add 'HKCU\Software\Wine\WineDbg' /v ShowCrashDialog /t REG_DWORD /d 0 &&
        "${WINESERVER:-wineserver}" -w
    exit
fi

Xvfb -displayfd 3 -screen 0 1280x1024x24 -nolisten tcp 3> /tmp/display > /tmp/xvfb.log 2>&1 &
for _ in {1..200}; do
    if [ -s /tmp/display ]; then break; fi
    sleep 0.05
done
export DISPLAY=:$(cat /tmp/display)
cd /mnt
exec timeout -k 10 "${WINE_TIMEOUT:-600}" "$wine" "$@"
