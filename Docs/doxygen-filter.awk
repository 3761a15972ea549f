# Makes the headers' plain comments readable for Doxygen, and puts each header's contents into the group of its folder.
function escaped(text) {
    gsub(/\\/, "\\\\", text)
    gsub(/@/, "\\@", text)
    gsub(/</, "\\<", text)
    gsub(/>/, "\\>", text)
    gsub(/#/, "\\#", text)
    gsub(/%/, "\\%", text)
    gsub(/"/, "\\\"", text)
    sub(/ \.\.$/, " to", text)  # a full stop in the line's last place would end a list
    return text
}
BEGIN {
    room = ARGV[1]
    sub(/^.*\/include\/DSPDll\//, "", room)
    sub(/\/[^\/]*$/, "", room)
    group = title = room
    gsub(/[^A-Za-z0-9]/, "_", group)
    sub(/^DSP\/Effects\//, "Effect: ", title)
    while ((getline line <"README.md") > 0) {
        split(line, cells, / *\| */)
        if (cells[2] == "`Src/" room "`") title = room ": " cells[3]
    }
    printf "/** \\defgroup %s %s */ /** \\addtogroup %s */ /** @{ */ ", group, title, group
}
# A comment is kept until the line after it tells what it is about.
function keep(text) { comment = comment (comment == "" ? "" : "\n") text }
function close_group() {
    if (open) print indent "///@}"
    open = 0
}
function about(next_line,    end) {
    if (comment == "") return
    if (indent == "" && next_line ~ /^(namespace .*)?$/) comment = "\\file\n" comment
    else if (next_line == "") {
        close_group()
        gsub(/\n/, " ", comment)
        end = index(comment, ". ")
        comment = "@name " (end ? substr(comment, 1, end - 1) "\n" substr(comment, end + 2) : comment) "\n@{"
        open = 1
    }
    gsub(/\n/, "\n" indent "/// ", comment)
    print indent "/// " comment
    comment = ""
}
/^[ \t]*\/\/ clang-format/ { next }
/^[ \t]*\/\/( |$)/ {
    indent = text = $0
    sub(/\/\/.*/, "", indent)
    sub(/^[ \t]*\/\/ ?/, "", text)
    keep(escaped(text))
    next
}
{ about($0) }
/^(public|protected|private):|^};/ { close_group() }
/[;,{})] +\/\/ / {
    at = match($0, / +\/\/ /)
    print substr($0, 1, at - 1) "  ///< " escaped(substr($0, at + RLENGTH))
    next
}
# In C, where sections have a heading and may have a text.
/^\/\* ---- .* ----/ {
    title = $0
    sub(/^\/\* ---- /, "", title)
    sub(/ ----.*/, "", title)
    section = group "_" ++sections
    printf "/** @} */ /** \\defgroup %s C: %s */ ", section, title
    if (/\*\//) print "/** \\addtogroup " section " */ /** @{ */"
    else print "/** \\addtogroup " section
    heading = !/\*\//
    next
}
heading && /\*\// {
    print $0 " /** \\addtogroup " section " */ /** @{ */"
    heading = 0
    next
}
/^[ \t]*\/\* / { sub(/\/\* /, "/** ") }
/[;,{}] +\/\* / { sub(/\/\* /, "/**< ") }
{ print }
END { print "/** @} */" }
