#!/usr/bin/env bash
# plugins.sh [PART]...
# Builds the plug-ins into build/plugins/{lv2,clap,vst3} and lets real hosts load, play and render them, without
# screen and sound card: ./check plugins. Parts may be named; without names all of them run.
set -euo pipefail
cd "$(dirname "$0")/.."
source Scripts/common.sh

need_packages "${BUILD_PACKAGES[@]}" dpf-source lv2-dev sordi lilv-utils jalv jackd2 jack-tools ffmpeg ardour \
    qtractor sonic-pi-samples python3-numpy python3-soundfile
python=/usr/bin/python3 hosts=$PWD/Tests/Plugins/Hosts

say "building (plugins)"
cmake --preset plugins -DDSP_BUILD_APPS=ON >/dev/null
cmake --build --preset plugins
build=$PWD/build/plugins
work=$build/hosts
dsphost=$build/bin/dsphost
rm -rf "$work"
mkdir -p "$work"/{lv2,home/.vst3,home/.clap}

# The hosts see these plug-ins and no others, and write nothing outside of the build folder.
ln -s $(dpkg -L lv2-dev | grep -E '^/usr/lib/lv2/[^/]+\.lv2$') "$build"/lv2/*.lv2 "$work/lv2"
ln -s "$build"/vst3/*.vst3 "$work/home/.vst3"
ln -s "$build"/clap/*.clap "$work/home/.clap"
real_home=$HOME real_cache=${XDG_CACHE_HOME:-}
export HOME=$work/home LV2_PATH=$work/lv2 LADSPA_PATH=$work CLAP_PATH=$build/clap VST3_PATH=$build/vst3 LC_ALL=C
export XDG_CONFIG_HOME=$HOME/.config XDG_CACHE_HOME=$HOME/.cache XDG_DATA_HOME=$HOME/.local/share
export JACK_DEFAULT_SERVER=dspdll-plugins-$$ JACK_NO_AUDIO_RESERVATION=1

# Every part runs even when one before it failed, so that one run tells all.
failed=() times=()
part() {
    local name=$1 begin=$SECONDS
    [ ${#chosen[@]} = 0 ] || [[ " ${chosen[*]} " == *" $name "* ]] || return 0
    say "$name"
    set +e
    (set -e; "${@:2}")
    local status=$?
    set -e
    [ $status = 0 ] || failed+=("$name")
    times+=("$(printf '%4d s  %s' $((SECONDS - begin)) "$name")")
}
chosen=("$@")

# each FUNCTION ARGUMENT...: calls the function for every argument, on all cores, and prints what each call says.
# Fails when one of them did; a function says why, in one line or more, and returns 1.
each() {
    local call=$1 argument i=0 status=0
    shift
    rm -rf "$work/each"
    mkdir "$work/each"
    for argument in "$@"; do
        while [ "$(jobs -rp | wc -l)" -ge "$(nproc)" ]; do wait -n || :; done
        (set +e; "$call" "$argument" > "$work/each/$i.txt" 2>&1 || touch "$work/each/failed") &
        i=$((i + 1))
    done
    wait
    [ $i -gt 0 ] || { echo "there is nothing to try"; return 1; }
    cat "$work"/each/*.txt
    [ ! -e "$work/each/failed" ]
}

uris() { lv2ls | grep '^urn:dspdll:'; }
name_of() { lv2info "$1" | sed -n 's/^\tName: *//p'; }
channels_of() { case $1 in *-mono) echo 1 ;; *) echo 2 ;; esac; }
# What dsphost calls the effect in a plug-in; without a band that is on the equaliser does what a gain of 0 dB does.
effect_of() { name_of "$1" | sed 's/ (mono)$//; s/^Equaliser$/Gain/'; }
about() { "$dsphost" effects "$(effect_of "$1")" --json | "$python" -c "import json, sys; effect = json.load(sys.stdin)[0]; print($2)"; }
latency_of() { about "$1" 'effect["latency"]'; }
# The last one that is not where the effect starts; nothing where it has none.
preset_of() { about "$1" '([p for i, p in enumerate(effect["presets"]) if i != effect["default_preset"]] or [""])[-1]'; }

ffmpeg -v error -y -i "$(dpkg -L sonic-pi-samples | grep -m1 '/loop_amen\.flac$')" -ar 48000 -t 1.5 -c:a pcm_f32le \
    "$work/in2.wav"
ffmpeg -v error -y -i "$work/in2.wav" -ac 1 -c:a pcm_f32le "$work/in1.wav"

# What goes into a plug-in: the recording, and its copy into a side-chain.
input_of() {
    local channels ports file
    channels=$(channels_of "$1")
    ports=$(lv2info "$1" | awk -v RS= '/#InputPort/ && /#AudioPort/ { ++n } END { print n }')
    file=$work/in$channels.wav
    if [ "$ports" != "$channels" ]; then
        file=$work/in$channels-side.wav
        [ -e "$file" ] || ffmpeg -v error -y -i "$work/in$channels.wav" -c:a pcm_f32le \
            -af "$([ "$channels" = 1 ] && echo 'pan=2c|c0=c0|c1=c0' || echo 'pan=4c|c0=c0|c1=c1|c2=c0|c3=c1')" "$file"
    fi
    echo "$file"
}

# reference URI [PRESET]: the library's own result; prints the file.
reference() {
    local effect channels file
    effect=$(effect_of "$1") channels=$(channels_of "$1")
    file="$work/reference-${1##*:}${2:+-preset}.wav"
    [ -e "$file" ] || "$dsphost" render -q -y --precision 32 --format f32 --block 1024 "$work/in$channels.wav" "$file" \
        --fx "$effect${2:+: preset=$2}" >&2
    echo "$file"
}

# expect URI FILE LATENCY [PRESET]: whether the file is the library's own result so many frames later.
expect() {
    local file
    file=$(reference "$1" "${4:-}") && "$python" "$hosts/compare.py" "$file" "$2" "$3"
}
sounds() { "$python" "$hosts/compare.py" --sounds "$1"; }

validate() {
    local log
    log=$(timeout 60 lv2_validate "$1"/*.ttl 2>&1) && grep -q 'Found 0 errors' <<< "$log" && ! grep -qi warning <<< "$log" ||
        { echo "${1##*/}:"; echo "$log"; return 1; }
}

# This engine's sound depends on the pieces that it gets, which in plug-ins are short ones.
expect_or_sounds() {
    if [[ $1 == *:pitch-shift* ]]; then sounds "$2"; else expect "$1" "$2" "$(latency_of "$1")"; fi
}

render_with_lv2apply() {
    local out=$work/lv2apply-${1##*:}.wav log
    log=$(timeout 60 lv2apply -i "$(input_of "$1")" -o "$out" "$1" 2>&1) ||
        { echo "$1: lv2apply ends with $?: $log"; return 1; }
    expect_or_sounds "$1" "$out"
}

render_with_ffmpeg() {
    local out=$work/ffmpeg-${1##*:}.wav log
    log=$(timeout 60 ffmpeg -v error -y -i "$(input_of "$1")" -af "lv2=p=${1//:/\\\\:}" -c:a pcm_f32le "$out" \
        2>&1 < /dev/null) || { echo "$1: ffmpeg ends with $?: $log"; return 1; }
    expect_or_sounds "$1" "$out"
}

# All of them at once, a metronome through every plug-in: each has to come out of it.
play_with_jalv() {
    local uri name port i outputs=()
    running=()  # for the trap, which comes when this function has ended
    jackd -n "$JACK_DEFAULT_SERVER" --no-realtime --timeout 5000 -d dummy -r 48000 -p 2048 > "$work/jackd.log" 2>&1 &
    running+=($!)
    trap 'kill "${running[@]}" 2> /dev/null || :' EXIT
    timeout 20 jack_wait -w > /dev/null 2>&1
    timeout 300 jack_metro -b 300 -D 100 -n metro > "$work/metro.log" 2>&1 &
    running+=($!)
    for uri in $(uris); do
        name=${uri##*:}
        # It reads commands until its input ends.
        timeout -k 5 200 jalv -x -n "$name" "$uri" > "$work/jalv-$name.log" 2>&1 < <(sleep 200) &
        running+=($!)
        for ((i = 0; i < 100; ++i)); do
            if jack_lsp "$name:" 2> /dev/null | grep -q "^$name:out"; then break; fi
            sleep 0.05
        done
        jack_lsp "$name:" 2> /dev/null | grep "^$name:out" > "$work/outputs" ||
            { echo "$uri does not start in jalv: $(cat "$work/jalv-$name.log")"; return 1; }
        mapfile -t -O ${#outputs[@]} outputs < "$work/outputs"
        for port in $(jack_lsp "$name:" 2> /dev/null | grep -E "^$name:(in|side)"); do jack_connect metro:300_bpm "$port"; done
    done
    timeout 30 jack_rec -f "$work/jalv.wav" -d 2 -b 24 "${outputs[@]}" > "$work/jack_rec.log" 2>&1 || :
    "$python" "$hosts/compare.py" --sounds "$work/jalv.wav" "${outputs[@]}"
}

# KIND URI: a session with the plug-in, exported.
render_with_ardour() {
    local kind=${1%% *} uri=${1#* } id channels preset folder log
    id=$uri channels=$(channels_of "$uri") preset=$(preset_of "$uri") folder=$work/ardour-$kind-${uri##*:}
    [ "$kind" = LV2 ] || id=$(name_of "$uri")
    log=$(SESSION="$folder|$kind|$id|$channels|$preset" timeout 60 ardour7-lua "$hosts/ardour.lua" 2>&1) ||
        { echo "$1: ardour7-lua ends with $?: $log"; return 1; }
    ! grep '^FAILED' <<< "$log" || return 1
    [ "$(sed -n 's/^LATENCY //p' <<< "$log")" = "$(latency_of "$uri")" ] ||
        { echo "$1: not the latency of $(latency_of "$uri"): $(grep LATENCY <<< "$log")"; return 1; }
    [ "$channels" = 2 ] || return 0  # what a mono one sounds like, other hosts tell without a panner
    "$python" "$hosts/ardour_region.py" "$folder" "$work/in$channels.wav" || return 1
    log=$(timeout 60 ardour7-export -s 48000 -b float -o "$folder.wav" "$folder" t 2>&1) ||
        { echo "$1: ardour7-export ends with $?: $log"; return 1; }
    case $uri in
        # Ardour plays silence before the range, and their oscillators and engines go on in it.
        *:tremolo | *:phaser | *:denoiser | *:pitch-shift) sounds "$folder.wav" ;;
        *) expect "$uri" "$folder.wav" 0 "$preset" || { echo "with the preset '$preset'"; return 1; } ;;
    esac
}
try_ardour() {
    local status=0 vst3=$work/home/.vst3/dspdll.vst3
    LD_LIBRARY_PATH=/usr/lib/ardour7 timeout 60 /usr/lib/ardour7/ardour-vst3-scanner -f "$vst3" 2>&1 | grep 'Found Plugin' ||
        { echo "Ardour's VST3 scanner finds nothing in $vst3"; status=1; }
    local uri plugins=("VST3 urn:dspdll:gain")
    for uri in $(uris); do plugins+=("LV2 $uri"); done
    each render_with_ardour "${plugins[@]}" || status=1
    return $status
}

scan_with_qtractor() {
    timeout 20 /usr/lib/*/qtractor/qtractor_plugin_scan <<< "clap:$1" 2> /dev/null | grep '^CLAP|' ||
        { echo "${1##*/} is not listed"; return 1; }
}

# A process for each file: one that crashes or hangs does not hide the others.
check_with_our_host() {
    timeout 300 "$build/bin/plugin_host" "$1" || { echo "${1##*/}: plugin_host ends with $?"; return 1; }
}

# The Windows files are checked by the same host, in one folder that Wine sees.
windows_build=build/win64-plugins
check_windows() {
    [ "$(id -u)" = 0 ] || { echo "skipped: needs root for Wine"; return 0; }
    unset HOME XDG_CONFIG_HOME XDG_CACHE_HOME XDG_DATA_HOME
    export HOME=$real_home
    [ -z "$real_cache" ] || export XDG_CACHE_HOME=$real_cache
    Scripts/windows-root.sh win64 > /dev/null
    local prefix stage=$windows_build/stage
    prefix=$(Scripts/windows-deps.sh win64)
    local fresh=()
    if [ -f $windows_build/CMakeCache.txt ] && ! grep -qF "$prefix/" $windows_build/CMakeCache.txt; then fresh=(--fresh); fi
    cmake --preset win64 -B $windows_build "${fresh[@]}" -DDSP_BUILD_PLUGINS=ON -DDSP_BUILD_TESTS=OFF -DDSP_BUILD_APPS=OFF > /dev/null
    cmake --build $windows_build
    rm -rf $stage
    mkdir $stage
    cp -r $windows_build/bin/plugin_host.exe $windows_build/clap/*.clap $windows_build/vst3/*.vst3 $stage
    # One file is one plug-in: it needs no DLL but the system's.
    local file
    for file in $stage/*.clap $stage/*.vst3/Contents/*/*.vst3; do
        ! x86_64-w64-mingw32-objdump -p "$file" | grep 'DLL Name: lib' || { echo "${file##*/} needs it"; return 1; }
    done
    Scripts/windows-wine.sh win64 $stage/plugin_host.exe $(cd $stage && ls -d *.clap *.vst3) 2> "$work/wine.log" ||
        { tail -n 3 "$work/wine.log"; return 1; }
}

part validate each validate "$build"/lv2/*.lv2
part lv2apply each render_with_lv2apply $(uris)
part ffmpeg each render_with_ffmpeg $(uris)
part jalv play_with_jalv
part ardour try_ardour
part qtractor each scan_with_qtractor "$build"/clap/*.clap
part plugin_host each check_with_our_host "$build"/clap/*.clap "$build"/vst3/*.vst3
part win64 check_windows

printf '\nplugins: times\n'
printf '%s\n' "${times[@]}"
[ ${#failed[@]} = 0 ] || {
    printf '\nplugins: FAILED:\n'
    printf '    %s\n' "${failed[@]}"
    exit 1
}
printf '\nplugins: everything passed\n'
