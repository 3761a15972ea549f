#!/usr/bin/env bash
# window.sh [SECONDS]
# The live analyser in a real window, on a display and with sound devices of its own: ./check analyser. Its pictures
# are compared with dsphost's of the same moment, keys and clicks are sent to it, its window changes size a hundred
# times, its memory is watched for SECONDS (20), inputs come and go, and the plug-in's window opens and closes 20 times
# in hosts.
set -euo pipefail
cd "$(dirname "$0")/../.."
source Scripts/common.sh

need_packages "${BUILD_PACKAGES[@]}" "${PLUGIN_PACKAGES[@]}" xvfb xdotool imagemagick sox pulseaudio pulseaudio-utils \
    jalv jackd2 sonic-pi-samples
say "building"
build_preset release dspdll-analyser dsphost
build_preset plugins analyser_plugin plugin_host

seconds=${1:-20}
work=$(mktemp -d)
program=$PWD/build/release/bin/dspdll-analyser host=$PWD/build/release/bin/dsphost
recording=$(dpkg -L sonic-pi-samples | grep -m1 '/guit_em9\.flac$')
export HOME=$work XDG_CONFIG_HOME=$work/config SDL_AUDIODRIVER=disk SDL_DISKAUDIOFILEIN=$work/in.raw SDL_DISKAUDIOFILE=/dev/null
exec {free}> "$work/display"
Xvfb -displayfd $free -screen 0 2600x1500x24 -dpi 96 > /dev/null 2>&1 &
jobs=($!)
trap 'kill "${jobs[@]}" 2> /dev/null || true; wait; rm -r "$work"' EXIT
until [ -s "$work/display" ]; do sleep 0.1; done
DISPLAY=:$(cat "$work/display")
export DISPLAY

failed=0
fail() { echo "FAILED: $*"; failed=1; }
open() {  # PROGRAM ARGUMENT...: leaves pid and window, which is empty where none comes
    "$@" & pid=$!
    jobs+=($pid)
    window=
    for ((i = 0; i < 100 && ${#window} == 0; ++i)); do
        sleep 0.1
        window=$(xdotool search --onlyvisible --pid $pid --name '^Analyser$' 2> /dev/null | tail -1) || true
    done
}
start() {
    open "$program" --save-to "$work/out" "$@"
    xdotool mousemove 2590 1490
    sleep 1
}
stop() {
    kill $pid
    for ((i = 0; i < 100; ++i)); do
        kill -0 $pid 2> /dev/null || break
        sleep 0.1
    done
    [ $i -lt 100 ] || { fail "the program does not end"; kill -KILL $pid; }
    wait $pid || fail "the program ended with $?"
}
keys() { for key in "$@"; do xdotool key --window "$window" "$key"; sleep 0.2; done; }
chosen() { grep -qxF "$1" "$XDG_CONFIG_HOME/dspdll/analyser.conf" || fail "not chosen: $1"; }
of() { soxi -D "$1" | awk '{print int($1) + 3}'; }

say "the same pictures as dsphost's"
sox -n -r 48000 -c 2 "$work/steady.wav" synth 20 sawtooth 196.5 vol 0.4  # its spectrum and note stay
for case in "1280x720 96 24" "2400x1400 192 48"; do
    read -r size dpi bar <<< "$case"
    whole=${size%x*}x$((${size#*x} - bar))
    for view in both:3 sonogram:2 spectrum:1 tuner:4; do
        file=$recording wait=$(of "$recording") most=0.03
        case $view in spectrum:*) file=$work/steady.wav wait=4 most=0.02 ;; tuner:*) file=$work/steady.wav wait=4 most=0.005 ;; esac
        rm -rf "$XDG_CONFIG_HOME"
        start --no-audio "$file" --size "$size" --dpi "$dpi"
        keys t "${view#*:}"
        sleep "$wait"
        import -window "$window" "$work/live.png"
        stop
        picture=(--size "$whole" --dpi "$dpi" -q -y)
        case ${view%:*} in
            both) "$host" sonogram "$file" "$work/host.png" --pitch --speed 4 --spectrum "${picture[@]}" ;;
            sonogram) "$host" sonogram "$file" "$work/host.png" --pitch --speed 4 "${picture[@]}" ;;
            spectrum) "$host" spectrum "$file" "$work/host.png" --view line --length 8192 --window blackman "${picture[@]}" ;;
            tuner) "$host" tuner "$file" "$work/host.png" --at 4 "${picture[@]}" ;;
        esac
        convert "$work/live.png" -crop "$whole+0+0" +repage "$work/part.png"
        off=$(compare -metric MAE "$work/part.png" "$work/host.png" null: 2>&1 | sed 's/.*(\(.*\))/\1/') || true
        echo "${view%:*} $size at $dpi dots per inch: mean difference $off"
        awk "BEGIN { exit !($off < $most) }" || fail "${view%:*} $size differs from dsphost's picture"
    done
done

say "an input, keys, clicks and files"
sox -n -r 48000 -c 2 -e floating-point -b 32 "$SDL_DISKAUDIOFILEIN" synth 60 sine 440 vol 0.5
rm -rf "$XDG_CONFIG_HOME"
start --size 1000x600
sleep 2
hears() {  # HERTZ DECIBELS WHAT
    rm -rf "$work/out"
    keys p
    sleep 1
    local loudest
    loudest=$(sort -s -t, -k2 -g -r "$work"/out/*.csv | grep -m1 '^[0-9]') || true
    echo "$3: the loudest row is $loudest"
    awk -F, "{ exit !(\$1 > $1 - 6 && \$1 < $1 + 6 && \$2 > $2 - 2 && \$2 < $2 + 1) }" <<< "$loudest" || fail "$3 is not heard"
}
hears 440 -6 "440 Hz"
for line in 1:0 2:1 4:3 3:2; do
    keys "${line%:*}"
    sleep 2.5
    chosen "View = ${line#*:}"
done
keys t bracketright comma
xdotool mousemove --window "$window" 500 300 click 3
keys h 2
xdotool mousemove --window "$window" 500 300 click --repeat 3 4
sleep 2.5
chosen "Tuner above = 0"
chosen "Sonogram speed = 5"
chosen "Tuner reference = 439"

say "a hundred sizes"
for ((i = 0; i < 100; ++i)); do xdotool windowsize "$window" $((RANDOM % 1600 + 80)) $((RANDOM % 1000 + 60)); done
xdotool windowsize --sync "$window" 800 500
sleep 1
import -window "$window" "$work/resized.png"
[ "$(identify -format %wx%h "$work/resized.png")" = 800x500 ] || fail "the window is not 800x500"
[ "$(identify -format %k "$work/resized.png")" -gt 100 ] || fail "the window is empty"

say "$seconds seconds of memory"
resident() { awk '/VmRSS/ {print $2}' /proc/$pid/status; }
sleep 5
before=$(resident)
sleep "$seconds"
after=$(resident)
echo "from $before to $after KiB"
# The sonogram's past grows to 16 MiB for each channel: here at 90 columns a second, none higher than 256 rows.
past=$((seconds * 90 * 256 / 1024))
[ "$after" -lt $((before + 2048 + 2 * (past < 16384 ? past : 16384))) ] || fail "the memory grows"
stop

say "a broken settings file, a file that is none, and no sound system"
printf 'rubbish' > "$XDG_CONFIG_HOME/dspdll/analyser.conf"
start "$0" 2> "$work/said"
stop
[ "$(grep -c '^dspdll-analyser: ' "$work/said")" = 2 ] || fail "two sentences were expected: $(cat "$work/said")"
SDL_AUDIODRIVER=nosuch start
stop

say "inputs that come and go"
sox -n -r 48000 -c 2 "$work/330.wav" synth 60 sine 330 vol 0.25
sound() {  # a sound server with a loudspeaker that a microphone may hear
    pulseaudio -n --exit-idle-time=-1 -L module-native-protocol-unix -L "module-null-sink sink_name=air" > "$work/pulse.log" 2>&1 &
    server=$!
    jobs+=($server)
    for ((i = 0; i < 100; ++i)); do pactl info > /dev/null 2>&1 && break; sleep 0.1; done
    paplay -d air "$work/330.wav" > /dev/null 2>&1 &
}
plug_in() {
    microphone=$(pactl load-module module-remap-source source_name=mic master=air.monitor \
        source_properties=device.description=Microphone)
    sleep 3
}
(
    export XDG_RUNTIME_DIR=$work SDL_AUDIODRIVER=pulseaudio
    rm -rf "$XDG_CONFIG_HOME"
    sound
    start --input Microphone
    plug_in
    hears 330 -12 "a microphone that was not there at first"
    pactl unload-module "$microphone"
    sleep 2
    hears 0 -300 "silence without it"
    plug_in
    hears 330 -12 "the microphone when it is back"
    kill $server
    sleep 5
    sound
    plug_in
    hears 330 -12 "the microphone of a new sound server"
    stop
    plays() { pactl list sink-inputs | grep -q '"dspdll-analyser"' || fail "$1 is not played"; }
    start "$work/330.wav"
    plays "a file"
    kill $server
    sleep 3
    sound
    sleep 5
    plays "a file whose sound server was started again"
    stop
    kill $server
    exit $failed
) || failed=1

say "the plug-in's window, 20 times"
export JACK_DEFAULT_SERVER=analyser$$ JACK_NO_AUDIO_RESERVATION=1 LV2_PATH=$PWD/build/plugins/lv2:/usr/lib/lv2
jackd -r -n "$JACK_DEFAULT_SERVER" -d dummy -r 48000 -p 256 > "$work/jackd" 2>&1 &
jobs+=($!)
timeout 20 jack_wait -w > /dev/null 2>&1 || fail "JACK does not start: $(tail -3 "$work/jackd")"
memory=()
for round in {1..20}; do
    open jalv.gtk3 urn:dspdll:analyser > "$work/jalv" 2>&1
    sleep 0.5
    if [ -n "$window" ] && import -window "$window" "$work/plugin.png"; then
        colours=$(identify -format %k "$work/plugin.png")
        [ "$colours" -gt 50 ] || fail "window $round of the plug-in is empty"
    else
        fail "window $round of the plug-in does not appear: $(tail -3 "$work/jalv")"
    fi
    memory+=("$(resident)")
    stop
done
echo "KiB with a window: ${memory[*]}"
sorted=($(printf '%s\n' "${memory[@]}" | sort -n))
[ "${sorted[-1]}" -lt $((sorted[0] * 11 / 10)) ] || fail "the host's memory differs from time to time"

say "its windows in CLAP and VST3, 20 times each"
plugins=build/plugins file=dspdll-analyser-plugin
$plugins/bin/plugin_host --windows $plugins/clap/$file.clap $plugins/vst3/$file.vst3 || fail "see above"

[ $failed = 0 ] && echo "the live analyser: everything passed"
exit $failed
