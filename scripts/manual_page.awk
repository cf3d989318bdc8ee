# Makes a manual page of a manual in Markdown: awk -v name=qmedit -v version=1.0 -f manual_page.awk MANUAL.md
#
# What the manuals here use is understood: headings of three depths, paragraphs, lists, code by four blanks or
# backquotes, tables, links. The first heading is the name, the first sentence below it what the name is for.

# A text with the signs that the page's own language gives a meaning.
function plain(text) {
    gsub(/\\/, "\\e", text)
    gsub(/-/, "\\-", text)
    return text
}

# Code in bold, links as their texts.
function marked(text,    out, parts, count, i, part) {
    while (match(text, /\[[^]]*\]\([^)]*\)/)) {
        part = substr(text, RSTART + 1, index(substr(text, RSTART), "](") - 2)
        text = substr(text, 1, RSTART - 1) part substr(text, RSTART + RLENGTH)
    }
    count = split(text, parts, "`")
    for (i = 1; i <= count; i++)
        out = out (i % 2 == 0 ? "\\fB" plain(parts[i]) "\\fR" : plain(parts[i]))
    return out
}

# A line that begins with a sign of control would be taken for one.
function put(line) {
    if (line ~ /^[.']/)
        line = "\\&" line
    print line
}

function endBlock() {
    if (block == "code")
        print ".fi\n.RE"
    block = ""
}

# One row of a table: what it is about, and what is said of it.
function tableRow(line,    cells, count, i, rest) {
    gsub(/\\\|/, "\001", line)
    sub(/^\| */, "", line)
    sub(/ *\|[ ]*$/, "", line)
    count = split(line, cells, / *\| */)
    if (block != "table") { # the heading says what the columns are, which a list shows by itself
        endBlock()
        block = "table"
        return
    }
    if (cells[1] ~ /^-+$/)
        return
    for (i = 1; i <= count; i++)
        gsub("\001", "|", cells[i])
    print ".TP"
    put(marked(cells[1]) (count > 2 && cells[2] != "" ? "  (" marked(cells[2]) ")" : ""))
    for (i = count > 2 ? 3 : 2; i <= count; i++)
        rest = rest (rest == "" ? "" : "; ") cells[i]
    put(rest == "" ? "\\&" : marked(rest))
}

/^# / {
    printf ".TH %s 1 \"\" \"%s %s\" \"Quillmarch\"\n", toupper(name), name, version
    print ".SH NAME"
    next
}
!named && NF {
    # The whole of the first paragraph is the description; its first clause the name's.
    clause = $0
    sub(/:.*/, "", clause)
    sub(/\.$/, "", clause)
    sub(/^The /, "the ", clause)
    print plain(name) " \\- " marked(clause)
    print ".SH DESCRIPTION"
    named = 1
}
/^## / { endBlock(); print ".SH " toupper(marked(substr($0, 4))); next }
/^### / { endBlock(); print ".SS " marked(substr($0, 5)); next }
/^    / && block != "item" {
    if (block != "code") {
        endBlock()
        print ".PP\n.RS 4\n.nf"
        block = "code"
    }
    for (; blanks > 0; blanks--)
        print ""
    put(plain(substr($0, 5)))
    next
}
/^\|/ { tableRow($0); next }
/^- / { endBlock(); print ".IP \\(bu 2"; put(marked(substr($0, 3))); block = "item"; next }
/^[ \t]*$/ {
    if (block == "code")
        blanks++
    else
        endBlock()
    next
}
{
    blanks = 0
    if (block != "text" && block != "item") {
        endBlock()
        print ".PP"
        block = "text"
    }
    sub(/^ +/, "")
    put(marked($0))
}
END { endBlock() }
