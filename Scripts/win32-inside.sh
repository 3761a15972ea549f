#!/bin/bash
# Installed in the i386 root: runs a Windows program from /mnt with a display to draw on.
Xvfb -displayfd 3 -screen 0 1280x1024x24 -nolisten tcp 3> /tmp/display > /tmp/xvfb.log 2>&1 &
for _ in {1..200}; do
    if [ -s /tmp/display ]; then break; fi
    sleep 0.05
done
export DISPLAY=:$(cat /tmp/display)
cd /mnt
exec timeout -k 10 "${WINE_TIMEOUT:-600}" wine "$@"
