#!/usr/bin/env bash
# shell.sh INSTALLED: the manual and the shells' completion, as they are installed.
set -euo pipefail
share=$1/share
for manual in dsphost:--learn dspdll-analyser:--save-to; do
    page=$share/man/man1/${manual%:*}.1
    complaints=$(MANWIDTH=100 LC_ALL=C.UTF-8 man --warnings -l "$page" 2>&1 >"$share/page.txt")
    grep -q -- "${manual#*:}" "$share/page.txt"
    rm "$share/page.txt"
    if [ -n "$complaints" ]; then echo "$complaints"; exit 1; fi
done

zsh -n "$share/zsh/site-functions/_dsphost"
bash -n "$share/bash-completion/completions/dsphost"
source "$share/bash-completion/completions/dsphost"
source "$share/bash-completion/completions/dspdll-analyser"
# What the last word given becomes.
program=dsphost
expect() {
    local wanted=$1
    shift
    COMP_WORDS=("$program" "$@") COMP_CWORD=$#
    "_${program//-/_}"
    [ "${COMPREPLY[*]}" = "$wanted" ] || { echo "$* became \"${COMPREPLY[*]}\", not \"$wanted\"" && exit 1; }
}
expect denoise den
expect "--profile" denoise --pr
expect "shaped shaped-strong" convert --dither sha
expect "Valvex" effects Val
expect "Echo: preset=Long Echo" render in.wav --fx '"Echo: preset=Lo'
expect "" render in
program=dspdll-analyser
expect "--size --save-to" song.wav --s
