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
# A sung line: MIDI note, cents off, seconds, depth of the vibrato in cents; note 0 is a breath.
awk 'BEGIN {
    rate = 44100; pi = atan2(0, -1); print "; Sample Rate " rate; print "; Channels 1"
    count = split("57 -38 .45 0  59 32 .4 0  60 -30 .4 0  64 35 1 28  0 0 .15 0  62 -35 .4 0  60 -42 .35 0  57 28 1.1 24", v)
    for (k = 1; k <= count; k += 4) {
        if (v[k] == 0) pitch = level = 0
        for (t = 0; t < v[k + 2]; t += 1 / rate) {
            wanted = v[k] + (v[k + 1] + v[k + 3] * (t > .3) * sin(2 * pi * 5.4 * t)) / 100
            pitch = pitch > 0 ? pitch + (wanted - pitch) / (.035 * rate) : wanted - (v[k] > 0) * 1.2
            level += ((v[k] > 0) - level) / (.02 * rate)
            f = v[k] > 0 ? 440 * exp((pitch - 69) / 12 * log(2)) : 0
            phase += 2 * pi * f / rate
            sum = 0
            for (h = 1; f > 0 && h <= 14; ++h)
                sum += sin(h * phase) * (.1 / h + .3 / (1 + ((h * f - 700) / 150) ^ 2) + .1 / (1 + ((h * f - 1100) / 200) ^ 2))
            print frame / rate, level * sum / 2
            frame += 1
        }
    }
}' >"$speech/in.dat"
sox "$speech/in.dat" "$speech/in.wav"
build/apps/bin/dsphost tune-voice "$speech/in.wav" "$speech/out.wav" --scale "A minor" --retune 10 -y -q --size 960x480 \
    --curve Docs/pictures/tune-voice.png --font build/fonts/Montserrat_400Regular.ttf
echo Docs/pictures/tune-voice.png
