#!/usr/bin/env bash
# What a compiled host relies on beyond names: the order of virtual operations, and where the fields of records lie.
# DSPDll.abi and DSPDrawing.abi beside this script describe the types that hosts get, as abidw reads them from the
# libraries; they are compared with abidiff. What is added after everything else is no fault.
#
#   abi.sh check INSTALLED   fails when a host built against the descriptions would not fit the installed libraries
#   abi.sh update            builds and installs the libraries and describes them anew
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)

# DSPDrawing is there where it was built.
libraries() { find "$1" -name 'libDSP*.so' | sort; }
baseline_of() { echo "$here/$(basename "$1" .so | sed 's/^lib//').abi"; }

# Only types from public headers, without the places they stand in and without indentation: it would be a third more.
describe() {
    abidw --headers-dir "$1/include" --drop-private-types --drop-undefined-syms --no-show-locs --no-corpus-path \
        --no-comp-dir-path --no-elf-needed --no-parameter-names --type-id-style hash \
        --suppressions "$here/abi.suppr" "$2" | sed 's/^ *//'
}

check() {
    now=$(mktemp)
    trap 'rm -f "$now"' EXIT
    local library checked=0
    for library in $(libraries "$1"); do
        check_library "$1" "$library"
        checked=$((checked + 1))
    done
    [ $checked != 0 ] || { echo "no library in $1"; return 1; }
}

check_library() {
    local report baseline
    baseline=$(baseline_of "$2")
    describe "$1" "$2" > "$now"
    report=$(abidiff --no-added-syms --suppressions "$here/abi.suppr" "$baseline" "$now") || {
        # What moved, once; abidiff says it for every function that it touches.
        grep -E '^ *\[D\]|vtable offset of .* changed|size changed|offset changed|(referenced|pointed to) type .(class|struct)|. at offset |type of .* changed' \
            <<< "$report" | sed 's/^ *//' | awk '!seen[$0]++' | grep . ||
            echo "$report"
        echo "Hosts built before would not fit this library. If that is meant, run Tests/Exports/abi.sh update and"
        echo "review the difference."
        return 1
    }
    echo "hosts built against Tests/Exports/$(basename "$baseline") fit"
}

update() {
    cd "$here/../.."
    installed=$(mktemp -d)
    trap 'rm -rf "$installed"' EXIT
    cmake --preset release > /dev/null
    cmake --build --preset release --target DSPDll DSPDrawing dsphost dsphost_shell_files dspdll-analyser
    cmake --install build/release --prefix "$installed" > /dev/null
    local library
    for library in $(libraries "$installed"); do describe "$installed" "$library" > "$(baseline_of "$library")"; done
    git --no-pager diff --stat -- "$here"
}

case "${1:-}" in
    check) check "$2" ;;
    update) update ;;
    *)
        sed -n '2,/^set/{/^set/!s/^# \{0,1\}//p}' "$0"
        exit 2
        ;;
esac
