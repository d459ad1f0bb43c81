# Filters the documents for Doxygen, so that they become one tree of pages. Each document gets a page name. A document
# that a table of contents links to becomes a subpage of the page with that table. A link to a file that is not
# a page (a source, the licence) becomes plain text.
# The tables of contents are the last section of README.md and docs/guide/README.md.

# The name of a page: docs/guide/trace.md is docs_guide_trace.
function label(path) {
    sub(/\.md$/, "", path)
    gsub(/[^A-Za-z0-9]/, "_", path)
    return path
}

# The path of a link's target, relative to the top of the tree.
function resolve(directory, target) {
    target = directory target
    while (match(target, /[^\/]+\/\.\.\//)) { target = substr(target, 1, RSTART - 1) substr(target, RSTART + RLENGTH) }
    return target
}

FNR == 1 {
    top = ENVIRON["PWD"] "/"
    file = index(FILENAME, top) == 1 ? substr(FILENAME, length(top) + 1) : FILENAME
    directory = file ~ /\// ? file : ""
    sub(/[^\/]*$/, "", directory)
    contents = file == "docs/guide/README.md"
    if ($0 ~ /^# /) { $0 = $0 " {#" (file == "README.md" ? "mainpage" : label(file)) "}" }
}

file == "README.md" && $0 == "## Documentation" { contents = 1 }

/^ *```/ { fenced = !fenced; if (fenced) { sub(/```[a-z]+.*/, "```") } }

!fenced {
    rest = $0
    $0 = ""
    while (match(rest, /\[[^]]*\]\([^)]*\)/)) {
        link = substr(rest, RSTART, RLENGTH)
        before = substr(rest, 1, RSTART - 1)
        rest = substr(rest, RSTART + RLENGTH)
        text = substr(link, 2, index(link, "](") - 2)
        target = substr(link, index(link, "](") + 2)
        sub(/\)$/, "", target)
        if (before ~ /!$/ || target ~ /^[a-z]+:/) {  # a picture, an address
            $0 = $0 before link
            continue
        }
        path = resolve(directory, target)
        if (path !~ /\.md$/ || path !~ /^(docs|platform)\/|^[A-Z]+\.md$/) {
            $0 = $0 before text
        } else if (contents && !(path in below)) {
            below[path] = 1
            $0 = $0 before "\\subpage " label(path) " \"" text "\""
        } else {
            $0 = $0 before "[" text "](@ref " (path == "README.md" ? "index" : label(path)) ")"
        }
    }
    $0 = $0 rest
}

{ print }
