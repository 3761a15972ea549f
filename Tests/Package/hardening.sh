#!/usr/bin/env bash
# hardening.sh FILE...: reads from programs and libraries, of Linux or Windows, whether they were built and linked
# as cmake/Hardening.cmake asks, and fails with a line for each thing that is missing.
set -euo pipefail
failed=0

complain() { echo "$file: $1"; failed=1; }
# need WHAT PATTERN TEXT: the text must have a line like that; need_no: it must have none.
need() { grep -qE -- "$2" <<< "$3" || complain "$1"; }
need_no() { ! grep -qE -- "$2" <<< "$3" || complain "$1"; }

check_elf() {
    local dynamic segments imports places
    dynamic=$(readelf -Wd "$file") segments=$(readelf -Wl "$file") imports=$(nm -D --undefined-only "$file")
    need "no stack protector (-fstack-protector-strong)" ' __stack_chk_fail\b' "$imports"
    # Where there is anything to check.
    ! grep -qE ' (v?sn?printf|v?swprintf|wmemcpy)\b' <<< "$imports" ||
        need "no checked copies (-D_FORTIFY_SOURCE=2)" ' __[a-z]+_chk\b' "$imports"
    # The compiler's start-up code has a few landing places of its own.
    [ "$(objdump -d "$file" | grep -c endbr)" -gt 20 ] || complain "jumps are not guarded (-fcf-protection)"
    need "functions are bound late (-z now)" 'FLAGS.*\bNOW\b' "$dynamic"
    need "pointers to functions stay writable (-z relro)" 'GNU_RELRO' "$segments"
    need "its stack is executable" 'GNU_STACK.* RW ' "$segments"
    need "it cannot be moved in memory" 'Elf file type is DYN' "$segments"
    need_no "its code is changed when it is loaded" TEXTREL "$dynamic"
    # An empty place, between two colons or at an end, is the folder that happens to be the current one.
    places=$(sed -nE 's/.*\((RUNPATH|RPATH)\).*\[(.*)\]/:\2:/p' <<< "$dynamic")
    need_no "an empty place among those where libraries are sought: ${places:1:-1}" '::' "$places"
}

check_pe() {
    local headers
    headers=$(objdump -p "$file")
    need "no stack protector (-fstack-protector-strong)" ' _{2,3}stack_chk_fail$' "$(nm "$file")"
    need "it cannot be moved in memory" DYNAMIC_BASE "$headers"
    need "its data is executable" NX_COMPAT "$headers"
    need_no "it needs a libssp beside it" 'DLL Name: libssp' "$headers"
    # The compiler's start-up code asks for libgcc by LoadLibraryA, which is loaded by then.
    need_no "libraries are loaded by name from anywhere (LoadLibraryEx says from where)" ' LoadLibraryW$' "$headers"
}

for file in "$@"; do
    case $file in
        *.dll | *.exe) check_pe ;;
        *) check_elf ;;
    esac
done
[ $# -gt 0 ] && [ $failed = 0 ] && echo "hardened: ${*##*/}"
