#!/usr/bin/env bash
# Makes the pictures of this folder anew, from recordings of Debian's sonic-pi-samples.
set -euo pipefail
cd "$(dirname "$0")/.."
source Scripts/common.sh

need_packages "${BUILD_PACKAGES[@]}" sonic-pi-samples espeak-ng
say "building"
build_preset apps dsphost
if ! [ -f build/fonts/Montserrat_400Regular.ttf ] && ! fetch_montserrat build/fonts; then
    echo "Montserrat cannot be fetched (npm, network?); the pictures would come out in another typeface" >&2
    exit 1
fi

recordings=$(dirname "$(dpkg -L sonic-pi-samples | grep -m1 '/loop_amen_full\.')")
# draw COMMAND RECORDING PICTURE [OPTION...]
draw() {
    local command=$1 recording=$recordings/$2 picture=Docs/pictures/$3
    shift 3
    build/apps/bin/dsphost "$command" "$recording" "$picture" -y -q \
        --font build/fonts/Montserrat_400Regular.ttf "$@"
    echo "$picture"
}

mkdir -p Docs/pictures
draw spectrum guit_em9.flac spectrum.png --size 960x400 --length 16384
draw spectrum loop_amen_full.flac bands.png --size 960x400 --view bars,third-octaves,60dB
draw sonogram bass_drop_c.flac sonogram.png --pitch --view note-names
draw sonogram loop_amen_full.flac both.png --spectrum --scheme 2
draw tuner bass_dnb_f.flac tuner.png --size 960x360

speech=$(mktemp -d)
trap 'rm -r "$speech"' EXIT
espeak-ng -w "$speech/in.wav" "Why were you away a year, Roy? We owe you a yellow lion."
build/apps/bin/dsphost tune-voice "$speech/in.wav" "$speech/out.wav" --scale "A minor" -y -q --size 960x480 \
    --curve Docs/pictures/tune-voice.png --font build/fonts/Montserrat_400Regular.ttf
echo Docs/pictures/tune-voice.png
