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
    gsub(/`/, "", title)
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
# The declarations of a line such as "int width = 0, height = 0;  // pixels" in `piece`, each with the line's comment: Doxygen
# would keep it for one of them. How many they are, 0 for every other line.
function declarations(line,    body, comment, at, c, depth, start, count, type) {
    if (line !~ /^ *[A-Za-z].*,.*;/ || line ~ /^ *(using|typedef|template|return|for) /) return 0
    at = match(line, /; +(\/\/|\/\*) /)
    comment = at ? substr(line, at + 1) : ""
    body = at ? substr(line, 1, at) : line
    if (body !~ /;$/) return 0
    start = 1
    for (at = 1; at <= length(body); at++) {
        c = substr(body, at, 1)
        if (type == "" && !depth) {
            if (c == "(") return 0  # a function
            if (c ~ /[=,;{]/) {
                type = substr(body, 1, at - 1)
                sub(/[&*]*[A-Za-z_][A-Za-z_0-9]*(\[[^\]]*\])* *$/, "", type)
            }
        }
        if (c == ")" && !depth) return 0  # the end of one
        if (c ~ /[({[]/ || c == "<" && substr(body, at - 1, 1) ~ /[a-z]/) depth++
        if (c ~ /[)}\]]/ || c == ">" && depth) depth--
        if (c !~ /[,;]/ || depth) continue
        piece[++count] = substr(body, start, at - start) ";" comment
        if (count > 1) sub(/^ */, type, piece[count])
        start = at + 1
    }
    return count > 1 ? count : 0
}
# A line that declares something, with the comment behind it.
function declare(line,    at) {
    about(line)
    ended = line ~ /[;}]( *\/\/.*)?$/
    at = match(line, / +\/\/ /)
    if (at) line = substr(line, 1, at - 1) "  ///< " escaped(substr(line, at + RLENGTH))
    sub(/; +\/\* /, "; /**< ", line)
    print code(line)
}
/^[ \t]*\/\/ clang-format/ { next }
# A list that goes on in the next line.
/^ +static [A-Za-z:]+ &.*,$/ {
    list = list $0
    next
}
list {
    sub(/^ +/, " ")
    $0 = list $0
    list = ""
}
/^template <class D> void / { next }  # bodies of what their classes declare
/^extern template /, /;$/ { next }
/= delete;$/ { next }
/^[ \t]*\/\/( |$)/ {
    indent = text = $0
    sub(/\/\/.*/, "", indent)
    sub(/^[ \t]*\/\/ ?/, "", text)
    keep(escaped(text))
    next
}
(count = declarations($0)) {
    for (i = 1; i <= count; i++) declare(piece[i])
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
    printf "/** @} */ /** \\defgroup %s C: %s\n * \\ingroup %s */ ", section, title, group
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
# What the C interface's header begins with is about all of it; another one's is about that header, a part of it.
FNR == 1 && /^\/\* / {
    opening = 1
    section = group
    if (FILENAME !~ /\/dspdll\.h$/) {
        title = FILENAME
        sub(/^.*\//, "", title)
        section = group "_" substr(title, 1, length(title) - 2)
        printf "/** @} */ /** \\defgroup %s C: %s\n * \\ingroup %s */ ", section, title, group
    } else printf "/** @} */ "
    sub(/^\/\* /, "/** \\addtogroup " section "\n * ")
}
opening {
    opening = !/\*\//
    print code($0) (opening ? "" : " /** \\addtogroup " section " */ /** @{ */")
    next
}
/^\/\* / { said_in_c = "" }
/^[ \t]*\/\* / { sub(/\/\* /, "/** ") }
/[;,{}0-9] +\/\* / { sub(/\/\* /, "/**< ") }
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
