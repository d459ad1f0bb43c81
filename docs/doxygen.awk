# Converts the plain comments of the headers to Doxygen's format:
#   a comment at the start of a file           describes the file
#   "// Title ----" and the following lines    open a group
#   a comment directly above declarations      describes each of them, up to the next empty line
#   "//   name  text" above a function         describes a parameter; the names "returns", "traces" and
#                                              "threads" describe the result, the traces and thread safety
#   other indented lines                       are a table, which is printed unchanged
#   a comment after a field or a macro         describes it
# A comment that is followed by an empty line describes nothing.
{ line[++lines] = $0 }

function is_comment(text) { return text ~ /^ *\/\/( |$)/ }

# Appends a line to `doc`, the comment under construction.
function say(text) { doc = doc indent text "\n" }

# Appends the comment lines `first` to `last`. With `columns`, indented lines are parameters, otherwise a table.
function render(first, last, columns, i, text, table) {
    for (i = first; i <= last; i++) {
        text = line[i]
        sub(/^ *\/\//, "", text)
        if (columns && match(text, /^   [A-Za-z_]+  +/)) {
            word = substr(text, 4, RLENGTH - 3)
            sub(/ +$/, "", word)
            text = substr(text, RLENGTH + 1)
            if (word == "returns") { say("@return " text) }
            else if (word == "traces" || word == "threads") {
                say("@par " toupper(substr(word, 1, 1)) substr(word, 2))
                say(text)
            } else { say("@param " word " " text) }
        } else if (!columns && (text ~ /^   /) != table) {
            table = !table
            say(table ? "@verbatim" : "@endverbatim")
            say(substr(text, table ? 4 : 2))
        } else {
            if (!table) { sub(/^ +/, "", text) }
            say(table ? substr(text, 4) : text)
        }
    }
    if (table) { say("@endverbatim") }
}

function show(last_words) {
    printf "%s/**\n%s%s%s*/\n", indent, doc, last_words, indent
}

function close_group() {
    if (grouped) { print "/// @}" }
    grouped = 0
}

END {
    for (at = 1; at <= lines; at++) {
        text = line[at]
        if (is_comment(text)) {
            for (last = at; is_comment(line[last + 1]);) { last++ }
            doc = ""
            match(text, /^ */)
            indent = substr(text, 1, RLENGTH)
            if (at == 1) {
                say("@file")
                render(at, last, 0)
                show()
                doc = ""
            } else if (text ~ /-----$/) {
                close_group()
                sub(/^ *\/\/ /, "", text)
                sub(/ -+$/, "", text)
                say("@name " text)
                render(at + 1, last, 0)
                show("@{\n")
                doc = ""
                grouped = 1
            } else if (line[last + 1] != "") {
                render(at, last, line[last + 1] !~ /^(typedef struct|struct|class) /)
            }
            at = last
            continue
        }
        if (text == "") { doc = "" }
        if (text ~ /^#/ && text !~ /^#define/) {
            if (text ~ /^#ifdef __cplusplus/) { close_group() }
        } else if (text != "") {
            if (!inside && doc != "") { show() }
            sub(/  \/\/ /, "  ///< ", text)
            code = text
            sub(/ *\/\/\/<.*/, "", code)
            inside = text ~ /^#define/ || macro ? (macro = code ~ /\\$/) : code !~ /[;{}:]$/
            if (code ~ /\{$/) { doc = "" }
        }
        print text
    }
}
