#!/usr/bin/env bash
# lv2-peers.sh [ROUNDS]
# The time of each of our LV2 plug-ins beside its nearest packaged peer, both in lv2bench with their defaults, as a
# table. Both take turns, before everything else that runs where the system allows that, and the fastest of their rounds
# counts: what else the machine does only adds to a time.
# Needs the plug-ins in build/plugins/lv2 (./check plugins builds them).
set -euo pipefail
cd "$(dirname "$0")/.."
source Scripts/common.sh
need_packages lilv-utils calf-plugins lsp-plugins-lv2 swh-lv2 mda-lv2 guitarix-lv2 x42-plugins
rounds=${1:-5} frames=480000 block=128
export LV2_PATH=$PWD/build/plugins/lv2:/usr/lib/lv2

swh=http://plugin.org.uk/swh-plugins calf=http://calf.sourceforge.net/plugins lsp=http://lsp-plug.in/plugins/lv2
mda=http://drobilla.net/plugins/mda guitarix=http://guitarix.sourceforge.net/plugins x42=http://gareus.org/oss/lv2
# Ours, the peer, what it is. One channel beside one, two beside two.
pairs="
gain-mono        $swh/amp                              swh Amp, mono
gain             $calf/StereoTools                     Calf Stereo Tools
compressor       $calf/SidechainCompressor             Calf Sidechain Compressor
compressor       $lsp/sc_compressor_stereo             LSP Sidechain Compressor
tremolo-mono     $guitarix/gx_tremolo#_tremolo         Guitarix Tremolo, mono
tremolo          $calf/Pulsator                        Calf Pulsator
equaliser        $calf/Equalizer8Band                  Calf Equalizer 8 Band
equaliser        $lsp/para_equalizer_x16_stereo        LSP Parametric Equalizer x16
valvex-mono      $swh/valve                            swh Valve saturation, mono
valvex           $calf/Saturator                       Calf Saturator
echo             $calf/VintageDelay                    Calf Vintage Delay
echo             $mda/Delay                            mda Delay
chorus           $calf/MultiChorus                     Calf Multi Chorus
phaser           $calf/Phaser                          Calf Phaser
reverb           $calf/Reverb                          Calf Reverb
cantrix-mono     $x42/fat1                             x42 Autotune, mono
pitch-shift-mono $swh/amPitchshift                     swh AM pitchshifter, mono
pitch-shift      $mda/Detune                           mda Detune
"

# Nanoseconds a frame; nothing when the plug-in does not run.
first=$(chrt -f 1 true 2> /dev/null && echo 'chrt -f 1' || :)
one() { timeout 60 $first lv2bench -b $block -n $frames "$1" 2> /dev/null | awk -v n=$frames '$1 > 0 { print $1 * 1e9 / n }' || :; }
fastest() { printf '%s\n' "$@" | sort -g | awk 'NF { printf "%.1f", $1; exit }'; }

echo "| Plug-in | ns a frame | Peer | ns a frame | Ratio |"
echo "|---|---|---|---|---|"
while read -r ours peer name; do
    [ "$ours" ] || continue
    us=() them=()
    for ((i = 0; i < rounds; ++i)); do
        us+=("$(one "urn:dspdll:$ours")")
        them+=("$(one "$peer")")
    done
    a=$(fastest "${us[@]}") b=$(fastest "${them[@]}")
    ratio=$(awk -v a="$a" -v b="$b" 'BEGIN { if (a && b) printf "%.2f", a / b }')
    echo "| $ours | ${a:-does not run} | $name | ${b:-does not run} | $ratio |"
done <<< "$pairs"
