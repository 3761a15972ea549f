#!/usr/bin/env bash
# What a compiled host relies on beyond names: the order of virtual operations, and where the fields of records lie.
# DSPDll.abi beside this script describes the types that hosts get, as abidw reads them from the library; it is
# compared with abidiff. What is added after everything else is no fault.
#
#   abi.sh check INSTALLED   fails when a host built against the description would not fit the installed library
#   abi.sh update            builds and installs the library and describes it anew
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)
baseline=$here/DSPDll.abi

# Only types from public headers, without the places they stand in.
describe() {
    local library
    library=$(find "$1" -name libDSPDll.so)
    abidw --headers-dir "$1/include" --drop-private-types --drop-undefined-syms --no-show-locs --no-corpus-path \
        --no-comp-dir-path --no-elf-needed --no-parameter-names --suppressions "$here/abi.suppr" \
        --out-file "$2" "$library"
}

check() {
    local now report
    now=$(mktemp) 
    trap 'rm -f "$now"' EXIT
    describe "$1" "$now"
    report=$(abidiff --no-added-syms --suppressions "$here/abi.suppr" "$baseline" "$now") || {
        echo "$report"
        echo "Hosts built before would not fit this library. If that is meant, run Tests/Exports/abi.sh update and"
        echo "review the difference."
        return 1
    }
    echo "hosts built against Tests/Exports/DSPDll.abi fit"
}

update() {
    cd "$here/../.."
    local installed
    installed=$(mktemp -d)
    trap 'rm -rf "$installed"' EXIT
    cmake --preset release > /dev/null
    cmake --build --preset release --target DSPDll DSPDrawing dsphost
    cmake --install build/release --prefix "$installed" > /dev/null
    describe "$installed" "$baseline"
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
