#!/usr/bin/env bash
# Makes the pictures of this folder anew, from recordings of Debian's sonic-pi-samples.
set -euo pipefail
cd "$(dirname "$0")/.."
source Scripts/common.sh

need_packages "${BUILD_PACKAGES[@]}" sonic-pi-samples espeak-ng sox
say "building"
build_preset apps dsphost
if ! [ -f build/fonts/Montserrat_400Regular.ttf ] && ! fetch_montserrat build/fonts; then
    echo "Montserrat cannot be fetched (npm, network?); the pictures would come out in another typeface" >&2
    exit 1
fi

recordings=$(dirname "$(dpkg -L sonic-pi-samples | grep -m1 '/loop_amen_full\.')")
# A voice in hiss and hum, with two seconds of noise before it.
noisy_voice() {
    local seconds folder=build/noisy-voice
    mkdir -p "$folder"
    espeak-ng -v en-us -s 160 -w "$folder/voice.wav" "The north wind and the sun were disputing which was the stronger, \
when a traveller came along, wrapped in a warm cloak."
    sox -R "$folder/voice.wav" -r 48000 -b 24 "$folder/clean.wav" gain -n -8 pad 2.2 1
    seconds=$(soxi -D "$folder/clean.wav")
    sox -R -n -r 48000 -b 24 "$folder/hiss.wav" synth "$seconds" pinknoise vol 0.1
    sox -R -n -r 48000 -b 24 "$folder/hum.wav" synth "$seconds" sine 50 synth "$seconds" sine mix 150 \
        synth "$seconds" sine mix 250 vol 0.06
    sox -R -m -v 1 "$folder/clean.wav" -v 1 "$folder/hiss.wav" -v 1 "$folder/hum.wav" "$folder/noisy.wav"
    build/apps/bin/dsphost denoise "$folder/noisy.wav" "$folder/cleaned.wav" --learn 0.2:2.0 \
        --residue "$folder/residue.wav" --save-profile "$folder/profile" -y -q
}

# draw COMMAND RECORDING PICTURE [OPTION...]
draw() {
    local command=$1 recording=$2 picture=Docs/pictures/$3
    [ -e "$recording" ] || recording=$recordings/$recording
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

noisy_voice
for pair in noisy:before cleaned:after residue:residue; do
    draw sonogram "build/noisy-voice/${pair%:*}.wav" "denoise-${pair#*:}.png" --size 740x280
done
draw spectrum build/noisy-voice/noisy.wav denoise-profile.png --size 960x400 --length 8192 \
    --profile build/noisy-voice/profile
speech=$(mktemp -d)
trap 'rm -r "$speech"' EXIT
espeak-ng -w "$speech/in.wav" "Why were you away a year, Roy? We owe you a yellow lion."
build/apps/bin/dsphost tune-voice "$speech/in.wav" "$speech/out.wav" --scale "A minor" -y -q --size 960x480 \
    --curve Docs/pictures/tune-voice.png --font build/fonts/Montserrat_400Regular.ttf
echo Docs/pictures/tune-voice.png
