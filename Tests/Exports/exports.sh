#!/usr/bin/env bash
# The names the library exports are its contract; they are kept in a list per target beside this script.
#
#   exports.sh check LIBRARY LIST   compares
#   exports.sh update               builds the libraries of both targets and rewrites the lists
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)

mangled() {
    case $1 in
        *.dll) i686-w64-mingw32-objdump -p "$1" |
            awk '/Ordinal\/Name Pointer/ { on = 1; next } on && /^[ \t]*\[/ { print $NF; next } { on = 0 }' ;;
        *) nm -D --defined-only "$1" | awk '{ print $NF }' ;;
    esac
}

# Readable and sorted; the variants of a constructor or destructor fall together.
names() { mangled "$1" | c++filt | LC_ALL=C sort -u; }

check() {
    local library=$1 list=$2 foreign difference
    # Instances of standard templates would tie the library's users to one version of the compiler's headers.
    if foreign=$(mangled "$library" | grep -E '^_Z(Z|GVZ?|T[ISV])?(N[KRO]?)?(S|9__gnu_cxx)'); then
        printf '%s exports names of the standard library (see cmake/Exports.map):\n%s\n' \
            "${library##*/}" "$(c++filt <<< "$foreign")"
        return 1
    fi
    if ! difference=$(diff -u --label "${list##*/}" --label "${library##*/}" "$list" <(names "$library")); then
        echo "$difference"
        echo
        echo "${library##*/} does not export what Tests/Exports/${list##*/} says. If the contract is meant to"
        echo "change, run"
        echo "    Tests/Exports/exports.sh update"
        echo "which builds both targets and rewrites the lists; review the difference and commit it."
        return 1
    fi
    echo "${library##*/} exports the $(wc -l < "$list") names of Tests/Exports/${list##*/}"
}

update() {
    cd "$here/../.."
    cmake --preset release > /dev/null
    cmake --build --preset release --target DSPDll DSPDrawing
    names build/release/bin/libDSPDll.so > "$here/linux.txt"
    names build/release/bin/libDSPDrawing.so > "$here/linux-drawing.txt"
    Scripts/win32-deps.sh > /dev/null
    cmake --preset win32 > /dev/null
    cmake --build --preset win32 --target DSPDll
    names build/win32/bin/DSPDll.dll > "$here/win32.txt"
    git --no-pager diff --stat -- "$here"
}

case "${1:-}" in
    check) check "$2" "$3" ;;
    update) update ;;
    *)
        sed -n '2,6s/^# \{0,1\}//p' "$0"
        exit 2
        ;;
esac
