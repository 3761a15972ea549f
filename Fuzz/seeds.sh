#!/usr/bin/env bash
# seeds.sh DSPHOST FOLDER: writes the corpus that fuzzing starts from, a folder per target: files of every kind that
# the host writes, settings of every effect in its own words, and automation. What the other targets decide by
# needs no seeds: all bytes are valid there.
set -euo pipefail
host=$1 to=$2
mkdir -p "$to"/{AudioFile,Automation,ChainText,ScaleText}

# A WAV file of `samples` 16-bit samples of noise, for the host to convert.
samples=600
little() { local n=$1; for _ in $(seq "$2"); do printf "\\x$(printf %02x $((n & 255)))"; n=$((n >> 8)); done; }
{
    printf RIFF; little $((36 + 2 * samples)) 4; printf 'WAVEfmt '; little 16 4
    little 1 2; little 2 2; little 8000 4; little 32000 4; little 4 2; little 16 2
    printf data; little $((2 * samples)) 4; head -c $((2 * samples)) "$host"
} > "$to/noise.wav"
for kind in wav flac ogg aiff w64 caf au rf64; do
    "$host" convert -q -y --rate 8000 "$to/noise.wav" "$to/noise.as.$kind"
    # As a file and as a pipe: the first byte says which.
    { printf '\0'; cat "$to/noise.as.$kind"; } > "$to/AudioFile/$kind"
    { printf '\1'; cat "$to/noise.as.$kind"; } > "$to/AudioFile/$kind-pipe"
done
rm "$to"/noise.*

printf 'A minor' > "$to/ScaleText/words"
printf 'Bbm' > "$to/ScaleText/short"
printf ' chromatic ' > "$to/ScaleText/blanks"

cat > "$to/Automation/pairs" <<'END'
[{"effect": "Tremolo", "parameter": "Depth", "points": [[0.0, 0.2], [0.15, 0.9]]},
 {"effect": 4, "parameter": "Gain", "points": [{"time": 0.1, "value": 0.5}, {"time": 2e-1, "value": 1}]}]
END
cat > "$to/Automation/object" <<'END'
{"effect": "Echo", "parameter": "Delay L", "points": [[0, 0.5]]}
END

# Every effect: its presets by name, and every parameter at the text that it shows.
"$host" effects --json | sed -n 's/^    "name": "\(.*\)",/\1/p' | while read -r effect; do
    json=$("$host" effects "$effect" --json) file=$to/ChainText/${effect// /-}
    every() { sed -n "s/^        \"$1\": \"\(.*\)\",/\1/p" <<< "$json"; }
    paste -d= <(every name) <(every text) | paste -sd, | sed "s/^/$effect: /" > "$file"
    sed -n 's/^      "\(.*[^,]\)",*$/\1/p' <<< "$json" | sed "s/.*/$effect: preset=&/" | head -4 > "$file-presets"
    [ -s "$file-presets" ] || rm "$file-presets"
done
printf 'EQ: 80 highpass; 2500 peak -3 q=200\nCompressor: preset=Studio Vocal' > "$to/ChainText/EQ"
