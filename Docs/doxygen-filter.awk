# Makes the headers' plain comments readable for Doxygen, and puts each header's contents into the group of its folder.
# A comment speaks for all declarations below it up to an empty line or the next comment.
function escaped(text) {
    gsub(/\\/, "\\\\", text)
    gsub(/@/, "\\@", text)
    gsub(/</, "\\<", text)
    gsub(/>/, "\\>", text)
    gsub(/#/, "\\#", text)
    gsub(/%/, "\\%", text)
    gsub(/"/, "\\\"", text)
    sub(/ \.\.$/, " to", text)  # a full stop in the line's last place would end a list
    return code(text)
}
# What stands between backticks is code.
function code(text) {
    while (match(text, /`[^`]+`/))
        text = substr(text, 1, RSTART - 1) "<tt>" substr(text, RSTART + 1, RLENGTH - 2) "</tt>" substr(text, RSTART + RLENGTH)
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
    if (comment == "") {
        if (speaks_for(next_line)) print said
        return
    }
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
    said = next_line == "" ? "" : indent "/// " comment
    comment = ""
}
# Whether the comment said last speaks for this line: a declaration of its own, beside the one before it.
function speaks_for(line,    at) {
    if (line == "") said = ""
    if (said == "" || !ended) return 0
    at = line
    sub(/[^ \t].*/, "", at)
    return at == indent && line !~ /^ *[}#]|^(public|protected|private):|~| override|= delete|friend |static_assert|[;,{})] +\/\/ /
}
/^[ \t]*\/\/ clang-format/ { next }
/^template <class D> void / { next }  # bodies of what their classes declare
/^[ \t]*\/\/( |$)/ {
    indent = text = $0
    sub(/\/\/.*/, "", indent)
    sub(/^[ \t]*\/\/ ?/, "", text)
    keep(escaped(text))
    next
}
{
    about($0)
    ended = /[;}]( *\/\/.*)?$/
}
/^(public|protected|private):|^};/ { close_group() }
/^}.* \/\/ namespace/ { sub(/ +\/\/.*/, "") }
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
/^\/\* / { said_in_c = "" }
/^[ \t]*\/\* / { sub(/\/\* /, "/** ") }
/[;,{}] +\/\* / { sub(/\/\* /, "/**< ") }
/^\/\*\* /, /\*\// {
    said_in_c = said_in_c code($0) "\n"
    spoken = 0
}
/^$/ { said_in_c = "" }
/^DSP_C_API/ {
    if (spoken) printf "%s", said_in_c
    spoken = 1
}
{ print code($0) }
END { print "/** @} */" }
