#!/usr/bin/env bash
# The names that a library exports are its contract. exports.txt beside this script has a row per class, one per
# namespace (`Corvo::`) for its free functions and `dsp_` for the C interface: how many members are exported, and a
# checksum over their signatures. `Class<>` counts the instances of its member templates. A row that names libraries
# holds for these only; the others hold for DSPDll on every target, so signatures are compared without the width of
# integers.
#
#   exports.sh check LIBRARY   fails on a name that no row covers; on a row that covers nothing; and on a class in
#                              which a member came, went, or changed its name or its parameters
#   exports.sh names LIBRARY   what is counted, a line each: two of these show what changed
#   exports.sh update          builds the native libraries and rewrites the numbers of the rows, with those of
#                              a Windows DLL where one stands in build/win32 or build/win64
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)
rows=$here/exports.txt

mangled() {
    case $1 in
        *.dll) objdump -p "$1" |
            awk '/Ordinal\/Name Pointer/ { on = 1; next } on && /^[ \t]*\[/ { print $NF; next } { on = 0 }' ;;
        *) nm -D --defined-only "$1" | awk '{ print $NF }' ;;
    esac
}

# Readable, the same on every target, sorted; the variants of a constructor or destructor fall together.
names() {
    mangled "$1" | c++filt | sed -E '/^typeinfo name for /d
        s/\bunsigned (int|long long|long)\b/size/g; s/\b(long long|long)\b/int/g; s/([0-9])ul{0,2}\b/\1/g
        s/\b_MP_ENVELOPE/MP_ENVELOPE/g' | LC_ALL=C sort -u
}

# libDSPDll.so, whatever its version.
short() { basename "$1" | sed 's/\.so\..*/.so/'; }

# Reads the rows, then the names of `library`. With `update` it prints the rows anew, else what is wrong.
compare() {
    awk -v library="$(short "$1")" -v update="${2:-}" '
    BEGIN { for (i = 1; i < 256; ++i) code[sprintf("%c", i)] = i }
    # The row that a name belongs to: its own, its class (with <> for instances of templates), or its namespace.
    function owner(name,    instance) {
        if (name ~ /^dsp_/) return "dsp_"
        if (name ~ /^(vtable|typeinfo) for /) return substr(name, index(name, " for ") + 5)
        gsub(/\(.*|\[abi:[a-z0-9]*\]/, "", name)
        while (sub(/<[^<>]*>/, "", name)) instance = "<>"
        sub(/^.* /, "", name)
        if (name in row) return name
        if (!sub(/::[^:]*$/, "", name)) return "::"
        return (name instance) in row ? name instance : name "::"
    }
    function checksum(sum, text,    i) {
        for (i = 1; i <= length(text); ++i) sum = (sum * 31 + code[substr(text, i, 1)]) % 16777213
        return sum
    }
    function holds() { return NF == 3 ? library ~ /^(lib)?DSPDll\./ : index(" " $4 " ", " " library " ") }
    function state(key) { return sprintf("%d %06x", members[key], sums[key]) }
    FILENAME == ARGV[1] {
        if (/^(#|$)/) next
        if (holds()) { row[$1] = $2 " " $3; order[++count] = $1 }
        next
    }
    {
        key = owner($0)
        if (!(key in row)) { print "no row covers " $0; failed = 1; next }
        ++members[key]
        ++total
        sums[key] = checksum(sums[key], $0 "\n")
        list[key] = list[key] "    " $0 "\n"
    }
    END {
        for (i = 1; i <= count; ++i) {
            key = order[i]
            if (update) print key, state(key)
            else if (!(key in members)) { print "nothing is exported of " key " any more"; failed = 1 }
            else if (state(key) != row[key]) {
                printf "%s is %s, not %s; exported now:\n%s", key, state(key), row[key], list[key]
                failed = 1
            }
        }
        if (!count || !total) { print "no rows, or no names, for " library; failed = 1 }
        if (!failed && !update) print library " exports " total " names, as " count " rows of exports.txt say"
        exit failed
    }' "$rows" <(names "$1")
}

check() {
    local foreign
    # Instances of standard templates would tie the library's users to one version of the compiler's headers.
    if foreign=$(mangled "$1" | grep -E '^_Z(Z|GVZ?|T[ISV])?(N[KRO]?)?(S|9__gnu_cxx)'); then
        printf '%s exports names of the standard library (see cmake/Exports.map):\n%s\n' \
            "$(short "$1")" "$(c++filt <<< "$foreign")"
        return 1
    fi
    compare "$1" || {
        echo "If the contract of $(short "$1") is meant to change, edit or add its rows in Tests/Exports/exports.txt, run"
        echo "    Tests/Exports/exports.sh update"
        echo "and review the difference."
        return 1
    }
}

update() {
    cd "$here/../.."
    cmake --preset release > /dev/null
    cmake --build --preset release --target DSPDll DSPDrawing
    for library in build/win{32,64}/bin/DSPDll.dll build/release/bin/lib{DSPDll,DSPDrawing}.so; do
        [ ! -e "$library" ] || rewrite "$library"
    done
    git --no-pager diff --stat -- "$here"
}

# The rows of one library with its numbers; the rest of the file stays as it is.
rewrite() {
    local numbers
    numbers=$(compare "$1" update) || { echo "$numbers"; return 1; }
    awk 'FNR == NR { new[$1] = $2 " " $3; next }
        $1 in new && (NF == 3 || index($4, library)) { printf "%-45s %s%s\n", $1, new[$1], (NF == 4 ? " " $4 : ""); next }
        { print }' library="$(short "$1")" <(echo "$numbers") "$rows" > "$rows.new"
    mv "$rows.new" "$rows"
}

case "${1:-}" in
    check) check "$2" ;;
    names) names "$2" ;;
    update) update ;;
    *)
        sed -n '2,/^set/{/^set/!s/^# \{0,1\}//p}' "$0"
        exit 2
        ;;
esac
