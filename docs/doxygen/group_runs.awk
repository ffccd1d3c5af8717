# A comment in our headers holds for all declarations that follow it without a gap. This filter tells Doxygen so: it
# puts such a run into a group, whose members share the documentation of the first.
function flush_run(    i) {
    if (run && declarations > 1) print "///@{"
    for (i = 1; i <= held; ++i) print lines[i]
    if (run && declarations > 1) print "///@}"
    held = run = declarations = 0
}
function hold(line) { lines[++held] = line }

/^ *\/\*\*/ { flush_run(); in_comment = 1; run = !/@file|@name|@}/ }
in_comment {
    hold($0)
    if (/\*\/ *$/) { in_comment = 0; first = 1 }
    next
}
/^ *$/ || /^ *(public|protected|private):/ || /^ *}/ || /^#/ || /^QUO_BASE_C_/ || /^ *\/\/\// {
    flush_run()
    print
    next
}
run {
    # Classes and the like have members of their own.
    if (first && /^ *(class|struct|enum|namespace|template)/) { run = 0; flush_run(); print; next }
    first = 0
    hold($0)
    if (/; *(\/\/\/<.*)?$/ || /} *(\/\/\/<.*)?$/) ++declarations
    next
}
{ flush_run(); print }
END { flush_run() }
