#!/usr/bin/env bash
# Holds the table of rooms in README.md against what the sources include. A room is a folder; it may include what
# its row names, and a row names only rooms further up, so there are no circles. Where a row says "public
# headers", these are the ones that CMake installs.
# Fails on: a forbidden include; one of our own in angle brackets; an installed header that includes one that is not;
# a folder without a row; a row without a folder; an arrow that nothing uses; an arrow that points down the table.
set -euo pipefail
cd "$(dirname "$0")/.."

awk '
function complain(place, text) { print place ": " text; failed = 1 }
function folder(path) { sub(/\/[^\/]*$/, "", path); return path }
# The row of a folder: its own, or the one that ends in <Name> for all folders beside each other.
function row_of(room) {
    if (room in line_of) return room
    sub(/[^\/]*$/, "<Name>", room)
    return room in line_of ? room : ""
}
# Takes the next name in backquotes out of the global `cell`; "" when there is none.
function next_name(    name) {
    if (!match(cell, /`[^`]+`/)) return ""
    name = substr(cell, RSTART + 1, RLENGTH - 2)
    cell = substr(cell, RSTART + RLENGTH)
    return name
}
function read_row(    cells, room, name) {
    split($0, cells, "|")
    cell = cells[2]
    room = next_name()
    if (room == "") return
    public_only[room] = cells[4] ~ /public headers/
    cell = cells[4]
    while ((name = next_name()) != "")
        if (("Src/" name) in line_of) allowed[room, "Src/" name] = unused[room, "Src/" name] = FILENAME ":" FNR
        else complain(FILENAME ":" FNR, room " may only include rooms further up, and " name " is none of them")
    line_of[room] = FILENAME ":" FNR
}
function check(place, header,    room, row, target, other) {
    room = folder(FILENAME)
    row = row_of(room)
    target = "Src/" header
    other = header ~ /\// ? folder(target) : room
    if ((FILENAME in installed) && !(target in installed))
        complain(place, "hosts get this header but not \"" header "\", which CMake does not install")
    if (row == "" || room == other) return
    if (public_only[row]) {
        if (!(target in installed) && header !~ /^Support\//) complain(place, room " may only include public headers, not \"" header "\"")
        return
    }
    delete unused[row, row_of(other)]
    if (!((row, row_of(other)) in allowed))
        complain(place, room " may not include " other " (the table in README.md says what it may)")
}
FILENAME == "README.md" {
    if (/^\| Room \|/) in_table = 1
    else if (!/^\|/) in_table = 0
    else if (in_table) read_row()
    next
}
FILENAME ~ /CMakeLists.txt$/ {
    if (/FILE_SET HEADERS/) in_headers = 1
    name = $NF
    if (in_headers && sub(/\.h\)?$/, ".h", name)) { installed[folder(FILENAME) "/" name] = 1; ++headers }
    if (/\)/) in_headers = 0
    next
}
FNR == 1 {
    row = row_of(folder(FILENAME))
    if (row == "") complain(FILENAME, folder(FILENAME) " has no row in the table of README.md")
    seen[row] = 1
}
/^[ \t]*#[ \t]*include[ \t]*"/ {
    split($0, quoted, "\"")
    check(FILENAME ":" FNR, quoted[2])
}
/^[ \t]*#[ \t]*include[ \t]*<[A-Za-z]+\// {
    split($0, quoted, /[<\/]/)
    for (room in line_of)
        if (index(room "/", "Src/" quoted[2] "/") == 1) {
            complain(FILENAME ":" FNR, "our own headers are included in quotes")
            break
        }
}
END {
    for (room in line_of) if (!(room in seen)) complain(line_of[room], room " has a row but no files")
    for (arrow in unused) {
        split(arrow, ends, SUBSEP)
        complain(unused[arrow], ends[1] " includes nothing of " ends[2] ": take it out of the row")
    }
    if (!headers) complain("Src", "no installed header is found in any CMakeLists.txt")
    exit failed
}' README.md $(find Src -name CMakeLists.txt) $(find Src Apps Plugins Python Fuzz Docs -name '*.h' -o -name '*.cpp' | LC_ALL=C sort)
echo "every room includes what the table allows"
