#!/usr/bin/env bash
# Builds the documentation into build/docs/site: ./check docs. Every block of code in it is run on the way.
set -euo pipefail
cd "$(dirname "$0")/.."
source Scripts/common.sh

need_packages "${BUILD_PACKAGES[@]}" furo python3-myst-parser doxygen doxygen-awesome-css codespell sonic-pi-samples \
    espeak-ng sox libsox-fmt-base parallel man-db zsh
docs=$PWD/build/docs source=$PWD/build/docs/source
export PYTHONDONTWRITEBYTECODE=1

say "building"
build_preset release dsphost dsphost_shell_files dsp_pages dspdll-analyser
rm -rf "$docs"
mkdir -p "$source"
cmake --install build/release --prefix "$docs/installed" >/dev/null

Tests/Package/shell.sh "$docs/installed"

say "writing pages"
build/release/bin/dsp_pages . "$source"
cp -r Docs/Site/. Docs/*.md Docs/pictures "$source"
# The README is a page of the site, too, where the guides stand beside it.
sed 's:(Docs/:(:g' README.md >"$source/readme.md"
cp -r examples "$source"
sed -i -e 's:(\.\./examples/:(examples/:g' -e 's:(\.\./README\.md:(readme.md:g' "$source"/*.md
cp Src/Threads/README.md "$source/threads.md"
sed -i -e "/^{{rooms}}$/{r $source/rooms.html" -e 'd}' "$source/house.md"
rm "$source/rooms.html"

# What the blocks of code find under the names they use.
recordings=$docs/recordings
mkdir "$recordings"
ln -s "$(dirname "$(dpkg -L sonic-pi-samples | grep -m1 '/loop_amen_full\.')")"/*.flac "$recordings"
espeak-ng -v en-us -s 160 -w "$recordings/voice.wav" "The north wind and the sun were disputing which was the stronger."
sox -R "$recordings/voice.wav" -r 48000 -b 24 "$recordings/clean.wav" gain -n -8 pad 2.2 58
sox -R -n -r 48000 -b 24 "$recordings/hiss.wav" synth 63 pinknoise vol 0.05
sox -R -m -v 1 "$recordings/clean.wav" -v 1 "$recordings/hiss.wav" "$recordings/talk.wav" trim 0 63
mkdir "$recordings/recordings"
cp "$recordings/guit_em9.flac" "$recordings/bass_dnb_f.flac" "$recordings/recordings"
rm "$recordings/hiss.wav" "$recordings/clean.wav"
cp "$recordings/voice.wav" "$recordings/sung.wav"
sox -R "$recordings/loop_amen.flac" -b 24 "$recordings/in.wav" repeat 3
sox -R "$recordings/in.wav" "$recordings/in.flac"

say "running the blocks of code"
PATH=$docs/installed/bin:$PATH Scripts/doc-blocks.py "$docs/installed" "$recordings" "$source"/*.md "$source"/effects/*.md

say "making the site"
sphinx-build -q -W --keep-going "$source" "$docs/site"
mkdir "$docs/site/reference"
{
    cat Docs/Doxyfile
    echo "INPUT = $docs/installed/include/DSPDll"
    echo "STRIP_FROM_PATH = $docs/installed/include/DSPDll"
    echo "STRIP_FROM_INC_PATH = $docs/installed/include/DSPDll"
    echo "OUTPUT_DIRECTORY = $docs/site/reference"
    echo "XML_OUTPUT = $docs/xml"
} | doxygen - 2>&1 | tee "$docs/warnings"
[ ! -s "$docs/warnings" ]
cp "$docs/site/reference/modules.html" "$docs/site/reference/index.html"
Scripts/doc-texts.py "$docs/xml"
Scripts/doc-links.py "$docs/site"

say "spelling"
codespell --ignore-words Docs/Site/words.txt README.md CHANGELOG.md Docs Src --skip '*.png,*.cpp'
codespell --ignore-words Docs/Site/words.txt examples
say "the documentation is build/docs/site/index.html"
