# A comment in our headers holds for all that is declared without a gap after it. This filter tells Doxygen so: it
# puts such a run into a group, whose members share the documentation of the first, and splits declarations of
# several members. Lines keep their numbers. The members of the configuration records share a sentence of its own.
function hold(line) { lines[++held] = line }
function flush_run(    i, group) {
    group = run && declarations > 1
    for (i = 1; i <= held; ++i) {
        if (group && i == end_of_comment) sub(/\*\/ *$/, "*/ /**@{*/", lines[i])
        print before lines[i]
        before = ""
    }
    if (group) before = "/**@}*/ "
    held = run = declarations = end_of_comment = 0
}
function show(line) { flush_run(); print before line; before = "" }
# "int a = 1, b = 2;  ///< text" becomes two declarations with the text behind each. Commas inside (), {} or <>
# separate no members.
function split_members(line,    text, names, type, indent, count, parts, i, out) {
    text = ""
    if (match(line, /  *\/\/\/<.*$/)) {
        text = substr(line, RSTART)
        sub(/^ *\/\/\/<  */, "", text)
        text = "/**< " text " */ "
        line = substr(line, 1, RSTART - 1)
    }
    count = split_at_commas(line, parts)
    if (count == 1) return line (text == "" ? "" : " " text)
    match(parts[1], /^ *((static|constexpr|const) +)*[A-Za-z_:0-9]+ +/)
    type = substr(parts[1], 1, RLENGTH)
    sub(/^ */, "", type)
    sub(/ *$/, "", type)
    out = parts[1]
    declarations += count - 1
    for (i = 2; i <= count; ++i) out = out "; " text type parts[i]
    return out (text == "" ? "" : " " text)
}
function split_at_commas(line, parts,    i, c, depth, count) {
    for (i in parts) delete parts[i]
    count = 1
    parts[1] = ""
    for (i = 1; i <= length(line); ++i) {
        c = substr(line, i, 1)
        if (c ~ /[({<]/) ++depth
        if (c ~ /[)}>]/) --depth
        if (c == "," && !depth) ++count
        else parts[count] = parts[count] c
    }
    return count
}
function is_member() {
    return /^    ((static|constexpr|const) +)*[A-Za-z_:0-9]+ [A-Za-z_0-9]+[^()]*, [^()]*; *(\/\/\/<.*)?$/
}

/^ *\/\*\*/ { flush_run(); in_comment = 1; run = !/@file|@name|@}/ }
in_comment {
    if (/@name/) run = 0
    hold($0)
    if (/\*\/ *$/) { in_comment = 0; first = 1; end_of_comment = held }
    next
}
/^    QUO_CONFIGURATION_RECORD/ {
    show("    QUO_CONFIGURATION_RECORD /** A parameter of the record: docs/configuration.md explains it. */ /**@{*/")
    record = 1
    next
}
record && /^};/ { record = 0; show("/**@}*/ " $0); next }
/^ *$/ || /^ *(public|protected|private):/ || /^ *}/ || /^#/ || /^QUO_BASE_C_/ || /^ *\/\/\// { show($0); next }
is_member() && (run || record) { $0 = split_members($0) }
run {
    # Classes and the like have members of their own.
    if (first && /^ *(typedef )?(class|struct|enum|namespace|template)/) { run = 0; show($0); next }
    first = 0
    hold($0)
    if (/; *((\/\/\/<|\/\*\*<).*)?$/ || /} *(\/\/\/<.*)?$/) ++declarations
    next
}
{ show($0) }
END { flush_run(); if (before != "") print before }
