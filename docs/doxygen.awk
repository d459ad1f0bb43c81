# Shows Doxygen the headers' plain comments as its own:
#   the comment that opens a file          describes the file
#   "// Title ----" with what follows      opens a group
#   a comment right above declarations     describes each of them, up to the next empty line
#   "//   name  text" above a function     a parameter, or what it "returns", "traces", or its "threads"
#   other indented lines                   a table, as it stands
#   a comment behind a field or a macro    describes it
# A comment that an empty line follows describes nothing.
{ line[++lines] = $0 }

function is_comment(text) { return text ~ /^ *\/\/( |$)/ }

# Appends to the comment that is being made, in `doc`.
function say(text) { doc = doc indent text "\n" }

# Adds comment lines first to last; `columns` tells parameters from tables.
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
