#!/usr/bin/env bash
# shell.sh INSTALLED: the manual and the shells' completion, as they are installed.
set -euo pipefail
share=$1/share
complaints=$(MANWIDTH=100 LC_ALL=C.UTF-8 man --warnings -l "$share/man/man1/dsphost.1" 2>&1 >"$share/dsphost.txt")
grep -q -- '--learn' "$share/dsphost.txt"
rm "$share/dsphost.txt"
if [ -n "$complaints" ]; then echo "$complaints"; exit 1; fi

zsh -n "$share/zsh/site-functions/_dsphost"
bash -n "$share/bash-completion/completions/dsphost"
source "$share/bash-completion/completions/dsphost"
# What the last word given becomes.
expect() {
    local wanted=$1
    shift
    COMP_WORDS=(dsphost "$@") COMP_CWORD=$#
    _dsphost
    [ "${COMPREPLY[*]}" = "$wanted" ] || { echo "$* became \"${COMPREPLY[*]}\", not \"$wanted\"" && exit 1; }
}
expect denoise den
expect "--profile" denoise --pr
expect "shaped shaped-strong" convert --dither sha
expect "Valvex" effects Val
expect "Echo: preset=Long Echo" render in.wav --fx '"Echo: preset=Lo'
expect "" render in
