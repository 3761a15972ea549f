#!/usr/bin/env bash
# plugins.sh [PART]...
# Builds the plug-ins into build/plugins/{lv2,clap,vst3} and lets real hosts load, play and render them, without
# screen and sound card: ./check plugins. Parts may be named; without names all of them run.
set -euo pipefail
cd "$(dirname "$0")/.."
source Scripts/common.sh

windows=()
if [ "$(id -u)" = 0 ]; then
    mapfile -t windows < <(source Scripts/windows-common.sh win64; printf '%s\n' "${WINDOWS_PACKAGES[@]}")
fi
need_packages "${BUILD_PACKAGES[@]}" "${PLUGIN_PACKAGES[@]}" libgtest-dev lv2-dev sordi lilv-utils jalv jackd2 jack-tools \
    ffmpeg ardour qtractor sonic-pi-samples python3-numpy python3-soundfile "${windows[@]}"
python=/usr/bin/python3 hosts=$PWD/Tests/Plugins/Hosts

say "building (plugins)"
begin=$SECONDS
build_preset release dsphost
build_preset plugins dsp_plugins plugin_host dsp_adapter_tests
times=("$(printf '%4d s  building' $((SECONDS - begin)))")
build=$PWD/build/plugins
work=$build/hosts
dsphost=$PWD/build/release/bin/dsphost
lv2=$build/lv2/dspdll.lv2 clap=$build/clap/dspdll.clap vst3=$build/vst3/dspdll.vst3
analyser=dspdll-analyser-plugin
rm -rf "$work"
mkdir -p "$work"/{lv2,home/.vst3,home/.clap}

# The hosts see these plug-ins and no others, and write nothing outside of the build folder.
ln -s $(dpkg -L lv2-dev | grep -E '^/usr/lib/lv2/[^/]+\.lv2$') "$lv2" "$work/lv2"
ln -s "$vst3" "$work/home/.vst3"
ln -s "$clap" "$work/home/.clap"
real_home=$HOME real_cache=${XDG_CACHE_HOME:-}
export HOME=$work/home LV2_PATH=$work/lv2 LADSPA_PATH=$work CLAP_PATH=$work/home/.clap
export VST3_PATH=$work/home/.vst3 LC_ALL=C
export XDG_CONFIG_HOME=$HOME/.config XDG_CACHE_HOME=$HOME/.cache XDG_DATA_HOME=$HOME/.local/share
export JACK_DEFAULT_SERVER=dspdll-plugins-$$ JACK_NO_AUDIO_RESERVATION=1

# Every part runs even when one before it failed, so that one run tells all.
# A part that cannot be done on this machine says why and ends with 77.
failed=() skipped=()
part() {
    local name=$1 begin=$SECONDS
    [ ${#chosen[@]} = 0 ] || [[ " ${chosen[*]} " == *" $name "* ]] || return 0
    say "$name"
    set +e
    (set -e; "${@:2}")
    local status=$?
    set -e
    case $status in
        0) ;;
        77) skipped+=("$name") ;;
        *) failed+=("$name") ;;
    esac
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
# What dsphost calls the effect in a plug-in.
effect_of() { name_of "$1" | sed 's/ (mono)$//; s/^Equaliser$/EQ: 1000 peak 6 q=200/'; }
# The values that a host sets where a new instance would leave the sound as it is, and dsphost's words for them: its
# equaliser has them in its name.
values_of() {
    case $1 in
        *:equaliser*) echo band_4_frequency=1000 band_4_gain=6 ;;
        *:gain*) echo gain=-6 ;;
        *:valvex-mono) echo drive=80 oversampling=2 ;;
        *:valvex) echo drive_l=80 drive_r=80 oversampling_l=2 oversampling_r=2 ;;
    esac
}
settings_of() {
    case $1 in
        *:gain*) echo 'Gain=-6' ;;
        *:valvex*) echo 'Drive L=80, Drive R=80, Oversampling L=4, Oversampling R=4' ;;
    esac
}
about() {
    local effect
    effect=$(effect_of "$1")
    # It has neither latency nor presets, as little as this one.
    [[ $effect != EQ:* ]] || effect=Gain
    "$dsphost" effects "$effect" --json | "$python" -c "import json, sys; effect = json.load(sys.stdin)[0]; print($2)"
}
first_latency_of() { about "$1" 'effect["latency"]'; }  # of a new instance
latency_of() { case $1 in *:valvex*) echo 4 ;; *) first_latency_of "$1" ;; esac; }
# One that is not where the effect starts; nothing where it has none.
preset_of() { about "$1" '([p for i, p in enumerate(effect["presets"]) if i != effect["default_preset"]] or [""])[0]'; }

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

# expect URI FILE LATENCY [PRESET] [LEAD]: whether the file is the library's own result so many frames later. LEAD frames
# of silence came before it.
expect() {
    local uri=$1 preset=${4:-} lead=${5:-0} effect settings in out
    settings=${preset:+preset=$preset}
    settings+=$(settings_of "$uri" | sed "s/^/${preset:+, }/")
    effect=$(effect_of "$uri")${settings:+: $settings} in=$work/in$(channels_of "$uri").wav
    out="$work/reference-${uri##*:}${preset:+-preset}-$lead.wav"
    if [ "$lead" != 0 ]; then
        [ -e "${in%.wav}-$lead.wav" ] ||
            ffmpeg -v error -y -i "$in" -af "adelay=${lead}S:all=1" -c:a pcm_f32le "${in%.wav}-$lead.wav"
        in=${in%.wav}-$lead.wav
    fi
    [ -e "$out" ] || "$dsphost" render -q -y --precision 32 --format f32 --block 1024 "$in" "$out" \
        --fx "$effect" >&2 || return 1
    "$python" "$hosts/compare.py" "$out" "$2" "$3" $lead
}
sounds() { "$python" "$hosts/compare.py" --sounds "$@"; }

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
    local out=$work/lv2apply-${1##*:}.wav log value values=()
    for value in $(values_of "$1"); do values+=(-c "${value%=*}" "${value#*=}"); done
    log=$(timeout 60 lv2apply -i "$(input_of "$1")" -o "$out" "${values[@]}" "$1" 2>&1) ||
        { echo "$1: lv2apply ends with $?: $log"; return 1; }
    expect_or_sounds "$1" "$out"
}

pass_through_analyser() {
    local out=$work/analyser.wav log
    log=$(LV2_PATH=$build/lv2 timeout 60 lv2apply -i "$work/in2.wav" -o "$out" urn:dspdll:analyser 2>&1) ||
        { echo "lv2apply ends with $?: $log"; return 1; }
    "$python" "$hosts/compare.py" "$work/in2.wav" "$out" 0
}

render_with_ffmpeg() {
    local out=$work/ffmpeg-${1##*:}.wav log values
    values=$(values_of "$1")
    values=${values:+:c=${values// /|}}
    log=$(timeout 60 ffmpeg -v error -y -i "$(input_of "$1")" -af "lv2=p=${1//:/\\\\:}$values" -c:a pcm_f32le "$out" \
        2>&1 < /dev/null) || { echo "$1: ffmpeg ends with $?: $log"; return 1; }
    expect_or_sounds "$1" "$out"
}

# A second of a metronome through one after the other: all of them at once are too much for a busy machine.
play_with_jalv() {
    local uri name port i channels outputs files=() status=0
    running=() client=  # for the trap, which comes when this function has ended
    jackd -n "$JACK_DEFAULT_SERVER" --no-realtime --timeout 5000 -d dummy -r 48000 -p 2048 > "$work/jackd.log" 2>&1 &
    running+=($!)
    trap 'kill $client "${running[@]}" 2> /dev/null || :' EXIT
    timeout 20 jack_wait -w > /dev/null 2>&1 || { echo "jackd does not start: $(tail -n 1 "$work/jackd.log")"; return 1; }
    timeout 500 jack_metro -b 300 -D 100 -n metro > "$work/metro.log" 2>&1 &
    running+=($!)
    # Its jalvs read commands until their input ends.
    mkfifo "$work/commands"
    sleep 500 > "$work/commands" &
    running+=($!)
    for uri in $(uris); do
        name=${uri##*:}
        timeout -k 5 60 jalv -x -n "$name" "$uri" < "$work/commands" > "$work/jalv-$name.log" 2>&1 &
        client=$!
        outputs=()
        channels=$(channels_of "$uri")
        for ((i = 0; i < 400 && ${#outputs[@]} != channels; ++i)); do
            sleep 0.05
            mapfile -t outputs < <(jack_lsp "$name:" 2> /dev/null | grep "^$name:out")
        done
        if [ ${#outputs[@]} != "$channels" ]; then
            echo "$uri does not start in jalv: $(cat "$work/jalv-$name.log")"
            status=1
        else
            for port in $(jack_lsp "$name:" 2> /dev/null | grep -E "^$name:(in|side)"); do jack_connect metro:300_bpm "$port"; done
            files+=("$work/jalv-$name.wav")
            timeout 20 jack_rec -f "$work/jalv-$name.wav" -d 1 -b 24 "${outputs[@]}" > "$work/jack_rec.log" 2>&1 || :
            kill -0 $client 2> /dev/null || { echo "$uri ends in jalv: $(cat "$work/jalv-$name.log")"; status=1; }
        fi
        kill $client 2> /dev/null || :
        wait $client || :
    done
    sounds "${files[@]}" || status=1
    return $status
}

# KIND URI: a session with the plug-in, exported.
render_with_ardour() {
    local kind=${1%% *} uri=${1#* } id channels preset folder log blocks said
    id=$uri channels=$(channels_of "$uri") preset=$(preset_of "$uri") folder=$work/ardour-$kind-${uri##*:}
    [ "$kind" = LV2 ] || id=$(name_of "$uri")
    log=$(SESSION="$folder|$kind|$id|$channels|$preset|$(values_of "$uri")" timeout 60 ardour7-lua "$hosts/ardour.lua" 2>&1) ||
        { echo "$1: ardour7-lua ends with $?: $log"; return 1; }
    ! grep '^FAILED' <<< "$log" || return 1
    # Nothing has been played yet.
    [ "$(sed -n 's/^LATENCY //p' <<< "$log")" = "$(first_latency_of "$uri")" ] ||
        { echo "$1: not the latency of $(first_latency_of "$uri"): $(grep LATENCY <<< "$log")"; return 1; }
    "$python" "$hosts/ardour_region.py" "$folder" "$work/in$channels.wav" || return 1
    # This Ardour's export crashes at times, with the plug-ins of others too, and on a busy machine is silent.
    for blocks in 1 2 3; do
        if log=$(timeout 60 ardour7-export -s 48000 -b float -o "$folder.wav" "$folder" t 2>&1); then
            if log=$("$python" "$hosts/compare.py" --sounds "$folder.wav" 2>&1); then break; fi
        fi
        echo "$1: export $blocks fails: $(tail -n 1 <<< "$log")"
        [ $blocks != 3 ] || return 1
    done
    # Where a range begins in Ardour's blocks, this engine's pieces depend on.
    if [[ $uri == *:pitch-shift* ]]; then return 0; fi
    # Ardour lets the plug-in run through silence before the range, in which oscillators go on: 2 s and 6 blocks, or
    # another number of blocks when the machine is busy.
    for blocks in 6 5 7 8 4 {9..40}; do
        if said=$(expect "$uri" "$folder.wav" 0 "$preset" $((96000 + 1024 * blocks)) 2>&1); then return 0; fi
        [ $blocks != 6 ] || log=$said
    done
    echo "$log, with the preset '$preset'"
    return 1
}
try_ardour() {
    local status=0 file
    for file in "$work"/home/.vst3/*.vst3; do
        LD_LIBRARY_PATH=/usr/lib/ardour7 timeout 60 /usr/lib/ardour7/ardour-vst3-scanner -f "$file" > "$work/scan.log" 2>&1 || :
        grep -q 'Found Plugin' "$work/scan.log" || { echo "Ardour's VST3 scanner finds nothing in $file"; status=1; }
    done
    local uri plugins=("VST3 urn:dspdll:reverb")
    for uri in $(uris); do plugins+=("LV2 $uri"); done
    each render_with_ardour "${plugins[@]}" || status=1
    return $status
}

scan_with_qtractor() {
    timeout 60 /usr/lib/*/qtractor/qtractor_plugin_scan <<< "clap:$1" 2> /dev/null | grep '^CLAP|' > "$work/clap.txt" || :
    cut -d '|' -f 2-5 "$work/clap.txt"
    [ "$(wc -l < "$work/clap.txt")" = "$(uris | wc -l)" ] || { echo "not every plug-in of ${1##*/} is listed"; return 1; }
}

# A process for each file: one that crashes or hangs does not hide the others.
check_with_our_host() {
    timeout 300 "$build/bin/plugin_host" "$1" || { echo "${1##*/}: plugin_host ends with $?"; return 1; }
}

# What musicians get, and what an installation puts where hosts look.
pack() {
    local file archive
    HOME=$real_home XDG_CACHE_HOME=$real_cache cmake --build --preset plugins --target dsp_plugin_archive > "$work/pack.log"
    archive=$(ls "$build"/dspdll-plugins-*.tar.xz)
    tar -tf "$archive" > "$work/archive.txt"
    for file in README.txt lv2/dspdll.lv2/dspdll.so lv2/dspdll.lv2/manifest.ttl clap/dspdll.clap \
        vst3/dspdll.vst3/Contents/x86_64-linux/dspdll.so; do
        grep -q "^[^/]*/$file\$" "$work/archive.txt" || { echo "${archive##*/} has no $file"; return 1; }
    done
    cmake --install "$build" --component plugins --prefix "$work/installed" > "$work/install.log"
    [ "$(LV2_PATH=$work/installed/lib/lv2 lv2ls)" = "$(LV2_PATH=$build/lv2 lv2ls)" ] ||
        { echo "an installation has other plug-ins than the build"; return 1; }
}

same_presets() { "$@" --presets "$clap" "$vst3" | "$python" "$hosts/presets.py" "$lv2"; }

# The Windows files are checked by the same host, in one folder that Wine sees.
windows_build=build/win64-plugins
check_windows() {
    [ "$(id -u)" = 0 ] || { echo "skipped: Wine's folders need root"; return 77; }
    unset HOME XDG_CONFIG_HOME XDG_CACHE_HOME XDG_DATA_HOME
    export HOME=$real_home
    [ -z "$real_cache" ] || export XDG_CACHE_HOME=$real_cache
    local status=0
    Scripts/windows-root.sh win64 > "$work/wine-root.log" || { status=$?; cat "$work/wine-root.log"; return $status; }
    local prefix file stage=$windows_build/stage
    prefix=$(Scripts/windows-deps.sh win64)
    local fresh=()
    if [ -f $windows_build/CMakeCache.txt ] && ! grep -qF "$prefix/" $windows_build/CMakeCache.txt; then fresh=(--fresh); fi
    cmake --preset win64 -B $windows_build "${fresh[@]}" -DDSP_BUILD_PLUGINS=ON -DDSP_BUILD_TESTS=OFF -DDSP_BUILD_APPS=OFF > /dev/null
    cmake --build $windows_build --target dsp_plugins plugin_host
    rm -rf $stage
    mkdir $stage
    cp -r $windows_build/bin/plugin_host.exe $windows_build/clap/dspdll.clap $windows_build/vst3/dspdll.vst3 $stage
    # One file is one plug-in: it needs no DLL but the system's.
    for file in $stage/*.clap $stage/*.vst3/Contents/*/*.vst3; do
        ! x86_64-w64-mingw32-objdump -p "$file" | grep 'DLL Name: lib' || { echo "${file##*/} needs it"; return 1; }
    done
    Scripts/windows-wine.sh win64 $stage/plugin_host.exe $(cd $stage && ls -d *.clap *.vst3) 2> "$work/wine.log" ||
        { tail -n 3 "$work/wine.log"; return 1; }
    clap=dspdll.clap vst3=dspdll.vst3 same_presets Scripts/windows-wine.sh win64 $stage/plugin_host.exe
}

part adapter "$build/bin/dsp_adapter_tests" --gtest_brief=1
part validate each validate "$lv2" "$build/lv2/$analyser.lv2"
part lv2apply each render_with_lv2apply $(uris)
part analyser pass_through_analyser
part ffmpeg each render_with_ffmpeg $(uris)
part jalv play_with_jalv
part ardour try_ardour
part qtractor scan_with_qtractor "$clap"
part plugin_host each check_with_our_host "$lv2" "$clap" "$vst3" "$build"/{lv2/$analyser.lv2,clap/$analyser.clap,vst3/$analyser.vst3}
part archive pack
part presets same_presets "$build/bin/plugin_host"
part win64 check_windows

printf '\nplugins: times\n'
printf '%s\n' "${times[@]}"
[ ${#skipped[@]} = 0 ] || {
    printf '\nplugins: SKIPPED, for the reason told above:\n'
    printf '    %s\n' "${skipped[@]}"
}
[ ${#failed[@]} = 0 ] || {
    printf '\nplugins: FAILED:\n'
    printf '    %s\n' "${failed[@]}"
    exit 1
}
if [ ${#skipped[@]} = 0 ]; then what=everything; else what='what was tried'; fi
printf '\nplugins: %s passed\n' "$what"
