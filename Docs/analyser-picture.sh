#!/usr/bin/env bash
# Makes Docs/pictures/analyser.gif: the live analyser playing a recording of Debian's sonic-pi-samples.
set -euo pipefail
cd "$(dirname "$0")/.."
source Scripts/common.sh

need_packages "${BUILD_PACKAGES[@]}" sonic-pi-samples xvfb xdotool ffmpeg
say "building"
build_preset apps dspdll-analyser
work=$(mktemp -d)
exec {free}> "$work/display"
Xvfb -displayfd $free -screen 0 640x420x24 -dpi 96 > /dev/null 2>&1 &
jobs=($!)
trap 'kill "${jobs[@]}" 2> /dev/null || true; wait; rm -r "$work"' EXIT
until [ -s "$work/display" ]; do sleep 0.1; done
DISPLAY=:$(cat "$work/display")
export DISPLAY XDG_CONFIG_HOME=$work SDL_VIDEODRIVER=x11
recording=$(dpkg -L sonic-pi-samples | grep -m1 '/guit_em9\.flac$')
build/apps/bin/dspdll-analyser --no-audio "$recording" --size 640x420 --full-screen &
jobs+=($!)
xdotool mousemove 639 419
sleep 1
xdotool key bracketright bracketright  # 150 columns a second: the window fills as it plays
ffmpeg -loglevel error -f x11grab -framerate 8 -video_size 640x420 -draw_mouse 0 -i "$DISPLAY" -t 7 "$work/grabbed.mkv"
ffmpeg -loglevel error -y -i "$work/grabbed.mkv" \
    -filter_complex "split[a][b];[a]palettegen=max_colors=48[p];[b][p]paletteuse=dither=none:diff_mode=rectangle" \
    Docs/pictures/analyser.gif
ls -l Docs/pictures/analyser.gif
